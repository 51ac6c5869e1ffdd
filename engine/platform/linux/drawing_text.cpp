#include "engine/platform/linux/drawing_text_p.h"

#include <algorithm>
#include <cmath>
#include <mutex>
#include <tuple>
#include <vector>

#include "engine/foundation/zmnumbers.h"

namespace zm::platform {
namespace {

constexpr double kDotsPerInch = 96;
constexpr double kDefaultEm = 16;  // 12 points
constexpr double kMostLayoutEm = 512;
constexpr std::size_t kMostFamilyLength = 256;
/// Glyphs above this size are drawn as outlines: as pictures they would stay in memory.
constexpr double kMostPictureEm = 512;
constexpr double kMostColorPictureEm = 4096;
/// Glyphs above this size are not drawn: the font layer has 16 bits for it, and each failure of
/// its leaves memory behind.
constexpr double kMostDrawnEm = 65535;
/// And below this nothing of them can be seen.
constexpr double kLeastDrawnEm = 1.0 / 64;
/// A limit beyond this is none: no line reaches it.
constexpr double kMostWrapWidth = 1e6;
constexpr std::size_t kMostWrapWindow = 65536;
constexpr double kMostPieceWidth = 200000;

double FromUnits(int units) {
    return static_cast<double>(units) / PANGO_SCALE;
}

bool IsContinuation(char byte) {
    return (static_cast<unsigned char>(byte) & 0xC0) == 0x80;
}

void AppendUtf8(std::string& text, char32_t character) {
    const auto put = [&](char32_t value) { text.push_back(static_cast<char>(value)); };
    if (character < 0x80) {
        put(character);
    } else if (character < 0x800) {
        put(0xC0 | character >> 6);
        put(0x80 | (character & 63));
    } else if (character < 0x10000) {
        put(0xE0 | character >> 12);
        put(0x80 | (character >> 6 & 63));
        put(0x80 | (character & 63));
    } else {
        put(0xF0 | character >> 18);
        put(0x80 | (character >> 12 & 63));
        put(0x80 | (character >> 6 & 63));
        put(0x80 | (character & 63));
    }
}

/// The character at `index`, which moves past it.
char32_t NextCharacter(std::u16string_view text, std::size_t& index) {
    constexpr char32_t kReplacement = 0xFFFD;
    const char16_t unit = text[index++];
    if (unit < 0xD800 || unit > 0xDFFF) {
        return unit;
    }
    const bool is_pair =
        unit < 0xDC00 && index < text.size() && text[index] >= 0xDC00 && text[index] <= 0xDFFF;
    if (!is_pair) {
        return kReplacement;
    }
    const char16_t low = text[index++];
    return 0x10000 + ((static_cast<char32_t>(unit) - 0xD800) << 10) + (low - 0xDC00);
}

bool IsLineEnd(char32_t character) {
    return character == '\n' || character == '\r' || character == 0x0B || character == 0x0C ||
           character == 0x85 || character == 0x2028 || character == 0x2029;
}

bool IsDroppedControl(char32_t character) {
    return (character < 0x20 && character != '\t') || (character >= 0x7F && character < 0xA0);
}

/// Whether a run's font has colours of its own.
bool HasColor(const TDrawingLibrary& library, const PangoLayoutLine* line) {
    for (const GSList* node = line->runs; node != nullptr; node = node->next) {
        const auto* const run = static_cast<const PangoGlyphItem*>(node->data);
        // Every font of this kind of map is of that class.
        auto* const font = reinterpret_cast<PangoFcFont*>(run->item->analysis.font);
        FcPattern* const pattern =
            font != nullptr ? library.pango_fc_font_get_pattern(font) : nullptr;
        FcBool is_color = FcFalse;
        if (pattern != nullptr &&
            library.FcPatternGetBool(pattern, FC_COLOR, 0, &is_color) == FcResultMatch &&
            is_color == FcTrue) {
            return true;
        }
    }
    return false;
}

/// Where a text that is longer than a window is cut: behind its last blank, else between
/// characters.
std::size_t CutPosition(std::string_view text, std::size_t window) {
    if (text.size() <= window) {
        return text.size();
    }
    const std::size_t blank = text.rfind(' ', window - 1);
    if (blank != std::string_view::npos && blank > window / 2) {
        return blank + 1;
    }
    std::size_t cut = window;
    while (cut > 1 && IsContinuation(text[cut])) {
        --cut;
    }
    while (cut < text.size() && IsContinuation(text[cut])) {
        ++cut;
    }
    return cut;
}

std::string_view WithoutTrailingBlanks(std::string_view text) {
    const std::size_t last = text.find_last_not_of(" \t");
    return last == std::string_view::npos ? std::string_view() : text.substr(0, last + 1);
}

}  // namespace

std::string DisplayText(std::u16string_view text) {
    std::string result;
    result.reserve(text.size());
    for (std::size_t index = 0; index < text.size() && text[index] != 0;) {
        const char32_t character = NextCharacter(text, index);
        if (IsLineEnd(character)) {
            const bool is_pair = character == '\r' && index < text.size() && text[index] == '\n';
            index += is_pair ? 1 : 0;
            result.push_back('\n');
        } else if (!IsDroppedControl(character)) {
            AppendUtf8(result, character);
        }
    }
    return result;
}

// Fonts.

TTextEngine::TTextEngine(const TDrawingLibrary& library)
    : library_(library), map_(library.pango_cairo_font_map_new()) {
    library_.pango_cairo_font_map_set_resolution(reinterpret_cast<PangoCairoFontMap*>(map_),
                                                 kDotsPerInch);
    context_ = library_.pango_font_map_create_context(map_);
    library_.pango_context_set_base_dir(context_, PANGO_DIRECTION_LTR);
}

TTextEngine::~TTextEngine() {
    if (setup_.description != nullptr) {
        library_.pango_font_description_free(setup_.description);
    }
    library_.g_object_unref(context_);
    library_.g_object_unref(map_);
}

bool TTextEngine::HasFonts() {
    PangoFontDescription* const description = library_.pango_font_description_new();
    library_.pango_font_description_set_family(description, "Sans");
    library_.pango_font_description_set_absolute_size(description, kDefaultEm * PANGO_SCALE);
    PangoFont* const font = library_.pango_font_map_load_font(map_, context_, description);
    library_.pango_font_description_free(description);
    if (font != nullptr) {
        library_.g_object_unref(font);
    }
    return font != nullptr;
}

/// Gives the description a size and reads the font's lines.
void TTextEngine::MeasureFont(double em) {
    setup_.em = std::min(em, kMostLayoutEm);
    setup_.scale = em / setup_.em;
    library_.pango_font_description_set_absolute_size(setup_.description, setup_.em * PANGO_SCALE);
    PangoFontMetrics* const metrics =
        library_.pango_context_get_metrics(context_, setup_.description, nullptr);
    setup_.ascent = FromUnits(library_.pango_font_metrics_get_ascent(metrics));
    const double glyphs =
        setup_.ascent + FromUnits(library_.pango_font_metrics_get_descent(metrics));
    const double line = FromUnits(library_.pango_font_metrics_get_height(metrics));
    setup_.line_height = std::max(line, glyphs);
    library_.pango_font_metrics_unref(metrics);
}

void TTextEngine::SetUpContext(const TTextRequest& request) {
    cairo_font_options_t* const options = library_.cairo_font_options_create();
    library_.cairo_font_options_set_antialias(
        options, request.is_smooth ? CAIRO_ANTIALIAS_GRAY : CAIRO_ANTIALIAS_NONE);
    library_.cairo_font_options_set_hint_style(
        options, request.is_hinted ? CAIRO_HINT_STYLE_SLIGHT : CAIRO_HINT_STYLE_NONE);
    library_.cairo_font_options_set_hint_metrics(
        options, request.is_hinted ? CAIRO_HINT_METRICS_ON : CAIRO_HINT_METRICS_OFF);
    library_.pango_cairo_context_set_font_options(context_, options);
    library_.cairo_font_options_destroy(options);
    library_.pango_context_set_round_glyph_positions(context_, request.is_hinted ? TRUE : FALSE);
}

const TTextEngine::TFontSetup& TTextEngine::SetUpFont(const TTextRequest& request) {
    const TDrawFont& font = *request.font;
    const auto key = [](const TDrawFont& f) {
        return std::tie(f.family, f.height, f.bold, f.italic, f.underline, f.strike_out);
    };
    SetUpContext(request);
    if (setup_.is_ready && setup_.is_hinted == request.is_hinted && key(setup_.font) == key(font)) {
        return setup_;
    }
    setup_.is_ready = false;
    if (setup_.description == nullptr) {
        setup_.description = library_.pango_font_description_new();
    }
    setup_.font = font;
    setup_.is_hinted = request.is_hinted;
    ++setups_;
    const std::string family =
        DisplayText(std::u16string_view(font.family).substr(0, kMostFamilyLength));
    library_.pango_font_description_set_family(setup_.description, family.c_str());
    library_.pango_font_description_set_weight(setup_.description,
                                               font.bold ? PANGO_WEIGHT_BOLD : PANGO_WEIGHT_NORMAL);
    library_.pango_font_description_set_style(
        setup_.description, font.italic ? PANGO_STYLE_ITALIC : PANGO_STYLE_NORMAL);
    const double height = font.height;
    if (height > 0) {
        // Lines grow with the em square: one measured line tells the size for a given height.
        MeasureFont(kMostLayoutEm);
        MeasureFont(height * kMostLayoutEm / std::max(setup_.line_height, 1.0));
    } else {
        MeasureFont(height < 0 ? -height : kDefaultEm);
    }
    setup_.is_ready = true;
    return setup_;
}

// Layout.

/// The run of one layout. Lengths within are as laid out; pieces and the size are as drawn.
class TTextEngine::TLayouter {
public:
    TLayouter(TTextEngine& engine, const TTextRequest& request, const TDeviceBox* visible,
              const TVisitPiece& visit)
        : library_(engine.library_),
          setup_(engine.SetUpFont(request)),
          visit_(visit),
          visible_(visible),
          max_height_(request.max_height > 0 ? request.max_height / setup_.scale : 0),
          text_(DisplayText(request.text)) {
        layout_ = library_.pango_layout_new(engine.context_);
        library_.pango_layout_set_font_description(layout_, setup_.description);
        library_.pango_layout_set_auto_dir(layout_, FALSE);
        library_.pango_layout_set_wrap(layout_, PANGO_WRAP_WORD_CHAR);
        const double width = request.max_width / setup_.scale;
        is_wrapped_ = width > 0 && width < kMostWrapWidth;
        if (is_wrapped_) {
            library_.pango_layout_set_width(layout_,
                                            std::max(RoundHalfEven(width * PANGO_SCALE), 1));
        }
        SetAttributes(*request.font);
    }
    ~TLayouter() { library_.g_object_unref(layout_); }
    TLayouter(const TLayouter&) = delete;
    TLayouter& operator=(const TLayouter&) = delete;

