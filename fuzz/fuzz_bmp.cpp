// Any bytes as a bitmap file: parameters only, default and native pixels, with and without alpha,
// without the file header; what loads is written again in each depth.

#include <cstddef>
#include <cstdint>

#include "engine/bitmap/zmmask.h"
#include "engine/bitmap/zmxBitmaps.h"
#include "engine/codecs/bmpfilt.h"
#include "engine/foundation/zmstreams.h"
#include "engine/io/zmimagelimits.h"
#include "engine/io/zmioparams.h"

namespace {

constexpr std::size_t kMaxInputBytes = 1 << 16;
constexpr std::int64_t kMaxPixelsToWrite = 1 << 14;

bool LowerLimits() {
    zm::ZmImageLimits().free_bytes = 4 << 20;
    zm::ZmImageLimits().bytes_per_file_byte = 64;
    return true;
}

void WriteAll(zm::TZmBitmap& bitmap, zm::TIOParams& params) {
    if (bitmap.IsEmpty() ||
        std::int64_t{bitmap.GetWidth()} * bitmap.GetHeight() > kMaxPixelsToWrite) {
        return;
    }
    for (const std::int32_t bits : {1, 4, 8}) {
        for (const std::int32_t samples : {1, 3}) {
            zm::TMemoryStream output;
            bool aborting = false;
            zm::TProgressRec progress;
            progress.Aborting = &aborting;
            params.fBitsPerSample = bits;
            params.fSamplesPerPixel = samples;
            zm::WriteBMPStream(output, bitmap, params, /*handle_transparency=*/true, progress);
        }
    }
}

struct TMode {
    bool native;
    bool ignore_alpha;
    bool no_file_header;
    bool params_only;
};

void Load(const std::uint8_t* data, std::size_t size, const TMode& mode) {
    zm::TBorrowedMemoryStream stream(data, static_cast<std::int64_t>(size));
    zm::TZmBitmap bitmap;
    zm::TZmMask alpha;
    zm::TIOParams params;
    params.fNativePixelFormat = mode.native;
    bool aborting = false;
    zm::TProgressRec progress;
    progress.Aborting = &aborting;
    zm::ReadBMPStream(stream, bitmap, 0, mode.ignore_alpha, alpha, mode.no_file_header,
                      mode.params_only, progress, params);
    if (aborting || mode.params_only) {
        return;
    }
    if (alpha.GetWidth() > 0) {
        bitmap.CopyFromTZmMask(alpha);
    }
    WriteAll(bitmap, params);
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size) {
    static const bool has_limits = LowerLimits();
    if (!has_limits || size > kMaxInputBytes) {
        return 0;
    }
    Load(data, size,
         {.native = false, .ignore_alpha = false, .no_file_header = false, .params_only = false});
    Load(data, size,
         {.native = true, .ignore_alpha = true, .no_file_header = false, .params_only = false});
    Load(data, size,
         {.native = false, .ignore_alpha = false, .no_file_header = true, .params_only = false});
    Load(data, size,
         {.native = false, .ignore_alpha = false, .no_file_header = false, .params_only = true});
    return 0;
}
