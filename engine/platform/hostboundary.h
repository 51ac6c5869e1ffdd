#pragma once

#include <cstdint>
#include <functional>
#include <string>

/// What happens where our code meets a host that another compiler built.
namespace zm::platform {

/// Runs `body`. Exceptions pass to the host and must not kill it: elsewhere than on Windows
/// they just propagate. On Windows a C++ exception that leaves `body` has its clean-up run
/// here and is raised again as an operating-system exception with the code
/// kHostExceptionCode, which any host's handler can catch; parameter 0 is the address of the
/// zero-terminated UTF-16 message, parameter 1 its length in characters. The message stays valid
/// until the thread's next such exception.
void GuardHostCall(const std::function<void()>& body);

inline constexpr std::uint32_t kHostExceptionCode = 0xE05A4D47;  // customer bit set, "ZMG"

/// Runs `body` as a host with a foreign handler would: true when it ended normally, false when an
/// operating-system or C++ exception came out; `message` (UTF-16) then tells its text. Used by
/// our host and the tests.
bool CallCatchingHostExceptions(const std::function<void()>& body, std::u16string& message);

/// Blocking message to the host's main window. On Windows a window handle; elsewhere the address
/// of a function (message, wparam, lparam) returning a pointer-sized answer. A nil handle
/// answers 0.
std::intptr_t SendHostMessage(void* window, std::uint32_t message, std::uintptr_t wparam,
                              std::intptr_t lparam);
using THostMessageFunction = std::intptr_t (*)(std::uint32_t message, std::uintptr_t wparam,
                                               std::intptr_t lparam);

}  // namespace zm::platform
