// The bitmap's members for the clipboard, and how it is opened.

#include <chrono>
#include <cstring>
#include <new>
#include <thread>
#include <vector>

#include "engine/bitmap/zmxBitmaps.h"
#include "engine/foundation/zmnumbers.h"
#include "engine/foundation/zmstreams.h"
#include "engine/io/zmfiletypes.h"
#include "engine/proc/zalmoproc.h"
#include "engine/proc/zmclipboard_p.h"

namespace zm {
namespace {

constexpr int kOpenTries = 10;
constexpr std::chrono::milliseconds kOpenPause{20};
constexpr std::int32_t kSmallestSide = 2;

const platform::TClipboardFormat raw_format = platform::ClipboardFormatNamed(u"ZALMO RAW FORMAT");
const platform::TClipboardFormat layer_format =
    platform::ClipboardFormatNamed(u"ZALMO LAYER FORMAT");

bool PutBytes(platform::TClipboard& clipboard, platform::TClipboardFormat format,
              const std::vector<std::uint8_t>& bytes) {
    return clipboard.SetBlock(format, static_cast<std::int64_t>(bytes.size()),
                              [&](std::span<std::uint8_t> block) {
                                  std::memcpy(block.data(), bytes.data(), bytes.size());
                                  return true;
                              });
}

bool PutDib(platform::TClipboard& clipboard, TZmBitmap& bitmap, std::int32_t dpi_x,
            std::int32_t dpi_y) {
    try {
        return PutBytes(clipboard, platform::kClipboardDib, bitmap.CreateDIB(dpi_x, dpi_y));
    } catch (const std::bad_alloc&) {
        return false;
    }
}

bool PutRaw(platform::TClipboard& clipboard, TZmBitmap& bitmap) {
    return clipboard.SetBlock(
        ClipboardRawFormat(), bitmap.CalcRAWSize(), [&](std::span<std::uint8_t> block) {
            return bitmap.SaveRAWToBufferOrStream(block.data(),
                                                  static_cast<std::int64_t>(block.size()), nullptr,
                                                  /*StreamHasSize=*/false);
        });
}

bool PutPng(platform::TClipboard& clipboard, TZmBitmap& bitmap) {
    TMemoryStream stream;
    return bitmap.Write(&stream, ioPNG, /*params=*/nullptr) &&
           PutBytes(clipboard, ClipboardPngFormat(), stream.Bytes());
}

bool HasTransparency(TZmBitmap& bitmap) {
    TZmBitmap* const plane = bitmap.GetAlphaChannelRaw();
    if (plane == nullptr) {
        return false;
    }
    plane->SyncFull();
    return !plane->GetFull();
}

}  // namespace

platform::TClipboardFormat ClipboardRawFormat() {
    return raw_format;
}

platform::TClipboardFormat ClipboardLayerFormat() {
    return layer_format;
}

platform::TClipboardFormat ClipboardPngFormat() {
    static const platform::TClipboardFormat format = platform::ClipboardFormatNamed(u"PNG");
    return format;
}

std::unique_ptr<platform::TClipboard> OpenClipboardPatiently() {
    for (int tries = 1;; ++tries) {
        auto clipboard = platform::TClipboard::Open();
        if (clipboard != nullptr || tries == kOpenTries) {
            return clipboard;
        }
        std::this_thread::sleep_for(kOpenPause);
    }
}

/// Puts there, in this order: the device-independent bitmap, which has no alpha, at the given
/// dots per inch; with `IncludeZalmoFormat` the raw form; with `IncludePNGFormat`, and only for
/// an image with transparent pixels, a PNG file. When the first cannot be made the clipboard is
/// left empty; when one of the others cannot, what could be set stays, and the result is False
/// all the same: who pastes would miss the alpha.
bool TZmBitmapSurface::CopyToClipboard(bool IncludeZalmoFormat, bool IncludePNGFormat,
                                       std::int32_t DpiX, std::int32_t DpiY) {
    auto& bitmap = static_cast<TZmBitmap&>(*this);
    if (bitmap.GetWidth() < kSmallestSide || bitmap.GetHeight() < kSmallestSide) {
        return false;
    }
    const auto clipboard = OpenClipboardPatiently();
    if (clipboard == nullptr || !clipboard->Empty() || !PutDib(*clipboard, bitmap, DpiX, DpiY)) {
        return false;
    }
    bool is_complete = true;
    if (IncludeZalmoFormat) {
        is_complete = PutRaw(*clipboard, bitmap);
    }
    if (IncludePNGFormat && HasTransparency(bitmap)) {
        is_complete = PutPng(*clipboard, bitmap) && is_complete;
    }
    return clipboard->Close() && is_complete;
}

bool TZmBitmapSurface::PasteFromClipboard() {
    TZalmoProc proc(static_cast<TZmBitmap*>(this));
    return proc.PasteFromClipboard(/*stretch=*/true, /*merge_alpha=*/true);
}

}  // namespace zm
