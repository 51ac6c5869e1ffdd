// Any bytes as a metafile; what loads is played on a small picture, once larger and mirrored.

#include <cstddef>
#include <cstdint>

#include "engine/bitmap/zmplatformbitmap.h"
#include "engine/canvas/zmgdiplus.h"
#include "engine/foundation/zmstreams.h"

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size) {
    constexpr std::size_t kMaxInputBytes = 1 << 16;
    constexpr std::int32_t kSide = 48;
    if (size > kMaxInputBytes) {
        return 0;
    }
    zm::TBorrowedMemoryStream stream(data, static_cast<std::int64_t>(size));
    zm::TBitmap bitmap;
    if (!bitmap.SetSize(kSide, kSide, zm::pf32bit)) {
        return 0;
    }
    zm::TCanvas canvas(bitmap);
    zm::TZmCanvas drawing(canvas, /*AntiAlias=*/true, /*UseGDIPlus=*/true, &bitmap);
    const zm::TZmMetafile metafile(stream);
    drawing.Draw(metafile, 4, 4, kSide - 8, kSide - 8);
    drawing.Draw(metafile, kSide, 0, -4 * kSide, 4 * kSide);
    drawing.Flush();
    return 0;
}
