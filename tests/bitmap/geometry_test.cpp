#include <gtest/gtest.h>

#include <array>
#include <cstring>
#include <limits>

#include "engine/bitmap/zmbitrow_p.h"
#include "engine/bitmap/zmrunmover_p.h"
#include "engine/bitmap/zmxBitmaps.h"
#include "tests/bitmap/place_support.h"
#include "tests/support/instructionsets.h"
#include "tests/support/testimages.h"

namespace zm::test {
namespace {

constexpr std::int32_t kMin = std::numeric_limits<std::int32_t>::min();
constexpr std::int32_t kMax = std::numeric_limits<std::int32_t>::max();

bool Bit(const std::uint8_t* row, std::int64_t x) {
    return (row[x >> 3] >> (7 - (x & 7)) & 1) != 0;
}

// Bit runs.

TEST(BitRuns, CopyAtEveryOffsetWithoutTouchingNeighbours) {
    constexpr std::int64_t kBits = 96;
    std::array<std::uint8_t, 12> source{};
    for (std::size_t i = 0; i < source.size(); ++i) {
        source[i] = static_cast<std::uint8_t>(i * 73 + 29);
    }
    for (std::int64_t from = 0; from < 9; ++from) {
        for (std::int64_t to = 0; to < 9; ++to) {
            for (std::int64_t count = 0; count <= kBits - 16; ++count) {
                // Exactly as many bytes as the run reaches into, so that tools see a read behind.
                const std::vector<std::uint8_t> tight(source.begin(),
                                                      source.begin() + ((from + count + 7) / 8));
                std::array<std::uint8_t, 12> dest{};
                dest.fill(0x5A);
                const auto before = dest;
                CopyBits(tight.data(), from, dest.data(), to, count);
                for (std::int64_t x = 0; x < kBits; ++x) {
                    const bool is_inside = x >= to && x < to + count;
                    ASSERT_EQ(Bit(dest.data(), x),
                              is_inside ? Bit(source.data(), x - to + from) : Bit(before.data(), x))
                        << "from " << from << " to " << to << " count " << count << " bit " << x;
                }
            }
        }
    }
}

TEST(BitRuns, FillAtEveryOffset) {
    for (const bool value : {false, true}) {
        for (std::int64_t to = 0; to < 9; ++to) {
            for (std::int64_t count = 0; count <= 40; ++count) {
                std::array<std::uint8_t, 7> dest{};
                dest.fill(0x5A);
                const auto before = dest;
                FillBits(dest.data(), to, count, value);
                for (std::int64_t x = 0; x < 56; ++x) {
                    const bool is_inside = x >= to && x < to + count;
                    ASSERT_EQ(Bit(dest.data(), x), is_inside ? value : Bit(before.data(), x));
                }
            }
        }
    }
}

// Runs past the caches.

TEST(RunMover, MovesTheSameBytesPastTheCaches) {
    TZmBitmap dest(1, 1, zm8g);
    const TRunMover mover(dest, kStreamedBytes);
    std::vector<std::uint8_t> source(6000);
    for (std::size_t i = 0; i < source.size(); ++i) {
        source[i] = static_cast<std::uint8_t>(i * i / 5);
    }
    ForEachInstructionSet([&] {
        for (const std::size_t count : {0, 1, 1023, 1024, 1025, 1087, 4099}) {
            for (std::size_t offset = 0; offset < 130; offset += 9) {
                std::vector<std::uint8_t> moved(6000, 0x5A);
                auto expected = moved;
                std::copy_n(source.begin() + 3, count,
                            expected.begin() + static_cast<std::ptrdiff_t>(offset));
                mover.Move(moved.data() + offset, source.data() + 3, count);
                ASSERT_TRUE(moved == expected) << count << " bytes to " << offset;
            }
        }
        for (const std::size_t to : {99, 101}) {  // runs that overlap
            auto moved = source;
            mover.Move(moved.data() + to, moved.data() + 100, 5000);
            ASSERT_EQ(std::memcmp(moved.data() + to, source.data() + 100, 5000), 0) << to;
        }
    });
}

// Copies of rectangles.

struct TCopyCase {
    std::int32_t src_x, src_y, dst_x, dst_y, width, height;
};

/// Columns or rows as the rule has it: what a negative destination cuts off at the start of the
/// source is lost, a negative source starts at 0.
bool SourceOf(std::int32_t dest, std::int32_t src, std::int32_t dst, std::int32_t length,
              std::int32_t source_size, std::int32_t& source) {
    const std::int64_t advanced = dst < 0 ? std::int64_t{src} - dst : src;
    const std::int64_t start = dst < 0 ? 0 : dst;
    const std::int64_t left = dst < 0 ? std::int64_t{length} + dst : length;
    const std::int64_t offset = dest - start;
    const std::int64_t found = (advanced < 0 ? 0 : advanced) + offset;
    source = static_cast<std::int32_t>(found < source_size ? found : source_size);
    return offset >= 0 && offset < left && found < source_size && advanced + left > 0;
}

constexpr TCopyCase kCopyCases[] = {
    {0, 0, 0, 0, 37, 11},        {1, 2, 3, 1, 20, 5},      {5, 1, 12, 4, 100, 100},
    {3, 3, -4, -2, 20, 9},       {-3, -2, 6, 1, 12, 7},    {8, 0, 1, 2, 1, 9},
    {0, 0, 30, 10, 37, 11},      {37, 0, 0, 0, 5, 5},      {0, 0, 41, 0, 5, 5},
    {-20, 0, 0, 0, 20, 11},      {0, 0, -20, 0, 20, 11},   {4, 4, 4, 4, 0, 5},
    {4, 4, 4, 4, 5, -1},         {0, 0, kMin, 0, kMax, 5}, {kMin, kMin, 0, 0, kMax, kMax},
    {kMax, 0, kMax, 0, kMax, 9}, {0, 0, 0, 0, kMax, kMax}, {0, 0, -7, 3, 30, kMax},
};

TEST(CopyRectTo, MatchesAPixelByPixelCopy) {
    for (const TZmPixelFormat format : kAllFormats) {
        for (const TCopyCase& test : kCopyCases) {
            const auto source = MakeNoise(format, 37, 11, 1);
            const auto dest = MakeNoise(format, 41, 13, 2);
            TZmBitmap expected(*dest);
            for (std::int32_t y = 0; y < 13; ++y) {
                for (std::int32_t x = 0; x < 41; ++x) {
                    std::int32_t from_x = 0;
                    std::int32_t from_y = 0;
                    if (SourceOf(x, test.src_x, test.dst_x, test.width, 37, from_x) &&
                        SourceOf(y, test.src_y, test.dst_y, test.height, 11, from_y)) {
                        if (format == zm1g) {
                            expected.SetPixels_zm1g(x, y, source->GetPixels_zm1g(from_x, from_y));
                        } else {
                            const auto bytes = static_cast<std::size_t>(source->GetBitCount() / 8);
                            std::memcpy(expected.GetSegment(y, x, 1),
                                        source->GetSegment(from_y, from_x, 1), bytes);
                        }
                    }
                }
            }
            source->CopyRectTo(dest.get(), test.src_x, test.src_y, test.dst_x, test.dst_y,
                               test.width, test.height, true);
            SCOPED_TRACE(::testing::Message() << "case " << &test - kCopyCases);
            ExpectSamePixels(expected, *dest);
        }
    }
}

TEST(CopyRectTo, WithinOneImageTakesPixelsBeforeTheyAreOverwritten) {
    constexpr TCopyCase kCases[] = {{0, 0, 3, 2, 30, 8},  {3, 2, 0, 0, 30, 8}, {0, 0, 5, 0, 30, 11},
                                    {5, 0, 0, 0, 30, 11}, {0, 3, 0, 0, 37, 8}, {1, 0, 2, 4, 35, 7}};
    for (const TZmPixelFormat format : kAllFormats) {
        for (const TCopyCase& test : kCases) {
            const auto bitmap = MakeNoise(format, 37, 11, 3);
            TZmBitmap before(*bitmap);
            TZmBitmap expected(*bitmap);
            before.CopyRectTo(&expected, test.src_x, test.src_y, test.dst_x, test.dst_y, test.width,
                              test.height, false);
            bitmap->CopyRectTo(bitmap.get(), test.src_x, test.src_y, test.dst_x, test.dst_y,
                               test.width, test.height, false);
            ExpectSamePixels(expected, *bitmap);
        }
    }
}

TEST(CopyRectTo, ConvertsPixelsBetweenFormats) {
    for (const TZmPixelFormat from : kAllFormats) {
        for (const TZmPixelFormat to : kAllFormats) {
            if (from == to) {
                continue;
            }
            const auto source = MakeNoise(from, 12, 4, 5);
            const auto dest = MakeNoise(to, 12, 4, 6);
            TZmBitmap expected(*dest);
            for (std::int32_t x = 0; x < 5; ++x) {
                expected.SetPixels(x + 5, 2, source->GetPixels(x + 3, 1));
            }
            source->CopyRectTo(dest.get(), 3, 1, 5, 2, 5, 1, false);
            SCOPED_TRACE(PixelFormatInfo(from).name);
            ExpectSamePixels(expected, *dest);
        }
    }
}

TEST(CopyRectTo, TakesThePlaneAlong) {
    TZmBitmap source(4, 4, zm24RGB);
    TZmBitmap dest(4, 4, zm24RGB);
    source.Fill(0.0);
    dest.Fill(0.0);
    source.AlphaFill(255);
    source.CopyRectTo(&dest, 0, 0, 0, 0, 4, 4, true);
    ASSERT_TRUE(dest.HasAlphaChannel());
    EXPECT_FALSE(dest.GetAlphaChannelRaw()->GetFull());  // a new plane's mark is not set
    dest.AlphaFill(255);
    source.CopyRectTo(&dest, 0, 0, 1, 1, 2, 2, true);
    EXPECT_TRUE(dest.GetAlphaChannelRaw()->GetFull());
    source.AlphaFill(9);
    source.CopyRectTo(&dest, 0, 0, 1, 1, 2, 2, false);
    EXPECT_EQ(dest.GetAlpha(1, 1), 255);
    source.CopyRectTo(&dest, 0, 0, 1, 1, 2, 2, true);
    EXPECT_EQ(dest.GetAlpha(1, 1), 9);
    EXPECT_EQ(dest.GetAlpha(3, 3), 255);
    EXPECT_FALSE(dest.GetAlphaChannelRaw()->GetFull());
}

TEST(CopyToEx, KeepsToTheEllipse) {
    TZmBitmap source(9, 5, zm8g);
    source.Fill(1.0);
    TZmBitmap dest(11, 7, zm8g);
    dest.Fill(0.0);
    int calls = 0;
    dest.SetOnChanged([&calls](void*) { ++calls; });
    source.CopyToEx(&dest, 0, 0, 1, 1, 9, 5, false, true);
    EXPECT_EQ(calls, 1);
    // Centres with ((x - 4) / 4.5)^2 + ((y - 2) / 2.5)^2 <= 1.
    constexpr const char* kRows[] = {"...........", "...#####...", ".#########.", ".#########.",
                                     ".#########.", "...#####...", "..........."};
    for (std::int32_t y = 0; y < 7; ++y) {
        for (std::int32_t x = 0; x < 11; ++x) {
            EXPECT_EQ(dest.GetPixels_zm8(x, y), kRows[y][x] == '#' ? 1 : 0) << x << ", " << y;
        }
    }
    // Clipped at the corner, the ellipse stays the one of the whole rectangle.
    dest.Fill(0.0);
    source.CopyToEx(&dest, 0, 0, -4, -2, 9, 5, false, true);
    EXPECT_EQ(dest.GetPixels_zm8(4, 0), 1);
    EXPECT_EQ(dest.GetPixels_zm8(4, 1), 1);
    EXPECT_EQ(dest.GetPixels_zm8(5, 1), 0);
    EXPECT_EQ(dest.GetPixels_zm8(2, 2), 1);
    EXPECT_EQ(dest.GetPixels_zm8(3, 2), 0);
}

// Crop.

TEST(Crop, ToTheWholeImageDoesNothing) {
    TZmBitmap bitmap(100, 50, zm24RGB);
    bitmap.Fill(5.0);
    int calls = 0;
    bitmap.SetOnChanged([&calls](void*) { ++calls; });
    EXPECT_TRUE(bitmap.Crop(0, 0, 99, 49, 0x00FFFFFF));
    EXPECT_TRUE(bitmap.Crop(5, 0, 4, 49, 0));
    EXPECT_TRUE(bitmap.Crop(0, 5, 99, 4, 0));
    EXPECT_EQ(calls, 0);
    EXPECT_EQ(bitmap.GetWidth(), 100);
    EXPECT_TRUE(bitmap.Crop(-10, 0, 99, 49, 0x00030201));
    EXPECT_EQ(calls, 1);
    EXPECT_EQ(bitmap.GetWidth(), 110);
    EXPECT_EQ(bitmap.GetPixels_zm24RGB(9, 49), (TRGB{3, 2, 1}));
    EXPECT_EQ(bitmap.GetPixels_zm24RGB(10, 0), (TRGB{0, 0, 5}));
}

TEST(Crop, MatchesAPixelByPixelCopyInAllFormats) {
    constexpr TRect kRects[] = {{3, 2, 20, 9},  {-5, -3, 40, 14}, {-9, 4, 10, 30},
                                {0, 0, 0, 0},   {36, 10, 36, 10}, {-7, -7, -2, -1},
                                {37, 0, 40, 5}, {0, 11, 5, 12},   {7, -1, 36, 10}};
    for (const TZmPixelFormat format : kAllFormats) {
        for (const TRect& rect : kRects) {
            const auto bitmap = MakeNoise(format, 37, 11, 9);
            TZmBitmap expected(rect.right - rect.left + 1, rect.bottom - rect.top + 1, format);
            bitmap->CopyPaletteTo(&expected);
            expected.Fill(static_cast<double>(0x00804020));
            for (std::int32_t y = 0; y < 11; ++y) {
                for (std::int32_t x = 0; x < 37; ++x) {
                    if (x >= rect.left && x <= rect.right && y >= rect.top && y <= rect.bottom) {
                        bitmap->CopyRectTo(&expected, x, y, x - rect.left, y - rect.top, 1, 1,
                                           false);
                    }
                }
            }
            ASSERT_TRUE(bitmap->Crop(rect, 0x00804020));
            ExpectSamePixels(expected, *bitmap);
        }
    }
}

TEST(Crop, KeepsThePlaneInStep) {
    TZmBitmap bitmap(4, 3, zm1g);
    bitmap.Fill(1.0);
    bitmap.AlphaFill(7);
    ASSERT_TRUE(bitmap.Crop(1, -1, 5, 1, 0));
    ASSERT_TRUE(bitmap.HasAlphaChannel());
    EXPECT_EQ(bitmap.GetAlphaChannelRaw()->GetWidth(), 5);
    EXPECT_EQ(bitmap.GetAlphaChannelRaw()->GetHeight(), 3);
    EXPECT_EQ(bitmap.GetAlpha(0, 0), 255);  // grown: opaque
    EXPECT_EQ(bitmap.GetAlpha(0, 1), 7);
    EXPECT_EQ(bitmap.GetAlpha(2, 2), 7);
    EXPECT_EQ(bitmap.GetAlpha(3, 2), 255);
    ASSERT_TRUE(bitmap.Crop(-9, -9, -5, -5, 0));
    EXPECT_EQ(bitmap.GetAlpha(4, 4), 255);
    bitmap.ReplaceAlphaChannel(TZmBitmap::CreateAsAlphaChannel(2, 9, zmMemory));
    bitmap.GetAlphaChannelRaw()->Fill(1.0);
    ASSERT_TRUE(bitmap.Crop(1, 1, 4, 9, 0));
    EXPECT_EQ(bitmap.GetAlpha(0, 7), 1);
    EXPECT_EQ(bitmap.GetAlpha(1, 7), 255);
}

TEST(Crop, WithoutRoomLeavesTheImage) {
    TZmBitmap bitmap(8, 8, zm24RGB);
    bitmap.Fill(5.0);
    bitmap.AlphaFill(6);
    constexpr TRect kHuge[] = {{kMin, 0, kMax, 7}, {0, kMin, 7, kMax}, {kMin, kMin, kMax, kMax},
                               {kMin, kMin, 0, 0}, {0, 0, kMax, kMax}, {kMax, kMax, kMax, kMax}};
    for (const TRect& rect : kHuge) {
        const bool is_one_pixel = rect.left == kMax;
        TZmBitmap copy(bitmap);
        EXPECT_EQ(copy.Crop(rect, 0), is_one_pixel);
        EXPECT_EQ(copy.GetWidth(), is_one_pixel ? 1 : 8);
        EXPECT_EQ(copy.GetAlpha(0, 0), is_one_pixel ? 255 : 6);
    }
    {
        const TBlockLimit small_blocks(200);
        const TSettingGuard no_disk(ZmGlobalSettings().fAutoLocateOnDisk, false);
        EXPECT_FALSE(bitmap.Crop(-50, -50, 50, 50, 0));
    }
    EXPECT_EQ(bitmap.GetWidth(), 8);
    EXPECT_EQ(bitmap.GetPixels_zm24RGB(7, 7), (TRGB{0, 0, 5}));
    EXPECT_EQ(bitmap.GetAlpha(7, 7), 6);
    TZmBitmap empty;
    EXPECT_FALSE(empty.Crop(0, 0, 5, 5, 0));
}

TEST(Crop, WithTheSentinelKeepsPictureEventsAndName) {
    TZmBitmap bitmap(4, 4, zm8g);
    bitmap.Fill(5.0);
    int calls = 0;
    bitmap.SetOnChanged([&calls](void*) { ++calls; });
    bitmap.SetFilename(u"a");
    ASSERT_TRUE(bitmap.Crop(-1, 1, 2, 2, kCropNoFill));
    EXPECT_EQ(bitmap.GetWidth(), 4);
    EXPECT_EQ(bitmap.GetPixels_zm8(1, 1), 5);
    bitmap.Changed();
    EXPECT_EQ(calls, 2);
    EXPECT_EQ(bitmap.GetFilename(), u"a");
}

// Fills.

struct TFillCase {
    TZmPixelFormat format;
    double value;
    std::vector<std::uint8_t> bytes;
};

TEST(Fill, MeansWhatTheFormatMakesOfTheValue) {
    const TFillCase kCases[] = {
        {zm1g, 0, {0}},
        {zm1g, 0.25, {255}},
        {zm8p, 7.9, {7}},
        {zm8g, 200, {200}},
        {zm8g, 0x010203, {3}},
        {zm16g, 0x1234, {0x34, 0x12}},
        {zm24RGB, 0x030201, {3, 2, 1}},
        {zm24RGB, -1.0, {255, 255, 255}},
        {zm32f, 0.5, {0, 0, 0, 0x3F}},
        {zmCMYK, 0x3264C8, {255, 128, 64, 200}},  // red 200, green 100, blue 50
        {zm48RGB, 0x030201, {1, 1, 2, 2, 3, 3}},
        {zmCIELab, 0xFFFFFF, {255, 0, 0}},
        {zm32RGB, 0x030201, {3, 2, 1, 255}},
    };
    for (const TFillCase& test : kCases) {
        TZmBitmap bitmap(13, 3, test.format);
        bitmap.Fill(test.value);
        for (std::int32_t y = 0; y < 3; ++y) {
            const std::uint8_t* const row = bitmap.GetScanLine(y);
            const std::size_t count = test.format == zm1g ? 1 : 13;
            for (std::size_t i = 0; i < count * test.bytes.size(); ++i) {
                ASSERT_EQ(row[i], test.bytes[i % test.bytes.size()])
                    << PixelFormatInfo(test.format).name << " byte " << i;
            }
        }
    }
}

TEST(Fill, WithFourBytesSetsTheAlphaByte) {
    TZmBitmap bitmap(3, 2, zm32RGB);
    bitmap.Fill(TRGBA{1, 2, 3, 4});
    EXPECT_EQ(bitmap.GetPixels_zm32RGB(2, 1), (TRGBA{1, 2, 3, 4}));
    TZmBitmap colors(3, 2, zm24RGB);
    colors.Fill(TRGBA{1, 2, 3, 4});
    EXPECT_EQ(colors.GetPixels_zm24RGB(2, 1), (TRGB{1, 2, 3}));
}

TEST(FillRect, StaysInsideItsRectangle) {
    constexpr TRect kRects[] = {{3, 2, 20, 9}, {-5, -5, 2, 2},     {30, 8, 99, 99}, {5, 5, 4, 5},
                                {5, 5, 5, 4},  {kMin, 3, kMax, 3}, {9, 1, 9, 1},    {40, 0, 50, 5}};
    for (const TZmPixelFormat format : kAllFormats) {
        for (const TRect& rect : kRects) {
            const auto bitmap = MakeNoise(format, 37, 11, 9);
            TZmBitmap expected(*bitmap);
            TZmBitmap pixel(1, 1, format);
            pixel.Fill(1.0);
            bitmap->CopyPaletteTo(&pixel);
            for (std::int32_t y = 0; y < 11; ++y) {
                for (std::int32_t x = 0; x < 37; ++x) {
                    if (x >= rect.left && x <= rect.right && y >= rect.top && y <= rect.bottom) {
                        pixel.CopyRectTo(&expected, 0, 0, x, y, 1, 1, false);
                    }
                }
            }
            bitmap->FillRect(rect.left, rect.top, rect.right, rect.bottom, 1.0);
            ExpectSamePixels(expected, *bitmap);
        }
    }
}

TEST(FillRect, WritesNoByteOfOtherRowsOrAround) {
    for (const TZmPixelFormat format : kAllFormats) {
        constexpr std::int32_t kWidth = 7;
        const auto row_len = CalcRowLen(kWidth, PixelFormatInfo(format).bit_count, 32).value();
        const auto row_bytes = static_cast<std::size_t>(row_len);
        std::vector<std::uint8_t> memory(row_bytes * 5, 0xA7);
        TZmBitmap bitmap;
        bitmap.EncapsulateMemory(memory.data() + row_bytes, kWidth, 3, format, true, zmboTOPLEFT);
        bitmap.FillRect(0, 1, kWidth - 1, 1, 0.0);
        const auto used =
            static_cast<std::size_t>((kWidth * PixelFormatInfo(format).bit_count + 7) / 8);
        for (std::size_t i = 0; i < memory.size(); ++i) {
            const std::size_t row = i / row_bytes;
            if (row != 2 || i % row_bytes >= used) {
                ASSERT_EQ(memory[i], 0xA7) << PixelFormatInfo(format).name << " byte " << i;
            }
        }
    }
}

TEST(FillRect, TakesTheMarkFromAFullPlane) {
    TZmBitmap bitmap(4, 4, zm8g);
    bitmap.AlphaFill(255);
    bitmap.GetAlphaChannelRaw()->FillRect(1, 1, 1, 1, 255.0);
    EXPECT_TRUE(bitmap.GetAlphaChannelRaw()->GetFull());
    bitmap.GetAlphaChannelRaw()->FillRect(1, 1, 1, 1, 254.0);
    EXPECT_FALSE(bitmap.GetAlphaChannelRaw()->GetFull());
}

}  // namespace
}  // namespace zm::test
