// The side that offers: a thread that keeps the selection and answers requests as they come.

#include <poll.h>
#include <sys/eventfd.h>
#include <sys/socket.h>
#include <unistd.h>

#include <algorithm>
#include <array>
#include <condition_variable>
#include <cstring>
#include <optional>
#include <system_error>
#include <thread>
#include <utility>

#include "engine/foundation/zmbytereader.h"
#include "engine/platform/linux/clipboard_x11_p.h"
#include "engine/platform/linux/support_p.h"

namespace zm::platform {
namespace {

/// Longer contents go in increments of so many bytes, so that neither the server nor the other
/// program needs room for all of it at once.
constexpr std::int64_t kIncrementBytes = 256 << 10;
constexpr std::int64_t kRequestHeadBytes = 64;
constexpr std::size_t kMostTransfers = 32;
constexpr std::int64_t kMostPairs = 64;
constexpr std::chrono::milliseconds kPublishTime{15000};
constexpr std::chrono::milliseconds kTransferTime{30000};
constexpr std::chrono::milliseconds kHandOverTime{10000};
constexpr std::chrono::milliseconds kStopTime{2000};

/// A content under its name: a head of a few bytes, then the block.
struct TXOffer {
    xcb_atom_t target = XCB_NONE;
    std::vector<std::uint8_t> head;
    std::shared_ptr<const std::vector<std::uint8_t>> block;

    std::int64_t Size() const { return static_cast<std::int64_t>(head.size() + block->size()); }
    std::vector<std::uint8_t> Part(std::int64_t position, std::int64_t count) const;
};

std::vector<std::uint8_t> TXOffer::Part(std::int64_t position, std::int64_t count) const {
    std::vector<std::uint8_t> part;
    const auto head_bytes = static_cast<std::int64_t>(head.size());
    const std::int64_t split = std::clamp(head_bytes - position, std::int64_t{0}, count);
    part.insert(part.end(), head.begin() + std::min(position, head_bytes),
                head.begin() + std::min(position, head_bytes) + split);
    const std::int64_t start = std::max(position - head_bytes, std::int64_t{0});
    part.insert(part.end(), block->begin() + start, block->begin() + start + (count - split));
    return part;
}

/// A content on its way in increments.
struct TXTransfer {
    xcb_window_t requestor = XCB_NONE;
    xcb_atom_t property = XCB_NONE;
    TXOffer offer;
    std::int64_t position = 0;
    TXDeadline deadline;
};

/// The head that makes a file of a device-independent bitmap.
std::vector<std::uint8_t> BmpFileHeader(std::span<const std::uint8_t> dib) {
    const std::int64_t pixel_offset = DibPixelOffset(dib).value_or(0);
    std::vector<std::uint8_t> head(kBmpFileHeaderBytes);
    head[0] = 'B';
    head[1] = 'M';
    PutU32LE(&head[2], static_cast<std::uint32_t>(dib.size() + kBmpFileHeaderBytes));
    PutU32LE(&head[10], static_cast<std::uint32_t>(pixel_offset) +
                            static_cast<std::uint32_t>(kBmpFileHeaderBytes));
    return head;
}

bool IsEarlier(xcb_timestamp_t time, xcb_timestamp_t than) {
    return static_cast<std::int32_t>(time - than) < 0;  // server times wrap around
}

}  // namespace

/// What callers and the thread share.
struct TXSelectionOwner::TShared {
    enum TAnswer : std::uint8_t { kPending, kTaken, kRefused };

    std::mutex mutex;
    std::condition_variable changed;
    std::thread thread;
    int wake = -1;    // an event counter that ends the thread's wait
    int socket = -1;  // of the thread's connection, while it has one
    bool is_running = false;
    bool must_stop = false;
    std::optional<TClipboardContent> wanted;  // to be offered next
    TAnswer answer = kRefused;
    xcb_window_t window = XCB_NONE;  // that offers `content`
    TClipboardContent content;

