// Sizing rule, dispatcher, and the Resample forms of the processor and the bitmap.

#include <gtest/gtest.h>

#include <array>
#include <string>
#include <vector>

#include "engine/bitmap/zmxBitmaps.h"
#include "engine/foundation/zmnumbers.h"
#include "engine/foundation/zmsettings.h"
#include "engine/proc/zalmoproc.h"
#include "engine/proc/zmresample.h"
#include "engine/proc/zmresample_p.h"
#include "tests/proc/resample_support.h"
#include "tests/support/testimages.h"

namespace zm::test {
namespace {

TEST(CalcResampleSizeTest, Table) {
    struct TSizeCase {
        std::int32_t new_width, new_height, width, height;
        bool keep_aspect;
        std::int32_t expected_width, expected_height;
    };
    const std::vector<TSizeCase> cases{
        {100, 100, 400, 200, true, 100, 50},
        {100, 100, 200, 400, true, 50, 100},
        {1000, 1000, 400, 200, true, 1000, 500},  // the fit enlarges
        {100, 100, 400, 200, false, 100, 100},
        {1, 1, 400, 200, true, 1, 1},  // Round(0.5) is 0, raised to 1
        {3, 3, 2, 2, true, 3, 3},
        {5, 5, 4, 2, true, 5, 2},  // Round(2.5) is even
        {-1, 50, 400, 200, false, 100, 50},
        {-1, 50, 400, 200, true, 100, 50},  // the flag does not count below 1
        {50, -1, 400, 200, false, 50, 25},
        {0, 50, 400, 200, false, 400, 50},
        {50, 0, 400, 200, true, 50, 200},
        {0, 0, 400, 200, true, 400, 200},
        {-5, 7, 400, 200, false, 5, 7},
        {7, -5, 400, 200, true, 7, 5},
        {-1, 0, 400, 200, false, 1, 200},  // 0 * 400 / 200 is below 1
        {0, -1, 400, 200, false, 400, 200},
        {-1, 1, 2, 400, false, 1, 1},  // 1 * 2 / 400
        {-5, -7, 400, 200, false, -5, -7},
        {-1, -1, 400, 200, true, -1, -1},
        {-1, 2000000, 5000, 1, false, kMaxInt32, 2000000},  // no wrap
        {kMinInt32, 1, 4, 4, false, kMaxInt32, 1},
        {10, 10, 0, 5, true, 10, 10},
    };
    for (const TSizeCase& test : cases) {
        const TZmImageSize size = CalcResampleSize(test.new_width, test.new_height, test.width,
                                                   test.height, test.keep_aspect);
        EXPECT_EQ(size.width, test.expected_width) << test.new_width << 'x' << test.new_height
                                                   << " of " << test.width << 'x' << test.height;
        EXPECT_EQ(size.height, test.expected_height) << test.new_width << 'x' << test.new_height
                                                     << " of " << test.width << 'x' << test.height;
    }
}

// The dispatcher.

/// Formats of the results: by rfNone, a kernel filter, rfFastLinear, rfBilinear, rfBicubic, a
/// projection, a platform filter.
struct TFormatRow {
    TZmPixelFormat source;
    std::array<TZmPixelFormat, 7> results;
};

constexpr std::array<TFormatRow, 10> kFormatTable{{
    {zm1g, {zm1g, zm24RGB, zm24RGB, zm24RGB, zm24RGB, zm1g, zm24RGB}},
    {zm8p, {zm8p, zm24RGB, zm24RGB, zm24RGB, zm24RGB, zm1g, zm24RGB}},
    {zm8g, {zm8g, zm8g, zm8g, zm8g, zm8g, zm8g, zm8g}},
    {zm16g, {zm16g, zm16g, zm16g, zm16g, zm16g, zm16g, zm16g}},
    {zm24RGB, {zm24RGB, zm24RGB, zm24RGB, zm24RGB, zm24RGB, zm1g, zm24RGB}},
    {zm32f, {zm32f, zm24RGB, zm24RGB, zm24RGB, zm24RGB, zm1g, zm32f}},
    {zmCMYK, {zmCMYK, zm24RGB, zm24RGB, zm24RGB, zm24RGB, zm1g, zmCMYK}},
    {zm48RGB, {zm48RGB, zm24RGB, zm24RGB, zm48RGB, zm48RGB, zm1g, zm48RGB}},
    {zmCIELab, {zmCIELab, zm24RGB, zm24RGB, zm24RGB, zm24RGB, zm1g, zmCIELab}},
    {zm32RGB, {zm32RGB, zm24RGB, zm24RGB, zm32RGB, zm32RGB, zm1g, zm32RGB}},
}};

std::size_t FilterColumn(int filter) {
    if (filter == rfNone) {
        return 0;
    }
    if (filter <= rfLinear) {
        return 1;
    }
    return filter <= rfBicubic     ? static_cast<std::size_t>(filter - rfFastLinear) + 2
           : filter <= rfProjectWB ? 5
                                   : 6;
}

TEST(ResampleDispatcherTest, FormatOfTheResult) {
    for (const TFormatRow& row : kFormatTable) {
        const auto source = MakeGradient(row.source, 20, 10);
        const auto untouched = MakeGradient(row.source, 20, 10);
        for (int filter = 0; filter < kResampleFilterCount; ++filter) {
            for (const auto& [width, height] : {std::pair{7, 4}, std::pair{33, 25}, {7, 25}}) {
                SCOPED_TRACE(testing::Message() << PixelFormatInfo(row.source).name << " filter "
                                                << filter << " to " << width << 'x' << height);
                const auto target = TargetFor(*source, width, height);
                ASSERT_TRUE(ResampleBitmapInto(*source, *target,
                                               static_cast<TResampleFilter>(filter), nullptr, {}));
                EXPECT_EQ(target->GetPixelFormat(), row.results[FilterColumn(filter)]);
                EXPECT_EQ(target->GetWidth(), width);
                EXPECT_EQ(target->GetHeight(), height);
            }
        }
        ExpectSamePixels(*untouched, *source);
    }
}

TEST(ResampleDispatcherTest, OnePixelFillsEverything) {
    for (int format = zm8p; format <= zm32RGB; ++format) {
        const auto source = MakeNoise(static_cast<TZmPixelFormat>(format), 1, 1, 3);
        const TRGB color = source->GetPixels(0, 0);
        for (int filter = 0; filter < kResampleFilterCount; ++filter) {
            const auto target = TargetFor(*source, 9, 4);
            ASSERT_TRUE(ResampleBitmapInto(*source, *target, static_cast<TResampleFilter>(filter),
                                           nullptr, {}));
            EXPECT_EQ(target->GetPixelFormat(), format);
            EXPECT_EQ(target->GetPixels(0, 0), color) << format << ' ' << filter;
            EXPECT_EQ(target->GetPixels(8, 3), color) << format << ' ' << filter;
        }
    }
}

TEST(ResampleDispatcherTest, EveryFilterSurvivesThinPictures) {
    struct TThinCase {
        TZmImageSize from;
        TZmImageSize to;
    };
    for (const TThinCase& test :
         {TThinCase{{1, 1}, {3, 2}}, TThinCase{{1, 300}, {300, 1}}, TThinCase{{300, 1}, {1, 300}},
          TThinCase{{2, 2}, {1, 1}}, TThinCase{{1, 20000}, {2, 1}}, TThinCase{{1, 2}, {1, 20000}},
          TThinCase{{65535, 1}, {1, 2}}, TThinCase{{1, 2}, {65535, 1}},
          TThinCase{{2, 1}, {1, 65535}}}) {
        for (const TZmPixelFormat format : {zm1g, zm8p, zm8g, zm16g, zm24RGB, zm32RGB, zm48RGB}) {
            const auto source = MakeGradient(format, test.from.width, test.from.height);
            for (int filter = 0; filter < kResampleFilterCount; ++filter) {
                const auto target = TargetFor(*source, test.to.width, test.to.height);
                EXPECT_TRUE(ResampleBitmapInto(*source, *target,
                                               static_cast<TResampleFilter>(filter), nullptr, {}))
                    << format << ' ' << filter;
                EXPECT_EQ(target->GetWidth(), test.to.width);
            }
        }
    }
}

/// The default filter of the settings for the duration of a test.
class TDefaultFilter {
public:
    explicit TDefaultFilter(TResampleFilter filter)
        : old_(ZmGlobalSettings().fDefaultResampleFilter) {
        ZmGlobalSettings().fDefaultResampleFilter = filter;
    }
    ~TDefaultFilter() { ZmGlobalSettings().fDefaultResampleFilter = old_; }

private:
    TResampleFilter old_;
};

TEST(ResampleDispatcherTest, ReplacesFiltersByTheDefault) {
    const auto source = MakeGradient(zm8p, 20, 10);
    struct TReplacement {
        TResampleFilter preset;
        TResampleFilter stands_for;
    };
    for (const TReplacement& test :
         {TReplacement{rfFastLinear, rfFastLinear}, TReplacement{rfLanczos3, rfLanczos3},
          TReplacement{rfNone, rfNone}, TReplacement{rfProjectBW, rfProjectBW},
          TReplacement{rfBilinear, rfFastLinear}, TReplacement{rfBicubic, rfFastLinear},
          TReplacement{rfWICFant, rfFastLinear}}) {
        const TDefaultFilter setting(test.preset);
        const auto expected = TargetFor(*source, 13, 7);
        const auto actual = TargetFor(*source, 13, 7);
        ASSERT_TRUE(ResampleBitmapInto(*source, *expected, test.stands_for, nullptr, {}));
        ASSERT_TRUE(ResampleBitmapInto(*source, *actual, rfBilinear, nullptr, {}));
        ExpectSamePixels(*expected, *actual);
    }
}

TEST(ResampleDispatcherTest, TargetOfAnotherFormatIsBroughtIntoFit) {
    const auto color = MakeNoise(zm24RGB, 12, 9, 4);
    for (int filter = 0; filter < kResampleFilterCount; ++filter) {
        // Fewer bytes than a row of the source's format needs.
        TZmBitmap target(5, 4, zm1g);
        ASSERT_TRUE(
            ResampleBitmapInto(*color, target, static_cast<TResampleFilter>(filter), nullptr, {}));
        EXPECT_NE(target.GetPixelFormat(),
                  filter == rfProjectBW || filter == rfProjectWB ? zm24RGB : zm1g);
    }
}

TEST(ResampleDispatcherTest, SameSizeIsACopyAndEmptyImagesGiveNothing) {
    TZmBitmap empty;
    TZmBitmap some(3, 3, zm24RGB);
    EXPECT_FALSE(ResampleBitmapInto(empty, some, rfBilinear, nullptr, {}));
    EXPECT_FALSE(ResampleBitmapInto(some, empty, rfBilinear, nullptr, {}));
    EXPECT_FALSE(ResampleBitmapInto(some, some, rfBilinear, nullptr, {}));
    const auto source = MakeNoise(zm48RGB, 6, 5, 8);
    AddNoiseAlpha(*source, 9);
    const auto target = TargetFor(*source, 6, 5);
    ASSERT_TRUE(ResampleBitmapInto(*source, *target, rfLanczos3, nullptr, {}));
    ExpectSamePixels(*source, *target);
    ExpectSameAlpha(*source, *target);
}

TEST(ResampleDispatcherTest, FileBackedImagesGiveTheSameBytes) {
    for (const TZmPixelFormat format : {zm1g, zm8p, zm8g, zm24RGB, zm32RGB, zm48RGB}) {
        const auto source = MakeNoise(format, 37, 23, 6);
        TZmBitmap on_disk;
        on_disk.SetLocation(zmFile);
        on_disk.SetMinFileSize(0);
        on_disk.AssignEx(source.get(), /*with_params=*/false);
        ASSERT_EQ(on_disk.GetLocation(), zmFile);
        for (int filter = 0; filter < kResampleFilterCount; ++filter) {
            for (const auto& [width, height] : {std::pair{11, 9}, std::pair{50, 61}}) {
                const auto expected = TargetFor(*source, width, height);
                TZmBitmap actual;
                actual.SetLocation(zmFile);
                actual.SetMinFileSize(0);
                ASSERT_TRUE(actual.Allocate(width, height, format));
                const auto kind = static_cast<TResampleFilter>(filter);
                ASSERT_TRUE(ResampleBitmapInto(*source, *expected, kind, nullptr, {}));
                ASSERT_TRUE(ResampleBitmapInto(on_disk, actual, kind, nullptr, {}));
                ExpectSamePixels(*expected, actual);
                ASSERT_FALSE(testing::Test::HasFailure()) << format << ' ' << filter;
            }
        }
    }
}

// Alpha.

TEST(ResampleAlphaTest, PlaneTakesTheFilterThatWasAskedFor) {
    const auto source = MakeNoise(zm8p, 12, 8, 21);
    AddNoiseAlpha(*source, 22);
    TZmBitmap& plane = *source->GetAlphaChannel();
    for (int filter = 0; filter < kResampleFilterCount; ++filter) {
        SCOPED_TRACE(filter);
        const auto target = TargetFor(*source, 5, 13);
        const auto kind = static_cast<TResampleFilter>(filter);
        ASSERT_TRUE(ResampleBitmapInto(*source, *target, kind, nullptr, {}));
        ASSERT_TRUE(target->HasAlphaChannel());
        TZmBitmap expected(5, 13, zm8g);
        // The image's rfBilinear is replaced here, the plane's is not; projections of a plane
        // are fast linear.
        ASSERT_TRUE(ResampleBitmapInto(plane, expected, kind, nullptr, {}));
        ExpectSamePixels(expected, *target->GetAlphaChannel());
    }
}

TEST(ResampleAlphaTest, FullFlagIsCopied) {
    const auto source = MakeNoise(zm24RGB, 8, 8, 1);
    source->GetAlphaChannel()->SyncFull();
    ASSERT_TRUE(source->GetAlphaChannel()->GetFull());
    TZmBitmap target(4, 4, zm24RGB);
    ASSERT_TRUE(ResampleBitmapInto(*source, target, rfBilinear, nullptr, {}));
    EXPECT_TRUE(target.GetAlphaChannel()->GetFull());
    source->GetAlphaChannel()->SetFull(false);
    ASSERT_TRUE(ResampleBitmapInto(*source, target, rfNone, nullptr, {}));
    EXPECT_FALSE(target.GetAlphaChannel()->GetFull());
    EXPECT_EQ(target.GetAlpha(3, 3), 255);
}

TEST(ResampleAlphaTest, PlanesThatDoNotFitAreBroughtIntoFit) {
    const auto source = MakeNoise(zm24RGB, 8, 6, 1);
    source->ReplaceAlphaChannel(MakeNoise(zm24RGB, 3, 40, 2));
    TZmBitmap target(16, 12, zm24RGB);
    target.ReplaceAlphaChannel(MakeNoise(zm8g, 2, 2, 3));
    for (int filter = 0; filter < kResampleFilterCount; ++filter) {
        const bool projected = filter == rfProjectBW || filter == rfProjectWB;
        ASSERT_TRUE(
            ResampleBitmapInto(*source, target, static_cast<TResampleFilter>(filter), nullptr, {}));
        EXPECT_EQ(target.GetPixelFormat(), projected ? zm1g : zm24RGB);
        EXPECT_EQ(target.GetAlphaChannel()->GetWidth(), 16);
        EXPECT_EQ(target.GetAlphaChannel()->GetHeight(), 12);
        EXPECT_EQ(target.GetAlphaChannel()->GetPixelFormat(), zm8g);
    }
    EXPECT_EQ(source->GetAlphaChannel()->GetWidth(), 3) << "the source is left as it is";
}

// The processor.

TEST(ZalmoProcResampleTest, ResizesInPlaceAndTellsSo) {
    const auto image = MakeNoise(zm24RGB, 40, 20, 2);
    AddNoiseAlpha(*image, 3);
    TZmBitmap expected(10, 5, zm24RGB);
    ASSERT_TRUE(ResampleBitmapInto(*image, expected, rfBilinear, nullptr, {}));
    image->SetFilename(u"kept.bmp");
    int changes = 0;
    int finished = 0;
    std::int32_t last_percent = 0;
    image->SetOnChanged([&](void*) { ++changes; });
    TZalmoProc proc(image.get());
    proc.SetOnFinishWork([&](void* sender) { finished += sender == &proc ? 1 : 100; });
    proc.SetOnProgress([&](void*, std::int32_t percent) { last_percent = percent; });
    proc.Resample(10, 10, rfBilinear, /*maintain_aspect_ratio=*/true);
    ExpectSamePixels(expected, *image);
    ExpectSameAlpha(expected, *image);
    EXPECT_EQ(image->GetFilename(), u"kept.bmp");
    EXPECT_GT(changes, 0) << "the event survives the resize";
    EXPECT_EQ(finished, 1);
    EXPECT_EQ(last_percent, 100);
}

TEST(ZalmoProcResampleTest, WhatChangesNothingDoesNothing) {
    const auto image = MakeNoise(zm24RGB, 40, 20, 2);
    const auto before = MakeNoise(zm24RGB, 40, 20, 2);
    int finished = 0;
    TZalmoProc proc(image.get());
    proc.SetAutoUndo(true);
    proc.SetOnFinishWork([&](void*) { ++finished; });
    proc.Resample(40, 20, rfBilinear, false);
    proc.Resample(-3, -3, rfBilinear, false);
    proc.Resample(0.0, rfBilinear);
    proc.Resample(-2.0, rfBilinear);
    proc.Resample(kMaxInt32, kMaxInt32, rfBilinear, false);
    proc.Resample(kMaxInt32, 1, rfNone, false);
    EXPECT_EQ(finished, 0);
    EXPECT_EQ(proc.GetUndoCount(), 0);
    ExpectSamePixels(*before, *image);
    // A size that only the rule turns into the present one runs.
    proc.Resample(0, 0, rfBilinear, false);
    EXPECT_EQ(finished, 1);
    EXPECT_EQ(proc.GetUndoCount(), 1);
    EXPECT_EQ(proc.GetUndoInfo(0)->Operation, 82);
    EXPECT_EQ(proc.GetUndoInfo(0)->Caption, u"Resize Image");
    ExpectSamePixels(*before, *image);
}

TEST(ZalmoProcResampleTest, MissingOrEmptyBitmapEndsSilently) {
    TZalmoProc proc(/*has_owner=*/true);
    EXPECT_NO_THROW(proc.Resample(5, 5, rfBilinear, false));
    proc.SetAttachedZmBitmap(nullptr);
    EXPECT_NO_THROW(proc.Resample(5, 5, rfBilinear, false));
    EXPECT_NO_THROW(proc.Resample(2.0, rfBilinear));
    EXPECT_EQ(proc.GetUndoCount(), 0);
}

TEST(ZalmoProcResampleTest, ScaleRoundsBothSides) {
    const auto image = MakeNoise(zm8g, 5, 7, 2);
    TZalmoProc proc(image.get());
    proc.Resample(0.5, rfFastLinear);
    EXPECT_EQ(image->GetWidth(), 2);   // Round(2.5)
    EXPECT_EQ(image->GetHeight(), 4);  // Round(3.5)
}

TEST(ZalmoProcResampleTest, ResampleToLeavesTheAttachedBitmap) {
    const auto image = MakeNoise(zm24RGB, 20, 10, 2);
    const auto before = MakeNoise(zm24RGB, 20, 10, 2);
    TZmBitmap target(5, 5, zm24RGB);
    target.SetAlpha(0, 0, 7);
    TZalmoProc proc(image.get());
    proc.ResampleTo(&target, 5, 5, rfBilinear, false);
    ExpectSamePixels(*before, *image);
    EXPECT_EQ(target.GetWidth(), 5);
    EXPECT_FALSE(target.HasAlphaChannel()) << "the plane of an earlier image";
    proc.ResampleTo(&target, 100, 5, rfBilinear, true);
    EXPECT_EQ(target.GetWidth(), 10);
}

/// Resamples with a listener that stops at its `stop`-th call; false when it was not called so
/// often.
bool StopsAt(TZmBitmap& image, std::int32_t stop, TZmImageSize to, TResampleFilter filter) {
    TZalmoProc proc(&image);
    std::int32_t calls = 0;
    proc.SetOnProgress([&](void*, std::int32_t) {
        if (++calls == stop) {
            throw EZmException("stop");
        }
    });
    try {
        proc.Resample(to.width, to.height, filter, false);
    } catch (const EZmException&) {
        return true;
    }
    return false;
}

TEST(ZalmoProcResampleTest, StoppingAtAnyStepLeavesTheBitmap) {
    for (const TZmPixelFormat format : {zm8g, zm16g, zm24RGB, zm32RGB}) {
        const auto before = MakeNoise(format, 20, 18, 2);
        for (const TResampleFilter filter : {rfBilinear, rfBicubic, rfLanczos3, rfFastLinear}) {
            for (const TZmImageSize to :
                 {TZmImageSize{13, 9}, TZmImageSize{33, 27}, TZmImageSize{9, 30}}) {
                const auto image = MakeNoise(format, 20, 18, 2);
                std::int32_t stop = 1;
                while (StopsAt(*image, stop, to, filter)) {
                    ASSERT_EQ(image->GetPixelFormat(), format);
                    ExpectSamePixels(*before, *image);
                    ASSERT_FALSE(testing::Test::HasFailure())
                        << format << ' ' << filter << " step " << stop;
                    ++stop;
                }
                EXPECT_GE(stop, to.height) << format << ' ' << filter;
                EXPECT_EQ(image->GetWidth(), to.width) << "the last run was not stopped";
            }
        }
    }
}

TEST(ZalmoProcResampleTest, StoppingFromAWorkerThreadLeavesTheBitmap) {
    const auto image = MakeNoise(zm24RGB, 300, 300, 2);
    const auto before = MakeNoise(zm24RGB, 300, 300, 2);
    for (const std::int32_t stop : {1, 30, 60}) {
        ASSERT_TRUE(StopsAt(*image, stop, {150, 100}, rfLanczos3)) << stop;
        ExpectSamePixels(*before, *image);
    }
}

TEST(ZalmoProcResampleTest, PlatformBitmapTakesTheNewSize) {
    TBitmap platform;
    ASSERT_TRUE(platform.SetSize(8, 6, pf24bit));
    TZalmoProc proc(&platform);
    proc.Resample(4, 3, rfBilinear, false);
    EXPECT_EQ(platform.GetWidth(), 4);
    EXPECT_EQ(platform.GetHeight(), 3);
    EXPECT_TRUE(platform.GetModified());
    proc.GetAttachedZmBitmap()->SetAlpha(0, 0, 0);
    proc.Update();
    EXPECT_FALSE(proc.GetAttachedZmBitmap()->HasAlphaChannel());
    EXPECT_EQ(proc.GetAttachedZmBitmap()->GetPixels_zm24RGB(0, 0), (TRGB{255, 255, 255}));
}

// The bitmap's own forms.

TEST(BitmapResampleTest, ShrinkOnlyNeverEnlarges) {
    for (const auto& [width, height, expected_width] :
         {std::tuple{20, 5, 10}, std::tuple{5, 20, 10}, std::tuple{10, 5, 10},
          std::tuple{5, 5, 5}}) {
        const auto image = MakeNoise(zm24RGB, 10, 10, 1);
        int changes = 0;
        image->SetOnChanged([&](void*) { ++changes; });
        image->Resample(width, height, rfBilinear, /*maintain_aspect_ratio=*/false,
                        /*shrink_only=*/true);
        EXPECT_EQ(image->GetWidth(), expected_width) << width << 'x' << height;
        EXPECT_GE(changes, 1);
    }
}

TEST(BitmapResampleTest, KeepsEventsAndScales) {
    const auto image = MakeNoise(zm48RGB, 21, 13, 1);
    const auto expected = TargetFor(*image, 10, 6);  // Round(10.5), Round(6.5)
    ASSERT_TRUE(ResampleBitmapInto(*image, *expected, rfBicubic, nullptr, {}));
    int changes = 0;
    std::int32_t last_percent = 0;
    image->SetOnChanged([&](void*) { ++changes; });
    image->SetOnProgress([&](void* sender, std::int32_t percent) {
        EXPECT_EQ(sender, image.get());
        last_percent = percent;
    });
    image->Resample(0.5, rfBicubic);
    EXPECT_EQ(last_percent, 100);
    EXPECT_GE(changes, 1);
    ExpectSamePixels(*expected, *image);
}

TEST(BitmapResampleTest, PlaneStaysAPlane) {
    const auto image = MakeNoise(zm24RGB, 8, 8, 1);
    TZmBitmap* plane = image->GetAlphaChannel();
    plane->Resample(4, 4, rfBicubic, false, false);
    EXPECT_TRUE(plane->GetIsAlpha());
    EXPECT_EQ(plane->GetAlphaChannel(), nullptr);
    EXPECT_EQ(plane->GetPixels_zm8(3, 3), 255);
}

TEST(BitmapResampleTest, SizeWithoutRoomLeavesTheImage) {
    const auto image = MakeNoise(zm24RGB, 8, 8, 1);
    image->Resample(kMaxInt32, 1, rfBilinear, false, false);
    image->Resample(kMaxInt32, kMaxInt32, rfNone, false, false);
    image->Resample(1e30, rfLanczos3);
    image->Resample(-4, -4, rfBilinear, false, false);
    ExpectSamePixels(*MakeNoise(zm24RGB, 8, 8, 1), *image);
}

}  // namespace
}  // namespace zm::test
