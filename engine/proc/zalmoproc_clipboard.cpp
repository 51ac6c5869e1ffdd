// Pasting: what is on the clipboard comes from anywhere. Each form is read into a bitmap of its
// own, so that a damaged block changes nothing.

#include <algorithm>
#include <cstdint>
#include <memory>
#include <new>
#include <span>

#include "engine/io/zalmoio.h"
#include "engine/io/zmfiletypes.h"
#include "engine/io/zmimagelimits.h"
#include "engine/proc/zalmoproc.h"
#include "engine/proc/zmclipboard_p.h"
#include "engine/proc/zmresample_p.h"

namespace zm {
namespace {

using TBlock = std::span<const std::uint8_t>;

std::int64_t SizeOf(TBlock block) {
    return static_cast<std::int64_t>(block.size());
}

bool LoadRaw(TBlock block, TZmBitmap& picture) {
    return picture.LoadRAWFromBufferOrStream(block.data(), SizeOf(block), nullptr);
}

/// By the driver, as a file of the type.
template <std::int32_t kFileType>
bool LoadFileOf(TBlock block, TZmBitmap& picture) {
    return TZalmoIO::CreateFromBitmap(&picture)->LoadFromBuffer(block.data(), SizeOf(block),
                                                                kFileType) &&
           !picture.IsEmpty();
}

bool LoadDib(TBlock block, TZmBitmap& picture) {
    return picture.CopyFromDIB(block.data(), SizeOf(block));
}

struct TPasteForm {
    platform::TClipboardFormat format;
    bool (*load)(TBlock block, TZmBitmap& picture);
};

/// The first picture that can be read, or nil. Its place settings are those of `owner`.
std::unique_ptr<TZmBitmap> ReadPicture(platform::TClipboard& clipboard, TZmBitmap& owner) {
    const TPasteForm forms[] = {
        {ClipboardRawFormat(), LoadRaw},
        {ClipboardPngFormat(), LoadFileOf<ioPNG>},
        {platform::kClipboardDib, LoadDib},
        {platform::kClipboardEnhMetafile, LoadFileOf<ioEMF>},
    };
    for (const TPasteForm& form : forms) {
        if (!clipboard.IsAvailable(form.format)) {
            continue;
        }
        auto picture = std::make_unique<TZmBitmap>();
        TakePlaceSettings(owner, *picture);
        const auto load = [&](TBlock block) { return form.load(block, *picture); };
        if (clipboard.UseBlock(form.format, ZmImageLimits().free_bytes, load)) {
            return picture;
        }
    }
    return nullptr;
}

}  // namespace

void TZalmoProc::PasteIntoSelection(TZmBitmap& picture, bool stretch, bool merge_alpha) {
    std::int32_t x1 = 0;
    std::int32_t y1 = 0;
    std::int32_t x2 = 0;
    std::int32_t y2 = 0;
    TZmBitmap* target = nullptr;
    TZmMask* mask = nullptr;
    if (!BeginImageProcessing(TZmPixelFormatSet(zm24RGB), x1, y1, x2, y2, u"Paste", target, mask,
                              kOperationNone)) {
        return;
    }
    const std::int32_t width = stretch ? x2 - x1 : std::min(x2 - x1, picture.GetWidth());
    const std::int32_t height = stretch ? y2 - y1 : std::min(y2 - y1, picture.GetHeight());
    picture.RenderToTZmBitmapEx(
        target, x1, y1, width, height, 0, 0, stretch ? picture.GetWidth() : width,
        stretch ? picture.GetHeight() : height, merge_alpha, 255, rfFastLinear, zmlNormal, 1.0);
    EndImageProcessing(target, mask);
}

bool TZalmoProc::PasteFromClipboard(bool stretch, bool merge_alpha) {
    RequireBitmap();
    std::unique_ptr<TZmBitmap> picture;
    {
        const auto clipboard = OpenClipboardPatiently();
        if (clipboard != nullptr) {
            picture = ReadPicture(*clipboard, *fZmBitmap);
        }
    }
    if (picture == nullptr) {
        return false;
    }
    if (!fZmBitmap->IsEmpty() && (fSelected || fSelectionMask != nullptr)) {
        PasteIntoSelection(*picture, stretch, merge_alpha);
        return true;
    }
    if (fAutoUndo) {
        SaveUndo(u"Paste", zmuImage, /*clear_redo=*/true, kOperationNone);
    }
    fZmBitmap->TakeOver(*picture);
    Update();
    return !fZmBitmap->IsEmpty();
}

}  // namespace zm