    TDrawSize Run() {
        std::string_view rest = text_;
        while (!rest.empty() && !is_full_) {
            const std::size_t end = std::min(rest.find('\n'), rest.size());
            AddParagraph(WithoutTrailingBlanks(rest.substr(0, end)));
            rest.remove_prefix(std::min(end + 1, rest.size()));
            is_full_ = is_full_ || IsBelowVisible();
        }
        return {static_cast<float>(width_ * setup_.scale), static_cast<float>(y_ * setup_.scale)};
    }

private:
    void SetAttributes(const TDrawFont& font) {
        PangoAttrList* const attributes = library_.pango_attr_list_new();
        // A word that is broken for its length stays as it is written.
        library_.pango_attr_list_insert(attributes, library_.pango_attr_insert_hyphens_new(FALSE));
        if (font.underline) {
            library_.pango_attr_list_insert(
                attributes, library_.pango_attr_underline_new(PANGO_UNDERLINE_SINGLE));
        }
        if (font.strike_out) {
            library_.pango_attr_list_insert(attributes,
                                            library_.pango_attr_strikethrough_new(TRUE));
        }
        library_.pango_layout_set_attributes(layout_, attributes);
        library_.pango_attr_list_unref(attributes);
    }

    bool IsBelowVisible() const {
        return visible_ != nullptr && (y_ - setup_.line_height) * setup_.scale > visible_->bottom;
    }

