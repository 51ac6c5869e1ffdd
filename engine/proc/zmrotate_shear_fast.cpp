// Rotation by three shears, fast: the first shear is kept whole, and the second and third run
// together, row by row of the result. Lines outside an image read as background, so that mixing
// needs no tests.

#include <algorithm>
#include <cstring>
#include <new>

#include "engine/proc/zmrotate_p.h"

namespace zm {
namespace {

constexpr std::int32_t kFractionBits = 12;
constexpr std::int32_t kHalf = 1 << (kFractionBits - 1);
/// Shortest run worth the way to the vectors.
constexpr std::int32_t kMinVectorBytes = 16;

std::uint8_t BlendByte(std::int32_t before, std::int32_t current, std::int32_t fraction) {
    return static_cast<std::uint8_t>(current +
                                     (((before - current) * fraction + kHalf) >> kFractionBits));
}

/// Mixes a line with the one before it; one fraction for each byte.
void BlendLines(const std::uint8_t* before, const std::uint8_t* current,
                const std::int16_t* fractions, std::uint8_t* out, std::int32_t byte_count) {
    std::int32_t i = 0;
    if (byte_count >= kMinVectorBytes) {
        i = ShearBlocks(before, current, fractions, 0, out, byte_count);
    }
    for (; i < byte_count; ++i) {
        out[i] = BlendByte(before[i], current[i], fractions[i]);
    }
}

/// The same with one fraction for all.
void BlendLines(const std::uint8_t* before, const std::uint8_t* current, std::int32_t fraction,
                std::uint8_t* out, std::int32_t byte_count) {
    std::int32_t i =
        ShearBlocks(before, current, nullptr, static_cast<std::int16_t>(fraction), out, byte_count);
    for (; i < byte_count; ++i) {
        out[i] = BlendByte(before[i], current[i], fraction);
    }
}

void UnpackBits(const std::uint8_t* row, std::int32_t width, std::uint8_t* out) {
    for (std::int32_t x = 0; x < width; ++x) {
        out[x] = static_cast<std::uint8_t>(row[x >> 3] >> (7 - (x & 7)) & 1);
    }
}

void PackBits(const std::uint8_t* bits, std::int32_t width, std::uint8_t* out) {
    for (std::int32_t x = 0; x < width; x += 8) {
        unsigned byte = 0;
        for (std::int32_t i = x; i < std::min(x + 8, width); ++i) {
            byte |= static_cast<unsigned>(bits[i]) << (7 - (i & 7));
        }
        *out++ = static_cast<std::uint8_t>(byte);
    }
}

/// Columns that the second shear moves by the same whole number of pixels.
struct TColumnRun {
    std::int32_t begin = 0;
    std::int32_t end = 0;
    std::int32_t whole = 0;
};

template <std::size_t kChannels>
class TFastShears {
public:
    TFastShears(const TShearGeometry& geometry, std::array<std::uint8_t, 3> background,
                bool is_bits)
        : g_(geometry),
          background_(background),
          is_bits_(is_bits),
          line_bytes_(static_cast<std::size_t>(geometry.w1) * kChannels),
          first_(MakeFirst()),
          ground_(MakeWorkBuffer<std::uint8_t>(static_cast<std::int64_t>(line_bytes_))),
          second_(ground_.size()),
          fractions_(ground_.size()) {
        FillGround(ground_.data(), g_.w1);
        lines_.assign(static_cast<std::size_t>(g_.height) + 2 * kLinesAround, ground_.data());
        FindRuns();
    }

    void Run(TZmBitmap& source, TZmBitmap& target, const TResampleListener& listener) {
        const double units = double{1} * g_.height + g_.w1 + g_.h3;
        TPercentReporter progress(listener, 100.0 / units);
        for (std::int32_t y = 0; y < g_.height; ++y) {
            ShearFirst(source.GetScanLine(y), y);
            progress.Report(y + 1);
        }
        bits_.resize(is_bits_ ? static_cast<std::size_t>(g_.w3) : 0);
        for (std::int32_t y = 0; y < g_.h3; ++y) {
            ShearSecond(y);
            ShearThird(target.GetScanLine(y), y);
            const std::int64_t rows_done = std::int64_t{y} + 1;
            progress.Report(g_.height + rows_done * (std::int64_t{g_.w1} + g_.h3) / g_.h3);
        }
    }

private:
    /// Lines of background above and below those of the first shear.
    static constexpr std::int32_t kLinesAround = 2;

    std::vector<std::uint8_t> MakeFirst() const {
        const auto bytes = CheckedMul(static_cast<std::int64_t>(line_bytes_), g_.height);
        if (!bytes) {
            throw std::bad_alloc();
        }
        return MakeWorkBuffer<std::uint8_t>(*bytes);
    }

    TShearShift Held(TShearShift shift) const {
        return {shift.whole, is_bits_ ? 0 : shift.fraction_q12};
    }

    void FindRuns() {
        for (std::int32_t x = 0; x < g_.w1; ++x) {
            const TShearShift shift = Held(SecondShift(g_, x));
            std::fill_n(fractions_.begin() + std::ptrdiff_t{x} * std::ptrdiff_t{kChannels},
                        kChannels, static_cast<std::int16_t>(shift.fraction_q12));
            if (runs_.empty() || runs_.back().whole != shift.whole) {
                runs_.push_back({x, x, shift.whole});
            }
            runs_.back().end = x + 1;
        }
    }

    /// `count` is not negative.
    void FillGround(std::uint8_t* out, std::int64_t count) const {
        if (kChannels == 1) {
            std::memset(out, background_[0], static_cast<std::size_t>(count));
            return;
        }
        for (std::int64_t i = 0; i < count; ++i, out += kChannels) {
            std::copy_n(background_.begin(), kChannels, out);
        }
    }

