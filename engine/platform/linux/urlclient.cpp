#include "engine/platform/urlclient.h"

#include <algorithm>
#include <array>
#include <memory>
#include <new>

#include "engine/foundation/zmstrings.h"
#include "engine/platform/module.h"

// The transfer library's C interface, declared here as it is bound by name: option and protocol
// numbers are fixed parts of its binary interface.
namespace zm::platform {
namespace {

using TCurl = void;
using TCurlOption = int;

constexpr TCurlOption kOptionLowSpeedLimit = 19;
constexpr TCurlOption kOptionLowSpeedTime = 20;
constexpr TCurlOption kOptionNoProgress = 43;
constexpr TCurlOption kOptionFailOnError = 45;
constexpr TCurlOption kOptionFollowLocation = 52;
constexpr TCurlOption kOptionMaxRedirections = 68;
constexpr TCurlOption kOptionConnectTimeout = 78;
constexpr TCurlOption kOptionNoSignal = 99;
constexpr TCurlOption kOptionProtocols = 181;
constexpr TCurlOption kOptionRedirectionProtocols = 182;
constexpr TCurlOption kOptionWriteData = 10001;
constexpr TCurlOption kOptionUrl = 10002;
constexpr TCurlOption kOptionProxy = 10004;
constexpr TCurlOption kOptionProgressData = 10057;
constexpr TCurlOption kOptionProxyUser = 10175;
constexpr TCurlOption kOptionProxyPassword = 10176;
constexpr TCurlOption kOptionWriteFunction = 20011;
constexpr TCurlOption kOptionProgressFunction = 20219;

constexpr long kProtocolHttp = 1;
constexpr long kProtocolHttps = 2;
constexpr long kProtocolFtp = 4;
constexpr long kProtocols = kProtocolHttp | kProtocolHttps | kProtocolFtp;
constexpr long kInitializeAll = 3;
constexpr long kRedirections = 10;

using TWriteFunction = std::size_t (*)(char* data, std::size_t size, std::size_t count,
                                       void* target);
using TProgressFunction = int (*)(void* target, std::int64_t download_total,
                                  std::int64_t download_now, std::int64_t upload_total,
                                  std::int64_t upload_now);

/// The library; loaded once and kept, since its own clean-up is not safe while threads live.
struct TCurlLibrary {
    std::unique_ptr<TLibrary> library;
    int (*global_init)(long flags) = nullptr;
    TCurl* (*easy_init)() = nullptr;
    int (*easy_setopt)(TCurl* handle, TCurlOption option, ...) = nullptr;
    int (*easy_perform)(TCurl* handle) = nullptr;
    void (*easy_cleanup)(TCurl* handle) = nullptr;
    const char* (*easy_strerror)(int code) = nullptr;
    bool is_ready = false;
};

template <typename TFunction>
bool Bind(TLibrary& library, const char* name, TFunction& function) {
    function = reinterpret_cast<TFunction>(library.FindSymbol(name));
    return function != nullptr;
}

bool BindAll(TCurlLibrary& curl) {
    TLibrary& library = *curl.library;
    return Bind(library, "curl_global_init", curl.global_init) &&
           Bind(library, "curl_easy_init", curl.easy_init) &&
           Bind(library, "curl_easy_setopt", curl.easy_setopt) &&
           Bind(library, "curl_easy_perform", curl.easy_perform) &&
           Bind(library, "curl_easy_cleanup", curl.easy_cleanup) &&
           Bind(library, "curl_easy_strerror", curl.easy_strerror);
}

TCurlLibrary* LoadCurl() {
    auto curl = std::make_unique<TCurlLibrary>();
    for (const char* name : {"libcurl.so.4", "libcurl-gnutls.so.4", "libcurl-nss.so.4"}) {
        std::string error_text;
        curl->library = LoadInstalledLibrary(name, error_text);
        if (curl->library != nullptr && BindAll(*curl)) {
            curl->is_ready = curl->global_init(kInitializeAll) == 0;
            break;
        }
    }
    return curl.release();
}

TCurlLibrary& Curl() {
    static TCurlLibrary* const curl = LoadCurl();
    return *curl;
}

/// What the callbacks of one transfer see. They are called by C code: nothing may leave them.
struct TTransfer {
    const TUrlRequest& request;
    std::vector<std::uint8_t> bytes;
    std::string stop_reason;
};

std::size_t TakeData(char* data, std::size_t size, std::size_t count, void* target) {
    auto& transfer = *static_cast<TTransfer*>(target);
    const std::size_t total = size * count;
    const auto limit =
        static_cast<std::size_t>(std::max<std::int64_t>(transfer.request.max_bytes, 0));
    if (total > limit - std::min(limit, transfer.bytes.size())) {
        transfer.stop_reason = "the answer is too long";
        return 0;
    }
    try {
        transfer.bytes.insert(transfer.bytes.end(), data, data + total);
    } catch (const std::bad_alloc&) {
        transfer.stop_reason = "out of memory";
        return 0;
    }
    return total;
}

int AskToStop(void* target, std::int64_t, std::int64_t, std::int64_t, std::int64_t) {
    auto& transfer = *static_cast<TTransfer*>(target);
    bool stops = true;
    try {
        stops = transfer.request.should_stop && transfer.request.should_stop();
    } catch (...) {
        stops = true;
    }
    if (stops) {
        transfer.stop_reason = "stopped";
    }
    return stops ? 1 : 0;
}

void SetOptions(TCurlLibrary& curl, TCurl* handle, TTransfer& transfer) {
    const TUrlRequest& request = transfer.request;
    const auto set_number = [&](TCurlOption option, long value) {
        curl.easy_setopt(handle, option, value);
    };
    // The library copies texts.
    const auto set_text = [&](TCurlOption option, const std::u16string& text) {
        if (!text.empty()) {
            curl.easy_setopt(handle, option, Utf8FromUtf16(text).c_str());
        }
    };
    set_text(kOptionUrl, request.url);
    set_text(kOptionProxy, request.proxy_address);
    set_text(kOptionProxyUser, request.proxy_user);
    set_text(kOptionProxyPassword, request.proxy_password);
    set_number(kOptionProtocols, kProtocols);
    set_number(kOptionRedirectionProtocols, kProtocols);
    set_number(kOptionFollowLocation, 1);
    set_number(kOptionMaxRedirections, kRedirections);
    set_number(kOptionFailOnError, 1);
    set_number(kOptionNoSignal, 1);
    set_number(kOptionConnectTimeout, request.connect_seconds);
    set_number(kOptionLowSpeedLimit, 1);
    set_number(kOptionLowSpeedTime, request.stall_seconds);
    set_number(kOptionNoProgress, 0);
    curl.easy_setopt(handle, kOptionWriteFunction, static_cast<TWriteFunction>(TakeData));
    curl.easy_setopt(handle, kOptionWriteData, static_cast<void*>(&transfer));
    curl.easy_setopt(handle, kOptionProgressFunction, static_cast<TProgressFunction>(AskToStop));
    curl.easy_setopt(handle, kOptionProgressData, static_cast<void*>(&transfer));
}

}  // namespace

bool UrlClientIsAvailable() {
    return Curl().is_ready;
}

std::optional<std::vector<std::uint8_t>> FetchUrl(const TUrlRequest& request,
                                                  std::string& error_text) {
    TCurlLibrary& curl = Curl();
    if (!curl.is_ready) {
        error_text = "no transfer library is installed";
        return std::nullopt;
    }
    const std::unique_ptr<TCurl, void (*)(TCurl*)> handle(curl.easy_init(), curl.easy_cleanup);
    if (handle == nullptr) {
        error_text = "out of memory";
        return std::nullopt;
    }
    TTransfer transfer{request, {}, {}};
    SetOptions(curl, handle.get(), transfer);
    const int result = curl.easy_perform(handle.get());
    if (result != 0) {
        error_text =
            transfer.stop_reason.empty() ? curl.easy_strerror(result) : transfer.stop_reason;
        return std::nullopt;
    }
    return std::move(transfer.bytes);
}

}  // namespace zm::platform
