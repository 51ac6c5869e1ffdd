#pragma once

#include "engine/platform/drawing.h"

#include <windows.h>

#include <objidl.h>

#include <gdiplus.h>

// The library of the system's vector graphics, bound by name at run time: a host without it can
// still load the module. Only the flat functions are used; the header gives their types.
namespace zm::platform {

/// Every entry point in use. All of them are of the library's first version.
#define ZM_GDIPLUS_ENTRIES(X)                \
    X(GdipAddPathArc)                        \
    X(GdipAddPathLine)                       \
    X(GdipAddPathLine2)                      \
    X(GdipClosePathFigure)                   \
    X(GdipCreateBitmapFromScan0)             \
    X(GdipCreateFont)                        \
    X(GdipCreateFontFamilyFromName)          \
    X(GdipCreateFontFromDC)                  \
    X(GdipCreateFromHDC2)                    \
    X(GdipCreateHatchBrush)                  \
    X(GdipCreateLineBrush)                   \
    X(GdipCreateMatrix)                      \
    X(GdipCreateMatrix2)                     \
    X(GdipCreateMetafileFromStream)          \
    X(GdipCreatePath)                        \
    X(GdipCreatePen1)                        \
    X(GdipCreateSolidFill)                   \
    X(GdipCreateStringFormat)                \
    X(GdipDeleteBrush)                       \
    X(GdipDeleteFont)                        \
    X(GdipDeleteFontFamily)                  \
    X(GdipDeleteGraphics)                    \
    X(GdipDeleteMatrix)                      \
    X(GdipDeletePath)                        \
    X(GdipDeletePen)                         \
    X(GdipDeleteStringFormat)                \
    X(GdipDisposeImage)                      \
    X(GdipDrawArc)                           \
    X(GdipDrawEllipse)                       \
    X(GdipDrawImageRect)                     \
    X(GdipDrawLine)                          \
    X(GdipDrawLines)                         \
    X(GdipDrawPath)                          \
    X(GdipDrawPie)                           \
    X(GdipDrawPolygon)                       \
    X(GdipDrawRectangle)                     \
    X(GdipDrawString)                        \
    X(GdipFillEllipse)                       \
    X(GdipFillPath)                          \
    X(GdipFillPie)                           \
    X(GdipFillPolygon)                       \
    X(GdipFillRectangle)                     \
    X(GdipFlush)                             \
    X(GdipGetGenericFontFamilySansSerif)     \
    X(GdipGetImageGraphicsContext)           \
    X(GdipGetMatrixElements)                 \
    X(GdipGetMetafileHeaderFromMetafile)     \
    X(GdipGetWorldTransform)                 \
    X(GdipMeasureString)                     \
    X(GdipResetClip)                         \
    X(GdipResetWorldTransform)               \
    X(GdipRotateWorldTransform)              \
    X(GdipScaleWorldTransform)               \
    X(GdipSetClipRect)                       \
    X(GdipSetCompositingMode)                \
    X(GdipSetCompositingQuality)             \
    X(GdipSetInterpolationMode)              \
    X(GdipSetPageUnit)                       \
    X(GdipSetPenDashStyle)                   \
    X(GdipSetPenLineJoin)                    \
    X(GdipSetPixelOffsetMode)                \
    X(GdipSetSmoothingMode)                  \
    X(GdipSetTextRenderingHint)              \
    X(GdipSetWorldTransform)                 \
    X(GdipStartPathFigure)                   \
    X(GdipStringFormatGetGenericTypographic) \
    X(GdipTranslateWorldTransform)

struct TGdiPlusEntries {
#define ZM_DECLARE_ENTRY(name) decltype(&Gdiplus::DllExports::name) name = nullptr;
    ZM_GDIPLUS_ENTRIES(ZM_DECLARE_ENTRY)
#undef ZM_DECLARE_ENTRY
};

/// The table, all entries set, or nil while the library is not bound. Valid until the binding
/// that the caller holds is given back.
const TGdiPlusEntries* GdiPlus();

/// Whether a call of the library did its work.
inline bool IsDone(Gdiplus::GpStatus status) {
    return status == Gdiplus::Ok;
}

/// An object of the library, deleted by the entry `kDelete` with its owner's end. A binding must
/// be held for as long.
template <typename T, auto kDelete>
class TGdiPlusHandle {
public:
    TGdiPlusHandle() = default;
    ~TGdiPlusHandle() { Reset(); }
    TGdiPlusHandle(const TGdiPlusHandle&) = delete;
    TGdiPlusHandle& operator=(const TGdiPlusHandle&) = delete;

    T* Get() const { return object_; }
    bool IsSet() const { return object_ != nullptr; }
    /// Where a creating call writes its result; what was held is deleted.
    T** Receive() {
        Reset();
        return &object_;
    }
    void Reset() {
        if (const TGdiPlusEntries* entries = GdiPlus(); object_ != nullptr && entries != nullptr) {
            (entries->*kDelete)(object_);
        }
        object_ = nullptr;
    }

private:
    T* object_ = nullptr;
};

using TGdiPlusGraphics = TGdiPlusHandle<Gdiplus::GpGraphics, &TGdiPlusEntries::GdipDeleteGraphics>;
using TGdiPlusPath = TGdiPlusHandle<Gdiplus::GpPath, &TGdiPlusEntries::GdipDeletePath>;
using TGdiPlusMatrix = TGdiPlusHandle<Gdiplus::GpMatrix, &TGdiPlusEntries::GdipDeleteMatrix>;
using TGdiPlusPen = TGdiPlusHandle<Gdiplus::GpPen, &TGdiPlusEntries::GdipDeletePen>;
using TGdiPlusFont = TGdiPlusHandle<Gdiplus::GpFont, &TGdiPlusEntries::GdipDeleteFont>;
using TGdiPlusFamily =
    TGdiPlusHandle<Gdiplus::GpFontFamily, &TGdiPlusEntries::GdipDeleteFontFamily>;
using TGdiPlusFormat =
    TGdiPlusHandle<Gdiplus::GpStringFormat, &TGdiPlusEntries::GdipDeleteStringFormat>;

/// Brushes and images have several kinds, which the library deletes by the kind's base.
template <typename T>
using TGdiPlusBrushOf = TGdiPlusHandle<T, &TGdiPlusEntries::GdipDeleteBrush>;
template <typename T>
using TGdiPlusImageOf = TGdiPlusHandle<T, &TGdiPlusEntries::GdipDisposeImage>;

}  // namespace zm::platform
