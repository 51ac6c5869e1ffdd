/// Text on pictures of two sizes: the time is that of the text, whatever the picture's size.

#include <benchmark/benchmark.h>

#include <string>

#include "engine/canvas/zmgdiplus.h"

namespace zm {
namespace {

constexpr std::int32_t kPoints = 48;

/// 40 characters at 48 points on a transparent picture, with a canvas of its own.
void DrawText(benchmark::State& state, std::int32_t width, std::int32_t height) {
    const std::u16string text(u"The quick brown fox jumps over lazy dogs");
    TBitmap bitmap;
    if (!bitmap.SetSize(width, height, pf32bit)) {
        state.SkipWithError("no memory");
        return;
    }
    TCanvas canvas(bitmap);
    canvas.Font.SetSize(kPoints);
    for (auto _ : state) {
        TZmCanvas zm_canvas(canvas, /*AntiAlias=*/true, /*UseGDIPlus=*/true, &bitmap);
        zm_canvas.DrawText(text, 100, 20, /*Angle=*/0);
    }
}

void DrawTextSmall(benchmark::State& state) {
    DrawText(state, 1600, 120);
}

void DrawTextLarge(benchmark::State& state) {
    DrawText(state, 4000, 3000);
}

/// The whole way of a first text but for loading the libraries, which only a new process shows.
void MeasureText(benchmark::State& state) {
    for (auto _ : state) {
        TZmEmptyCanvas canvas;
        canvas.GetFont().SetSize(kPoints);
        benchmark::DoNotOptimize(canvas.MeasureText(u"The quick brown fox jumps over lazy dogs"));
    }
}

BENCHMARK(DrawTextSmall)->Unit(benchmark::kMicrosecond);
BENCHMARK(DrawTextLarge)->Unit(benchmark::kMicrosecond);
BENCHMARK(DrawTextLarge)->Threads(8)->UseRealTime()->Unit(benchmark::kMicrosecond);
BENCHMARK(MeasureText)->Unit(benchmark::kMicrosecond);

}  // namespace
}  // namespace zm
