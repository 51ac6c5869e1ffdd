#include "engine/metadata/zmiptc.h"

#include <algorithm>
#include <array>
#include <optional>

#include "engine/foundation/zmbytereader.h"
#include "engine/foundation/zmstreams.h"
#include "engine/io/zmfieldstreams.h"

namespace zm {

namespace {

using TBytes = std::vector<std::uint8_t>;
using TByteSpan = std::span<const std::uint8_t>;

constexpr std::uint8_t kItemMark = 0x1C;
constexpr std::string_view kResourceName = "Photoshop 3.0";
constexpr std::array<std::uint8_t, 6> kIptcResource{'8', 'B', 'I', 'M', 0x04, 0x04};
constexpr std::size_t kShortItemLimit = 32768;
constexpr std::int32_t kLeastItemBytes = 6;  // in the stream form: two numbers and a length

TBytes BytesOf(std::string_view text) {
    return {text.begin(), text.end()};
}

/// Where the datasets start: behind the mark of their resource, when there are resources.
TByteSpan BlockInside(TByteSpan buffer) {
    if (buffer.size() >= kResourceName.size() &&
        std::equal(kResourceName.begin(), kResourceName.end(), buffer.begin())) {
        const auto found =
            std::search(buffer.begin(), buffer.end(), kIptcResource.begin(), kIptcResource.end());
        if (found == buffer.end()) {
            return {};
        }
        buffer = TByteSpan(found + kIptcResource.size(), buffer.end());
    }
    return TByteSpan(std::find(buffer.begin(), buffer.end(), kItemMark), buffer.end());
}

/// The size of an item's data: one word, or with its top bit set the count of the bytes that
/// hold the size. Nothing when the size cannot be of data that are there.
std::optional<std::size_t> ReadItemSize(TZmByteReader& reader) {
    const std::uint16_t word = reader.U16BE();
    if ((word & 0x8000) == 0) {
        return word;
    }
    std::uint64_t size = 0;
    for (int left = word & 0x7FFF; left > 0 && !reader.HasFailed(); --left) {
        size = size << 8 | reader.U8();
        if (size > reader.Remaining()) {
            return std::nullopt;
        }
    }
    return static_cast<std::size_t>(size);
}

void AppendU32BE(TBytes& target, std::size_t value) {
    for (int shift = 24; shift >= 0; shift -= 8) {
        target.push_back(static_cast<std::uint8_t>(value >> shift));
    }
}

void AppendItemSize(TBytes& target, std::size_t size) {
    if (size < kShortItemLimit) {
        target.push_back(static_cast<std::uint8_t>(size >> 8));
        target.push_back(static_cast<std::uint8_t>(size));
        return;
    }
    // Required: the first byte is 0 and not 0x80; readers of existing files look for this form.
    target.push_back(0);
    target.push_back(4);
    AppendU32BE(target, size);
}

}  // namespace

const TZmIPTCInfoList::TItem* TZmIPTCInfoList::ItemAt(std::int32_t index) const {
    return index >= 0 && index < Count() ? &items_[static_cast<std::size_t>(index)] : nullptr;
}

TZmIPTCInfoList::TItem* TZmIPTCInfoList::ItemAt(std::int32_t index) {
    return index >= 0 && index < Count() ? &items_[static_cast<std::size_t>(index)] : nullptr;
}

std::int32_t TZmIPTCInfoList::AddBufferItem(std::uint8_t record, std::uint8_t dataset,
                                            TByteSpan data) {
    items_.push_back({record, dataset, {data.begin(), data.end()}});
    return Count() - 1;
}

std::int32_t TZmIPTCInfoList::AddStringItem(std::uint8_t record, std::uint8_t dataset,
                                            std::string_view text) {
    return AddBufferItem(record, dataset, BytesOf(text));
}

void TZmIPTCInfoList::InsertStringItem(std::int32_t index, std::uint8_t record,
                                       std::uint8_t dataset, std::string_view text) {
    const std::int32_t place = std::clamp(index, 0, Count());
    items_.insert(items_.begin() + place, TItem{record, dataset, BytesOf(text)});
}

std::int32_t TZmIPTCInfoList::IndexOf(std::uint8_t record, std::uint8_t dataset) const {
    const auto found = std::find_if(items_.begin(), items_.end(), [&](const TItem& item) {
        return item.record == record && item.dataset == dataset;
    });
    return found == items_.end() ? -1 : static_cast<std::int32_t>(found - items_.begin());
}

void TZmIPTCInfoList::DeleteItem(std::int32_t index) {
    if (ItemAt(index) != nullptr) {
        items_.erase(items_.begin() + index);
    }
}

TByteSpan TZmIPTCInfoList::GetItemData(std::int32_t index) const {
    const TItem* item = ItemAt(index);
    return item == nullptr ? TByteSpan() : TByteSpan(item->data);
}

std::int32_t TZmIPTCInfoList::GetItemLength(std::int32_t index) const {
    return static_cast<std::int32_t>(GetItemData(index).size());
}

std::string TZmIPTCInfoList::GetStrings(std::int32_t index) const {
    const TByteSpan data = GetItemData(index);
    return {data.begin(), data.end()};
}

void TZmIPTCInfoList::SetStrings(std::int32_t index, std::string_view text) {
    if (TItem* item = ItemAt(index); item != nullptr) {
        item->data = BytesOf(text);
    }
}

std::uint8_t TZmIPTCInfoList::GetRecordNumber(std::int32_t index) const {
    const TItem* item = ItemAt(index);
    return item == nullptr ? std::uint8_t{0} : item->record;
}

void TZmIPTCInfoList::SetRecordNumber(std::int32_t index, std::uint8_t record) {
    if (TItem* item = ItemAt(index); item != nullptr) {
        item->record = record;
    }
}

std::uint8_t TZmIPTCInfoList::GetDataSet(std::int32_t index) const {
    const TItem* item = ItemAt(index);
    return item == nullptr ? std::uint8_t{0} : item->dataset;
}

void TZmIPTCInfoList::SetDataSet(std::int32_t index, std::uint8_t dataset) {
    if (TItem* item = ItemAt(index); item != nullptr) {
        item->dataset = dataset;
    }
}

void TZmIPTCInfoList::SaveToStream(TStream& stream) const {
    TZmFieldWriter writer(stream);
    writer.S32(Count());
    for (const TItem& item : items_) {
        writer.U8(item.record);
        writer.U8(item.dataset);
        writer.WriteBlock(item.data);
    }
}

bool TZmIPTCInfoList::LoadFromStream(TStream& stream) {
    TZmFieldReader reader(stream);
    return LoadFromReader(reader);
}

bool TZmIPTCInfoList::LoadFromReader(TZmFieldReader& reader) {
    Clear();
    const std::int32_t count = reader.ReadCount(kLeastItemBytes);
    for (std::int32_t i = 0; i < count; ++i) {
        TItem item;
        item.record = reader.U8();
        item.dataset = reader.U8();
        if (!reader.ReadBlock(item.data)) {
            return false;
        }
        items_.push_back(std::move(item));
    }
    return count >= 0;
}

bool TZmIPTCInfoList::LoadFromStandardBuffer(TByteSpan buffer) {
    Clear();
    const TByteSpan block = BlockInside(buffer);
    TZmByteReader reader(block);
    while (reader.Remaining() > 0 && reader.U8() == kItemMark) {
        const std::uint8_t record = reader.U8();
        const std::uint8_t dataset = reader.U8();
        const std::optional<std::size_t> size = ReadItemSize(reader);
        if (!size || reader.HasFailed() || *size > reader.Remaining()) {
            break;
        }
        AddBufferItem(record, dataset, block.subspan(reader.Position(), *size));
        reader.Skip(*size);
    }
    return Count() > 0;
}

TBytes TZmIPTCInfoList::SaveToStandardBuffer(bool with_resource_header) const {
    if (items_.empty()) {
        return {};
    }
    TBytes bytes;
    if (with_resource_header) {
        bytes.assign(kResourceName.begin(), kResourceName.end());
        bytes.push_back(0);
        bytes.insert(bytes.end(), kIptcResource.begin(), kIptcResource.end());
        bytes.insert(bytes.end(), {0, 0});        // empty resource name
        bytes.insert(bytes.end(), {0, 0, 0, 0});  // size, known at the end
    } else {
        bytes = {kItemMark, kIptcApplicationRecord, 0, 0, 2, 0, 2};
    }
    const std::size_t head_bytes = bytes.size();
    for (const TItem& item : items_) {
        const bool is_version = item.record == kIptcApplicationRecord && item.dataset == 0;
        if (is_version || item.data.empty()) {
            continue;
        }
        bytes.insert(bytes.end(), {kItemMark, item.record, item.dataset});
        AppendItemSize(bytes, item.data.size());
        bytes.insert(bytes.end(), item.data.begin(), item.data.end());
    }
    if (with_resource_header) {
        TBytes size_bytes;
        AppendU32BE(size_bytes, bytes.size() - head_bytes);
        std::copy(size_bytes.begin(), size_bytes.end(),
                  bytes.begin() + static_cast<std::ptrdiff_t>(head_bytes) - 4);
    }
    if (bytes.size() % 2 != 0) {
        bytes.push_back(0);
    }
    return bytes;
}

}  // namespace zm
