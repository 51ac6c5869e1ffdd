// The nearest sample of a turned image, for every pixel format: the positions of the inverse
// filter, rounded. The fast form finds the run of columns whose source lies inside the image and
// copies without tests there.

#include <cstring>
#include <numbers>

#include "engine/proc/zmrotate_map_p.h"

namespace zm {
namespace {

/// The size of the turned picture, a side's edges included, at least one pixel.
std::optional<TZmImageSize> NearestSize(TZmImageSize source, double angle) {
    const double radians = angle * std::numbers::pi / 180;
    const double sine = std::sin(radians);
    const double cosine = std::cos(radians);
    const double width = source.width;
    const double height = source.height;
    const TZmImageSize size{RoundHalfEven(std::fabs(cosine * width) + std::fabs(sine * height)),
                            RoundHalfEven(std::fabs(sine * width) + std::fabs(cosine * height))};
    if (size.width == kMaxInt32 || size.height == kMaxInt32) {
        return std::nullopt;
    }
    return TZmImageSize{std::max(size.width, 1), std::max(size.height, 1)};
}

bool PrepareTarget(TZmBitmap& source, TZmBitmap& target, double angle, TColor background) {
    const auto size = NearestSize({source.GetWidth(), source.GetHeight()}, angle);
    if (!size || !target.Allocate(size->width, size->height, source.GetPixelFormat()) ||
        target.GetPixelFormat() != source.GetPixelFormat()) {
        return false;
    }
    if (source.GetPixelFormat() == zm8p) {
        source.CopyPaletteTo(&target);
    }
    target.Fill(static_cast<double>(background));
    return true;
}

void CopyBit(const std::uint8_t* from, std::int32_t i, std::uint8_t* to, std::int32_t x) {
    const unsigned bit = from[i >> 3] >> (7 - (i & 7)) & 1u;
    const unsigned mask = 0x80u >> (x & 7);
    const unsigned kept = to[x >> 3] & ~mask;
    to[x >> 3] = static_cast<std::uint8_t>(bit != 0 ? kept | mask : kept);
}

/// One row of a run of columns, and where it comes from.
struct TNearestRun {
    const TRotationMap& map;
    TRotationMap::TRow row;
    const std::uint8_t* const* rows;
    TColumnSpan span;
    std::uint8_t* out;  // of column 0
};

void CopyBitRun(const TNearestRun& run) {
    for (std::int32_t x = run.span.begin; x < run.span.end; ++x) {
        const std::int32_t j = RoundInside(run.map.SourceY(x, run.row));
        CopyBit(run.rows[j], RoundInside(run.map.SourceX(x, run.row)), run.out, x);
    }
}

template <std::size_t N>
void CopyRun(const TNearestRun& run) {
    std::uint8_t* out = run.out + static_cast<std::size_t>(run.span.begin) * N;
    for (std::int32_t x = run.span.begin; x < run.span.end; ++x, out += N) {
        const std::int32_t j = RoundInside(run.map.SourceY(x, run.row));
        const auto i = static_cast<std::size_t>(RoundInside(run.map.SourceX(x, run.row)));
        std::memcpy(out, run.rows[j] + i * N, N);
    }
}

using TRunFunction = void (*)(const TNearestRun& run);

TRunFunction RunFunctionFor(std::int32_t bit_count) {
    switch (bit_count) {
        case 1: return CopyBitRun;
        case 8: return CopyRun<1>;
        case 16: return CopyRun<2>;
        case 24: return CopyRun<3>;
        case 32: return CopyRun<4>;
        default: return CopyRun<6>;
    }
}

}  // namespace

bool RotateNearestPlain(TZmBitmap& source, TZmBitmap& target, double angle, TColor background,
                        const TResampleListener& listener) {
    if (!PrepareTarget(source, target, angle, background)) {
        return false;
    }
    const TZmImageSize size{source.GetWidth(), source.GetHeight()};
    const TRotationMap map(size, {target.GetWidth(), target.GetHeight()}, angle);
    const std::int32_t bit_count = source.GetBitCount();
    const std::int32_t bytes = bit_count / 8;
    const std::int32_t height = target.GetHeight();
    for (std::int32_t y = 0; y < height; ++y) {
        const TRotationMap::TRow row = map.Row(y);
        std::uint8_t* const out = target.GetScanLine(y);
        for (std::int32_t x = 0; x < target.GetWidth(); ++x) {
            const std::int32_t i = RoundHalfEven(map.SourceX(x, row));
            const std::int32_t j = RoundHalfEven(map.SourceY(x, row));
            if (i < 0 || i >= size.width || j < 0 || j >= size.height) {
                continue;
            }
            const std::uint8_t* const from = source.GetScanLine(j);
            if (bit_count == 1) {
                CopyBit(from, i, out, x);
            } else {
                std::memcpy(out + std::int64_t{x} * bytes, from + std::int64_t{i} * bytes,
                            static_cast<std::size_t>(bytes));
            }
        }
        if (listener.on_progress) {
            listener.on_progress(listener.sender, TruncToInt(y * (100.0 / height)));
        }
    }
    return true;
}

bool RotateNearest(TZmBitmap& source, TZmBitmap& target, double angle, TColor background,
                   const TResampleListener& listener) {
    if (!PrepareTarget(source, target, angle, background)) {
        return false;
    }
    const TAccessGuard reading(source, zmdRead);
    const TZmImageSize size{source.GetWidth(), source.GetHeight()};
    const std::int32_t width = target.GetWidth();
    const std::int32_t height = target.GetHeight();
    const TRotationMap map(size, {width, height}, angle);
    const auto rounded = [](double position) { return std::nearbyint(position); };
    const TPositionBounds inside{0, static_cast<double>(size.width), 0,
                                 static_cast<double>(size.height)};
    const TRunFunction copy = RunFunctionFor(source.GetBitCount());
    TSourceRows rows(source);
    const std::int32_t tile = TileColumns(rows, map, width);
    for (std::int32_t first = 0; first < width; first += std::min(tile, width - first)) {
        const TColumnSpan columns{first, first + std::min(tile, width - first)};
        for (std::int32_t y = 0; y < height; ++y) {
            const TRotationMap::TRow row = map.Row(y);
            const TColumnSpan span = FindSpan(map, row, columns, inside, rounded);
            if (!span.IsEmpty()) {
                RequireRowsOf(rows, map, row, span, 0, 1, size.height);
                copy(TNearestRun{map, row, rows.Table(), span, target.GetScanLine(y)});
            }
            if (listener.on_progress && columns.end == width) {
                listener.on_progress(listener.sender, TruncToInt(y * (100.0 / height)));
            }
        }
    }
    return true;
}

}  // namespace zm