    /// Whether one more line fits at the present place.
    bool AcceptLine(double height) {
        constexpr double kTolerance = 1.0 / 64;
        is_full_ = max_height_ > 0 && y_ + height > max_height_ + kTolerance;
        return !is_full_;
    }

    void AddParagraph(std::string_view text) {
        if (text.empty()) {
            if (AcceptLine(setup_.line_height)) {
                y_ += setup_.line_height;
            }
        } else if (is_wrapped_) {
            AddWrapped(text);
        } else {
            AddLongLine(text);
        }
    }

    void SetText(std::string_view text) {
        library_.pango_layout_set_text(layout_, text.data(), static_cast<int>(text.size()));
    }

    /// Lines of a paragraph, window by window: the last line of a window that does not reach the
    /// paragraph's end begins the next one.
    void AddWrapped(std::string_view text) {
        std::size_t window = kMostPieceCharacters;
        while (!text.empty() && !is_full_ && !IsBelowVisible()) {
            const std::size_t cut = CutPosition(text, window);
            SetText(text.substr(0, cut));
            int count = library_.pango_layout_get_line_count(layout_);
            if (cut < text.size() && count < 2 && window < kMostWrapWindow) {
                window *= 4;
                continue;
            }
            std::size_t used = cut;
            if (cut < text.size() && count >= 2) {
                --count;
                const PangoLayoutLine* const last =
                    library_.pango_layout_get_line_readonly(layout_, count);
                used = static_cast<std::size_t>(last->start_index);
            }
            for (int i = 0; i < count && !is_full_; ++i) {
                AddLine(library_.pango_layout_get_line_readonly(layout_, i), 0);
            }
            text.remove_prefix(std::max<std::size_t>(used, 1));
        }
    }

