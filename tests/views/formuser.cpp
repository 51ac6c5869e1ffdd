#include "tests/views/formuser.h"

#include <algorithm>
#include <cstdio>
#include <cstdlib>
#include <utility>

#include "engine/foundation/zmstrings.h"

namespace zm::test {
namespace {

/// Steps without an act: forty seconds, and more where the machine is slow.
constexpr int kMaxWaits = 4000;

const char* TestName() {
    const testing::TestInfo* const test = testing::UnitTest::GetInstance()->current_test_info();
    return test == nullptr ? "no test" : test->name();
}

}  // namespace

const TFormControl& TFormWindow::Declared(const char16_t* name) const {
    const auto found =
        std::find_if(design.controls.begin(), design.controls.end(),
                     [name](const TFormControl& control) { return control.name == name; });
    EXPECT_NE(found, design.controls.end()) << Utf8FromUtf16(name);
    return found == design.controls.end() ? design.controls.front() : *found;
}

TUser::TUser() {
    CallInLoops([this] { Step(); });
}

TUser::~TUser() {
    CallInLoops({});
    EXPECT_TRUE(acts_.empty()) << "never came: " << Utf8FromUtf16(acts_.front().first);
}

void TUser::WhenReady(const std::u16string& title, TAct act) {
    acts_.emplace_back(title, std::move(act));
}

void TUser::In(const std::u16string& title, std::function<void(TWindow)> act) {
    WhenReady(title, [act = std::move(act)](TWindow window) {
        act(window);
        return true;
    });
}

void TUser::In(const TActionFormDesign& design, std::function<void(const TFormWindow&)> act) {
    In(design.caption,
       [&design, act = std::move(act)](TWindow window) { act(TFormWindow(window, design)); });
}

void TUser::Press(const TActionFormDesign& design, const char16_t* button) {
    In(design, [button](const TFormWindow& form) { form.Press(button); });
}

void TUser::PressKey(const TActionFormDesign& design, TKey key) {
    In(design.caption, [key](TWindow window) { test::PressKey(window, key); });
}

/// An act may open a dialog and with it another message loop, in which the next acts come.
void TUser::Step() {
    const TWindow window = acts_.empty() ? nullptr : WindowTitled(acts_.front().first);
    if (window == nullptr) {
        Wait();
        return;
    }
    auto act = std::move(acts_.front());
    acts_.pop_front();
    const int waits = std::exchange(waits_, 0);
    if (!act.second(window)) {
        acts_.push_front(std::move(act));
        waits_ = waits;
        Wait();
    }
}

void TUser::Wait() {
    if (++waits_ > kMaxWaits) {
        const std::string wanted = acts_.empty()
                                       ? "nothing more to do"
                                       : "waiting to act in " + Utf8FromUtf16(acts_.front().first);
        std::fprintf(stderr, "%s: a window stays open; %s, acts left: %zu\n", TestName(),
                     wanted.c_str(), acts_.size());
        std::fflush(nullptr);
        std::_Exit(EXIT_FAILURE);
    }
}

}  // namespace zm::test
