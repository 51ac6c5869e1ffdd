#include <algorithm>

#include "engine/foundation/zmnumbers.h"
#include "engine/platform/win32/drawing_plain_p.h"

// Text of the plain drawing.
namespace zm::platform {
namespace {

/// The most characters that one call of the system takes.
constexpr std::size_t kPieceUnits = 8192;
/// The most that is laid out in lines: the system looks through the rest for each line.
constexpr std::size_t kMaxWrappedUnits = 65535;

bool IsHighSurrogate(char16_t unit) {
    return (unit & 0xFC00) == 0xD800;
}

/// Takes the next piece off the text; characters of two units stay whole.
std::u16string_view TakePiece(std::u16string_view& text) {
    std::size_t length = std::min(text.size(), kPieceUnits);
    if (length < text.size() && IsHighSurrogate(text[length - 1])) {
        --length;
    }
    const std::u16string_view piece = text.substr(0, length);
    text.remove_prefix(length);
    return piece;
}

const wchar_t* NativeText(std::u16string_view text) {
    return reinterpret_cast<const wchar_t*>(text.data());
}

SIZE PieceExtent(HDC context, std::u16string_view piece) {
    SIZE size{};
    ::GetTextExtentPoint32W(context, NativeText(piece), static_cast<int>(piece.size()), &size);
    return size;
}

SIZE LineExtent(HDC context, std::u16string_view text) {
    SIZE whole = PieceExtent(context, TakePiece(text));
    while (!text.empty()) {
        const SIZE size = PieceExtent(context, TakePiece(text));
        whole.cx = SaturateToInt32(std::int64_t{whole.cx} + size.cx);
        whole.cy = std::max(whole.cy, size.cy);
    }
    return whole;
}

/// Font, colours and background mode for one text.
class TTextScope {
public:
    TTextScope(HDC context, const TDrawFont& font, TColor color, const TColor* background)
        : context_(context),
          font_(context, MakeSystemFont(font, TFontUse::kPlain)),
          color_(::SetTextColor(context, Native(color))),
          background_(::SetBkColor(context, Native(background != nullptr ? *background : 0))),
          mode_(::SetBkMode(context, background != nullptr ? OPAQUE : TRANSPARENT)) {}
    ~TTextScope() {
        ::SetBkMode(context_, mode_);
        ::SetBkColor(context_, background_);
        ::SetTextColor(context_, color_);
    }
    TTextScope(const TTextScope&) = delete;
    TTextScope& operator=(const TTextScope&) = delete;
    bool IsReady() const { return font_.IsSelected(); }

private:
    static COLORREF Native(TColor color) {
        const TRGB channels = RGBFromColor(color);
        return RGB(channels.r, channels.g, channels.b);
    }

