// The job editor as a new user meets it: from no file at all to a job with a caption.
#include <filesystem>

#include "engine/bitmap/zmxBitmaps.h"
#include "engine/io/zmfiletypes.h"
#include "tests/support/testimages.h"
#include "tests/views/edituser.h"

namespace zm::test {
namespace {

TEST_F(JobEditor, FromNothingToACaption) {
    user.In(kEditor, [](TWindow editor) {
        for (const TEditorButton button : {ebConfigure, ebRemove, ebMoveUp, ebMoveDown, ebSave}) {
            EXPECT_FALSE(IsEnabled(editor, button)) << int{button};
        }
    });
    Add(kEditor, 0);
    user.In(OpenImageForm(), [](const TFormWindow& form) {
        form.Focus(u"edtImageFile");
        form.Press(u"SpeedButton1");  // returns when the list of variables has closed
        EXPECT_EQ(form.Text(u"edtImageFile"), u"{name}");
        form.Type(u"edtImageFile", u"{file}");
    });
    PickVariable(user, 2);
    user.Press(OpenImageForm(), u"btnOk");
    Add(kChangedEditor, 5);
    user.In(TextOnImageForm(), [](const TFormWindow& form) {
        form.Type(u"edtText", u"(c) me");
        form.Choose(u"cbYPos", 2);
    });
    user.Press(TextOnImageForm(), u"btnOk");
    Add(kChangedEditor, 2);
    user.Press(ResizeImageForm(), u"btnCancel");
    Add(kChangedEditor, 1);
    user.In(SaveImageForm(),
            [](const TFormWindow& form) { form.Type(u"edtImageFile", u"{out}/made.jpg"); });
    user.Press(SaveImageForm(), u"btnOk");
    Press(kChangedEditor, ebSave);
    Press(kEditor, ebClose);
    Edit(std::nullopt);
    EXPECT_EQ(Saved(),
              "[Open Image]\nsource=0\nimage_file={file}\n\n"
              "[Draw Text on Image]\ntext=(c) me\nfont_name=Tahoma\nfont_size=16\nfont_color=0\n"
              "font_styles=0\nx_pos=3\ny_pos=2\ncustom_x=0\ncustom_y=0\n\n"
              "[Save Image]\ndest=0\nimage_file={out}/made.jpg\nformat=0\nsave_meta=0\n");
    ASSERT_TRUE(MakeGradient(zm24RGB, 60, 40)->Write(folder.Name("a.png"), ioPNG, nullptr));
    const std::string program = (std::filesystem::path(ZM_MODULE_DIR) / "qvrun").string();
    const TProcessResult result =
        RunProcess(program + " run " + folder.File("made.qvjob").string() + " " +
                       folder.File("a.png").string() + " --output " + folder.Path().string(),
                   folder.Path());
    EXPECT_EQ(result.exit_status, 0) << result.standard_error;
    EXPECT_TRUE(std::filesystem::exists(folder.File("made.jpg")));
}

TEST_F(JobEditor, CancelledDialogsLeaveTheFile) {
    WriteFileBytes(folder.File("made.qvjob"), {std::begin(kCommented), std::end(kCommented) - 1});
    Press(kEditor, ebConfigure);
    user.In(OpenImageForm(), [](const TFormWindow& form) {
        form.Focus(u"edtImageFile");
        form.Type(u"edtImageFile", u"lost");
        form.Press(u"SpeedButton1");
        EXPECT_EQ(form.Text(u"edtImageFile"), u"lost");
    });
    user.In(kVariables, [](TWindow list) { PressKey(list, tkEscape); });
    user.Press(OpenImageForm(), u"btnCancel");
    Press(kEditor, ebClose);
    Edit(kCommented);
    EXPECT_EQ(Saved(), kCommented);
}

TEST_F(JobEditor, CommentsAndOrderAreKept) {
    user.In(kEditor, [](TWindow editor) {
        EXPECT_FALSE(IsEnabled(editor, ebMoveUp));
        ChooseStep(editor, 1);
    });
    Press(kEditor, ebMoveDown);
    user.In(kChangedEditor, [](TWindow editor) {
        EXPECT_EQ(ChosenStep(editor), 2);
        EXPECT_FALSE(IsEnabled(editor, ebMoveDown));
    });
    Press(kChangedEditor, ebMoveUp);
    Press(kChangedEditor, ebConfigure);
    user.In(RotateImageForm(), [](const TFormWindow& form) { form.Type(u"edtAngle", u"180"); });
    user.Press(RotateImageForm(), u"btnOk");
    user.In(kChangedEditor, [](TWindow editor) { ChooseStep(editor, 2); });
    Press(kChangedEditor, ebRemove);
    Press(kChangedEditor, ebSave);
    Press(kEditor, ebClose);
    Edit(kCommented);
    EXPECT_EQ(Saved(),
              "# mine\r\n[Open Image]\r\nimage_file={file}\r\n\r\n# half\r\n[Rotate Image]\r\n"
              "angle=180\r\naction=0\r\n\r\n");
}

TEST_F(JobEditor, ChangesAreAskedForBeforeTheyAreLost) {
    Press(kEditor, ebMoveDown);
    Press(kChangedEditor, ebClose);
    user.Answer(kQuestion, taCancel);
    user.In(kChangedEditor, [](TWindow editor) { PressCloseBox(editor); });
    user.Answer(kQuestion, taDiscard);
    Edit("[Open Image]\n[Save Image]\n");
    EXPECT_FALSE(std::filesystem::exists(folder.File("made.qvjob")));

    Press(kEditor, ebRemove);
    Press(kChangedEditor, ebClose);
    user.Answer(kQuestion, taSave);
    Edit("# mine\n[Open Image]\n# last\n[Save Image]\n");
    EXPECT_EQ(Saved(), "# mine\n# last\n[Save Image]\n");
}

/// A step that the plug-in doesn't know, and a file that cannot be written.
TEST_F(JobEditor, FailuresAreTold) {
    Press(kEditor, ebConfigure);
    user.CloseMessage(kQuestion, u"This plug-in has no such action.");
    Press(kEditor, ebRemove);
    Press(kChangedEditor, ebSave);
    user.CloseMessage(kQuestion, u"The job cannot be saved: ");
    Press(kChangedEditor, ebClose);
    user.Answer(kQuestion, taDiscard);
    std::filesystem::create_directory(folder.File("made.qvjob"));
    Edit("[Fly]\n");
    EXPECT_TRUE(std::filesystem::is_directory(folder.File("made.qvjob")));
}

}  // namespace
}  // namespace zm::test