    /// One line, in pieces side by side where it is long.
    void AddLongLine(std::string_view text) {
        const auto window = static_cast<std::size_t>(
            TruncToInt(std::clamp(kMostPieceWidth / setup_.em, 1.0, double{kMostPieceCharacters})));
        // The library's time for a line grows with the square of its tabs.
        constexpr std::size_t kMostTabbedCharacters = 128;
        double x = 0;
        const double top = y_;
        while (!text.empty() && !is_full_) {
            y_ = top;
            const bool has_tabs = text.substr(0, window).find('\t') != std::string_view::npos;
            const std::size_t cut =
                CutPosition(text, has_tabs ? std::min(window, kMostTabbedCharacters) : window);
            SetText(text.substr(0, cut));
            x += AddLine(library_.pango_layout_get_line_readonly(layout_, 0), x);
            text.remove_prefix(cut);
            if (visible_ != nullptr && (x - setup_.em) * setup_.scale > visible_->right) {
                break;
            }
        }
    }

    /// Adds a line at `x` and moves on below it; returns its width.
    double AddLine(PangoLayoutLine* line, double x) {
        PangoRectangle ink{};
        PangoRectangle logical{};
        library_.pango_layout_line_get_extents(line, &ink, &logical);
        const double ascent = std::max(setup_.ascent, -FromUnits(logical.y));
        const double descent =
            std::max(setup_.line_height - setup_.ascent, FromUnits(logical.height + logical.y));
        if (!AcceptLine(ascent + descent)) {
            return 0;
        }
        const double base = y_ + ascent;
        y_ += ascent + descent;
        const double width = FromUnits(logical.x + logical.width);
        width_ = std::max(width_, x + width);
        Visit(line, ink, {x, base, x + width, 0});
        return width;
    }

    /// `place` is where the base line begins and, at its right, ends.
    void Visit(PangoLayoutLine* line, const PangoRectangle& ink, const TDeviceBox& place) {
        if (!visit_) {
            return;
        }
        constexpr double kMargin = 2;  // for the rounding of glyph pictures
        const double scale = setup_.scale;
        TTextPiece piece;
        piece.line = line;
        piece.x = place.left * scale;
        piece.y = place.top * scale;
        piece.width = (place.right - place.left) * scale;
        piece.scale = scale;
        piece.em = setup_.em * scale;
        const double left = piece.x + FromUnits(ink.x) * scale;
        const double top = piece.y + FromUnits(ink.y) * scale;
        piece.ink = Enlarge(
            {left, top, left + FromUnits(ink.width) * scale, top + FromUnits(ink.height) * scale},
            kMargin);
        if (visible_ == nullptr || !Intersect(piece.ink, *visible_).IsEmpty()) {
            piece.has_color = HasColor(library_, line);
            visit_(piece);
        }
    }

