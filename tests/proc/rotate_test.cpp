// Rotation: hand-worked values of each engine, fast forms against the plain ones, the choice of
// the engine, alpha in step, and what must leave an image as it was.

#include <gtest/gtest.h>

#include <array>
#include <cmath>
#include <cstring>
#include <iterator>
#include <limits>
#include <stdexcept>

#include "engine/bitmap/zmbitmapmemory_p.h"
#include "engine/foundation/zmsettings.h"
#include "engine/proc/zalmoproc.h"
#include "engine/proc/zmrotate.h"
#include "engine/proc/zmrotate_p.h"
#include "tests/proc/resample_support.h"
#include "tests/support/testimages.h"

namespace zm::test {
namespace {

constexpr TColor kWhite = 0xFFFFFF;

TMatrix Turned(const TMatrix& values, TZmPixelFormat format, double angle) {
    const auto image = GrayPicture(format, values);
    image->Rotate(angle, zmrBilinear, kWhite);
    return ValuesOf(*image);
}

// Hand-worked values.

TEST(RotateQuarters, PositiveAnglesTurnCounterClockwise) {
    const TMatrix picture{{1, 2, 3}, {4, 5, 6}};
    const TMatrix left{{3, 6}, {2, 5}, {1, 4}};
    const TMatrix half{{6, 5, 4}, {3, 2, 1}};
    const TMatrix right{{4, 1}, {5, 2}, {6, 3}};
    for (const TZmPixelFormat format : {zm8g, zm16g}) {
        EXPECT_EQ(Turned(picture, format, 90), left);
        EXPECT_EQ(Turned(picture, format, -270), left);
        EXPECT_EQ(Turned(picture, format, 450), left);
        EXPECT_EQ(Turned(picture, format, 180), half);
        EXPECT_EQ(Turned(picture, format, -180), half);
        EXPECT_EQ(Turned(picture, format, 270), right);
        EXPECT_EQ(Turned(picture, format, -90), right);
        EXPECT_EQ(Turned(picture, format, 360), picture);
    }
    for (const TZmAntialiasMode mode : {zmrNone, zmrFast, zmrBilinear, zmrBicubic}) {
        const auto color = ColorPicture(picture);
        color->Rotate(90, mode, kWhite);
        EXPECT_EQ(ValuesOf(*color), left) << "mode " << int{mode};
    }
}

TEST(RotateInverseFilter, HandWorkedHalfRightAngle) {
    // Three pixels in a row turned by 45 degrees fill 2 by 2. Positions in the source: (1, -0.71),
    // (1.71, 0); (0.29, 0), (1, 0.71).
    const auto row = ColorPicture({{10, 20, 30}});
    TZmBitmap target;
    ASSERT_TRUE(RotateInverse(*row, target, 45, zmrBilinear, kWhite, kNobody));
    // 255 + (20 - 255) * 0.29 = 186.2; 20 + 10 * 0.71 = 27.1; 10 + 10 * 0.29 = 12.9.
    EXPECT_EQ(ValuesOf(target), (TMatrix{{186, 27}, {12, 186}}));
    // Cubic weights of 0.71: -0.0607, 0.3536, 0.8536, -0.1464, of 0.29 the same backwards:
    // -0.61 + 7.07 + 25.61 - 2.93 = 29.1; -2.93 + 8.54 + 7.07 - 1.82 = 10.9.
    ASSERT_TRUE(RotateInverse(*row, target, 45, zmrBicubic, 0x141414, kNobody));
    EXPECT_EQ(ValuesOf(target), (TMatrix{{20, 29}, {11, 20}}));
    const auto plane = GrayPicture(zm8g, {{10, 20, 30}});
    ASSERT_TRUE(RotateInverse(*plane, target, 45, zmrBilinear, 0, kNobody));
    // Beside the row 0 instead of 255: 20 * 0.29 = 5.9.
    EXPECT_EQ(ValuesOf(target), (TMatrix{{5, 27}, {12, 5}}));
}

TEST(RotateInverseFilter, BackgroundIsAColor) {
    TZmBitmap image(5, 5, zm24RGB);
    image.Fill(0.0);
    image.Rotate(45, zmrBilinear, 0x030201);
    EXPECT_EQ(image.GetPixels_zm24RGB(0, 0), (TRGB{3, 2, 1}));
    EXPECT_EQ(image.GetPixels_zm24RGB(image.GetWidth() / 2, image.GetHeight() / 2), TRGB{});
}

TEST(RotateShears, HandWorkedSinglePixel) {
    // 40 degrees: t = tan 20 = 0.36397, s = sin 40 = 0.64279. Sizes: w1 = Round(2.364) = 2,
    // o2 = Round(0.643) = 1, h2 = Round(3.286) = 3, o3 = Round(0.364) = 0, h3 = 1,
    // w3 = Round(3.364) = 3.
    const auto geometry = FindShearGeometry({1, 1}, 40);
    ASSERT_TRUE(geometry.has_value());
    EXPECT_EQ(geometry->w1, 2);
    EXPECT_EQ(geometry->o2, 1);
    EXPECT_EQ(geometry->o3, 0);
    EXPECT_EQ(geometry->h3, 1);
    EXPECT_EQ(geometry->w3, 3);
    const auto dot = GrayPicture(zm8g, {{200}});
    TZmBitmap target;
    // First shear 200, 0. Column 0 moves by 2 * s = 1.2856 less 1: f = 1169,
    // (200 * 2927 + 2048) / 4096 = 143. Row 0 does not move.
    ASSERT_TRUE(RotateByShears(*dot, target, 40, 0, kNobody));
    EXPECT_EQ(ValuesOf(target), (TMatrix{{143, 0, 0}}));
    // -40: the row moves by t, f = 1490: 127, 73. Column 0 loses its pixel above the edge,
    // column 1 moves by s less 1: the rest of 73 * 2632 / 4096 = 47. Then f = 1490 again: 30, 17.
    ASSERT_TRUE(RotateByShears(*dot, target, -40, 0, kNobody));
    EXPECT_EQ(ValuesOf(target), (TMatrix{{0, 30, 17}}));
}

TEST(RotateShears, AnglesAreHeldToThousandths) {
    const struct {
        double angle;
        TQuarterTurns turns;
        double rest;
    } kCases[] = {{45.0005, 0, 45}, {-45.0009, 0, -45}, {45.001, 1, -44.999}, {-46, 3, 44},
                  {0.0009, 0, 0},   {359, 0, -1},       {-359, 0, 1},         {90.0004, 1, 0},
                  {730.5, 0, 10.5}, {1e300, 0, 0},      {1e306, 0, 0}};
    for (const auto& c : kCases) {
        const TShearAngle split = SplitShearAngle(c.angle);
        if (c.angle < 1e300) {
            EXPECT_EQ(split.turns, c.turns) << c.angle;
            EXPECT_NEAR(split.rest, c.rest, 1e-9) << c.angle;
        }
        EXPECT_LE(std::fabs(split.rest), 45) << c.angle;
    }
    EXPECT_EQ(SplitShearAngle(std::numeric_limits<double>::quiet_NaN()).rest, 0);
    EXPECT_EQ(SplitShearAngle(45.0005).rest, 45.0);
}

TEST(RotateNearestSample, HandWorkedHalfRightAngle) {
    const TMatrix turned{{7, 7, 30}, {7, 20, 7}, {10, 7, 7}};
    for (const TZmPixelFormat format : {zm8g, zm8p, zm16g}) {
        const auto row = GrayPicture(format, {{10, 20, 30}});
        row->Rotate(45, zmrBilinear, 7);
        EXPECT_EQ(row->GetPixelFormat(), format);
        EXPECT_EQ(ValuesOf(*row), turned);
    }
    for (const TColor background : {0, 256}) {
        const auto bits = GrayPicture(zm1g, {{1, 0, 1}});
        bits->Rotate(45, zmrNone, background);
        const int ground = background != 0 ? 1 : 0;
        EXPECT_EQ(ValuesOf(*bits),
                  (TMatrix{{ground, ground, 1}, {ground, 0, ground}, {1, ground, ground}}));
    }
}

// Fast forms against the plain ones.

TEST(RotateFastForms, QuartersOfEveryFormatAndWidth) {
    for (const TZmPixelFormat format : kAllFormats) {
        for (std::int32_t width = 1; width <= 70; ++width) {
            const std::int32_t height = width % 5 == 0 ? 67 + width % 9 : 1 + width * 7 % 20;
            const auto image = MakeNoise(format, width, height, static_cast<unsigned>(width));
            for (const TQuarterTurns turns : {1, 2, 3}) {
                TZmBitmap plain;
                TZmBitmap fast;
                plain.SetBitAlignment(8);
                fast.SetBitAlignment(8);  // rows touch: a byte too many would meet the next row
                ASSERT_TRUE(TurnQuartersPlain(*image, plain, turns));
                ASSERT_TRUE(TurnQuarters(*image, fast, turns));
                ExpectSamePixels(plain, fast);
                const bool is_same =
                    std::memcmp(plain.GetMemory(), fast.GetMemory(),
                                static_cast<std::size_t>(plain.GetRowLen()) *
                                    static_cast<std::size_t>(plain.GetHeight())) == 0;
                ASSERT_TRUE(is_same) << PixelFormatInfo(format).name << ", width " << width
                                     << ", unused bits at the end of rows";
            }
        }
    }
}

/// Plain and fast form of an engine, called with the source, the target, and an angle.
template <typename Formats, typename Angles, typename Plain, typename Fast>
void CompareForms(const Formats& formats, const Angles& angles, const Plain& plain_form,
                  const Fast& fast_form) {
    for (const TZmPixelFormat format : formats) {
        for (std::int32_t width = 1; width <= 70; ++width) {
            const std::int32_t height = 1 + width * 13 % 41;
            const auto image = MakeNoise(format, width, height, static_cast<unsigned>(width));
            const double angle = angles[static_cast<std::size_t>(width) % std::size(angles)];
            TZmBitmap plain;
            TZmBitmap fast;
            ASSERT_TRUE(plain_form(*image, plain, angle));
            ASSERT_TRUE(fast_form(*image, fast, angle));
            SCOPED_TRACE(testing::Message() << width << " by " << height << ", " << angle);
            ExpectSamePixels(plain, fast);
        }
    }
}

/// Angles in every quarter, near whole ones, and large.
constexpr double kAngles[] = {7, -7, 45, -45, 30.5, 60, 89.9, 133, 179.99, -100, 0.01, 1000.3};
constexpr double kRests[] = {7, -7, 45, -45, 30.5, -12.25, 0.001, -0.5, 44.999, -1};
constexpr TColor kSomeColor = 0x3040F0;

TEST(RotateFastForms, EveryEngine) {
    for (const TZmAntialiasMode mode : {zmrBilinear, zmrBicubic}) {
        CompareForms(
            std::array{zm24RGB, zm8g, zm8p}, kAngles,
            [mode](TZmBitmap& source, TZmBitmap& target, double angle) {
                return RotateInversePlain(source, target, angle, mode, kSomeColor, kNobody);
            },
            [mode](TZmBitmap& source, TZmBitmap& target, double angle) {
                return RotateInverse(source, target, angle, mode, kSomeColor, kNobody);
            });
    }
    CompareForms(
        kAllFormats, kAngles,
        [](TZmBitmap& source, TZmBitmap& target, double angle) {
            return RotateNearestPlain(source, target, angle, 1, kNobody);
        },
        [](TZmBitmap& source, TZmBitmap& target, double angle) {
            return RotateNearest(source, target, angle, 1, kNobody);
        });
    CompareForms(
        std::array{zm24RGB, zm8g, zm1g}, kRests,
        [](TZmBitmap& source, TZmBitmap& target, double rest) {
            return RotateByShearsPlain(source, target, rest, kSomeColor, kNobody);
        },
        [](TZmBitmap& source, TZmBitmap& target, double rest) {
            return RotateByShears(source, target, rest, kSomeColor, kNobody);
        });
}

TEST(RotateFastForms, VectorsWriteNothingBeyondTheirPixels) {
    std::vector<std::uint8_t> source(3 * 72, 100);
    const std::uint8_t* const rows[] = {source.data(), source.data(), source.data(), source.data()};
    for (std::int32_t count = 1; count <= 70; ++count) {
        std::vector<double> positions(static_cast<std::size_t>(count), 1.5);
        std::vector<double> zeros(static_cast<std::size_t>(count), 0.25);
        const auto bytes = static_cast<std::size_t>(count) * 3;
        std::vector<std::uint8_t> out(bytes + 2, 77);
        for (const auto& filter : {BilinearRun24, BicubicRun24}) {
            std::fill(out.begin(), out.end(), std::uint8_t{77});
            const std::int32_t pixels =
                filter({positions.data(), zeros.data(), {}, rows + 1, out.data() + 1, count});
            EXPECT_EQ(out.front(), 77) << count;
            EXPECT_EQ(out.back(), 77) << count;
            EXPECT_GE(std::count(out.begin(), out.end(), 100), pixels * 3);
            EXPECT_GE(pixels, count - 5);
        }
        std::fill(out.begin(), out.end(), std::uint8_t{77});
        const std::int32_t done =
            ShearBlocks(source.data(), source.data(), nullptr, 4095, out.data() + 1, count * 3);
        EXPECT_LE(done, count * 3);
        EXPECT_EQ(std::count(out.begin(), out.end(), 100), done);
        EXPECT_EQ(out.back(), 77) << count;
    }
}

TEST(RotateFastForms, MixingIsExactForAllFractions) {
    std::vector<std::uint8_t> before(256);
    std::vector<std::uint8_t> current(256);
    std::vector<std::uint8_t> out(256);
    for (int i = 0; i < 256; ++i) {
        before[static_cast<std::size_t>(i)] = static_cast<std::uint8_t>(i);
    }
    for (const int value : {0, 1, 127, 254, 255}) {
        std::fill(current.begin(), current.end(), static_cast<std::uint8_t>(value));
        for (std::int16_t f = 0; f < 4096; ++f) {
            const std::int32_t done =
                ShearBlocks(before.data(), current.data(), nullptr, f, out.data(), 256);
            for (std::int32_t i = 0; i < done; ++i) {
                const int stated = (i * f + value * (4096 - f) + 2048) / 4096;
                ASSERT_EQ(out[static_cast<std::size_t>(i)], stated)
                    << i << ' ' << value << ' ' << f;
            }
        }
    }
}

TEST(RotateFastForms, ImagesInFilesGiveTheSame) {
    for (const TZmPixelFormat format : {zm24RGB, zm8g, zm1g}) {
        const auto image = MakeNoise(format, 41, 59, 3);
        TZmBitmap filed;
        filed.SetMinFileSize(0);
        filed.AssignEx(image.get(), /*with_params=*/false);
        ASSERT_EQ(filed.GetLocation(), zmFile);
        for (const double angle : {90.0, 180.0, 20.0, -75.0}) {
            for (const TZmAntialiasMode mode : {zmrNone, zmrFast, zmrBilinear, zmrBicubic}) {
                TZmBitmap in_memory(*image);
                TZmBitmap in_file;
                in_file.SetMinFileSize(0);
                in_file.AssignEx(&filed, /*with_params=*/false);
                in_memory.Rotate(angle, mode, kWhite);
                in_file.Rotate(angle, mode, kWhite);
                EXPECT_EQ(in_file.GetLocation(), zmFile);
                ExpectSamePixels(in_memory, in_file);
                TZmBitmap to_file(*image);
                to_file.SetMinFileSize(0);
                ASSERT_EQ(to_file.GetLocation(), zmMemory);
                to_file.Rotate(angle, mode, kWhite);
                EXPECT_EQ(to_file.GetLocation(), zmFile);
                ExpectSamePixels(in_memory, to_file);
            }
        }
    }
}

// The forms of the bitmap.

TEST(BitmapRotate, WithoutAntialiasTheModeDoesNotCount) {
    const auto image = MakeNoise(zm24RGB, 23, 17, 1);
    TZmBitmap nearest;
    ASSERT_TRUE(RotateNearest(*image, nearest, 20, kWhite, kNobody));
    image->Rotate(20, /*antialias=*/false, zmrBicubic, kWhite);
    ExpectSamePixels(nearest, *image);
}

TEST(BitmapRotate, AlphaStaysInStepAndIsClearBesideThePicture) {
    for (const TZmPixelFormat format : kAllFormats) {
        for (const TZmAntialiasMode mode : {zmrNone, zmrFast, zmrBilinear, zmrBicubic}) {
            for (const double angle : {45.0, 90.0, -30.0, 180.0}) {
                const auto image = MakeNoise(format, 21, 13, 1);
                image->GetAlphaChannel()->SetFull(true);
                image->Rotate(angle, mode, kWhite);
                TZmBitmap* const plane = image->GetAlphaChannelRaw();
                ASSERT_NE(plane, nullptr);
                EXPECT_TRUE(plane->GetIsAlpha());
                ASSERT_EQ(plane->GetWidth(), image->GetWidth());
                ASSERT_EQ(plane->GetHeight(), image->GetHeight());
                const bool is_quarter = std::fmod(angle, 90) == 0;
                EXPECT_EQ(plane->GetPixels_zm8(0, 0), is_quarter ? 255 : 0);
                EXPECT_EQ(plane->GetPixels_zm8(plane->GetWidth() / 2, plane->GetHeight() / 2), 255);
                EXPECT_EQ(plane->GetFull(), is_quarter);
            }
        }
    }
    const auto opaque = MakeNoise(zm24RGB, 21, 13, 1);
    opaque->Rotate(45, zmrBilinear, kWhite);
    EXPECT_FALSE(opaque->HasAlphaChannel());
    EXPECT_EQ(opaque->GetPixels_zm24RGB(0, 0), (TRGB{255, 255, 255}));
}

TEST(BitmapRotate, APlaneOfAnotherSizeIsBroughtIntoFit) {
    const auto image = MakeNoise(zm24RGB, 8, 4, 1);
    image->ReplaceAlphaChannel(GrayPicture(zm8g, {{10, 20}}));
    image->Rotate(90, zmrBilinear, kWhite);
    EXPECT_EQ(image->GetAlpha(0, 0), 20);
    EXPECT_EQ(image->GetAlpha(3, 7), 10);
}

TEST(BitmapRotate, PaletteAndSettingsStay) {
    const auto image = MakeNoise(zm8p, 9, 5, 1);
    image->SetPaletteUsed(17);
    image->SetFilename(u"name");
    const TRGB color = image->GetPalette(200);
    for (const double angle : {90.0, 33.0, 180.0}) {
        image->Rotate(angle, zmrNone, 0);
        EXPECT_EQ(image->GetPalette(200), color);
        EXPECT_EQ(image->GetPaletteUsed(), 17);
        EXPECT_EQ(image->GetFilename(), u"name");
    }
}

TEST(BitmapRotate, ChangedIsToldOnce) {
    const struct {
        double angle;
        TZmAntialiasMode mode;
        int count;
    } kCases[] = {{0, zmrBilinear, 0},  {360, zmrBilinear, 1}, {0.0004, zmrFast, 1},
                  {90, zmrBilinear, 1}, {33, zmrBilinear, 1},  {33, zmrFast, 1}};
    for (const auto& c : kCases) {
        const auto image = MakeNoise(zm24RGB, 9, 5, 1);
        int changes = 0;
        image->SetOnChanged([&changes](void*) { ++changes; });
        image->Rotate(c.angle, c.mode, 0);
        EXPECT_EQ(changes, c.count) << c.angle;
        if (c.angle < 1 || c.angle == 360) {
            ExpectSamePixels(*MakeNoise(zm24RGB, 9, 5, 1), *image);
        }
    }
}

// Bad input.

TEST(BitmapRotate, NoNumbersAndNoRoomLeaveTheImage) {
    for (const TZmPixelFormat format : {zm24RGB, zm8g, zm1g}) {
        const auto image = MakeNoise(format, 40, 30, 1);
        AddNoiseAlpha(*image, 2);
        TZmBitmap before(*image);
        for (const double angle :
             {std::numeric_limits<double>::quiet_NaN(), std::numeric_limits<double>::infinity(),
              -std::numeric_limits<double>::infinity()}) {
            image->Rotate(angle, zmrBilinear, kWhite);
        }
        ZmGlobalSettings().fAutoLocateOnDisk = false;
        ZmGlobalSettings().fAutoFragmentBitmap = false;
        SetLargestBitmapBlock(100);
        for (const double angle : {90.0, 45.0}) {
            for (const TZmAntialiasMode mode : {zmrNone, zmrFast, zmrBilinear}) {
                image->Rotate(angle, mode, kWhite);
            }
        }
        SetLargestBitmapBlock(-1);
        ZmGlobalSettings().fAutoLocateOnDisk = true;
        ZmGlobalSettings().fAutoFragmentBitmap = true;
        ExpectSamePixels(before, *image);
        ExpectSameAlpha(before, *image);
    }
    EXPECT_FALSE(InverseFilterSize({kMaxInt32, kMaxInt32}, 45).has_value());
    EXPECT_FALSE(FindShearGeometry({kMaxInt32, kMaxInt32}, 45).has_value());
    TZmBitmap empty;
    empty.Rotate(45, zmrBilinear, kWhite);
    EXPECT_TRUE(empty.IsEmpty());
}

TEST(BitmapRotate, TinyThinAndHugeAngles) {
    const std::int32_t sizes[][2] = {{1, 1}, {1, 2}, {2, 1}, {1, 900}, {900, 1}, {2, 2}};
    const double angles[] = {45, -45, 1e9 + 0.5, 1e300, -1e306, 1e-300, 5e-324, 89.9999, 22.5};
    for (const auto& size : sizes) {
        for (const TZmPixelFormat format : {zm24RGB, zm8g, zm1g, zm48RGB}) {
            for (const double angle : angles) {
                for (const TZmAntialiasMode mode : {zmrNone, zmrFast, zmrBilinear, zmrBicubic}) {
                    const auto image = MakeNoise(format, size[0], size[1], 1);
                    image->Rotate(angle, mode, kWhite);
                    ASSERT_GE(image->GetWidth(), 1);
                    ASSERT_GE(image->GetHeight(), 1);
                    ASSERT_LE(image->GetWidth() + image->GetHeight(), 2000);
                }
            }
        }
    }
}

TEST(BitmapRotate, ProgressRisesAndAnAbortLeavesTheImage) {
    for (const TZmAntialiasMode mode : {zmrNone, zmrFast, zmrBilinear}) {
        for (int last = 0; last < 40; ++last) {
            const auto image = MakeNoise(zm24RGB, 20, 15, 1);
            AddNoiseAlpha(*image, 2);
            TZmBitmap before(*image);
            int calls = 0;
            int percent = 0;
            const auto listen = [&](void*, std::int32_t now) {
                EXPECT_GE(now, percent);
                EXPECT_LE(now, 100);
                percent = now;
                if (calls++ == last) {
                    throw std::runtime_error("stop");
                }
            };
            try {
                image->RotateEx(20, mode, kWhite, nullptr, listen);
                EXPECT_LE(calls, last);
            } catch (const std::runtime_error&) {
                ExpectSamePixels(before, *image);
                ExpectSameAlpha(before, *image);
            }
            EXPECT_GT(calls, 0);
        }
    }
}

// The processor.

TEST(ProcRotate, SavesUndoWithTheAngleAndTellsTheEnd) {
    const auto image = MakeNoise(zm24RGB, 6, 4, 1);
    TZalmoProc proc(image.get());
    int ends = 0;
    proc.SetOnFinishWork([&ends](void*) { ++ends; });
    proc.SetAutoUndo(true);
    proc.Rotate(0, zmrBilinear, kWhite);
    EXPECT_EQ(proc.GetUndoCount(), 0);
    EXPECT_EQ(ends, 0);
    proc.SetBackground(0x0000FF);
    proc.Rotate(45, zmrBilinear, -1);
    EXPECT_EQ(ends, 1);
    EXPECT_EQ(image->GetPixels_zm24RGB(0, 0), (TRGB{0, 0, 255}));
    ASSERT_NE(proc.GetUndoInfo(0), nullptr);
    EXPECT_EQ(proc.GetUndoInfo(0)->Operation, 84);
    EXPECT_EQ(proc.GetUndoInfo(0)->Caption, u"Rotate 45\u00B0");
    proc.Undo(/*auto_redo=*/false);
    ExpectSamePixels(*MakeNoise(zm24RGB, 6, 4, 1), *image);
    proc.Rotate(-30.7, /*antialias=*/false, zmrBilinear, kWhite);
    EXPECT_EQ(proc.GetUndoInfo(0)->Caption, u"Rotate -30\u00B0");
    EXPECT_EQ(ends, 2);
}

TEST(ProcRotate, FlipsSaveTheirOwnOperations) {
    const auto image = GrayPicture(zm8g, {{1, 2}, {3, 4}});
    TZalmoProc proc(image.get());
    proc.SetAutoUndo(true);
    proc.SetUndoLimit(2);
    proc.Flip(fdNone);
    EXPECT_EQ(proc.GetUndoCount(), 0);
    proc.Flip(fdHorizontal);
    EXPECT_EQ(ValuesOf(*image), (TMatrix{{2, 1}, {4, 3}}));
    proc.Flip(fdVertical);
    EXPECT_EQ(ValuesOf(*image), (TMatrix{{4, 3}, {2, 1}}));
    EXPECT_EQ(proc.GetUndoInfo(1)->Operation, 48);
    EXPECT_EQ(proc.GetUndoInfo(1)->Caption, u"Flip Horizontal");
    EXPECT_EQ(proc.GetUndoInfo(0)->Operation, 49);
    EXPECT_EQ(proc.GetUndoInfo(0)->Caption, u"Flip Vertical");
}

}  // namespace
}  // namespace zm::test
