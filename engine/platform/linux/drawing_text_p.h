#pragma once

#include <functional>
#include <memory>
#include <string>
#include <string_view>

#include "engine/platform/drawing.h"
#include "engine/platform/drawing_path_p.h"
#include "engine/platform/linux/drawing_library_p.h"

/// Layout of text: shaping, fallback fonts and wrapping by Pango, over a font map that no other
/// thread uses meanwhile.
namespace zm::platform {

/// A text to lay out, as TVectorGraphics has it.
struct TTextRequest {
    std::u16string_view text;
    const TDrawFont* font = nullptr;
    double max_width = 0;   ///< 0 or less: no limit
    double max_height = 0;  ///< 0 or less: no limit; only lines that fit whole
    bool is_hinted = false;
    bool is_smooth = true;
};

/// One line, or a piece of a very long one.
struct TTextPiece {
    PangoLayoutLine* line = nullptr;  ///< valid during the call
    double x = 0;                     ///< start of its base line
    double y = 0;
    double width = 0;
    double scale = 1;  ///< how much larger than laid out it is to be drawn
    double em = 0;     ///< as drawn
    TDeviceBox ink;    ///< holds its glyphs as drawn
    bool has_color = false;
};

/// Lines of more than this many characters are shaped in pieces, cut at blanks where there are
/// some: letters do not join and do not change places across a cut.
inline constexpr std::size_t kMostPieceCharacters = 2048;

class TTextEngine {
public:
    explicit TTextEngine(const TDrawingLibrary& library);
    ~TTextEngine();
    TTextEngine(const TTextEngine&) = delete;
    TTextEngine& operator=(const TTextEngine&) = delete;
    /// False when the machine has no font at all.
    bool HasFonts();
    /// Whether it has seen so many fonts that what it keeps of them should go.
    bool IsWorn() const { return setups_ >= kMostSetups; }

    /// Size of the laid out text, from 0, 0 on. `visit` is called for each piece, in order. With
    /// `visible` pieces outside it may be left out, and the layout ends when nothing more can be
    /// within it: the size then is not that of the whole text.
    using TVisitPiece = std::function<void(const TTextPiece&)>;
    TDrawSize LayOut(const TTextRequest& request, const TDeviceBox* visible,
                     const TVisitPiece& visit);
    /// Draws a piece at its place; the matrix brings the text's coordinates to the surface's.
    void DrawPiece(cairo_t* cairo, const TTextPiece& piece, const TDeviceMatrix& to_surface);

private:
    static constexpr int kMostSetups = 500;
    class TLayouter;

    /// A font as the library describes it. Large ones are laid out smaller and drawn enlarged:
    /// the library's numbers are 32 bits with 10 of them behind the point.
    struct TFontSetup {
        TDrawFont font;
        PangoFontDescription* description = nullptr;
        double em = 0;  ///< as laid out
        double scale = 1;
        double ascent = 0;  ///< of a line as laid out
        double line_height = 0;
        bool is_hinted = false;  ///< lines are fitted to pixels too
        bool is_ready = false;   ///< whole; what failed half-way is not taken for its font
    };
    void SetUpContext(const TTextRequest& request);
    const TFontSetup& SetUpFont(const TTextRequest& request);
    void MeasureFont(double em);

    const TDrawingLibrary& library_;
    PangoFontMap* map_;
    PangoContext* context_;
    TFontSetup setup_;  // of the last font
    int setups_ = 0;
};

/// Engines are expensive to make: they are handed out to one canvas at a time and kept.
struct TReturnTextEngine {
    void operator()(TTextEngine* engine) const;
};
using TTextEngineLease = std::unique_ptr<TTextEngine, TReturnTextEngine>;
/// Nil when the machine has no font.
TTextEngineLease TakeTextEngine(const TDrawingLibrary& library);

/// UTF-16 to UTF-8 for display: unpaired surrogates become U+FFFD, U+0000 ends the text, other
/// control characters but tabs are left out. Line ends of all kinds become LF.
std::string DisplayText(std::u16string_view text);

}  // namespace zm::platform
