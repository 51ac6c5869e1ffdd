// Any bytes as a PNG file: parameters only, default and native pixels; what loads is written
// again.

#include <cstddef>
#include <cstdint>

#include "engine/bitmap/zmxBitmaps.h"
#include "engine/codecs/pngfilt.h"
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

void Load(const std::uint8_t* data, std::size_t size, bool native, bool params_only) {
    zm::TBorrowedMemoryStream stream(data, static_cast<std::int64_t>(size));
    zm::TZmBitmap bitmap;
    zm::TIOParams params;
    params.fNativePixelFormat = native;
    bool aborting = false;
    zm::TProgressRec progress;
    progress.Aborting = &aborting;
    zm::ReadPNGStream(stream, bitmap, params, params_only, progress);
    if (aborting || params_only) {
        return;
    }
    zm::TMemoryStream output;
    zm::WritePNGStreamWithAlpha(output, bitmap, params, progress);
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size) {
    static const bool has_limits = LowerLimits();
    if (!has_limits || size > kMaxInputBytes) {
        return 0;
    }
    Load(data, size, /*native=*/false, /*params_only=*/true);
    Load(data, size, /*native=*/false, /*params_only=*/false);
    Load(data, size, /*native=*/true, /*params_only=*/false);
    return 0;
}
