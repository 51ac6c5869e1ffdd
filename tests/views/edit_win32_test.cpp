// The job editor's window of this system.
#include <windows.h>

#include <commctrl.h>

#include "host/views/win32/qveditids_win32.h"
#include "tests/views/edituser.h"
#include "tests/views/win32windows.h"

namespace zm::test {
namespace {

HWND Button(TWindow editor, TEditorButton button) {
    constexpr int kIds[] = {qvrun::kConfigureId, qvrun::kRemoveId, qvrun::kMoveUpId,
                            qvrun::kMoveDownId,  qvrun::kSaveId,   IDCANCEL};
    return GetDlgItem(HandleOf(editor), kIds[button]);
}

HWND StepList(TWindow editor) {
    return GetDlgItem(HandleOf(editor), qvrun::kStepListId);
}

TEST_F(JobEditor, PointerAndKeysWorkInTheList) {
    user.In(kEditor, [](TWindow editor) {
        EXPECT_FALSE(IsWindowVisible(GetDlgItem(HandleOf(editor), qvrun::kPlaceholderId)));
        EXPECT_EQ(GetFocus(), StepList(editor));
        RECT row{LVIR_BOUNDS, 0, 0, 0};
        SendMessageW(StepList(editor), LVM_GETITEMRECT, 0, reinterpret_cast<LPARAM>(&row));
        PostMessageW(StepList(editor), WM_LBUTTONDBLCLK, MK_LBUTTON,
                     MAKELPARAM(row.left + 40, row.top + 4));
    });
    user.Press(OpenImageForm(), u"btnCancel");
    const auto press = [this](const char16_t* title, WPARAM key) {
        user.In(title, [key](TWindow editor) { PressVirtualKey(HandleOf(editor), key); });
    };
    press(kEditor, VK_DOWN);
    // The key Enter configures what the list has chosen.
    press(kEditor, VK_RETURN);
    user.Press(RotateImageForm(), u"btnCancel");
    user.In(kEditor, [](TWindow editor) { SetFocus(StepList(editor)); });
    for (int step = 0; step < 3; ++step) {
        press(step == 0 ? kEditor : kChangedEditor, VK_DELETE);
    }
    user.In(kChangedEditor, [](TWindow editor) {
        EXPECT_TRUE(IsWindowVisible(GetDlgItem(HandleOf(editor), qvrun::kPlaceholderId)));
        PressKey(editor, tkEscape);
    });
    user.Answer(kQuestion, taDiscard);
    Edit(kCommented);
}

/// As a service does: its window station shows nothing.
TEST(JobEditorWindow, WithoutADesktopThereIsNone) {
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

bool IsEnabled(TWindow editor, TEditorButton button) {
    return IsWindowEnabled(Button(editor, button)) != FALSE;
}

void PressButton(TWindow editor, TEditorButton button) {
    PostMessageW(Button(editor, button), BM_CLICK, 0, 0);
}

/// Posted, as the menu's own command is.
void PressAdd(TWindow editor, int action) {
    PostMessageW(HandleOf(editor), WM_COMMAND, static_cast<WPARAM>(qvrun::kFirstActionId + action),
                 0);
}

int ChosenStep(TWindow editor) {
    return static_cast<int>(
        SendMessageW(StepList(editor), LVM_GETNEXTITEM, static_cast<WPARAM>(-1), LVNI_SELECTED));
}

void ChooseStep(TWindow editor, int step) {
    LVITEMW item{};
    item.stateMask = LVIS_SELECTED | LVIS_FOCUSED;
    item.state = item.stateMask;
    SendMessageW(StepList(editor), LVM_SETITEMSTATE, static_cast<WPARAM>(step),
                 reinterpret_cast<LPARAM>(&item));
}

void PickVariable(TUser& user, int row) {
    user.In(kVariables, [row](TWindow list) {
        for (int down = 0; down < row; ++down) {
            PressVirtualKey(HandleOf(list), VK_DOWN);
        }
    });
    user.In(kVariables, [](TWindow list) { PressKey(list, tkEnter); });
}

}  // namespace zm::test
