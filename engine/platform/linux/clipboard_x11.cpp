#include <dlfcn.h>
#include <poll.h>

#include <algorithm>
#include <atomic>
#include <condition_variable>
#include <optional>
#include <system_error>
#include <thread>

#include "engine/platform/linux/clipboard_x11_p.h"
#include "engine/platform/linux/support_p.h"
#include "engine/platform/module.h"

namespace zm::platform {
namespace {

constexpr std::chrono::milliseconds kConnectTime{5000};
constexpr std::uint32_t kAnyType = XCB_GET_PROPERTY_TYPE_ANY;

constexpr char kXcbLibrary[] = "libxcb.so.1";

/// Nothing when the library or one of its functions is missing. It stays loaded: code of its own
/// may still run when our module goes.
std::optional<TXcb> LoadXcb() {
    std::string error_text;
    const auto library = LoadInstalledLibrary(kXcbLibrary, error_text);
    if (library == nullptr) {
        return std::nullopt;
    }
    TXcb xcb{};
    bool is_complete = true;
#define ZM_XCB_BIND(name)                                                               \
    xcb.name = reinterpret_cast<decltype(xcb.name)>(library->FindSymbol("xcb_" #name)); \
    is_complete = is_complete && xcb.name != nullptr;
    ZM_XCB_FUNCTIONS(ZM_XCB_BIND)
#undef ZM_XCB_BIND
    const bool is_kept =
        is_complete && ::dlopen(kXcbLibrary, RTLD_NOW | RTLD_NOLOAD | RTLD_NODELETE) != nullptr;
    return is_kept ? std::optional(xcb) : std::nullopt;
}

/// In storage of the module, which needs no clean-up.
const TXcb* BindXcb() {
    static const std::optional<TXcb> xcb = LoadXcb();
    return xcb ? &*xcb : nullptr;
}

/// Keeps the code of this module in memory for good.
void PinModule() {
    Dl_info info{};
    if (::dladdr(reinterpret_cast<const void*>(&PinModule), &info) != 0) {
        static_cast<void>(::dlopen(info.dli_fname, RTLD_NOW | RTLD_NOLOAD | RTLD_NODELETE));
    }
}

/// The handshake with a display server has no time limit of its own. It runs on a thread that
/// can be left behind, which then closes what it may still get.
struct THandshake {
    std::mutex mutex;
    std::condition_variable changed;
    bool is_done = false;
    bool is_left_behind = false;
    xcb_connection_t* connection = nullptr;
    int screen = 0;
};

void RunHandshake(const TXcb& xcb, const std::shared_ptr<THandshake>& handshake) {
    int screen = 0;
    xcb_connection_t* const connection = xcb.connect(nullptr, &screen);
    const std::lock_guard lock(handshake->mutex);
    if (handshake->is_left_behind) {
        xcb.disconnect(connection);
        return;
    }
    handshake->connection = connection;
    handshake->screen = screen;
    handshake->is_done = true;
    handshake->changed.notify_all();
}

/// Whether the handshake ended in time.
bool CompleteHandshake(const TXcb& xcb, const std::shared_ptr<THandshake>& handshake) {
    std::thread thread;
    try {
        const TBlockedSignals blocked;  // the host's handlers do not belong on this thread
        thread = std::thread([&xcb, handshake] { RunHandshake(xcb, handshake); });
    } catch (const std::system_error&) {
        return false;
    }
    std::unique_lock lock(handshake->mutex);
    const bool is_done =
        handshake->changed.wait_for(lock, kConnectTime, [&] { return handshake->is_done; });
    if (is_done) {
        lock.unlock();
        thread.join();
        return true;
    }
    handshake->is_left_behind = true;
    PinModule();
    thread.detach();
    return false;
}

}  // namespace

TBlockedSignals::TBlockedSignals() {
    sigset_t all;
    ::sigfillset(&all);
    ::pthread_sigmask(SIG_BLOCK, &all, &before_);
}

TBlockedSignals::~TBlockedSignals() {
    ::pthread_sigmask(SIG_SETMASK, &before_, nullptr);
}

int XMillisecondsUntil(TXDeadline deadline) {
    const auto left = std::chrono::duration_cast<std::chrono::milliseconds>(
        deadline - std::chrono::steady_clock::now());
    return static_cast<int>(std::clamp<std::int64_t>(left.count(), 0, 3'600'000));
}

std::unique_ptr<TXConnection> TXConnection::Connect() {
    static std::atomic<bool> is_unresponsive{false};
    const char* const display = std::getenv("DISPLAY");
    const TXcb* const xcb =
        display == nullptr || *display == '\0' || is_unresponsive ? nullptr : BindXcb();
    if (xcb == nullptr) {
        return nullptr;
    }
    const auto handshake = std::make_shared<THandshake>();
    if (!CompleteHandshake(*xcb, handshake)) {
        is_unresponsive = true;
        return nullptr;
    }
    std::unique_ptr<TXConnection> connection(
        new TXConnection(*xcb, handshake->connection, handshake->screen));
    if (connection->HasFailed()) {
        return nullptr;
    }
    return connection;
}

TXConnection::TXConnection(const TXcb& xcb, xcb_connection_t* connection, int screen)
    : xcb_(xcb), connection_(connection) {
    if (HasFailed()) {
        return;
    }
    auto roots = xcb_.setup_roots_iterator(xcb_.get_setup(connection_));
    for (; screen > 0 && roots.rem > 1; --screen) {
        xcb_.screen_next(&roots);
    }
    if (roots.rem < 1) {
        return;
    }
    window_ = xcb_.generate_id(connection_);
    const std::uint32_t events = XCB_EVENT_MASK_PROPERTY_CHANGE;
    xcb_.create_window(connection_, XCB_COPY_FROM_PARENT, window_, roots.data->root, -1, -1, 1, 1,
                       0, XCB_WINDOW_CLASS_INPUT_ONLY, XCB_COPY_FROM_PARENT, XCB_CW_EVENT_MASK,
                       &events);
}

TXConnection::~TXConnection() {
    xcb_.disconnect(connection_);
}

/// The reply to a request; nil for errors, late answers and lost connections.
void* TXConnection::WaitReply(unsigned int sequence) {
    const TXDeadline deadline = XDeadlineIn(kXReplyTime);
    Flush();
    while (!HasFailed()) {
        void* reply = nullptr;
        xcb_generic_error_t* error = nullptr;
        if (xcb_.poll_for_reply(connection_, sequence, &reply, &error) != 0) {
            std::free(error);
            return reply;
        }
        const int time = XMillisecondsUntil(deadline);
        pollfd ready{FileDescriptor(), POLLIN, 0};
        if (time == 0 || (::poll(&ready, 1, time) < 0 && errno != EINTR)) {
            return nullptr;
        }
    }
    return nullptr;
}

xcb_atom_t TXConnection::Atom(const std::string& name) {
    const auto known = atoms_.find(name);
    if (known != atoms_.end()) {
        return known->second;
    }
    const auto cookie = xcb_.intern_atom(connection_, /*only_if_exists=*/0,
                                         static_cast<std::uint16_t>(name.size()), name.data());
    const TXOwned<xcb_intern_atom_reply_t> reply(
        static_cast<xcb_intern_atom_reply_t*>(WaitReply(cookie.sequence)));
    if (reply == nullptr) {
        return XCB_NONE;
    }
    return atoms_[name] = reply->atom;
}

xcb_window_t TXConnection::SelectionOwner(xcb_atom_t selection) {
    const auto cookie = xcb_.get_selection_owner(connection_, selection);
    const TXOwned<xcb_get_selection_owner_reply_t> reply(
        static_cast<xcb_get_selection_owner_reply_t*>(WaitReply(cookie.sequence)));
    return reply == nullptr ? XCB_NONE : reply->owner;
}

TXOwned<xcb_get_property_reply_t> TXConnection::GetProperty(xcb_window_t window,
                                                            xcb_atom_t property,
                                                            std::int64_t offset_bytes,
                                                            std::int64_t max_bytes) {
    const auto cookie = xcb_.get_property(connection_, /*_delete=*/0, window, property, kAnyType,
                                          static_cast<std::uint32_t>(offset_bytes / 4),
                                          static_cast<std::uint32_t>((max_bytes + 3) / 4));
    return TXOwned<xcb_get_property_reply_t>(
        static_cast<xcb_get_property_reply_t*>(WaitReply(cookie.sequence)));
}

void TXConnection::SetProperty(xcb_window_t window, xcb_atom_t property, xcb_atom_t type,
                               std::uint8_t bits, std::uint32_t count, const void* values) {
    xcb_.change_property(connection_, XCB_PROP_MODE_REPLACE, window, property, type, bits, count,
                         values);
}

TXEvent TXConnection::WaitEvent(TXDeadline deadline) {
    Flush();
    while (!HasFailed()) {
        if (TXEvent event = TakeEvent()) {
            return event;
        }
        const int time = XMillisecondsUntil(deadline);
        pollfd ready{FileDescriptor(), POLLIN, 0};
        if (time == 0 || (::poll(&ready, 1, time) < 0 && errno != EINTR)) {
            return nullptr;
        }
    }
    return nullptr;
}

}  // namespace zm::platform
