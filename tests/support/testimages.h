#pragma once

#include <cstdint>
#include <memory>

#include "engine/bitmap/zmxBitmaps.h"

/// Pictures for tests and their comparison. All pictures are the same on every run and target.
namespace zm::test {

/// A picture whose channels rise along x, along y and along both, each pixel of a small picture
/// differing from its neighbours. zm8p gets a palette of 256 different colours; zm32f runs from
/// 0 to 1; the alpha byte of zm32RGB varies. Without room the result is empty.
std::unique_ptr<TZmBitmap> MakeGradient(TZmPixelFormat format, std::int32_t width,
                                        std::int32_t height);

/// Evenly distributed noise in all channels (finite floats of 0 to 1 in zm32f) from a seed.
std::unique_ptr<TZmBitmap> MakeNoise(TZmPixelFormat format, std::int32_t width, std::int32_t height,
                                     std::uint32_t seed);

/// Gives the bitmap an alpha plane of noise; about one value in three is 255, one in three 0.
void AddNoiseAlpha(TZmBitmap& bitmap, std::uint32_t seed);

/// Value of a channel in memory order (zm24RGB: 0 blue; zm48RGB: 0 red); signed for a and b of
/// zmCIELab. The alpha of zm32RGB is channel 3.
double ChannelValue(TZmBitmap& bitmap, std::int32_t x, std::int32_t y, std::int32_t channel);

/// Fails the test at the first pixel that differs and tells x, y, channel and both values. Size
/// and format have to agree; zm8p pixels are compared by index and, for indexes in use, by
/// colour. Alpha planes are not looked at.
void ExpectSamePixels(TZmBitmap& expected, TZmBitmap& actual);

/// Both without a plane, or planes with the same pixels.
void ExpectSameAlpha(TZmBitmap& expected, TZmBitmap& actual);

}  // namespace zm::test
