#pragma once

#include <cstddef>
#include <cstdint>
#include <cstring>
#include <functional>
#include <type_traits>
#include <vector>

namespace zm {

/// What has changed in a list since the flags were last cleared; a set of the bits.
enum TZmListChanges : std::uint8_t {
    zmlcNone = 0,
    zmlcItems = 1,         ///< items came, went, moved or got other values
    zmlcCurrentValue = 2,  ///< the current value was set
};

/// A growable array of items of one fixed size, whose bytes may be copied. Indexes count from 0;
/// one that is outside raises EZmException "List index out of bounds (%d)". Not thread-safe.
class TZmList {
public:
    /// Reads or writes the value that an owner of the list counts as current: `item` is the
    /// address of one item's bytes.
    using TZmListCurrentValueEvent = std::function<void(TZmList& sender, void* item)>;
    /// Negative, 0 or positive, as the first item stands before, beside or behind the second.
    using TCompare = std::function<int(const void* first, const void* second)>;

    /// `itemSize` in bytes, at least 1.
    explicit TZmList(std::int32_t itemSize);
    TZmList(const TZmList&) = delete;
    TZmList& operator=(const TZmList&) = delete;
    virtual ~TZmList() = default;

    virtual void Delete(std::int32_t idx);
    virtual void Clear();
    /// Takes over all items; items of another size raise EZmException.
    virtual void Assign(const TZmList& Source);

    void ExchangeItems(std::int32_t idx1, std::int32_t idx2);
    /// Stable; a comparison that contradicts itself only costs the order.
    void Sort(const TCompare& Compare);

    std::int32_t GetCount() const { return fCount; }
    std::int32_t GetItemSize() const { return fItemSize; }
    /// Items for which there is room.
    std::int32_t GetCapacity() const;
    /// Makes room ahead; below the count it does nothing.
    void SetCapacity(std::int32_t capacity);

    TZmListCurrentValueEvent fOnGetCurrentValue;
    TZmListCurrentValueEvent fOnSetCurrentValue;
    std::uint8_t fChanged = zmlcNone;  ///< bits of TZmListChanges; the owner clears them

protected:
    void AddItem(const void* item) { InsertItem(fCount, item); }
    /// `idx` may be the count.
    void InsertItem(std::int32_t idx, const void* item);
    void ReadItem(std::int32_t idx, void* item) const;
    void WriteItem(std::int32_t idx, const void* item);
    void ReadCurrentValue(void* item);
    void WriteCurrentValue(void* item);

private:
    void CheckIndex(std::int32_t idx, std::int32_t limit) const;
    std::size_t OffsetOf(std::int32_t idx) const;
    void MergeRuns(std::size_t run, const TCompare& compare, std::vector<std::uint8_t>& target);

    std::int32_t fCount = 0;
    std::int32_t fItemSize;
    std::vector<std::uint8_t> fData;
};

/// The operations of a list of one type of numbers.
template <typename TItem>
class TZmNumberList : public TZmList {
    static_assert(std::is_arithmetic_v<TItem>);

public:
    TZmNumberList() : TZmList(sizeof(TItem)) {}
    /// Index of the new item.
    std::int32_t Add(TItem item) {
        AddItem(&item);
        return GetCount() - 1;
    }
    /// `idx` may be the count: the item then goes to the end.
    void Insert(std::int32_t idx, TItem item) { InsertItem(idx, &item); }
    TItem GetItem(std::int32_t idx) const {
        TItem item{};
        ReadItem(idx, &item);
        return item;
    }
    void SetItem(std::int32_t idx, TItem item) { WriteItem(idx, &item); }
    /// Index of the first equal item, -1 for none.
    std::int32_t IndexOf(TItem item) const {
        for (std::int32_t i = 0; i < GetCount(); ++i) {
            if (GetItem(i) == item) {
                return i;
            }
        }
        return -1;
    }
    /// The owner's current value; 0, or no effect, without its event.
    TItem GetCurrentValue() {
        TItem item{};
        ReadCurrentValue(&item);
        return item;
    }
    void SetCurrentValue(TItem item) { WriteCurrentValue(&item); }
    /// Ascending.
    void SortAscending() {
        Sort([](const void* first, const void* second) {
            TItem a{};
            TItem b{};
            std::memcpy(&a, first, sizeof(a));
            std::memcpy(&b, second, sizeof(b));
            return static_cast<int>(a > b) - static_cast<int>(a < b);
        });
    }
};

class TZmDoubleList : public TZmNumberList<double> {};
class TZmIntegerList : public TZmNumberList<std::int32_t> {};

}  // namespace zm
