#pragma once

#include <cstdint>
#include <memory>
#include <optional>
#include <span>
#include <string>
#include <string_view>
#include <vector>

#include "engine/foundation/zmdefs.h"
#include "engine/platform/dibsection.h"

/// The one seam toward the system's drawing. Two abstract classes draw on the pixels of a
/// TDibSection: TPlatformCanvas, the plain drawing that every system brings, and TVectorGraphics,
/// the drawing library with coverage, transparency and text, which is bound at run time.
///
/// Coordinates are pixels, x to the right and y down from the top left corner of the target; any
/// value is allowed, also those that are not numbers, and what lies outside the target is left
/// out. Angles are degrees, clockwise, 0 pointing right. A call that fails draws nothing.
///
/// Objects belong to the thread that made them; several threads may each use their own at the
/// same time. They never raise; lack of memory is a failure like any other.
namespace zm::platform {

/// Alpha in the high byte, then red, green, blue.
using TArgb = std::uint32_t;

constexpr TArgb MakeArgb(std::uint8_t alpha, TRGB color) {
    return static_cast<TArgb>(alpha) << 24 | static_cast<TArgb>(color.r) << 16 |
           static_cast<TArgb>(color.g) << 8 | color.b;
}

/// What is drawn on; the section and the colours outlive all that is made over it. At 32 bits the
/// fourth byte is alpha, the colours not multiplied by it.
struct TDrawTarget {
    TDibSection* section = nullptr;
    std::int32_t width = 0;
    std::int32_t height = 0;
    std::int32_t bits_per_pixel = 0;            ///< 1, 8, 24 or 32
    const std::vector<TRGB>* colors = nullptr;  ///< 256 entries, used at 1 and 8 bits
};

struct TDrawPoint {
    float x = 0;
    float y = 0;
};

struct TDrawSize {
    float width = 0;
    float height = 0;
};

struct TDrawRect {
    float x = 0;
    float y = 0;
    float width = 0;
    float height = 0;
};

/// A font by description; one that is missing is replaced by the nearest that the machine has.
struct TDrawFont {
    std::u16string family;
    std::int32_t height = 0;  ///< pixels: negative the em square, positive a line, 0 the default
    bool bold = false;
    bool italic = false;
    bool underline = false;
    bool strike_out = false;
};

/// Pen of the plain drawing. Styles: 0 solid, 1 dash, 2 dot, 3 dash dot, 4 dash dot dot, 5 none,
/// 6 solid inside the frame; others are solid. Modes combine pen and pixel: 0 black, 1 white,
/// 2 none, 3 not, 4 copy, 5 not copy, 6 merge pen not, 7 mask pen not, 8 merge not pen, 9 mask not
/// pen, 10 merge, 11 not merge, 12 mask, 13 not mask, 14 xor, 15 not xor.
struct TPlainPen {
    TColor color = 0;
    std::int32_t width = 1;
    std::uint8_t style = 0;
    std::uint8_t mode = 4;
};

/// Brush of the plain drawing. Styles: 0 solid, 1 none, 2 horizontal, 3 vertical, 4 falling,
/// 5 rising lines, 6 crossed, 7 diagonally crossed lines.
struct TPlainBrush {
    TColor color = 0xFFFFFF;
    std::uint8_t style = 0;
};

/// Place of a text in its rectangle.
enum TTextPlace : std::uint8_t { tpNear, tpCenter, tpFar };
struct TPlainTextLayout {
    TTextPlace horizontal = tpNear;
    TTextPlace vertical = tpNear;
    bool is_wrapped = false;  ///< breaks lines at words; otherwise one line, line ends as blanks
};

/// The plain drawing: whole pixels, no coverage, no transparency; a fourth byte that it writes
/// to becomes 0. Rectangles are right and bottom exclusive. Alone of what is made over a target
/// its destruction may come later than that of the target's section.
class TPlatformCanvas {
public:
    virtual ~TPlatformCanvas() = default;