    void Wake() const {
        const std::uint64_t one = 1;
        static_cast<void>(!::write(wake, &one, sizeof one));
    }
};

/// The thread's own part.
class TXSelectionOwner::TServer {
public:
    explicit TServer(TShared& shared) : shared_(shared) {}
    void Run();

private:
    bool Prepare();
    void Serve();
    void TakeCommands();
    void Wait();
    bool HandleEvents();
    void HandleEvent(const xcb_generic_event_t& event);
    void HandleProperty(const xcb_property_notify_event_t& event);
    void HandleRequest(const xcb_selection_request_event_t& event);
    void HandleClear(const xcb_selection_clear_event_t& event);
    void AskTime();
    void TakeSelection(xcb_timestamp_t time);
    void StartHandOver();
    std::vector<TXOffer> MakeOffers(const TClipboardContent& content);
    std::vector<xcb_atom_t> OfferedTargets() const;
    bool Answer(xcb_window_t requestor, xcb_atom_t target, xcb_atom_t property);
    bool AnswerMultiple(xcb_window_t requestor, xcb_atom_t property);
    bool SendOffer(xcb_window_t requestor, xcb_atom_t property, const TXOffer& offer);
    void SendIncrement(TXTransfer& transfer);
    void EndTransfer(std::size_t index);
    void DropLateTransfers();
    void WatchProperties(xcb_window_t window, bool watch);
    bool IsFinished() const;

