// The side that asks: contents of the selection of another program. Nothing that it sends is
// trusted, and it may stop at any point.

#include <algorithm>
#include <cstring>
#include <new>
#include <utility>

#include "engine/foundation/zmbytereader.h"
#include "engine/platform/linux/clipboard_x11_p.h"
#include "engine/platform/linux/support_p.h"

namespace zm::platform {
namespace {

/// For each answer of the owner, which may have to make the content first, and for all of it.
constexpr std::chrono::milliseconds kStepTime{10000};
constexpr std::chrono::milliseconds kWholeTime{60000};
constexpr std::int64_t kMostTargetBytes = 4096 * 4;
constexpr std::int64_t kPartBytes = 1 << 20;

/// Makes a packed bitmap of a file of one: its head goes, and a gap before the pixels.
bool StripFileHeader(std::vector<std::uint8_t>& bytes) {
    if (bytes.size() <= kBmpFileHeaderBytes || bytes[0] != 'B' || bytes[1] != 'M') {
        return false;
    }
    TZmByteReader reader(bytes);
    reader.MoveTo(10);
    const std::int64_t told = std::int64_t{reader.U32LE()} - std::int64_t{kBmpFileHeaderBytes};
    bytes.erase(bytes.begin(), bytes.begin() + kBmpFileHeaderBytes);
    const auto packed = DibPixelOffset(bytes);
    const auto size = static_cast<std::int64_t>(bytes.size());
    if (!packed || told >= size) {
        return false;
    }
    if (told > *packed) {
        bytes.erase(bytes.begin() + *packed, bytes.begin() + told);
    }
    return true;
}

}  // namespace

std::optional<std::int64_t> DibPixelOffset(std::span<const std::uint8_t> dib) {
    constexpr std::uint32_t kCoreHeaderBytes = 12;
    constexpr std::uint32_t kInfoHeaderBytes = 40;
    constexpr std::uint32_t kBitFields = 3;
    TZmByteReader reader(dib);
    const std::uint32_t header_bytes = reader.U32LE();
    const bool is_core = header_bytes == kCoreHeaderBytes;
    if (!is_core && header_bytes < kInfoHeaderBytes) {
        return std::nullopt;
    }
    reader.MoveTo(is_core ? 10 : 14);
    const std::uint32_t bit_count = reader.U16LE();
    const std::uint32_t compression = is_core ? 0 : reader.U32LE();
    reader.MoveTo(is_core ? 0 : 32);
    const std::uint32_t colors_told = is_core ? 0 : reader.U32LE();
    const std::uint32_t colors = colors_told == 0 && bit_count <= 8 ? 1u << bit_count : colors_told;
    const std::int64_t mask_bytes =
        header_bytes == kInfoHeaderBytes && compression == kBitFields ? 12 : 0;
    const std::int64_t offset =
        header_bytes + mask_bytes + std::int64_t{colors} * (is_core ? 3 : 4);
    if (reader.HasFailed() || offset > static_cast<std::int64_t>(dib.size())) {
        return std::nullopt;
    }
    return offset;
}

TXSelectionReader::TXSelectionReader(TXConnection& connection)
    : connection_(connection),
      selection_(connection.Atom("CLIPBOARD")),
      property_(connection.Atom("ZALMO_CLIPBOARD")) {}

bool TXSelectionReader::IsAvailable(TClipboardFormat format) {
    TWriteSignalGuard guard;
    const bool is_available = TargetOf(format) != XCB_NONE;
    guard.Consume();
    return is_available;
}

TXSelectionReader::TBytes TXSelectionReader::Read(TClipboardFormat format, std::int64_t max_bytes) {
    TWriteSignalGuard guard;
    TBytes bytes;
    bool is_read = false;
    try {
        const xcb_atom_t target = TargetOf(format);
        is_read = target != XCB_NONE && Convert(target, max_bytes, bytes) &&
                  (format != kClipboardDib || StripFileHeader(bytes));
    } catch (const std::bad_alloc&) {
        is_read = false;
    }
    guard.Consume();
    if (!is_read) {
        return {};
    }
    return bytes;
}

xcb_atom_t TXSelectionReader::TargetOf(TClipboardFormat format) {
    if (!has_targets_) {
        has_targets_ = true;
        AskTargets();
    }
    for (const std::string& name : TargetNamesOf(format)) {
        const xcb_atom_t atom = connection_.Atom(name);
        if (atom != XCB_NONE &&
            std::find(targets_.begin(), targets_.end(), atom) != targets_.end()) {
            return atom;
        }
    }
    return XCB_NONE;
}

void TXSelectionReader::AskTargets() {
    TBytes bytes;
    if (Convert(connection_.Atom("TARGETS"), kMostTargetBytes, bytes)) {
        targets_.resize(bytes.size() / sizeof(xcb_atom_t));
        std::memcpy(targets_.data(), bytes.data(), targets_.size() * sizeof(xcb_atom_t));
    }
}

bool TXSelectionReader::Convert(xcb_atom_t target, std::int64_t max_bytes, TBytes& bytes) {
    if (is_silent_ || selection_ == XCB_NONE || property_ == XCB_NONE || target == XCB_NONE) {
        return false;
    }
    const TXcb& xcb = connection_.Xcb();
    xcb.delete_property(connection_.Get(), connection_.Window(), property_);
    xcb.convert_selection(connection_.Get(), connection_.Window(), selection_, target, property_,
                          XCB_CURRENT_TIME);
    bool is_incremental = false;
    return WaitNotice(target) && ReadProperty(max_bytes, bytes, is_incremental) &&
           (!is_incremental || ReadIncrements(max_bytes, bytes));
}

/// Whether the owner has put the content into our property.
bool TXSelectionReader::WaitNotice(xcb_atom_t target) {
    const TXDeadline deadline = XDeadlineIn(kStepTime);
    while (const TXEvent event = connection_.WaitEvent(deadline)) {
        if ((event->response_type & 0x7F) != XCB_SELECTION_NOTIFY) {
            continue;
        }
        const auto& notice = reinterpret_cast<const xcb_selection_notify_event_t&>(*event);
        if (notice.selection == selection_ && notice.target == target) {
            return notice.property != XCB_NONE;
        }
    }
    is_silent_ = true;
    return false;
}

bool TXSelectionReader::WaitNewValue(TXDeadline deadline) {
    while (const TXEvent event = connection_.WaitEvent(deadline)) {
        if ((event->response_type & 0x7F) != XCB_PROPERTY_NOTIFY) {
            continue;
        }
        const auto& notice = reinterpret_cast<const xcb_property_notify_event_t&>(*event);
        if (notice.atom == property_ && notice.state == XCB_PROPERTY_NEW_VALUE) {
            return true;
        }
    }
    is_silent_ = true;
    return false;
}

/// Appends the property's value to `bytes` and removes the property, which tells the owner that
/// it was taken. An incremental one has no value of its own yet.
bool TXSelectionReader::ReadProperty(std::int64_t max_bytes, TBytes& bytes, bool& is_incremental) {
    const TXcb& xcb = connection_.Xcb();
    const xcb_atom_t incr = connection_.Atom("INCR");
    for (std::int64_t offset = 0;;) {
        const auto reply =
            connection_.GetProperty(connection_.Window(), property_, offset, kPartBytes);
        if (reply == nullptr) {
            return false;
        }
        is_incremental = reply->type == incr;
        const std::int64_t count = xcb.get_property_value_length(reply.get());
        const auto size = static_cast<std::int64_t>(bytes.size());
        if (is_incremental || count > max_bytes - size ||
            reply->bytes_after > max_bytes - size - count) {
            break;
        }
        const auto* const values =
            static_cast<const std::uint8_t*>(xcb.get_property_value(reply.get()));
        bytes.insert(bytes.end(), values, values + count);
        offset += count;
        if (reply->bytes_after == 0 || count == 0) {
            xcb.delete_property(connection_.Get(), connection_.Window(), property_);
            return reply->bytes_after == 0;
        }
    }
    xcb.delete_property(connection_.Get(), connection_.Window(), property_);
    return is_incremental;
}

/// Parts come one at a time, each after the last was taken; an empty one ends them.
bool TXSelectionReader::ReadIncrements(std::int64_t max_bytes, TBytes& bytes) {
    const TXDeadline whole = XDeadlineIn(kWholeTime);
    for (;;) {
        if (!WaitNewValue(std::min(whole, XDeadlineIn(kStepTime)))) {
            return false;
        }
        const std::size_t before = bytes.size();
        bool is_incremental = false;
        if (!ReadProperty(max_bytes, bytes, is_incremental) || is_incremental) {
            is_silent_ = true;  // more of it would come between later answers
            return false;
        }
        if (bytes.size() == before) {
            return true;
        }
    }
}

}  // namespace zm::platform
