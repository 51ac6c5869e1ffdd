// Images on the clipboard: what is put there under which format, and what comes back, also from
// programs that put damaged blocks there.

#include <gtest/gtest.h>

#include <chrono>
#include <cstring>
#include <functional>
#include <string>
#include <thread>
#include <utility>
#include <vector>

#include "engine/bitmap/zmplatformbitmap.h"
#include "engine/bitmap/zmxBitmaps.h"
#include "engine/foundation/zmstreams.h"
#include "engine/io/zmfiletypes.h"
#include "engine/platform/clipboard.h"
#include "engine/proc/zalmoproc.h"
#include "tests/support/testimages.h"

namespace zm::test {
namespace {

using platform::kClipboardDib;
using platform::TClipboard;
using platform::TClipboardFormat;
using TBytes = std::vector<std::uint8_t>;
constexpr std::int64_t kMostBytes = 1 << 24;

TClipboardFormat RawFormat() {
    return platform::ClipboardFormatNamed(u"ZALMO RAW FORMAT");
}

TClipboardFormat PngFormat() {
    return platform::ClipboardFormatNamed(u"PNG");
}

/// The bytes under a format, empty when there are none.
TBytes BytesOf(TClipboardFormat format) {
    TBytes bytes;
    const auto clipboard = TClipboard::Open();
    EXPECT_NE(clipboard, nullptr);
    const auto take = [&](std::span<const std::uint8_t> block) {
        bytes.assign(block.begin(), block.end());
        return true;
    };
    EXPECT_EQ(clipboard->UseBlock(format, kMostBytes, take), clipboard->IsAvailable(format));
    return bytes;
}

struct TBlockToPut {
    TClipboardFormat format;
    TBytes bytes;
};

/// Makes these blocks all that is on the clipboard.
void Put(const std::vector<TBlockToPut>& blocks) {
    const auto clipboard = TClipboard::Open();
    ASSERT_NE(clipboard, nullptr);
    ASSERT_TRUE(clipboard->Empty());
    for (const TBlockToPut& block : blocks) {
        ASSERT_TRUE(clipboard->SetBlock(block.format, static_cast<std::int64_t>(block.bytes.size()),
                                        [&](std::span<std::uint8_t> target) {
                                            std::memcpy(target.data(), block.bytes.data(),
                                                        block.bytes.size());
                                            return true;
                                        }));
    }
    ASSERT_TRUE(clipboard->Close());
}

/// As an application made by others would offer it: 2 by 2 pixels of 24 bits, bottom row first,
/// each row padded from 6 to 8 bytes.
const TBytes kForeignDib = {
    40, 0, 0, 0,  2,  0,  0, 0, 2, 0, 0, 0, 1, 0, 24, 0, 0, 0, 0, 0,
    0,  0, 0, 0,  0,  0,  0, 0, 0, 0, 0, 0, 0, 0, 0,  0, 0, 0, 0, 0,  // header
    1,  2, 3, 4,  5,  6,  0, 0,                                       // bottom row
    7,  8, 9, 10, 11, 12, 0, 0,                                       // top row
};

TBytes PngOf(TZmBitmap& bitmap) {
    TMemoryStream stream;
    EXPECT_TRUE(bitmap.Write(&stream, ioPNG, nullptr));
    return stream.Bytes();
}

TBytes RawOf(TZmBitmap& bitmap) {
    TBytes bytes(static_cast<std::size_t>(bitmap.CalcRAWSize()));
    EXPECT_TRUE(bitmap.SaveRAWToBufferOrStream(bytes.data(),
                                               static_cast<std::int64_t>(bytes.size()), nullptr,
                                               /*StreamHasSize=*/false));
    return bytes;
}

class Clipboard : public testing::TestWithParam<TZmPixelFormat> {};

TEST_P(Clipboard, GivesBackPixelsFormatAndAlpha) {
    auto picture = MakeGradient(GetParam(), 33, 15);
    AddNoiseAlpha(*picture, 7);
    ASSERT_TRUE(picture->CopyToClipboard(/*IncludeZalmoFormat=*/true, /*IncludePNGFormat=*/false,
                                         200, 200));
    TZmBitmap pasted;
    ASSERT_TRUE(pasted.PasteFromClipboard());
    ExpectSamePixels(*picture, pasted);
    ExpectSameAlpha(*picture, pasted);
    EXPECT_FALSE(pasted.GetParamsEnabled());
    EXPECT_TRUE(BytesOf(PngFormat()).empty());
}

INSTANTIATE_TEST_SUITE_P(Formats, Clipboard,
                         testing::Values(zm1g, zm8p, zm8g, zm16g, zm24RGB, zm32f, zmCMYK, zm48RGB,
                                         zmCIELab, zm32RGB));

TEST(ClipboardCopy, OffersTheFormatsAskedFor) {
    auto picture = MakeGradient(zm24RGB, 5, 3);
    ASSERT_TRUE(picture->CopyToClipboard(false, true, 200, 100));
    const TBytes dib = BytesOf(kClipboardDib);
    ASSERT_GE(dib.size(), 40u + 3 * 16);
    EXPECT_EQ(dib[14], 24);                                       // bits a pixel
    EXPECT_EQ((TBytes{dib[24], dib[25]}), (TBytes{0xC2, 0x1E}));  // 7874 pixels a metre
    EXPECT_EQ((TBytes{dib[28], dib[29]}), (TBytes{0x61, 0x0F}));  // 3937
    EXPECT_TRUE(BytesOf(RawFormat()).empty());
    // A plane that is opaque all over is no reason for a PNG file, transparent pixels are.
    EXPECT_TRUE(BytesOf(PngFormat()).empty());
    picture->AlphaFill(255);
    ASSERT_TRUE(picture->CopyToClipboard(false, true, 200, 200));
    EXPECT_TRUE(BytesOf(PngFormat()).empty());
    picture->SetAlpha(1, 1, 100);
    picture->GetAlphaChannel()->SetFull(false);
    ASSERT_TRUE(picture->CopyToClipboard(false, true, 200, 200));
    EXPECT_EQ(BytesOf(PngFormat()).at(1), 'P');
    TZmBitmap pasted;
    ASSERT_TRUE(pasted.PasteFromClipboard());
    ExpectSameAlpha(*picture, pasted);
}

TEST(ClipboardCopy, LeavesImagesOfOneRowOrColumn) {
    Put({{kClipboardDib, kForeignDib}});
    EXPECT_FALSE(MakeGradient(zm8g, 1, 9)->CopyToClipboard(true, true, 200, 200));
    EXPECT_FALSE(MakeGradient(zm8g, 9, 1)->CopyToClipboard(true, true, 200, 200));
    EXPECT_FALSE(TZmBitmap().CopyToClipboard(true, true, 200, 200));
    EXPECT_FALSE(BytesOf(kClipboardDib).empty());  // it was not even emptied
}

TEST(ClipboardPaste, TakesTheFirstFormatThatCanBeRead) {
    auto raw = MakeGradient(zm16g, 4, 4);
    auto png = MakeGradient(zm24RGB, 5, 5);
    const TBytes raw_bytes = RawOf(*raw);
    const TBytes png_bytes = PngOf(*png);
    TZmBitmap pasted;
    Put({{kClipboardDib, kForeignDib}, {PngFormat(), png_bytes}, {RawFormat(), raw_bytes}});
    ASSERT_TRUE(pasted.PasteFromClipboard());
    ExpectSamePixels(*raw, pasted);
    Put({{kClipboardDib, kForeignDib}, {PngFormat(), png_bytes}});
    ASSERT_TRUE(pasted.PasteFromClipboard());
    ExpectSamePixels(*png, pasted);
    Put({{kClipboardDib, kForeignDib}});
    ASSERT_TRUE(pasted.PasteFromClipboard());
    EXPECT_EQ(pasted.GetPixels(0, 0), (TRGB{7, 8, 9}));
    EXPECT_EQ(pasted.GetPixels(1, 1), (TRGB{4, 5, 6}));
    EXPECT_FALSE(pasted.HasAlphaChannel());
}

TEST(ClipboardPaste, PassesOverDamagedBlocks) {
    auto picture = MakeGradient(zm24RGB, 6, 4);
    const TBytes raw = RawOf(*picture);
    const TBytes png = PngOf(*picture);
    auto before = MakeGradient(zm8g, 3, 3);
    for (const TBytes& whole : {raw, png, kForeignDib}) {
        const bool is_dib = whole.size() == kForeignDib.size();
        const TClipboardFormat format = is_dib         ? kClipboardDib
                                        : whole == raw ? RawFormat()
                                                       : PngFormat();
        // The last row of a device-independent bitmap may lack its padding.
        const std::size_t spare = is_dib ? 2 : format == PngFormat() ? 16 : 0;
        for (std::size_t size = 1; size + spare < whole.size(); size += 3) {
            Put({{format,
                  TBytes(whole.begin(), whole.begin() + static_cast<std::ptrdiff_t>(size))}});
            TZmBitmap target(*before);
            EXPECT_FALSE(target.PasteFromClipboard()) << format << " cut to " << size;
            ExpectSamePixels(*before, target);
        }
    }
    Put({{RawFormat(), TBytes(500, 0xFF)},
         {PngFormat(), TBytes(9, 0)},
         {kClipboardDib, kForeignDib}});
    TZmBitmap target(*before);
    EXPECT_TRUE(target.PasteFromClipboard());
    EXPECT_EQ(target.GetWidth(), 2);
}

TEST(ClipboardPaste, FillsASelection) {
    Put({{kClipboardDib, kForeignDib}});
    TZmBitmap image(6, 4, zm24RGB);
    image.Fill(0.0);
    TZalmoProc proc(&image);
    proc.Select(TRect{3, 1, 6, 4});
    ASSERT_TRUE(proc.PasteFromClipboard(/*stretch=*/false, /*merge_alpha=*/true));
    EXPECT_EQ(image.GetPixels(3, 1), (TRGB{7, 8, 9}));
    EXPECT_EQ(image.GetPixels(4, 2), (TRGB{4, 5, 6}));
    EXPECT_EQ(image.GetPixels(5, 3), TRGB{});
    ASSERT_TRUE(proc.PasteFromClipboard(/*stretch=*/true, /*merge_alpha=*/true));
    EXPECT_NE(image.GetPixels(5, 3), TRGB{});
    EXPECT_EQ(image.GetPixels(2, 1), TRGB{});
}

TEST(ClipboardOpen, WaitsForOthersButNotForEver) {
    auto picture = MakeGradient(zm24RGB, 4, 4);
    auto held = TClipboard::Open();
    ASSERT_NE(held, nullptr);
    bool copied_while_held = true;
    bool pasted_while_held = true;
    std::thread([&] {
        copied_while_held = picture->CopyToClipboard(true, false, 200, 200);
        pasted_while_held = TZmBitmap().PasteFromClipboard();
    }).join();
    EXPECT_FALSE(copied_while_held);
    EXPECT_FALSE(pasted_while_held);
    // On a busy machine the clipboard may come free after the last try: then once more.
    bool copied = false;
    for (int round = 0; round < 20 && !copied; ++round) {
        held = held == nullptr ? TClipboard::Open() : std::move(held);
        ASSERT_NE(held, nullptr);
        std::thread waiting([&] { copied = picture->CopyToClipboard(true, false, 200, 200); });
        std::this_thread::sleep_for(std::chrono::milliseconds(40));
        held.reset();
        waiting.join();
    }
    EXPECT_TRUE(copied);
}

TEST(ClipboardOpen, RefusesBlocksThatCannotBe) {
    const auto fill = [](std::span<std::uint8_t>) { return true; };
    const auto refuse = [](std::span<std::uint8_t>) { return false; };
    auto clipboard = TClipboard::Open();
    ASSERT_NE(clipboard, nullptr);
    ASSERT_TRUE(clipboard->Empty());
    EXPECT_FALSE(clipboard->SetBlock(kClipboardDib, 0, fill));
    EXPECT_FALSE(clipboard->SetBlock(kClipboardDib, -1, fill));
    EXPECT_FALSE(clipboard->SetBlock(kClipboardDib, 60, refuse));
    EXPECT_FALSE(clipboard->IsAvailable(kClipboardDib));
    EXPECT_TRUE(clipboard->Close());
    clipboard.reset();
    TZmBitmap image;
    EXPECT_FALSE(image.PasteFromClipboard());
    EXPECT_TRUE(image.IsEmpty());
}

// Platform bitmaps.

TEST(PlatformBitmapCopy, KeepsPixelsBothWays) {
    for (const TZmPixelFormat format : {zm1g, zm8p, zm24RGB, zm32RGB}) {
        auto picture = MakeGradient(format, 13, 5);
        TBitmap platform_bitmap;
        picture->CopyToTBitmap(&platform_bitmap);
        TZmBitmap back;
        back.CopyFromTBitmap(&platform_bitmap);
        ExpectSamePixels(*picture, back);
    }
    TZmBitmap gray(3, 2, zm16g);
    gray.SetPixels_zm16g(2, 1, 0xABCD);
    TBitmap platform_bitmap;
    gray.CopyToTBitmap(&platform_bitmap);
    EXPECT_EQ(platform_bitmap.GetPixelFormat(), pf8bit);
    EXPECT_EQ(platform_bitmap.GetScanLine(1)[2], 0xAB);
    EXPECT_EQ(platform_bitmap.ColorTable()[0xAB], (TRGB{0xAB, 0xAB, 0xAB}));
}

TEST(PlatformBitmapCopy, NamesTheFormatsThatDoNotFit) {
    const std::pair<TZmPixelFormat, std::string> formats[] = {
        {zmCMYK, "CMYK to TBitmap not supported"},
        {zm48RGB, "RGB48 to TBitmap not supported"},
        {zmCIELab, "CIELab to TBitmap not supported"},
    };
    for (const auto& [format, text] : formats) {
        TBitmap dest;
        try {
            MakeGradient(format, 2, 2)->CopyToTBitmap(&dest);
            ADD_FAILURE() << text;
        } catch (const EZmException& error) {
            EXPECT_EQ(error.what(), text);
        }
    }
}

}  // namespace
}  // namespace zm::test
