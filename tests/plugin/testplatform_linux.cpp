#include <exception>

#include "engine/foundation/zmstrings.h"
#include "tests/plugin/testplatform.h"

namespace zm::test {
namespace {

TWindowAnswer window_answer;

std::intptr_t AnswerMessage(std::uint32_t message, std::uintptr_t wparam, std::intptr_t lparam) {
    return window_answer(message, wparam, lparam);
}

}  // namespace

TTestWindow::TTestWindow(TWindowAnswer answer) : handle_(reinterpret_cast<void*>(&AnswerMessage)) {
    window_answer = std::move(answer);
}

TTestWindow::~TTestWindow() {
    window_answer = nullptr;
}

bool IconsHaveHandles() {
    return false;
}

TForeignCatch CatchAsForeignHost(const std::function<void()>& call) {
    TForeignCatch result;
    try {
        call();
    } catch (const std::exception& error) {
        result.exception_came = true;
        result.is_platform_kind = true;
        result.message = Utf16FromUtf8(error.what());
    }
    return result;
}

}  // namespace zm::test
