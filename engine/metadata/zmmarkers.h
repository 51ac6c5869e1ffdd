#pragma once

#include <cstddef>
#include <cstdint>
#include <memory>
#include <span>
#include <vector>

namespace zm {

class TMemoryStream;
class TStream;
class TZmFieldReader;

/// Codes of the markers that carry metadata in a JPEG file.
inline constexpr std::uint8_t kMarkerApp0 = 0xE0;
inline constexpr std::uint8_t kMarkerApp1 = 0xE1;   ///< EXIF, XMP
inline constexpr std::uint8_t kMarkerApp2 = 0xE2;   ///< colour profile
inline constexpr std::uint8_t kMarkerApp13 = 0xED;  ///< IPTC in a resource block
inline constexpr std::uint8_t kMarkerApp14 = 0xEE;  ///< written by the JPEG library itself
inline constexpr std::uint8_t kMarkerComment = 0xFE;

/// The raw markers of a JPEG file in their order: a type byte and the bytes behind the length
/// word. The list copies as a value. Indices outside the list give type 0 and no data, and
/// change nothing.
class TZmMarkerList {
public:
    std::int32_t Count() const { return static_cast<std::int32_t>(items_.size()); }
    /// Appends and returns the new item's index.
    std::int32_t AddMarker(std::uint8_t type, std::span<const std::uint8_t> data);
    /// Puts an item before `index`; an index at or past the end appends.
    void InsertMarker(std::int32_t index, std::uint8_t type, std::span<const std::uint8_t> data);
    /// Replaces the data of the first item of the type, or appends one.
    void SetMarker(std::uint8_t type, std::span<const std::uint8_t> data);
    void Clear() { items_.clear(); }
    /// Removes all items of other types.
    void ClearExcept(std::uint8_t type);
    /// Index of the first item of the type, or -1.
    std::int32_t IndexOf(std::uint8_t type) const;
    void DeleteMarker(std::int32_t index);
    /// Removes all items of the type.
    void DeleteMarkerInstances(std::uint8_t type);
    /// Orders by type; equal types keep their order.
    void Sort();
    void Assign(const TZmMarkerList& source) { *this = source; }

    /// Stream form: a zero byte, a 32-bit count, and for each item its type, a 32-bit length and
    /// its data; little-endian.
    void SaveToStream(TStream& stream) const;
    /// Replaces the contents. False when the stream ends inside the list or holds another form;
    /// the items before that are kept.
    bool LoadFromStream(TStream& stream);
    bool LoadFromReader(TZmFieldReader& reader);

    std::uint8_t GetMarkerType(std::int32_t index) const;
    /// Valid until the list changes.
    std::span<const std::uint8_t> GetMarkerData(std::int32_t index) const;
    std::int32_t GetMarkerLength(std::int32_t index) const;
    /// A stream over a copy of the data, at its start.
    std::unique_ptr<TMemoryStream> GetMarkerStream(std::int32_t index) const;

private:
    struct TItem {
        std::uint8_t type = 0;
        std::vector<std::uint8_t> data;
    };
    bool IsInside(std::int32_t index) const { return index >= 0 && index < Count(); }

    std::vector<TItem> items_;
};

/// Whether the bytes of an APP1 marker hold an EXIF block ("Exif" and two zero bytes).
bool IsExifMarkerData(std::span<const std::uint8_t> data);

}  // namespace zm
