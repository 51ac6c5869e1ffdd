// Turning and mirroring a 12-megapixel picture, against a memcpy of the same bytes in the same
// run. Flips work in place: a memcpy reads and writes as much.

#include <benchmark/benchmark.h>

#include <cstdint>
#include <cstring>
#include <memory>
#include <vector>

#include "engine/proc/zmrotate.h"
#include "engine/proc/zmrotate_p.h"

namespace zm {
namespace {

constexpr std::int32_t kWidth = 4000;
constexpr std::int32_t kHeight = 3000;
constexpr TColor kWhite = 0xFFFFFF;

std::unique_ptr<TZmBitmap> MakePicture(TZmPixelFormat format) {
    auto bitmap = std::make_unique<TZmBitmap>(kWidth, kHeight, format);
    std::uint32_t noise = 1;
    for (std::int32_t y = 0; y < kHeight; ++y) {
        std::uint8_t* const row = bitmap->GetScanLine(y);
        for (std::int64_t i = 0; i < bitmap->GetRowLen(); ++i) {
            noise = noise * 1664525u + 1013904223u;
            row[i] = static_cast<std::uint8_t>(noise >> 24);
        }
    }
    return bitmap;
}

void BM_RotateMemcpy(benchmark::State& state) {
    const std::size_t bytes = std::size_t{kWidth} * kHeight * 3;
    const std::vector<std::uint8_t> from(bytes, 1);
    std::vector<std::uint8_t> to(bytes);
    for (auto _ : state) {
        std::memcpy(to.data(), from.data(), bytes);
        benchmark::DoNotOptimize(to.data());
        benchmark::ClobberMemory();
    }
}
BENCHMARK(BM_RotateMemcpy)->Unit(benchmark::kMillisecond);

/// A turn into a target that is there already.
void Rotate(benchmark::State& state, TZmPixelFormat format, double angle, TZmAntialiasMode mode) {
    const auto source = MakePicture(format);
    TZmBitmap target;
    for (auto _ : state) {
        if (RotateBitmapInto(*source, target, angle, mode, kWhite, nullptr, {}) !=
            TRotateOutcome::kRotated) {
            state.SkipWithError("no result");
        }
        benchmark::ClobberMemory();
    }
    state.SetItemsProcessed(state.iterations() * target.GetWidth() * target.GetHeight());
}

BENCHMARK_CAPTURE(Rotate, Left90, zm24RGB, 90, zmrBilinear)->Unit(benchmark::kMillisecond);
BENCHMARK_CAPTURE(Rotate, Half180, zm24RGB, 180, zmrBilinear)->Unit(benchmark::kMillisecond);
BENCHMARK_CAPTURE(Rotate, Right270, zm24RGB, 270, zmrBilinear)->Unit(benchmark::kMillisecond);
BENCHMARK_CAPTURE(Rotate, Left90Gray, zm8g, 90, zmrBilinear)->Unit(benchmark::kMillisecond);
BENCHMARK_CAPTURE(Rotate, Left90Bits, zm1g, 90, zmrBilinear)->Unit(benchmark::kMillisecond);
BENCHMARK_CAPTURE(Rotate, Bilinear7, zm24RGB, 7, zmrBilinear)->Unit(benchmark::kMillisecond);
BENCHMARK_CAPTURE(Rotate, Bilinear10, zm24RGB, 10, zmrBilinear)->Unit(benchmark::kMillisecond);
BENCHMARK_CAPTURE(Rotate, Bilinear80, zm24RGB, 80, zmrBilinear)->Unit(benchmark::kMillisecond);
BENCHMARK_CAPTURE(Rotate, Bicubic10, zm24RGB, 10, zmrBicubic)->Unit(benchmark::kMillisecond);
BENCHMARK_CAPTURE(Rotate, Shears10, zm24RGB, 10, zmrFast)->Unit(benchmark::kMillisecond);
BENCHMARK_CAPTURE(Rotate, Shears10Bits, zm1g, 10, zmrFast)->Unit(benchmark::kMillisecond);
BENCHMARK_CAPTURE(Rotate, Nearest10, zm24RGB, 10, zmrNone)->Unit(benchmark::kMillisecond);
BENCHMARK_CAPTURE(Rotate, Nearest10Gray, zm8g, 10, zmrNone)->Unit(benchmark::kMillisecond);

void Flip(benchmark::State& state, TFlipDir direction) {
    const auto bitmap = MakePicture(zm24RGB);
    for (auto _ : state) {
        FlipBitmap(*bitmap, direction);
        benchmark::ClobberMemory();
    }
}
BENCHMARK_CAPTURE(Flip, Horizontal, fdHorizontal)->Unit(benchmark::kMillisecond);
BENCHMARK_CAPTURE(Flip, Vertical, fdVertical)->Unit(benchmark::kMillisecond);

/// The plain forms, for the gain of the fast ones.
void BM_RotatePlain(benchmark::State& state) {
    const auto source = MakePicture(zm24RGB);
    TZmBitmap target;
    for (auto _ : state) {
        const bool is_done = state.range(0) == 0 ? TurnQuartersPlain(*source, target, 1)
                             : state.range(0) == 1
                                 ? RotateInversePlain(*source, target, 10, zmrBilinear, kWhite, {})
                                 : RotateByShearsPlain(*source, target, 10, kWhite, {});
        if (!is_done) {
            state.SkipWithError("no result");
        }
    }
}
BENCHMARK(BM_RotatePlain)->ArgName("engine")->Arg(0)->Arg(1)->Arg(2)->Unit(benchmark::kMillisecond);

}  // namespace
}  // namespace zm
