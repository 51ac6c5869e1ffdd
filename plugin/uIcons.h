#pragma once

#include <cstddef>
#include <cstdint>
#include <vector>

namespace zm {

/// An icon: the image of its file and, once asked for, the system's handle. Owns both.
class TIcon {
public:
    TIcon() = default;
    ~TIcon();
    TIcon(const TIcon&) = delete;
    TIcon& operator=(const TIcon&) = delete;

    /// Takes the bytes of an icon file with one entry.
    void LoadFromFileImage(std::vector<std::uint8_t> file_image);
    const std::vector<std::uint8_t>& FileImage() const { return file_image_; }
    /// Handle for the host's records; nil for an empty icon and where icons have no handles.
    /// Valid as long as the object. Not thread-safe on the first call.
    void* GetHandle();

private:
    std::vector<std::uint8_t> file_image_;
    void* handle_ = nullptr;
};

/// Our drawings, by what they stand for.
enum TIconGlyph : std::uint8_t {
    igPlugin,
    igOpen,
    igSave,
    igResize,
    igCrop,
    igRotate,
    igText,
    igImage,
    igBorder,
};
inline constexpr int kIconGlyphCount = 9;

/// Bytes of an icon file with one image of 16 by 16 pixels and 256 colours: a file header, an
/// info header, the palette, a byte per pixel and the mask.
inline constexpr std::size_t kIconFileBytes = 6 + 16 + 40 + 256 * 4 + 16 * 16 + 16 * 4;
static_assert(kIconFileBytes == 1406);

/// The icon file of a drawing, kIconFileBytes long.
std::vector<std::uint8_t> BuildIconFile(TIconGlyph glyph);

}  // namespace zm
