/// Every family of operations on each place that can hold the format: what it leaves in the
/// bitmap, in a second one and in bytes is what it leaves with all pixels in plain memory.

#include <gtest/gtest.h>

#include <algorithm>
#include <functional>
#include <string>
#include <vector>

#include "engine/bitmap/zmdibbitmap.h"
#include "engine/bitmap/zmmask.h"
#include "engine/bitmap/zmxBitmaps.h"
#include "tests/bitmap/place_support.h"
#include "tests/support/testimages.h"

namespace zm::test {
namespace {

constexpr std::int32_t kWidth = 29;
constexpr std::int32_t kHeight = 13;
constexpr TColor kOrange = 0x000080FF;

using TBytes = std::vector<std::uint8_t>;

/// What an operation works on. `subject` has the place and format of the case, noise in its
/// pixels and in an alpha plane; `other` is a picture of zm24RGB with a plane, in plain memory.
struct TScene {
    TZmBitmap& subject;
    TZmBitmap& other;
    TBytes bytes;
};

struct TOperation {
    const char* name;
    std::function<void(TScene& scene)> run;
};

/// As the source of a conversion, which some pairs change on their way.
void ConvertFrom(TScene& scene, TZmPixelFormat format) {
    TZmBitmap converted(kWidth, kHeight, format);
    converted.Fill(0.0);
    converted.CopyAndConvertFormat(&scene.subject);
    converted.SwitchTo(&scene.other);
}

void DrawSubject(TScene& scene, std::int32_t dest_width, TResampleFilter filter,
                 TZmRenderOperation operation) {
    scene.subject.RenderToTZmBitmapEx(&scene.other, 3, 1, dest_width, 9, 1, 2, 20, 9, true, 200,
                                      filter, operation, 0.7);
}

void DrawOther(TScene& scene, std::int32_t dest_width, TResampleFilter filter) {
    scene.other.RenderToTZmBitmapEx(&scene.subject, 3, 1, dest_width, 9, 1, 2, 20, 9, true, 200,
                                    filter, zmlScreen, 0.7);
}

void SaveRaw(TZmBitmap& bitmap, TBytes& bytes) {
    bytes.resize(static_cast<std::size_t>(bitmap.CalcRAWSize()));
    bitmap.SaveRAWToBufferOrStream(bytes.data(), static_cast<std::int64_t>(bytes.size()), nullptr,
                                   false);
}

void LoadRaw(TZmBitmap& bitmap, const TBytes& bytes) {
    bitmap.LoadRAWFromBufferOrStream(bytes.data(), static_cast<std::int64_t>(bytes.size()),
                                     nullptr);
}

void CopyThroughMask(TScene& scene) {
    const TBlockLimit all_blocks(-1);  // a mask has no fragments
    TZmMask mask;
    scene.subject.CopyToTZmMask(mask);
    mask.CopyZmBitmap(&scene.other, &scene.subject, 2, 3);
    mask.Negative(255);
    scene.subject.CopyFromTZmMask(mask);
    mask.CopyZmBitmap(&scene.subject, &scene.other, -1, 2);
}

void CropToOpaquePart(TScene& scene) {
    scene.subject.AlphaFill(0);
    scene.subject.AlphaFillRect(4, 3, 17, 9, 200);
    scene.subject.CropAlpha();
}

void SaveAndRestore(TScene& scene) {
    scene.subject.SaveState();
    scene.subject.Crop(0, 0, 9, 5, kOrange);
    scene.subject.Fill(1.0);
    scene.subject.SaveState();
    scene.subject.Clear();
    scene.subject.RestoreState();
    scene.other.AssignImage(&scene.subject);
    scene.subject.RestoreState();
}

void ExchangeSections(TScene& scene) {
    TZmDibbitmap section;
    scene.subject.CopyToTDibBitmap(&section, 2, 1, 20, 9);
    scene.other.MergeFromTDibBitmap(&section, 5, 2);
    scene.other.CopyToTDibBitmap(&section, 0, 0, 15, 11);
    scene.subject.MergeFromTDibBitmap(&section, 1, 1);
}

const TOperation kConversions[] = {
    {"ordered bits",
     [](TScene& s) {
         s.subject.SetDefaultDitherMethod(zmOrdered);
         s.subject.SetPixelFormat(zm1g);
     }},
    {"range of greys",
     [](TScene& s) {
         s.subject.SetBlackValue(10);
         s.subject.SetWhiteValue(200);
         s.subject.SetPixelFormat(zm24RGB);
     }},
};

const TOperation kGeometry[] = {
    {"crop beyond", [](TScene& s) { s.subject.Crop(-3, 2, 20, 15, kOrange); }},
    {"crop within", [](TScene& s) { s.subject.Crop(5, 1, 20, 9, kCropNoFill); }},
    {"crop to alpha", CropToOpaquePart},
    {"canvas size", [](TScene& s) { s.subject.Resize(40, 20, 1.0, 99, zmhCenter, zmvBottom); }},
    {"canvas sides", [](TScene& s) { s.subject.Resize(2, -1, 3, 4, 1.0, 77); }},
    {"width", [](TScene& s) { s.subject.SetWidth(17); }},
    {"height", [](TScene& s) { s.subject.SetHeight(5); }},
    {"move", [](TScene& s) { s.subject.MoveRegion(2, 1, 20, 8, 5, 4, 1.0, 50, true); }},
    {"copy out", [](TScene& s) { s.subject.CopyRectTo(&s.other, 3, 1, 5, 2, 20, 9, true); }},
    {"copy in", [](TScene& s) { s.other.CopyRectTo(&s.subject, 3, 1, 5, 2, 20, 9, true); }},
    {"copy within", [](TScene& s) { s.subject.CopyRectTo(&s.subject, 2, 1, 5, 3, 20, 9, true); }},
    {"copy an ellipse out",
     [](TScene& s) { s.subject.CopyToEx(&s.other, 3, 1, 5, 2, 20, 9, true, true); }},
    {"copy an ellipse in",
     [](TScene& s) { s.other.CopyToEx(&s.subject, 3, 1, 5, 2, 20, 9, true, true); }},
    {"flip", [](TScene& s) { s.subject.Flip(fdHorizontal); }},
    {"flip over", [](TScene& s) { s.subject.Flip(fdVertical); }},
    {"quarter turn", [](TScene& s) { s.subject.Rotate(90.0, zmrNone, kOrange); }},
    {"half turn", [](TScene& s) { s.subject.Rotate(180.0, zmrNone, kOrange); }},
    {"turn back", [](TScene& s) { s.subject.Rotate(270.0, zmrNone, kOrange); }},
    {"turn", [](TScene& s) { s.subject.Rotate(17.0, zmrBilinear, kOrange); }},
    {"smaller", [](TScene& s) { s.subject.Resample(20, 9, rfBilinear, false, false); }},
    {"larger", [](TScene& s) { s.subject.Resample(41, 31, rfLanczos3, false, false); }},
    {"nearest", [](TScene& s) { s.subject.Resample(17, 21, rfNone, false, false); }},
    {"stretch out",
     [](TScene& s) {
         s.subject.StretchRectTo(&s.other, 2, 1, 15, 9, 1, 1, 25, 11, rfBilinear, 255, 1.0);
     }},
    {"stretch in",
     [](TScene& s) {
         s.other.StretchRectTo(&s.subject, 2, 1, 15, 9, 1, 1, 25, 11, rfNone, 200, 0.5);
     }},
};

const TOperation kPainting[] = {
    {"fill", [](TScene& s) { s.subject.Fill(1.0); }},
    {"fill colour",
     [](TScene& s) {
         s.subject.Fill(TRGBA{10, 20, 30, 40});
     }},
    {"fill a part", [](TScene& s) { s.subject.FillRect(3, 2, 17, 9, 1.0); }},
    {"gradient", [](TScene& s) { s.subject.GradientFill(0xFF, 0xFFFF00, zmgDiagonal); }},
    {"gradient of a part",
     [](TScene& s) { s.subject.GradientFillRect(-2, 1, 17, 20, 0xFF, 0xFFFF00, zmgVertical); }},
    {"pixels",
     [](TScene& s) {
         for (std::int32_t x = 0; x < kWidth; ++x) {
             s.subject.SetPixels(x, x % kHeight, s.subject.GetPixels(kWidth - 1 - x, 4));
             s.subject.SetAlpha(x, x % kHeight, s.subject.GetAlpha(kWidth - 1 - x, 4));
         }
     }},
    {"draw", [](TScene& s) { DrawSubject(s, 20, rfNone, zmlNormal); }},
    {"draw scaled", [](TScene& s) { DrawSubject(s, 13, rfNone, zmlNormal); }},
    {"draw resampled", [](TScene& s) { DrawSubject(s, 13, rfBilinear, zmlSoftLight); }},
    {"be drawn on", [](TScene& s) { DrawOther(s, 20, rfNone); }},
    {"be drawn on scaled", [](TScene& s) { DrawOther(s, 13, rfBilinear); }},
};

const TOperation kAlpha[] = {
    {"alpha", [](TScene& s) { s.subject.AlphaFill(77); }},
    {"alpha of a part", [](TScene& s) { s.subject.AlphaFillRect(3, 2, 17, 9, 31); }},
    {"alpha gradient",
     [](TScene& s) { s.subject.AlphaFillRect(3, 2, 17, 9, 0, 255, zmgDiagonal2); }},
    {"merge alpha out",
     [](TScene& s) { s.subject.MergeAlphaRectTo(&s.other, 1, 2, 3, 1, 20, 9, zmaAdd, 0.6); }},
    {"merge alpha in",
     [](TScene& s) { s.other.MergeAlphaRectTo(&s.subject, 1, 2, 3, 1, 20, 9, zmaSubtract, 0.6); }},
    {"feather", [](TScene& s) { s.subject.FeatherAlphaEdges(3, false); }},
    {"feather quickly", [](TScene& s) { s.subject.FeatherAlphaEdges(3, true); }},
    {"transparent colours",
     [](TScene& s) {
         s.subject.SetTransparentColors(TRGB{20, 0, 30}, TRGB{255, 200, 255}, 9);
     }},
    {"masks", CopyThroughMask},
    {"drop alpha", [](TScene& s) { s.subject.RemoveAlphaChannel(true, kOrange); }},
    {"alpha to pixels", [](TScene& s) { s.subject.SynchronizeRGBA(false, true); }},
    {"alpha from pixels",
     [](TScene& s) {
         s.subject.SetPixelFormat(zm32RGB);
         s.subject.AlphaFill(3);
         s.subject.SynchronizeRGBA(true, true);
     }},
    {"alpha size",
     [](TScene& s) {
         s.subject.GetAlphaChannel()->Crop(2, 2, 20, 30, kOrange);
         s.subject.SyncAlphaChannel(true);
     }},
};

const TOperation kExchange[] = {
    {"save raw", [](TScene& s) { SaveRaw(s.subject, s.bytes); }},
    {"load raw",
     [](TScene& s) {
         SaveRaw(s.subject, s.bytes);
         s.subject.Fill(0.0);
         LoadRaw(s.subject, s.bytes);
     }},
    {"load another's raw",
     [](TScene& s) {
         SaveRaw(s.other, s.bytes);
         LoadRaw(s.subject, s.bytes);
     }},
    {"make a DIB", [](TScene& s) { s.bytes = s.subject.CreateDIB(72, 96); }},
    {"take a DIB",
     [](TScene& s) {
         s.bytes = s.other.CreateDIB(3, 2, 20, 9);
         s.subject.CopyFromDIB(s.bytes.data(), static_cast<std::int64_t>(s.bytes.size()));
     }},
    {"sections", ExchangeSections},
    {"states", SaveAndRestore},
    {"assign out", [](TScene& s) { s.other.Assign(&s.subject); }},
    {"switch", [](TScene& s) { s.subject.SwitchTo(&s.other); }},
    {"take over", [](TScene& s) { s.other.TakeOver(s.subject); }},
    {"be given another", [](TScene& s) { s.subject.TakeOver(s.other); }},
    {"places",
     [](TScene& s) {
         s.subject.SetLocation(zmFile);
         s.subject.SetLocation(zmMemory);
     }},
};

using TCase = std::tuple<TPlace, TZmPixelFormat>;

class EveryPlace : public ::testing::TestWithParam<TCase> {
protected:
    template <std::size_t kCount>
    static void RunAll(const TOperation (&operations)[kCount]) {
        for (const TOperation& operation : operations) {
            SCOPED_TRACE(operation.name);
            RunOne(operation);
        }
    }

