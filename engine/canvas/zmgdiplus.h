#pragma once

#include <cstdint>
#include <functional>
#include <memory>
#include <string>
#include <vector>

#include "engine/canvas/zmplatformcanvas.h"
#include "engine/foundation/zmdefs.h"
#include "engine/foundation/zmstreams.h"
#include "engine/platform/drawing.h"

/// The antialiasing canvas: shapes with coverage, transparency and gradients, transforms and text,
/// over the platform's vector library. Without it shapes are drawn by the platform canvas; text
/// is not, but for the names that say so.
namespace zm {

class TZmBitmap;

/// Values of the library are the ordinals minus 1; the first is refused and changes nothing.
enum TZmCanvasSmoothingMode : std::uint8_t {
    zmsmInvalid,
    zmsmDefault,
    zmsmBestPerformance,
    zmsmBestRenderingQuality,
    zmsmNone,
    zmsmAntialias,
};
enum TZmCanvasInterpolationMode : std::uint8_t {
    zmiiInvalid,
    zmiiDefault,
    zmiiLowQuality,
    zmiiHighQuality,
    zmiiBilinear,
    zmiiBicubic,
    zmiiNearestNeighbor,
    zmiiHighQualityBilinear,
    zmiiHighQualityBicubic,
};
/// Values of the library are the ordinals, here and below.
enum TZmTextRenderingHintMode : std::uint8_t {
    zmtrTextRenderingHintSystemDefault,
    zmtrTextRenderingHintSingleBitPerPixelGridFit,
    zmtrTextRenderingHintSingleBitPerPixel,
    zmtrTextRenderingHintAntiAliasGridFit,
    zmtrTextRenderingHintAntiAlias,
    zmtrTextRenderingHintClearTypeGridFit,
};
enum TZmCanvasPenLineJoin : std::uint8_t { zmljMiter, zmljBevel, zmljRound, zmljMiterClipped };
enum TZmCanvasCompositingQuality : std::uint8_t {
    zmCompositingQualityDefault,
    zmCompositingQualityHighSpeed,
    zmCompositingQualityHighQuality,
    zmCompositingQualityGammaCorrected,
    zmCompositingQualityAssumeLinear,
};
enum TZmCanvasCompositingMode : std::uint8_t {
    zmCompositingModeSourceOver,
    zmCompositingModeSourceCopy,
};

enum TZmGDIPlusGradient : std::uint8_t {
    gpgNone,
    gpgHorizontal,
    gpgVertical,
    gpgHorzCenter,
    gpgVertCenter,
    gpgDiagonal,
    gpgDiagonal2,
    gpgDiagCenter,
    gpgDiagCenter2,
};

using TZmGPPointF = platform::TDrawPoint;

struct TZmDPoint {
    double X = 0;
    double Y = 0;
};
using TZmDPointArray = std::vector<TZmDPoint>;

/// Keeps the vector library bound as long as it lives: when it is wanted and the global setting
/// fUseGDIPlus lets it be used. Objects of the library go before their hold.
class TZmLibraryHold {
public:
    explicit TZmLibraryHold(bool is_wanted);
    ~TZmLibraryHold();
    TZmLibraryHold(const TZmLibraryHold&) = delete;
    TZmLibraryHold& operator=(const TZmLibraryHold&) = delete;
    /// Wanted and allowed, whether or not the system has the library.
    bool IsWanted() const { return is_wanted_; }
    bool IsBound() const { return is_bound_; }

private:
    const bool is_wanted_;
    bool is_bound_ = false;
};

/// The channels of the colour that ColorToRGB gives, with an alpha before them.
platform::TArgb ZmColorToARGB(TColor Color, std::int32_t Alpha);

/// Pen of an antialiasing canvas. Without the library it only passes its values on to the
/// platform pen that it was made over. Setters raise EZmException when the library refuses.
class TZmPen {
public:
    /// Over a platform pen, which outlives it: its colour, width, style and mode. Over nil: white,
    /// width 1, solid, pmCopy.
    explicit TZmPen(TPen* Pen, bool UseGDIPlus = true);
    TColor GetColor() const { return fColor; }
    void SetColor(TColor Color);
    /// 255 opaque; other values are limited to 0 to 255.
    std::int32_t GetTransparency() const { return fTransparency; }
    void SetTransparency(std::int32_t Transparency);
    float GetWidth() const { return fWidth; }
    void SetWidth(float Width);
    TPenStyle GetStyle() const { return fStyle; }
    void SetStyle(TPenStyle Style);
    TPenMode GetMode() const { return fMode; }
    void SetMode(TPenMode Mode);
    TZmCanvasPenLineJoin GetLineJoin() const { return fLineJoin; }
    void SetLineJoin(TZmCanvasPenLineJoin LineJoin);
    /// The library's pen; nil while the library is not in use.
    platform::TVectorPen* GetGHandle() const { return fGHandle.get(); }

private:
    void Rebuild();

