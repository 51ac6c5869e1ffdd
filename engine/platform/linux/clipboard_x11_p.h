#pragma once

#include <xcb/xcb.h>
#include <xcb/xcbext.h>

#include <chrono>
#include <csignal>
#include <cstdint>
#include <cstdlib>
#include <map>
#include <memory>
#include <mutex>
#include <optional>
#include <span>
#include <string>
#include <vector>

#include "engine/platform/clipboard.h"

/// The clipboard of an X display: connections with bounded waits, the side that offers, and the
/// side that asks. The protocol is that of the Inter-Client Communication Conventions Manual,
/// section 2, with the CLIPBOARD and CLIPBOARD_MANAGER selections of freedesktop.org.
namespace zm::platform {

/// The functions of libxcb that we call. The library is bound at run time, by these names, so
/// that a machine without a display needs none.
#define ZM_XCB_FUNCTIONS(X)       \
    X(change_property)            \
    X(change_window_attributes)   \
    X(connect)                    \
    X(connection_has_error)       \
    X(convert_selection)          \
    X(create_window)              \
    X(delete_property)            \
    X(disconnect)                 \
    X(flush)                      \
    X(generate_id)                \
    X(get_file_descriptor)        \
    X(get_maximum_request_length) \
    X(get_property)               \
    X(get_property_value)         \
    X(get_property_value_length)  \
    X(get_selection_owner)        \
    X(get_setup)                  \
    X(intern_atom)                \
    X(poll_for_event)             \
    X(poll_for_reply)             \
    X(screen_next)                \
    X(send_event)                 \
    X(set_selection_owner)        \
    X(setup_roots_iterator)

struct TXcb {
#define ZM_XCB_MEMBER(name) decltype(&::xcb_##name) name = nullptr;
    ZM_XCB_FUNCTIONS(ZM_XCB_MEMBER)
#undef ZM_XCB_MEMBER
};

/// Blocks all signals on the calling thread while it lives; threads started meanwhile, for good.
class TBlockedSignals {
public:
    TBlockedSignals();
    ~TBlockedSignals();
    TBlockedSignals(const TBlockedSignals&) = delete;
    TBlockedSignals& operator=(const TBlockedSignals&) = delete;

private:
    sigset_t before_{};
};

using TXDeadline = std::chrono::steady_clock::time_point;
inline TXDeadline XDeadlineIn(std::chrono::milliseconds time) {
    return std::chrono::steady_clock::now() + time;
}
/// Milliseconds left for a poll, at least 0.
int XMillisecondsUntil(TXDeadline deadline);

struct TXFree {
    void operator()(void* block) const { std::free(block); }
};
template <typename T>
using TXOwned = std::unique_ptr<T, TXFree>;
using TXEvent = TXOwned<xcb_generic_event_t>;

inline constexpr std::chrono::milliseconds kXReplyTime{5000};

/// A connection with a hidden window of its own, told of changes of its properties. Belongs to
/// one thread, in which the signal of a broken pipe is blocked.
class TXConnection {
public:
    /// To the display that the environment names; nil without one, when it cannot be reached, or
    /// does not answer in time (and then ever after).
    static std::unique_ptr<TXConnection> Connect();
    ~TXConnection();
    TXConnection(const TXConnection&) = delete;
    TXConnection& operator=(const TXConnection&) = delete;

    const TXcb& Xcb() const { return xcb_; }
    xcb_connection_t* Get() const { return connection_; }
    xcb_window_t Window() const { return window_; }
    int FileDescriptor() const { return xcb_.get_file_descriptor(connection_); }
    bool HasFailed() const { return xcb_.connection_has_error(connection_) != 0; }
    void Flush() const { xcb_.flush(connection_); }

    /// The number of a name; 0 on failure.
    xcb_atom_t Atom(const std::string& name);
    xcb_window_t SelectionOwner(xcb_atom_t selection);
    /// A property of at most `max_bytes`, not removed; nil on failure.
    TXOwned<xcb_get_property_reply_t> GetProperty(xcb_window_t window, xcb_atom_t property,
                                                  std::int64_t offset_bytes,
                                                  std::int64_t max_bytes);
    void SetProperty(xcb_window_t window, xcb_atom_t property, xcb_atom_t type, std::uint8_t bits,
                     std::uint32_t count, const void* values);
    /// An event that has arrived, or nil.
    TXEvent TakeEvent() { return TXEvent(xcb_.poll_for_event(connection_)); }
    /// The next event; nil at the deadline and when the connection has failed.
    TXEvent WaitEvent(TXDeadline deadline);

private:
    TXConnection(const TXcb& xcb, xcb_connection_t* connection, int screen);
    void* WaitReply(unsigned int sequence);

    const TXcb& xcb_;
    xcb_connection_t* connection_;
    xcb_window_t window_ = XCB_NONE;
    std::map<std::string, xcb_atom_t> atoms_;
};

/// What this process put on the clipboard.
struct TClipboardItem {
    TClipboardFormat format = 0;
    std::shared_ptr<const std::vector<std::uint8_t>> bytes;
};
using TClipboardContent = std::vector<TClipboardItem>;

/// Names by which programs know a format, ours first; none for those that have no name here.
std::vector<std::string> TargetNamesOf(TClipboardFormat format);

inline constexpr std::size_t kBmpFileHeaderBytes = 14;
/// Where the pixels of a packed device-independent bitmap start by what its header tells; nothing
/// for bytes that are none.
std::optional<std::int64_t> DibPixelOffset(std::span<const std::uint8_t> dib);

/// Keeps the CLIPBOARD selection and answers other programs, on a thread of its own, which
/// starts with the first content. Any thread may call.
class TXSelectionOwner {
public:
    TXSelectionOwner();
    /// Hands the content to a clipboard manager, when one runs.
    ~TXSelectionOwner();
    TXSelectionOwner(const TXSelectionOwner&) = delete;
    TXSelectionOwner& operator=(const TXSelectionOwner&) = delete;

    /// Offers a content in place of what was there; False when the display does not take it.
    bool Publish(const TClipboardContent& content);
    /// What is offered, if `window` is the one that offers it; else nothing.
    TClipboardContent ContentOf(xcb_window_t window);

private:
    class TServer;
    struct TShared;
    std::unique_ptr<TShared> shared_;
};

/// The selection of another program, as its window tells. Belongs to one thread.
class TXSelectionReader {
public:
    explicit TXSelectionReader(TXConnection& connection);
    bool IsAvailable(TClipboardFormat format);
    /// Bytes as `format` demands them; empty when there are none.
    std::vector<std::uint8_t> Read(TClipboardFormat format, std::int64_t max_bytes);

private:
    using TBytes = std::vector<std::uint8_t>;
    /// The first name of a format that is offered; 0 for none.
    xcb_atom_t TargetOf(TClipboardFormat format);
    void AskTargets();
    bool Convert(xcb_atom_t target, std::int64_t max_bytes, TBytes& bytes);
    bool WaitNotice(xcb_atom_t target);
    bool WaitNewValue(TXDeadline deadline);
    bool ReadProperty(std::int64_t max_bytes, TBytes& bytes, bool& is_incremental);
    bool ReadIncrements(std::int64_t max_bytes, TBytes& bytes);

    TXConnection& connection_;
    xcb_atom_t selection_ = XCB_NONE;
    xcb_atom_t property_ = XCB_NONE;
    std::vector<xcb_atom_t> targets_;
    bool has_targets_ = false;
    /// The owner did not answer in time: it is not asked again.
    bool is_silent_ = false;
};

}  // namespace zm::platform
