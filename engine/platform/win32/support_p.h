#pragma once

#include <windows.h>

#include <cstddef>
#include <string>
#include <string_view>

namespace zm::platform {

static_assert(sizeof(wchar_t) == sizeof(char16_t));

/// Text as the system's calls take it; valid as long as `text`.
inline const wchar_t* WideOf(const std::u16string& text) {
    return reinterpret_cast<const wchar_t*>(text.c_str());
}

inline std::u16string FromWide(const wchar_t* text, std::size_t length) {
    return {reinterpret_cast<const char16_t*>(text), length};
}

inline bool HasEmbeddedZero(std::u16string_view name) {
    return name.find(u'\0') != std::u16string_view::npos;
}

/// A file name as the system's calls take it. Names near or above the classic limit of 260
/// characters get the absolute form that lifts it.
std::u16string NativeName(const std::u16string& name);

/// The system's words for an error code.
std::string ErrorText(DWORD error_code);

/// Closes a handle with its end.
class THandle {
public:
    explicit THandle(HANDLE handle = INVALID_HANDLE_VALUE) : handle_(handle) {}
    ~THandle() { Close(); }
    THandle(const THandle&) = delete;
    THandle& operator=(const THandle&) = delete;
    HANDLE Get() const { return handle_; }
    bool IsValid() const { return handle_ != INVALID_HANDLE_VALUE && handle_ != nullptr; }
    bool Close() {
        const bool closed = !IsValid() || CloseHandle(handle_) != FALSE;
        handle_ = INVALID_HANDLE_VALUE;
        return closed;
    }

private:
    HANDLE handle_;
};

}  // namespace zm::platform
