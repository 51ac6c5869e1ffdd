/// Drawing of pictures over pictures, in one thread; the memcpy of bitmap_bench is the yardstick.
/// Bytes counted are those of the destination's drawn part.

#include <benchmark/benchmark.h>

#include "engine/bitmap/zmblend.h"
#include "engine/bitmap/zmxBitmaps.h"

namespace zm {
namespace {

constexpr std::int32_t kWidth = 4000;
constexpr std::int32_t kHeight = 3000;

void FillRows(TZmBitmap& bitmap, std::int32_t step) {
    const auto row_bytes = static_cast<std::int32_t>(bitmap.GetRowLen());
    for (std::int32_t y = 0; y < bitmap.GetHeight(); ++y) {
        std::uint8_t* const row = bitmap.GetScanLine(y);
        for (std::int32_t i = 0; i < row_bytes; ++i) {
            row[i] = static_cast<std::uint8_t>(i * step + y * 13);
        }
    }
}

void CountPixels(benchmark::State& state, std::int64_t width, std::int64_t height) {
    state.SetBytesProcessed(static_cast<std::int64_t>(state.iterations()) * width * height * 3);
}

enum class TBenchPlane : std::uint8_t { kNone, kNoise };

/// A picture of `width` by `height` drawn at its own size.
void Draw(benchmark::State& state, std::int32_t width, std::int32_t height, TZmPixelFormat format,
          TBenchPlane plane, double opacity, TZmRenderOperation operation) {
    TZmBitmap source(width, height, format);
    TZmBitmap dest(kWidth, kHeight, zm24RGB);
    FillRows(source, 7);
    FillRows(dest, 5);
    if (plane == TBenchPlane::kNoise) {
        FillRows(*source.GetAlphaChannel(), 11);
    }
    for (auto _ : state) {
        source.RenderToTZmBitmapEx(&dest, 0, 0, width, height, 0, 0, width, height, true, 255,
                                   rfNone, operation, opacity);
    }
    CountPixels(state, width, height);
}

void RenderWhole(benchmark::State& state, TZmPixelFormat format, TBenchPlane plane,
                 double opacity) {
    Draw(state, kWidth, kHeight, format, plane, opacity, zmlNormal);
}

/// An overlay of 4 megapixels over a picture of 12.
void RenderOverlay(benchmark::State& state) {
    Draw(state, 2000, 2000, zm24RGB, TBenchPlane::kNoise, 0.8, zmlNormal);
}

void RenderOperation(benchmark::State& state, TZmRenderOperation operation) {
    Draw(state, kWidth, kHeight, zm24RGB, TBenchPlane::kNoise, 0.8, operation);
}

/// The whole picture at half its size.
void RenderScaled(benchmark::State& state, TResampleFilter filter) {
    TZmBitmap source(kWidth, kHeight, zm24RGB);
    TZmBitmap dest(kWidth / 2, kHeight / 2, zm24RGB);
    FillRows(source, 7);
    dest.Fill(0.0);
    for (auto _ : state) {
        source.DrawToTZmBitmap(&dest, TRect{0, 0, kWidth / 2, kHeight / 2},
                               TRect{0, 0, kWidth, kHeight}, filter);
    }
    CountPixels(state, kWidth / 2, kHeight / 2);
}

BENCHMARK_CAPTURE(RenderWhole, copy, zm24RGB, TBenchPlane::kNone, 1.0)
    ->Unit(benchmark::kMillisecond);
BENCHMARK_CAPTURE(RenderWhole, opacity, zm24RGB, TBenchPlane::kNone, 0.8)
    ->Unit(benchmark::kMillisecond);
BENCHMARK_CAPTURE(RenderWhole, plane, zm24RGB, TBenchPlane::kNoise, 1.0)
    ->Unit(benchmark::kMillisecond);
BENCHMARK_CAPTURE(RenderWhole, plane_and_opacity, zm24RGB, TBenchPlane::kNoise, 0.8)
    ->Unit(benchmark::kMillisecond);
BENCHMARK_CAPTURE(RenderWhole, zm8p_plane, zm8p, TBenchPlane::kNoise, 1.0)
    ->Unit(benchmark::kMillisecond);
BENCHMARK_CAPTURE(RenderWhole, zm32RGB_plane, zm32RGB, TBenchPlane::kNoise, 1.0)
    ->Unit(benchmark::kMillisecond);
BENCHMARK_CAPTURE(RenderWhole, zm48RGB_plane, zm48RGB, TBenchPlane::kNoise, 1.0)
    ->Unit(benchmark::kMillisecond);
BENCHMARK(RenderOverlay)->Unit(benchmark::kMillisecond);
BENCHMARK_CAPTURE(RenderOperation, zmlMul, zmlMul)->Unit(benchmark::kMillisecond);
BENCHMARK_CAPTURE(RenderOperation, zmlScreen, zmlScreen)->Unit(benchmark::kMillisecond);
BENCHMARK_CAPTURE(RenderOperation, zmlOverlay, zmlOverlay)->Unit(benchmark::kMillisecond);
BENCHMARK_CAPTURE(RenderOperation, zmlHardLight, zmlHardLight)->Unit(benchmark::kMillisecond);
BENCHMARK_CAPTURE(RenderOperation, zmlAdd, zmlAdd)->Unit(benchmark::kMillisecond);
BENCHMARK_CAPTURE(RenderOperation, zmlSub, zmlSub)->Unit(benchmark::kMillisecond);
BENCHMARK_CAPTURE(RenderOperation, zmlMAX, zmlMAX)->Unit(benchmark::kMillisecond);
BENCHMARK_CAPTURE(RenderOperation, zmlMIN, zmlMIN)->Unit(benchmark::kMillisecond);
BENCHMARK_CAPTURE(RenderOperation, zmlAverage, zmlAverage)->Unit(benchmark::kMillisecond);
BENCHMARK_CAPTURE(RenderOperation, zmlExclusion, zmlExclusion)->Unit(benchmark::kMillisecond);
BENCHMARK_CAPTURE(RenderOperation, zmlSoftLight, zmlSoftLight)->Unit(benchmark::kMillisecond);
BENCHMARK_CAPTURE(RenderScaled, rfNone, rfNone)->Unit(benchmark::kMillisecond);
BENCHMARK_CAPTURE(RenderScaled, rfBilinear, rfBilinear)->Unit(benchmark::kMillisecond);

}  // namespace
}  // namespace zm