    const TDrawingLibrary& library_;
    const TFontSetup& setup_;
    const TVisitPiece& visit_;
    const TDeviceBox* const visible_;
    const double max_height_;
    const std::string text_;
    PangoLayout* layout_ = nullptr;
    bool is_wrapped_ = false;
    bool is_full_ = false;
    double y_ = 0;
    double width_ = 0;
};

TDrawSize TTextEngine::LayOut(const TTextRequest& request, const TDeviceBox* visible,
                              const TVisitPiece& visit) {
    return TLayouter(*this, request, visible, visit).Run();
}

void TTextEngine::DrawPiece(cairo_t* cairo, const TTextPiece& piece,
                            const TDeviceMatrix& to_surface) {
    const double em = piece.em * std::sqrt(std::abs(to_surface.Determinant()));
    const double em_across = piece.em * std::hypot(to_surface.m11, to_surface.m12);
    const double em_down = piece.em * std::hypot(to_surface.m21, to_surface.m22);
    if (!(std::min({em, em_across, em_down}) >= kLeastDrawnEm &&
          std::max(em_across, em_down) <= kMostDrawnEm)) {
        return;
    }
    const cairo_matrix_t matrix{to_surface.m11 * piece.scale,
                                to_surface.m12 * piece.scale,
                                to_surface.m21 * piece.scale,
                                to_surface.m22 * piece.scale,
                                to_surface.dx,
                                to_surface.dy};
    library_.cairo_set_matrix(cairo, &matrix);
    library_.cairo_new_path(cairo);
    library_.cairo_move_to(cairo, piece.x / piece.scale, piece.y / piece.scale);
    if (piece.has_color && em > kMostColorPictureEm) {
        return;  // pictures have no outlines; those made of their pixels take seconds a glyph
    }
    if (piece.has_color || em <= kMostPictureEm) {
        library_.pango_cairo_show_layout_line(cairo, piece.line);
        return;
    }
    library_.pango_cairo_layout_line_path(cairo, piece.line);
    library_.cairo_set_fill_rule(cairo, CAIRO_FILL_RULE_WINDING);
    library_.cairo_fill(cairo);
}

// The engines that wait for work.

namespace {

struct TEnginePool {
    std::mutex lock;
    std::vector<std::unique_ptr<TTextEngine>> engines;
    bool is_open = true;
};
constexpr std::size_t kMostIdleEngines = 16;

/// The pool is emptied when its module goes. It has no destructor of its own: canvases that go
/// later still give their engines back, which then end there.
union TPoolStorage {
    TPoolStorage() : pool() {}
    ~TPoolStorage() {}  // NOLINT(modernize-use-equals-default): the member stays
    TPoolStorage(const TPoolStorage&) = delete;
    TPoolStorage& operator=(const TPoolStorage&) = delete;

    TEnginePool pool;
};

class TPoolCloser {
public:
    explicit TPoolCloser(TEnginePool& pool) : pool_(pool) {}
    ~TPoolCloser() {
        const std::scoped_lock guard(pool_.lock);
        pool_.is_open = false;
        std::vector<std::unique_ptr<TTextEngine>>().swap(pool_.engines);
    }
    TPoolCloser(const TPoolCloser&) = delete;
    TPoolCloser& operator=(const TPoolCloser&) = delete;

private:
    TEnginePool& pool_;
};

TEnginePool& EnginePool() {
    static TPoolStorage storage;
    static const TPoolCloser closer(storage.pool);
    return storage.pool;
}

}  // namespace

void TReturnTextEngine::operator()(TTextEngine* engine) const {
    std::unique_ptr<TTextEngine> owner(engine);
    TEnginePool& pool = EnginePool();
    const std::scoped_lock guard(pool.lock);
    if (pool.is_open && pool.engines.size() < kMostIdleEngines && !owner->IsWorn()) {
        pool.engines.push_back(std::move(owner));
    }
}

TTextEngineLease TakeTextEngine(const TDrawingLibrary& library) {
    TEnginePool& pool = EnginePool();
    {
        const std::scoped_lock guard(pool.lock);
        if (!pool.engines.empty()) {
            TTextEngineLease engine(pool.engines.back().release());
            pool.engines.pop_back();
            return engine;
        }
    }
    auto engine = std::make_unique<TTextEngine>(library);
    return TTextEngineLease(engine->HasFonts() ? engine.release() : nullptr);
}

}  // namespace zm::platform
