#include "engine/platform/hostboundary.h"

#include <cxxabi.h>

#include <exception>

#include "engine/foundation/zmstrings.h"

namespace zm::platform {

void GuardHostCall(const std::function<void()>& body) {
    body();
}

bool CallCatchingHostExceptions(const std::function<void()>& body, std::u16string& message) {
    try {
        body();
        return true;
    } catch (const std::exception& error) {
        message = Utf16FromUtf8(error.what());
    } catch (abi::__forced_unwind&) {
        throw;  // the end of a cancelled thread is no failure and must go on
    } catch (...) {
        message = u"unknown exception";
    }
    return false;
}

std::intptr_t SendHostMessage(void* window, std::uint32_t message, std::uintptr_t wparam,
                              std::intptr_t lparam) {
    if (window == nullptr) {
        return 0;
    }
    return reinterpret_cast<THostMessageFunction>(window)(message, wparam, lparam);
}

}  // namespace zm::platform
