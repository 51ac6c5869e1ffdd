#pragma once

#include <cstdint>

#include "engine/bitmap/zmrender.h"
#include "engine/bitmap/zmxBitmaps.h"

/// Between the renderer's entry, its paths and its pixel transfer.
namespace zm {

/// A rectangle by position and size.
struct TZmRenderRect {
    std::int32_t x = 0;
    std::int32_t y = 0;
    std::int32_t width = 0;
    std::int32_t height = 0;
};

/// Arguments of a drawing. Ratios are source pixels for each destination pixel, as they are
/// before any clipping.
struct TZmRenderCall {
    TZmBitmap* destination = nullptr;
    TZmLookupTable* columns = nullptr;
    TZmLookupTable* rows = nullptr;
    const TRect* update_rect = nullptr;
    TZmRenderRect dest;
    TZmRenderRect source;
    double ratio_x = 1;
    double ratio_y = 1;
    bool enable_alpha = false;
    bool solid_background = false;
    std::int32_t transparency = 255;
    TResampleFilter filter = rfNone;
    TZmRenderOperation operation = zmlNormal;
    double opacity = 1;
};

/// Fits both rectangles of a call to their images. False when nothing is left to draw.
bool ClipRenderCall(TZmRenderCall& call, std::int32_t source_width, std::int32_t source_height);

/// The part of the destination rectangle inside update rectangle and image; right and bottom
/// exclusive, empty when right <= left or bottom <= top.
TRect FindVisibleRect(const TZmRenderCall& call);

/// The plane of a source when it takes part: asked for, zm8g and with pixels. Else nil.
TZmBitmap* FindRenderPlane(TZmBitmapRendering& source, bool enable_alpha);

/// Which of the two forms of the row loops runs; both give the same bytes.
enum class TRenderLoop : std::uint8_t {
    kPlain,  ///< pixel by pixel as the rule is stated
    kFast,   ///< row by row, in vectors where that is possible
};

/// One call of a pixel transfer routine.
struct TZmRenderTransfer {
    TZmBitmap* destination = nullptr;
    TRect area;                               ///< of the destination; right, bottom exclusive
    const std::int32_t* columns = nullptr;    ///< source column of area.left and those after it
    const std::int32_t* rows = nullptr;       ///< source row of area.top and those after it
    TZmBitmap* plane = nullptr;               ///< alpha plane that takes part, or nil
    const std::uint8_t* row_alpha = nullptr;  ///< without a plane: one alpha, for each column
    bool solid_background = false;
    std::int32_t transparency = 255;
    TZmRenderOperation operation = zmlNormal;
    double opacity = 1;
    TRenderLoop loop = TRenderLoop::kFast;
};

/// Holds a row by GetRow; frees it at the end. Two rows of one image can be held at once.
class TRowHold {
public:
    TRowHold(TZmBitmap& bitmap, std::int32_t row)
        : bitmap_(bitmap), row_(row), address_(bitmap.GetRow(row)) {}
    ~TRowHold() { bitmap_.FreeRow(row_); }
    TRowHold(const TRowHold&) = delete;
    TRowHold& operator=(const TRowHold&) = delete;
    std::uint8_t* Get() const { return address_; }

private:
    TZmBitmap& bitmap_;
    std::int32_t row_;
    std::uint8_t* address_;
};

}  // namespace zm
