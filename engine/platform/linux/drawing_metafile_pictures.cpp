#include <algorithm>
#include <array>
#include <cmath>
#include <utility>

#include "engine/foundation/zmnumbers.h"
#include "engine/platform/linux/drawing_metafile_p.h"

// Pictures and texts of metafiles.
namespace zm::platform {
namespace {

enum TRecordType : std::uint32_t {
    rtBitBlt = 76,
    rtStretchBlt = 77,
    rtStretchDib = 81,
    rtTextBytes = 83,
    rtText = 84,
    rtSmallText = 108,
};
/// Raster operations that need nothing of what is there.
enum TRasterOperation : std::uint32_t {
    roBlackness = 0x00000042,
    roSourceCopy = 0x00CC0020,
    roPatternCopy = 0x00F00021,
    roWhiteness = 0x00FF0062,
};
enum TTextOption : std::uint32_t {
    toOpaque = 0x0002,
    toClipped = 0x0004,
    toGlyphNumbers = 0x0010,
    toNoRect = 0x0100,
    toSmallUnits = 0x0200,
    toPairs = 0x2000,
};
enum TTextAlign : std::uint32_t {
    taUpdatePosition = 1,
    taRight = 2,
    taCenter = 6,
    taHorizontal = 6,
    taBottom = 8,
    taBaseline = 24,
};
constexpr double kTextCost = 50000;
constexpr double kUnitCost = 500;
constexpr TArgb kOpaqueBlack = 0xFF000000;

}  // namespace

/// A device-independent bitmap within its record.
struct TMetafilePlayer::TPicture {
    std::int32_t width = 0;
    std::int32_t height = 0;
    bool is_bottom_first = true;
    std::uint32_t bit_count = 0;
    std::array<TArgb, 256> colors{};
    std::span<const std::uint8_t> bits;
    std::int64_t row_bytes = 0;

