// The job editor as a new user meets it: from no file at all to a job with a caption. The real
// windows, worked by messages.
#include <windows.h>

#include <commctrl.h>

#include <filesystem>
#include <optional>
#include <string>

#include "engine/bitmap/zmxBitmaps.h"
#include "engine/foundation/zmstrings.h"
#include "engine/io/zmfiletypes.h"
#include "host/qvedit.h"
#include "host/views/win32/qveditids_win32.h"
#include "tests/support/testfiles.h"
#include "tests/support/testimages.h"
#include "tests/support/testprocess.h"
#include "tests/views/win32support.h"

namespace zm::test {
namespace {

constexpr char16_t kEditor[] = u"made.qvjob - Job";
constexpr char16_t kChangedEditor[] = u"*made.qvjob - Job";
constexpr char16_t kQuestion[] = u"Job Editor";

qvrun::THost& Host() {
    static qvrun::THost* const host = [] {
        auto* loaded = new qvrun::THost;
        std::string error_text;
        EXPECT_TRUE(loaded->Load(Utf16FromUtf8(ZM_MODULE_DIR "/Graphics.qvp"), error_text))
            << error_text;
        return loaded;
    }();
    return *host;
}

int Chosen(HWND list) {
    return static_cast<int>(
        SendMessageW(list, LVM_GETNEXTITEM, static_cast<WPARAM>(-1), LVNI_SELECTED));
}

bool IsEnabled(HWND window, int id) {
    return IsWindowEnabled(GetDlgItem(window, id)) != FALSE;
}

/// Through the queue, to the control that has the keyboard.
void Key(WPARAM key) {
    PostMessageW(GetFocus(), WM_KEYDOWN, key, 0);
    PostMessageW(GetFocus(), WM_KEYUP, key, static_cast<LPARAM>(0xC0000000));
}

class Win32Edit : public testing::Test {
protected:
    void SetUp() override {
        if (!HasDisplay()) {
            GTEST_SKIP() << "there is no display to open windows on";
        }
    }
    void Edit(const std::optional<std::string>& text) {
        std::u16string reason;
        qvrun::IJobEditorWindow* const window = qvrun::FindEditWindow(u"", reason);
        ASSERT_NE(window, nullptr) << Utf8FromUtf16(reason);
        qvrun::TJobEditor editor(Host(), folder.Name("made.qvjob"), window);
        qvrun::TJobFileError error;
        ASSERT_TRUE(editor.Open(text, error)) << error.message;
        window->Run(editor);
    }
    std::string Saved() const { return ReadWholeText(folder.File("made.qvjob")); }

    void In(const char16_t* title, std::function<void(HWND)> act) {
        user.WhenReady(title, [act = std::move(act)](HWND window) {
            act(window);
            return true;
        });
    }
    /// Posted, as the menu's own command is: the act is done before the step's dialog opens.
    void Add(const char16_t* title, int action) {
        In(title, [action](HWND window) {
            PostMessageW(window, WM_COMMAND, static_cast<WPARAM>(qvrun::kFirstActionId + action),
                         0);
        });
    }
    void PressInList(const char16_t* title, WPARAM key) {
        In(title, [key](HWND window) {
            SetFocus(GetDlgItem(window, qvrun::kStepListId));
            Key(key);
        });
    }
    void Press(const char16_t* title, int id) {
        In(title, [id](HWND window) {
            EXPECT_TRUE(IsEnabled(window, id)) << id;
            PostMessageW(GetDlgItem(window, id), BM_CLICK, 0, 0);
        });
    }

