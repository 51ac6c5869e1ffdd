#include "engine/platform/console.h"

#include <windows.h>

#include <shellapi.h>

#include <array>
#include <cwchar>

#include "engine/foundation/zmstrings.h"
#include "engine/platform/win32/support_p.h"

namespace zm::platform {
namespace {

bool IsConsole(HANDLE handle) {
    DWORD mode = 0;
    return GetConsoleMode(handle, &mode) != FALSE;
}

void WriteToConsole(HANDLE handle, const std::u16string& text) {
    const wchar_t* rest = WideOf(text);
    std::size_t left = text.size();
    while (left > 0) {
        DWORD written = 0;
        const auto piece = static_cast<DWORD>(left < 8192 ? left : 8192);
        if (WriteConsoleW(handle, rest, piece, &written, nullptr) == FALSE || written == 0) {
            return;
        }
        rest += written;
        left -= written;
    }
}

void WriteToFile(HANDLE handle, const std::string& text) {
    std::size_t done = 0;
    while (done < text.size()) {
        DWORD written = 0;
        if (WriteFile(handle, text.data() + done, static_cast<DWORD>(text.size() - done), &written,
                      nullptr) == FALSE ||
            written == 0) {
            return;
        }
        done += written;
    }
}

void WriteTo(DWORD standard_handle, const std::string& text) {
    const HANDLE handle = GetStdHandle(standard_handle);
    if (IsConsole(handle)) {
        WriteToConsole(handle, Utf16FromUtf8(text));
    } else {
        WriteToFile(handle, text);
    }
}

}  // namespace

std::vector<std::string> ProgramArguments(int argc, char** argv) {
    int count = 0;
    wchar_t** const wide = CommandLineToArgvW(GetCommandLineW(), &count);
    if (wide == nullptr) {
        return {argv, argv + argc};
    }
    std::vector<std::string> arguments;
    for (int i = 0; i < count; ++i) {
        arguments.push_back(Utf8FromUtf16(FromWide(wide[i], std::wcslen(wide[i]))));
    }
    LocalFree(wide);
    return arguments;
}

bool StderrIsTerminal() {
    return IsConsole(GetStdHandle(STD_ERROR_HANDLE));
}

void WriteStdout(const std::string& text) {
    WriteTo(STD_OUTPUT_HANDLE, text);
}

void WriteStderr(const std::string& text) {
    WriteTo(STD_ERROR_HANDLE, text);
}

std::optional<std::string> EnvironmentVariable(const std::string& name) {
    const std::u16string wide_name = Utf16FromUtf8(name);
    std::vector<wchar_t> value(256);
    while (true) {
        SetLastError(ERROR_SUCCESS);
        const DWORD length = GetEnvironmentVariableW(WideOf(wide_name), value.data(),
                                                     static_cast<DWORD>(value.size()));
        if (length == 0 && GetLastError() != ERROR_SUCCESS) {
            return std::nullopt;
        }
        if (length < value.size()) {
            return Utf8FromUtf16(FromWide(value.data(), length));
        }
        value.resize(length + 1u);
    }
}

std::string LocaleName() {
    std::array<wchar_t, LOCALE_NAME_MAX_LENGTH> name{};
    const int length = GetUserDefaultLocaleName(name.data(), static_cast<int>(name.size()));
    return length > 1 ? Utf8FromUtf16(FromWide(name.data(), static_cast<std::size_t>(length - 1)))
                      : std::string();
}

}  // namespace zm::platform
