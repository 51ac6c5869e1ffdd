/// The bitmap's own work on a picture of 12 megapixels, in one thread, beside a memcpy of the
/// same bytes in the same run: only the ratios (`memcpys`: CPU time in memcpys of the picture; the
/// unit that the report sets behind it has no meaning) mean something on another machine.

#include <benchmark/benchmark.h>

#include <algorithm>
#include <cstring>
#include <ctime>
#include <vector>

#include "engine/bitmap/zmpixelformats.h"
#include "engine/bitmap/zmrowconvert.h"
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

/// CPU seconds of a memcpy of the picture, the best of several.
double MemcpySeconds() {
    const std::vector<std::uint8_t> source(static_cast<std::size_t>(kPictureBytes), 1);
    std::vector<std::uint8_t> dest(source.size(), 2);
    double best = 1.0;
    for (int i = 0; i < 15; ++i) {
        const std::clock_t start = std::clock();
        std::memcpy(dest.data(), source.data(), source.size());
        benchmark::DoNotOptimize(dest.data());
        benchmark::ClobberMemory();
        best = std::min(best, static_cast<double>(std::clock() - start) / CLOCKS_PER_SEC);
    }
    return best;
}

void CountBytes(benchmark::State& state, std::int64_t bytes) {
    static const double memcpy_seconds = MemcpySeconds();
    state.SetBytesProcessed(static_cast<std::int64_t>(state.iterations()) * bytes);
    using TCounter = benchmark::Counter;
    state.counters["memcpys"] =
        TCounter(memcpy_seconds, TCounter::kIsIterationInvariantRate | TCounter::kInvert);
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

/// Bytes are half of those read and written, as in the memcpy's count of the picture read.
void CountConversion(benchmark::State& state, TZmPixelFormat from, TZmPixelFormat to) {
    CountBytes(state, std::int64_t{kWidth} * kHeight *
                          (PixelFormatInfo(from).bit_count + PixelFormatInfo(to).bit_count) / 16);
}

/// Bits are ordered ones.
void Convert(benchmark::State& state, TZmPixelFormat from, TZmPixelFormat to) {
    TZmBitmap source(kWidth, kHeight, from);
    TZmBitmap dest(kWidth, kHeight, to);
    FillWithRamp(source);
    dest.Fill(0.0);
    dest.SetDefaultDitherMethod(zmOrdered);
    for (auto _ : state) {
        dest.CopyAndConvertFormat(&source);
    }
    CountConversion(state, from, to);
}

/// The stated loops, whose bytes the fast ones give: for the gain.
void ConvertPlain(benchmark::State& state, TZmPixelFormat from, TZmPixelFormat to) {
    TZmBitmap source(kWidth, kHeight, from);
    TZmBitmap dest(kWidth, kHeight, to);
    FillWithRamp(source);
    dest.Fill(0.0);
    const TZmRowFunction convert = FindPlainRowFunction(from, to);
    const TZmRowContext context = MakeRowContext(source.GetPaletteArray().data());
    for (auto _ : state) {
        for (std::int32_t y = 0; y < kHeight; ++y) {
            convert(source.GetScanLine(y), dest.GetScanLine(y), kWidth, context);
        }
    }
    CountConversion(state, from, to);
}

/// Bits above the automatic level, for which every grey is counted first.
void ConvertByThreshold(benchmark::State& state) {
    TZmBitmap source(kWidth, kHeight, zm24RGB);
    TZmBitmap dest(kWidth, kHeight, zm1g);
    FillWithRamp(source);
    dest.SetDefaultDitherMethod(zmThreshold);
    for (auto _ : state) {
        dest.CopyAndConvertFormat(&source);
    }
    CountConversion(state, zm24RGB, zm1g);
}

/// The raw form to a buffer and back, in one turn each.
void RawBlob(benchmark::State& state) {
    TZmBitmap source(kWidth, kHeight, zm24RGB);
    TZmBitmap copy;
    FillWithRamp(source);
    std::vector<std::uint8_t> blob(static_cast<std::size_t>(source.CalcRAWSize()));
    const auto blob_bytes = static_cast<std::int64_t>(blob.size());
    for (auto _ : state) {
        if (!source.SaveRAWToBufferOrStream(blob.data(), blob_bytes, nullptr, false) ||
            !copy.LoadRAWFromBufferOrStream(blob.data(), blob_bytes, nullptr)) {
            state.SkipWithError("no room");
        }
    }
    CountBytes(state, 2 * kPictureBytes);
}

BENCHMARK(Memcpy)->Unit(benchmark::kMillisecond);
BENCHMARK(Fill)->Unit(benchmark::kMillisecond);
BENCHMARK(CopyRectTo)->Unit(benchmark::kMillisecond);
BENCHMARK(CopyRectToShiftedBits)->Unit(benchmark::kMillisecond);
BENCHMARK(CropGrowing)->Unit(benchmark::kMillisecond);
BENCHMARK_CAPTURE(Convert, zm24RGB_to_zm8g, zm24RGB, zm8g)->Unit(benchmark::kMillisecond);
BENCHMARK_CAPTURE(Convert, zm24RGB_to_zm32RGB, zm24RGB, zm32RGB)->Unit(benchmark::kMillisecond);
BENCHMARK_CAPTURE(Convert, zm32RGB_to_zm24RGB, zm32RGB, zm24RGB)->Unit(benchmark::kMillisecond);
BENCHMARK_CAPTURE(Convert, zm24RGB_to_zm48RGB, zm24RGB, zm48RGB)->Unit(benchmark::kMillisecond);
BENCHMARK_CAPTURE(Convert, zm48RGB_to_zm24RGB, zm48RGB, zm24RGB)->Unit(benchmark::kMillisecond);
BENCHMARK_CAPTURE(Convert, zm8g_to_zm24RGB, zm8g, zm24RGB)->Unit(benchmark::kMillisecond);
BENCHMARK_CAPTURE(Convert, zm8p_to_zm24RGB, zm8p, zm24RGB)->Unit(benchmark::kMillisecond);
BENCHMARK_CAPTURE(Convert, zm1g_to_zm24RGB, zm1g, zm24RGB)->Unit(benchmark::kMillisecond);
BENCHMARK_CAPTURE(Convert, zm24RGB_to_zm1g, zm24RGB, zm1g)->Unit(benchmark::kMillisecond);
BENCHMARK(ConvertByThreshold)->Unit(benchmark::kMillisecond);
BENCHMARK_CAPTURE(ConvertPlain, zm24RGB_to_zm8g, zm24RGB, zm8g)->Unit(benchmark::kMillisecond);
BENCHMARK_CAPTURE(ConvertPlain, zm24RGB_to_zm32RGB, zm24RGB, zm32RGB)
    ->Unit(benchmark::kMillisecond);
BENCHMARK_CAPTURE(ConvertPlain, zm32RGB_to_zm24RGB, zm32RGB, zm24RGB)
    ->Unit(benchmark::kMillisecond);
BENCHMARK_CAPTURE(ConvertPlain, zm24RGB_to_zm48RGB, zm24RGB, zm48RGB)
    ->Unit(benchmark::kMillisecond);
BENCHMARK_CAPTURE(ConvertPlain, zm48RGB_to_zm24RGB, zm48RGB, zm24RGB)
    ->Unit(benchmark::kMillisecond);
BENCHMARK_CAPTURE(ConvertPlain, zm8g_to_zm24RGB, zm8g, zm24RGB)->Unit(benchmark::kMillisecond);
BENCHMARK_CAPTURE(ConvertPlain, zm8p_to_zm24RGB, zm8p, zm24RGB)->Unit(benchmark::kMillisecond);
BENCHMARK(RawBlob)->Unit(benchmark::kMillisecond);

}  // namespace
}  // namespace zm
