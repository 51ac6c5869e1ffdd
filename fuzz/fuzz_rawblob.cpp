// Any bytes as the raw form of a bitmap and as a packed device-independent one: a refusal leaves
// the bitmap as it was, and what is taken comes back from the bytes that are written of it.

#include <cstddef>
#include <cstdint>
#include <cstdlib>
#include <vector>

#include "engine/bitmap/zmxBitmaps.h"
#include "engine/foundation/zmstreams.h"

namespace {

constexpr std::size_t kMaxInputBytes = 1 << 16;

void Require(bool holds) {
    if (!holds) {
        std::abort();
    }
}

/// Whether a bitmap that refused its input still is what it was.
bool IsUntouched(zm::TZmBitmap& bitmap) {
    return bitmap.GetWidth() == 2 && bitmap.GetHeight() == 2 &&
           bitmap.GetPixelFormat() == zm::zm8g && bitmap.GetPixels_zm8(1, 1) == 77 &&
           !bitmap.HasAlphaChannel();
}

std::vector<std::uint8_t> Save(zm::TZmBitmap& bitmap) {
    std::vector<std::uint8_t> blob(static_cast<std::size_t>(bitmap.CalcRAWSize()));
    Require(bitmap.SaveRAWToBufferOrStream(blob.data(), static_cast<std::int64_t>(blob.size()),
                                           nullptr, false));
    return blob;
}

void LoadRaw(const std::uint8_t* data, std::int64_t size) {
    zm::TZmBitmap bitmap(2, 2, zm::zm8g);
    bitmap.Fill(77.0);
    zm::TBorrowedMemoryStream stream(data, size);
    const bool is_taken = bitmap.LoadRAWFromBufferOrStream(nullptr, 0, &stream);
    if (!is_taken) {
        Require(IsUntouched(bitmap) && stream.GetPosition() == 0);
        return;
    }
    const std::vector<std::uint8_t> blob = Save(bitmap);
    zm::TZmBitmap copy;
    Require(copy.LoadRAWFromBufferOrStream(blob.data(), static_cast<std::int64_t>(blob.size()),
                                           nullptr));
    Require(Save(copy) == blob);
}

void TakeDib(const std::uint8_t* data, std::int64_t size) {
    zm::TZmBitmap bitmap(2, 2, zm::zm8g);
    bitmap.Fill(77.0);
    if (!bitmap.CopyFromDIB(data, size)) {
        Require(IsUntouched(bitmap));
        return;
    }
    const std::vector<std::uint8_t> dib = bitmap.CreateDIB(96, 96);
    zm::TZmBitmap copy;
    Require(copy.CopyFromDIB(dib.data(), static_cast<std::int64_t>(dib.size())));
    Require(copy.CreateDIB(96, 96) == dib);
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size) {
    if (size > kMaxInputBytes) {
        return 0;
    }
    LoadRaw(data, static_cast<std::int64_t>(size));
    TakeDib(data, static_cast<std::int64_t>(size));
    return 0;
}
