#pragma once

#include <cstdint>

#include "engine/bitmap/zmbitmapmemory_p.h"
#include "engine/bitmap/zmxBitmaps.h"
#include "engine/foundation/zmsettings.h"

/// Means to force the place of a bitmap's pixels.
namespace zm::test {

inline constexpr TZmPixelFormat kAllFormats[] = {zm1g,  zm8p,   zm8g,    zm16g,    zm24RGB,
                                                 zm32f, zmCMYK, zm48RGB, zmCIELab, zm32RGB};
inline constexpr TZmPixelFormat kTBitmapFormats[] = {zm1g, zm8p, zm8g, zm24RGB, zm32RGB};

/// Refuses larger blocks while it lives; a negative limit refuses none.
class TBlockLimit {
public:
    explicit TBlockLimit(std::int64_t bytes) { SetLargestBitmapBlock(bytes); }
    ~TBlockLimit() { SetLargestBitmapBlock(-1); }
    TBlockLimit(const TBlockLimit&) = delete;
    TBlockLimit& operator=(const TBlockLimit&) = delete;
};

/// Changes a field of the settings while it lives.
template <typename T>
class TSettingGuard {
public:
    TSettingGuard(T& field, T value) : field_(field), saved_(field) { field_ = value; }
    ~TSettingGuard() { field_ = saved_; }
    TSettingGuard(const TSettingGuard&) = delete;
    TSettingGuard& operator=(const TSettingGuard&) = delete;

private:
    T& field_;
    T saved_;
};

enum TPlace { kInMemory, kInFragments, kInFile, kInTBitmap };

/// While it lives, bitmaps of the format and about the size go to a place, and so do whatever
/// planes and helpers an operation makes: beyond a quarter of the bitmap no block is to be had,
/// or no bitmap is too small for the disk.
class TForcedPlace {
public:
    TForcedPlace(TPlace place, TZmPixelFormat format, std::int32_t width, std::int32_t height)
        : place_(place),
          limit_(place == kInFragments ? QuarterBytes(format, width, height) : -1),
          file_size_(ZmGlobalSettings().fDefMinFileSize,
                     place == kInFile ? std::int64_t{0} : std::int64_t{1} << 40) {}

    /// Makes an empty bitmap a copy of the source, in the place.
    void Copy(TZmBitmap& source, TZmBitmap& bitmap) const {
        if (place_ == kInTBitmap) {
            bitmap.SetLocation(zmTBitmap);
        }
        bitmap.AssignImage(&source);
    }
    bool Holds(const TZmBitmap& bitmap) const {
        const TZmLocation location = place_ == kInFile      ? zmFile
                                     : place_ == kInTBitmap ? zmTBitmap
                                                            : zmMemory;
        return bitmap.GetLocation() == location &&
               (bitmap.GetFragmentsCount() > 0) == (place_ == kInFragments);
    }

private:
    static std::int64_t QuarterBytes(TZmPixelFormat format, std::int32_t width,
                                     std::int32_t height) {
        const std::int64_t row_bytes = (width * PixelFormatInfo(format).bit_count + 31) / 32 * 4;
        return row_bytes * ((height + 3) / 4);
    }

    TPlace place_;
    TBlockLimit limit_;
    TSettingGuard<std::int64_t> file_size_;
};

}  // namespace zm::test
