#include <windows.h>

#include "engine/platform/hostboundary.h"
#include "tests/plugin/testplatform.h"

namespace zm::test {
namespace {

constexpr wchar_t kWindowClass[] = L"ZmTestHostWindow";

TWindowAnswer window_answer;

LRESULT CALLBACK AnswerMessage(HWND window, UINT message, WPARAM wparam, LPARAM lparam) {
    if (message < WM_USER || !window_answer) {
        return DefWindowProcW(window, message, wparam, lparam);
    }
    return window_answer(message, wparam, lparam);
}

/// Set by the handler that sees every exception of the process first.
bool system_exception_seen = false;
std::u16string system_exception_text;

LONG CALLBACK WatchException(EXCEPTION_POINTERS* pointers) {
    const EXCEPTION_RECORD& record = *pointers->ExceptionRecord;
    if (record.ExceptionCode == platform::kHostExceptionCode && record.NumberParameters >= 2) {
        system_exception_seen = true;
        system_exception_text.assign(
            reinterpret_cast<const char16_t*>(record.ExceptionInformation[0]),
            record.ExceptionInformation[1]);
    }
    return EXCEPTION_CONTINUE_SEARCH;
}

}  // namespace

TTestWindow::TTestWindow(TWindowAnswer answer) {
    window_answer = std::move(answer);
    WNDCLASSW window_class{};
    window_class.lpfnWndProc = &AnswerMessage;
    window_class.hInstance = GetModuleHandleW(nullptr);
    window_class.lpszClassName = kWindowClass;
    RegisterClassW(&window_class);
    handle_ = CreateWindowExW(0, kWindowClass, L"", 0, 0, 0, 0, 0, HWND_MESSAGE, nullptr,
                              window_class.hInstance, nullptr);
}

TTestWindow::~TTestWindow() {
    DestroyWindow(static_cast<HWND>(handle_));
    UnregisterClassW(kWindowClass, GetModuleHandleW(nullptr));
    window_answer = nullptr;
}

bool IconsHaveHandles() {
    return true;
}

TForeignCatch CatchAsForeignHost(const std::function<void()>& call) {
    system_exception_seen = false;
    system_exception_text.clear();
    void* const watch = AddVectoredExceptionHandler(/*First=*/1, &WatchException);
    TForeignCatch result;
    std::u16string caught_text;
    result.exception_came = !platform::CallCatchingHostExceptions(call, caught_text);
    RemoveVectoredExceptionHandler(watch);
    result.is_platform_kind = system_exception_seen && caught_text == system_exception_text;
    result.message = system_exception_text;
    return result;
}

}  // namespace zm::test