    /// The current position; lines run from it to a point, which is left out, and move it.
    virtual void MoveTo(std::int32_t x, std::int32_t y) = 0;
    virtual void LineTo(const TPlainPen& pen, std::int32_t x, std::int32_t y) = 0;
    virtual void Polyline(const TPlainPen& pen, std::span<const TPoint> points) = 0;
    /// Closed; the inside by the even-odd rule.
    virtual void Polygon(const TPlainPen& pen, const TPlainBrush& brush,
                         std::span<const TPoint> points) = 0;
    /// Without an outline.
    virtual void FillRect(const TPlainBrush& brush, const TRect& rect) = 0;
    /// Outline within the rectangle, and its inside. Corners in any order.
    virtual void Rectangle(const TPlainPen& pen, const TPlainBrush& brush, const TRect& rect) = 0;
    virtual void Ellipse(const TPlainPen& pen, const TPlainBrush& brush, const TRect& rect) = 0;
    /// Corners are quarters of an ellipse of the given size.
    virtual void RoundRect(const TPlainPen& pen, const TPlainBrush& brush, const TRect& rect,
                           std::int32_t corner_width, std::int32_t corner_height) = 0;
    /// The part of an ellipse counter-clockwise from the ray through `start` to that through
    /// `end`; the same ray twice means all of it.
    virtual void Pie(const TPlainPen& pen, const TPlainBrush& brush, const TRect& rect,
                     TPoint start, TPoint end) = 0;
    virtual void Arc(const TPlainPen& pen, const TRect& rect, TPoint start, TPoint end) = 0;

    /// Moves the origin of this class's coordinates. Does not reach the vector graphics.
    virtual void OffsetViewportOrg(std::int32_t dx, std::int32_t dy) = 0;
    /// Pushes origin and current position / brings back those of the last push.
    virtual void SaveState() = 0;
    virtual void RestoreState() = 0;

    /// Size of a text on one line, without the parts of glyphs that hang over.
    virtual TPoint TextExtent(std::u16string_view text, const TDrawFont& font) = 0;
    /// A line from its top left corner; fills its box first unless `background` is nil. With
    /// `clip` nothing outside it is drawn, and the background fills all of it.
    virtual void TextOut(std::int32_t x, std::int32_t y, std::u16string_view text,
                         const TDrawFont& font, TColor color, const TColor* background,
                         const TRect* clip) = 0;
    /// A text within a rectangle, clipped to it, no background.
    virtual void TextInRect(const TRect& rect, std::u16string_view text, const TDrawFont& font,
                            TColor color, const TPlainTextLayout& layout) = 0;

