#pragma once

#include <cerrno>
#include <csignal>
#include <string>
#include <string_view>

#include "engine/foundation/zmstrings.h"

namespace zm::platform {

/// A file name as the system takes it.
inline std::string NativeName(std::u16string_view name) {
    return Utf8FromUtf16(name);
}

/// The system's words for an error number; thread-safe.
std::string ErrorText(int error_number);

/// Repeats a system call that a signal interrupted.
template <typename TCall>
auto RetryInterrupted(TCall call) -> decltype(call()) {
    decltype(call()) result;
    do {
        result = call();
    } while (result == -1 && errno == EINTR);
    return result;
}

/// Turns the signals that a refused write sends (broken pipe, file size limit), which would end
/// the process, into plain errors of the call while the object lives. Consume takes a signal that
/// came meanwhile out of the thread's queue.
class TWriteSignalGuard {
public:
    TWriteSignalGuard();
    ~TWriteSignalGuard();
    TWriteSignalGuard(const TWriteSignalGuard&) = delete;
    TWriteSignalGuard& operator=(const TWriteSignalGuard&) = delete;
    void Consume();

private:
    sigset_t guarded_{};
    sigset_t before_{};
};

}  // namespace zm::platform
