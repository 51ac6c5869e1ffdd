#include <algorithm>
#include <array>

#include "engine/foundation/zmnumbers.h"
#include "engine/platform/win32/drawing_graphics_p.h"

// Underlines and strike-outs, which some releases of the library leave out of pictures.
namespace zm::platform {
namespace {

constexpr INT kProbeSide = 32;

/// Pixels with ink of one letter in a style.
std::ptrdiff_t InkOf(const TGdiPlusEntries& entries, INT style) {
    std::array<std::uint32_t, kProbeSide * kProbeSide> pixels{};
    TGdiPlusImageOf<Gdiplus::GpBitmap> picture;
    TGdiPlusGraphics graphics;
    TGdiPlusFamily family;
    TGdiPlusFont font;
    TGdiPlusBrushOf<Gdiplus::GpSolidFill> brush;
    const Gdiplus::RectF place(4, 4, 0, 0);
    const bool is_drawn =
        IsDone(entries.GdipCreateBitmapFromScan0(
            kProbeSide, kProbeSide, kProbeSide * 4, PixelFormat32bppARGB,
            reinterpret_cast<BYTE*>(pixels.data()), picture.Receive())) &&
        IsDone(entries.GdipGetImageGraphicsContext(picture.Get(), graphics.Receive())) &&
        IsDone(entries.GdipGetGenericFontFamilySansSerif(family.Receive())) &&
        IsDone(entries.GdipCreateFont(family.Get(), kProbeSide / 2, style, Gdiplus::UnitPixel,
                                      font.Receive())) &&
        IsDone(entries.GdipCreateSolidFill(0xFF000000, brush.Receive())) &&
        IsDone(entries.GdipDrawString(graphics.Get(), L"i", 1, font.Get(), &place, nullptr,
                                      brush.Get())) &&
        IsDone(entries.GdipFlush(graphics.Get(), Gdiplus::FlushIntentionSync));
    graphics.Reset();
    return is_drawn ? std::count_if(pixels.begin(), pixels.end(),
                                    [](std::uint32_t pixel) { return pixel != 0; })
                    : 0;
}

}  // namespace

bool LibraryDrawsTextLines() {
    static const bool draws_lines = [] {
        const TGdiPlusEntries* entries = GdiPlus();
        return entries == nullptr || InkOf(*entries, Gdiplus::FontStyleUnderline) >
                                         InkOf(*entries, Gdiplus::FontStyleRegular);
    }();
    return draws_lines;
}

/// A bar along a line of text, on whole pixels.
bool TGdiPlusDrawing::DrawBar(Gdiplus::GpBrush* brush, float left, float width, double top,
                              double thickness) {
    const auto y = static_cast<float>(RoundHalfEven(top));
    const auto height = static_cast<float>(std::max(RoundHalfEven(thickness), 1));
    return Call<&TGdiPlusEntries::GdipSetPixelOffsetMode>(Gdiplus::PixelOffsetModeHalf) &&
           Call<&TGdiPlusEntries::GdipFillRectangle>(brush, left, y, width, height) &&
           Call<&TGdiPlusEntries::GdipSetPixelOffsetMode>(Gdiplus::PixelOffsetModeNone);
}

/// Draws the bars of a piece, which is laid out once more line by line for their lengths.
bool TGdiPlusDrawing::DrawTextLines(const TTextPiece& piece, const Gdiplus::GpStringFormat* format,
                                    TArgb color) {
    const TGdiPlusEntries* entries = GdiPlus();
    TGdiPlusBrushOf<Gdiplus::GpSolidFill> brush;
    TTextPiece line;
    if (entries == nullptr || !IsDone(entries->GdipCreateSolidFill(color, brush.Receive())) ||
        !MeasurePiece(u"x", {}, format, line)) {
        return false;
    }
    const float line_height = line.size.height;
    constexpr float kSlack = 0.01F;
    Gdiplus::RectF rect(piece.rect.X, piece.rect.Y, piece.rect.Width, line_height + kSlack);
    std::u16string_view text = piece.text;
    for (INT count = 0; count < piece.lines && !text.empty(); ++count) {
        const std::size_t length = std::min(text.find(u'\n'), text.size());
        if (!MeasurePiece(text.substr(0, length), rect, format, line) ||
            (length > 0 && line.fitted <= 0)) {
            return false;
        }
        const double baseline = rect.Y + font_lines_.ascent;
        if (font_traits_.underline &&
            !DrawBar(brush.Get(), rect.X, line.size.width, baseline - font_lines_.underline,
                     font_lines_.underline_size)) {
            return false;
        }
        if (font_traits_.strike_out &&
            !DrawBar(brush.Get(), rect.X, line.size.width, baseline - font_lines_.strike_out,
                     font_lines_.strike_out_size)) {
            return false;
        }
        const auto fitted = static_cast<std::size_t>(std::max(line.fitted, 0));
        text.remove_prefix(std::min(fitted, length));
        const bool ends_here = fitted >= length && !text.empty();
        text.remove_prefix(ends_here ? 1 : std::min(text.find_first_not_of(u' '), text.size()));
        rect.Y += line_height;
    }
    return true;
}

}  // namespace zm::platform
