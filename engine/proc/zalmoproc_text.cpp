/// Text on the attached bitmap.

#include <algorithm>
#include <cmath>
#include <cstdlib>
#include <memory>
#include <numbers>

#include "engine/canvas/zmgdiplus.h"
#include "engine/foundation/zmnumbers.h"
#include "engine/proc/zalmoproc.h"

namespace zm {

/// What the overloads of TextOut ask for.
struct TZmTextRequest {
    std::int32_t x = 0;
    std::int32_t y = 0;
    const std::u16string& text;
    TFont font;
    std::int32_t angle = 0;
    bool has_rect = false;
    std::int32_t rect_width = 0;
    std::int32_t rect_height = 0;
    bool anti_alias = true;
    bool auto_enlarge = false;
};

namespace {

constexpr std::int32_t kMarginDivisor = 20;
constexpr std::int32_t kFullTurn = 360;
constexpr std::int32_t kOpaque = 255;
/// Room for glyphs that reach beyond their text's box, in parts of the font's height, and more
/// for small fonts. Half of it has to stay clear.
constexpr std::int32_t kSlackDivisor = 2;
constexpr std::int64_t kSmallestSlack = 16;
constexpr std::int64_t kSlackGrowth = 4;

/// A rectangle in 64 bits, right and bottom exclusive, for positions anywhere.
struct TWideRect {
    std::int64_t left = 0;
    std::int64_t top = 0;
    std::int64_t right = 0;
    std::int64_t bottom = 0;
};

double Radians(std::int32_t angle) {
    return -static_cast<double>(angle) * std::numbers::pi / (kFullTurn / 2);
}

/// The angle that the canvas, which turns clockwise, draws with; full turns are left out, so that
/// no angle is too large to be negated.
std::int32_t CanvasAngle(std::int32_t angle) {
    return -(angle % kFullTurn);
}

/// Size of a text, of its turned box when there is an angle.
TPoint TurnedSize(TPoint size, std::int32_t angle) {
    if (angle == 0) {
        return size;
    }
    const double cosine = std::abs(std::cos(Radians(angle)));
    const double sine = std::abs(std::sin(Radians(angle)));
    return {TruncToInt(cosine * size.x + sine * size.y),
            TruncToInt(sine * size.x + cosine * size.y)};
}

/// A coordinate of one axis, keywords resolved against the image's and the text's size.
std::int32_t ResolvePosition(std::int32_t value, std::int32_t image_size, std::int32_t text_size) {
    const std::int32_t margin = image_size / kMarginDivisor;
    switch (value) {
        case TextPosMargin: return margin;
        case TextPosCenter: return (image_size - text_size) / 2;
        case TextPosFarMargin: return image_size - text_size - margin;
        case TextPosEnd: return image_size - text_size;
        default: return value;
    }
}

/// A colour as the value that fills a bitmap with it (see Fill).
double FillValueOf(TZmBitmap& bitmap, TColor color) {
    const TZmPixelFormat format = bitmap.GetPixelFormat();
    TZmBitmap pixel(1, 1, format);
    if (format == zm8p) {
        bitmap.CopyPaletteTo(&pixel);
    }
    pixel.SetPixels(0, 0, RGBFromColor(color));
    switch (format) {
        case zm1g: return pixel.GetPixels_zm1g(0, 0) ? 1 : 0;
        case zm8p:
        case zm8g: return pixel.GetPixels_zm8(0, 0);
        case zm16g: return pixel.GetPixels_zm16g(0, 0);
        default: return color;
    }
}

void EnlargeFor(TZmBitmap& bitmap, TPoint size, TColor background) {
    const std::int32_t width = std::max(bitmap.GetWidth(), size.x);
    const std::int32_t height = std::max(bitmap.GetHeight(), size.y);
    if (width == bitmap.GetWidth() && height == bitmap.GetHeight()) {
        return;
    }
    const std::int32_t alpha = bitmap.HasAlphaChannel() ? bitmap.GetAlpha(0, 0) : kOpaque;
    bitmap.Resize(width, height, FillValueOf(bitmap, background), alpha, zmhLeft, zmvTop);
}

/// What the text's layout covers: the rectangle around a box turned about its corner, or the
/// rectangle that the text is wrapped in.
TWideRect LayoutBounds(const TZmTextRequest& request, TPoint text_size) {
    const bool is_limited = request.has_rect && request.rect_width > 0 && request.rect_height > 0;
    const double width = is_limited ? request.rect_width : text_size.x;
    const double height = is_limited ? request.rect_height : text_size.y;
    // Turned text in a rectangle is clipped to it.
    const double turn = is_limited ? 0 : Radians(request.angle);
    const double across_x = std::cos(turn) * width;
    const double across_y = std::sin(turn) * width;
    const double down_x = -std::sin(turn) * height;
    const double down_y = std::cos(turn) * height;
    const auto [min_x, max_x] = std::minmax({0.0, across_x, down_x, across_x + down_x});
    const auto [min_y, max_y] = std::minmax({0.0, across_y, down_y, across_y + down_y});
    return {request.x + std::int64_t{TruncToInt(std::floor(min_x))},
            request.y + std::int64_t{TruncToInt(std::floor(min_y))},
            request.x + std::int64_t{TruncToInt(std::ceil(max_x))},
            request.y + std::int64_t{TruncToInt(std::ceil(max_y))}};
}

/// The part of a rectangle, grown at all sides, that lies in an image; empty when none does.
TRect GrownWithin(const TWideRect& rect, std::int64_t slack, std::int32_t width,
                  std::int32_t height) {
    const auto limit = [](std::int64_t value, std::int32_t size) {
        return static_cast<std::int32_t>(std::clamp<std::int64_t>(value, 0, size));
    };
    return {limit(rect.left - slack, width), limit(rect.top - slack, height),
            limit(rect.right + slack, width), limit(rect.bottom + slack, height)};
}

bool IsClear(TZmBitmap& region, const TRect& part) {
    for (std::int32_t y = part.top; y < part.bottom; ++y) {
        for (std::int32_t x = part.left; x < part.right; ++x) {
            if (region.GetPixels_zm32RGB(x, y).a != 0) {
                return false;
            }
        }
    }
    return true;
}

/// Whether a drawn region of an image has a clear band at the sides where the image goes on.
bool HasClearBand(TZmBitmap& region, const TRect& place, TZmBitmap& image, std::int64_t slack) {
    const std::int32_t width = region.GetWidth();
    const std::int32_t height = region.GetHeight();
    const auto band_x = static_cast<std::int32_t>(std::min<std::int64_t>(slack / 2, width));
    const auto band_y = static_cast<std::int32_t>(std::min<std::int64_t>(slack / 2, height));
    return (place.left == 0 || IsClear(region, {0, 0, band_x, height})) &&
           (place.top == 0 || IsClear(region, {0, 0, width, band_y})) &&
           (place.right == image.GetWidth() ||
            IsClear(region, {width - band_x, 0, width, height})) &&
           (place.bottom == image.GetHeight() ||
            IsClear(region, {0, height - band_y, width, height}));
}

void DrawOn(TZmCanvas& canvas, const TZmTextRequest& request, const TRect& place) {
    if (!request.anti_alias) {
        canvas.SetTextRendering(zmtrTextRenderingHintSingleBitPerPixel);
    }
    canvas.GetBrush().SetColor(request.font.Color);
    canvas.GetFont() = request.font;
    const std::int64_t left = std::int64_t{request.x} - place.left;
    const std::int64_t top = std::int64_t{request.y} - place.top;
    const std::int32_t angle = CanvasAngle(request.angle);
    if (request.has_rect) {
        const TRect rect{SaturateToInt32(left), SaturateToInt32(top),
                         SaturateToInt32(left + request.rect_width),
                         SaturateToInt32(top + request.rect_height)};
        canvas.DrawText(request.text, rect, angle);
    } else {
        canvas.DrawText(request.text, SaturateToInt32(left), SaturateToInt32(top), angle);
    }
    canvas.Flush();
}

/// Draws within a rectangle of the image. False when the text may go on outside of it; the image
/// is then as it was.
bool DrawWithin(TZmBitmap& image, const TZmTextRequest& request, const TRect& place,
                std::int64_t slack) {
    const auto canvas = image.CreateROICanvas(place, request.anti_alias, /*UseGDIPlus=*/true,
                                              /*PerformAlphaCompositing=*/request.anti_alias);
    if (canvas == nullptr) {
        return true;  // no room: nothing is drawn
    }
    DrawOn(*canvas, request, place);
    TZmBitmap& region = *canvas->GetROIBitmap();
    if (!request.anti_alias || HasClearBand(region, place, image, slack)) {
        return true;
    }
    region.Fill(TRGBA{});
    return false;
}

/// The region is the whole image in effect. As a transparent one it is cut to where the text is,
/// so that a line costs the same on an image of any size: marks may be stacked beyond any box, so
/// the cut counts only with a clear band around the text; otherwise a larger region is tried.
void DrawRequest(TZmBitmap& image, const TZmTextRequest& request, TPoint text_size) {
    const TRect whole{0, 0, image.GetWidth(), image.GetHeight()};
    if (!request.anti_alias) {
        DrawWithin(image, request, whole, 0);
        return;
    }
    const TWideRect bounds = LayoutBounds(request, text_size);
    std::int64_t slack =
        kSmallestSlack + std::abs(std::int64_t{request.font.Height}) / kSlackDivisor;
    TRect place = GrownWithin(bounds, slack, whole.right, whole.bottom);
    while (place.left < place.right && place.top < place.bottom &&
           !DrawWithin(image, request, place, slack)) {
        slack *= kSlackGrowth;
        place = GrownWithin(bounds, slack, whole.right, whole.bottom);
    }
}

/// Gives a font its colour back when it goes.
class TFontColorKeeper {
public:
    explicit TFontColorKeeper(TFont& font) : font_(font), color_(font.Color) {}
    ~TFontColorKeeper() { font_.Color = color_; }
    TFontColorKeeper(const TFontColorKeeper&) = delete;
    TFontColorKeeper& operator=(const TFontColorKeeper&) = delete;

private:
    TFont& font_;
    TColor color_;
};

}  // namespace

void TZalmoProc::DrawTextRequest(TZmTextRequest& request) {
    std::int32_t x1 = 0;
    std::int32_t y1 = 0;
    std::int32_t x2 = 0;
    std::int32_t y2 = 0;
    TZmBitmap* image = nullptr;
    if (!BeginImageProcessing(TZmPixelFormatSet(), x1, y1, x2, y2, OperationCaption(kOperationText),
                              image, kOperationText) ||
        image->IsEmpty()) {
        return;
    }
    {
        // Required: the font is that of the platform canvas, which lies on a platform bitmap: the
        // image moves to one, and the formats that none has raise. Where there is no room for one
        // the image stays, and takes the text all the same.
        image->GetCanvas();
        const TFontColorKeeper keeper(image->GetCanvasFont());
        image->GetCanvasFont() = request.font;
        TZmEmptyCanvas measuring;
        measuring.GetFont() = request.font;
        const TPoint text_size = measuring.MeasureText(request.text);
        const TPoint box = TurnedSize(text_size, request.angle);
        if (request.auto_enlarge) {
            EnlargeFor(*image, box, fBackground);
        }
        request.x = ResolvePosition(request.x, image->GetWidth(), box.x);
        request.y = ResolvePosition(request.y, image->GetHeight(), box.y);
        DrawRequest(*image, request, text_size);
    }
    EndImageProcessing(image);
    if (fOnFinishWork) {
        fOnFinishWork(this);
    }
}

/// The canvas font with what a caller asks for.
TFont TZalmoProc::NamedFont(const std::u16string& name, std::int32_t size, TColor color,
                            TFontStyles style) const {
    TFont font = fZmBitmap == nullptr ? TFont{} : fZmBitmap->GetCanvasFont();
    if (!name.empty()) {
        font.Name = name;
    }
    if (size > 0) {
        font.SetSize(size);
    }
    font.Color = color;
    font.Style = style;
    return font;
}

void TZalmoProc::TextOut(std::int32_t X, std::int32_t Y, const std::u16string& Text,
                         const TFont& AFont, std::int32_t Angle, bool bAntiAlias,
                         bool bAutoEnlarge) {
    TZmTextRequest request{X, Y, Text, AFont, Angle, false, 0, 0, bAntiAlias, bAutoEnlarge};
    DrawTextRequest(request);
}

void TZalmoProc::TextOut(std::int32_t X, std::int32_t Y, const std::u16string& Text,
                         const std::u16string& sFontName, std::int32_t iFontSize, TColor cFontColor,
                         TFontStyles Style, std::int32_t Angle, bool bAntiAlias,
                         bool bAutoEnlarge) {
    TextOut(X, Y, Text, NamedFont(sFontName, iFontSize, cFontColor, Style), Angle, bAntiAlias,
            bAutoEnlarge);
}

// Required: the corner passes the same way as a position, so that a keyword's value in it counts
// as that keyword.
void TZalmoProc::TextOut(const TRect& Rect, const std::u16string& Text, const TFont& AFont,
                         std::int32_t Angle) {
    TZmTextRequest request{Rect.left, Rect.top, Text, AFont, Angle, true};
    request.rect_width = SaturateToInt32(std::int64_t{Rect.right} - Rect.left);
    request.rect_height = SaturateToInt32(std::int64_t{Rect.bottom} - Rect.top);
    DrawTextRequest(request);
}

void TZalmoProc::TextOut(const TRect& Rect, const std::u16string& Text,
                         const std::u16string& sFontName, std::int32_t iFontSize, TColor cFontColor,
                         TFontStyles Style, std::int32_t Angle) {
    TextOut(Rect, Text, NamedFont(sFontName, iFontSize, cFontColor, Style), Angle);
}

}  // namespace zm
