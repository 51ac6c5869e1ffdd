#pragma once

#include <array>
#include <cstdint>
#include <functional>
#include <memory>
#include <string>
#include <vector>

#include "engine/bitmap/zmbasebitmap.h"
#include "engine/bitmap/zmfont.h"
#include "engine/bitmap/zmplatformbitmap.h"
#include "engine/foundation/zmdefs.h"
#include "engine/foundation/zmutils_filebuffer.h"

namespace zm {

class TCanvas;
class TIOParams;
class TZmBitmap;
class TZmCanvas;
class TZmMask;

/// Deleters of objects whose classes live on higher floors; defined there.
struct TIOParamsDeleter {
    void operator()(TIOParams* params) const;
};
struct TCanvasDeleter {
    void operator()(TCanvas* canvas) const;
};
struct TZmCanvasDeleter {
    void operator()(TZmCanvas* canvas) const;
};

/// Supplies the rows of a virtual bitmap.
class TZmVirtualBitmapProvider {
public:
    virtual ~TZmVirtualBitmapProvider() = default;
    /// Address of `width` pixels of a row from column `start`, valid until the next call.
    virtual std::uint8_t* GetRow(TZmBitmap* bitmap, std::int32_t row, std::int32_t start,
                                 std::int32_t width) = 0;
};

using TZmNotifyEvent = std::function<void(void* sender)>;
using TZmBitmapProgressEvent = std::function<void(void* sender, std::int32_t percent)>;
/// Writes pixel (x, y) of a virtual bitmap at `pixel`.
using TZmRenderVirtualPixelEvent =
    std::function<void(TZmBitmap* bitmap, std::int32_t x, std::int32_t y, void* pixel)>;

/// The fields of TZmBitmap, which alone works on them. Bit count, channel count and row length
/// always follow from format, width and alignment.
class TZmBitmapState : public TZmBaseBitmap {
protected:
    TZmBitmapState();
    ~TZmBitmapState() override;

    std::unique_ptr<TZmFileBuffer> fmemmap;
    std::uint8_t* fWorkingMap = nullptr;
    std::vector<TRGB> fRGBPalette;
    std::int32_t fPaletteUsed = 256;
    std::unique_ptr<TZmBitmap> fAlphaChannel;
    std::uint8_t* fMemory = nullptr;
    void* fRealMemory = nullptr;
    std::int64_t fRealMemorySize = 0;
    TZmMemoryAllocator fRealMemoryAllocator = zmmaAuto;  // the one that made fRealMemory
    TBitmap* fBitmap = nullptr;
    std::unique_ptr<TBitmap> fOwnedBitmap;
    std::vector<std::uint8_t*> fBitmapScanlines;
    std::vector<std::uint8_t*> fScanlinesToUnMapPtr;
    std::vector<std::int32_t> fScanlinesToUnMapRow;
    TZmBitmapOrigin fOrigin = zmboBOTTOMLEFT;
    std::u16string fFilename;
    std::int32_t fFileType = 0;
    std::int32_t fWidth = 0;
    std::int32_t fHeight = 0;
    std::int32_t fBitCount = 0;
    std::int32_t fChannelCount = 0;
    std::int64_t fRowLen = 0;
    TZmPixelFormat fPixelFormat = zmnull;
    bool fIsAlpha = false;
    TZmLocation fLocation = zmFile;
    bool fFull = false;
    bool fEncapsulatedFromTBitmap = false;
    bool fEncapsulatedFromMemory = false;
    std::int64_t fMinFileSize = 0;
    TZmDitherMethod fDefaultDitherMethod = zmThreshold;
    double fBlackValue = 0;
    double fWhiteValue = 0;
    std::array<std::int32_t, 4> fChannelOffset{};
    bool fEnableChannelOffset = false;
    std::int32_t fContrast = 0;
    std::unique_ptr<TZmMask> fAdjustmentsMask;
    std::int32_t fBitAlignment = 32;
    TZmMemoryAllocator fMemoryAllocator = zmmaAuto;
    bool fFullReallocate = true;
    std::int32_t fCanvasCurrentAlpha = -1;
    TFont fCanvasFont;  // the canvases borrow it
    std::unique_ptr<TCanvas, TCanvasDeleter> fCanvas;
    std::unique_ptr<TZmCanvas, TZmCanvasDeleter> fZmCanvas;  // draws on fCanvas
    TZmBitmap* fROIOriginalBitmap = nullptr;
    TRect fROIOriginalRect{};
    TZmCanvas* fROICanvas = nullptr;
    bool fROIAlphaCompositing = false;
    TZmNotifyEvent fOnChanged;
    TZmBitmapProgressEvent fOnProgress;
    bool fModified = false;
    std::int32_t fFragmentsCount = 0;
    std::int32_t fRowsPerFragment = 0;
    std::vector<std::uint8_t*> fFragments;
    TZmRenderVirtualPixelEvent fOnRenderVirtualPixel;
    TZmVirtualBitmapProvider* fVirtualBitmapProvider = nullptr;
    std::vector<std::uint8_t> fVirtualBitmapRowBuffer;
    bool fIsVirtual = false;
    bool fIsResource = false;
    std::vector<std::unique_ptr<TZmBitmap>> fSavedBitmaps;
    bool fWicFastLoading = false;
    std::unique_ptr<TIOParams, TIOParamsDeleter> fIOParams;
};

}  // namespace zm
