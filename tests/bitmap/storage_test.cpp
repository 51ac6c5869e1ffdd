#include <gtest/gtest.h>

#include <cstring>
#include <limits>

#include "engine/bitmap/zmvirtualbitmaps.h"
#include "tests/bitmap/place_support.h"
#include "tests/support/testimages.h"

namespace zm {

/// Looks behind the bitmap's interface.
class TZmBitmapStorageTest {
public:
    static std::uint8_t* Fragment(TZmBitmap& bitmap, std::size_t index) {
        return bitmap.fFragments[index];
    }
    static std::int32_t RowsPerFragment(TZmBitmap& bitmap) { return bitmap.fRowsPerFragment; }
    static const std::uint8_t* Block(TZmBitmap& bitmap) {
        return static_cast<const std::uint8_t*>(bitmap.fRealMemory);
    }
    static std::size_t MappedRows(TZmBitmap& bitmap) { return bitmap.fScanlinesToUnMapRow.size(); }
};

namespace test {
namespace {

TEST(RowLength, FollowsTheAlignment) {
    struct TCase {
        std::int32_t width, bits, alignment;
        std::int64_t row_len;
    };
    constexpr TCase kCases[] = {{1, 1, 32, 4},   {32, 1, 32, 4},  {33, 1, 32, 8}, {1, 24, 32, 4},
                                {5, 24, 32, 16}, {3, 48, 32, 20}, {3, 8, 8, 3},   {9, 1, 8, 2},
                                {3, 8, 64, 8},   {1, 1, 512, 64}, {0, 8, 32, 0}};
    for (const TCase& test : kCases) {
        EXPECT_EQ(CalcRowLen(test.width, test.bits, test.alignment), test.row_len)
            << test.width << " x " << test.bits << " bits at " << test.alignment;
    }
    EXPECT_FALSE(CalcRowLen(std::numeric_limits<std::int32_t>::max(), 48, 32).has_value());
    EXPECT_FALSE(CalcRowLen(-1, 8, 32).has_value());
    EXPECT_FALSE(CalcRowLen(1, 8, 24).has_value());
    EXPECT_FALSE(CalcRowLen(1, 8, 0).has_value());
}

TEST(PixelFormats, HaveTheirBitsAndChannels) {
    struct TCase {
        TZmPixelFormat format;
        std::int32_t ordinal, bits, channels;
    };
    constexpr TCase kCases[] = {{zmnull, 0, 0, 0},    {zm1g, 1, 1, 1},     {zm8p, 2, 8, 1},
                                {zm8g, 3, 8, 1},      {zm16g, 4, 16, 1},   {zm24RGB, 5, 24, 3},
                                {zm32f, 6, 32, 1},    {zmCMYK, 7, 32, 4},  {zm48RGB, 8, 48, 3},
                                {zmCIELab, 9, 24, 3}, {zm32RGB, 10, 32, 4}};
    for (const TCase& test : kCases) {
        EXPECT_EQ(test.format, test.ordinal);
        EXPECT_EQ(PixelFormatInfo(test.format).bit_count, test.bits);
        EXPECT_EQ(PixelFormatInfo(test.format).channel_count, test.channels);
    }
    EXPECT_EQ(PixelFormatInfo(static_cast<TZmPixelFormat>(11)).bit_count, 0);
}

TEST(Allocate, PutsRowZeroLast) {
    TZmBitmap bitmap(5, 10, zm24RGB);
    EXPECT_EQ(bitmap.GetLocation(), zmMemory);  // a small image, although the wish was a file
    EXPECT_EQ(bitmap.GetRowLen(), 16);
    EXPECT_EQ(bitmap.GetScanLine(0), bitmap.GetMemory() + 9 * 16);
    EXPECT_EQ(bitmap.GetScanLine(9), bitmap.GetMemory());
    EXPECT_EQ(reinterpret_cast<std::uintptr_t>(bitmap.GetMemory()) % 64, 0u);
}

TEST(Allocate, OfTheSameSizeKeepsThePixels) {
    TZmBitmap bitmap(4, 4, zm8g);
    bitmap.Fill(77.0);
    int calls = 0;
    bitmap.SetOnChanged([&calls](void*) { ++calls; });
    EXPECT_TRUE(bitmap.Allocate(4, 4, zm8g));
    EXPECT_EQ(calls, 1);
    EXPECT_EQ(bitmap.GetPixels_zm8(3, 3), 77);
    EXPECT_TRUE(bitmap.Allocate(4, 4, zm8p));
    EXPECT_EQ(bitmap.GetPaletteLen(), 256);
}

TEST(Allocate, RejectsWhatIsNoImage) {
    struct TCase {
        std::int32_t width, height;
        TZmPixelFormat format;
    };
    constexpr std::int32_t kMax = std::numeric_limits<std::int32_t>::max();
    constexpr std::int32_t kMin = std::numeric_limits<std::int32_t>::min();
    const TCase kCases[] = {{0, 5, zm8g},
                            {5, 0, zm8g},
                            {-1, 5, zm8g},
                            {5, kMin, zm8g},
                            {5, 5, zmnull},
                            {5, 5, static_cast<TZmPixelFormat>(11)},
                            {5, 5, static_cast<TZmPixelFormat>(255)},
                            {kMax, kMax, zm48RGB},
                            {kMax, 1, zm48RGB}};
    for (const TCase& test : kCases) {
        TZmBitmap bitmap(3, 3, zm24RGB);
        EXPECT_FALSE(bitmap.Allocate(test.width, test.height, test.format));
        EXPECT_EQ(bitmap.GetWidth(), 0);
        EXPECT_EQ(bitmap.GetHeight(), 0);
        EXPECT_TRUE(bitmap.IsEmpty());
        EXPECT_TRUE(bitmap.Allocate(2, 2, zm24RGB));
    }
}

TEST(Allocate, WithAColourFillsAndMakesThePlane) {
    TZmBitmap bitmap;
    ASSERT_TRUE(bitmap.Allocate(2, 2, TColor{0x030201}, 128));
    EXPECT_EQ(bitmap.GetPixels_zm24RGB(1, 1), (TRGB{3, 2, 1}));
    ASSERT_TRUE(bitmap.HasAlphaChannel());
    EXPECT_EQ(bitmap.GetAlpha(0, 1), 128);
    ASSERT_TRUE(bitmap.Allocate(3, 2, TColor{0}, 255));
    EXPECT_FALSE(bitmap.HasAlphaChannel());
}

TEST(Allocate, TakesTheHeapOfTheAllocator) {
    TZmBitmap small(4, 4, zm8g);
    TZmBitmap large(1024, 1024, zm8g);
    TZmBitmap system;
    system.SetMemoryAllocator(zmmaSystem);
    ASSERT_TRUE(system.Allocate(4, 4, zm8g));
    EXPECT_EQ(TZmBitmapStorageTest::Block(small)[-4], 0);  // runtime heap below 1 MiB
    EXPECT_EQ(TZmBitmapStorageTest::Block(large)[-4], 1);  // system heap
    EXPECT_EQ(TZmBitmapStorageTest::Block(system)[-4], 1);
    EXPECT_EQ(system.GetPixels_zm8(3, 3), 0);  // which is zero-filled
    EXPECT_FALSE(WasBlockFilled(TZmBitmapStorageTest::Block(large), zmmaAuto));
    TZmBitmap words(1024, 1024, zm16g);
    large.CopyAndConvertFormat(&words);
    EXPECT_TRUE(WasBlockFilled(TZmBitmapStorageTest::Block(large), zmmaAuto));
    system.SetMemoryAllocator(zmmaVCL);  // the block knows where it came from
    ASSERT_TRUE(system.Allocate(5, 4, zm8g));
    system.Fill(1.0);
}

TEST(Place, IsChosenByTheLimit) {
    TSettingGuard limit(ZmGlobalSettings().fDefMinFileSize, std::int64_t{999});
    TZmBitmap bitmap;
    EXPECT_EQ(bitmap.GetMinFileSize(), 999);
    ASSERT_TRUE(bitmap.Allocate(100, 10, zm8g));
    EXPECT_EQ(bitmap.GetLocation(), zmFile);
    ASSERT_TRUE(bitmap.Allocate(100, 9, zm8g));
    EXPECT_EQ(bitmap.GetLocation(), zmMemory);
    bitmap.SetMinFileSize(1000);
    bitmap.SetLocation(zmFile);
    ASSERT_TRUE(bitmap.Allocate(100, 10, zm8g));
    EXPECT_EQ(bitmap.GetLocation(), zmMemory);
}

TEST(Place, FallsBackFromBlockToFragmentsToDisk) {
    const TBlockLimit limit(100 * 25);  // a quarter of the image, not all of it
    TZmBitmap bitmap(100, 100, zm8g);
    EXPECT_EQ(bitmap.GetLocation(), zmMemory);
    EXPECT_EQ(bitmap.GetFragmentsCount(), 4);
    {
        TSettingGuard no_fragments(ZmGlobalSettings().fAutoFragmentBitmap, false);
        ASSERT_TRUE(bitmap.Allocate(100, 101, zm8g));
        EXPECT_EQ(bitmap.GetLocation(), zmFile);
        TSettingGuard no_disk(ZmGlobalSettings().fAutoLocateOnDisk, false);
        EXPECT_FALSE(bitmap.Allocate(100, 102, zm8g));
        EXPECT_EQ(bitmap.GetWidth(), 0);
    }
    // Halves of a quarter would be below 10 MiB: no further splitting, so to disk.
    const TBlockLimit smaller(100 * 20);
    ASSERT_TRUE(bitmap.Allocate(100, 100, zm8g));
    EXPECT_EQ(bitmap.GetLocation(), zmFile);
    EXPECT_EQ(bitmap.GetFragmentsCount(), 0);
}

TEST(Place, FragmentsHoldTheRowsFromTheTop) {
    const TBlockLimit limit(64);
    TZmBitmap bitmap(4, 10, zm8g);
    ASSERT_EQ(bitmap.GetFragmentsCount(), 4);
    EXPECT_EQ(TZmBitmapStorageTest::RowsPerFragment(bitmap), 3);  // 10 / 4 rounded up
    EXPECT_EQ(bitmap.GetScanLine(0), TZmBitmapStorageTest::Fragment(bitmap, 0));
    EXPECT_EQ(bitmap.GetScanLine(5), TZmBitmapStorageTest::Fragment(bitmap, 1) + 2 * 4);
    EXPECT_EQ(bitmap.GetScanLine(9), TZmBitmapStorageTest::Fragment(bitmap, 3));
    EXPECT_EQ(bitmap.GetMemory(), nullptr);
}

TEST(Place, LargeFragmentsAreSplitFurther) {
    // Four parts of three rows (30 MiB) are refused, eight of two rows are not.
    const TBlockLimit limit(20 << 20);
    TZmBitmap bitmap(10 << 20, 10, zm8g);
    EXPECT_EQ(bitmap.GetFragmentsCount(), 8);
    EXPECT_EQ(TZmBitmapStorageTest::RowsPerFragment(bitmap), 2);
    bitmap.SetPixels_zm8((10 << 20) - 1, 9, 5);
    EXPECT_EQ(bitmap.GetPixels_zm8((10 << 20) - 1, 9), 5);
}

TEST(FileRows, TwoAtOnceStayValid) {
    TZmBitmap bitmap;
    bitmap.SetMinFileSize(0);
    ASSERT_TRUE(bitmap.Allocate(7, 5, zm8g));
    bitmap.Fill(9.0);
    std::uint8_t* const first = bitmap.GetRow(0);
    std::uint8_t* const second = bitmap.GetRow(4);
    std::memset(first, 1, 7);
    std::memset(second, 5, 7);
    EXPECT_EQ(TZmBitmapStorageTest::MappedRows(bitmap), 2u);
    bitmap.FreeRow(0);
    bitmap.FreeRow(4);
    bitmap.FreeRow(4);  // not mapped any more: ignored
    EXPECT_EQ(TZmBitmapStorageTest::MappedRows(bitmap), 0u);
    EXPECT_EQ(bitmap.GetPixels_zm8(6, 0), 1);
    EXPECT_EQ(bitmap.GetPixels_zm8(6, 2), 9);
    EXPECT_EQ(bitmap.GetPixels_zm8(0, 4), 5);
}

// Platform bitmaps.

TEST(PlatformBitmapPlace, RefusesFourFormatsByTheirTexts) {
    struct TCase {
        TZmPixelFormat format;
        const char* text;
    };
    constexpr TCase kCases[] = {
        {zm32f, "zm32f pixel format not allowed when ZmBitmap.Location=zmTBitmap"},
        {zmCMYK, "zmCMYK pixel format not allowed when ZmBitmap.Location=zmTBitmap"},
        {zm48RGB, "zmRGB48 pixel format not allowed when ZmBitmap.Location=zmTBitmap"},
        {zmCIELab, "zmCIELab pixel format not allowed when ZmBitmap.Location=zmTBitmap"}};
    for (const TCase& test : kCases) {
        TZmBitmap bitmap;
        bitmap.SetLocation(zmTBitmap);
        try {
            bitmap.Allocate(6, 4, test.format);
            ADD_FAILURE() << test.text;
        } catch (const EZmException& error) {
            EXPECT_STREQ(error.what(), test.text);
        }
        EXPECT_EQ(bitmap.GetWidth(), 6);
        EXPECT_EQ(bitmap.GetHeight(), 4);
        EXPECT_TRUE(bitmap.IsEmpty());
        bitmap.Fill(1.0);  // no pixels to be reached
        ASSERT_TRUE(bitmap.SetPixelFormat(zm24RGB));
        bitmap.Fill(1.0);
        EXPECT_EQ(bitmap.GetPixels_zm24RGB(5, 3).r, 1);
    }
}

TEST(PlatformBitmapPlace, TurnsSixteenBitsIntoEight) {
    TZmBitmap bitmap;
    bitmap.SetLocation(zmTBitmap);
    ASSERT_TRUE(bitmap.Allocate(6, 4, zm16g));
    EXPECT_EQ(bitmap.GetPixelFormat(), zm8g);
    EXPECT_EQ(bitmap.GetBitCount(), 8);
    EXPECT_EQ(bitmap.GetRowLen(), 8);
    const auto source = MakeGradient(zm16g, 6, 4);
    bitmap.AssignImage(source.get());
    EXPECT_EQ(bitmap.GetPixels_zm8(5, 3), source->GetPixels_zm16g(5, 3) >> 8);
}

TEST(Encapsulate, FollowsAPlatformBitmap) {
    TBitmap foreign;
    ASSERT_TRUE(foreign.SetSize(5, 3, pf8bit));
    foreign.ColorTable()[2] = TRGB{1, 2, 3};
    foreign.GetScanLine(2)[4] = 2;
    TZmBitmap bitmap(2, 2, zm24RGB);
    bitmap.EncapsulateTBitmap(&foreign, true);
    EXPECT_EQ(bitmap.GetPixelFormat(), zm8p);
    EXPECT_EQ(bitmap.GetWidth(), 5);
    EXPECT_EQ(bitmap.GetPixels(4, 2), (TRGB{1, 2, 3}));
    ASSERT_TRUE(foreign.SetSize(9, 2, pf32bit));  // behind its back
    EXPECT_EQ(bitmap.GetWidth(), 9);
    EXPECT_EQ(bitmap.GetHeight(), 2);
    EXPECT_EQ(bitmap.GetPixelFormat(), zm32RGB);
    EXPECT_EQ(bitmap.GetScanLine(1), foreign.GetScanLine(1));
    ASSERT_TRUE(bitmap.Crop(0, 0, 3, 1, 0));
    EXPECT_EQ(foreign.GetWidth(), 4);  // the owner sees the change
    bitmap.FreeImage(true);
    EXPECT_EQ(foreign.GetWidth(), 4);
}

TEST(Encapsulate, TakesTheLayoutsOfAPlatformBitmap) {
    constexpr std::pair<TBitmapPixelFormat, TZmPixelFormat> kLayouts[] = {
        {pf1bit, zm1g}, {pf8bit, zm8p}, {pf24bit, zm24RGB}, {pf32bit, zm32RGB}};
    for (const auto& [layout, format] : kLayouts) {
        TBitmap foreign;
        ASSERT_TRUE(foreign.SetSize(3, 3, layout));
        TZmBitmap bitmap;
        bitmap.EncapsulateTBitmap(&foreign, true);
        EXPECT_EQ(bitmap.GetPixelFormat(), format);
    }
}

TEST(Encapsulate, BorrowsMemoryInBothOrders) {
    std::uint8_t rows[] = {1, 2, 3, 4, 5, 6, 7, 8};
    TZmBitmap bitmap;
    bitmap.EncapsulateMemory(rows, 3, 2, zm8g, true, zmboTOPLEFT);
    EXPECT_EQ(bitmap.GetScanLine(0), rows);
    EXPECT_EQ(bitmap.GetScanLine(1), rows + 4);
    bitmap.EncapsulateMemory(rows, 3, 2, zm8g, true, zmboBOTTOMLEFT);
    EXPECT_EQ(bitmap.GetScanLine(0), rows + 4);
    bitmap.SetPixels_zm8(0, 0, 50);
    EXPECT_EQ(rows[4], 50);
    bitmap.FreeImage(true);
    EXPECT_EQ(rows[4], 50);
    bitmap.EncapsulateMemory(rows, 2, 2, zm8p, true, zmboTOPLEFT);
    EXPECT_EQ(bitmap.GetPaletteLen(), 256);
}

// Hand-over and copies.

TEST(SwitchTo, HandsOverWithoutACopy) {
    TZmBitmap source(6, 4, zm24RGB);
    source.Fill(3.0);
    source.GetAlphaChannel();
    const std::uint8_t* const row = source.GetScanLine(0);
    TZmBitmap target(2, 2, zm8p);
    source.SwitchTo(&target);
    EXPECT_EQ(target.GetScanLine(0), row);
    EXPECT_TRUE(target.HasAlphaChannel());
    EXPECT_EQ(source.GetWidth(), 0);
    EXPECT_EQ(source.GetPixelFormat(), zmnull);
    EXPECT_FALSE(source.HasAlphaChannel());
    EXPECT_TRUE(source.GetFullReallocate());
    EXPECT_EQ(source.GetOrigin(), zmboBOTTOMLEFT);
    ASSERT_TRUE(source.Allocate(6, 4, zm24RGB));
    source.Fill(1.0);
    target.SwitchTo(&source);
    EXPECT_EQ(source.GetPixels_zm24RGB(5, 3).r, 3);
}

TEST(SaveState, StacksImages) {
    TZmBitmap bitmap(4, 3, zm8g);
    bitmap.Fill(1.0);
    bitmap.SetWhiteValue(9);
    bitmap.SaveState();
    EXPECT_EQ(bitmap.GetWhiteValue(), 9);
    bitmap.Fill(2.0);
    bitmap.SaveState();
    bitmap.Clear();
    bitmap.RestoreState();
    EXPECT_EQ(bitmap.GetPixels_zm8(3, 2), 2);
    bitmap.RestoreState();
    EXPECT_EQ(bitmap.GetPixels_zm8(3, 2), 1);
    bitmap.RestoreState();  // nothing saved: nothing done
    EXPECT_EQ(bitmap.GetPixels_zm8(3, 2), 1);
}

TEST(FreeImage, KeepsThePlaneWhenAsked) {
    TZmBitmap bitmap(6, 4, zm24RGB);
    bitmap.GetAlphaChannel();
    bitmap.FreeImage(false);
    EXPECT_EQ(bitmap.GetWidth(), 0);
    EXPECT_EQ(bitmap.GetPixelFormat(), zm24RGB);
    ASSERT_TRUE(bitmap.HasAlphaChannel());
    EXPECT_EQ(bitmap.GetAlphaChannelRaw()->GetWidth(), 6);
    bitmap.FreeImage(true);
    EXPECT_FALSE(bitmap.HasAlphaChannel());
}

TEST(Assign, CopiesPixelsPlaneAndPalette) {
    for (const TZmPixelFormat format : kAllFormats) {
        const auto source = MakeNoise(format, 9, 5, 1);
        AddNoiseAlpha(*source, 2);
        source->SetPaletteUsed(17);
        source->SetFilename(u"a.png");
        TZmBitmap copy;
        copy.Assign(source.get());
        ExpectSamePixels(*source, copy);
        ExpectSameAlpha(*source, copy);
        EXPECT_EQ(copy.GetPaletteUsed(), 17);
        EXPECT_EQ(copy.GetFilename(), u"a.png");
        TZmBitmap image;
        image.SetBitAlignment(8);
        image.AssignImage(source.get());
        EXPECT_EQ(image.GetFilename(), u"");
        ExpectSamePixels(*source, image);
        source->RemoveAlphaChannel(false, 0);
        copy.Assign(source.get());
        EXPECT_FALSE(copy.HasAlphaChannel());
    }
}

TEST(Assign, OfARectangleCutsItOut) {
    const auto source = MakeGradient(zm1g, 40, 20);
    TZmBitmap part(*source, TRect{3, 2, 30, 12});
    ASSERT_EQ(part.GetWidth(), 27);
    ASSERT_EQ(part.GetHeight(), 10);
    for (std::int32_t x = 0; x < 27; ++x) {
        EXPECT_EQ(part.GetPixels_zm1g(x, 9), source->GetPixels_zm1g(x + 3, 11));
    }
    TZmBitmap none(*source, TRect{5, 5, 5, 9});
    EXPECT_TRUE(none.IsEmpty());
    std::vector<std::uint8_t> row(16, 3);  // a copy of a view reads no byte behind it
    TZmBitmap borrowed(row.data(), 5, 1, zm24RGB);
    TZmVirtualClippedBitmap view(borrowed, TRect{2, 0, 5, 1});
    TZmBitmap copy(view);
    EXPECT_EQ(copy.GetPixels_zm24RGB(2, 0), (TRGB{3, 3, 3}));
}

TEST(Sides, KeepWhatBothSizesHave) {
    for (const TZmPixelFormat format : kAllFormats) {
        const auto original = MakeNoise(format, 19, 9, 4);
        TZmBitmap bitmap(*original);
        bitmap.GetAlphaChannel();
        bitmap.SetWidth(35);
        bitmap.SetHeight(20);
        EXPECT_EQ(bitmap.GetAlphaChannelRaw()->GetWidth(), 35);
        EXPECT_EQ(bitmap.GetAlphaChannelRaw()->GetHeight(), 20);
        ASSERT_TRUE(bitmap.Crop(0, 0, 18, 8, 0));
        ExpectSamePixels(*original, bitmap);
    }
    TZmBitmap bitmap;
    bitmap.SetPixelFormat(zm8g);
    bitmap.SetWidth(4);
    EXPECT_TRUE(bitmap.IsEmpty());
    bitmap.SetHeight(3);
    ASSERT_FALSE(bitmap.IsEmpty());
    bitmap.Fill(1.0);
    bitmap.SetHeight(0);
    EXPECT_TRUE(bitmap.IsEmpty());
    TZmBitmap sides_first;
    sides_first.SetWidth(5);
    sides_first.SetHeight(4);
    const TSettingGuard no_disk(ZmGlobalSettings().fAutoLocateOnDisk, false);
    {
        const TBlockLimit no_room(10);
        EXPECT_FALSE(sides_first.SetPixelFormat(zm24RGB));
        EXPECT_TRUE(sides_first.IsEmpty());
    }
    ASSERT_TRUE(sides_first.SetPixelFormat(zm24RGB));
    sides_first.Fill(7.0);
    EXPECT_EQ(sides_first.GetPixels_zm24RGB(4, 3).r, 7);
}

TEST(Place, ChangesWithThePixels) {
    const auto original = MakeNoise(zm8p, 19, 9, 4);
    TZmBitmap bitmap(*original);
    bitmap.SetLocation(zmTBitmap);
    EXPECT_EQ(bitmap.GetLocation(), zmTBitmap);
    ExpectSamePixels(*original, bitmap);
    bitmap.SetMinFileSize(0);
    bitmap.SetLocation(zmFile);
    EXPECT_EQ(bitmap.GetLocation(), zmFile);
    ExpectSamePixels(*original, bitmap);
}

// Palette and pixels.

TEST(Palette, IgnoresIndexesOutside) {
    TZmBitmap bitmap(2, 2, zm8p);
    bitmap.SetPalette(255, TRGB{1, 2, 3});
    int calls = 0;
    bitmap.SetOnChanged([&calls](void*) { ++calls; });
    bitmap.SetPalette(256, TRGB{9, 9, 9});
    bitmap.SetPalette(-1, TRGB{9, 9, 9});
    EXPECT_EQ(calls, 0);
    EXPECT_EQ(bitmap.GetPalette(255), (TRGB{1, 2, 3}));
    EXPECT_EQ(bitmap.GetPalette(256), TRGB{});
    EXPECT_EQ(bitmap.GetPalette(-1), TRGB{});
}

TEST(Pixels, LieInMemoryAsDeclared) {
    constexpr TRGB kColor{1, 2, 3};
    constexpr TRGBA kRgba{1, 2, 3, 4};
    constexpr TCMYK kInks{1, 2, 3, 4};
    constexpr TRGB48 kWords{0x0102, 0x0304, 0x0506};
    constexpr TCIELab kLab{9, -1, 1};
    struct TCase {
        TZmPixelFormat format;
        void (*set)(TZmBitmap&);
        std::vector<std::uint8_t> bytes;  // of pixel 1
    };
    const TCase kCases[] = {
        {zm8g, [](TZmBitmap& b) { b.SetPixels_zm8(1, 0, 7); }, {7}},
        {zm16g, [](TZmBitmap& b) { b.SetPixels_zm16g(1, 0, 0x1234); }, {0x34, 0x12}},
        {zm24RGB, [](TZmBitmap& b) { b.SetPixels_zm24RGB(1, 0, kColor); }, {1, 2, 3}},
        {zm32f, [](TZmBitmap& b) { b.SetPixels_zm32f(1, 0, 1.0f); }, {0, 0, 0x80, 0x3F}},
        {zmCMYK, [](TZmBitmap& b) { b.SetPixels_zmCMYK(1, 0, kInks); }, {1, 2, 3, 4}},
        {zm48RGB, [](TZmBitmap& b) { b.SetPixels_zm48RGB(1, 0, kWords); }, {2, 1, 4, 3, 6, 5}},
        {zmCIELab, [](TZmBitmap& b) { b.SetPixels_zmCIELab(1, 0, kLab); }, {9, 255, 1}},
        {zm32RGB, [](TZmBitmap& b) { b.SetPixels_zm32RGB(1, 0, kRgba); }, {1, 2, 3, 4}},
    };
    for (const TCase& test : kCases) {
        TZmBitmap bitmap(3, 1, test.format);
        bitmap.Fill(0.0);
        test.set(bitmap);
        const std::uint8_t* const pixel = bitmap.GetScanLine(0) + test.bytes.size();
        EXPECT_EQ(std::vector<std::uint8_t>(pixel, pixel + test.bytes.size()), test.bytes);
    }
    TZmBitmap bits(10, 1, zm1g);
    bits.Fill(0.0);
    bits.SetPixels_zm1g(1, 0, true);
    bits.SetPixels_zm1g(8, 0, true);
    EXPECT_EQ(bits.GetScanLine(0)[0], 0x40);
    EXPECT_EQ(bits.GetScanLine(0)[1], 0x80);
    bits.SetPixels_zm1g(1, 0, false);
    EXPECT_FALSE(bits.GetPixels_zm1g(1, 0));
}

TEST(Pixels, GoThroughRGBInEveryFormat) {
    for (const TZmPixelFormat format : kAllFormats) {
        TZmBitmap bitmap(3, 2, format);
        bitmap.Fill(0.0);
        if (format == zm8p) {
            bitmap.SetPalette(9, TRGB{255, 255, 255});
        }
        bitmap.SetPixels(1, 1, TRGB{250, 250, 250});
        const TRGB got = bitmap.GetPixels(1, 1);
        const bool is_coarse = format == zm1g || format == zm8p;  // white is the nearest
        EXPECT_NEAR(got.g, is_coarse ? 255 : 250, 1) << PixelFormatInfo(format).name;
        EXPECT_EQ(bitmap.GetPixels(1, 0).g < 10, true) << PixelFormatInfo(format).name;
    }
}

// Virtual bitmaps.

TEST(VirtualBitmap, RendersRowsByItsEvent) {
    TZmBitmap bitmap;
    bitmap.SetOnRenderVirtualPixel([](TZmBitmap*, std::int32_t x, std::int32_t y, void* pixel) {
        const TRGB rgb{static_cast<std::uint8_t>(x), static_cast<std::uint8_t>(y), 9};
        std::memcpy(pixel, &rgb, 3);
    });
    ASSERT_TRUE(bitmap.GetIsVirtual());
    ASSERT_TRUE(bitmap.Allocate(5, 4, zm24RGB));
    EXPECT_EQ(bitmap.GetMemory(), nullptr);
    EXPECT_EQ(bitmap.GetPixels_zm24RGB(4, 2), (TRGB{4, 2, 9}));
    EXPECT_EQ(std::memcmp(bitmap.GetSegment(3, 2, 2), "\x02\x03\x09\x03\x03\x09", 6), 0);
    TZmBitmap real(5, 4, zm24RGB);
    bitmap.CopyRectTo(&real, 0, 0, 0, 0, 5, 4, false);
    EXPECT_EQ(real.GetPixels_zm24RGB(3, 3), (TRGB{3, 3, 9}));
    bitmap.Fill(0.0);  // there is nothing to fill
    TZmBitmap inks(5, 4, zmCMYK);
    inks.CopyAndConvertFormat(&bitmap);
    EXPECT_EQ(inks.GetPixels_zmCMYK(3, 3).k, 9);
    bitmap.SetOnRenderVirtualPixel(nullptr);
    EXPECT_TRUE(bitmap.IsEmpty());
}

class TStripes : public TZmVirtualBitmapProvider {
public:
    std::uint8_t* GetRow(TZmBitmap*, std::int32_t row, std::int32_t start,
                         std::int32_t width) override {
        std::memset(row_, row * 10 + start, static_cast<std::size_t>(width));
        return row_;
    }

private:
    std::uint8_t row_[8] = {};
};

TEST(VirtualBitmap, AsksItsProvider) {
    TStripes stripes;
    TZmBitmap bitmap;
    bitmap.SetVirtualProvider(&stripes);
    ASSERT_TRUE(bitmap.Allocate(8, 3, zm8g));
    EXPECT_EQ(bitmap.GetScanLine(2)[7], 20);
    EXPECT_EQ(bitmap.GetSegment(1, 3, 2)[0], 13);
    // The route through zm24RGB must not read the provider's rows as wider ones.
    TZmBitmap inks(8, 3, zmCMYK);
    inks.CopyAndConvertFormat(&bitmap);
    EXPECT_EQ(inks.GetPixels_zmCMYK(7, 2), (TCMYK{255, 255, 255, 20}));
    EXPECT_EQ(bitmap.GetPixelFormat(), zm8g);
}

}  // namespace
}  // namespace test
}  // namespace zm
