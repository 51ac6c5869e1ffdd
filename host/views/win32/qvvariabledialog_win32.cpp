#include "host/views/win32/qvvariabledialog_win32_p.h"

#include <windows.h>

#include <commctrl.h>

#include "host/views/win32/qvdialog_win32_p.h"
#include "host/views/win32/qveditids_win32.h"

namespace zm::qvrun {
namespace {

constexpr SIZE kPickerClient{460, 320};
constexpr SIZE kSmallestPicker{300, 200};

class TVariableDialog : public TListDialog {
public:
    explicit TVariableDialog(const std::vector<TVariableInfo>& variables) : variables_(variables) {}
    std::u16string Pick() {
        Run(GetActiveWindow());
        return picked_;
    }

private:
    SIZE Build() override;
    SIZE SmallestClient() const override { return kSmallestPicker; }
    void PlaceControls(int width, int height) override;
    void OnCommand(int id) override;
    void OnNotify(const NMHDR& notice) override;
    void Accept();

    const std::vector<TVariableInfo>& variables_;
    TRowList list_;
    HWND insert_ = nullptr;
    HWND cancel_ = nullptr;
    std::u16string picked_;
};

SIZE TVariableDialog::Build() {
    SetWindowTextW(Window(), L"Insert Variable");
    list_.Attach(AddList(kVariableListId), {u"Variable", u"Stands for"});
    insert_ = AddButton(u"&Insert", IDOK);
    cancel_ = AddButton(u"&Cancel", IDCANCEL);
    SendMessageW(Window(), DM_SETDEFID, IDOK, 0);
    std::vector<TRowList::TRow> rows;
    for (const TVariableInfo& variable : variables_) {
        rows.push_back({variable.reference, variable.meaning});
    }
    list_.SetRows(rows);
    list_.Choose(0);
    Focus(list_.Window());
    return kPickerClient;
}

void TVariableDialog::PlaceControls(int width, int height) {
    const SIZE button = ButtonSize({insert_, cancel_});
    const int button_top = height - kMargin - button.cy;
    Place(list_.Window(), kMargin, kMargin, width - 2 * kMargin, button_top - 2 * kMargin);
    list_.FitColumns();
    const int cancel_left = width - kMargin - button.cx;
    Place(cancel_, cancel_left, button_top, button.cx, button.cy);
    Place(insert_, cancel_left - kGap - button.cx, button_top, button.cx, button.cy);
}

void TVariableDialog::OnCommand(int id) {
    if (id == IDOK) {
        Accept();
    } else if (id == IDCANCEL) {
        Close();
    }
}

void TVariableDialog::OnNotify(const NMHDR& notice) {
    if (notice.hwndFrom == list_.Window() && notice.code == static_cast<UINT>(NM_DBLCLK)) {
        Accept();
    }
}

void TVariableDialog::Accept() {
    const int chosen = list_.Chosen();
    if (chosen >= 0) {
        picked_ = variables_[static_cast<std::size_t>(chosen)].reference;
        Close();
    }
}

}  // namespace

std::u16string RunVariableDialog(const std::vector<TVariableInfo>& variables) {
    return TVariableDialog(variables).Pick();
}

}  // namespace zm::qvrun
