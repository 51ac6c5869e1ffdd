#pragma once

#include <optional>
#include <string>

#include "engine/foundation/zmstrings.h"
#include "host/qvedit.h"
#include "tests/support/testfiles.h"
#include "tests/support/testprocess.h"
#include "tests/views/formuser.h"

/// The job editor's windows in a user's hands; edituser_gtk.cpp and edituser_win32.cpp are.
namespace zm::test {

enum TEditorButton : std::uint8_t {
    ebConfigure,
    ebRemove,
    ebMoveUp,
    ebMoveDown,
    ebSave,
    ebClose,
};

bool IsEnabled(TWindow editor, TEditorButton button);
void PressButton(TWindow editor, TEditorButton button);
/// The menu's entry of an action. It may come after the act that presses it.
void PressAdd(TWindow editor, int action);
int ChosenStep(TWindow editor);
void ChooseStep(TWindow editor, int step);
/// Picks a row in the list of variables.
void PickVariable(TUser& user, int row);

inline constexpr char16_t kEditor[] = u"made.qvjob - Job";
inline constexpr char16_t kChangedEditor[] = u"*made.qvjob - Job";
inline constexpr char16_t kQuestion[] = u"Job Editor";
inline constexpr char16_t kVariables[] = u"Insert Variable";

inline qvrun::THost& Host() {
    static qvrun::THost* const host = [] {
        auto* loaded = new qvrun::THost;
        std::string error_text;
        EXPECT_TRUE(loaded->Load(Utf16FromUtf8(ZM_MODULE_DIR "/Graphics.qvp"), error_text))
            << error_text;
        return loaded;
    }();
    return *host;
}

class JobEditor : public testing::Test {
protected:
    void SetUp() override {
        if (!HasDisplay()) {
            GTEST_SKIP() << "there is no display to open windows on";
        }
    }
    /// Edits a file with this text, or none, while the user acts.
    void Edit(const std::optional<std::string>& text) {
        std::u16string reason;
        qvrun::IJobEditorWindow* const window =
            qvrun::FindEditWindow(Utf16FromUtf8(ZM_MODULE_DIR "/"), reason);
        ASSERT_NE(window, nullptr) << Utf8FromUtf16(reason);
        qvrun::TJobEditor editor(Host(), folder.Name("made.qvjob"), window);
        qvrun::TJobFileError error;
        ASSERT_TRUE(editor.Open(text, error)) << error.message;
        window->Run(editor);
    }
    std::string Saved() const { return ReadWholeText(folder.File("made.qvjob")); }

    void Add(const char16_t* title, int action) {
        user.In(title, [action](TWindow editor) { PressAdd(editor, action); });
    }
    void Press(const char16_t* title, TEditorButton button) {
        user.In(title, [button](TWindow editor) {
            EXPECT_TRUE(IsEnabled(editor, button)) << int{button};
            PressButton(editor, button);
        });
    }

    TempFolder folder;
    TUser user;
};

inline constexpr char kCommented[] =
    "# mine\r\n[Open Image]\r\nimage_file={file}\r\n\r\n# half\r\n[Rotate Image]\r\n"
    "angle=90\r\n; why\r\n[Save Image]\r\nimage_file=x.png";

}  // namespace zm::test