    HDC context_;
    TSelectedObject font_;
    COLORREF color_;
    COLORREF background_;
    int mode_;
};

/// Draws the pieces of a line that may be seen, `seen` in the coordinates of the call.
void DrawPieces(HDC context, std::int64_t x, std::int64_t y, std::u16string_view text,
                const TDeviceBox& seen, const RECT* clip) {
    while (!text.empty() && static_cast<double>(x) <= seen.right) {
        const std::u16string_view piece = TakePiece(text);
        const SIZE size = PieceExtent(context, piece);
        // Glyphs may hang over their box, by less than its height.
        const TDeviceBox box{static_cast<double>(x - size.cy), static_cast<double>(y),
                             static_cast<double>(x + size.cx + size.cy),
                             static_cast<double>(y + size.cy)};
        if (box.right >= seen.left && box.left <= seen.right && box.bottom >= seen.top &&
            box.top <= seen.bottom) {
            ::ExtTextOutW(context, SaturateToInt32(x), SaturateToInt32(y),
                          clip != nullptr ? ETO_CLIPPED : 0, clip, NativeText(piece),
                          static_cast<UINT>(piece.size()), nullptr);
        }
        x += size.cx;
    }
}

/// Where a length stands in a space.
std::int64_t PlaceOf(TTextPlace place, std::int64_t first, std::int64_t last, std::int64_t size) {
    switch (place) {
        case tpNear: break;
        case tpCenter: return first + (last - first - size) / 2;
        case tpFar: return last - size;
    }
    return first;
}

UINT AlignmentOf(TTextPlace place) {
    return place == tpCenter ? DT_CENTER : place == tpFar ? DT_RIGHT : DT_LEFT;
}

/// On one line the ends of lines are blanks.
std::u16string OneLine(std::u16string_view text) {
    std::u16string line(text);
    std::replace_if(
        line.begin(), line.end(), [](char16_t unit) { return unit == u'\r' || unit == u'\n'; },
        u' ');
    return line;
}

void DrawLines(HDC context, RECT rect, std::u16string_view text, const TPlainTextLayout& layout) {
    text = text.substr(0, kMaxWrappedUnits);
    const UINT flags = DT_WORDBREAK | DT_NOPREFIX | DT_EXPANDTABS | AlignmentOf(layout.horizontal);
    const auto draw = [&](RECT& place, UINT more) {
        ::DrawTextW(context, NativeText(text), static_cast<int>(text.size()), &place, flags | more);
    };
    RECT measured = rect;
    if (layout.vertical != tpNear) {
        draw(measured, DT_CALCRECT);
    }
    const std::int64_t height = std::int64_t{measured.bottom} - measured.top;
    RECT place = rect;
    place.top = SaturateToInt32(PlaceOf(layout.vertical, rect.top, rect.bottom, height));
    const int saved = ::SaveDC(context);
    ::IntersectClipRect(context, rect.left, rect.top, rect.right, rect.bottom);
    draw(place, DT_NOCLIP);
    ::RestoreDC(context, saved);
}

}  // namespace

TPoint TGdiCanvas::TextExtent(std::u16string_view text, const TDrawFont& font) {
    const TTextScope scope(context_, font, 0, nullptr);
    if (!scope.IsReady()) {
        return {};
    }
    const SIZE size = LineExtent(context_, text);
    return {size.cx, size.cy};
}

void TGdiCanvas::TextOut(std::int32_t x, std::int32_t y, std::u16string_view text,
                         const TDrawFont& font, TColor color, const TColor* background,
                         const TRect* clip) {
    const TTextScope scope(context_, font, color, background);
    if (!scope.IsReady()) {
        return;
    }
    const RECT seen_clip = clip != nullptr ? SeenPart(*clip) : RECT{};
    if (background != nullptr && clip != nullptr) {
        ::ExtTextOutW(context_, 0, 0, ETO_OPAQUE, &seen_clip, nullptr, 0, nullptr);
        ::SetBkMode(context_, TRANSPARENT);
    }
    DrawPieces(context_, x, y, text, Neighbourhood(0), clip != nullptr ? &seen_clip : nullptr);
}

void TGdiCanvas::TextInRect(const TRect& rect, std::u16string_view text, const TDrawFont& font,
                            TColor color, const TPlainTextLayout& layout) {
    const TTextScope scope(context_, font, color, nullptr);
    const RECT seen = SeenPart(rect);
    if (!scope.IsReady() || text.empty() || seen.left >= seen.right || seen.top >= seen.bottom) {
        return;
    }
    if (layout.is_wrapped) {
        DrawLines(context_, seen, text, layout);
        return;
    }
    try {
        const std::u16string line = OneLine(text);
        const SIZE size = LineExtent(context_, line);
        DrawPieces(context_, PlaceOf(layout.horizontal, rect.left, rect.right, size.cx),
                   PlaceOf(layout.vertical, rect.top, rect.bottom, size.cy), line, Neighbourhood(0),
                   &seen);
    } catch (const std::bad_alloc&) {
    }
}

}  // namespace zm::platform