    static void RunOne(const TOperation& operation) {
        const auto [place, format] = GetParam();
        const auto plain = MakeNoise(format, kWidth, kHeight, 7);
        AddNoiseAlpha(*plain, 3);
        const auto expected = MakeNoise(zm24RGB, kWidth, kHeight, 8);
        AddNoiseAlpha(*expected, 4);
        TZmBitmap actual;
        actual.AssignImage(expected.get());
        const TForcedPlace forced(place, format, kWidth, kHeight);
        TZmBitmap subject;
        forced.Copy(*plain, subject);
        ASSERT_TRUE(forced.Holds(subject));
        ExpectSameImage(*plain, subject);

        TScene scene{subject, actual, {}};
        operation.run(scene);
        TScene plain_scene{*plain, *expected, {}};
        RunInMemory(operation, plain_scene);
        ExpectSameImage(*plain, subject);
        ExpectSameImage(*expected, actual);
        EXPECT_EQ(plain_scene.bytes, scene.bytes);
    }

private:
    static void RunInMemory(const TOperation& operation, TScene& scene) {
        const TForcedPlace forced(kInMemory, zm8g, kWidth, kHeight);
        operation.run(scene);
    }

    static void ExpectSameImage(TZmBitmap& expected, TZmBitmap& actual) {
        ExpectSamePixels(expected, actual);
        ExpectSameAlpha(expected, actual);
        EXPECT_EQ(expected.GetPaletteUsed(), actual.GetPaletteUsed());
    }
};

std::string NameOfCase(const ::testing::TestParamInfo<TCase>& info) {
    constexpr const char* kPlaces[] = {"Memory", "Fragments", "File", "TBitmap"};
    return std::string(kPlaces[std::get<0>(info.param)]) + "_" +
           PixelFormatInfo(std::get<1>(info.param)).name;
}

INSTANTIATE_TEST_SUITE_P(Places, EveryPlace,
                         ::testing::Combine(::testing::Values(kInFragments, kInFile),
                                            ::testing::ValuesIn(kAllFormats)),
                         NameOfCase);
INSTANTIATE_TEST_SUITE_P(PlatformBitmap, EveryPlace,
                         ::testing::Combine(::testing::Values(kInTBitmap),
                                            ::testing::ValuesIn(kTBitmapFormats)),
                         NameOfCase);

TEST_P(EveryPlace, ConvertsAsMemoryDoes) {
    RunAll(kConversions);
    for (const TZmPixelFormat format : kAllFormats) {
        SCOPED_TRACE(PixelFormatInfo(format).name);
        RunOne({"from", [=](TScene& s) { ConvertFrom(s, format); }});
        const bool is_held =
            std::count(std::begin(kTBitmapFormats), std::end(kTBitmapFormats), format) > 0;
        if (is_held || std::get<0>(GetParam()) != kInTBitmap) {
            RunOne({"to", [=](TScene& s) { s.subject.SetPixelFormat(format); }});
        }
    }
}

TEST_P(EveryPlace, KeepsToGeometryAsMemoryDoes) {
    RunAll(kGeometry);
}

TEST_P(EveryPlace, IsPaintedAsMemoryIs) {
    RunAll(kPainting);
}

TEST_P(EveryPlace, HasAlphaAsMemoryHas) {
    RunAll(kAlpha);
}

TEST_P(EveryPlace, IsExchangedAsMemoryIs) {
    RunAll(kExchange);
}

}  // namespace
}  // namespace zm::test