    /// Nothing unless it is uncompressed and its rows lie within the record.
    static std::optional<TPicture> Read(std::span<const std::uint8_t> info,
                                        std::span<const std::uint8_t> bits);
    /// Row 0 is the top one.
    TArgb PixelAt(std::int32_t x, std::int32_t y) const;
};

std::optional<TMetafilePlayer::TPicture> TMetafilePlayer::TPicture::Read(
    std::span<const std::uint8_t> info, std::span<const std::uint8_t> bits) {
    constexpr std::int32_t kMostSide = 65535;
    TZmByteReader reader(info);
    const std::uint32_t info_bytes = reader.U32LE();
    TPicture picture;
    picture.width = reader.S32LE();
    const std::int64_t height = reader.S32LE();
    reader.Skip(2);
    picture.bit_count = reader.U16LE();
    const std::uint32_t compression = reader.U32LE();
    reader.MoveTo(info_bytes);
    const std::uint32_t bit_count = picture.bit_count;
    const bool is_known = bit_count == 1 || bit_count == 4 || bit_count == 8 || bit_count == 16 ||
                          bit_count == 24 || bit_count == 32;
    if (reader.HasFailed() || info_bytes < 40 || compression != 0 || !is_known ||
        picture.width < 1 || picture.width > kMostSide || height == 0 ||
        std::abs(height) > kMostSide) {
        return std::nullopt;
    }
    picture.is_bottom_first = height > 0;
    picture.height = static_cast<std::int32_t>(std::abs(height));
    picture.row_bytes = (std::int64_t{picture.width} * bit_count + 31) / 32 * 4;
    picture.bits = bits;
    for (std::size_t i = 0; bit_count <= 8 && i < (std::size_t{1} << bit_count); ++i) {
        const std::uint8_t blue = reader.U8();
        const std::uint8_t green = reader.U8();
        const std::uint8_t red = reader.U8();
        reader.Skip(1);
        picture.colors[i] = MakeArgb(255, TRGB{blue, green, red});
    }
    const auto room = static_cast<std::int64_t>(bits.size());
    return picture.row_bytes * picture.height <= room ? std::optional(picture) : std::nullopt;
}

TArgb TMetafilePlayer::TPicture::PixelAt(std::int32_t x, std::int32_t y) const {
    const std::int64_t line = is_bottom_first ? height - 1 - y : y;
    const std::uint8_t* const row = bits.data() + line * row_bytes;
    switch (bit_count) {
        case 1: return colors[row[x / 8] >> (7 - x % 8) & 1];
        case 4: return colors[row[x / 2] >> (x % 2 == 0 ? 4 : 0) & 15];
        case 8: return colors[row[x]];
        case 16: {
            const unsigned value = static_cast<unsigned>(row[2 * x] | row[2 * x + 1] << 8);
            const auto channel = [&](int shift) {
                return static_cast<std::uint8_t>((value >> shift & 31) * 255 / 31);
            };
            return MakeArgb(255, TRGB{channel(0), channel(5), channel(10)});
        }
        default: {
            const std::uint8_t* const p = row + std::int64_t{x} * (bit_count / 8);
            return MakeArgb(255, TRGB{p[0], p[1], p[2]});
        }
    }
}

namespace {

/// Pixels of a picture by places of the target, the nearest one each.
template <typename TPicture>
class TPicturePaint : public TPaint {
public:
    TPicturePaint(const TPicture& picture, const TDeviceMatrix& to_picture)
        : picture_(picture), to_picture_(to_picture) {}
    void ReadRow(std::int32_t x, std::int32_t y, std::int32_t count, TArgb* colors) override {
        const auto place = [](double value, std::int32_t size) {
            return TruncToInt(std::clamp(std::floor(value), 0.0, size - 1.0));
        };
        for (std::int32_t i = 0; i < count; ++i) {
            const TDevicePoint p = to_picture_.Map(x + i + 0.5, y + 0.5);
            colors[i] = picture_.PixelAt(place(p.x, picture_.width), place(p.y, picture_.height));
        }
    }

private:
    const TPicture& picture_;
    const TDeviceMatrix to_picture_;
};

}  // namespace

// Pictures.

void TMetafilePlayer::FillBox(const TDeviceBox& box, const TVectorBrushRecord& brush) {
    TOutline outline(FullMatrix());
    outline.AddRectangle(box);
    if (Spend(kUnitCost)) {
        graphics_.Fill(brush, outline, CAIRO_FILL_RULE_EVEN_ODD);
    }
}

/// `from` in pixels of the picture, `to` in logical units; sides that run backward mirror it.
void TMetafilePlayer::DrawPicture(const TPicture& picture, const TDeviceBox& from,
                                  const TDeviceBox& to) {
    const double scale_x = (to.right - to.left) / (from.right - from.left);
    const double scale_y = (to.bottom - to.top) / (from.bottom - from.top);
    const TDeviceMatrix to_device = FullMatrix().After(
        {scale_x, 0, 0, scale_y, to.left - from.left * scale_x, to.top - from.top * scale_y});
    const auto to_picture = to_device.Inverse();
    TOutline outline(FullMatrix());
    outline.AddRectangle(to);
    const auto bounds = outline.Bounds();
    if (!to_picture || !bounds || !Spend(kUnitCost)) {
        return;
    }
    TPicturePaint paint(picture, *to_picture);
    graphics_.raster_.Paint(Intersect(*bounds, graphics_.ClipBox()), paint, kCombineOver,
                            [&](const TTile& tile) {
                                graphics_.ApplyClip(tile);
                                return FillFigures(graphics_.raster_.Library(), tile,
                                                   outline.Figures(), TMaskEdges::kHard);
                            });
}

bool TMetafilePlayer::PlayPicture(const TRecord& record, TZmByteReader& reader) {
    const bool is_dib = record.type == rtStretchDib;
    if (!is_dib && record.type != rtBitBlt && record.type != rtStretchBlt) {
        return false;
    }
    const auto next = [&] { return static_cast<double>(reader.S32LE()); };
    reader.Skip(16);
    const double x = next();
    const double y = next();
    double width = is_dib ? 0 : next();
    double height = is_dib ? 0 : next();
    std::uint32_t operation = is_dib ? 0 : reader.U32LE();
    const double source_x = next();
    const double source_y = next();
    double source_width = is_dib ? next() : width;
    double source_height = is_dib ? next() : height;
    reader.Skip(is_dib ? 0 : 32);  // the source's transform, colour and kind of colours
    std::array<std::uint32_t, 4> places{};
    for (std::uint32_t& place : places) {
        place = reader.U32LE();
    }
    if (is_dib) {
        reader.Skip(4);
        operation = reader.U32LE();
        width = next();
        height = next();
    } else if (record.type == rtStretchBlt) {
        source_width = next();
        source_height = next();
    }
    if (reader.HasFailed()) {
        return true;
    }
    const TDeviceBox to{x, y, x + width, y + height};
    if (operation == roBlackness || operation == roWhiteness) {
        FillBox(to, {vbSolid, operation == roBlackness ? kOpaqueBlack : ~TArgb{0}, 0, 0, {}, {}});
    } else if (operation == roPatternCopy && state_.brush.is_visible) {
        FillBox(to, BrushRecord());
    }
    const std::size_t size = record.bytes.size();
    const auto part = [&](std::size_t start, std::size_t length) {
        const bool fits = start <= size && length <= size - start;
        return fits ? record.bytes.subspan(start, length) : std::span<const std::uint8_t>();
    };
    const auto picture = TPicture::Read(part(places[0], places[1]), part(places[2], places[3]));
    if (operation == roSourceCopy && picture && source_width != 0 && source_height != 0) {
        // Rows of the one kind count from the bottom where the picture has its bottom row first.
        const bool counts_up = is_dib && picture->is_bottom_first;
        const double top = counts_up ? picture->height - source_y - source_height : source_y;
        DrawPicture(*picture, {source_x, top, source_x + source_width, top + source_height}, to);
    }
    return true;
}

// Texts.

std::optional<TMetafilePlayer::TText> TMetafilePlayer::ReadText(const TRecord& record,
                                                                TZmByteReader& reader,
                                                                bool is_wide) const {
    TText text;
    reader.Skip(16 + 4 + 8);  // bounds, mode, scales
    text.reference.x = reader.S32LE();
    text.reference.y = reader.S32LE();
    const std::uint32_t count = reader.U32LE();
    const std::uint32_t text_place = reader.U32LE();
    text.options = reader.U32LE();
    TDeviceBox rect;
    rect.left = reader.S32LE();
    rect.top = reader.S32LE();
    rect.right = reader.S32LE();
    rect.bottom = reader.S32LE();
    const std::uint32_t advances_place = reader.U32LE();
    if (reader.HasFailed()) {
        return std::nullopt;
    }
    if ((text.options & (toOpaque | toClipped)) != 0) {
        text.rect = rect;
    }
    TZmByteReader units(record.bytes);
    units.MoveTo(text_place);
    if (units.Remaining() / (is_wide ? 2 : 1) < count) {
        return std::nullopt;
    }
    for (std::uint32_t i = 0; i < count; ++i) {
        text.text.push_back(is_wide ? static_cast<char16_t>(units.U16LE())
                                    : static_cast<char16_t>(units.U8()));
    }
    TZmByteReader advances(record.bytes);
    advances.MoveTo(advances_place);
    const std::size_t step = (text.options & toPairs) != 0 ? 8 : 4;
    if (advances_place != 0 && advances.Remaining() / step >= count) {
        for (std::uint32_t i = 0; i < count; ++i) {
            text.advance += advances.S32LE();
            advances.Skip(step - 4);
        }
    }
    return text;
}

std::optional<TMetafilePlayer::TText> TMetafilePlayer::ReadSmallText(TZmByteReader& reader) const {
    TText text;
    text.reference.x = reader.S32LE();
    text.reference.y = reader.S32LE();
    const std::uint32_t count = reader.U32LE();
    text.options = reader.U32LE();
    reader.Skip(4 + 8);
    if ((text.options & toNoRect) == 0) {
        TDeviceBox rect;
        rect.left = reader.S32LE();
        rect.top = reader.S32LE();
        rect.right = reader.S32LE();
        rect.bottom = reader.S32LE();
        text.rect = rect;
    }
    const bool is_small = (text.options & toSmallUnits) != 0;
    if (reader.HasFailed() || reader.Remaining() / (is_small ? 1 : 2) < count) {
        return std::nullopt;
    }
    for (std::uint32_t i = 0; i < count; ++i) {
        text.text.push_back(is_small ? static_cast<char16_t>(reader.U8())
                                     : static_cast<char16_t>(reader.U16LE()));
    }
    return text;
}

bool TMetafilePlayer::PlayText(const TRecord& record, TZmByteReader& reader) {
    if (record.type != rtText && record.type != rtTextBytes && record.type != rtSmallText) {
        return false;
    }
    auto text = record.type == rtSmallText
                    ? ReadSmallText(reader)
                    : ReadText(record, reader, /*is_wide=*/record.type == rtText);
    if (!text) {
        return true;
    }
    const auto kept_clip = state_.clip;
    if ((text->options & toOpaque) != 0 && text->rect) {
        FillBox(*text->rect, {vbSolid, state_.back_color, 0, 0, {}, {}});
    }
    if ((text->options & toClipped) != 0 && text->rect) {
        const TDeviceBox box = MapBox(FullMatrix(), *text->rect);
        SetClip(kept_clip ? Intersect(*kept_clip, box) : box);
    }
    DrawText(std::move(*text));
    SetClip(kept_clip);
    return true;
}

/// Draws a text upright and unmirrored, whatever the page's directions, in the font scaled to the
/// target, as long as its advances tell.
void TMetafilePlayer::DrawText(TText text) {
    const TDeviceMatrix full = FullMatrix();
    const double scale_x = std::hypot(full.m11, full.m12);
    const double scale_y = std::hypot(full.m21, full.m22);
    const bool uses_position = (state_.text_align & taUpdatePosition) != 0;
    const TDevicePoint reference = uses_position ? state_.position : text.reference;
    const TDevicePoint place = full.Map(reference.x, reference.y);
    TTextEngine* const engine = graphics_.Engine();
    const double cost = kTextCost + kUnitCost * static_cast<double>(text.text.size());
    if (text.text.empty() || (text.options & toGlyphNumbers) != 0 || engine == nullptr ||
        !std::isfinite(place.x + place.y + scale_x + scale_y) || scale_x == 0 || scale_y == 0 ||
        !Spend(cost)) {
        return;
    }
    TDrawFont font = state_.font.font;
    const double height = font.height == 0 ? -16.0 : font.height * scale_y;
    font.height = RoundHalfEven(height);
    font.height = font.height == 0 ? -1 : font.height;
    double base = 0;
    const TDrawSize size =
        engine->LayOut(graphics_.MakeRequest(text.text, font, {}, {}), nullptr,
                       [&](const TTextPiece& piece) { base = base == 0 ? piece.y : base; });
    const double wanted = text.advance * scale_x;
    const double stretch = wanted > 0 && size.width > 0 ? wanted / size.width : 1;
    const std::uint32_t across = state_.text_align & taHorizontal;
    const double shift_x = across == taCenter  ? size.width / 2.0
                           : across == taRight ? double{size.width}
                                               : 0;
    const std::uint32_t down = state_.text_align & taBaseline;
    const double shift_y = down == taBaseline ? base : down == taBottom ? double{size.height} : 0;
    const TDeviceMatrix turned = graphics_.world_.After(state_.world);
    const double angle =
        state_.font.angle * 0.017453292519943295769 + std::atan2(turned.m12, std::abs(turned.m11));
    const TDeviceMatrix at_place{std::cos(angle), std::sin(angle), -std::sin(angle),
                                 std::cos(angle), place.x,         place.y};
    const TDeviceMatrix kept_world = graphics_.world_;
    graphics_.world_ = at_place.After({stretch, 0, 0, 1, -shift_x * stretch, -shift_y});
    if (state_.is_opaque) {
        TOutline box(graphics_.world_);
        box.AddRectangle({0, 0, size.width, size.height});
        graphics_.Fill({vbSolid, state_.back_color, 0, 0, {}, {}}, box, CAIRO_FILL_RULE_EVEN_ODD);
    }
    graphics_.DrawString(text.text, font, {}, {}, state_.text_color);
    graphics_.world_ = kept_world;
    if (uses_position) {
        state_.position.x += text.advance > 0 ? text.advance : size.width / scale_x;
    }
}

}  // namespace zm::platform
