/// Text of the vector graphics.

#include <algorithm>
#include <cmath>
#include <new>

#include "engine/platform/linux/drawing_vector_p.h"

namespace zm::platform {
namespace {

/// Room at either end of a line that is not typographic, in em squares.
constexpr double kPaddingEms = 1.0 / 6;

double PaddingOf(const TDrawFont& font, TTextFormat format) {
    return format.is_typographic ? 0 : std::abs(static_cast<double>(font.height)) * kPaddingEms;
}

}  // namespace

TTextEngine* TLinuxGraphics::Engine() {
    if (engine_ == nullptr) {
        engine_ = TakeTextEngine(raster_.Library());
    }
    return engine_.get();
}

TTextRequest TLinuxGraphics::MakeRequest(std::u16string_view text, const TDrawFont& font,
                                         TTextFormat format, const TDrawRect& layout) const {
    constexpr double kLeastWidth = 1;
    TTextRequest request;
    request.text = text;
    request.font = &font;
    request.max_height = format.is_typographic ? layout.height : 0;
    if (layout.width > 0) {
        request.max_width = std::max(layout.width - 2 * PaddingOf(font, format), kLeastWidth);
    }
    request.is_hinted = text_hint_ == 1 || text_hint_ == 3 || text_hint_ == 5;
    request.is_smooth = text_hint_ != 1 && text_hint_ != 2;
    return request;
}

std::optional<TDrawSize> TLinuxGraphics::MeasureString(std::u16string_view text,
                                                       const TDrawFont& font, TTextFormat format,
                                                       const TDrawRect& layout) try {
    TTextEngine* const engine = Engine();
    if (engine == nullptr) {
        return std::nullopt;
    }
    TDrawSize size = engine->LayOut(MakeRequest(text, font, format, layout), nullptr, nullptr);
    size.width += static_cast<float>(2 * PaddingOf(font, format));
    return size;
} catch (const std::bad_alloc&) {
    return std::nullopt;
}

/// A text with all that its drawing needs.
struct TLinuxGraphics::TPlacedText {
    TTextEngine& engine;
    const TTextRequest& request;
    TDeviceMatrix to_device;  ///< from the layout's coordinates
    TDeviceBox clip;
    TArgb color;
};

bool TLinuxGraphics::DrawString(std::u16string_view text, const TDrawFont& font, TTextFormat format,
                                const TDrawRect& layout, TArgb color) try {
    TTextEngine* const engine = Engine();
    const double x = layout.x + PaddingOf(font, format);
    const TDeviceMatrix to_device = world_.After({1, 0, 0, 1, x, layout.y});
    if (engine == nullptr || !to_device.IsFinite()) {
        return false;
    }
    const auto kept_clip = clip_;
    if (!format.is_typographic && layout.width > 0 && layout.height > 0 && !clip_) {
        SetClipRect(layout);
    }
    const TTextRequest request = MakeRequest(text, font, format, layout);
    const bool is_drawn = DrawPlacedText({*engine, request, to_device, ClipBox(), color});
    clip_ = kept_clip;
    return is_drawn;
} catch (const std::bad_alloc&) {
    return false;
}

/// Two runs over the same layout: the first finds the pixels, the second draws tile by tile.
bool TLinuxGraphics::DrawPlacedText(const TPlacedText& text) {
    const auto from_device = text.to_device.Inverse();
    if (!from_device || text.clip.IsEmpty()) {
        return true;  // nothing of it can be seen
    }
    const TDeviceBox visible = Enlarge(MapBox(*from_device, text.clip), 1);
    TDeviceBox box;
    bool has_color = false;
    text.engine.LayOut(text.request, &visible, [&](const TTextPiece& piece) {
        const TDeviceBox ink = Enlarge(MapBox(text.to_device, piece.ink), 1);
        box = box.IsEmpty()
                  ? ink
                  : TDeviceBox{std::min(box.left, ink.left), std::min(box.top, ink.top),
                               std::max(box.right, ink.right), std::max(box.bottom, ink.bottom)};
        has_color = has_color || piece.has_color;
    });
    const TDrawingLibrary& library = raster_.Library();
    const auto draw = [&](const TTile& tile) {
        ApplyClip(tile);
        const TDeviceMatrix to_tile = TDeviceMatrix{1,
                                                    0,
                                                    0,
                                                    1,
                                                    -static_cast<double>(tile.area.left),
                                                    -static_cast<double>(tile.area.top)}
                                          .After(text.to_device);
        if (has_color) {
            library.cairo_set_source_rgba(tile.cairo, (text.color >> 16 & 255) / 255.0,
                                          (text.color >> 8 & 255) / 255.0,
                                          (text.color & 255) / 255.0, 1);
        }
        const TDeviceBox in_tile = Enlarge(MapBox(*from_device, BoxOf(tile.area)), 1);
        text.engine.LayOut(text.request, &in_tile, [&](const TTextPiece& piece) {
            text.engine.DrawPiece(tile.cairo, piece, to_tile);
        });
        return true;
    };
    const TDeviceBox pixels = Intersect(box, text.clip);
    if (has_color) {
        return raster_.PaintColors(pixels, static_cast<std::uint8_t>(text.color >> 24), combining_,
                                   draw);
    }
    TSolidPaint paint(text.color);
    return raster_.Paint(pixels, paint, combining_, draw);
}

}  // namespace zm::platform