    TZmLibraryHold hold_;
    std::unique_ptr<platform::TVectorPen> fGHandle;
    TPen* fPen;
    TColor fColor = 0xFFFFFF;
    std::int32_t fTransparency = 255;
    float fWidth = 1;
    TPenStyle fStyle = psSolid;
    TPenMode fMode = pmCopy;
    TZmCanvasPenLineJoin fLineJoin = zmljMiter;
};

/// Brush of an antialiasing canvas; as the pen, it serves the platform brush that it was made
/// over too, or none. Setters raise EZmException when the library refuses.
class TZmBrush {
public:
    explicit TZmBrush(TBrush* Brush, bool UseGDIPlus = true);
    TColor GetColor() const { return fColor; }
    void SetColor(TColor Color);
    std::int32_t GetTransparency() const { return fTransparency; }
    void SetTransparency(std::int32_t Transparency);
    TColor GetBackColor() const { return fBackColor; }
    void SetBackColor(TColor BackColor);
    std::int32_t GetBackTransparency() const { return fBackTransparency; }
    void SetBackTransparency(std::int32_t BackTransparency);
    TBrushStyle GetStyle() const { return fStyle; }
    void SetStyle(TBrushStyle Style);
    TZmGPPointF GetGradPoint1() const { return fGradPoint1; }
    TZmGPPointF GetGradPoint2() const { return fGradPoint2; }
    /// A second point of 0, 0 means no gradient; the brush then fills by its style.
    void SetGradPoints(TZmGPPointF Point1, TZmGPPointF Point2);
    /// Sets the points for a rectangle of a size at 0, 0. Halves truncate toward zero.
    void SetGradient(TZmGDIPlusGradient Dir, std::int32_t Width, std::int32_t Height);
    platform::TVectorBrush* GetGHandle() const { return fGHandle.get(); }

private:
    friend class TZmCanvas;  // fills rectangles that do not begin at 0, 0
    void Rebuild();
    void RebuildAt(float origin_x, float origin_y);

    TZmLibraryHold hold_;
    std::unique_ptr<platform::TVectorBrush> fGHandle;
    TBrush* fBrush;
    TColor fColor = 0xFFFFFF;
    std::int32_t fTransparency = 255;
    TColor fBackColor = 0xFFFFFF;
    std::int32_t fBackTransparency = 255;
    TBrushStyle fStyle = bsSolid;
    TZmGPPointF fGradPoint1;
    TZmGPPointF fGradPoint2;
};

using TZmMetafileHeader = platform::TDrawMetafileHeader;

/// A recorded picture. One that cannot be read, or of a kind that this system cannot play, has a
/// header of type 0 and draws nothing.
class TZmMetafile {
public:
    explicit TZmMetafile(const std::u16string& Filename);
    /// From the stream's position to its end.
    explicit TZmMetafile(TStream& Stream);
    ~TZmMetafile();
    bool IsWmf() const;
    bool IsEmf() const;
    bool IsEmfPlus() const;
    bool IsEmfPlusDual() const;
    const TZmMetafileHeader& GetHeader() const { return fHeader; }
    const platform::TDrawMetafile* GetHandle() const { return fHandle.get(); }

private:
    void Load(TStream& stream);

    TZmLibraryHold hold_{/*is_wanted=*/true};
    std::unique_ptr<platform::TDrawMetafile> fHandle;
    TZmMetafileHeader fHeader;
};

/// A drawing surface over a platform canvas. Shapes are filled with the brush and outlined with
/// the pen. Angles are degrees, clockwise. Belongs to the thread that made it.
class TZmCanvas {
public:
    using TNotifyEvent = std::function<void(TZmCanvas*)>;

    /// Canvas and bitmap outlive it; a bitmap of nil means the canvas's own. The library is used
    /// when `UseGDIPlus` and the global setting fUseGDIPlus both say so; when it cannot be,
    /// EZmException "Cannot create TZmCanvas. Ensure GDI+ is installed on system." is raised.
    TZmCanvas(TCanvas& Canvas, bool AntiAlias, bool UseGDIPlus, TBitmap* Bitmap = nullptr);
    virtual ~TZmCanvas();
    TZmCanvas(const TZmCanvas&) = delete;
    TZmCanvas& operator=(const TZmCanvas&) = delete;

