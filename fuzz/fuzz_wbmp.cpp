// Any bytes as a wireless bitmap; what loads is written and read again.

#include <cstddef>
#include <cstdint>
#include <cstdlib>

#include "engine/bitmap/zmxBitmaps.h"
#include "engine/codecs/wbmpfilt.h"
#include "engine/foundation/zmstreams.h"
#include "engine/io/zmimagelimits.h"
#include "engine/io/zmioparams.h"

namespace {

bool LowerLimits() {
    zm::ZmImageLimits().free_bytes = 4 << 20;
    zm::ZmImageLimits().bytes_per_file_byte = 64;
    return true;
}

bool Load(zm::TStream& stream, zm::TZmBitmap& bitmap, bool params_only) {
    zm::TIOParams params;
    bool aborting = false;
    zm::TProgressRec progress;
    progress.Aborting = &aborting;
    zm::ReadWBMPStream(stream, bitmap, params, params_only, progress);
    return !aborting;
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size) {
    constexpr std::size_t kMaxInputBytes = 1 << 16;
    static const bool has_limits = LowerLimits();
    if (!has_limits || size > kMaxInputBytes) {
        return 0;
    }
    zm::TBorrowedMemoryStream stream(data, static_cast<std::int64_t>(size));
    zm::TZmBitmap bitmap;
    Load(stream, bitmap, /*params_only=*/true);
    stream.SetPosition(0);
    if (!Load(stream, bitmap, /*params_only=*/false)) {
        return 0;
    }
    zm::TMemoryStream output;
    bool aborting = false;
    zm::TProgressRec progress;
    progress.Aborting = &aborting;
    zm::WriteWBMPStream(output, bitmap, progress);
    output.SetPosition(0);
    zm::TZmBitmap again;
    if (aborting || !Load(output, again, /*params_only=*/false)) {
        std::abort();
    }
    return 0;
}
