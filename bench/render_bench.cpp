/// Drawing of pictures over pictures, in one thread; the memcpy of bitmap_bench is the yardstick.
/// Bytes counted are those of the destination's drawn part.

#include <benchmark/benchmark.h>

#include <cstring>
#include <vector>

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

/// The operation alone; what mixing by alpha adds is the difference of RenderWhole's rows.
constexpr std::int32_t kOverlaySide = 1000;

/// The overlay of a drawing step: 1 megapixel with alpha, at its own size.
void DrawImage(benchmark::State& state, double opacity) {
    Draw(state, kOverlaySide, kOverlaySide, zm24RGB, TBenchPlane::kNoise, opacity, zmlNormal);
}

/// Its yardstick: the overlay's pixels, its plane and the picture below, copied.
void CopyOverlay(benchmark::State& state) {
    const std::size_t bytes = std::size_t{kOverlaySide} * kOverlaySide * (3 + 1 + 3);
    const std::vector<std::uint8_t> source(bytes, 7);
    std::vector<std::uint8_t> dest(bytes);
    for (auto _ : state) {
        std::memcpy(dest.data(), source.data(), bytes);
        benchmark::DoNotOptimize(dest.data());
        benchmark::ClobberMemory();
    }
    CountPixels(state, kOverlaySide, kOverlaySide);
}

void RenderOperation(benchmark::State& state, TZmRenderOperation operation) {
    Draw(state, kWidth, kHeight, zm24RGB, TBenchPlane::kNone, 1.0, operation);
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
BENCHMARK_CAPTURE(DrawImage, alpha, 1.0)->Unit(benchmark::kMillisecond);
BENCHMARK_CAPTURE(DrawImage, alpha_and_opacity, 0.85)->Unit(benchmark::kMillisecond);
BENCHMARK(CopyOverlay)->Unit(benchmark::kMillisecond);
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