    TZmPen& GetPen() { return *fPen; }
    TZmBrush& GetBrush() { return *fBrush; }
    /// The platform canvas's font, with which text is measured and drawn.
    TFont& GetFont() { return fCanvas.Font; }
    TCanvas& GetCanvas() { return fCanvas; }
    void* GetCanvasHandle() const { return fCanvasHandle; }
    bool GetUseGDIPlus() const { return fUseGDIPlus; }
    TPoint GetPenPos() const { return fPenPos; }

    TZmCanvasSmoothingMode GetSmoothingMode() const { return fSmoothingMode; }
    void SetSmoothingMode(TZmCanvasSmoothingMode Mode);
    TZmCanvasInterpolationMode GetInterpolationMode() const { return fInterpolationMode; }
    void SetInterpolationMode(TZmCanvasInterpolationMode Mode);
    TZmTextRenderingHintMode GetTextRendering() const { return fTextRendering; }
    void SetTextRendering(TZmTextRenderingHintMode Mode);
    void SetCompositingMode(TZmCanvasCompositingMode Mode, TZmCanvasCompositingQuality Quality);
    /// Text in the font's own metrics (the start value), or with room around it.
    bool GetTypographicDrawText() const { return fTypographicDrawText; }
    void SetTypographicDrawText(bool Typographic) { fTypographicDrawText = Typographic; }

    /// Called first when the canvas goes.
    void SetOnDestroy(TNotifyEvent Event) { fOnDestroy = std::move(Event); }
    /// The bitmap that this canvas draws on; it goes with the canvas, after all else of it.
    void SetROIBitmap(std::unique_ptr<TZmBitmap> Bitmap);
    TZmBitmap* GetROIBitmap() const { return fROIBitmap.get(); }
    /// Holds all pixels drawn on by the library since creation; all of the bitmap without it.
    TRect GetTouchedRect() const;

    // Lines.
    void MoveTo(std::int32_t X, std::int32_t Y);
    /// With the library the end is drawn too, and the pen's position moves there in both cases.
    void LineTo(std::int32_t X, std::int32_t Y);
    void DrawLine(double X1, double Y1, double X2, double Y2);
    /// An arc from one point around `CenterX`, `CenterY`, the shorter way (as the clock goes when
    /// both are equally long), until it faces the other point, and on to that in a straight line.
    /// Only that line where the points face each other already, and without the library.
    void DrawCurvedLine(double X1, double Y1, double X2, double Y2, double CenterX, double CenterY);
    void DrawLinesPath(const TZmDPointArray& Points);
    void Polyline(const std::vector<TPoint>& Points);
    void PolylineD(const TZmDPointArray& Points);
    /// The part of an ellipse counter-clockwise between the rays through two points.
    void Arc(std::int32_t X1, std::int32_t Y1, std::int32_t X2, std::int32_t Y2, std::int32_t X3,
             std::int32_t Y3, std::int32_t X4, std::int32_t Y4);

    // Shapes.
    /// With the library corners are sorted and the last column and row are left out: a rectangle
    /// 0, 0, 10, 10 fills 9 by 9.
    void FillRect(const TRect& Rect);
    void Rectangle(std::int32_t X1, std::int32_t Y1, std::int32_t X2, std::int32_t Y2);
    void Rectangle(const TRect& Rect) { Rectangle(Rect.left, Rect.top, Rect.right, Rect.bottom); }
    void Ellipse(std::int32_t X1, std::int32_t Y1, std::int32_t X2, std::int32_t Y2);
    void Ellipse(const TRect& Rect) { Ellipse(Rect.left, Rect.top, Rect.right, Rect.bottom); }
    /// Corners are quarters of an ellipse of size X3 by Y3, at most the rectangle's.
    void RoundRect(std::int32_t X1, std::int32_t Y1, std::int32_t X2, std::int32_t Y2,
                   std::int32_t X3, std::int32_t Y3);
    void Polygon(const std::vector<TPoint>& Points);
    void PolygonD(const TZmDPointArray& Points);
    /// Counter-clockwise between the rays through two points / by angles, clockwise.
    void Pie(std::int32_t X1, std::int32_t Y1, std::int32_t X2, std::int32_t Y2, std::int32_t X3,
             std::int32_t Y3, std::int32_t X4, std::int32_t Y4);
    void Pie(std::int32_t X1, std::int32_t Y1, std::int32_t X2, std::int32_t Y2, float StartAngle,
             float SweepAngle);
    /// Between the brush's colour and back colour / two others; the brush is as before
    /// afterwards. Nothing without the library.
    void GradientFillRect(const TRect& Rect, TZmGDIPlusGradient Dir);
    void GradientFillRect(const TRect& Rect, TColor FromColor, TColor ToColor,
                          TZmGDIPlusGradient Dir);
    void Draw(const TZmMetafile& Metafile, std::int32_t X, std::int32_t Y, std::int32_t Width,
              std::int32_t Height);

