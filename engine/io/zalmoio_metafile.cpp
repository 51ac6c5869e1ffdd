#include "engine/io/zalmoio_metafile_p.h"

#include <algorithm>
#include <cmath>
#include <optional>

#include "engine/bitmap/zmxBitmaps.h"
#include "engine/canvas/zmgdiplus.h"
#include "engine/foundation/zmnumbers.h"
#include "engine/foundation/zmsettings.h"
#include "engine/foundation/zmstreams.h"
#include "engine/io/zalmoio.h"
#include "engine/io/zmfiletypes.h"
#include "engine/io/zmioparams.h"

namespace zm {
namespace {

constexpr TColor kWhite = 0xFFFFFF;
constexpr TColor kBlack = 0;

/// The size to draw at, within the limits of the settings.
TPoint SizeToDraw(const TZmMetafileHeader& header, const TMetafileImport& import) {
    double width = import.width;
    double height = import.height;
    if (import.width < 1 && import.height < 1) {
        width = header.width;
        height = header.height;
    } else if (import.width < 1) {
        width = height * header.width / header.height;
    } else if (import.height < 1) {
        height = width * header.height / header.width;
    }
    const TZmZalmoGlobalSettings& settings = ZmGlobalSettings();
    const double side = std::max(settings.fMaxImageEMFSize, 1);
    const double area = std::max(settings.fMaxImageEMFMatrixSize, 1);
    const double scale =
        std::min({1.0, side / width, side / height, std::sqrt(area / (width * height))});
    return {std::max(TruncToInt(width * scale), 1), std::max(TruncToInt(height * scale), 1)};
}

void FillParams(const TZmMetafileHeader& header, TPoint size, TIOParams& params) {
    params.fWidth = params.fOriginalWidth = size.x;
    params.fHeight = params.fOriginalHeight = size.y;
    params.fBitsPerSample = 8;
    params.fSamplesPerPixel = 3;
    // Of the drawn pixels, which limits and wanted sizes may have made larger or smaller.
    params.SetDpiX(RoundHalfEven(double{header.dpi_x} * size.x / header.width));
    params.SetDpiY(RoundHalfEven(double{header.dpi_y} * size.y / header.height));
    params.SetImageCount(1);
    params.FreeColorMap();
}

bool DrawOn(TColor paper, const TZmMetafile& metafile, TPoint size, TZmBitmap& picture) {
    if (!picture.Allocate(size.x, size.y, zm24RGB)) {
        return false;
    }
    picture.RemoveAlphaChannel(/*merge=*/false, paper);
    picture.Fill(paper);
    try {
        const auto canvas =
            picture.CreateROICanvas(TRect{0, 0, size.x, size.y}, /*AntiAlias=*/true,
                                    /*UseGDIPlus=*/true, /*PerformAlphaCompositing=*/false);
        if (canvas == nullptr) {
            return false;
        }
        canvas->Draw(metafile, 0, 0, size.x, size.y);
    } catch (const EZmException&) {
        return false;  // no drawing library
    }
    return true;
}

/// A row of colours and of alpha from what was drawn on black and on white.
void SplitRow(const TRGB* on_white, TRGB* on_black, std::uint8_t* alpha, std::int32_t width) {
    const auto pure = [](std::uint8_t value, int cover) {
        return static_cast<std::uint8_t>(std::min((value * 255 + cover / 2) / cover, 255));
    };
    for (std::int32_t x = 0; x < width; ++x) {
        TRGB& color = on_black[x];
        const int clearness = std::max(
            {on_white[x].r - color.r, on_white[x].g - color.g, on_white[x].b - color.b, 0});
        const int cover = 255 - clearness;
        alpha[x] = static_cast<std::uint8_t>(cover);
        color = cover == 0 ? TRGB{}
                           : TRGB{pure(color.b, cover), pure(color.g, cover), pure(color.r, cover)};
    }
}

/// Draws on white and on black: where they agree the metafile covers, whatever records drew it.
/// The alpha that players leave on a transparent picture depends on the kind of record.
bool DrawWithAlpha(const TZmMetafile& metafile, TPoint size, TZmBitmap& picture) {
    TZmBitmap on_white;
    if (!DrawOn(kWhite, metafile, size, on_white) || !DrawOn(kBlack, metafile, size, picture)) {
        return false;
    }
    TZmBitmap* const plane = picture.GetAlphaChannel();
    if (plane == nullptr) {
        return false;
    }
    for (std::int32_t y = 0; y < size.y; ++y) {
        const auto* const white_row = reinterpret_cast<const TRGB*>(on_white.GetScanLine(y));
        auto* const row = reinterpret_cast<TRGB*>(picture.GetScanLine(y));
        std::uint8_t* const alpha_row = plane->GetScanLine(y);
        if (white_row == nullptr || row == nullptr || alpha_row == nullptr) {
            return false;
        }
        SplitRow(white_row, row, alpha_row, size.x);
    }
    plane->SyncFull();
    return true;
}

bool ReadImage(TZmLoadCall& call, const TMetafileImport& import) {
    const TZmMetafile metafile(call.stream);
    const TZmMetafileHeader& header = metafile.GetHeader();
    if (metafile.GetHandle() == nullptr || header.width < 1 || header.height < 1) {
        return false;
    }
    const TPoint size = SizeToDraw(header, import);
    FillParams(header, size, call.params);
    if (call.params_only) {
        return true;
    }
    const bool is_drawn = import.with_alpha ? DrawWithAlpha(metafile, size, call.bitmap)
                                            : DrawOn(kWhite, metafile, size, call.bitmap);
    call.progress.per1 = 100;
    return is_drawn && StepProgress(call.progress, 1);
}

}  // namespace

void ReadMetafile(TZmLoadCall& call, const TMetafileImport& import) {
    if (!ReadImage(call, import)) {
        *call.progress.Aborting = true;
    }
}

}  // namespace zm
