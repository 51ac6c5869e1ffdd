#include "engine/foundation/zmutils_lists.h"

#include <algorithm>
#include <new>
#include <string>

#include "engine/foundation/zmdefs.h"
#include "engine/foundation/zmnumbers.h"

namespace zm {

TZmList::TZmList(std::int32_t itemSize) : fItemSize(std::max(itemSize, 1)) {}

void TZmList::CheckIndex(std::int32_t idx, std::int32_t limit) const {
    if (idx < 0 || idx >= limit) {
        throw EZmException("List index out of bounds (" + std::to_string(idx) + ")");
    }
}

std::size_t TZmList::OffsetOf(std::int32_t idx) const {
    return static_cast<std::size_t>(idx) * static_cast<std::size_t>(fItemSize);
}

std::int32_t TZmList::GetCapacity() const {
    const std::size_t items = fData.capacity() / static_cast<std::size_t>(fItemSize);
    return SaturateToInt32(static_cast<std::int64_t>(items));
}

void TZmList::SetCapacity(std::int32_t capacity) {
    const std::int64_t bytes = std::int64_t{capacity} * fItemSize;
    if (!FitsAddressSpace(std::max<std::int64_t>(bytes, 0))) {
        throw std::bad_alloc();
    }
    if (capacity > fCount) {
        fData.reserve(static_cast<std::size_t>(bytes));
    }
}

void TZmList::InsertItem(std::int32_t idx, const void* item) {
    CheckIndex(idx, fCount < kMaxInt32 ? fCount + 1 : fCount);
    if (fCount == kMaxInt32 || !FitsAddressSpace((std::int64_t{fCount} + 1) * fItemSize)) {
        throw std::bad_alloc();
    }
    const auto* const bytes = static_cast<const std::uint8_t*>(item);
    fData.insert(fData.begin() + static_cast<std::ptrdiff_t>(OffsetOf(idx)), bytes,
                 bytes + fItemSize);
    ++fCount;
    fChanged |= zmlcItems;
}

void TZmList::ReadItem(std::int32_t idx, void* item) const {
    CheckIndex(idx, fCount);
    std::memcpy(item, fData.data() + OffsetOf(idx), static_cast<std::size_t>(fItemSize));
}

void TZmList::WriteItem(std::int32_t idx, const void* item) {
    CheckIndex(idx, fCount);
    std::memcpy(fData.data() + OffsetOf(idx), item, static_cast<std::size_t>(fItemSize));
    fChanged |= zmlcItems;
}

void TZmList::Delete(std::int32_t idx) {
    CheckIndex(idx, fCount);
    const auto first = fData.begin() + static_cast<std::ptrdiff_t>(OffsetOf(idx));
    fData.erase(first, first + fItemSize);
    --fCount;
    fChanged |= zmlcItems;
}

void TZmList::Clear() {
    fData.clear();
    fCount = 0;
    fChanged |= zmlcItems;
}

void TZmList::Assign(const TZmList& Source) {
    if (Source.fItemSize != fItemSize) {
        throw EZmException("The lists hold items of different sizes");
    }
    if (&Source != this) {
        fData = Source.fData;
        fCount = Source.fCount;
    }
    fChanged |= zmlcItems;
}

void TZmList::ExchangeItems(std::int32_t idx1, std::int32_t idx2) {
    CheckIndex(idx1, fCount);
    CheckIndex(idx2, fCount);
    if (idx1 != idx2) {
        std::uint8_t* const first = fData.data() + OffsetOf(idx1);
        std::swap_ranges(first, first + fItemSize, fData.data() + OffsetOf(idx2));
    }
    fChanged |= zmlcItems;
}

/// Merges neighbouring sorted runs of `run` items into runs of twice the length.
void TZmList::MergeRuns(std::size_t run, const TCompare& compare,
                        std::vector<std::uint8_t>& target) {
    const auto size = static_cast<std::size_t>(fItemSize);
    const auto count = static_cast<std::size_t>(fCount);
    const std::uint8_t* const source = fData.data();
    std::uint8_t* out = target.data();
    for (std::size_t start = 0; start < count;) {
        const std::size_t middle = start + std::min(run, count - start);
        const std::size_t end = middle + std::min(run, count - middle);
        std::size_t left = start;
        std::size_t right = middle;
        while (left < middle || right < end) {
            const bool take_right =
                left == middle ||
                (right < end && compare(source + left * size, source + right * size) > 0);
            std::size_t& taken = take_right ? right : left;
            std::memcpy(out, source + taken * size, size);
            out += size;
            ++taken;
        }
        start = end;
    }
}

void TZmList::Sort(const TCompare& Compare) {
    std::vector<std::uint8_t> merged(fData.size());
    const auto count = static_cast<std::size_t>(fCount);
    for (std::size_t run = 1; run < count; run *= 2) {
        MergeRuns(run, Compare, merged);
        fData.swap(merged);
    }
    fChanged |= zmlcItems;
}

void TZmList::ReadCurrentValue(void* item) {
    if (fOnGetCurrentValue) {
        fOnGetCurrentValue(*this, item);
    }
}

void TZmList::WriteCurrentValue(void* item) {
    if (fOnSetCurrentValue) {
        fOnSetCurrentValue(*this, item);
        fChanged |= zmlcCurrentValue;
    }
}

}  // namespace zm
