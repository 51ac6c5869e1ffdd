// Palettes worked out by hand, and the rules by which a palette's kind is chosen.

#include <gtest/gtest.h>

#include <algorithm>
#include <cstdlib>
#include <limits>
#include <utility>
#include <vector>

#include "engine/bitmap/zmquantizer.h"
#include "engine/bitmap/zmxBitmaps.h"
#include "engine/foundation/zmsettings.h"
#include "engine/proc/neurquant_p.h"
#include "tests/support/testimages.h"

namespace zm {
namespace {

// Sets the method and quality for one test.
class TReductionSettings {
public:
    TReductionSettings(std::int32_t algorithm, std::int32_t quality) {
        ZmGlobalSettings().fColorReductionAlgorithm = algorithm;
        ZmGlobalSettings().fColorReductionQuality = quality;
    }
    ~TReductionSettings() {
        ZmGlobalSettings().fColorReductionAlgorithm = -1;
        ZmGlobalSettings().fColorReductionQuality = -1;
    }
};

constexpr std::int32_t kNeural = 0;
constexpr std::int32_t kBoxes = 1;

TRGB Color(std::uint8_t red, std::uint8_t green, std::uint8_t blue) {
    return TRGB{blue, green, red};
}

// One row of colours.
void MakeRow(TZmBitmap& bitmap, const std::vector<TRGB>& colors, TZmPixelFormat format = zm24RGB) {
    ASSERT_TRUE(bitmap.Allocate(static_cast<std::int32_t>(colors.size()), 1, format));
    for (std::size_t x = 0; x < colors.size(); ++x) {
        bitmap.SetPixels(static_cast<std::int32_t>(x), 0, colors[x]);
    }
}

std::int32_t Distance(TRGB a, TRGB b) {
    return std::abs(a.r - b.r) + std::abs(a.g - b.g) + std::abs(a.b - b.b);
}

TEST(Quantizer, KeepsFewColoursExactly) {
    TZmBitmap bitmap;
    MakeRow(bitmap, {Color(9, 1, 1), Color(5, 6, 7), Color(9, 1, 1), Color(200, 0, 3)});
    std::vector<TRGB> map;
    TZmQuantizer quantizer(bitmap, map, 16);
    ASSERT_EQ(map.size(), 16u);
    EXPECT_EQ(quantizer.GetFoundColors(), 3);
    EXPECT_FALSE(quantizer.GetGrayScale());
    EXPECT_EQ(map[0], Color(9, 1, 1));
    EXPECT_EQ(map[1], Color(5, 6, 7));
    EXPECT_EQ(map[2], Color(200, 0, 3));
    EXPECT_EQ(map[3], TRGB{});
    EXPECT_EQ(quantizer.GetRGBIndex(Color(5, 6, 7)), 1);
    EXPECT_EQ(quantizer.GetRGBIndex(Color(200, 0, 3)), 2);
    EXPECT_EQ(quantizer.GetRGBIndex(Color(199, 0, 0)), 2);  // none such: the nearest
}

// As many colours as entries are exact, one more is not.
TEST(Quantizer, CountsColoursUpToTheLimit) {
    TZmBitmap bitmap;
    ASSERT_TRUE(bitmap.Allocate(32, 32, zm24RGB));
    for (std::int32_t i = 0; i < 1024; ++i) {
        bitmap.SetPixels_zm24RGB(
            i % 32, i / 32,
            TRGB{static_cast<std::uint8_t>(i), static_cast<std::uint8_t>(i / 256), 99});
    }
    std::vector<TRGB> map;
    TZmQuantizer exact(bitmap, map, 1024);
    EXPECT_EQ(exact.GetFoundColors(), 1024);
    for (std::int32_t i = 0; i < 1024; ++i) {
        const TRGB color = bitmap.GetPixels_zm24RGB(i % 32, i / 32);
        EXPECT_EQ(exact.GetRGBIndex(color), i);
        EXPECT_EQ(map[static_cast<std::size_t>(i)], color);
    }
    const TReductionSettings settings(kBoxes, -1);
    TZmQuantizer split(bitmap, map, 1023);
    EXPECT_LT(split.GetFoundColors(), 1023);  // only 128 cells of the cube are in use
}

TEST(Quantizer, GreyImagesGetAnEvenRamp) {
    TZmBitmap gray;
    ASSERT_TRUE(gray.Allocate(2, 2, zm8g));
    std::vector<TRGB> map;
    TZmQuantizer three(gray, map, 3);
    EXPECT_TRUE(three.GetGrayScale());
    EXPECT_EQ(map, (std::vector<TRGB>{Color(0, 0, 0), Color(85, 85, 85), Color(170, 170, 170)}));
    EXPECT_EQ(three.GetRGBIndex(Color(85, 0, 0)), 0);
    EXPECT_EQ(three.GetRGBIndex(Color(86, 0, 0)), 1);
    EXPECT_EQ(three.GetRGBIndex(Color(255, 0, 0)), 2);
    TZmQuantizer all(gray, map, 256);
    TZmQuantizer many(gray, map, 1024);
    EXPECT_EQ(all.GetRGBIndex(Color(77, 77, 77)), 77);
    EXPECT_EQ(many.GetRGBIndex(Color(255, 255, 255)), 1020);
    EXPECT_EQ(map[1023], Color(255, 255, 255));
    // Grey pixels in a colour format count as grey.
    TZmBitmap colors;
    MakeRow(colors, {Color(3, 3, 3), Color(250, 250, 250)});
    TZmQuantizer from_colors(colors, map, 16);
    EXPECT_TRUE(from_colors.GetGrayScale());
    EXPECT_EQ(map[1], Color(16, 16, 16));
}

TEST(Quantizer, PaletteImagesKeepTheirPalette) {
    TZmBitmap bitmap;
    ASSERT_TRUE(bitmap.Allocate(1, 1, zm8p));
    for (std::int32_t i = 0; i < 256; ++i) {
        bitmap.SetPalette(i, Color(static_cast<std::uint8_t>(i), 7, 9));
    }
    bitmap.SetPixels_zm8(0, 0, 3);
    std::vector<TRGB> map;
    TZmQuantizer quantizer(bitmap, map, 16);
    EXPECT_EQ(map[15], Color(15, 7, 9));
    EXPECT_EQ(quantizer.GetRGBIndex(Color(200, 7, 9)), 200);
    EXPECT_EQ(quantizer.GetRGBIndex(Color(200, 7, 10)), 256);  // missing: the palette's size
}

TEST(Quantizer, LimitsTheColourCountAndTakesDegenerateImages) {
    TZmBitmap bitmap;
    MakeRow(bitmap, {Color(1, 2, 3)}, zm32RGB);
    TZmBitmap empty;
    for (const std::int32_t algorithm : {kNeural, kBoxes}) {
        const TReductionSettings settings(algorithm, -1);
        for (const std::int32_t count : {std::numeric_limits<std::int32_t>::min(), 0, 1, 2, 256,
                                         1024, std::numeric_limits<std::int32_t>::max()}) {
            std::vector<TRGB> map;
            TZmQuantizer quantizer(bitmap, map, count);
            EXPECT_EQ(map.size(), count < 1 ? 1u : count > 1024 ? 1024u : std::size_t(count));
            const std::int32_t index = quantizer.GetRGBIndex(Color(1, 2, 3));
            EXPECT_GE(index, 0);
            EXPECT_LT(index, static_cast<std::int32_t>(map.size()));
            TZmQuantizer nothing(empty, map, count);
            EXPECT_EQ(nothing.GetFoundColors(), 0);
            EXPECT_EQ(nothing.GetRGBIndex(Color(1, 2, 3)), 0);
        }
    }
}

// Box means are multiples of 8, which neurons almost never all are.
TEST(Quantizer, ChoosesTheMethod) {
    auto noise = test::MakeNoise(zm24RGB, 60, 40, 3);
    const auto is_boxes = [&](std::int32_t count) {
        std::vector<TRGB> map;
        TZmQuantizer quantizer(*noise, map, count);
        for (const TRGB& entry : map) {
            if ((entry.r | entry.g | entry.b) % 8 != 0) {
                return false;
            }
        }
        return true;
    };
    EXPECT_TRUE(is_boxes(100));
    EXPECT_TRUE(is_boxes(127));
    EXPECT_FALSE(is_boxes(128));
    EXPECT_FALSE(is_boxes(200));
    const TReductionSettings boxes(kBoxes, -1);
    EXPECT_TRUE(is_boxes(200));
    const TReductionSettings other(7, -1);
    EXPECT_FALSE(is_boxes(100));
}

TEST(Quantizer, BoxSplitByHand) {
    const struct {
        const char* name;
        std::vector<TRGB> pixels;
        std::vector<TRGB> palette;
        std::int32_t found;
        std::vector<std::pair<TRGB, std::int32_t>> indexes;
    } cases[] = {
        // Red levels 0, 1 and 31. Mean 10.67, cuts from level 5 (middle of 0 and the mean) on all
        // score alike: the first wins. Halves 0 to 5, of mean 0.5, which rounds to 0, and 6 to 31.
        {"first cut of equal scores",
         {Color(0, 0, 0), Color(8, 0, 0), Color(248, 0, 0)},
         {Color(0, 0, 0), Color(248, 0, 0)},
         2,
         {{Color(8, 0, 0), 0}, {Color(47, 255, 255), 0}, {Color(48, 0, 0), 1}}},
        // Red levels 2, 10 and 12: mean 8, trial cuts from 4 to 20. The weighted sum leaves out
        // level 2, which lies below the first cut, and counts per pixel of the whole box: cut 4
        // scores 1 / 2 * 8 * 8 = 32, cut 10 scores 2 / 1 * (8 - 10 / 3)^2 = 43.6 and wins, though
        // the means of the halves lie farther apart at cut 4. Bin 10 goes to the lower half, of
        // mean 6.
        {"sums from the first trial cut",
         {Color(16, 0, 0), Color(80, 0, 0), Color(96, 0, 0)},
         {Color(48, 0, 0), Color(96, 0, 0)},
         2,
         {{Color(87, 0, 0), 0}, {Color(88, 0, 0), 1}}},
        // The first cut, between levels 1 and 30, leaves boxes of equal variance. The first is cut
        // next; its upper half goes to the end.
        {"lower half in place",
         {Color(0, 0, 0), Color(8, 0, 0), Color(240, 0, 0), Color(248, 0, 0)},
         {Color(0, 0, 0), Color(240, 0, 0), Color(8, 0, 0)},
         3,
         {}},
        // Red and green part the image equally well; the third colour shares the second's cell.
        {"red on a tie",
         {Color(0, 0, 0), Color(248, 248, 0), Color(249, 248, 0)},
         {Color(0, 0, 0), Color(248, 248, 0)},
         2,
         {{Color(0, 255, 0), 0}, {Color(255, 0, 0), 1}}},
        {"one cell",
         {Color(17, 0, 0), Color(18, 0, 0), Color(19, 0, 0)},
         {Color(16, 0, 0), {}},
         1,
         {}},
    };
    const TReductionSettings settings(kBoxes, -1);
    for (const auto& c : cases) {
        TZmBitmap bitmap;
        MakeRow(bitmap, c.pixels);
        std::vector<TRGB> map;
        TZmQuantizer quantizer(bitmap, map, static_cast<std::int32_t>(c.palette.size()));
        EXPECT_EQ(map, c.palette) << c.name;
        EXPECT_EQ(quantizer.GetFoundColors(), c.found) << c.name;
        for (const auto& [color, index] : c.indexes) {
            EXPECT_EQ(quantizer.GetRGBIndex(color), index) << c.name;
        }
    }
}

// Two neurons at 0 and 2048, three samples of red 160, 320, 3200 (times 16) at alpha 1024, 990,
// 957: neuron 0 wins all, and goes to 160, 314, 3011, that is 188.
TEST(Quantizer, NeuralTrainingByHand) {
    const TReductionSettings settings(kNeural, 100);
    TZmBitmap bitmap;
    MakeRow(bitmap, {Color(10, 0, 0), Color(20, 0, 0), Color(200, 0, 0)});
    std::vector<TRGB> map;
    TZmQuantizer quantizer(bitmap, map, 2);
    EXPECT_EQ(map, (std::vector<TRGB>{Color(188, 0, 0), Color(128, 128, 128)}));
    EXPECT_EQ(quantizer.GetFoundColors(), 2);
    EXPECT_EQ(quantizer.GetRGBIndex(Color(10, 0, 0)), 0);
    EXPECT_EQ(quantizer.GetRGBIndex(Color(120, 130, 140)), 1);
}

// Sixteen neurons have radius 2: the neighbour of the winner moves by 192 / 256 of the way. The
// sample is red 256; neuron 1 stands at 256 in all channels, its green and blue go to 64.
TEST(Quantizer, NeuralNeighboursFollowByHand) {
    const TReductionSettings settings(kNeural, 100);
    TZmBitmap bitmap;
    MakeRow(bitmap, {Color(16, 0, 0)}, zm32RGB);
    std::vector<TRGB> map;
    TZmQuantizer quantizer(bitmap, map, 16);
    EXPECT_EQ(map[0], Color(16, 0, 0));
    EXPECT_EQ(map[1], Color(16, 4, 4));
    EXPECT_EQ(map[2], Color(32, 32, 32));
    EXPECT_EQ(map[15], Color(240, 240, 240));
}

// Whole palettes of a formula picture, worked out by a separate plain program from the rules of
// the two methods. 0xRRGGBB.
void MakeFormulaPicture(TZmBitmap& bitmap) {
    ASSERT_TRUE(bitmap.Allocate(40, 30, zm24RGB));
    for (std::int32_t y = 0; y < 30; ++y) {
        for (std::int32_t x = 0; x < 40; ++x) {
            bitmap.SetPixels_zm24RGB(x, y,
                                     Color(static_cast<std::uint8_t>(x * 7 + y * 13),
                                           static_cast<std::uint8_t>(x * x + y * 5),
                                           static_cast<std::uint8_t>(x * y * 3)));
        }
    }
}

void ExpectPalette(std::int32_t method, std::int32_t quality,
                   const std::vector<std::uint32_t>& expected) {
    const TReductionSettings settings(method, quality);
    TZmBitmap bitmap;
    MakeFormulaPicture(bitmap);
    std::vector<TRGB> map;
    TZmQuantizer quantizer(bitmap, map, static_cast<std::int32_t>(expected.size()));
    for (std::size_t i = 0; i < expected.size(); ++i) {
        const std::uint32_t rgb = expected[i];
        EXPECT_EQ(map[i],
                  Color(static_cast<std::uint8_t>(rgb >> 16), static_cast<std::uint8_t>(rgb >> 8),
                        static_cast<std::uint8_t>(rgb)))
            << i;
    }
}

TEST(Quantizer, WholeNeuralPalettes) {
    // Every pixel a sample; 4 neighbours on either side at the start.
    ExpectPalette(kNeural, 100,
                  {0x3D27DD, 0x262C86, 0x1F120F, 0x431F2E, 0x722117, 0xD83910, 0xCD3A5E, 0xD0946D,
                   0xF245C7, 0xC157E4, 0xAD14B1, 0x84447E, 0xAE6DA7, 0x4A7311, 0x24DD38, 0x32B11F,
                   0x127126, 0x307C77, 0x61424B, 0x6C8F52, 0x9F4E1B, 0xB4B510, 0xCFE549, 0xD4932D,
                   0x7CCE94, 0x72D529, 0x25CE8A, 0x1E74C3, 0x6E91D4, 0xA5C7E6, 0x2ECEE0, 0xE7CAB6});
    // One pixel in 30: the outer neurons stay where they began.
    ExpectPalette(kNeural, 0,
                  {0x000000, 0x010101, 0x040404, 0x1E1010, 0x2A1817, 0x137827, 0x08A43B, 0x2A6F54,
                   0x502A8E, 0x731681, 0x6D3857, 0x9E3258, 0xE22640, 0xE33534, 0xE4BC7D, 0x7A9753,
                   0x89A25D, 0x9CCD89, 0x93C59D, 0x63AF8D, 0x398193, 0x2C66C1, 0x26ABC4, 0x5BE5BE,
                   0x98A3D3, 0xA758E8, 0xC25CC6, 0xD3A4EE, 0xE0E0E0, 0xE8E8E8, 0xF0F0F0, 0xF8F8F8});
}

TEST(Quantizer, WholeBoxPalette) {
    ExpectPalette(kBoxes, -1,
                  {0x302810, 0x3040D0, 0xD04020, 0x38C830, 0xD050D0, 0x304080, 0xD0D030, 0x38D0D8,
                   0x307830, 0xD05088, 0x9058C8, 0x50D088, 0xD8D0D0, 0x803030, 0x885088, 0xD08828,
                   0x4090D0, 0x88C830, 0x90D0D8, 0x808838, 0x389088, 0x383048, 0xD8D088, 0xD03860});
}

TEST(Quantizer, NeuralLookupFindsTheNearestEntry) {
    auto noise = test::MakeNoise(zm24RGB, 80, 60, 21);
    std::vector<TRGB> map;
    TZmQuantizer quantizer(*noise, map, 200);
    auto queries = test::MakeNoise(zm24RGB, 64, 32, 22);
    for (std::int32_t i = 0; i < 64 * 32; ++i) {
        TRGB color = queries->GetPixels_zm24RGB(i % 64, i / 64);
        color.g = static_cast<std::uint8_t>(i);  // every green value, with its ends
        std::int32_t nearest = 1000;
        for (const TRGB& entry : map) {
            nearest = std::min(nearest, Distance(entry, color));
        }
        const auto index = static_cast<std::size_t>(quantizer.GetRGBIndex(color));
        ASSERT_EQ(Distance(map[index], color), nearest) << i;
    }
}

// A row of colours gets the answers of single ones, whatever answers them: exact colours, greys,
// the network, boxes, a palette of the image's own (also for colours that it has not).
TEST(Quantizer, RowsAndSingleColoursAgree) {
    auto queries = test::MakeNoise(zm24RGB, 300, 1, 41);
    const auto* const row = reinterpret_cast<const TRGB*>(queries->GetScanLine(0));
    const struct {
        TZmPixelFormat format;
        std::int32_t width;
        std::int32_t method;
    } cases[] = {{zm24RGB, 12, kNeural},
                 {zm8g, 40, kNeural},
                 {zm24RGB, 40, kNeural},
                 {zm24RGB, 40, kBoxes},
                 {zm8p, 40, kNeural}};
    for (const auto& c : cases) {
        const TReductionSettings settings(c.method, -1);
        auto image = test::MakeNoise(c.format, c.width, 20, 42);
        std::vector<TRGB> map;
        TZmQuantizer by_row(*image, map, 256);
        TZmQuantizer by_color(*image, map, 256);
        std::vector<std::uint16_t> indexes(300);
        for (int round = 0; round < 2; ++round) {
            by_row.GetRGBIndexes(row, indexes.size(), indexes.data());
            for (std::size_t i = 0; i < indexes.size(); ++i) {
                ASSERT_EQ(indexes[i], by_color.GetRGBIndex(row[i])) << int{c.format} << ' ' << i;
            }
        }
    }
}

// Every count, against the formula in plain numbers; what lies behind stays as it was.
TEST(Quantizer, MovesTowardTheTarget) {
    for (std::size_t count = 0; count <= 70; ++count) {
        std::vector<std::int32_t> powers;
        std::vector<std::int32_t> values;
        for (std::size_t i = 0; i < 70 + 2 * kContestBlock; ++i) {
            powers.push_back(static_cast<std::int32_t>(i * 7919 * 31 % 262145));
            values.push_back(static_cast<std::int32_t>(i * 1237 % 4081));
        }
        std::vector<std::int32_t> expected = values;
        const auto target = static_cast<std::int32_t>(count * 997 % 4081);
        for (std::size_t i = 0; i < count; ++i) {
            expected[i] -= (values[i] - target) * powers[i] / 262144;
        }
        MoveToward(values.data(), powers.data(), count, target);
        ASSERT_EQ(values, expected) << count;
    }
}

// Vectors of neurons and single ones find the same winners, ties included, and leave the same
// frequencies and biases.
TEST(Quantizer, ContestsAgree) {
    std::uint32_t state = 5;
    const auto random = [&](std::int32_t count) {
        state = state * 1664525u + 1013904223u;
        return static_cast<std::int32_t>((state >> 8) % static_cast<std::uint32_t>(count));
    };
    for (std::int32_t count = 1; count <= 70; ++count) {
        const std::size_t padded =
            (static_cast<std::size_t>(count) + kContestBlock - 1) / kContestBlock * kContestBlock;
        std::vector<std::int32_t> channels[3];
        for (auto& channel : channels) {
            channel.assign(padded, kContestFarAway);
            std::generate_n(channel.begin(), count, [&] { return random(40) * 100; });
        }
        std::vector<std::int32_t> freq(padded, 0);
        std::vector<std::int32_t> bias(padded, 0);
        std::generate_n(freq.begin(), count, [&] { return random(66000); });
        std::generate_n(bias.begin(), count, [&] { return (random(8000) - 4000) * 16384; });
        auto plain_freq = freq;
        auto plain_bias = bias;
        for (int round = 0; round < 8; ++round) {
            const std::int32_t b = random(256) * 16;
            const std::int32_t g = random(256) * 16;
            const std::int32_t r = random(256) * 16;
            const auto view = [&](std::vector<std::int32_t>& f, std::vector<std::int32_t>& s) {
                return TContestView{channels[0].data(), channels[1].data(), channels[2].data(),
                                    f.data(),           s.data(),           padded};
            };
            ASSERT_EQ(RunContest(view(freq, bias), b, g, r),
                      RunContestPlain(view(plain_freq, plain_bias), b, g, r))
                << count;
            ASSERT_EQ(freq, plain_freq);
            ASSERT_EQ(bias, plain_bias);
        }
    }
}

TEST(Quantizer, SamplingFactor) {
    const struct {
        std::int32_t quality;
        std::int64_t pixels;
        std::int32_t factor;
    } cases[] = {{100, 5000, 1},   {0, 5000, 30},     {50, 5000, 15},    {99, 5000, 1},
                 {96, 5000, 2},    {200, 5000, 1},    {-1000, 5000, 30}, {-1, 0, 1},
                 {-1, 1000, 1},    {-1, 1999, 1},     {-1, 2000, 2},     {-1, 150000, 15},
                 {-1, 320769, 30}, {-1, 12000000, 30}};
    for (const auto& c : cases) {
        EXPECT_EQ(NeuralSamplingFactor(c.quality, c.pixels), c.factor)
            << c.quality << ", " << c.pixels;
    }
}

TEST(Quantizer, StepSharesNoFactorWithTheImage) {
    EXPECT_EQ(NeuralStep(1000), 499);
    EXPECT_EQ(NeuralStep(499), 491);
    EXPECT_EQ(NeuralStep(499 * 491), 487);
    EXPECT_EQ(NeuralStep(499LL * 491 * 487), 503);
}

TEST(ReduceToTwoColors, FindsTheTwoAndTheirOrder) {
    const TRGB white = Color(255, 255, 255);
    const struct {
        std::vector<TRGB> pixels;
        TRGB dark;
        TRGB light;
        std::vector<bool> bits;  // none: refused
    } cases[] = {
        {{Color(250, 250, 0), Color(0, 0, 90), Color(250, 250, 0)},
         Color(0, 0, 90),
         Color(250, 250, 0),
         {true, false, true}},
        {{white, white}, {}, white, {true, true}},
        {{Color(9, 0, 0)}, Color(9, 0, 0), white, {false}},
        {{Color(1, 0, 0), Color(2, 0, 0), Color(3, 0, 0)}, {}, {}, {}},
    };
    TZmBitmap source;
    TZmBitmap bits;
    TRGB dark;
    TRGB light;
    EXPECT_FALSE(ReduceToTwoColors(source, bits, dark, light));
    for (const auto& c : cases) {
        MakeRow(source, c.pixels);
        ASSERT_EQ(ReduceToTwoColors(source, bits, dark, light), !c.bits.empty());
        EXPECT_EQ(bits.IsEmpty(), c.bits.empty());
        for (std::size_t x = 0; x < c.bits.size(); ++x) {
            EXPECT_EQ(bits.GetPixels_zm1g(static_cast<std::int32_t>(x), 0), c.bits[x]) << x;
            EXPECT_EQ(dark, c.dark);
            EXPECT_EQ(light, c.light);
        }
        EXPECT_EQ(source.GetPixelFormat(), zm24RGB);
    }
}

}  // namespace
}  // namespace zm
