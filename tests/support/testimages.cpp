#include "tests/support/testimages.h"

#include <gtest/gtest.h>

#include <cstring>

namespace zm::test {
namespace {

/// A linear congruential generator; its upper bits are good enough for noise.
class TNoise {
public:
    explicit TNoise(std::uint32_t seed) : state_(seed * 2654435761u + 12345u) {}
    std::uint32_t Next() {
        state_ = state_ * 1664525u + 1013904223u;
        return state_ >> 16;
    }

private:
    std::uint32_t state_;
};

void SetTestPalette(TZmBitmap& bitmap) {
    for (std::int32_t i = 0; i < 256; ++i) {
        const auto byte = static_cast<std::uint8_t>(i);
        bitmap.SetPalette(
            i, TRGB{static_cast<std::uint8_t>(255 - i), byte, static_cast<std::uint8_t>(i * 7)});
    }
}

/// Writes one channel; `value` has 16 bits and is scaled down to the channel's depth.
void SetChannel(TZmBitmap& bitmap, std::int32_t x, std::int32_t y, std::int32_t channel,
                std::uint32_t value) {
    std::uint8_t* row = bitmap.GetScanLine(y);
    const auto column = static_cast<std::size_t>(x);
    const auto index = static_cast<std::size_t>(channel);
    switch (bitmap.GetPixelFormat()) {
        case zm1g: bitmap.SetPixels_zm1g(x, y, value >= 32768); break;
        case zm16g: bitmap.SetPixels_zm16g(x, y, static_cast<std::uint16_t>(value)); break;
        case zm32f: bitmap.SetPixels_zm32f(x, y, static_cast<float>(value) / 65535.0f); break;
        case zm48RGB: {
            const auto word = static_cast<std::uint16_t>(value);
            std::memcpy(row + column * 6 + index * 2, &word, 2);
            break;
        }
        default: {
            const auto channels = static_cast<std::size_t>(bitmap.GetChannelCount());
            row[column * channels + index] = static_cast<std::uint8_t>(value >> 8);
        }
    }
}

std::unique_ptr<TZmBitmap> MakeEmptyPicture(TZmPixelFormat format, std::int32_t width,
                                            std::int32_t height) {
    auto bitmap = std::make_unique<TZmBitmap>();
    if (bitmap->Allocate(width, height, format)) {
        bitmap->Fill(0.0);
        if (format == zm8p) {
            SetTestPalette(*bitmap);
        }
    }
    return bitmap;
}

std::uint32_t GradientValue(std::int32_t x, std::int32_t y, std::int32_t channel) {
    const auto column = static_cast<std::uint32_t>(x);
    const auto line = static_cast<std::uint32_t>(y);
    switch (channel) {
        case 0: return (column * 1799 + line * 257) & 65535u;
        case 1: return (line * 2313 + column * 771) & 65535u;
        case 2: return ((column + line) * 1285 + 8192) & 65535u;
        default: return (65535 - column * 1028 - line * 514) & 65535u;
    }
}

template <typename Source>
std::unique_ptr<TZmBitmap> MakePicture(TZmPixelFormat format, std::int32_t width,
                                       std::int32_t height, Source&& source) {
    auto bitmap = MakeEmptyPicture(format, width, height);
    const std::int32_t channels = bitmap->IsEmpty() ? 0 : bitmap->GetChannelCount();
    for (std::int32_t y = 0; y < height && channels > 0; ++y) {
        for (std::int32_t x = 0; x < width; ++x) {
            for (std::int32_t channel = 0; channel < channels; ++channel) {
                SetChannel(*bitmap, x, y, channel, source(x, y, channel));
            }
        }
    }
    return bitmap;
}

}  // namespace

std::unique_ptr<TZmBitmap> MakeGradient(TZmPixelFormat format, std::int32_t width,
                                        std::int32_t height) {
    return MakePicture(format, width, height, GradientValue);
}

std::unique_ptr<TZmBitmap> MakeNoise(TZmPixelFormat format, std::int32_t width, std::int32_t height,
                                     std::uint32_t seed) {
    TNoise noise(seed);
    return MakePicture(format, width, height,
                       [&noise](std::int32_t, std::int32_t, std::int32_t) { return noise.Next(); });
}

void AddNoiseAlpha(TZmBitmap& bitmap, std::uint32_t seed) {
    TNoise noise(seed);
    TZmBitmap* plane = bitmap.GetAlphaChannel();
    for (std::int32_t y = 0; y < plane->GetHeight(); ++y) {
        for (std::int32_t x = 0; x < plane->GetWidth(); ++x) {
            const std::uint32_t kind = noise.Next() % 3;
            const auto value = static_cast<std::uint8_t>(noise.Next());
            const std::uint8_t alpha = kind == 0   ? std::uint8_t{255}
                                       : kind == 1 ? std::uint8_t{0}
                                                   : value;
            plane->SetPixels_zm8(x, y, alpha);
        }
    }
    plane->SyncFull();
}

double ChannelValue(TZmBitmap& bitmap, std::int32_t x, std::int32_t y, std::int32_t channel) {
    const auto index = static_cast<std::size_t>(channel);
    switch (bitmap.GetPixelFormat()) {
        case zm1g: return bitmap.GetPixels_zm1g(x, y) ? 1 : 0;
        case zm16g: return bitmap.GetPixels_zm16g(x, y);
        case zm32f: return static_cast<double>(bitmap.GetPixels_zm32f(x, y));
        case zm48RGB: {
            const TRGB48 pixel = bitmap.GetPixels_zm48RGB(x, y);
            return channel == 0 ? pixel.r : channel == 1 ? pixel.g : pixel.b;
        }
        default: break;
    }
    const auto channels = static_cast<std::size_t>(bitmap.GetChannelCount());
    const std::uint8_t byte = bitmap.GetScanLine(y)[static_cast<std::size_t>(x) * channels + index];
    const bool is_signed = bitmap.GetPixelFormat() == zmCIELab && channel > 0;
    return is_signed ? static_cast<double>(static_cast<std::int8_t>(byte)) : byte;
}

namespace {

bool SameChannel(double expected, double actual) {
    return std::memcmp(&expected, &actual, sizeof expected) == 0 || expected == actual;
}

/// False, and a failed expectation, at the first difference in a pixel.
bool ExpectSamePixel(TZmBitmap& expected, TZmBitmap& actual, std::int32_t x, std::int32_t y,
                     std::int32_t channels) {
    for (std::int32_t channel = 0; channel < channels; ++channel) {
        const double want = ChannelValue(expected, x, y, channel);
        const double got = ChannelValue(actual, x, y, channel);
        if (!SameChannel(want, got)) {
            ADD_FAILURE() << PixelFormatInfo(expected.GetPixelFormat()).name
                          << ": first difference at x " << x << ", y " << y << ", channel "
                          << channel << ": expected " << want << ", got " << got;
            return false;
        }
    }
    if (expected.GetPixelFormat() == zm8p &&
        !(expected.GetPixels(x, y) == actual.GetPixels(x, y))) {
        ADD_FAILURE() << "palettes differ at index " << ChannelValue(expected, x, y, 0)
                      << ", used at x " << x << ", y " << y;
        return false;
    }
    return true;
}

}  // namespace

void ExpectSamePixels(TZmBitmap& expected, TZmBitmap& actual) {
    ASSERT_EQ(expected.GetWidth(), actual.GetWidth());
    ASSERT_EQ(expected.GetHeight(), actual.GetHeight());
    ASSERT_EQ(PixelFormatInfo(expected.GetPixelFormat()).name,
              PixelFormatInfo(actual.GetPixelFormat()).name);
    const std::int32_t width = expected.GetWidth();
    const std::int32_t height = expected.GetHeight();
    const std::int32_t channels = expected.IsEmpty() ? 0 : expected.GetChannelCount();
    for (std::int32_t y = 0; y < height && channels > 0; ++y) {
        for (std::int32_t x = 0; x < width; ++x) {
            if (!ExpectSamePixel(expected, actual, x, y, channels)) {
                return;
            }
        }
    }
}

void ExpectSameAlpha(TZmBitmap& expected, TZmBitmap& actual) {
    ASSERT_EQ(expected.HasAlphaChannel(), actual.HasAlphaChannel());
    if (expected.HasAlphaChannel()) {
        SCOPED_TRACE("alpha plane");
        ExpectSamePixels(*expected.GetAlphaChannelRaw(), *actual.GetAlphaChannelRaw());
    }
}

}  // namespace zm::test
