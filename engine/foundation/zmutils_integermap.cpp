#include "engine/foundation/zmutils_integermap.h"

#include <algorithm>
#include <limits>
#include <new>

namespace zm {

TZmIntegerMap::TZmIntegerMap(std::int32_t bucketCount)
    : fHeads(static_cast<std::size_t>(std::max(bucketCount, 1)), -1) {}

std::size_t TZmIntegerMap::BucketOf(std::int64_t key) const {
    return static_cast<std::size_t>(static_cast<std::uint64_t>(key) % fHeads.size());
}

const TZmIntegerMap::TZmIntegerMapItem* TZmIntegerMap::Find(std::int64_t key) const {
    for (std::int32_t at = fHeads[BucketOf(key)]; at >= 0;) {
        const TZmIntegerMapItem& item = fItems[static_cast<std::size_t>(at)];
        if (item.key == key) {
            return &item;
        }
        at = item.next;
    }
    return nullptr;
}

bool TZmIntegerMap::Insert(std::int64_t key, std::int64_t value) {
    if (Find(key) != nullptr) {
        return false;
    }
    if (fItems.size() >= static_cast<std::size_t>(std::numeric_limits<std::int32_t>::max())) {
        throw std::bad_alloc();
    }
    std::int32_t& head = fHeads[BucketOf(key)];
    fItems.push_back({key, value, head});
    head = GetKeysCount() - 1;
    fIterateIndex = fHeads.size();
    fIterateItem = -1;
    return true;
}

bool TZmIntegerMap::KeyExists(std::int64_t key) const {
    return Find(key) != nullptr;
}

std::optional<std::int64_t> TZmIntegerMap::Get(std::int64_t key) const {
    const TZmIntegerMapItem* const item = Find(key);
    return item != nullptr ? std::optional<std::int64_t>(item->value) : std::nullopt;
}

void TZmIntegerMap::Clear() {
    std::fill(fHeads.begin(), fHeads.end(), -1);
    fItems.clear();
    fIterateIndex = fHeads.size();
    fIterateItem = -1;
}

void TZmIntegerMap::IterateBegin() {
    fIterateIndex = 0;
    fIterateItem = -1;
}

bool TZmIntegerMap::IterateNext(std::int64_t& key, std::int64_t& value) {
    while (fIterateItem < 0 && fIterateIndex < fHeads.size()) {
        fIterateItem = fHeads[fIterateIndex++];
    }
    if (fIterateItem < 0) {
        return false;
    }
    const TZmIntegerMapItem& item = fItems[static_cast<std::size_t>(fIterateItem)];
    key = item.key;
    value = item.value;
    fIterateItem = item.next;
    return true;
}

bool TZmRGBMap::IterateNext(TRGB& key, std::int64_t& value) {
    std::int64_t packed = 0;
    if (!fMap.IterateNext(packed, value)) {
        return false;
    }
    key = {static_cast<std::uint8_t>(packed), static_cast<std::uint8_t>(packed >> 8),
           static_cast<std::uint8_t>(packed >> 16)};
    return true;
}

}  // namespace zm