    /// The system's device context; nil where it has none.
    virtual void* DeviceContext() const = 0;
};

/// Nil where the system cannot draw on such a target.
std::unique_ptr<TPlatformCanvas> CreatePlatformCanvas(const TDrawTarget& target);

// The vector library.

/// Whether BindVectorGraphics may load the library, or only counts.
enum class TLibraryLoading : std::uint8_t { kAllowed, kForbidden };
enum class TUnbinding : std::uint8_t { kCounted, kForced };

/// Under the binding's lock: adds 1 to its count, then, when the library is not loaded and may
/// be, loads it with all entry points and starts it; one that does not start is unloaded at once.
/// True when the library is loaded afterwards. To be paired with Unbind in either case.
bool BindVectorGraphics(TLibraryLoading loading);
/// Does nothing at a count of 0 or less, unless forced. Otherwise takes 1 off, and at 0 shuts the
/// library down and frees it when this code lies in a library itself. A system whose drawing
/// library cannot be unloaded keeps it.
void UnbindVectorGraphics(TUnbinding unbinding);
bool IsVectorGraphicsBound();

/// Dash: 0 solid, 1 dash (3 on, 1 off), 2 dot (1, 1), 3 dash dot (3, 1, 1, 1), 4 dash dot dot
/// (3, 1, 1, 1, 1, 1), in widths of the pen; others are solid. Join: 0 miter (beyond 10 half
/// widths cut there), 1 bevel, 2 round, 3 miter (beyond that a bevel). Widths are pixels of the
/// target, whatever the world transform, and at least 1.
struct TVectorPenRecord {
    TArgb color = 0;
    float width = 1;
    std::uint8_t dash = 0;
    std::uint8_t join = 0;
};

enum TVectorBrushKind : std::uint8_t { vbSolid, vbHatch, vbLinear };

/// Hatches (tiles of 8 by 8 pixels): 0 horizontal, 1 vertical, 2 falling, 3 rising, 4 crossed,
/// 5 diagonally crossed lines of `color` on `back_color`. Linear: from `color` at point 1 to
/// `back_color` at point 2, mirrored over and over beyond them; equal points are a failure.
struct TVectorBrushRecord {
    TVectorBrushKind kind = vbSolid;
    TArgb color = 0;
    TArgb back_color = 0;
    std::uint8_t hatch = 0;
    TDrawPoint point1;
    TDrawPoint point2;
};

class TVectorPen {
public:
    virtual ~TVectorPen() = default;
};
class TVectorBrush {
public:
    virtual ~TVectorBrush() = default;
};
/// Nil when the library is not bound or refuses. They go before the library is unbound.
std::unique_ptr<TVectorPen> CreateVectorPen(const TVectorPenRecord& record);
std::unique_ptr<TVectorBrush> CreateVectorBrush(const TVectorBrushRecord& record);

/// Parts of a path in their order. A part that begins elsewhere than the last one ended is
/// joined to it by a line.
enum TDrawPathKind : std::uint8_t { pkLine, pkArc, pkStartFigure, pkCloseFigure };
struct TDrawPathPart {
    TDrawPathKind kind = pkLine;
    TDrawPoint from;  ///< pkLine
    TDrawPoint to;
    TDrawRect bounds;  ///< pkArc: of the whole ellipse
    float start_angle = 0;
    float sweep_angle = 0;
};
using TDrawPath = std::vector<TDrawPathPart>;

/// x' = m11 x + m21 y + dx, y' = m12 x + m22 y + dy.
struct TDrawMatrix {
    float m11 = 1;
    float m12 = 0;
    float m21 = 0;
    float m22 = 1;
    float dx = 0;
    float dy = 0;
};

struct TDrawMetafileHeader {
    std::int32_t type = 0;  ///< 0 none, 1 WMF, 2 placeable WMF, 3 EMF, 4 EMF+ alone, 5 EMF+ dual
    std::uint32_t size_bytes = 0;
    std::uint32_t version = 0;
    float dpi_x = 0;
    float dpi_y = 0;
    std::int32_t x = 0;  ///< bounds, pixels at dpi_x, dpi_y
    std::int32_t y = 0;
    std::int32_t width = 0;
    std::int32_t height = 0;
    TRect frame;  ///< hundredths of a millimetre; zero where the file tells none
};

class TDrawMetafile {
public:
    virtual ~TDrawMetafile() = default;
    virtual TDrawMetafileHeader Header() const = 0;
};
/// The bytes of a metafile's file or of the memory form. Nil for other bytes, without the library,
/// and for kinds that the system cannot play: Linux plays the enhanced ones' plain records alone.
std::unique_ptr<TDrawMetafile> CreateMetafile(std::span<const std::uint8_t> bytes);

/// How text is laid out. Typographic: the font's own metrics, nothing around them; in a limited
/// height there are only the lines that fit whole, none where the first does not; nothing is
/// clipped. Otherwise: room around the text, glyphs fitted to pixels, and, where both sides are
/// limited and no clipping is set, clipped to them with the last line cut through.
struct TTextFormat {
    bool is_typographic = true;
};

/// Drawing on one target. Fills cover the squares of pixels from whole coordinate to whole
/// coordinate: a rectangle at 0 of width 9 is pixels 0 to 8. Pens run through the middles of
/// pixels: a line of width 1 along y = 5 is row 5. Coverage goes to the alpha byte of 32-bit
/// targets by the rule of one picture over another. Calls return false on failure.
class TVectorGraphics {
public:
    virtual ~TVectorGraphics() = default;

