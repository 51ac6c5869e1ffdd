/// The bitmap's own work on a picture of 12 megapixels, in one thread, beside a memcpy of the
/// same bytes in the same run: only the ratios mean something on another machine.

#include <benchmark/benchmark.h>

#include <cstring>
#include <vector>

#include "engine/bitmap/zmxBitmaps.h"

namespace zm {
namespace {

constexpr std::int32_t kWidth = 4000;
constexpr std::int32_t kHeight = 3000;
constexpr std::int64_t kPictureBytes = std::int64_t{kWidth} * 3 * kHeight;

void FillWithRamp(TZmBitmap& bitmap) {
    const auto row_bytes = static_cast<std::int32_t>(bitmap.GetRowLen());
    for (std::int32_t y = 0; y < bitmap.GetHeight(); ++y) {
        std::uint8_t* const row = bitmap.GetScanLine(y);
        for (std::int32_t i = 0; i < row_bytes; ++i) {
            row[i] = static_cast<std::uint8_t>(i * 7 + y * 13);
        }
    }
}

void CountBytes(benchmark::State& state, std::int64_t bytes) {
    state.SetBytesProcessed(static_cast<std::int64_t>(state.iterations()) * bytes);
}

void Memcpy(benchmark::State& state) {
    const std::vector<std::uint8_t> source(static_cast<std::size_t>(kPictureBytes), 1);
    std::vector<std::uint8_t> dest(source.size(), 2);
    for (auto _ : state) {
        std::memcpy(dest.data(), source.data(), source.size());
        benchmark::DoNotOptimize(dest.data());
        benchmark::ClobberMemory();
    }
    CountBytes(state, kPictureBytes);
}

void Fill(benchmark::State& state) {
    TZmBitmap bitmap(kWidth, kHeight, zm24RGB);
    for (auto _ : state) {
        bitmap.Fill(static_cast<double>(0x00804020));
    }
    CountBytes(state, kPictureBytes);
}

void CopyRectTo(benchmark::State& state) {
    TZmBitmap source(kWidth, kHeight, zm24RGB);
    TZmBitmap dest(kWidth, kHeight, zm24RGB);
    FillWithRamp(source);
    dest.Fill(0.0);
    for (auto _ : state) {
        source.CopyRectTo(&dest, 0, 0, 0, 0, kWidth, kHeight, /*copy_alpha=*/false);
    }
    CountBytes(state, kPictureBytes);
}

/// Bits that land 3 bits off.
void CopyRectToShiftedBits(benchmark::State& state) {
    TZmBitmap source(kWidth, kHeight, zm1g);
    TZmBitmap dest(kWidth, kHeight, zm1g);
    FillWithRamp(source);
    dest.Fill(0.0);
    for (auto _ : state) {
        source.CopyRectTo(&dest, 0, 0, 3, 0, kWidth, kHeight, /*copy_alpha=*/false);
    }
    CountBytes(state, kPictureBytes / 24);
}

/// The new picture's memory included, the old one's release not.
void CropGrowing(benchmark::State& state) {
    TZmBitmap source(kWidth, kHeight, zm24RGB);
    FillWithRamp(source);
    for (auto _ : state) {
        state.PauseTiming();
        TZmBitmap bitmap(source);
        state.ResumeTiming();
        bitmap.Crop(-50, -50, kWidth + 49, kHeight + 49, 0x00FFFFFF);
        state.PauseTiming();
        bitmap.FreeImage(true);
        state.ResumeTiming();
    }
    CountBytes(state, kPictureBytes);
}

/// Bytes are those read and written, as in the memcpy's count of the picture read.
void Convert(benchmark::State& state, TZmPixelFormat from, TZmPixelFormat to) {
    TZmBitmap source(kWidth, kHeight, from);
    TZmBitmap dest(kWidth, kHeight, to);
    FillWithRamp(source);
    dest.Fill(0.0);
    for (auto _ : state) {
        dest.CopyAndConvertFormat(&source);
    }
    CountBytes(state, std::int64_t{kWidth} * kHeight *
                          (source.GetBitCount() + dest.GetBitCount()) / 16);
}

BENCHMARK(Memcpy)->Unit(benchmark::kMillisecond);
BENCHMARK(Fill)->Unit(benchmark::kMillisecond);
BENCHMARK(CopyRectTo)->Unit(benchmark::kMillisecond);
BENCHMARK(CopyRectToShiftedBits)->Unit(benchmark::kMillisecond);
BENCHMARK(CropGrowing)->Unit(benchmark::kMillisecond);
BENCHMARK_CAPTURE(Convert, zm24RGB_to_zm8g, zm24RGB, zm8g)->Unit(benchmark::kMillisecond);
BENCHMARK_CAPTURE(Convert, zm24RGB_to_zm32RGB, zm24RGB, zm32RGB)->Unit(benchmark::kMillisecond);
BENCHMARK_CAPTURE(Convert, zm24RGB_to_zm48RGB, zm24RGB, zm48RGB)->Unit(benchmark::kMillisecond);
BENCHMARK_CAPTURE(Convert, zm48RGB_to_zm24RGB, zm48RGB, zm24RGB)->Unit(benchmark::kMillisecond);
BENCHMARK_CAPTURE(Convert, zm32RGB_to_zm24RGB, zm32RGB, zm24RGB)->Unit(benchmark::kMillisecond);
BENCHMARK_CAPTURE(Convert, zm8g_to_zm24RGB, zm8g, zm24RGB)->Unit(benchmark::kMillisecond);
BENCHMARK_CAPTURE(Convert, zm8p_to_zm24RGB, zm8p, zm24RGB)->Unit(benchmark::kMillisecond);
BENCHMARK_CAPTURE(Convert, zm1g_to_zm24RGB, zm1g, zm24RGB)->Unit(benchmark::kMillisecond);
BENCHMARK_CAPTURE(Convert, zm24RGB_to_zm1g, zm24RGB, zm1g)->Unit(benchmark::kMillisecond);

}  // namespace
}  // namespace zm
