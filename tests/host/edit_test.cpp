#include "host/qvedit.h"

#include <gtest/gtest.h>

#include "engine/foundation/zmstrings.h"
#include "tests/support/testfiles.h"
#include "tests/support/testprocess.h"

namespace zm::test {
namespace {

using qvrun::TJobEditor;

TEST(QvEdit, ListsMovesAndSaves) {
    qvrun::THost host;
    std::string error_text;
    ASSERT_TRUE(host.Load(Utf16FromUtf8(ZM_MODULE_DIR "/Graphics.qvp"), error_text)) << error_text;
    const TempFolder folder;
    TJobEditor editor(host, folder.Name("a.qvjob"), nullptr);
    qvrun::TJobFileError error;
    ASSERT_TRUE(editor.Open("[a_graphics_open_image]\nimage_file={file}\n[Fly]\n", error));
    EXPECT_EQ(editor.ActionNames().size(), 8u);
    ASSERT_EQ(editor.Steps().size(), 2u);
    EXPECT_EQ(editor.Steps()[0].action, u"Open Image");
    EXPECT_EQ(editor.Steps()[0].description, u"Open image from '{file}'");
    EXPECT_EQ(editor.Steps()[1].action, u"Fly");
    EXPECT_FALSE(editor.ConfigureStep(1));
    EXPECT_EQ(editor.TakeLog().size(), 1u);
    EXPECT_TRUE(editor.TakeLog().empty());

    EXPECT_FALSE(editor.IsChanged());
    editor.MoveStep(1, 0);
    editor.MoveStep(5, 0);
    editor.RemoveStep(7);
    EXPECT_TRUE(editor.IsChanged());
    std::u16string reason;
    EXPECT_TRUE(editor.Save(reason));
    EXPECT_FALSE(editor.IsChanged());
    EXPECT_EQ(ReadWholeText(folder.File("a.qvjob")),
              "[Fly]\n\n[a_graphics_open_image]\nimage_file={file}\n");
    TJobEditor lost(host, folder.Name("no/folder.qvjob"), nullptr);
    EXPECT_FALSE(lost.Save(reason));
    EXPECT_FALSE(reason.empty());
}

}  // namespace
}  // namespace zm::test
