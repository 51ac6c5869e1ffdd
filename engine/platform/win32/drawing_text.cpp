#include <algorithm>
#include <cmath>
#include <limits>

#include "engine/foundation/zmnumbers.h"
#include "engine/platform/win32/drawing_fonts_p.h"
#include "engine/platform/win32/drawing_graphics_p.h"

// Text of the vector graphics.
namespace zm::platform {
namespace {

/// The most that is laid out: longer than any text that a picture shows, and what the library
/// copes with in 32 bits of address space.
constexpr std::size_t kMaxTextUnits = 1 << 22;
/// Lengths of the pieces in which lines are broken.
constexpr std::size_t kFirstPieceUnits = 256;
constexpr std::size_t kMinPieceUnits = 64;
constexpr INT kManyLines = 16;
/// A line this short is handed to the library whole, seen or not.
constexpr std::size_t kShortLineUnits = 1024;
/// Coverage from which a pixel counts as covered where text knows no halves.
constexpr std::uint32_t kHalfCoverage = 0x80;
constexpr char16_t kReplacement = u'\uFFFD';

bool IsHighSurrogate(char16_t unit) {
    return (unit & 0xFC00) == 0xD800;
}

bool IsLowSurrogate(char16_t unit) {
    return (unit & 0xFC00) == 0xDC00;
}

/// The text as the library takes it: up to a U+0000, whole characters, lines ended by LF alone.
std::u16string PreparedText(std::u16string_view text) {
    std::u16string prepared;
    prepared.reserve(std::min(text.size(), kMaxTextUnits));
    for (std::size_t index = 0; index < text.size() && text[index] != u'\0'; ++index) {
        const char16_t unit = text[index];
        const char16_t next = index + 1 < text.size() ? text[index + 1] : u'\0';
        if (prepared.size() + 2 > kMaxTextUnits) {
            break;
        }
        if (IsHighSurrogate(unit) && IsLowSurrogate(next)) {
            prepared += {unit, next};
            ++index;
        } else if (IsHighSurrogate(unit) || IsLowSurrogate(unit)) {
            prepared += kReplacement;
        } else if (unit == u'\r') {
            prepared += u'\n';
            index += next == u'\n' ? 1 : 0;
        } else {
            prepared += unit;
        }
    }
    return prepared;
}

constexpr double kEndless = std::numeric_limits<double>::infinity();

bool SameTraits(const TDrawFont& a, const TDrawFont& b) {
    return a.family == b.family && a.height == b.height && a.bold == b.bold &&
           a.italic == b.italic && a.underline == b.underline && a.strike_out == b.strike_out;
}

/// The font that the system has selected for the description, as the library sees it.
bool TakeFontOfContext(const TGdiPlusEntries& entries, HDC context, const TDrawFont& traits,
                       TGdiPlusFont& font, TFontLines& lines) {
    const TSelectedObject selected(context, MakeSystemFont(traits, TFontUse::kVector));
    OUTLINETEXTMETRICW metrics{};
    metrics.otmSize = sizeof(metrics);
    if (::GetOutlineTextMetricsW(context, sizeof(metrics), &metrics) != 0) {
        lines = {static_cast<double>(metrics.otmTextMetrics.tmAscent),
                 static_cast<double>(metrics.otmsUnderscorePosition),
                 static_cast<double>(metrics.otmsUnderscoreSize),
                 static_cast<double>(metrics.otmsStrikeoutPosition),
                 static_cast<double>(metrics.otmsStrikeoutSize)};
    }
    return selected.IsSelected() && IsDone(entries.GdipCreateFontFromDC(context, font.Receive()));
}

INT StyleOf(const TDrawFont& traits) {
    return (traits.bold ? Gdiplus::FontStyleBold : 0) |
           (traits.italic ? Gdiplus::FontStyleItalic : 0) |
           (traits.underline ? Gdiplus::FontStyleUnderline : 0) |
           (traits.strike_out ? Gdiplus::FontStyleStrikeout : 0);
}

/// Where the system chose a font without outlines the library refuses it.
bool TakeGenericFont(const TGdiPlusEntries& entries, const TDrawFont& traits, TGdiPlusFont& font) {
    constexpr double kDefaultHeight = 16;
    constexpr double kMaxHeight = 8192;
    const double height =
        traits.height == 0 ? kDefaultHeight : std::abs(static_cast<double>(traits.height));
    TGdiPlusFamily family;
    return IsDone(entries.GdipGetGenericFontFamilySansSerif(family.Receive())) &&
           IsDone(entries.GdipCreateFont(family.Get(),
                                         static_cast<float>(std::min(height, kMaxHeight)),
                                         StyleOf(traits), Gdiplus::UnitPixel, font.Receive()));
}

bool MakeFormat(TTextFormat format, TGdiPlusFormat& native) {
    const TGdiPlusEntries* entries = GdiPlus();
    if (entries == nullptr) {
        return false;
    }
    return IsDone(format.is_typographic
                      ? entries->GdipStringFormatGetGenericTypographic(native.Receive())
                      : entries->GdipCreateStringFormat(0, 0, native.Receive()));
}

/// The layout's rectangle, 0 for no limit; nothing where it is no place.
std::optional<Gdiplus::RectF> NativeLayout(const TDrawRect& layout) {
    if (!std::isfinite(layout.x) || !std::isfinite(layout.y) || !std::isfinite(layout.width) ||
        !std::isfinite(layout.height)) {
        return std::nullopt;
    }
    return Gdiplus::RectF(layout.x, layout.y, std::max(layout.width, 0.0F),
                          std::max(layout.height, 0.0F));
}

const wchar_t* NativeText(std::u16string_view text) {
    return reinterpret_cast<const wchar_t*>(text.data());
}

/// Where the next piece begins: past the blanks that a broken line swallows.
std::size_t SkipBlanks(std::u16string_view line, std::size_t place) {
    return std::min(line.find_first_not_of(u' ', place), line.size());
}

/// The first units of a line; characters of two stay whole.
std::u16string_view StartOf(std::u16string_view line, std::size_t units) {
    std::u16string_view piece = line.substr(0, units);
    if (piece.size() < line.size() && IsHighSurrogate(piece.back())) {
        piece.remove_suffix(1);
    }
    return piece;
}

}  // namespace

bool TGdiPlusDrawing::PrepareFont(const TDrawFont& font) {
    if (font_.IsSet() && SameTraits(font, font_traits_)) {
        return true;
    }
    const TGdiPlusEntries* entries = GdiPlus();
    const auto context = static_cast<HDC>(target_.section->DeviceContext());
    if (entries == nullptr || (!TakeFontOfContext(*entries, context, font, font_, font_lines_) &&
                               !TakeGenericFont(*entries, font, font_))) {
        font_.Reset();
        return false;
    }
    font_traits_ = font;
    return true;
}

bool TGdiPlusDrawing::MeasurePiece(std::u16string_view text, const Gdiplus::RectF& rect,
                                   const Gdiplus::GpStringFormat* format, TTextPiece& piece) {
    Gdiplus::RectF bounds;
    piece.text = text;
    piece.rect = rect;
    if (!Call<&TGdiPlusEntries::GdipMeasureString>(NativeText(text), static_cast<INT>(text.size()),
                                                   font_.Get(), &rect, format, &bounds,
                                                   &piece.fitted, &piece.lines)) {
        return false;
    }
    piece.size = {bounds.Width, bounds.Height};
    return true;
}

/// Cuts a measured piece before its last line, which the text after it may still lengthen. False
/// when there is no such line yet.
bool TGdiPlusDrawing::KeepWholeLines(const Gdiplus::GpStringFormat* format, TTextPiece& piece) {
    const auto lines = static_cast<float>(piece.lines);
    Gdiplus::RectF rect = piece.rect;
    // Short of a line by half: formats differ in whether they show one that is cut off.
    rect.Height = piece.size.height / lines * (lines - 1.5F);
    TTextPiece kept;
    if (piece.lines < 4 || !MeasurePiece(piece.text, rect, format, kept) || kept.fitted <= 0 ||
        static_cast<std::size_t>(kept.fitted) >= piece.text.size()) {
        return false;
    }
    kept.text = piece.text.substr(0, static_cast<std::size_t>(kept.fitted));
    kept.rect = piece.rect;
    piece = kept;
    return true;
}

/// Hands a text to `work` in pieces of whole lines, from the top: in one call the library would
/// look through all of the rest for each line that it breaks.
bool TGdiPlusDrawing::LayOut(std::u16string_view text, Gdiplus::RectF rect,
                             const Gdiplus::GpStringFormat* format, double reach,
                             const TPieceWork& work) {
    TTextPiece piece;
    if (text.size() <= kFirstPieceUnits) {
        return text.empty() || (MeasurePiece(text, rect, format, piece) && work(piece));
    }
    if (!MeasurePiece(u"x", {}, format, piece)) {
        return false;
    }
    TTextLayout layout{rect, rect.Height > 0, rect.Y + reach};
    const TTextPiece empty_line{{}, rect, {0, piece.size.height}, 0, 1};
    // The end of a last line begins another one.
    for (bool has_line = true; has_line && !layout.IsFull();) {
        if (layout.has_floor) {
            // Whether a line cut off by the floor shows is the format's own choice.
            const Gdiplus::RectF rest(0, 0, 0, layout.rect.Height);
            if (!MeasurePiece(u"x", rest, format, piece) || piece.fitted == 0) {
                break;
            }
        }
        const std::size_t length = std::min(text.find(u'\n'), text.size());
        if (length == 0) {
            if (!work(empty_line)) {
                return false;
            }
            layout.MoveDown(empty_line.size.height);
        } else if (!LayOutLine(text.substr(0, length), format, reach, layout, work)) {
            return false;
        }
        has_line = length < text.size();
        text.remove_prefix(has_line ? length + 1 : length);
    }
    return true;
}

/// The same for a text without line ends.
bool TGdiPlusDrawing::LayOutLine(std::u16string_view line, const Gdiplus::GpStringFormat* format,
                                 double reach, TTextLayout& layout, const TPieceWork& work) {
    if (layout.rect.Width <= 0) {
        TTextPiece piece;
        const std::u16string_view seen = SeenPart(line, format, reach);
        if (!MeasurePiece(seen, layout.rect, format, piece) || !work(piece)) {
            return false;
        }
        layout.MoveDown(piece.size.height);
        return true;
    }
    std::size_t units = kFirstPieceUnits;
    while (!line.empty() && !layout.IsFull()) {
        TTextPiece piece;
        if (!MeasurePiece(StartOf(line, units), layout.rect, format, piece)) {
            return false;
        }
        const bool is_full =
            layout.has_floor && static_cast<std::size_t>(piece.fitted) < piece.text.size();
        const bool is_last = is_full || piece.text.size() == line.size();
        if (!is_last && !KeepWholeLines(format, piece)) {
            units *= 4;
            continue;
        }
        if (!work(piece)) {
            return false;
        }
        layout.MoveDown(is_full ? layout.rect.Height : piece.size.height);
        units = piece.lines > kManyLines ? std::max(units / 2, kMinPieceUnits) : units;
        line.remove_prefix(is_last ? line.size() : SkipBlanks(line, piece.text.size()));
    }
    return true;
}

/// The start of a line without what lies farther than `reach`, for the library shapes and renders
/// all that it is given. Lines are taken to run from left to right.
std::u16string_view TGdiPlusDrawing::SeenPart(std::u16string_view line,
                                              const Gdiplus::GpStringFormat* format, double reach) {
    for (std::size_t units = kShortLineUnits; units < line.size() && reach < kEndless; units *= 2) {
        TTextPiece piece;
        const std::u16string_view start = StartOf(line, units);
        if (!MeasurePiece(start, {}, format, piece) ||
            piece.size.width > reach + 2 * piece.size.height) {
            return start;
        }
    }
    return line;
}

std::optional<TDrawSize> TGdiPlusDrawing::MeasureString(std::u16string_view text,
                                                        const TDrawFont& font, TTextFormat format,
                                                        const TDrawRect& layout) {
    TDrawSize size;
    const bool is_measured = SucceedsInMemory([&] {
        const std::u16string prepared = PreparedText(text);
        const auto rect = NativeLayout(layout);
        TGdiPlusFormat native;
        return rect && PrepareFont(font) && MakeFormat(format, native) &&
               LayOut(prepared, *rect, native.Get(), kEndless, [&](const TTextPiece& piece) {
                   size.width = std::max(size.width, piece.size.width);
                   size.height += piece.size.height;
                   return true;
               });
    });
    return is_measured ? std::optional(size) : std::nullopt;
}

bool TGdiPlusDrawing::DrawString(std::u16string_view text, const TDrawFont& font,
                                 TTextFormat format, const TDrawRect& layout, TArgb color) {
    return SucceedsInMemory([&] {
        const std::u16string prepared = PreparedText(text);
        const auto rect = NativeLayout(layout);
        TGdiPlusFormat native;
        if (!rect || !PrepareFont(font) || !MakeFormat(format, native)) {
            return false;
        }
        // Not all releases of the library cut what hangs out of the rectangle off.
        const bool is_cut = !format.is_typographic && rect->Width > 0 && rect->Height > 0 &&
                            !has_clip_ && SetClipRect(layout);
        const double reach = ReachFrom({rect->X, rect->Y});
        const auto draw = [&](const TTextPiece& piece) {
            return DrawPiece(piece, native.Get(), color);
        };
        const bool is_drawn = LayOut(prepared, *rect, native.Get(), reach, draw);
        return (!is_cut || ResetClip()) && is_drawn;
    });
}

/// How far the target's farthest corner is from a point, before the world transform.
double TGdiPlusDrawing::ReachFrom(TDevicePoint start) const {
    const TDeviceBox target = Neighbourhood(0);
    double reach = 0;
    for (const double x : {target.left, target.right}) {
        for (const double y : {target.top, target.bottom}) {
            const auto world = ToWorld({x, y});
            const double distance = world ? std::hypot(world->x - start.x, world->y - start.y) : 0;
            reach = std::max(reach, distance);
        }
    }
    return reach;
}

bool TGdiPlusDrawing::DrawPiece(const TTextPiece& piece, const Gdiplus::GpStringFormat* format,
                                TArgb color) {
    if (piece.text.empty()) {
        return true;
    }
    // A line that is cut through may be measured as nothing.
    const float height = piece.size.height > 0 ? piece.size.height : piece.rect.Height;
    // Glyphs may hang over their box, by less than the height of a line.
    const float overhang = height / static_cast<float>(std::max(piece.lines, 1));
    const TDrawRect box{piece.rect.X - overhang, piece.rect.Y - overhang,
                        piece.size.width + 2 * overhang, height + 2 * overhang};
    const TDeviceBox seen = SeenBox(box);
    if (seen.left >= seen.right || seen.top >= seen.bottom) {
        return true;
    }
    const bool is_single_bit = hint_ == Gdiplus::TextRenderingHintSingleBitPerPixelGridFit ||
                               hint_ == Gdiplus::TextRenderingHintSingleBitPerPixel;
    const bool is_drawn = is_single_bit && picture_.IsSet() && !copies_
                              ? DrawSingleBit(piece, format, color, seen)
                              : DrawOn(graphics_, piece, format, color);
    const bool has_lines = font_traits_.underline || font_traits_.strike_out;
    return is_drawn && (!has_lines || !picture_.IsSet() || LibraryDrawsTextLines() ||
                        DrawTextLines(piece, format, color));
}

bool TGdiPlusDrawing::DrawOn(const TGdiPlusGraphics& graphics, const TTextPiece& piece,
                             const Gdiplus::GpStringFormat* format, TArgb color) {
    const TGdiPlusEntries* entries = GdiPlus();
    const TContextScope scope(context_);
    TGdiPlusBrushOf<Gdiplus::GpSolidFill> brush;
    return entries != nullptr && IsDone(entries->GdipCreateSolidFill(color, brush.Receive())) &&
           IsDone(entries->GdipDrawString(graphics.Get(), NativeText(piece.text),
                                          static_cast<INT>(piece.text.size()), font_.Get(),
                                          &piece.rect, format, brush.Get()));
}

/// Some releases of the library draw halves although single bits are asked for. The text goes to
/// a picture of its own first, where its coverage is cut to all or nothing.
bool TGdiPlusDrawing::DrawSingleBit(const TTextPiece& piece, const Gdiplus::GpStringFormat* format,
                                    TArgb color, const TDeviceBox& seen) {
    const TGdiPlusEntries* entries = GdiPlus();
    const std::int32_t width = TruncToInt(seen.right - seen.left);
    const std::int32_t height = TruncToInt(seen.bottom - seen.top);
    std::vector<std::uint32_t> pixels(static_cast<std::size_t>(width) *
                                      static_cast<std::size_t>(height));
    TGdiPlusImageOf<Gdiplus::GpBitmap> picture;
    TGdiPlusGraphics graphics;
    TGdiPlusMatrix matrix;
    constexpr TArgb kOpaque = 0xFF000000;
    const bool is_drawn =
        entries != nullptr &&
        IsDone(entries->GdipCreateBitmapFromScan0(width, height, width * 4, PixelFormat32bppARGB,
                                                  reinterpret_cast<BYTE*>(pixels.data()),
                                                  picture.Receive())) &&
        IsDone(entries->GdipGetImageGraphicsContext(picture.Get(), graphics.Receive())) &&
        IsDone(entries->GdipSetPageUnit(graphics.Get(), Gdiplus::UnitPixel)) &&
        IsDone(entries->GdipSetTextRenderingHint(graphics.Get(), hint_)) &&
        IsDone(entries->GdipCreateMatrix2(matrix_.m11, matrix_.m12, matrix_.m21, matrix_.m22,
                                          static_cast<float>(matrix_.dx - seen.left),
                                          static_cast<float>(matrix_.dy - seen.top),
                                          matrix.Receive())) &&
        IsDone(entries->GdipSetWorldTransform(graphics.Get(), matrix.Get())) &&
        DrawOn(graphics, piece, format, kOpaque) &&
        IsDone(entries->GdipFlush(graphics.Get(), Gdiplus::FlushIntentionSync));
    graphics.Reset();
    if (!is_drawn) {
        return false;
    }
    for (std::uint32_t& pixel : pixels) {
        pixel = pixel >> 24 >= kHalfCoverage ? color : 0;
    }
    return PlacePicture(picture.Get(), seen);
}

/// Draws a picture pixel by pixel at its place on the target, whatever the transform.
bool TGdiPlusDrawing::PlacePicture(Gdiplus::GpImage* picture, const TDeviceBox& place) {
    const TDrawMatrix matrix = matrix_;
    const bool is_placed =
        ResetTransform() &&
        Call<&TGdiPlusEntries::GdipSetInterpolationMode>(
            Gdiplus::InterpolationModeNearestNeighbor) &&
        Call<&TGdiPlusEntries::GdipDrawImageRect>(picture, static_cast<float>(place.left),
                                                  static_cast<float>(place.top),
                                                  static_cast<float>(place.right - place.left),
                                                  static_cast<float>(place.bottom - place.top));
    Call<&TGdiPlusEntries::GdipSetInterpolationMode>(interpolation_);
    return SetTransform(matrix) && is_placed;
}

}  // namespace zm::platform
