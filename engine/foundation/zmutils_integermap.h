#pragma once

#include <cstddef>
#include <cstdint>
#include <optional>
#include <vector>

#include "engine/foundation/zmdefs.h"

namespace zm {

/// A hash map from integers to integers with a fixed number of chained buckets. It also serves
/// as a set. Not thread-safe.
class TZmIntegerMap {
public:
    /// `bucketCount` below 1 counts as 1. A key's bucket is the key, as an unsigned number, modulo
    /// the count.
    explicit TZmIntegerMap(std::int32_t bucketCount);

    /// False, and the old value kept, when the key is there already.
    bool Insert(std::int64_t key, std::int64_t value = 0);
    bool KeyExists(std::int64_t key) const;
    /// The value of a key, or nothing.
    std::optional<std::int64_t> Get(std::int64_t key) const;
    std::int32_t GetKeysCount() const { return static_cast<std::int32_t>(fItems.size()); }
    /// Removes all keys; the buckets stay.
    void Clear();

    /// A walk over all entries: buckets in order, in a bucket the entry inserted last first. One
    /// walk at a time; an Insert or Clear ends it.
    void IterateBegin();
    /// The next entry; false when the walk is over.
    bool IterateNext(std::int64_t& key, std::int64_t& value);

private:
    struct TZmIntegerMapItem {
        std::int64_t key = 0;
        std::int64_t value = 0;
        std::int32_t next = -1;  ///< index in fItems, -1 at the chain's end
    };
    std::size_t BucketOf(std::int64_t key) const;
    const TZmIntegerMapItem* Find(std::int64_t key) const;

    std::vector<std::int32_t> fHeads;  ///< first item of each bucket, -1 for none
    std::vector<TZmIntegerMapItem> fItems;
    std::size_t fIterateIndex = 0;   ///< bucket whose chain begins next
    std::int32_t fIterateItem = -1;  ///< item that comes next, -1: the next bucket's first
};

/// The same keyed by a colour: its bytes blue, green, red, blue lowest, are the key.
class TZmRGBMap {
public:
    explicit TZmRGBMap(std::int32_t bucketCount) : fMap(bucketCount) {}
    bool Insert(TRGB key, std::int64_t value = 0) { return fMap.Insert(Pack(key), value); }
    bool KeyExists(TRGB key) const { return fMap.KeyExists(Pack(key)); }
    std::optional<std::int64_t> Get(TRGB key) const { return fMap.Get(Pack(key)); }
    std::int32_t GetKeysCount() const { return fMap.GetKeysCount(); }
    void Clear() { fMap.Clear(); }
    void IterateBegin() { fMap.IterateBegin(); }
    bool IterateNext(TRGB& key, std::int64_t& value);

private:
    static std::int64_t Pack(TRGB key) { return key.b | (key.g << 8) | (key.r << 16); }

    TZmIntegerMap fMap;
};

}  // namespace zm
