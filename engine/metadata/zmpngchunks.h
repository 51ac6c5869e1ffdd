#pragma once

#include <cstdint>
#include <string>
#include <string_view>
#include <vector>

namespace zm {

/// Chunks of a PNG file that carry metadata of other rooms.
enum TZmPngChunkKind : std::uint8_t {
    kPngChunkExif,     ///< eXIf: an EXIF block, a TIFF structure
    kPngChunkProfile,  ///< iCCP: a colour profile
    kPngChunkText,     ///< iTXt: international text, also the carrier of XMP packets
};

/// A kept chunk. What the file compressed is unpacked here.
struct TZmPngChunk {
    TZmPngChunkKind kind = kPngChunkText;
    std::string key;                 ///< keyword of a text, name of a profile; Latin-1
    std::string language;            ///< of a text: its language tag, empty when the file has none
    std::string translated_key;      ///< of a text: the keyword in that language, UTF-8
    std::vector<std::uint8_t> data;  ///< of a text: UTF-8

    friend bool operator==(const TZmPngChunk&, const TZmPngChunk&) = default;
};

/// The kept chunks of a PNG file in the order in which the file has each kind. The list copies as
/// a value. Pointers into it are valid until it changes.
class TZmPngChunkList {
public:
    std::int32_t Count() const { return static_cast<std::int32_t>(items_.size()); }
    const TZmPngChunk& operator[](std::int32_t index) const {
        return items_[static_cast<std::size_t>(index)];
    }
    void Add(TZmPngChunk chunk) { items_.push_back(std::move(chunk)); }
    void Clear() { items_.clear(); }
    /// The first of a kind, or nil.
    const TZmPngChunk* Find(TZmPngChunkKind kind) const;
    /// The text with this keyword and these very bytes, or nil.
    const TZmPngChunk* FindText(std::string_view key, std::string_view value) const;
    /// The text that carries the XMP packet, or nil.
    const TZmPngChunk* FindXmp() const;
    void Delete(TZmPngChunkKind kind);
    /// Deletes the texts that carry XMP packets / all other texts.
    void DeleteXmp();
    void DeletePlainTexts();

private:
    std::vector<TZmPngChunk> items_;
};

/// Whether a text is an XMP packet (keyword "XML:com.adobe.xmp").
bool IsXmpChunk(const TZmPngChunk& chunk);

}  // namespace zm