    void BlendPixel(const std::uint8_t* before, const std::uint8_t* current, std::int32_t fraction,
                    std::uint8_t* out) const {
        for (std::size_t c = 0; c < kChannels; ++c) {
            out[c] = BlendByte(before[c], current[c], fraction);
        }
    }

    /// Moves a row into one of `out_count` pixels and fills what it leaves.
    void LayRow(const std::uint8_t* from, std::int64_t count, TShearShift shift,
                std::int32_t offset, std::uint8_t* out, std::int64_t out_count) const {
        constexpr auto kPixel = static_cast<std::int64_t>(kChannels);
        const std::int64_t start = std::int64_t{shift.whole} - offset;
        const std::int32_t f = shift.fraction_q12;
        // Source pixels `begin` to `end` - 1 fall on the row; the one at `count` is background.
        const std::int64_t all = count + (f > 0 ? 1 : 0);
        const std::int64_t begin = std::clamp<std::int64_t>(-start, 0, all);
        const std::int64_t end = std::clamp<std::int64_t>(out_count - start, begin, all);
        const std::int64_t left = std::clamp<std::int64_t>(start + begin, 0, out_count);
        FillGround(out, left);
        std::uint8_t* const first = out + left * kPixel;
        FillGround(first + (end - begin) * kPixel, out_count - left - (end - begin));
        if (begin == end) {
            return;
        }
        if (f == 0) {
            std::memcpy(first, from + begin * kPixel,
                        static_cast<std::size_t>((end - begin) * kPixel));
            return;
        }
        BlendSpan(from, count, f, begin, end, first);
    }

    /// Pixels `begin` to `end` - 1 of a row, of which -1 and `count` are background.
    void BlendSpan(const std::uint8_t* from, std::int64_t count, std::int32_t f, std::int64_t begin,
                   std::int64_t end, std::uint8_t* out) const {
        constexpr auto kPixel = static_cast<std::int64_t>(kChannels);
        std::int64_t i = begin;
        if (i == 0) {
            BlendPixel(background_.data(), from, f, out);
            out += kPixel;
            ++i;
        }
        const std::int64_t inner = std::min(end, count) - i;
        if (inner > 0) {
            BlendLines(from + (i - 1) * kPixel, from + i * kPixel, f, out,
                       static_cast<std::int32_t>(inner * kPixel));
            out += inner * kPixel;
        }
        if (end > count) {
            BlendPixel(from + (count - 1) * kPixel, background_.data(), f, out);
        }
    }

    void ShearFirst(const std::uint8_t* row, std::int32_t y) {
        std::uint8_t* const line = first_.data() + static_cast<std::size_t>(y) * line_bytes_;
        if (is_bits_) {
            unpacked_.resize(static_cast<std::size_t>(g_.width));
            UnpackBits(row, g_.width, unpacked_.data());
            row = unpacked_.data();
        }
        LayRow(row, g_.width, Held(FirstShift(g_, y)), 0, line, g_.w1);
        lines_[static_cast<std::size_t>(y + kLinesAround)] = line;
    }

    /// Row y of the second shear: each run of columns comes from the same two lines.
    void ShearSecond(std::int32_t y) {
        for (const TColumnRun& run : runs_) {
            const std::int64_t line = std::clamp<std::int64_t>(std::int64_t{y} + g_.o2 - run.whole,
                                                               -1, std::int64_t{g_.height} + 1);
            const auto at = static_cast<std::size_t>(line + kLinesAround);
            const std::size_t byte = static_cast<std::size_t>(run.begin) * kChannels;
            const auto count = static_cast<std::int32_t>(
                static_cast<std::size_t>(run.end - run.begin) * kChannels);
            BlendLines(lines_[at - 1] + byte, lines_[at] + byte, fractions_.data() + byte,
                       second_.data() + byte, count);
        }
    }

    void ShearThird(std::uint8_t* out, std::int32_t y) {
        std::uint8_t* const row = is_bits_ ? bits_.data() : out;
        LayRow(second_.data(), g_.w1, Held(ThirdShift(g_, y)), g_.o3, row, g_.w3);
        if (is_bits_) {
            PackBits(row, g_.w3, out);
        }
    }

    const TShearGeometry& g_;
    std::array<std::uint8_t, 3> background_;
    bool is_bits_;
    std::size_t line_bytes_;
    std::vector<std::uint8_t> first_;
    std::vector<std::uint8_t> ground_;
    std::vector<std::uint8_t> second_;
    std::vector<std::int16_t> fractions_;
    std::vector<const std::uint8_t*> lines_;
    std::vector<TColumnRun> runs_;
    std::vector<std::uint8_t> unpacked_;
    std::vector<std::uint8_t> bits_;
};

}  // namespace

bool RotateByShears(TZmBitmap& source, TZmBitmap& target, double rest, TColor background,
                    const TResampleListener& listener) {
    const TZmPixelFormat format = source.GetPixelFormat();
    const auto geometry = FindShearGeometry({source.GetWidth(), source.GetHeight()}, rest);
    if (!geometry || !target.Allocate(geometry->w3, geometry->h3, format)) {
        return false;
    }
    const TAccessGuard reading(source, zmdRead);
    const TAccessGuard writing(target, zmdWrite);
    const auto ground = ShearBackground(format, background);
    if (format == zm24RGB) {
        TFastShears<3>(*geometry, ground, /*is_bits=*/false).Run(source, target, listener);
    } else {
        TFastShears<1>(*geometry, ground, format == zm1g).Run(source, target, listener);
    }
    return true;
}

}  // namespace zm
