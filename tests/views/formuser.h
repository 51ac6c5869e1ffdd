#pragma once

#include <gtest/gtest.h>

#include <cstdint>
#include <deque>
#include <functional>
#include <string>
#include <utility>
#include <vector>

#include "actions/uActionFormModel.h"

/// A user of real windows, free of any toolkit: formuser_gtk.cpp and formuser_win32.cpp do what
/// formuser.cpp asks for.
namespace zm::test {

/// A window or control: a GtkWidget's address or a window handle.
using TWindow = void*;

/// Whether windows can be shown here.
bool HasDisplay();

/// The window of this title, when it is there and no other takes the input from it; else nil. A
/// window of the toolkit's own may go by its class.
TWindow WindowTitled(const std::u16string& title);

/// Has every message loop of the thread call `step` each ten milliseconds; an empty one ends that.
/// A step may run inside of another one.
void CallInLoops(std::function<void()> step);

enum TKey : std::uint8_t { tkEnter, tkEscape };
/// To the control that has the keyboard.
void PressKey(TWindow window, TKey key);
void PressCloseBox(TWindow window);

/// A form's window, worked by the names of its controls.
class TFormWindow {
public:
    TFormWindow(TWindow shown, const TActionFormDesign& declared)
        : window(shown), design(declared) {}

    const TFormControl& Declared(const char16_t* name) const;
    /// The control's window, or that of an item of a radio group.
    TWindow Control(const char16_t* name, std::int32_t item = -1) const;

    /// As shown, without marks of mnemonics.
    std::u16string Text(const char16_t* name) const;
    bool IsEnabled(const char16_t* name) const;
    /// Index in a list or colour box.
    std::int32_t Chosen(const char16_t* name) const;
    bool HasFocus(const char16_t* name) const;
    void Focus(const char16_t* name) const;
    /// In UTF-16 units.
    std::int32_t Caret(const char16_t* edit) const;
    void PutCaret(const char16_t* edit, std::int32_t place) const;

    /// In place of what is there.
    void Type(const char16_t* edit, const std::u16string& text) const;
    /// In a list, colour box or radio group.
    void Choose(const char16_t* name, std::int32_t item) const;
    /// A button or check box, with the pointer.
    void Press(const char16_t* name) const;

    const TWindow window;
    const TActionFormDesign& design;
};

/// The answers to "save the changes?".
enum TAnswer : std::uint8_t { taSave, taDiscard, taCancel };

/// Does one act after the other, each as soon as its window waits for one. A window that nobody
/// answers ends the program with a message: a test must not stand still.
class TUser {
public:
    /// True when the act is done, False to be asked again.
    using TAct = std::function<bool(TWindow window)>;

    TUser();
    ~TUser();
    TUser(const TUser&) = delete;
    TUser& operator=(const TUser&) = delete;

    void WhenReady(const std::u16string& title, TAct act);
    void In(const std::u16string& title, std::function<void(TWindow)> act);
    void In(const TActionFormDesign& design, std::function<void(const TFormWindow&)> act);
    void Press(const TActionFormDesign& design, const char16_t* button);
    void PressKey(const TActionFormDesign& design, TKey key);
    /// Closes a message box whose text begins so; its title, where the toolkit shows one.
    void CloseMessage(const std::u16string& title, const std::u16string& text);
    void Answer(const std::u16string& title, TAnswer answer);

private:
    void Step();
    void Wait();

    std::deque<std::pair<std::u16string, TAct>> acts_;
    int waits_ = 0;
};

/// The form has the size of the scale, and no text of a control is cut off.
void ExpectFits(const TFormWindow& form, std::int32_t percent);
/// Gives a window the keyboard, where no desktop does; True once it has it.
bool HasKeyboard(TWindow window);
/// Names of the controls that the tab key leads to, a radio group's with its item behind.
std::vector<std::u16string> FocusRound(const TFormWindow& form);
/// The font of dialogs, where the toolkit takes it from its user.
void UseDialogFont(const std::string& font);
/// Saves the window's client area as a PNG file.
bool SavePicture(TWindow window, const std::u16string& file_name);

}  // namespace zm::test
