#pragma once

#include <cstdint>
#include <span>
#include <string>
#include <string_view>
#include <vector>

namespace zm {

class TStream;
class TZmFieldReader;

/// Record of the editorial data that pictures carry.
inline constexpr std::uint8_t kIptcApplicationRecord = 2;

/// The datasets of an IPTC block in their order (IPTC-NAA Information Interchange Model): a
/// record number, a dataset number and bytes. The list copies as a value. Indices outside the
/// list give 0 and no data, and change nothing.
class TZmIPTCInfoList {
public:
    std::int32_t Count() const { return static_cast<std::int32_t>(items_.size()); }
    /// Appends and returns the new item's index.
    std::int32_t AddStringItem(std::uint8_t record, std::uint8_t dataset, std::string_view text);
    std::int32_t AddBufferItem(std::uint8_t record, std::uint8_t dataset,
                               std::span<const std::uint8_t> data);
    /// Puts an item before `index`; an index at or past the end appends.
    void InsertStringItem(std::int32_t index, std::uint8_t record, std::uint8_t dataset,
                          std::string_view text);
    void Clear() { items_.clear(); }
    /// Index of the first item with both numbers, or -1.
    std::int32_t IndexOf(std::uint8_t record, std::uint8_t dataset) const;
    void DeleteItem(std::int32_t index);
    void Assign(const TZmIPTCInfoList& source) { *this = source; }

    /// Valid until the list changes.
    std::span<const std::uint8_t> GetItemData(std::int32_t index) const;
    std::int32_t GetItemLength(std::int32_t index) const;
    std::string GetStrings(std::int32_t index) const;
    void SetStrings(std::int32_t index, std::string_view text);
    std::uint8_t GetRecordNumber(std::int32_t index) const;
    void SetRecordNumber(std::int32_t index, std::uint8_t record);
    std::uint8_t GetDataSet(std::int32_t index) const;
    void SetDataSet(std::int32_t index, std::uint8_t dataset);

    /// Stream form: a 32-bit count, and for each item its record number, its dataset number, a
    /// 32-bit length and its data; little-endian.
    void SaveToStream(TStream& stream) const;
    /// Replaces the contents. False when the stream ends inside the list; the items before that
    /// are kept.
    bool LoadFromStream(TStream& stream);
    bool LoadFromReader(TZmFieldReader& reader);

    /// Replaces the contents by the datasets of a bare block, or of the block that a resource
    /// block ("Photoshop 3.0", resource 0x0404) holds. An item that runs past the end ends the
    /// reading, the items before it are kept. True when there is any.
    bool LoadFromStandardBuffer(std::span<const std::uint8_t> buffer);
    /// The block as files carry it, inside a resource block when asked; empty for an empty list.
    /// Items without data and record versions (2:0) are left out.
    std::vector<std::uint8_t> SaveToStandardBuffer(bool with_resource_header) const;

private:
    struct TItem {
        std::uint8_t record = 0;
        std::uint8_t dataset = 0;
        std::vector<std::uint8_t> data;
    };
    const TItem* ItemAt(std::int32_t index) const;
    TItem* ItemAt(std::int32_t index);

    std::vector<TItem> items_;
};

}  // namespace zm
