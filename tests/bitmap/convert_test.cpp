#include <gtest/gtest.h>

#include <algorithm>
#include <cmath>
#include <cstring>
#include <fstream>
#include <limits>
#include <sstream>

#include "engine/bitmap/zmonebit_p.h"
#include "engine/bitmap/zmrowconvert.h"
#include "tests/bitmap/place_support.h"
#include "tests/support/testimages.h"

namespace zm::test {
namespace {

/// Sets the channels of a pixel from a list in memory order.
void SetChannels(TZmBitmap& bitmap, const std::vector<double>& values) {
    const auto byte = [&values](std::size_t i) { return static_cast<std::uint8_t>(values[i]); };
    const auto word = [&values](std::size_t i) { return static_cast<std::uint16_t>(values[i]); };
    switch (bitmap.GetPixelFormat()) {
        case zm1g: return bitmap.SetPixels_zm1g(0, 0, values[0] != 0);
        case zm16g: return bitmap.SetPixels_zm16g(0, 0, word(0));
        case zm32f: return bitmap.SetPixels_zm32f(0, 0, static_cast<float>(values[0]));
        case zm48RGB: return bitmap.SetPixels_zm48RGB(0, 0, TRGB48{word(0), word(1), word(2)});
        case zmCIELab:
            return bitmap.SetPixels_zmCIELab(0, 0,
                                             TCIELab{byte(0), static_cast<std::int8_t>(values[1]),
                                                     static_cast<std::int8_t>(values[2])});
        default:
            for (std::size_t i = 0; i < values.size(); ++i) {
                bitmap.GetScanLine(0)[i] = byte(i);
            }
    }
}

struct TCell {
    TZmPixelFormat format;
    std::vector<double> channels;
};

// Every cell of the matrix by a value that is worked out by hand from its formula: a source pixel,
// then what it becomes in each other format, channels in memory order. zm8p stands with blue,
// green and red of its entry; as the source it is the index of the colour that the test sets. The
// colour is red 200, green 100, blue 50 where the source can hold it: grey (4200 + 7100 + 400) /
// 100 = 117, 16-bit grey 30184650 / 1000, float (42.52 + 71.52 + 3.61) / 255, inks against K = 200.
constexpr const char* kMatrix[] = {
    "zm1g 1  zm8p 255 255 255  zm8g 255  zm16g 65535  zm24RGB 255 255 255  zm32f 1"
    " zmCMYK 255 255 255 255  zm48RGB 65535 65535 65535  zmCIELab 255 0 0  zm32RGB 255 255 255 255",
    "zm1g 0  zm8p 0 0 0  zm8g 0  zm16g 0  zm24RGB 0 0 0  zm32f 0"
    " zmCMYK 255 255 255 0  zm48RGB 0 0 0  zmCIELab 0 0 0  zm32RGB 0 0 0 255",
    "zm8p 3  zm1g 1  zm8g 117  zm16g 30184  zm24RGB 50 100 200  zm32f 0.4613725490196"
    " zmCMYK 255 128 64 200  zm48RGB 51400 25700 12850  zmCIELab 136 36 45  zm32RGB 50 100 200 255",
    "zm8g 100  zm1g 1  zm8p 100 100 100  zm16g 25700  zm24RGB 100 100 100  zm32f 0.3921568627451"
    " zmCMYK 255 255 255 100  zm48RGB 25700 25700 25700  zmCIELab 108 0 0  zm32RGB 100 100 100 255",
    // 64 7F in bytes.
    "zm16g 25727  zm1g 1  zm8p 100 100 100  zm8g 100  zm24RGB 100 100 100  zm32f 0.3925688563363"
    " zmCMYK 255 255 255 100  zm48RGB 25727 25727 25727  zmCIELab 108 0 0  zm32RGB 100 100 100 255",
    "zm24RGB 50 100 200  zm1g 1  zm8p 50 100 200  zm8g 117  zm16g 30184  zm32f 0.4613725490196"
    " zmCMYK 255 128 64 200  zm48RGB 51400 25700 12850  zmCIELab 136 36 45  zm32RGB 50 100 200 255",
    // White: 255 * 257000 / 1000.
    "zm24RGB 255 255 255  zm1g 1  zm8p 255 255 255  zm8g 255  zm16g 65535  zm32f 1"
    " zmCMYK 255 255 255 255  zm48RGB 65535 65535 65535  zmCIELab 255 0 0  zm32RGB 255 255 255 255",
    "zm32f 0.5  zm1g 1  zm8p 127 127 127  zm8g 127  zm16g 32767  zm24RGB 127 127 127"
    " zmCMYK 255 255 255 127  zm48RGB 32767 32767 32767  zmCIELab 135 0 0  zm32RGB 127 127 127 255",
    // 200 * 255 / 255, 200 * 128 / 255 = 100, 200 * 64 / 255 = 50
    "zmCMYK 255 128 64 200  zm1g 1  zm8p 50 100 200  zm8g 117  zm16g 30184  zm24RGB 50 100 200"
    " zm32f 0.4613725490196  zm48RGB 51400 25700 12850  zmCIELab 136 36 45  zm32RGB 50 100 200 255",
    // High bytes 200, 100, 50. Grey (10908460 + 18253513 + 969600) / 1000, float by words.
    "zm48RGB 51455 25601 12928  zm1g 1  zm8p 50 100 200  zm8g 117  zm16g 30131  zm24RGB 50 100 200"
    " zm32f 0.4623555422794  zmCMYK 255 128 64 200  zmCIELab 136 36 45  zm32RGB 50 100 200 255",
    // Red 199, green 100, blue 50: grey 11679 / 100, 30130166 / 1000, 117.4374 / 255.
    "zmCIELab 136 36 45  zm1g 1  zm8p 50 100 199  zm8g 116  zm16g 30130  zm24RGB 50 100 199"
    " zm32f 0.4605388235294  zmCMYK 255 129 65 199  zm48RGB 51143 25700 12850"
    " zm32RGB 50 100 199 255",
    "zm32RGB 50 100 200 9  zm1g 1  zm8p 50 100 200  zm8g 117  zm16g 30184  zm24RGB 50 100 200"
    " zm32f 0.4613725490196  zmCMYK 255 128 64 200  zm48RGB 51400 25700 12850"
    " zmCIELab 136 36 45"};

/// The source's pixel first.
std::vector<TCell> CellsOf(const char* row) {
    std::vector<TCell> cells;
    std::istringstream words(row);
    for (std::string word; words >> word;) {
        if (word[0] == 'z') {
            const auto* const format =
                std::find_if(std::begin(kAllFormats), std::end(kAllFormats),
                             [&word](auto each) { return word == PixelFormatInfo(each).name; });
            cells.push_back({*format, {}});
        } else {
            cells.back().channels.push_back(std::stod(word));
        }
    }
    return cells;
}

void MakeSource(TZmBitmap& bitmap, const TCell& cell) {
    ASSERT_TRUE(bitmap.Allocate(1, 1, cell.format));
    bitmap.Fill(0.0);
    if (cell.format == zm8p) {
        bitmap.SetPalette(3, TRGB{50, 100, 200});
    }
    SetChannels(bitmap, cell.channels);
}

void ExpectChannels(TZmBitmap& bitmap, const std::vector<double>& expected) {
    if (bitmap.GetPixelFormat() == zm8p) {
        const TRGB rgb = bitmap.GetPixels(0, 0);
        EXPECT_EQ(std::vector<double>({static_cast<double>(rgb.b), static_cast<double>(rgb.g),
                                       static_cast<double>(rgb.r)}),
                  expected);
        return;
    }
    for (std::size_t i = 0; i < expected.size(); ++i) {
        const double got = ChannelValue(bitmap, 0, 0, static_cast<std::int32_t>(i));
        const double tolerance = bitmap.GetPixelFormat() == zm32f ? 1e-7 : 0;
        EXPECT_NEAR(got, expected[i], tolerance) << "channel " << i;
    }
}

TEST(ConversionMatrix, GivesTheStatedValueInEveryCell) {
    for (const char* const row : kMatrix) {
        const std::vector<TCell> cells = CellsOf(row);
        ASSERT_EQ(cells.size(), std::size(kAllFormats)) << row;
        for (std::size_t i = 1; i < cells.size(); ++i) {
            SCOPED_TRACE(std::string(PixelFormatInfo(cells[0].format).name) + " to " +
                         PixelFormatInfo(cells[i].format).name);
            TZmBitmap source;
            MakeSource(source, cells[0]);
            TZmBitmap dest(1, 1, cells[i].format);
            dest.SetDefaultDitherMethod(zmOrdered);
            dest.CopyAndConvertFormat(&source);
            ExpectChannels(dest, cells[i].channels);
            TZmBitmap property;
            MakeSource(property, cells[0]);
            property.SetDefaultDitherMethod(zmOrdered);
            EXPECT_TRUE(property.SetPixelFormat(cells[i].format));
            ExpectChannels(property, cells[i].channels);
        }
    }
}

TEST(ConversionMatrix, ChangesTheSourceOnlyOnTheRouteThrough24) {
    for (const TZmPixelFormat from : kAllFormats) {
        for (const TZmPixelFormat to : kAllFormats) {
            const bool is_via_24 =
                from != to && from != zm24RGB &&
                (((from == zmCMYK || from == zmCIELab) && to != zm24RGB && to != zm32RGB) ||
                 (from == zm32RGB && to != zm24RGB) || to == zmCMYK || to == zmCIELab ||
                 (from == zm48RGB && (to == zm8p || to == zm1g)));
            const auto source = MakeGradient(from, 5, 4);
            TZmBitmap dest(5, 4, to);
            dest.CopyAndConvertFormat(source.get());
            EXPECT_EQ(source->GetPixelFormat(), is_via_24 ? zm24RGB : from)
                << PixelFormatInfo(from).name << " to " << PixelFormatInfo(to).name;
        }
    }
    // 16-bit colours become bits by their high bytes without a detour when ordered.
    const auto source = MakeGradient(zm48RGB, 5, 4);
    TZmBitmap dest(5, 4, zm1g);
    dest.SetDefaultDitherMethod(zmOrdered);
    dest.CopyAndConvertFormat(source.get());
    EXPECT_EQ(source->GetPixelFormat(), zm48RGB);
}

TEST(ConversionMatrix, DoesNothingForOtherSizesAndEqualFormats) {
    TZmBitmap dest(3, 3, zm24RGB);
    dest.Fill(7.0);
    TZmBitmap other(3, 4, zm8g);
    other.Fill(200.0);
    dest.CopyAndConvertFormat(&other);
    TZmBitmap same(3, 3, zm24RGB);
    same.Fill(200.0);
    same.AlphaFill(9);
    dest.CopyAndConvertFormat(&same);
    dest.CopyAndConvertFormat(&dest);
    dest.CopyAndConvertFormat(nullptr);
    EXPECT_EQ(dest.GetPixels_zm24RGB(2, 2), (TRGB{0, 0, 7}));
    EXPECT_EQ(dest.GetAlpha(2, 2), 9);  // the plane follows in all cases
}

TEST(ConversionMatrix, TakesEveryRowAlone) {
    // A whole row gives what its pixels give one by one, and no byte behind it changes.
    for (const TZmPixelFormat from : kAllFormats) {
        for (const TZmPixelFormat to : kAllFormats) {
            const TZmRowFunction convert = FindRowFunction(from, to);
            if (convert == nullptr) {
                continue;
            }
            const auto source = MakeNoise(from, 300, 1, 11);
            const TZmRowContext context = MakeRowContext(source->GetPaletteArray().data());
            const auto dest_bytes = static_cast<std::size_t>(PixelFormatInfo(to).bit_count / 8);
            for (std::int32_t width = 1; width <= 300; width += width < 70 ? 1 : 77) {
                const auto size = static_cast<std::size_t>(width) * dest_bytes;
                std::vector<std::uint8_t> dest(size + 16, 0xC3);
                convert(source->GetScanLine(0), dest.data(), width, context);
                for (std::size_t i = size; i < dest.size(); ++i) {
                    ASSERT_EQ(dest[i], 0xC3) << "behind " << width;
                }
                for (std::int32_t x = 0; x < width; ++x) {
                    std::uint8_t pixel[8] = {};
                    TZmBitmap one(1, 1, from);
                    source->CopyPaletteTo(&one);
                    source->CopyRectTo(&one, x, 0, 0, 0, 1, 1, false);
                    convert(one.GetScanLine(0), pixel, 1, context);
                    ASSERT_EQ(std::memcmp(pixel, &dest[static_cast<std::size_t>(x) * dest_bytes],
                                          dest_bytes),
                              0)
                        << PixelFormatInfo(from).name << " to " << PixelFormatInfo(to).name
                        << " width " << width << " x " << x;
                }
            }
        }
    }
}

/// A provider of a picture that it does not have.
class TNoRows : public TZmVirtualBitmapProvider {
public:
    std::uint8_t* GetRow(TZmBitmap*, std::int32_t, std::int32_t, std::int32_t) override {
        return nullptr;
    }
};

TEST(ConversionMatrix, LeavesPixelsOfWhichNoRowIsToBeHad) {
    for (const TZmPixelFormat from : {zm8p, zm8g, zm16g, zm24RGB, zm32f, zm48RGB}) {
        for (const TZmPixelFormat to : {zm1g, zm24RGB}) {
            for (const TZmDitherMethod method : {zmOrdered, zmThreshold}) {
                TNoRows no_rows;
                TZmBitmap source;
                source.SetVirtualProvider(&no_rows);
                ASSERT_TRUE(source.Allocate(20, 3, from));
                const auto dest = MakeNoise(to, 20, 3, 1);
                TZmBitmap before(*dest);
                dest->SetDefaultDitherMethod(method);
                dest->SetWhiteValue(100);
                dest->CopyAndConvertFormat(&source);
                if (from != zm48RGB || to != zm1g) {  // which goes through a copy of black
                    ExpectSamePixels(before, *dest);
                }
                EXPECT_EQ(source.IsGrayScale(), from != zm24RGB && from != zm48RGB);
            }
        }
    }
}

TEST(LargeConversion, GivesTheBytesOfItsRows) {
    // So large that rows go past the caches, into rows that begin anywhere in a line of 64 bytes.
    constexpr std::pair<TZmPixelFormat, TZmPixelFormat> kPairs[] = {
        {zm8g, zm24RGB}, {zm24RGB, zm32RGB}, {zm24RGB, zm48RGB}, {zm32RGB, zm24RGB}};
    for (const auto& [from, to] : kPairs) {
        const auto noise = MakeNoise(from, 1701, 1, 5);
        TZmBitmap source(1701, 1700, from);
        for (std::int32_t y = 0; y < 1700; ++y) {
            noise->CopyRectTo(&source, 0, 0, 0, y, 1701, 1, false);
            *source.GetScanLine(y) = static_cast<std::uint8_t>(y);
        }
        const auto row_bytes =
            static_cast<std::size_t>(CalcRowLen(1701, PixelFormatInfo(to).bit_count, 32).value());
        std::vector<std::uint8_t> memory(row_bytes * 1700 + 128, 0xC3);
        TZmBitmap dest;
        dest.EncapsulateMemory(memory.data() + 60, 1701, 1700, to, true, zmboBOTTOMLEFT);
        dest.CopyAndConvertFormat(&source);
        std::vector<std::uint8_t> row(row_bytes, 0xC3);
        for (std::int32_t y = 0; y < 1700; ++y) {
            FindPlainRowFunction(from, to)(source.GetScanLine(y), row.data(), 1701,
                                           TZmRowContext{});
            ASSERT_EQ(std::memcmp(row.data(), dest.GetScanLine(y), row_bytes), 0)
                << PixelFormatInfo(from).name << " row " << y;
        }
        EXPECT_EQ(memory[59], 0xC3);
        EXPECT_EQ(memory[60 + row_bytes * 1700], 0xC3);
    }
}

/// Anonymous memory of this process in bytes; nothing where the system does not tell.
std::optional<std::int64_t> AnonymousBytes() {
    std::ifstream status("/proc/self/status");
    for (std::string line; std::getline(status, line);) {
        if (line.rfind("RssAnon:", 0) == 0) {
            return std::stoll(line.substr(8)) * 1024;
        }
    }
    return std::nullopt;
}

/// Looks at the process's memory in the middle of conversions.
class TMemoryWatch : public TZmCMYKTransform {
public:
    void Transform(const std::uint16_t*, std::uint16_t* colors, std::int32_t count) const override {
        std::fill_n(colors, 3 * count, std::uint16_t{65535});
        if (calls_++ % 1000 == 0) {
            most_ = std::max(most_, AnonymousBytes().value_or(0));
        }
    }
    std::int64_t Most() const { return most_; }

private:
    mutable std::int64_t most_ = 0;
    mutable std::int64_t calls_ = 0;
};

TEST(LargeConversion, OnDiskTakesConstantMemory) {
    if (!AnonymousBytes().has_value()) {
        GTEST_SKIP() << "this system does not tell";
    }
#ifdef __SANITIZE_THREAD__
    GTEST_SKIP() << "the sanitizer keeps a shadow of what was read";
#endif
    // Through zm24RGB to grey: 24 MB, 18 MB and 6 MB, each of which would show.
    const TForcedPlace on_disk(kInFile, zmCMYK, 4000, 1500);
    TZmBitmap bitmap(4000, 1500, zmCMYK);
    TZmBitmap wide(4000, 1500, zm32RGB);
    ASSERT_EQ(bitmap.GetLocation(), zmFile);
    const std::int64_t before = *AnonymousBytes();
    const TMemoryWatch watch;
    SetCMYKTransform(&watch);
    wide.CopyAndConvertFormat(&bitmap);
    EXPECT_TRUE(bitmap.SetPixelFormat(zm8g));
    SetCMYKTransform(nullptr);
    EXPECT_EQ(bitmap.GetLocation(), zmFile);
    EXPECT_EQ(bitmap.GetPixels_zm8(3999, 1499), 255);
    EXPECT_GT(watch.Most(), 0);
    EXPECT_LT(watch.Most() - before, 4 << 20);
    EXPECT_LT(*AnonymousBytes() - before, 4 << 20);
}

// Grey.

TEST(Gray, TakesItsWeightsFromTheSettings) {
    struct TCase {
        std::int32_t red, green, blue;
        std::uint8_t gray;  // of red 200, green 100, blue 50
    };
    constexpr TCase kCases[] = {{100, 0, 0, 200},
                                {0, 0, 100, 50},
                                {100, 100, 100, 94},  // 350, low 8 bits
                                {100, -100, 0, 100},
                                {2000000000, 0, 0, 0}};  // 4000000000: low 8 bits 0
    TZmZalmoGlobalSettings& settings = ZmGlobalSettings();
    for (const TCase& test : kCases) {
        const TSettingGuard red(settings.fRedToGrayCoef, test.red);
        const TSettingGuard green(settings.fGreenToGrayCoef, test.green);
        const TSettingGuard blue(settings.fBlueToGrayCoef, test.blue);
        TZmBitmap color(3, 1, zm24RGB);
        color.Fill(static_cast<double>(0x003264C8));
        TZmBitmap gray(3, 1, zm8g);
        gray.CopyAndConvertFormat(&color);
        EXPECT_EQ(gray.GetPixels_zm8(2, 0), test.gray);
    }
    // 255 * 8 / 100, 255 * 71 / 100 and 255 * 21 / 100, each rounded down.
    EXPECT_EQ(GrayByCoef(TRGB{255, 0, 0}, TZmRowContext{}), 20);
    EXPECT_EQ(GrayByCoef(TRGB{0, 255, 0}, TZmRowContext{}), 181);
    EXPECT_EQ(GrayByCoef(TRGB{0, 0, 255}, TZmRowContext{}), 53);
}

TEST(GrayRange, StretchesOnceAndIsUsedUp) {
    struct TCase {
        TZmPixelFormat format;
        double black, white, value;
        std::uint8_t result;
    };
    constexpr TCase kCases[] = {
        {zm8g, 10, 20, 15, 127},  // Trunc(5 / 10 * 255)
        {zm8g, 10, 20, 5, 0},
        {zm8g, 10, 20, 25, 255},
        {zm8g, 20, 10, 15, 127},
        {zm8g, 20, 10, 25, 0},
        {zm8g, 10.75, 20.5, 10, 0},     // limited to 10: below black
        {zm16g, 1000, 3000, 1500, 63},  // Trunc(500 / 2000 * 255)
        {zm16g, 1000, 3000, 65535, 255},
        {zm16g, 0, 0, 0x7F80, 0x7F},
    };
    for (const TCase& test : kCases) {
        TZmBitmap source(3, 2, test.format);
        source.Fill(test.value);
        TZmBitmap dest(3, 2, zm24RGB);
        dest.SetBlackValue(test.black);
        dest.SetWhiteValue(test.white);
        dest.CopyAndConvertFormat(&source);
        EXPECT_EQ(dest.GetPixels_zm24RGB(2, 1), (TRGB{test.result, test.result, test.result}));
        EXPECT_EQ(dest.GetBlackValue(), 0);
        EXPECT_EQ(dest.GetWhiteValue(), 0);
    }
}

TEST(Float, OutsideItsScaleIsLimited) {
    struct TCase {
        float value;
        std::uint8_t byte;
        std::uint16_t word;
    };
    const TCase kCases[] = {{-0.5f, 0, 0},
                            {1.5f, 255, 65535},
                            {1e30f, 255, 65535},
                            {std::nanf(""), 0, 0},
                            {std::numeric_limits<float>::infinity(), 255, 65535},
                            {0.999f, 254, 65469}};
    for (const TCase& test : kCases) {
        TZmBitmap source(1, 1, zm32f);
        source.SetPixels_zm32f(0, 0, test.value);
        TZmBitmap bytes(1, 1, zm8g);
        bytes.CopyAndConvertFormat(&source);
        EXPECT_EQ(bytes.GetPixels_zm8(0, 0), test.byte);
        TZmBitmap words(1, 1, zm16g);
        words.CopyAndConvertFormat(&source);
        EXPECT_EQ(words.GetPixels_zm16g(0, 0), test.word);
    }
}

// One bit.

TEST(OneBit, OrderedComparesWithTheMatrix) {
    struct TCase {
        std::int32_t x, y, entry;
    };
    constexpr TCase kCases[] = {{0, 0, 0},  {1, 0, 48}, {0, 1, 32},   {4, 4, 1},    {7, 1, 31},
                                {7, 7, 21}, {2, 3, 36}, {10, 19, 36}, {13, 14, 57}, {8, 8, 0}};
    for (const TCase& test : kCases) {
        for (const std::int32_t offset : {0, 1}) {
            TZmBitmap gray(20, 20, zm8g);
            gray.Fill(static_cast<double>(test.entry * 4 + offset * 4));
            TZmBitmap words(20, 20, zm16g);
            words.Fill(static_cast<double>((test.entry * 4 + offset * 4) << 8));
            for (TZmBitmap* source : {&gray, &words}) {
                TZmBitmap bits(20, 20, zm1g);
                bits.SetDefaultDitherMethod(zmOrdered);
                bits.CopyAndConvertFormat(source);
                EXPECT_EQ(bits.GetPixels_zm1g(test.x, test.y), offset == 1)
                    << test.x << ", " << test.y;
            }
        }
    }
}

TEST(OneBit, OrderedOfFloatsSetsTheFirstEntryOnly) {
    for (const float value : {0.0f, 0.01f, 1.0f}) {
        TZmBitmap source(16, 8, zm32f);
        source.Fill(static_cast<double>(value));
        TZmBitmap bits(16, 8, zm1g);
        bits.SetDefaultDitherMethod(zmOrdered);
        bits.CopyAndConvertFormat(&source);
        for (std::int32_t y = 0; y < 8; ++y) {
            for (std::int32_t x = 0; x < 16; ++x) {
                EXPECT_EQ(bits.GetPixels_zm1g(x, y), value > 0 && x % 8 == 0 && y == 0);
            }
        }
    }
}

TEST(OneBit, FindsTheLevelBetweenTwoMeans) {
    struct TCase {
        std::vector<std::uint8_t> values;
        std::int32_t level;
    };
    const TCase kCases[] = {
        // mean 90; means 13.3 and 205 give 109, which stays
        {{10, 10, 20, 200, 210}, 109},
        // mean 35; 6.6 and 107.75 give 57; 11.8 and 177.5 give 94, which stays
        {{0, 0, 0, 0, 0, 0, 32, 34, 36, 40, 100, 255, 0, 0}, 94},
        {{0, 255}, 127},
        {{7, 7, 7}, 127},  // a single grey
        {{}, 127},
    };
    for (const TCase& test : kCases) {
        TGrayHistogram histogram{};
        AddToHistogram(test.values.data(), static_cast<std::int32_t>(test.values.size()),
                       histogram);
        EXPECT_EQ(FindAutomaticLevel(histogram), test.level);
    }
}

TEST(OneBit, ThresholdSetsWhatIsAboveTheLevel) {
    for (const TZmPixelFormat format : {zm8p, zm8g, zm16g, zm24RGB, zm32f, zm48RGB, zm32RGB}) {
        TZmBitmap source(11, 2, zm8g);
        constexpr std::uint8_t kValues[] = {10, 10, 20, 200, 210, 109, 110, 10, 10, 10, 210};
        for (std::int32_t y = 0; y < 2; ++y) {
            std::memcpy(source.GetScanLine(y), kValues, sizeof kValues);
        }
        source.SetPixelFormat(format);
        ASSERT_EQ(source.GetPixelFormat(), format);
        ASSERT_TRUE(source.SetPixelFormat(zm1g));
        for (std::int32_t x = 0; x < 11; ++x) {
            EXPECT_EQ(source.GetPixels_zm1g(x, 1), kValues[x] > 105)
                << PixelFormatInfo(format).name;
        }
        EXPECT_EQ(source.GetScanLine(0)[1] & 0x1F, 0);
    }
    TZmBitmap white(9, 1, zm8g);
    white.Fill(255.0);
    ASSERT_TRUE(white.SetPixelFormat(zm1g));
    EXPECT_TRUE(white.GetPixels_zm1g(8, 0));
}

TEST(OneBit, DitheringLeavesTheBits) {
    const auto source = MakeNoise(zm8g, 20, 5, 1);
    const auto bits = MakeNoise(zm1g, 20, 5, 2);
    TZmBitmap before(*bits);
    bits->SetDefaultDitherMethod(zmDithering);
    bits->CopyAndConvertFormat(source.get());
    ExpectSamePixels(before, *bits);
}

// Palettes.

TEST(PaletteConversion, SetsTheStatedPalettes) {
    TZmBitmap bits(2, 1, zm1g);
    bits.Fill(0.0);
    bits.SetPixels_zm1g(1, 0, true);
    ASSERT_TRUE(bits.SetPixelFormat(zm8p));
    EXPECT_EQ(bits.GetPixels_zm8(1, 0), 1);
    EXPECT_EQ(bits.GetPalette(0), TRGB{});
    EXPECT_EQ(bits.GetPalette(1), (TRGB{255, 255, 255}));
    for (const TZmPixelFormat format : {zm8g, zm16g, zm32f}) {
        TZmBitmap gray(2, 1, format);
        gray.Fill(0.0);
        ASSERT_TRUE(gray.SetPixelFormat(zm8p));
        EXPECT_EQ(gray.GetPalette(77), (TRGB{77, 77, 77}));
    }
}

TEST(PaletteConversion, KeepsFewColoursExactly) {
    const auto source = MakeNoise(zm24RGB, 10, 10, 3);  // 100 colours
    TZmBitmap before(*source);
    ASSERT_TRUE(source->SetPixelFormat(zm8p));
    EXPECT_EQ(source->GetPaletteLen(), 256);
    for (std::int32_t i = 0; i < 100; ++i) {
        EXPECT_EQ(source->GetPixels(i % 10, i / 10), before.GetPixels_zm24RGB(i % 10, i / 10));
    }
}

// Inks and CIELab.

TEST(Inks, RestoreEveryColourExactly) {
    const TZmRowFunction to_inks = FindRowFunction(zm24RGB, zmCMYK);
    const TZmRowFunction to_rgb = FindRowFunction(zmCMYK, zm24RGB);
    std::vector<std::uint8_t> row(256 * 3);
    std::vector<std::uint8_t> inks(256 * 4);
    std::vector<std::uint8_t> back(256 * 3);
    for (int r = 0; r < 256; r += 5) {
        for (int g = 0; g < 256; ++g) {
            for (std::size_t b = 0; b < 256; ++b) {
                row[b * 3] = static_cast<std::uint8_t>(b);
                row[b * 3 + 1] = static_cast<std::uint8_t>(g);
                row[b * 3 + 2] = static_cast<std::uint8_t>(r);
            }
            to_inks(row.data(), inks.data(), 256, TZmRowContext{});
            to_rgb(inks.data(), back.data(), 256, TZmRowContext{});
            ASSERT_EQ(back, row) << "red " << r << " green " << g;
        }
    }
}

TEST(Inks, OfWhiteAndBlack) {
    TZmBitmap inks(2, 1, zmCMYK);
    inks.SetPixels_zmCMYK(0, 0, TCMYK{255, 255, 255, 255});
    inks.SetPixels_zmCMYK(1, 0, TCMYK{200, 100, 50, 0});
    TZmBitmap rgb(2, 1, zm32RGB);
    rgb.CopyAndConvertFormat(&inks);
    EXPECT_EQ(rgb.GetPixels_zm32RGB(0, 0), (TRGBA{255, 255, 255, 255}));
    EXPECT_EQ(rgb.GetPixels_zm32RGB(1, 0), (TRGBA{0, 0, 0, 255}));
}

/// Red takes the cyan word, green the yellow word and blue the black word.
class TTestTransform : public TZmCMYKTransform {
public:
    void Transform(const std::uint16_t* inks, std::uint16_t* colors,
                   std::int32_t count) const override {
        for (std::int32_t i = 0; i < count; ++i) {
            colors[3 * i] = inks[4 * i];
            colors[3 * i + 1] = inks[4 * i + 2];
            colors[3 * i + 2] = inks[4 * i + 3];
        }
    }
};

TEST(Inks, GoThroughTheColourTransformWhenSet) {
    const auto inks = MakeNoise(zmCMYK, 600, 2, 4);
    const TTestTransform transform;
    SetCMYKTransform(&transform);
    TZmBitmap rgb(600, 2, zm24RGB);
    rgb.CopyAndConvertFormat(inks.get());
    const TSettingGuard no_profile(ZmGlobalSettings().fUseCMYKProfile, false);
    TZmBitmap plain(600, 2, zm24RGB);
    plain.CopyAndConvertFormat(inks.get());
    SetCMYKTransform(nullptr);
    for (std::int32_t x = 0; x < 600; ++x) {
        const TCMYK ink = inks->GetPixels_zmCMYK(x, 1);
        const TRGB expected{static_cast<std::uint8_t>(255 - ink.k),
                            static_cast<std::uint8_t>(255 - ink.y),
                            static_cast<std::uint8_t>(255 - ink.c)};
        ASSERT_EQ(rgb.GetPixels_zm24RGB(x, 1), expected) << x;
        ASSERT_EQ(plain.GetPixels_zm24RGB(x, 1).r, ink.k * ink.c / 255) << x;
    }
}

TEST(CIELab, ComesOutAsComputedElsewhere) {
    struct TCase {
        TRGB rgb;
        TCIELab lab;
    };
    // From the formulas with independent double arithmetic, truncated.
    constexpr TCase kCases[] = {
        {{255, 255, 255}, {255, 0, 0}}, {{0, 0, 0}, {0, 0, 0}},
        {{0, 0, 255}, {135, 80, 67}},   // red: 135.74, 80.1, 67.2
        {{0, 255, 0}, {223, -86, 83}},  // green: 223.7, -86.2, 83.2
        {{255, 0, 0}, {82, 79, -107}},  // blue: 82.4, 79.2, -107.9
    };
    for (const TCase& test : kCases) {
        TZmBitmap lab(1, 1, zmCIELab);
        TZmBitmap rgb(1, 1, zm24RGB);
        rgb.SetPixels_zm24RGB(0, 0, test.rgb);
        lab.CopyAndConvertFormat(&rgb);
        EXPECT_EQ(lab.GetPixels_zmCIELab(0, 0), test.lab);
    }
    TZmBitmap lab(2, 1, zmCIELab);
    lab.SetPixels_zmCIELab(0, 0, TCIELab{128, -40, 60});  // 73.4, 134.6, below 0
    lab.SetPixels_zmCIELab(1, 0, TCIELab{128, 40, -60});  // 124.8, 98.99, 222.8
    TZmBitmap rgb(2, 1, zm24RGB);
    rgb.CopyAndConvertFormat(&lab);
    EXPECT_EQ(rgb.GetPixels_zm24RGB(0, 0), (TRGB{0, 135, 73}));
    EXPECT_EQ(rgb.GetPixels_zm24RGB(1, 0), (TRGB{223, 99, 125}));
}

// The property and its users.

TEST(PixelFormatProperty, KeepsThePlaneAndSurvivesAFullHeap) {
    const auto bitmap = MakeNoise(zmCMYK, 40, 30, 1);
    AddNoiseAlpha(*bitmap, 2);
    TZmBitmap before(*bitmap);
    const TSettingGuard no_disk(ZmGlobalSettings().fAutoLocateOnDisk, false);
    const TSettingGuard no_fragments(ZmGlobalSettings().fAutoFragmentBitmap, false);
    for (const std::int64_t bytes : {100, 40 * 30 * 2}) {
        const TBlockLimit limit(bytes);  // no room for the goal; room for it but not for 24 bits
        EXPECT_FALSE(bitmap->SetPixelFormat(bytes == 100 ? zm24RGB : zm8g));
    }
    ExpectSamePixels(before, *bitmap);
    ExpectSameAlpha(before, *bitmap);
    EXPECT_TRUE(bitmap->SetPixelFormat(zm8g));
    ExpectSameAlpha(before, *bitmap);
    EXPECT_FALSE(bitmap->SetPixelFormat(static_cast<TZmPixelFormat>(11)));
    EXPECT_FALSE(bitmap->SetPixelFormat(zmnull));
    EXPECT_EQ(bitmap->GetPixelFormat(), zm8g);
}

TEST(CheckFormat, TakesTheFirstWishThatIsAllowed) {
    struct TCase {
        TZmPixelFormat present;
        TZmPixelFormatSet allowed;
        TZmPixelFormat result;
    };
    const TCase kCases[] = {
        {zm1g, TZmPixelFormatSet(zm24RGB, zm32f), zm32f},
        {zm1g, TZmPixelFormatSet(zm24RGB, zm8g), zm8g},
        {zm8p, TZmPixelFormatSet(zm48RGB, zmCMYK), zmCMYK},
        {zm8g, TZmPixelFormatSet(zm24RGB, zm48RGB), zm24RGB},
        {zm16g, TZmPixelFormatSet(zm24RGB, zm8g), zm8g},
        {zm24RGB, TZmPixelFormatSet(zm8g, zm16g), zm16g},
        {zm24RGB, TZmPixelFormatSet(zmCIELab, zm48RGB), zmCIELab},
        {zm32f, TZmPixelFormatSet(zmCIELab, zm48RGB), zm48RGB},
        {zmCMYK, TZmPixelFormatSet(zm8g, zmCIELab), zmCIELab},
        {zm48RGB, TZmPixelFormatSet(zm16g, zm8g), zm16g},
        {zmCIELab, TZmPixelFormatSet(zm8g, zm48RGB), zm48RGB},
        {zm32RGB, TZmPixelFormatSet(zm8g, zmCMYK), zmCMYK},
        {zm1g, TZmPixelFormatSet(zm8p, zmCMYK), zmCMYK},  // none wished: from the highest
        {zm8p, TZmPixelFormatSet(zm1g, zm16g), zm16g},
        {zm24RGB, TZmPixelFormatSet(zm32RGB, zm32f), zm32RGB},
        {zm24RGB, TZmPixelFormatSet(), zm24RGB},  // an empty set allows all
        {zm24RGB, TZmPixelFormatSet(zm24RGB, zm8g), zm24RGB},
    };
    for (const TCase& test : kCases) {
        const auto bitmap = MakeGradient(test.present, 4, 4);
        const bool is_allowed = test.present == test.result;
        EXPECT_EQ(bitmap->CheckFormat(test.allowed, false), is_allowed);
        EXPECT_EQ(bitmap->GetPixelFormat(), test.present);
        EXPECT_TRUE(bitmap->CheckFormat(test.allowed, true));
        EXPECT_STREQ(PixelFormatInfo(bitmap->GetPixelFormat()).name,
                     PixelFormatInfo(test.result).name);
    }
}

TEST(IsGrayScale, LooksAtAllPixels) {
    for (const TZmPixelFormat format : {zm24RGB, zm32RGB, zm48RGB}) {
        TZmBitmap bitmap(5, 3, format);
        bitmap.Fill(static_cast<double>(0x00777777));
        EXPECT_TRUE(bitmap.IsGrayScale());
        TZmBitmap other(bitmap);
        bitmap.SetPixels(4, 2, TRGB{0x77, 0x77, 0x78});
        EXPECT_FALSE(bitmap.IsGrayScale());
        other.SetPixels(0, 0, TRGB{0x76, 0x77, 0x77});
        EXPECT_FALSE(other.IsGrayScale());
    }
    TZmBitmap indexed(1, 1, zm8p);
    indexed.SetPalette(9, TRGB{1, 2, 3});
    EXPECT_FALSE(indexed.IsGrayScale());
    indexed.SetPaletteUsed(9);
    EXPECT_TRUE(indexed.IsGrayScale());
    for (const TZmPixelFormat format : {zm1g, zm8g, zm16g, zm32f}) {
        EXPECT_TRUE(TZmBitmap(1, 1, format).IsGrayScale());
    }
    EXPECT_FALSE(TZmBitmap(1, 1, zmCMYK).IsGrayScale());
    EXPECT_FALSE(TZmBitmap(1, 1, zmCIELab).IsGrayScale());
}

}  // namespace
}  // namespace zm::test
