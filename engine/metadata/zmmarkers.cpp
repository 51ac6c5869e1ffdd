#include "engine/metadata/zmmarkers.h"

#include <algorithm>
#include <array>

#include "engine/foundation/zmstreams.h"
#include "engine/io/zmfieldstreams.h"

namespace zm {

namespace {

constexpr std::uint8_t kListForm = 0;
constexpr std::int32_t kLeastItemBytes = 5;  // type and length

}  // namespace

std::int32_t TZmMarkerList::AddMarker(std::uint8_t type, std::span<const std::uint8_t> data) {
    items_.push_back({type, {data.begin(), data.end()}});
    return Count() - 1;
}

void TZmMarkerList::InsertMarker(std::int32_t index, std::uint8_t type,
                                 std::span<const std::uint8_t> data) {
    const std::int32_t place = std::clamp(index, 0, Count());
    items_.insert(items_.begin() + place, TItem{type, {data.begin(), data.end()}});
}

void TZmMarkerList::SetMarker(std::uint8_t type, std::span<const std::uint8_t> data) {
    const std::int32_t index = IndexOf(type);
    if (index < 0) {
        AddMarker(type, data);
        return;
    }
    items_[static_cast<std::size_t>(index)].data = {data.begin(), data.end()};
}

void TZmMarkerList::ClearExcept(std::uint8_t type) {
    std::erase_if(items_, [type](const TItem& item) { return item.type != type; });
}

std::int32_t TZmMarkerList::IndexOf(std::uint8_t type) const {
    const auto found = std::find_if(items_.begin(), items_.end(),
                                    [type](const TItem& item) { return item.type == type; });
    return found == items_.end() ? -1 : static_cast<std::int32_t>(found - items_.begin());
}

void TZmMarkerList::DeleteMarker(std::int32_t index) {
    if (IsInside(index)) {
        items_.erase(items_.begin() + index);
    }
}

void TZmMarkerList::DeleteMarkerInstances(std::uint8_t type) {
    std::erase_if(items_, [type](const TItem& item) { return item.type == type; });
}

void TZmMarkerList::Sort() {
    std::stable_sort(items_.begin(), items_.end(),
                     [](const TItem& a, const TItem& b) { return a.type < b.type; });
}

std::uint8_t TZmMarkerList::GetMarkerType(std::int32_t index) const {
    return IsInside(index) ? items_[static_cast<std::size_t>(index)].type : std::uint8_t{0};
}

std::span<const std::uint8_t> TZmMarkerList::GetMarkerData(std::int32_t index) const {
    if (!IsInside(index)) {
        return {};
    }
    return items_[static_cast<std::size_t>(index)].data;
}

std::int32_t TZmMarkerList::GetMarkerLength(std::int32_t index) const {
    return static_cast<std::int32_t>(GetMarkerData(index).size());
}

std::unique_ptr<TMemoryStream> TZmMarkerList::GetMarkerStream(std::int32_t index) const {
    const std::span<const std::uint8_t> data = GetMarkerData(index);
    return std::make_unique<TMemoryStream>(std::vector<std::uint8_t>(data.begin(), data.end()));
}

void TZmMarkerList::SaveToStream(TStream& stream) const {
    TZmFieldWriter writer(stream);
    writer.U8(kListForm);
    writer.S32(Count());
    for (const TItem& item : items_) {
        writer.U8(item.type);
        writer.WriteBlock(item.data);
    }
}

bool TZmMarkerList::LoadFromStream(TStream& stream) {
    TZmFieldReader reader(stream);
    return LoadFromReader(reader);
}

bool TZmMarkerList::LoadFromReader(TZmFieldReader& reader) {
    Clear();
    const std::uint8_t form = reader.U8();
    const std::int32_t count = form == kListForm ? reader.ReadCount(kLeastItemBytes) : -1;
    for (std::int32_t i = 0; i < count; ++i) {
        TItem item;
        item.type = reader.U8();
        if (!reader.ReadBlock(item.data)) {
            return false;
        }
        items_.push_back(std::move(item));
    }
    return count >= 0;
}

bool IsExifMarkerData(std::span<const std::uint8_t> data) {
    static constexpr std::array<std::uint8_t, 6> kExifPrefix{'E', 'x', 'i', 'f', 0, 0};
    return data.size() >= kExifPrefix.size() &&
           std::equal(kExifPrefix.begin(), kExifPrefix.end(), data.begin());
}

}  // namespace zm
