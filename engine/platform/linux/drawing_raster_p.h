#pragma once

#include <functional>
#include <optional>
#include <vector>

#include "engine/platform/drawing.h"
#include "engine/platform/drawing_path_p.h"
#include "engine/platform/linux/drawing_library_p.h"

/// From coverage to pixels. The library below only says how much of each pixel a shape covers;
/// colours are laid over the target here, in exact integers, so that a straight-alpha target keeps
/// the full colour even where little of a pixel is covered. The work goes by tiles of limited
/// size over the part of the target that a drawing can reach.
namespace zm::platform {

/// Colours by device pixel.
class TPaint {
public:
    virtual ~TPaint() = default;
    virtual void ReadRow(std::int32_t x, std::int32_t y, std::int32_t count, TArgb* colors) = 0;
};

class TSolidPaint : public TPaint {
public:
    explicit TSolidPaint(TArgb color) : color_(color) {}
    void ReadRow(std::int32_t x, std::int32_t y, std::int32_t count, TArgb* colors) override;

private:
    TArgb color_;
};

/// How a colour meets a pixel: over it by its alpha, in its place, or by one of the 16 modes of
/// the plain drawing (kPlainFirst + mode).
using TCombining = std::int32_t;
inline constexpr TCombining kCombineOver = 0;
inline constexpr TCombining kCombineCopy = 1;
inline constexpr TCombining kPlainFirst = 2;

enum class TMaskEdges : std::uint8_t { kSmooth, kHard };

/// Rows of a target as colours.
class TTargetRows {
public:
    explicit TTargetRows(const TDrawTarget& target);
    bool IsValid() const { return row_bytes_ > 0; }
    void ReadRow(std::int32_t x, std::int32_t y, std::int32_t count, TArgb* colors) const;
    /// Writes the pixels that differ from what was read.
    void WriteRow(std::int32_t x, std::int32_t y, std::int32_t count, const TArgb* before,
                  const TArgb* colors);

private:
    std::uint8_t* Row(std::int32_t y) const;
    std::size_t NearestEntry(TArgb color) const;

    TDrawTarget target_;
    std::int64_t row_bytes_ = 0;
};

/// What a callback draws a part on.
struct TTile {
    cairo_t* cairo = nullptr;  ///< origin at the tile's corner, source opaque white
    TRect area;                ///< in device pixels
    std::uint8_t* mask = nullptr;
    std::int32_t mask_stride = 0;
};

class TRaster {
public:
    TRaster(const TDrawTarget& target, const TDrawingLibrary& library);
    bool IsValid() const { return rows_.IsValid(); }
    TDeviceBox Bounds() const;
    TRect TouchedRect() const { return touched_; }
    /// Pixels of all tiles so far, for drawings that set themselves a limit.
    std::int64_t PaintedPixels() const { return painted_pixels_; }
    const TDrawingLibrary& Library() const { return library_; }

    /// Draws coverage into tiles over the part of `box` within the target, and lays the paint on
    /// the target there. False when the library or memory fails.
    using TDrawCoverage = std::function<bool(const TTile&)>;
    bool Paint(const TDeviceBox& box, TPaint& paint, TCombining combining,
               const TDrawCoverage& draw);
    /// As Paint, for drawings that bring their own colours; those are limited by an alpha.
    bool PaintColors(const TDeviceBox& box, std::uint8_t alpha, TCombining combining,
                     const TDrawCoverage& draw);

private:
    bool DrawTile(TTile& tile, cairo_format_t format, const TDrawCoverage& draw);
    template <typename TCompose>
    bool PaintTiles(const TDeviceBox& box, cairo_format_t format, const TDrawCoverage& draw,
                    TCompose compose);
    void ComposeMask(const TTile& tile, TPaint& paint, TCombining combining);
    void ComposeColors(const TTile& tile, std::uint8_t alpha, TCombining combining);
    void ComposeRow(const TTile& tile, std::int32_t y, TCombining combining);

    const TDrawTarget target_;
    const TDrawingLibrary& library_;
    TTargetRows rows_;
    TRect touched_{};
    std::int64_t painted_pixels_ = 0;
    std::vector<std::uint8_t> buffer_;
    std::vector<std::uint8_t> coverage_;
    std::vector<TArgb> colors_;
    std::vector<TArgb> before_;
    std::vector<TArgb> after_;
};

/// Puts figures on a tile's path, moved by an offset in pixels.
void AddFigures(const TDrawingLibrary& library, const TTile& tile,
                const std::vector<TPolyline>& figures, double offset);
/// Fills figures, even-odd unless told otherwise.
bool FillFigures(const TDrawingLibrary& library, const TTile& tile,
                 const std::vector<TPolyline>& figures, TMaskEdges edges,
                 cairo_fill_rule_t rule = CAIRO_FILL_RULE_EVEN_ODD);

/// How far outside a tile figures are kept: so far that cuts never show, yet within the range of
/// the library's numbers.
inline constexpr double kCutMargin = 1 << 20;

}  // namespace zm::platform
