#include "engine/metadata/zmmarkers.h"

#include <algorithm>
#include <array>

namespace zm {

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

bool IsExifMarkerData(std::span<const std::uint8_t> data) {
    static constexpr std::array<std::uint8_t, 6> kExifPrefix{'E', 'x', 'i', 'f', 0, 0};
    return data.size() >= kExifPrefix.size() &&
           std::equal(kExifPrefix.begin(), kExifPrefix.end(), data.begin());
}

}  // namespace zm
