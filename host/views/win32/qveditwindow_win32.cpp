#include <windows.h>

#include <commctrl.h>

#include <algorithm>
#include <memory>

#include "engine/foundation/zmstrings.h"
#include "host/qvedit.h"
#include "host/views/win32/qvdialog_win32_p.h"
#include "host/views/win32/qveditids_win32.h"
#include "host/views/win32/qvvariabledialog_win32_p.h"

/// The job editor's window: the list of steps with its buttons. It belongs to the program itself,
/// because its toolkit is the system's.
namespace zm::qvrun {
namespace {

constexpr SIZE kEditorClient{740, 400};
constexpr int kMaxHintLines = 4;
constexpr char16_t kPlaceholder[] =
    u"No steps yet.\n\nPress Add. A job opens an image, changes it, and saves it:\n"
    u"begin with Open Image and end with Save Image.\nIn the dialogs, {V} offers the names of "
    u"the files that the job will run for.";

struct TMenuEnd {
    using pointer = HMENU;
    void operator()(HMENU menu) const { DestroyMenu(menu); }
};

/// A menu's text marks no letter of its own.
std::u16string MenuText(const std::u16string& name) {
    std::u16string text;
    for (const char16_t letter : name) {
        text.append(letter == u'&' ? 2 : 1, letter);
    }
    return text;
}

class TEditDialog : public TListDialog {
public:
    explicit TEditDialog(IJobEditor& editor) : editor_(editor) {}

private:
    SIZE Build() override;
    SIZE SmallestClient() const override;
    void PlaceControls(int width, int height) override;
    void OnCommand(int id) override;
    void OnNotify(const NMHDR& notice) override;
    HBRUSH LabelBackground(HWND label, HDC device) override;

    void PlaceButtonColumn(int left, SIZE button) const;
    void PlaceBottomRow(int width, int top, int row_height, SIZE button) const;
    int HintHeight(int width) const;
    SIZE CommonButtonSize() const;
    void Refresh(int chosen);
    void RefreshButtons();
    void OpenAddMenu();
    void Add(std::size_t action);
    void Configure();
    void MoveBy(int distance);
    void Remove();
    bool Save();
    /// Whether the window may close; asks when there is something to lose.
    bool MayClose();
    void ShowLog();

