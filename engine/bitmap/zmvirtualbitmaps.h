#pragma once

#include <cstdint>
#include <vector>

#include "engine/bitmap/zmxBitmaps.h"
#include "engine/foundation/zmdefs.h"

/// Views of a bitmap: virtual bitmaps whose rows are made from the rows of another on demand, so
/// that no copy is needed. A view has the format, palette, display settings and, as a view too,
/// the alpha plane that its source has when it is made. The source must outlive the view and keep
/// its size and format. A row is valid until the next row is asked for, of the view or of a
/// file-backed source. One thread at a time.
namespace zm {

/// Whether a view takes its source's alpha plane along.
enum class TZmViewAlpha : std::uint8_t { kWithPlane, kWithoutPlane };

/// The rows of a rectangle of a bitmap. What lies beyond the bitmap has all bits set, which is
/// opaque in an alpha plane.
class TZmClippedRows : public TZmVirtualBitmapProvider {
public:
    TZmClippedRows(TZmBitmap& source, std::int32_t left, std::int32_t top);
    std::uint8_t* GetRow(TZmBitmap* bitmap, std::int32_t row, std::int32_t start,
                         std::int32_t width) override;

private:
    std::uint8_t* CopyRow(TZmBitmap& bitmap, std::int32_t source_row, std::int32_t first,
                          std::int32_t width);

    TZmBitmap& source_;
    std::int32_t left_;
    std::int32_t top_;
    std::vector<std::uint8_t> buffer_;
};

/// A rectangle of a bitmap; right and bottom exclusive, limited to the bitmap. Rows of formats of
/// whole bytes are those of the source. A rectangle outside gives an empty view.
class TZmVirtualClippedBitmap : public TZmBitmap {
public:
    TZmVirtualClippedBitmap(TZmBitmap& source, const TRect& rect,
                            TZmViewAlpha alpha = TZmViewAlpha::kWithPlane);

private:
    TZmClippedRows rows_;
};

/// The rows of a bitmap turned by quarters. What lies beyond the bitmap has all bits set.
class TZmRotatedRows : public TZmVirtualBitmapProvider {
public:
    /// `quarter_turns` 0 to 3, counter-clockwise; the size is that of the upright picture.
    TZmRotatedRows(TZmBitmap& source, std::int32_t quarter_turns, std::int32_t width,
                   std::int32_t height);
    std::uint8_t* GetRow(TZmBitmap* bitmap, std::int32_t row, std::int32_t start,
                         std::int32_t width) override;

private:
    TZmBitmap& source_;
    std::int32_t quarter_turns_;
    std::int32_t last_x_;
    std::int32_t last_y_;
    std::vector<std::uint8_t> buffer_;
};

/// A bitmap turned by quarters, counter-clockwise for positive counts; every count is taken
/// modulo 4. Rows of odd turns read all rows of the source each.
class TZmVirtualRotatedBitmap : public TZmBitmap {
public:
    TZmVirtualRotatedBitmap(TZmBitmap& source, std::int32_t quarter_turns,
                            TZmViewAlpha alpha = TZmViewAlpha::kWithPlane);

private:
    TZmRotatedRows rows_;
};

}  // namespace zm