    // Modes. Values out of range change nothing and return false.
    /// 0 default, 1 fast, 2 best, 3 none, 4 antialias; 0, 1 and 3 draw without coverage.
    virtual bool SetSmoothingMode(std::int32_t mode) = 0;
    /// 0 the system's choice, 1 and 2 single bit, 3 and 4 antialias, 5 for flat screens; odd ones
    /// and 5 fitted to pixels.
    virtual bool SetTextRenderingHint(std::int32_t hint) = 0;
    /// 0 default, 1 low, 2 high quality, 3 bilinear, 4 bicubic, 5 nearest, 6 and 7 high quality
    /// bilinear and bicubic.
    virtual bool SetInterpolationMode(std::int32_t mode) = 0;
    /// 0 over, 1 copy: the colour with its alpha replaces what is there.
    virtual bool SetCompositingMode(std::int32_t mode) = 0;
    /// 0 default, 1 fast, 2 high quality, 3 gamma corrected, 4 linear.
    virtual bool SetCompositingQuality(std::int32_t quality) = 0;

    // Lines.
    virtual bool DrawLine(const TVectorPen& pen, TDrawPoint from, TDrawPoint to) = 0;
    virtual bool DrawLines(const TVectorPen& pen, std::span<const TDrawPoint> points) = 0;
    virtual bool DrawPath(const TVectorPen& pen, const TDrawPath& path) = 0;
    virtual bool DrawRectangle(const TVectorPen& pen, const TDrawRect& rect) = 0;
    virtual bool DrawEllipse(const TVectorPen& pen, const TDrawRect& rect) = 0;
    virtual bool DrawPolygon(const TVectorPen& pen, std::span<const TDrawPoint> points) = 0;
    virtual bool DrawPie(const TVectorPen& pen, const TDrawRect& rect, float start_angle,
                         float sweep_angle) = 0;
    virtual bool DrawArc(const TVectorPen& pen, const TDrawRect& rect, float start_angle,
                         float sweep_angle) = 0;

    // Fills; paths and polygons by the even-odd rule, open figures closed.
    virtual bool FillPath(const TVectorBrush& brush, const TDrawPath& path) = 0;
    virtual bool FillRectangle(const TVectorBrush& brush, const TDrawRect& rect) = 0;
    virtual bool FillEllipse(const TVectorBrush& brush, const TDrawRect& rect) = 0;
    virtual bool FillPolygon(const TVectorBrush& brush, std::span<const TDrawPoint> points) = 0;
    virtual bool FillPie(const TVectorBrush& brush, const TDrawRect& rect, float start_angle,
                         float sweep_angle) = 0;

    // World transform: each step acts on points before those that were there.
    virtual bool RotateTransform(float angle) = 0;
    virtual bool TranslateTransform(float dx, float dy) = 0;
    virtual bool ScaleTransform(float sx, float sy) = 0;
    virtual bool ResetTransform() = 0;
    virtual bool SetTransform(const TDrawMatrix& matrix) = 0;
    virtual TDrawMatrix GetTransform() const = 0;

    /// Replaces the clipping by a rectangle, under the world transform of this moment.
    virtual bool SetClipRect(const TDrawRect& rect) = 0;
    virtual bool ResetClip() = 0;

    /// Stretches a metafile over a rectangle.
    virtual bool DrawMetafile(const TDrawMetafile& metafile, const TDrawRect& rect) = 0;
    /// When this returns the pixels are in the section.
    virtual bool Flush() = 0;

    // Text, UTF-16; unpaired surrogates show as U+FFFD, U+0000 ends it. Lines end at CR LF, CR or
    // LF. A layout width of 0 or less sets no limit; otherwise lines break at words, and within
    // words that are wider. A layout height of 0 or less sets no limit either.
    /// Size of the laid out text; nothing on failure.
    virtual std::optional<TDrawSize> MeasureString(std::u16string_view text, const TDrawFont& font,
                                                   TTextFormat format, const TDrawRect& layout) = 0;
    virtual bool DrawString(std::u16string_view text, const TDrawFont& font, TTextFormat format,
                            const TDrawRect& layout, TArgb color) = 0;

    /// Holds all pixels that were drawn on since creation (right and bottom exclusive); all of the
    /// target where that is not known.
    virtual TRect TouchedRect() const = 0;
};

/// Nil when the library is not bound or cannot draw on such a target.
std::unique_ptr<TVectorGraphics> CreateVectorGraphics(const TDrawTarget& target);

}  // namespace zm::platform
