#pragma once

#include <cstdint>
#include <functional>
#include <optional>
#include <string>
#include <vector>

/// Fetching a resource over http, https or ftp, through a library of the system that is bound at
/// run time.
namespace zm::platform {

struct TUrlRequest {
    std::u16string url;
    std::u16string proxy_address;  ///< "host:port"; empty: the system's own choice
    std::u16string proxy_user;     ///< empty: no user name and password
    std::u16string proxy_password;
    std::int64_t max_bytes = std::int64_t{512} << 20;  ///< a longer answer is a failure
    std::int32_t connect_seconds = 30;
    std::int32_t stall_seconds = 60;  ///< without a byte for so long: a failure
    /// Asked now and then; true ends the fetch as a failure. May be empty.
    std::function<bool()> should_stop;
};

/// Whether the system has a library for it.
bool UrlClientIsAvailable();

/// The bytes of the answer; nothing on failure, which an answer with an error status is too, with
/// the reason in `error_text`. Follows up to 10 redirections, to the same protocols only. Any
/// threads. Exceptions of `should_stop` count as true.
std::optional<std::vector<std::uint8_t>> FetchUrl(const TUrlRequest& request,
                                                  std::string& error_text);

}  // namespace zm::platform
