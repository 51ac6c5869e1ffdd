// Any bytes as a JPEG file: parameters only, default and native pixels, a scaled load, always with
// the picture turned upright; what loads is written again.

#include <cstddef>
#include <cstdint>
#include <cstdlib>

#include "engine/bitmap/zmxBitmaps.h"
#include "engine/codecs/jpegfilt.h"
#include "engine/foundation/zmstreams.h"
#include "engine/io/zmimagelimits.h"
#include "engine/io/zmioparams.h"

namespace {

constexpr std::size_t kMaxInputBytes = 1 << 16;

bool LowerLimits() {
    zm::ZmImageLimits().free_bytes = 8 << 20;
    zm::ZmImageLimits().bytes_per_file_byte = 32;
    return true;
}

void Load(const std::uint8_t* data, std::size_t size, const zm::TJpegReadOptions& options,
          zm::TIOJPEGScale scale) {
    zm::TBorrowedMemoryStream stream(data, static_cast<std::int64_t>(size));
    zm::TZmBitmap bitmap;
    zm::TIOParams params;
    params.fJPEG_Scale = scale;
    params.fJPEG_EnableAdjustOrientation = true;
    bool aborting = false;
    zm::TProgressRec progress;
    progress.Aborting = &aborting;
    zm::ReadJPEGStream(stream, bitmap, options, progress, params);
    if (aborting || options.params_only) {
        return;
    }
    zm::TMemoryStream output;
    zm::WriteJPEGStream(output, bitmap, params, progress);
}

/// An exchanged file takes the same exchange once more.
void Exchange(const std::uint8_t* data, std::size_t size, zm::TJpegBlock block) {
    constexpr std::uint8_t kBlock[] = {'E', 'x', 'i', 'f', 0, 0, 'M', 'M'};
    zm::TBorrowedMemoryStream stream(data, static_cast<std::int64_t>(size));
    zm::TMemoryStream output;
    if (!zm::ExchangeJpegBlock(stream, output, block, kBlock)) {
        return;
    }
    output.SetPosition(0);
    zm::TMemoryStream again;
    if (!zm::ExchangeJpegBlock(output, again, block, kBlock)) {
        std::abort();
    }
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size) {
    static const bool has_limits = LowerLimits();
    if (!has_limits || size > kMaxInputBytes) {
        return 0;
    }
    Exchange(data, size, zm::kJpegBlockIptc);
    Exchange(data, size, zm::kJpegBlockExif);
    zm::TJpegReadOptions options;
    Load(data, size, options, zm::ioJPEG_FULLSIZE);
    Load(data, size, options, zm::ioJPEG_EIGHTH);
    options.native_format = true;
    Load(data, size, options, zm::ioJPEG_FULLSIZE);
    options.params_only = true;
    Load(data, size, options, zm::ioJPEG_FULLSIZE);
    return 0;
}
