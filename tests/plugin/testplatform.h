#pragma once

#include <cstdint>
#include <functional>
#include <string>

/// The platform's side of a host in tests: its main window and its exception handler.
namespace zm::test {

using TWindowAnswer = std::function<std::intptr_t(std::uint32_t message, std::uintptr_t wparam,
                                                  std::intptr_t lparam)>;

/// A main window as the contract means it on this platform. One at a time.
class TTestWindow {
public:
    explicit TTestWindow(TWindowAnswer answer);
    ~TTestWindow();
    TTestWindow(const TTestWindow&) = delete;
    TTestWindow& operator=(const TTestWindow&) = delete;
    void* Handle() const { return handle_; }

private:
    void* handle_ = nullptr;
};

/// Whether icons have handles on this platform.
bool IconsHaveHandles();

/// What a host of another make saw of a call.
struct TForeignCatch {
    bool exception_came = false;
    /// It was of the platform's kind: an operating-system exception with our code and message on
    /// Windows, a C++ exception elsewhere.
    bool is_platform_kind = false;
    std::u16string message;
};
TForeignCatch CatchAsForeignHost(const std::function<void()>& call);

}  // namespace zm::test
