// Conversions to few colours: palettes, dither matrices, and the operations of the processor.

#include <gtest/gtest.h>

#include <algorithm>
#include <set>

#include "engine/proc/zalmoproc.h"
#include "engine/proc/zmdither.h"
#include "engine/proc/zmpalettes.h"
#include "tests/proc/resample_support.h"
#include "tests/support/testimages.h"

namespace zm::test {
namespace {

constexpr TZmDitherMethod kMethods[] = {zmOrdered, zmThreshold, zmDithering};

std::set<std::uint32_t> ColorsOf(TZmBitmap& image) {
    std::set<std::uint32_t> colors;
    for (std::int32_t y = 0; y < image.GetHeight(); ++y) {
        for (std::int32_t x = 0; x < image.GetWidth(); ++x) {
            colors.insert(static_cast<std::uint32_t>(ColorFromRGB(image.GetPixels(x, y))));
        }
    }
    return colors;
}

double MeanGray(TZmBitmap& image) {
    double sum = 0;
    for (std::int32_t y = 0; y < image.GetHeight(); ++y) {
        for (std::int32_t x = 0; x < image.GetWidth(); ++x) {
            const TRGB rgb = image.GetPixels(x, y);
            sum += rgb.r + rgb.g + rgb.b;
        }
    }
    return sum / 3 / image.GetWidth() / image.GetHeight();
}

// Palettes.

TEST(FixedPalettes, HaveTheirCountsAndLevels) {
    const struct {
        TZmPaletteType type;
        std::size_t count;
        std::size_t index;
        TRGB color;  // blue, green, red
    } kCases[] = {{zmptMedianCut, 0, 0, {}},
                  {zmptFixedBW, 2, 1, {255, 255, 255}},
                  {zmptFixedHalftone8, 8, 3, {255, 255, 0}},
                  {zmptFixedHalftone27, 27, 13, {128, 128, 128}},
                  {zmptFixedHalftone64, 64, 27, {255, 170, 85}},
                  {zmptFixedHalftone125, 125, 31, {64, 64, 64}},
                  {zmptFixedWebPalette, 216, 51, {153, 102, 51}},
                  {zmptFixedHalftone252, 252, 251, {255, 255, 255}},
                  {zmptFixedHalftone256, 256, 37, {85, 36, 36}},
                  {zmptFixedGray4, 4, 1, {85, 85, 85}},
                  {zmptFixedGray16, 16, 3, {51, 51, 51}},
                  {zmptFixedGray256, 256, 200, {200, 200, 200}}};
    ASSERT_EQ(std::size(kCases), std::size_t{kPaletteTypeCount});
    for (const auto& c : kCases) {
        const TZmPalette palette = MakeFixedPalette(c.type);
        ASSERT_EQ(palette.colors.size(), c.count) << int{c.type};
        if (c.count > 0) {
            EXPECT_EQ(palette.colors[0], TRGB{}) << int{c.type};
            EXPECT_EQ(palette.colors.back(), (TRGB{255, 255, 255})) << int{c.type};
            EXPECT_EQ(palette.colors[c.index], c.color) << int{c.type};
        }
    }
}

TEST(PaletteFinder, FindsTheFirstOfTheNearest) {
    std::vector<TRGB> colors;
    for (std::uint32_t i = 0, noise = 7; i < 200; ++i) {
        noise = noise * 1664525u + 1013904223u;
        colors.push_back({static_cast<std::uint8_t>(noise >> 24),
                          static_cast<std::uint8_t>(noise >> 18 & 0xC0),
                          static_cast<std::uint8_t>(noise >> 9)});
    }
    TPaletteFinder finder(colors);
    const auto distance = [](TRGB a, TRGB b) {
        return (a.r - b.r) * (a.r - b.r) + (a.g - b.g) * (a.g - b.g) + (a.b - b.b) * (a.b - b.b);
    };
    for (std::uint32_t i = 0; i < 5000; ++i) {
        const std::uint32_t key = i * 2654435761u;
        const TRGB color{static_cast<std::uint8_t>(key >> 24), static_cast<std::uint8_t>(key >> 16),
                         static_cast<std::uint8_t>(key >> 8)};
        const auto best = std::min_element(colors.begin(), colors.end(), [&](TRGB a, TRGB b) {
            return distance(a, color) < distance(b, color);
        });
        ASSERT_EQ(finder.Find(color), best - colors.begin());
    }
}

// Dithering.

TEST(DitherMatrix, EveryRankOnce) {
    const int sizes[kDitherTypeCount] = {0, 4, 8, 16, 4, 8, 4, 8, 0};
    for (int type = 0; type < kDitherTypeCount; ++type) {
        const TDitherMatrix matrix(static_cast<TZmDitherType>(type));
        ASSERT_EQ(matrix.Size(), sizes[type]) << type;
        std::set<std::int32_t> ranks;
        for (std::int32_t y = 0; y < matrix.Size(); ++y) {
            for (std::int32_t x = 0; x < matrix.Size(); ++x) {
                ranks.insert(matrix.Rank(x, y));
                EXPECT_EQ(matrix.Rank(x, y), matrix.Rank(x + 3 * matrix.Size(), y));
            }
        }
        EXPECT_EQ(ranks.size(), static_cast<std::size_t>(matrix.Cells())) << type;
        if (!ranks.empty()) {
            EXPECT_EQ(*ranks.rbegin(), matrix.Cells() - 1) << type;
        }
    }
}

TEST(DitherMatrix, OrdersAreWorkedOutByHand) {
    const auto rows_of = [](TZmDitherType type) {
        const TDitherMatrix matrix(type);
        TMatrix rows;
        for (std::int32_t y = 0; y < matrix.Size(); ++y) {
            auto& row = rows.emplace_back();
            for (std::int32_t x = 0; x < matrix.Size(); ++x) {
                row.push_back(matrix.Rank(x, y));
            }
        }
        return rows;
    };
    EXPECT_EQ(rows_of(zmdtOrdered4x4),
              (TMatrix{{0, 12, 3, 15}, {8, 4, 11, 7}, {2, 14, 1, 13}, {10, 6, 9, 5}}));
    // Right, down, left, up from the middle, ever longer.
    EXPECT_EQ(rows_of(zmdtSpiral4x4),
              (TMatrix{{6, 7, 8, 9}, {5, 0, 1, 10}, {4, 3, 2, 11}, {15, 14, 13, 12}}));
    EXPECT_EQ(rows_of(zmdtDualSpiral4x4),
              (TMatrix{{0, 2, 15, 13}, {6, 4, 9, 11}, {14, 12, 1, 3}, {8, 10, 7, 5}}));
    // The columns of the fixed matrix of the conversion to one bit.
    const TDitherMatrix large(zmdtOrdered8x8);
    const int first[8] = {0, 32, 8, 40, 2, 34, 10, 42};
    const int last[8] = {63, 31, 55, 23, 61, 29, 53, 21};
    for (std::int32_t y = 0; y < 8; ++y) {
        EXPECT_EQ(large.Rank(0, y), first[y]);
        EXPECT_EQ(large.Rank(7, y), last[y]);
    }
}

TEST(BitDitherer, SharesOfSetBitsFollowTheGray) {
    for (int type = 1; type < kDitherTypeCount; ++type) {
        for (const int gray : {0, 64, 128, 191, 255}) {
            TBitDitherer ditherer(static_cast<TZmDitherType>(type), 64);
            const std::vector<std::uint8_t> row(64, static_cast<std::uint8_t>(gray));
            std::vector<std::uint8_t> bits(9, 0xAA);
            int set = 0;
            for (int y = 0; y < 64; ++y) {
                ditherer.MapRow(row.data(), bits.data());
                for (std::size_t i = 0; i < 8; ++i) {
                    set += __builtin_popcount(bits[i]);
                }
                ASSERT_EQ(bits[8], 0xAA);
            }
            EXPECT_NEAR(set / 4096.0, gray / 255.0, gray == 0 || gray == 255 ? 0.0 : 0.02)
                << "type " << type << ", gray " << gray;
        }
    }
}

TEST(Ditherer, ErrorsGoToTheNeighboursInSixteenths) {
    // Grey 100 under black and white: 100 is black, its error 100 goes on as 44 (7/16, rounded):
    // 144 is white, -111 goes on as -49 (-48.6): 51 is black.
    const TZmPalette palette{{{0, 0, 0}, {255, 255, 255}}, {255, 255, 255}};
    TPaletteFinder finder(palette.colors);
    TDitherer ditherer(
        palette, [&](TRGB color) { return finder.Find(color); }, zmdtErrorDiffusion, 3);
    const std::vector<TRGB> row(3, TRGB{100, 100, 100});
    std::vector<std::uint16_t> indexes(3);
    ditherer.MapRow(row.data(), indexes.data());
    EXPECT_EQ(indexes, (std::vector<std::uint16_t>{0, 1, 0}));
    // Below: 100 + (100 * 5 - 111 * 3) / 16 = 110 is black, +48; 100 + (100 - 111 * 5 + 51 * 3 +
    // 110 * 7) / 16 = 129 is white, -126; 100 + (-111 + 51 * 5 - 126 * 7) / 16 = 54 is black.
    ditherer.MapRow(row.data(), indexes.data());
    EXPECT_EQ(indexes, (std::vector<std::uint16_t>{0, 1, 0}));
}

// The operations.

TEST(ConvertToColors, KeepsFewColorsAndLimitsMany) {
    for (const TZmDitherMethod method : kMethods) {
        const auto few = MakeNoise(zm8p, 30, 20, 1);
        TZmBitmap before(*few);
        TZalmoProc proc(few.get());
        proc.ConvertTo(1024, method);
        EXPECT_EQ(few->GetPixelFormat(), zm24RGB);
        ASSERT_TRUE(before.SetPixelFormat(zm24RGB));
        ExpectSamePixels(before, *few);
        for (const std::int32_t count : {3, 16, 100, 200}) {
            const auto many = MakeGradient(zm24RGB, 60, 50);
            TZalmoProc(many.get()).ConvertTo(count, method);
            const std::size_t found = ColorsOf(*many).size();
            EXPECT_LE(found, static_cast<std::size_t>(count));
            EXPECT_GE(found, 2u);
        }
    }
}

TEST(ConvertToColors, ActsFrom3To1024AndSavesUndo) {
    const auto image = MakeGradient(zm24RGB, 20, 10);
    AddNoiseAlpha(*image, 3);
    TZmBitmap before(*image);
    TZalmoProc proc(image.get());
    proc.SetAutoUndo(true);
    int ends = 0;
    proc.SetOnFinishWork([&ends](void*) { ++ends; });
    for (const std::int32_t count : {-1, 0, 2, 1025, 1 << 30}) {
        proc.ConvertTo(count, zmThreshold);
    }
    ExpectSamePixels(before, *image);
    EXPECT_EQ(proc.GetUndoCount(), 0);
    EXPECT_EQ(ends, 0);
    proc.ConvertTo(16, zmThreshold);
    EXPECT_EQ(ends, 1);
    EXPECT_EQ(proc.GetUndoInfo(0)->Operation, 26);
    EXPECT_EQ(proc.GetUndoInfo(0)->Caption, u"Convert to 16 colors");
    ExpectSameAlpha(before, *image);
    proc.Undo(/*auto_redo=*/false);
    ExpectSamePixels(before, *image);
    TZmBitmap empty;
    TZalmoProc(&empty).ConvertTo(16, zmThreshold);
    EXPECT_TRUE(empty.IsEmpty());
}

TEST(ConvertToColors, StoppingAtAnyRowLeavesTheImage) {
    const auto before = MakeNoise(zm24RGB, 9, 6, 4);
    for (std::int32_t stop = 1; stop <= 6; ++stop) {
        const auto image = MakeNoise(zm24RGB, 9, 6, 4);
        TZalmoProc proc(image.get());
        std::int32_t calls = 0;
        proc.SetOnProgress([&](void*, std::int32_t) {
            if (++calls == stop) {
                throw EZmException("stop");
            }
        });
        EXPECT_THROW(proc.ConvertTo(4, zmDithering), EZmException) << stop;
        calls = 0;
        EXPECT_THROW(proc.ConvertToPalette({{1, 2, 3}, {200, 100, 50}}, zmThreshold), EZmException);
        ExpectSamePixels(*before, *image);
    }
}

TEST(ConvertToPalette, TakesTheNearestEntries) {
    const auto image = ColorPicture({{0, 60, 130, 255}});
    AddNoiseAlpha(*image, 1);
    TZmBitmap before(*image);
    const std::vector<TRGB> colors{{200, 200, 200}, {0, 0, 0}, {100, 100, 100}};
    TZalmoProc proc(image.get());
    proc.ConvertToPalette(colors, zmThreshold);
    ASSERT_EQ(image->GetPixelFormat(), zm8p);
    EXPECT_EQ(ValuesOf(*image), (TMatrix{{1, 2, 2, 0}}));
    EXPECT_EQ(image->GetPaletteUsed(), 3);
    EXPECT_EQ(image->GetPalette(0), colors[0]);
    ExpectSameAlpha(before, *image);
    TZmBitmap mapped(*image);
    proc.ConvertToPalette({}, zmThreshold);
    proc.ConvertToPalette(std::vector<TRGB>(257), zmThreshold);
    ExpectSamePixels(mapped, *image);
}

TEST(ConvertToFormat, EveryPaletteAndDitherOnEverySource) {
    for (const TZmPixelFormat format : kAllFormats) {
        for (int palette = 0; palette < kPaletteTypeCount; ++palette) {
            for (int dither = 0; dither < kDitherTypeCount; ++dither) {
                const auto type = static_cast<TZmPaletteType>(palette);
                const auto image = MakeGradient(format, 19, 5);
                AddNoiseAlpha(*image, 2);
                TZmBitmap before(*image);
                const bool is_done =
                    TZalmoProc(image.get())
                        .ConvertTo(zm8p, type, static_cast<TZmDitherType>(dither), false);
                ASSERT_TRUE(is_done);
                ASSERT_EQ(image->GetPixelFormat(), zm8p);
                ExpectSameAlpha(before, *image);
                if (type == zmptMedianCut) {
                    continue;
                }
                const std::vector<TRGB> colors = MakeFixedPalette(type).colors;
                EXPECT_EQ(image->GetPaletteUsed(), static_cast<std::int32_t>(colors.size()));
                for (std::int32_t x = 0; x < 19; ++x) {
                    ASSERT_LT(image->GetPixels_zm8(x, 4), colors.size());
                }
            }
        }
    }
}

TEST(ConvertToFormat, DitheringKeepsTheMean) {
    for (int dither = 1; dither < kDitherTypeCount; ++dither) {
        for (const TZmPaletteType type : {zmptFixedBW, zmptFixedHalftone8, zmptFixedGray4}) {
            TZmBitmap image(64, 64, zm24RGB);
            image.Fill(static_cast<double>(0x646464));
            ASSERT_TRUE(TZalmoProc(&image).ConvertTo(zm8p, type, static_cast<TZmDitherType>(dither),
                                                     false));
            EXPECT_NEAR(MeanGray(image), 100, 6)
                << "dither " << dither << ", palette " << int{type};
            EXPECT_GE(ColorsOf(image).size(), 2u);
        }
    }
}

TEST(ConvertToFormat, OneBitGoesByThresholdMatrixOrDots) {
    for (const bool is_ordered : {false, true}) {
        const auto image = MakeNoise(zm8g, 33, 20, 1);
        const auto expected = MakeNoise(zm8g, 33, 20, 1);
        expected->SetDefaultDitherMethod(is_ordered ? zmOrdered : zmThreshold);
        ASSERT_TRUE(expected->SetPixelFormat(zm1g));
        const TZmDitherType dither = is_ordered ? zmdtOrdered8x8 : zmdtSolid;
        image->SetDefaultDitherMethod(zmDithering);
        ASSERT_TRUE(TZalmoProc(image.get()).ConvertTo(zm1g, zmptFixedBW, dither, false));
        ExpectSamePixels(*expected, *image);
        EXPECT_EQ(image->GetDefaultDitherMethod(), zmDithering) << "the image's own choice stays";
    }
    const auto dots = GrayPicture(zm16g, {{0, 65535, 0, 65535}});
    ASSERT_TRUE(TZalmoProc(dots.get()).ConvertTo(zm1g, zmptFixedBW, zmdtSpiral4x4, false));
    EXPECT_EQ(ValuesOf(*dots), (TMatrix{{0, 1, 0, 1}}));
}

TEST(ConvertToFormat, CheckingAloneChangesNothing) {
    const auto image = MakeNoise(zm24RGB, 9, 9, 1);
    TZalmoProc proc(image.get());
    proc.SetAutoUndo(true);
    EXPECT_TRUE(proc.ConvertTo(zm8p, zmptFixedWebPalette, zmdtErrorDiffusion, true));
    EXPECT_TRUE(proc.ConvertTo(zm1g, zmptFixedBW, zmdtDualSpiral8x8, true));
    EXPECT_TRUE(proc.ConvertTo(zmCMYK, zmptMedianCut, zmdtSolid, true));
    EXPECT_FALSE(proc.ConvertTo(zm1g, zmptFixedGray4, zmdtSolid, true));
    EXPECT_FALSE(proc.ConvertTo(zmnull, zmptFixedBW, zmdtSolid, true));
    EXPECT_FALSE(proc.ConvertTo(zm1g, zmptMedianCut, zmdtSolid, false));
    EXPECT_FALSE(proc.ConvertTo(zm8p, static_cast<TZmPaletteType>(12), zmdtSolid, false));
    EXPECT_FALSE(proc.ConvertTo(zm8p, zmptFixedBW, static_cast<TZmDitherType>(9), false));
    ExpectSamePixels(*MakeNoise(zm24RGB, 9, 9, 1), *image);
    EXPECT_EQ(proc.GetUndoCount(), 0);
    EXPECT_TRUE(proc.ConvertTo(zm16g, zmptMedianCut, zmdtSolid, false));
    EXPECT_EQ(image->GetPixelFormat(), zm16g);
    EXPECT_EQ(proc.GetUndoCount(), 1);
    TZmBitmap empty;
    EXPECT_FALSE(TZalmoProc(&empty).ConvertTo(zm8p, zmptFixedBW, zmdtSolid, false));
}

}  // namespace
}  // namespace zm::test
