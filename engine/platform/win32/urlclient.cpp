#include "engine/platform/urlclient.h"

#include <algorithm>
#include <array>
#include <memory>
#include <new>

#include "engine/platform/module.h"
#include "engine/platform/win32/support_p.h"

#include <wininet.h>

// The system's own client, bound by name so that a host without it can still load the module.
namespace zm::platform {
namespace {

constexpr DWORD kMillisecondsPerSecond = 1000;

/// Loaded once and kept.
struct TInternetLibrary {
    std::unique_ptr<TLibrary> library;
    decltype(&::InternetOpenW) open = nullptr;
    decltype(&::InternetOpenUrlW) open_url = nullptr;
    decltype(&::InternetReadFile) read_file = nullptr;
    decltype(&::InternetCloseHandle) close_handle = nullptr;
    decltype(&::InternetSetOptionW) set_option = nullptr;
    decltype(&::HttpQueryInfoW) query_info = nullptr;
    bool is_ready = false;
};

template <typename TFunction>
bool Bind(TLibrary& library, const char* name, TFunction& function) {
    function = reinterpret_cast<TFunction>(library.FindSymbol(name));
    return function != nullptr;
}

bool BindAll(TInternetLibrary& internet) {
    TLibrary& library = *internet.library;
    return Bind(library, "InternetOpenW", internet.open) &&
           Bind(library, "InternetOpenUrlW", internet.open_url) &&
           Bind(library, "InternetReadFile", internet.read_file) &&
           Bind(library, "InternetCloseHandle", internet.close_handle) &&
           Bind(library, "InternetSetOptionW", internet.set_option) &&
           Bind(library, "HttpQueryInfoW", internet.query_info);
}

TInternetLibrary* LoadInternet() {
    auto internet = std::make_unique<TInternetLibrary>();
    std::string error_text;
    internet->library = LoadInstalledLibrary("wininet.dll", error_text);
    internet->is_ready = internet->library != nullptr && BindAll(*internet);
    return internet.release();
}

TInternetLibrary& Internet() {
    static TInternetLibrary* const internet = LoadInternet();
    return *internet;
}

/// A handle of the client; closes itself.
class TInternetHandle {
public:
    explicit TInternetHandle(HINTERNET handle) : handle_(handle) {}
    ~TInternetHandle() {
        if (handle_ != nullptr) {
            Internet().close_handle(handle_);
        }
    }
    TInternetHandle(const TInternetHandle&) = delete;
    TInternetHandle& operator=(const TInternetHandle&) = delete;
    HINTERNET Get() const { return handle_; }

private:
    HINTERNET handle_;
};

void SetNumber(HINTERNET handle, DWORD option, DWORD value) {
    Internet().set_option(handle, option, &value, sizeof(value));
}

void SetText(HINTERNET handle, DWORD option, const std::u16string& text) {
    if (!text.empty()) {
        Internet().set_option(handle, option, const_cast<wchar_t*>(WideOf(text)),
                              static_cast<DWORD>(text.size()));
    }
}

bool AsksToStop(const TUrlRequest& request) {
    try {
        return request.should_stop && request.should_stop();
    } catch (...) {
        return true;
    }
}

/// An answer of http with an error status has a page of its own, which is no image.
bool StatusIsGood(HINTERNET answer) {
    constexpr DWORD kFirstErrorStatus = 400;
    DWORD status = 0;
    DWORD size = sizeof(status);
    const BOOL has_status = Internet().query_info(
        answer, HTTP_QUERY_STATUS_CODE | HTTP_QUERY_FLAG_NUMBER, &status, &size, nullptr);
    return has_status == FALSE || status < kFirstErrorStatus;
}

bool ReadAnswer(HINTERNET answer, const TUrlRequest& request, std::vector<std::uint8_t>& bytes,
                std::string& error_text) {
    std::array<std::uint8_t, 16384> piece;
    for (;;) {
        DWORD got = 0;
        const BOOL is_read =
            Internet().read_file(answer, piece.data(), static_cast<DWORD>(piece.size()), &got);
        if (is_read == FALSE) {
            error_text = ErrorText(GetLastError());
            return false;
        }
        if (got == 0) {
            return true;
        }
        if (static_cast<std::int64_t>(bytes.size()) + got > request.max_bytes) {
            error_text = "the answer is too long";
            return false;
        }
        if (AsksToStop(request)) {
            error_text = "stopped";
            return false;
        }
        bytes.insert(bytes.end(), piece.data(), piece.data() + got);
    }
}

}  // namespace

bool UrlClientIsAvailable() {
    return Internet().is_ready;
}

std::optional<std::vector<std::uint8_t>> FetchUrl(const TUrlRequest& request,
                                                  std::string& error_text) {
    TInternetLibrary& internet = Internet();
    if (!internet.is_ready) {
        error_text = "the system's client is missing";
        return std::nullopt;
    }
    const bool has_proxy = !request.proxy_address.empty();
    const TInternetHandle session(internet.open(
        L"Mozilla/5.0", has_proxy ? INTERNET_OPEN_TYPE_PROXY : INTERNET_OPEN_TYPE_PRECONFIG,
        has_proxy ? WideOf(request.proxy_address) : nullptr, nullptr, 0));
    if (session.Get() == nullptr) {
        error_text = ErrorText(GetLastError());
        return std::nullopt;
    }
    SetNumber(session.Get(), INTERNET_OPTION_CONNECT_TIMEOUT,
              static_cast<DWORD>(request.connect_seconds) * kMillisecondsPerSecond);
    SetNumber(session.Get(), INTERNET_OPTION_RECEIVE_TIMEOUT,
              static_cast<DWORD>(request.stall_seconds) * kMillisecondsPerSecond);
    SetText(session.Get(), INTERNET_OPTION_PROXY_USERNAME, request.proxy_user);
    SetText(session.Get(), INTERNET_OPTION_PROXY_PASSWORD, request.proxy_password);
    const TInternetHandle answer(
        internet.open_url(session.Get(), WideOf(request.url), nullptr, 0,
                          INTERNET_FLAG_RELOAD | INTERNET_FLAG_NO_UI | INTERNET_FLAG_PASSIVE, 0));
    if (answer.Get() == nullptr || !StatusIsGood(answer.Get())) {
        error_text = answer.Get() == nullptr ? ErrorText(GetLastError()) : "an error status";
        return std::nullopt;
    }
    std::vector<std::uint8_t> bytes;
    try {
        if (!ReadAnswer(answer.Get(), request, bytes, error_text)) {
            return std::nullopt;
        }
    } catch (const std::bad_alloc&) {
        error_text = "out of memory";
        return std::nullopt;
    }
    return bytes;
}

}  // namespace zm::platform