    // World transform; each step acts before those already there.
    void Rotate(double Angle);
    /// Moves the origin of the platform canvas too, for good.
    void Translate(std::int32_t DX, std::int32_t DY);
    void Scale(double SX, double SY);
    void ResetTransform();
    void Flush();

    // Text of the library; without it nothing is drawn and sizes are 0.
    /// Size in whole pixels, rounded up; of the rotated box when `Angle` is no multiple of 180.
    TPoint MeasureText(const std::u16string& Text, std::int32_t Angle = 0);
    /// Within the width and height of a rectangle, right and bottom inclusive.
    TPoint MeasureText(const std::u16string& Text, const TRect& BoundingRect, std::int32_t Angle);
    /// Wrapped within a rectangle.
    void DrawText(const std::u16string& Text, const TRect& BoundingRect);
    /// Turned about the rectangle's middle, and clipped to it unless `Angle` is 0.
    void DrawText(const std::u16string& Text, const TRect& BoundingRect, std::int32_t Angle);
    /// From its top left corner, turned about it.
    void DrawText(const std::u16string& Text, std::int32_t X, std::int32_t Y, std::int32_t Angle);

    // Text by whichever of the two is in use.
    std::int32_t TextWidth(const std::u16string& Text) { return TextExtent(Text).x; }
    std::int32_t TextHeight(const std::u16string& Text) { return TextExtent(Text).y; }
    TPoint TextExtent(const std::u16string& Text);
    void TextOut(std::int32_t X, std::int32_t Y, const std::u16string& Text);
    void TextRect(const TRect& Rect, std::int32_t X, std::int32_t Y, const std::u16string& Text);

    // Text of the platform canvas.
    std::int32_t GDITextWidth(const std::u16string& Text) { return GDITextExtent(Text).x; }
    std::int32_t GDITextHeight(const std::u16string& Text) { return GDITextExtent(Text).y; }
    TPoint GDITextExtent(const std::u16string& Text) { return fCanvas.TextExtent(Text); }
    /// On a box of the brush / on what is there.
    void GDITextOut(std::int32_t X, std::int32_t Y, const std::u16string& Text);
    void GDITextOut2(std::int32_t X, std::int32_t Y, const std::u16string& Text);
    /// From a point, clipped to the rectangle / placed in it, on what is there.
    void GDITextRect(const TRect& Rect, std::int32_t X, std::int32_t Y, const std::u16string& Text);
    void GDITextRectEx(const TRect& Rect, const std::u16string& Text,
                       const platform::TPlainTextLayout& Layout);

private:
    enum class TTextPass : std::uint8_t { kMeasure, kDraw };
    TPoint TextCore(const std::u16string& text, const platform::TDrawRect& layout, TTextPass pass);
    void DrawTurnedText(const std::u16string& text, const platform::TDrawRect& box,
                        std::int32_t angle);
    void FillAndDraw(const platform::TDrawPath& path);
    void FillAndDrawPie(const platform::TDrawRect& bounds, float start_angle, float sweep_angle);
    /// The library's pen, nil when it draws nothing.
    const platform::TVectorPen* VisiblePen() const;

    TZmLibraryHold hold_;
    TZmCanvasSmoothingMode fSmoothingMode = zmsmInvalid;
    TZmCanvasInterpolationMode fInterpolationMode = zmiiDefault;
    TZmTextRenderingHintMode fTextRendering = zmtrTextRenderingHintSystemDefault;
    void* fCanvasHandle = nullptr;
    bool fSavedDC = false;
    std::unique_ptr<platform::TVectorGraphics> fGraphics;
    TCanvas& fCanvas;
    std::unique_ptr<TZmPen> fPen;
    TPoint fPenPos;
    std::unique_ptr<TZmBrush> fBrush;
    bool fUseGDIPlus;
    TNotifyEvent fOnDestroy;
    std::unique_ptr<TZmBitmap> fROIBitmap;
    bool fTypographicDrawText = true;
};

/// Holds what an empty canvas draws on; a base class, so that it is there before the canvas.
class TZmTempBitmap {
protected:
    TZmTempBitmap();
    TBitmap fTempBitmap;
    TCanvas fTempCanvas;
};

/// A canvas on a small bitmap of its own, for measuring text where there is no target.
class TZmEmptyCanvas : private TZmTempBitmap, public TZmCanvas {
public:
    TZmEmptyCanvas();
};

}  // namespace zm