    TShared& shared_;
    std::unique_ptr<TXConnection> connection_;
    xcb_atom_t clipboard_ = XCB_NONE;
    xcb_atom_t manager_ = XCB_NONE;
    xcb_atom_t targets_ = XCB_NONE;
    xcb_atom_t timestamp_ = XCB_NONE;
    xcb_atom_t multiple_ = XCB_NONE;
    xcb_atom_t save_targets_ = XCB_NONE;
    xcb_atom_t incr_ = XCB_NONE;
    xcb_atom_t atom_pair_ = XCB_NONE;
    xcb_atom_t own_property_ = XCB_NONE;
    std::int64_t increment_bytes_ = kIncrementBytes;
    std::optional<TClipboardContent> publishing_;  // waits for the server's time
    std::vector<TXOffer> offers_;
    std::vector<TXTransfer> transfers_;
    xcb_timestamp_t owned_since_ = XCB_CURRENT_TIME;
    bool is_stopping_ = false;
    bool is_saved_ = false;
    TXDeadline stop_deadline_;
};

// The thread's life.

void TXSelectionOwner::TServer::Run() {
    connection_ = TXConnection::Connect();
    if (connection_ != nullptr && Prepare()) {
        {
            const std::lock_guard lock(shared_.mutex);
            shared_.socket = connection_->FileDescriptor();
        }
        Serve();
        connection_->Flush();
    }
    const std::lock_guard lock(shared_.mutex);
    shared_.socket = -1;
    connection_.reset();
    shared_.window = XCB_NONE;
    shared_.content.clear();
    shared_.answer = TShared::kRefused;
    shared_.is_running = false;
    shared_.changed.notify_all();
}

bool TXSelectionOwner::TServer::Prepare() {
    const std::pair<const char*, xcb_atom_t*> names[] = {
        {"CLIPBOARD", &clipboard_},
        {"CLIPBOARD_MANAGER", &manager_},
        {"TARGETS", &targets_},
        {"TIMESTAMP", &timestamp_},
        {"MULTIPLE", &multiple_},
        {"SAVE_TARGETS", &save_targets_},
        {"INCR", &incr_},
        {"ATOM_PAIR", &atom_pair_},
        {"ZALMO_CLIPBOARD", &own_property_},
    };
    for (const auto& [name, atom] : names) {
        *atom = connection_->Atom(name);
        if (*atom == XCB_NONE) {
            return false;
        }
    }
    const std::int64_t most_bytes =
        std::int64_t{connection_->Xcb().get_maximum_request_length(connection_->Get())} * 4;
    increment_bytes_ = std::min(kIncrementBytes, most_bytes - kRequestHeadBytes);
    return increment_bytes_ > 0;
}

bool TXSelectionOwner::TServer::IsFinished() const {
    return is_stopping_ && (is_saved_ || XMillisecondsUntil(stop_deadline_) == 0);
}

void TXSelectionOwner::TServer::Serve() {
    while (!connection_->HasFailed()) {
        TakeCommands();
        DropLateTransfers();
        // A flush may take events in while it waits for room, hence the order.
        do {
            connection_->Flush();
        } while (HandleEvents());
        if (IsFinished()) {
            return;
        }
        Wait();
    }
}

void TXSelectionOwner::TServer::TakeCommands() {
    bool must_stop = false;
    std::optional<TClipboardContent> wanted;
    {
        const std::lock_guard lock(shared_.mutex);
        must_stop = shared_.must_stop;
        wanted.swap(shared_.wanted);
    }
    if (wanted) {
        publishing_ = std::move(wanted);
        AskTime();
    }
    if (must_stop && !is_stopping_) {
        is_stopping_ = true;
        stop_deadline_ = XDeadlineIn(kHandOverTime);
        StartHandOver();
    }
}

void TXSelectionOwner::TServer::Wait() {
    int time = -1;  // without end: other programs and the owner's calls wake it
    const auto shorten = [&](TXDeadline deadline) {
        const int left = XMillisecondsUntil(deadline);
        time = time < 0 ? left : std::min(time, left);
    };
    for (const TXTransfer& transfer : transfers_) {
        shorten(transfer.deadline);
    }
    if (is_stopping_) {
        shorten(stop_deadline_);
    }
    pollfd ready[] = {{connection_->FileDescriptor(), POLLIN, 0}, {shared_.wake, POLLIN, 0}};
    ::poll(ready, 2, time);
    std::uint64_t count = 0;
    static_cast<void>(!::read(shared_.wake, &count, sizeof count));
}

// Events.

/// Whether there were any.
bool TXSelectionOwner::TServer::HandleEvents() {
    bool any = false;
    while (const TXEvent event = connection_->TakeEvent()) {
        any = true;
        HandleEvent(*event);
    }
    return any;
}

void TXSelectionOwner::TServer::HandleEvent(const xcb_generic_event_t& event) {
    constexpr std::uint8_t kSentMark = 0x80;
    switch (event.response_type & ~kSentMark) {
        case XCB_PROPERTY_NOTIFY:
            HandleProperty(reinterpret_cast<const xcb_property_notify_event_t&>(event));
            break;
        case XCB_SELECTION_REQUEST:
            HandleRequest(reinterpret_cast<const xcb_selection_request_event_t&>(event));
            break;
        case XCB_SELECTION_CLEAR:
            HandleClear(reinterpret_cast<const xcb_selection_clear_event_t&>(event));
            break;
        case XCB_SELECTION_NOTIFY: is_saved_ = true; break;  // the manager's, our only request
        default: break;  // errors too: the other program's window has gone
    }
}

void TXSelectionOwner::TServer::HandleProperty(const xcb_property_notify_event_t& event) {
    if (event.window == connection_->Window()) {
        if (event.atom == own_property_ && publishing_) {
            TakeSelection(event.time);
        }
        return;
    }
    const auto transfer =
        std::find_if(transfers_.begin(), transfers_.end(), [&](const TXTransfer& candidate) {
            return candidate.requestor == event.window && candidate.property == event.atom;
        });
    if (event.state == XCB_PROPERTY_DELETE && transfer != transfers_.end()) {
        SendIncrement(*transfer);
    }
}

void TXSelectionOwner::TServer::HandleRequest(const xcb_selection_request_event_t& event) {
    // Programs of old times leave the property out; the target's name stands for it. The time of
    // a request is not looked at: many programs give one that is too early.
    const xcb_atom_t property = event.property != XCB_NONE ? event.property : event.target;
    const bool is_served = event.selection == clipboard_ && !offers_.empty();
    const bool is_answered =
        is_served && (event.target == multiple_ ? AnswerMultiple(event.requestor, property)
                                                : Answer(event.requestor, event.target, property));
    xcb_selection_notify_event_t notice{};
    notice.response_type = XCB_SELECTION_NOTIFY;
    notice.time = event.time;
    notice.requestor = event.requestor;
    notice.selection = event.selection;
    notice.target = event.target;
    notice.property = is_answered ? property : xcb_atom_t{XCB_NONE};
    std::array<char, 32> bytes{};  // events have this size on the wire
    std::memcpy(bytes.data(), &notice, sizeof notice);
    connection_->Xcb().send_event(connection_->Get(), /*propagate=*/0, event.requestor,
                                  XCB_EVENT_MASK_NO_EVENT, bytes.data());
}

void TXSelectionOwner::TServer::HandleClear(const xcb_selection_clear_event_t& event) {
    if (event.selection != clipboard_ || IsEarlier(event.time, owned_since_)) {
        return;
    }
    offers_.clear();
    is_saved_ = true;  // another content is there, or the manager has ours
    const std::lock_guard lock(shared_.mutex);
    shared_.window = XCB_NONE;
    shared_.content.clear();
}

// Taking the selection and handing it over.

/// An empty change of a property brings an event with the server's time, which the selection has
/// to be taken with.
void TXSelectionOwner::TServer::AskTime() {
    connection_->Xcb().change_property(connection_->Get(), XCB_PROP_MODE_APPEND,
                                       connection_->Window(), own_property_, XCB_ATOM_INTEGER, 32,
                                       0, nullptr);
}

void TXSelectionOwner::TServer::TakeSelection(xcb_timestamp_t time) {
    const xcb_window_t window = connection_->Window();
    TClipboardContent content = std::move(*publishing_);
    publishing_.reset();
    offers_ = MakeOffers(content);
    owned_since_ = time;
    connection_->Xcb().set_selection_owner(connection_->Get(), window, clipboard_, time);
    const bool is_taken = connection_->SelectionOwner(clipboard_) == window;
    if (!is_taken) {
        offers_.clear();
        content.clear();
    }
    const std::lock_guard lock(shared_.mutex);
    shared_.window = is_taken ? window : xcb_window_t{XCB_NONE};
    shared_.content = std::move(content);
    shared_.answer = is_taken ? TShared::kTaken : TShared::kRefused;
    shared_.changed.notify_all();
}

/// Asks the clipboard manager, when there is one, to save what is offered; it answers when it has
/// all of it.
void TXSelectionOwner::TServer::StartHandOver() {
    is_saved_ = offers_.empty() || connection_->SelectionOwner(manager_) == XCB_NONE;
    if (is_saved_) {
        return;
    }
    std::vector<xcb_atom_t> wanted;
    for (const TXOffer& offer : offers_) {
        wanted.push_back(offer.target);
    }
    connection_->SetProperty(connection_->Window(), own_property_, XCB_ATOM_ATOM, 32,
                             static_cast<std::uint32_t>(wanted.size()), wanted.data());
    connection_->Xcb().convert_selection(connection_->Get(), connection_->Window(), manager_,
                                         save_targets_, own_property_, XCB_CURRENT_TIME);
}

std::vector<TXOffer> TXSelectionOwner::TServer::MakeOffers(const TClipboardContent& content) {
    std::vector<TXOffer> offers;
    for (const TClipboardItem& item : content) {
        const std::vector<std::string> names = TargetNamesOf(item.format);
        if (names.empty()) {
            continue;
        }
        TXOffer offer;
        offer.target = connection_->Atom(names.front());
        offer.block = item.bytes;
        if (item.format == kClipboardDib) {
            offer.head = BmpFileHeader(*item.bytes);
        }
        if (offer.target != XCB_NONE) {
            offers.push_back(std::move(offer));
        }
    }
    return offers;
}

// Answers.

std::vector<xcb_atom_t> TXSelectionOwner::TServer::OfferedTargets() const {
    std::vector<xcb_atom_t> targets = {targets_, timestamp_, multiple_, save_targets_};
    for (const TXOffer& offer : offers_) {
        targets.push_back(offer.target);
    }
    return targets;
}

bool TXSelectionOwner::TServer::Answer(xcb_window_t requestor, xcb_atom_t target,
                                       xcb_atom_t property) {
    if (target == targets_) {
        const std::vector<xcb_atom_t> targets = OfferedTargets();
        connection_->SetProperty(requestor, property, XCB_ATOM_ATOM, 32,
                                 static_cast<std::uint32_t>(targets.size()), targets.data());
        return true;
    }
    if (target == timestamp_) {
        connection_->SetProperty(requestor, property, XCB_ATOM_INTEGER, 32, 1, &owned_since_);
        return true;
    }
    const auto offer = std::find_if(offers_.begin(), offers_.end(), [&](const TXOffer& candidate) {
        return candidate.target == target;
    });
    return offer != offers_.end() && SendOffer(requestor, property, *offer);
}

/// Several targets at once: the property holds pairs of a target and a property, of which those
/// that fail are marked.
bool TXSelectionOwner::TServer::AnswerMultiple(xcb_window_t requestor, xcb_atom_t property) {
    const auto reply = connection_->GetProperty(requestor, property, 0, kMostPairs * 8);
    if (reply == nullptr || reply->format != 32) {
        return false;
    }
    const auto* const values =
        static_cast<const xcb_atom_t*>(connection_->Xcb().get_property_value(reply.get()));
    std::vector<xcb_atom_t> pairs(values, values + reply->value_len / 2 * 2);
    for (std::size_t i = 0; i + 1 < pairs.size(); i += 2) {
        if (pairs[i + 1] != XCB_NONE && !Answer(requestor, pairs[i], pairs[i + 1])) {
            pairs[i + 1] = XCB_NONE;
        }
    }
    connection_->SetProperty(requestor, property, atom_pair_, 32,
                             static_cast<std::uint32_t>(pairs.size()), pairs.data());
    return true;
}

bool TXSelectionOwner::TServer::SendOffer(xcb_window_t requestor, xcb_atom_t property,
                                          const TXOffer& offer) {
    const std::int64_t size = offer.Size();
    if (size <= increment_bytes_) {
        connection_->SetProperty(requestor, property, offer.target, 8,
                                 static_cast<std::uint32_t>(size), offer.Part(0, size).data());
        return true;
    }
    if (transfers_.size() >= kMostTransfers) {
        return false;
    }
    std::erase_if(transfers_, [&](const TXTransfer& old) {
        return old.requestor == requestor && old.property == property;
    });
    WatchProperties(requestor, /*watch=*/true);
    const auto size_told = static_cast<std::uint32_t>(size);
    connection_->SetProperty(requestor, property, incr_, 32, 1, &size_told);
    transfers_.push_back({requestor, property, offer, 0, XDeadlineIn(kTransferTime)});
    return true;
}

/// The next increment; one of no bytes ends the transfer.
void TXSelectionOwner::TServer::SendIncrement(TXTransfer& transfer) {
    const std::int64_t count =
        std::min(transfer.offer.Size() - transfer.position, increment_bytes_);
    const std::vector<std::uint8_t> part = transfer.offer.Part(transfer.position, count);
    connection_->SetProperty(transfer.requestor, transfer.property, transfer.offer.target, 8,
                             static_cast<std::uint32_t>(count), part.data());
    transfer.position += count;
    transfer.deadline = XDeadlineIn(kTransferTime);
    if (count == 0) {
        EndTransfer(static_cast<std::size_t>(&transfer - transfers_.data()));
    }
}

void TXSelectionOwner::TServer::EndTransfer(std::size_t index) {
    const xcb_window_t requestor = transfers_[index].requestor;
    transfers_.erase(transfers_.begin() + static_cast<std::ptrdiff_t>(index));
    const bool is_used =
        std::any_of(transfers_.begin(), transfers_.end(),
                    [&](const TXTransfer& other) { return other.requestor == requestor; });
    if (!is_used) {
        WatchProperties(requestor, /*watch=*/false);
    }
}

/// Programs that stop fetching are not waited for.
void TXSelectionOwner::TServer::DropLateTransfers() {
    for (std::size_t i = transfers_.size(); i-- > 0;) {
        if (XMillisecondsUntil(transfers_[i].deadline) == 0) {
            EndTransfer(i);
        }
    }
}

void TXSelectionOwner::TServer::WatchProperties(xcb_window_t window, bool watch) {
    const std::uint32_t events = watch ? XCB_EVENT_MASK_PROPERTY_CHANGE : XCB_EVENT_MASK_NO_EVENT;
    connection_->Xcb().change_window_attributes(connection_->Get(), window, XCB_CW_EVENT_MASK,
                                                &events);
}

// The callers' side.

TXSelectionOwner::TXSelectionOwner() : shared_(std::make_unique<TShared>()) {
    shared_->wake = ::eventfd(0, EFD_CLOEXEC | EFD_NONBLOCK);
}

TXSelectionOwner::~TXSelectionOwner() {
    {
        std::unique_lock lock(shared_->mutex);
        shared_->must_stop = true;
        shared_->Wake();
        const auto has_ended = [this] { return !shared_->is_running; };
        if (!shared_->changed.wait_for(lock, kHandOverTime + kStopTime, has_ended) &&
            shared_->socket >= 0) {
            // The server does not read: this ends every wait for it.
            ::shutdown(shared_->socket, SHUT_RDWR);
        }
    }
    if (shared_->thread.joinable()) {
        shared_->thread.join();
    }
    ::close(shared_->wake);
}

bool TXSelectionOwner::Publish(const TClipboardContent& content) {
    std::unique_lock lock(shared_->mutex);
    if (shared_->wake < 0) {
        return false;
    }
    if (!shared_->is_running) {
        if (shared_->thread.joinable()) {
            shared_->thread.join();
        }
        try {
            const TBlockedSignals blocked;
            shared_->thread = std::thread([this] { TServer(*shared_).Run(); });
        } catch (const std::system_error&) {
            return false;
        }
        shared_->is_running = true;
    }
    shared_->wanted = content;
    shared_->answer = TShared::kPending;
    shared_->Wake();
    shared_->changed.wait_for(lock, kPublishTime,
                              [this] { return shared_->answer != TShared::kPending; });
    shared_->wanted.reset();
    return shared_->answer == TShared::kTaken;
}

TClipboardContent TXSelectionOwner::ContentOf(xcb_window_t window) {
    const std::lock_guard lock(shared_->mutex);
    return window != XCB_NONE && window == shared_->window ? shared_->content : TClipboardContent();
}

}  // namespace zm::platform