    TempFolder folder;
    TWin32User user;
};

TEST_F(Win32Edit, FromNothingToACaption) {
    In(kEditor, [](HWND window) {
        EXPECT_TRUE(IsWindowVisible(GetDlgItem(window, qvrun::kPlaceholderId)));
        for (const int id : {qvrun::kConfigureId, qvrun::kRemoveId, qvrun::kMoveUpId,
                             qvrun::kMoveDownId, qvrun::kSaveId}) {
            EXPECT_FALSE(IsEnabled(window, id)) << id;
        }
        EXPECT_EQ(GetFocus(), GetDlgItem(window, qvrun::kAddId));
    });
    Add(kEditor, 0);
    user.In(OpenImageForm(), [](const TFormWindow& form) {
        SetFocus(form.Control(u"edtImageFile"));
        form.Click(u"SpeedButton1");  // returns when the list of variables has closed
        EXPECT_EQ(form.Text(u"edtImageFile"), u"{name}");
        form.Type(u"edtImageFile", u"{file}");
    });
    In(u"Insert Variable", [](HWND) {
        Key(VK_DOWN);
        Key(VK_DOWN);
    });
    In(u"Insert Variable", [](HWND) { Key(VK_RETURN); });
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
            [](const TFormWindow& form) { form.Type(u"edtImageFile", u"{out}\\made.jpg"); });
    user.Press(SaveImageForm(), u"btnOk");
    Press(kChangedEditor, qvrun::kSaveId);
    Press(kEditor, IDCANCEL);
    Edit(std::nullopt);
    EXPECT_EQ(Saved(),
              "[Open Image]\nsource=0\nimage_file={file}\n\n"
              "[Draw Text on Image]\ntext=(c) me\nfont_name=Tahoma\nfont_size=16\nfont_color=0\n"
              "font_styles=0\nx_pos=3\ny_pos=2\ncustom_x=0\ncustom_y=0\n\n"
              "[Save Image]\ndest=0\nimage_file={out}\\made.jpg\nformat=0\nsave_meta=0\n");
    ASSERT_TRUE(MakeGradient(zm24RGB, 60, 40)->Write(folder.Name("a.png"), ioPNG, nullptr));
    const std::string program = (std::filesystem::path(ZM_MODULE_DIR) / "qvrun").string();
    const TProcessResult result =
        RunProcess(program + " run " + folder.File("made.qvjob").string() + " " +
                       folder.File("a.png").string() + " --output " + folder.Path().string(),
                   folder.Path());
    EXPECT_EQ(result.exit_status, 0) << result.standard_error;
    EXPECT_TRUE(std::filesystem::exists(folder.File("made.jpg")));
}

constexpr char kCommented[] =
    "# mine\r\n[Open Image]\r\nimage_file={file}\r\n\r\n# half\r\n[Rotate Image]\r\n"
    "angle=90\r\n; why\r\n[Save Image]\r\nimage_file=x.png";

TEST_F(Win32Edit, CancelledDialogsLeaveTheFile) {
    WriteFileBytes(folder.File("made.qvjob"), {std::begin(kCommented), std::end(kCommented) - 1});
    In(kEditor, [](HWND window) {
        const HWND list = GetDlgItem(window, qvrun::kStepListId);
        RECT row{LVIR_BOUNDS, 0, 0, 0};
        SendMessageW(list, LVM_GETITEMRECT, 0, reinterpret_cast<LPARAM>(&row));
        PostMessageW(list, WM_LBUTTONDBLCLK, MK_LBUTTON, MAKELPARAM(row.left + 40, row.top + 4));
    });
    user.In(OpenImageForm(), [](const TFormWindow& form) {
        form.Type(u"edtImageFile", u"lost");
        form.Click(u"SpeedButton1");
        EXPECT_EQ(form.Text(u"edtImageFile"), u"lost");
    });
    In(u"Insert Variable", [](HWND) { Key(VK_ESCAPE); });
    user.Press(OpenImageForm(), u"btnCancel");
    PressInList(kEditor, VK_DOWN);
    // The key Enter configures what the list has chosen.
    In(kEditor, [](HWND window) {
        EXPECT_EQ(Chosen(GetDlgItem(window, qvrun::kStepListId)), 1);
        Key(VK_RETURN);
    });
    user.Press(RotateImageForm(), u"btnCancel");
    In(kEditor, [](HWND) { Key(VK_ESCAPE); });
    Edit(kCommented);
    EXPECT_EQ(Saved(), kCommented);
}

TEST_F(Win32Edit, CommentsAndOrderAreKept) {
    In(kEditor, [](HWND window) {
        EXPECT_FALSE(IsEnabled(window, qvrun::kMoveUpId));
        EXPECT_EQ(GetFocus(), GetDlgItem(window, qvrun::kStepListId));
        Key(VK_DOWN);
    });
    Press(kEditor, qvrun::kMoveDownId);
    In(kChangedEditor, [](HWND window) {
        EXPECT_EQ(Chosen(GetDlgItem(window, qvrun::kStepListId)), 2);
        EXPECT_FALSE(IsEnabled(window, qvrun::kMoveDownId));
    });
    Press(kChangedEditor, qvrun::kMoveUpId);
    Press(kChangedEditor, qvrun::kConfigureId);
    user.In(RotateImageForm(), [](const TFormWindow& form) { form.Type(u"edtAngle", u"180"); });
    user.Press(RotateImageForm(), u"btnOk");
    PressInList(kChangedEditor, VK_DOWN);
    PressInList(kChangedEditor, VK_DELETE);
    Press(kChangedEditor, qvrun::kSaveId);
    Press(kEditor, IDCANCEL);
    Edit(kCommented);
    EXPECT_EQ(Saved(),
              "# mine\r\n[Open Image]\r\nimage_file={file}\r\n\r\n# half\r\n[Rotate Image]\r\n"
              "angle=180\r\naction=0\r\n\r\n");
}

TEST_F(Win32Edit, ChangesAreAskedForBeforeTheyAreLost) {
    Press(kEditor, qvrun::kMoveDownId);
    Press(kChangedEditor, IDCANCEL);
    user.Answer(kQuestion, IDCANCEL);
    In(kChangedEditor, [](HWND window) { PostMessageW(window, WM_CLOSE, 0, 0); });
    user.Answer(kQuestion, IDNO);
    Edit("[Open Image]\n[Save Image]\n");
    EXPECT_FALSE(std::filesystem::exists(folder.File("made.qvjob")));

    Press(kEditor, qvrun::kRemoveId);
    Press(kChangedEditor, IDCANCEL);
    user.Answer(kQuestion, IDYES);
    Edit("# mine\n[Open Image]\n# last\n[Save Image]\n");
    EXPECT_EQ(Saved(), "# mine\n# last\n[Save Image]\n");
}

/// A step that the plug-in doesn't know, and a file that cannot be written.
TEST_F(Win32Edit, FailuresAreTold) {
    Press(kEditor, qvrun::kConfigureId);
    In(kQuestion, [](HWND box) {
        EXPECT_NE(FindWindowExW(box, nullptr, L"Static", L"This plug-in has no such action."),
                  nullptr);
        EndDialog(box, IDOK);
    });
    Press(kEditor, qvrun::kRemoveId);
    Press(kChangedEditor, qvrun::kSaveId);
    user.Answer(kQuestion, IDOK);
    Press(kChangedEditor, IDCANCEL);
    user.Answer(kQuestion, IDNO);
    std::filesystem::create_directory(folder.File("made.qvjob"));
    Edit("[Fly]\n");
    EXPECT_TRUE(std::filesystem::is_directory(folder.File("made.qvjob")));
}

/// As a service does: its window station shows nothing.
TEST(Win32EditWindow, WithoutADesktopThereIsNone) {
    const HWINSTA own = GetProcessWindowStation();
    const HWINSTA unseen = CreateWindowStationW(nullptr, 0, WINSTA_ALL_ACCESS, nullptr);
    ASSERT_NE(unseen, nullptr);
    ASSERT_TRUE(SetProcessWindowStation(unseen));
    std::u16string reason;
    EXPECT_EQ(qvrun::FindEditWindow(u"", reason), nullptr);
    EXPECT_EQ(reason, u"there is no display to show it on");
    SetProcessWindowStation(own);
    CloseWindowStation(unseen);
}

}  // namespace
}  // namespace zm::test
