// Resampling of a 12-megapixel picture, against a memcpy of the same bytes in the same run.
// `items` are target pixels.

#include <benchmark/benchmark.h>

#include <algorithm>
#include <cstdint>
#include <cstring>
#include <memory>
#include <vector>

#include "engine/bitmap/zmquantizer.h"
#include "engine/bitmap/zmxBitmaps.h"
#include "engine/foundation/zmsettings.h"
#include "engine/foundation/zmstreams.h"
#include "engine/io/zmfiletypes.h"
#include "engine/io/zmioparams.h"
#include "engine/proc/zalmoproc.h"
#include "engine/proc/zmresample.h"
#include "engine/proc/zmresample_p.h"

namespace zm {
namespace {

constexpr std::int32_t kLargeWidth = 4000;
constexpr std::int32_t kLargeHeight = 3000;
constexpr std::int32_t kSmallWidth = 1000;
constexpr std::int32_t kSmallHeight = 750;

/// A picture as cameras make it: smooth shapes under some noise.
std::unique_ptr<TZmBitmap> MakePicture(std::int32_t width, std::int32_t height) {
    auto bitmap = std::make_unique<TZmBitmap>(width, height, zm24RGB);
    std::uint32_t noise = 1;
    for (std::int32_t y = 0; y < height; ++y) {
        std::uint8_t* row = bitmap->GetScanLine(y);
        for (std::int32_t i = 0; i < width * 3; ++i) {
            noise = noise * 1664525u + 1013904223u;
            row[i] =
                static_cast<std::uint8_t>((i * 255 / (width * 3) + y / 8 + (noise >> 28)) & 255);
        }
    }
    return bitmap;
}

void BM_MemcpyLarge(benchmark::State& state) {
    const std::size_t bytes = std::size_t{kLargeWidth} * kLargeHeight * 3;
    std::vector<std::uint8_t> from(bytes, 1);
    std::vector<std::uint8_t> to(bytes);
    for (auto _ : state) {
        std::memcpy(to.data(), from.data(), bytes);
        benchmark::DoNotOptimize(to.data());
        benchmark::ClobberMemory();
    }
}
BENCHMARK(BM_MemcpyLarge)->Unit(benchmark::kMillisecond);

void Resample(benchmark::State& state, TZmImageSize from, TZmImageSize to, TResampleFilter filter) {
    const auto source = MakePicture(from.width, from.height);
    TZmBitmap target(to.width, to.height, zm24RGB);
    for (auto _ : state) {
        if (!ResampleBitmapInto(*source, target, filter, nullptr, {})) {
            state.SkipWithError("no result");
        }
        benchmark::ClobberMemory();
    }
    state.SetItemsProcessed(state.iterations() * to.width * to.height);
}

constexpr TZmImageSize kLarge{kLargeWidth, kLargeHeight};
constexpr TZmImageSize kSmall{kSmallWidth, kSmallHeight};
constexpr TZmImageSize kDyadic{1024, 768};
constexpr TZmImageSize kUneven{1111, 833};
constexpr TZmImageSize kIcon{32, 24};
constexpr TZmImageSize kUnevenLarge{3777, 2833};
constexpr TZmImageSize kNarrowHigh{1000, 4000};
constexpr TZmImageSize kWideLow{5000, 1000};

BENCHMARK_CAPTURE(Resample, BilinearShrink, kLarge, kSmall, rfBilinear)
    ->Unit(benchmark::kMillisecond);
BENCHMARK_CAPTURE(Resample, BilinearShrink1024, kLarge, kDyadic, rfBilinear)
    ->Unit(benchmark::kMillisecond);
BENCHMARK_CAPTURE(Resample, BilinearShrinkUneven, kLarge, kUneven, rfBilinear)
    ->Unit(benchmark::kMillisecond);
BENCHMARK_CAPTURE(Resample, BilinearShrinkIcon, kLarge, kIcon, rfBilinear)
    ->Unit(benchmark::kMillisecond);
BENCHMARK_CAPTURE(Resample, BilinearEnlarge, kSmall, kLarge, rfBilinear)
    ->Unit(benchmark::kMillisecond);
BENCHMARK_CAPTURE(Resample, BilinearEnlargeUneven, kSmall, kUnevenLarge, rfBilinear)
    ->Unit(benchmark::kMillisecond);
BENCHMARK_CAPTURE(Resample, BilinearNarrowerAndHigher, kLarge, kNarrowHigh, rfBilinear)
    ->Unit(benchmark::kMillisecond);
BENCHMARK_CAPTURE(Resample, BilinearWiderAndLower, kLarge, kWideLow, rfBilinear)
    ->Unit(benchmark::kMillisecond);
BENCHMARK_CAPTURE(Resample, BicubicEnlarge, kSmall, kLarge, rfBicubic)
    ->Unit(benchmark::kMillisecond);
BENCHMARK_CAPTURE(Resample, BicubicEnlargeUneven, kSmall, kUnevenLarge, rfBicubic)
    ->Unit(benchmark::kMillisecond);
BENCHMARK_CAPTURE(Resample, NearestShrink, kLarge, kSmall, rfNone)->Unit(benchmark::kMillisecond);
BENCHMARK_CAPTURE(Resample, NearestEnlarge, kSmall, kLarge, rfNone)->Unit(benchmark::kMillisecond);
BENCHMARK_CAPTURE(Resample, FastLinearShrink, kLarge, kSmall, rfFastLinear)
    ->Unit(benchmark::kMillisecond);
BENCHMARK_CAPTURE(Resample, FastLinearEnlarge, kSmall, kLarge, rfFastLinear)
    ->Unit(benchmark::kMillisecond);

/// Partial alpha makes the enlargement choose colours at its edges.
void BM_BilinearEnlargeAlpha(benchmark::State& state) {
    const auto source = MakePicture(kSmallWidth, kSmallHeight);
    // A disc of soft shadow over a clear ground.
    for (std::int32_t y = 0; y < kSmallHeight; ++y) {
        for (std::int32_t x = 0; x < kSmallWidth; ++x) {
            const std::int32_t distance = (x - 500) * (x - 500) + (y - 375) * (y - 375);
            source->SetAlpha(x, y,
                             static_cast<std::uint8_t>(std::clamp(340 - distance / 256, 0, 255)));
        }
    }
    TZmBitmap target(kLargeWidth, kLargeHeight, zm24RGB);
    for (auto _ : state) {
        if (!ResampleBitmapInto(*source, target, rfBilinear, nullptr, {})) {
            state.SkipWithError("no result");
        }
    }
}
BENCHMARK(BM_BilinearEnlargeAlpha)->Unit(benchmark::kMillisecond);

/// A palette of 256 colours and the index of every pixel.
void BM_Quantize(benchmark::State& state, std::int32_t method) {
    const auto source = MakePicture(kLargeWidth, kLargeHeight);
    const std::int32_t old_method = ZmGlobalSettings().fColorReductionAlgorithm;
    ZmGlobalSettings().fColorReductionAlgorithm = method;
    std::vector<std::uint16_t> indices(std::size_t{kLargeWidth} * kLargeHeight);
    for (auto _ : state) {
        std::vector<TRGB> palette;
        TZmQuantizer quantizer(*source, palette, 256);
        std::uint16_t* out = indices.data();
        for (std::int32_t y = 0; y < kLargeHeight; ++y, out += kLargeWidth) {
            const auto* row = reinterpret_cast<const TRGB*>(source->GetScanLine(y));
            quantizer.GetRGBIndexes(row, kLargeWidth, out);
        }
        benchmark::DoNotOptimize(indices.data());
    }
    ZmGlobalSettings().fColorReductionAlgorithm = old_method;
}
BENCHMARK_CAPTURE(BM_Quantize, Neural, 0)->Unit(benchmark::kMillisecond);
BENCHMARK_CAPTURE(BM_Quantize, Boxes, 1)->Unit(benchmark::kMillisecond);

/// A whole reduction from the file on: a BMP in memory opened, 256 colours found by the default
/// method, every pixel mapped.
void QuantizeFile(benchmark::State& state) {
    TMemoryStream file;
    TIOParams params;
    if (!MakePicture(kLargeWidth, kLargeHeight)->Write(&file, ioBMP, &params)) {
        state.SkipWithError("not written");
        return;
    }
    for (auto _ : state) {
        TZmBitmap image;
        file.SetPosition(0);
        TIOParams read_params;
        image.Read(&file, ioBMP, &read_params);
        TZalmoProc proc(&image);
        if (!proc.ConvertTo(zm8p, zmptMedianCut, zmdtSolid, /*check_parameters_only=*/false)) {
            state.SkipWithError("no result");
        }
    }
}
BENCHMARK(QuantizeFile)->Unit(benchmark::kMillisecond);

/// The time that passes, with one thread and with two; the vertical pass never has more than one.
void Lanczos3(benchmark::State& state) {
    const auto source = MakePicture(kLargeWidth, kLargeHeight);
    TZmBitmap target(kSmallWidth, kSmallHeight, zm24RGB);
    TZmZalmoGlobalSettings& settings = ZmGlobalSettings();
    const std::int32_t old_count = settings.fImageProcMaxThreads;
    settings.fImageProcMaxThreads = static_cast<std::int32_t>(state.range(0));
    for (auto _ : state) {
        if (!ResampleBitmapInto(*source, target, rfLanczos3, nullptr, {})) {
            state.SkipWithError("no result");
        }
    }
    settings.fImageProcMaxThreads = old_count;
}
BENCHMARK(Lanczos3)->ArgName("threads")->Arg(1)->Arg(2)->UseRealTime()->Unit(
    benchmark::kMillisecond);

/// The plain forms, for the gain of the fast ones.
template <typename Engine>
void RunPlain(benchmark::State& state, TZmImageSize from, TZmImageSize to, const Engine& engine) {
    const auto source = MakePicture(from.width, from.height);
    TZmBitmap target(to.width, to.height, zm24RGB);
    for (auto _ : state) {
        if (!engine(*source, target)) {
            state.SkipWithError("no result");
        }
    }
}

void BM_BicubicPlain(benchmark::State& state) {
    RunPlain(state, kSmall, kLarge, [](TZmBitmap& source, TZmBitmap& target) {
        return ResampleAreaPlain(source, target, nullptr, TAreaInterpolation::kCubic, {});
    });
}
BENCHMARK(BM_BicubicPlain)->Unit(benchmark::kMillisecond);

void BM_FastLinearPlain(benchmark::State& state) {
    const bool shrink = state.range(0) != 0;
    RunPlain(state, shrink ? kLarge : kSmall, shrink ? kSmall : kLarge,
             [](TZmBitmap& source, TZmBitmap& target) {
                 return ResampleFastLinear(source, target, nullptr, {}, TResampleForm::kPlain);
             });
}
BENCHMARK(BM_FastLinearPlain)->ArgName("shrink")->Arg(1)->Arg(0)->Unit(benchmark::kMillisecond);

void BM_Lanczos3Plain(benchmark::State& state) {
    const std::int32_t old_count = ZmGlobalSettings().fImageProcMaxThreads;
    ZmGlobalSettings().fImageProcMaxThreads = 1;
    RunPlain(state, kLarge, kSmall, [](TZmBitmap& source, TZmBitmap& target) {
        return ResampleKernel(source, target, rfLanczos3, {}, TResampleForm::kPlain);
    });
    ZmGlobalSettings().fImageProcMaxThreads = old_count;
}
BENCHMARK(BM_Lanczos3Plain)->Unit(benchmark::kMillisecond);

void BM_BilinearPlain(benchmark::State& state) {
    const bool shrink = state.range(0) != 0;
    const auto source =
        shrink ? MakePicture(kLargeWidth, kLargeHeight) : MakePicture(kSmallWidth, kSmallHeight);
    const TZmImageSize to = shrink ? kSmall : kLarge;
    TZmBitmap target(to.width, to.height, zm24RGB);
    for (auto _ : state) {
        if (!ResampleAreaPlain(*source, target, nullptr, TAreaInterpolation::kLinear, {})) {
            state.SkipWithError("no result");
        }
    }
}
BENCHMARK(BM_BilinearPlain)->ArgName("shrink")->Arg(1)->Arg(0)->Unit(benchmark::kMillisecond);

}  // namespace
}  // namespace zm