    IJobEditor& editor_;
    TRowList list_;
    std::u16string hint_text_;
    HWND placeholder_ = nullptr;
    HWND add_ = nullptr;
    HWND configure_ = nullptr;
    HWND remove_ = nullptr;
    HWND up_ = nullptr;
    HWND down_ = nullptr;
    HWND hint_ = nullptr;
    HWND save_ = nullptr;
    HWND close_ = nullptr;
    bool refreshing_ = false;  ///< rows come and go: what the list tells then is no user's choice
};

SIZE TEditDialog::Build() {
    // The placeholder lies before the list, which takes what is clicked there.
    placeholder_ = AddControl(WC_STATICW, SS_CENTER | SS_NOPREFIX, std::u16string(kPlaceholder),
                              kPlaceholderId);
    list_.Attach(AddList(kStepListId), {u"", u"Step", u"What it does"});
    add_ = AddButton(u"&Add...", kAddId);
    configure_ = AddButton(u"&Configure...", kConfigureId);
    remove_ = AddButton(u"&Remove", kRemoveId);
    up_ = AddButton(u"Move &Up", kMoveUpId);
    down_ = AddButton(u"Move &Down", kMoveDownId);
    hint_text_ = u"Run it with:  qvrun run " + editor_.FileName() + u" PICTURES... --output FOLDER";
    // A field without a frame, so that the command can be copied.
    hint_ = AddControl(WC_EDITW, ES_READONLY | ES_MULTILINE, hint_text_, kHintId);
    save_ = AddButton(u"&Save", kSaveId);
    close_ = AddButton(u"C&lose", IDCANCEL);
    Refresh(0);
    Focus(list_.Count() > 0 ? list_.Window() : add_);
    return kEditorClient;
}

SIZE TEditDialog::CommonButtonSize() const {
    return ButtonSize({add_, configure_, remove_, up_, down_, save_, close_});
}

/// The placeholder beside the buttons, and all of these above the longest hint.
SIZE TEditDialog::SmallestClient() const {
    constexpr int kColumnButtons = 5;
    const SIZE button = CommonButtonSize();
    const SIZE text = TextSize(kPlaceholder);
    const LONG hint = kMaxHintLines * TextSize(u"X").cy;
    return {text.cx + button.cx + 5 * kMargin,
            kColumnButtons * (button.cy + kGap) + std::max(hint, button.cy) + 3 * kMargin};
}

int TEditDialog::HintHeight(int width) const {
    const LONG line = TextSize(u"X").cy;
    return static_cast<int>(std::min(TextSize(hint_text_, width).cy, kMaxHintLines * line));
}

void TEditDialog::PlaceControls(int width, int height) {
    const SIZE button = CommonButtonSize();
    const int hint_width = width - 2 * kMargin - 2 * (button.cx + kGap);
    const int row_height = std::max(static_cast<int>(button.cy), HintHeight(hint_width));
    const int row_top = height - kMargin - row_height;
    const int column_left = width - kMargin - button.cx;
    const int list_width = column_left - 2 * kMargin;
    const int list_height = row_top - 2 * kMargin;
    Place(list_.Window(), kMargin, kMargin, list_width, list_height);
    list_.FitColumns();
    SIZE text = TextSize(kPlaceholder);
    text.cx += 2 * kGap;  // a label that is no wider than its text may break its lines anew
    Place(placeholder_, kMargin + (list_width - text.cx) / 2, kMargin + (list_height - text.cy) / 2,
          text.cx, text.cy);
    PlaceButtonColumn(column_left, button);
    PlaceBottomRow(width, row_top, row_height, button);
    InvalidateRect(Window(), nullptr, TRUE);
}

void TEditDialog::PlaceButtonColumn(int left, SIZE button) const {
    int top = kMargin;
    for (const HWND control : {add_, configure_, remove_, up_, down_}) {
        Place(control, left, top, button.cx, button.cy);
        top += button.cy + kGap;
    }
}

void TEditDialog::PlaceBottomRow(int width, int top, int row_height, SIZE button) const {
    const int button_top = top + (row_height - button.cy) / 2;
    const int close_left = width - kMargin - button.cx;
    const int save_left = close_left - kGap - button.cx;
    const int hint_width = save_left - kGap - kMargin;
    const int hint_height = HintHeight(hint_width);
    Place(hint_, kMargin, top + (row_height - hint_height) / 2, hint_width, hint_height);
    Place(save_, save_left, button_top, button.cx, button.cy);
    Place(close_, close_left, button_top, button.cx, button.cy);
}

void TEditDialog::OnCommand(int id) {
    switch (id) {
        case kAddId: OpenAddMenu(); break;
        case kConfigureId: Configure(); break;
        case kRemoveId: Remove(); break;
        case kMoveUpId: MoveBy(-1); break;
        case kMoveDownId: MoveBy(1); break;
        case kSaveId: Save(); break;
        case IDCANCEL:
            if (MayClose()) {
                Close();
            }
            break;
        default:
            if (id >= kFirstActionId) {
                Add(static_cast<std::size_t>(id - kFirstActionId));
            }
            break;
    }
}

void TEditDialog::OnNotify(const NMHDR& notice) {
    if (notice.hwndFrom != list_.Window() || refreshing_) {
        return;
    }
    switch (notice.code) {
        case static_cast<UINT>(LVN_ITEMCHANGED): RefreshButtons(); break;
        case static_cast<UINT>(NM_DBLCLK): Configure(); break;
        case static_cast<UINT>(LVN_KEYDOWN):
            if (reinterpret_cast<const NMLVKEYDOWN&>(notice).wVKey == VK_DELETE) {
                Remove();
            }
            break;
        default: break;
    }
}

HBRUSH TEditDialog::LabelBackground(HWND label, HDC device) {
    if (label != placeholder_) {
        return nullptr;
    }
    SetTextColor(device, GetSysColor(COLOR_WINDOWTEXT));
    SetBkColor(device, GetSysColor(COLOR_WINDOW));
    return GetSysColorBrush(COLOR_WINDOW);
}

/// Shows the job as it is now.
void TEditDialog::Refresh(int chosen) {
    std::vector<TRowList::TRow> rows;
    for (const TStepLine& step : editor_.Steps()) {
        rows.push_back(
            {Utf16FromUtf8(std::to_string(rows.size() + 1)), step.action, step.description});
    }
    refreshing_ = true;
    list_.SetRows(rows);
    list_.Choose(std::min(chosen, static_cast<int>(rows.size()) - 1));
    refreshing_ = false;
    ShowWindow(placeholder_, rows.empty() ? SW_SHOW : SW_HIDE);
    const std::u16string title =
        (editor_.IsChanged() ? u"*" : u"") + FileBaseName(editor_.FileName()) + u" - Job";
    SetWindowTextW(Window(), WideText(title));
    RefreshButtons();
}

void TEditDialog::RefreshButtons() {
    const int chosen = list_.Chosen();
    const int count = list_.Count();
    const HWND next_focus = count > 0 ? list_.Window() : add_;
    Enable(configure_, chosen >= 0, next_focus);
    Enable(remove_, chosen >= 0, next_focus);
    Enable(up_, chosen > 0, next_focus);
    Enable(down_, chosen >= 0 && chosen + 1 < count, next_focus);
    Enable(save_, editor_.IsChanged(), next_focus);
    // What the key Enter does in the list.
    SendMessageW(Window(), DM_SETDEFID, static_cast<WPARAM>(chosen >= 0 ? kConfigureId : kAddId),
                 0);
}

/// Below the button, one entry per action; the entries come back as commands.
void TEditDialog::OpenAddMenu() {
    const std::unique_ptr<HMENU, TMenuEnd> menu(CreatePopupMenu());
    int id = kFirstActionId;
    for (const std::u16string& action : editor_.ActionNames()) {
        AppendMenuW(menu.get(), MF_STRING, static_cast<UINT_PTR>(id++), WideText(MenuText(action)));
    }
    TPMPARAMS beside{};
    beside.cbSize = sizeof(beside);
    GetWindowRect(add_, &beside.rcExclude);
    TrackPopupMenuEx(menu.get(), TPM_LEFTALIGN | TPM_TOPALIGN | TPM_VERTICAL, beside.rcExclude.left,
                     beside.rcExclude.bottom, Window(), &beside);
}

/// Steps are added below the chosen one.
void TEditDialog::Add(std::size_t action) {
    const int position = list_.Chosen() + 1;
    if (editor_.AddStep(action, static_cast<std::size_t>(position))) {
        Refresh(position);
        Focus(list_.Window());
    }
    ShowLog();
}

void TEditDialog::Configure() {
    const int chosen = list_.Chosen();
    if (chosen >= 0 && editor_.ConfigureStep(static_cast<std::size_t>(chosen))) {
        Refresh(chosen);
    }
    ShowLog();
}

void TEditDialog::MoveBy(int distance) {
    const int chosen = list_.Chosen();
    const int target = chosen + distance;
    if (chosen >= 0 && target >= 0) {
        editor_.MoveStep(static_cast<std::size_t>(chosen), static_cast<std::size_t>(target));
        Refresh(target);
    }
}

void TEditDialog::Remove() {
    const int chosen = list_.Chosen();
    if (chosen >= 0) {
        editor_.RemoveStep(static_cast<std::size_t>(chosen));
        Refresh(chosen);
    }
}

bool TEditDialog::Save() {
    std::u16string reason;
    const bool saved = editor_.Save(reason);
    if (!saved) {
        Tell(Window(), MB_ICONERROR, u"The job cannot be saved: " + reason);
    }
    Refresh(list_.Chosen());
    return saved;
}

bool TEditDialog::MayClose() {
    if (!editor_.IsChanged()) {
        return true;
    }
    const int answer = MessageBoxW(Window(), L"Save the changes of the job?", kMessageTitle,
                                   MB_YESNOCANCEL | MB_ICONQUESTION);
    return answer == IDNO || (answer == IDYES && Save());
}

void TEditDialog::ShowLog() {
    std::u16string text;
    for (const std::u16string& line : editor_.TakeLog()) {
        text += (text.empty() ? u"" : u"\n") + line;
    }
    if (!text.empty()) {
        Tell(Window(), MB_ICONWARNING, text);
    }
}

class TWin32JobEditorWindow : public IJobEditorWindow {
public:
    void Run(IJobEditor& editor) override { TEditDialog(editor).Run(nullptr); }
    std::u16string PickVariable(const std::vector<TVariableInfo>& variables) override {
        return RunVariableDialog(variables);
    }
};

/// Whether the system gives windows to this program and somebody can see them.
bool CanShowWindows() {
    if (!HasVisibleDesktop()) {
        return false;
    }
    const HWND window = CreateWindowExW(0, WC_STATICW, L"", WS_POPUP, 0, 0, 1, 1, nullptr, nullptr,
                                        OwnModule(), nullptr);
    if (window != nullptr) {
        DestroyWindow(window);
    }
    return window != nullptr;
}

}  // namespace

IJobEditorWindow* FindEditWindow(const std::u16string&, std::u16string& reason) {
    static TWin32JobEditorWindow window;
    if (!CanShowWindows()) {
        reason = u"there is no display to show it on";
        return nullptr;
    }
    return &window;
}

}  // namespace zm::qvrun
