// Area interpolation, fast form where both sides enlarge.
//
// A target pixel is then smaller than a source pixel: along each axis it has one last piece and,
// where it lies across a border, one piece before it, which ends at the border and contributes
// the pixel beyond it as it is. So every source row is filtered horizontally once, and a target
// row mixes two (linear) or four (cubic) filtered rows.
//
// As in shrinking, the arithmetic is single precision for bytes and double for 16-bit samples,
// and the pixels near a rounding tie are computed again as the plain form does. The cubic rounds
// its four horizontal values to integers: these are made exact first, in the same way.

#include <algorithm>
#include <array>
#include <cmath>
#include <limits>
#include <vector>

#include "engine/proc/zmresample_area_p.h"

namespace zm {
namespace {

/// The pieces of a target pixel along an axis.
struct TEnlargedPixel {
    std::int32_t index = 0;   ///< source pixel of the last piece
    bool has_border = false;  ///< there is a piece before it, of source pixel `index` - 1
    double border = 0;        ///< length of that piece
    double end = 0;           ///< length of the last piece
    double fraction = 0;      ///< where the last piece ends in its source pixel
};

/// All target pixels along an axis, with what bounds their arithmetic.
class TEnlargedAxis {
public:
    TEnlargedAxis(std::int32_t source_size, std::int32_t target_size);
    const TEnlargedPixel& operator[](std::size_t pixel) const { return pixels_[pixel]; }
    double Step() const { return step_; }
    bool IsRegular() const { return regular_; }
    int LengthBits() const { return length_bits_; }
    int FractionBits() const { return fraction_bits_; }
    /// Largest sum of absolute lengths of a pixel.
    double LengthSum() const { return length_sum_; }
    /// Largest sum of absolute weights of the cubic.
    double CubicSum() const { return cubic_sum_; }

private:
    void Measure(const TEnlargedPixel& pixel);

    double step_;
    bool regular_ = true;
    int length_bits_ = 0;
    int fraction_bits_ = 0;
    double length_sum_ = 0;
    double cubic_sum_ = 1;
    std::vector<TEnlargedPixel> pixels_;
};

TEnlargedAxis::TEnlargedAxis(std::int32_t source_size, std::int32_t target_size)
    : step_(static_cast<double>(source_size) / target_size),
      pixels_(MakeWorkBuffer<TEnlargedPixel>(target_size)) {
    TAreaWalk walk(step_, source_size);
    double last = 0;
    for (TEnlargedPixel& pixel : pixels_) {
        TAreaStep step = walk.Next();
        for (; !step.ends_pixel; step = walk.Next()) {
            regular_ = regular_ && !pixel.has_border;
            pixel.has_border = true;
            pixel.border = step.position - last;
            last += pixel.border;
        }
        pixel.index = step.index;
        pixel.end = step.position - last;
        last += pixel.end;
        pixel.fraction = step.position - step.index;
        Measure(pixel);
    }
}

void TEnlargedAxis::Measure(const TEnlargedPixel& pixel) {
    length_bits_ =
        std::max({length_bits_, BitsBehindPoint(pixel.border), BitsBehindPoint(pixel.end)});
    fraction_bits_ = std::max(fraction_bits_, BitsBehindPoint(pixel.fraction));
    length_sum_ = std::max(length_sum_, std::fabs(pixel.border) + std::fabs(pixel.end));
    double sum = 0;
    for (const double weight : CubicWeights(pixel.fraction)) {
        sum += std::fabs(weight);
    }
    cubic_sum_ = std::max(cubic_sum_, sum);
}

template <typename Sample, std::size_t kChannels>
class TEnlarger {
public:
    TEnlarger(TZmBitmap& source, TZmBitmap& target, TAreaInterpolation interpolation,
              const TResampleListener& listener)
        : source_(source),
          target_(target),
          listener_(listener),
          cubic_(interpolation == TAreaInterpolation::kCubic),
          columns_(source.GetWidth(), target.GetWidth()),
          rows_(source.GetHeight(), target.GetHeight()),
          scale_(1 / (columns_.Step() * rows_.Step())),
          margin_(TieMargin()),
          row_margin_(cubic_ ? CubicRowMargin() : 0) {}

    bool IsPrecise() const {
        return columns_.IsRegular() && rows_.IsRegular() && margin_ <= kMaxTieMargin &&
               row_margin_ <= kMaxTieMargin;
    }
    void Run();

private:
    using Real = TAreaReal<Sample>;
    static constexpr double kLimit = std::numeric_limits<Sample>::max();
    static constexpr int kDigits = std::numeric_limits<Real>::digits;
    /// Pixels repeated before and behind a row; the last one is for whole vector reads.
    static constexpr std::size_t kBefore = 1;
    static constexpr std::size_t kBehind = 3;
    static constexpr std::size_t kLanes = kChannels == 3 ? 4 : kChannels;

    /// A source row and its horizontal values: the weighted sums of both pieces (linear), or the
    /// integers of the last piece (cubic).
    struct TRow {
        std::int32_t index = -1;
        std::vector<Real> samples;
        std::vector<Real> filtered;
        const Real* Pixels() const { return samples.data() + kBefore * kChannels; }
    };

    double TieMargin() const;
    double CubicRowMargin() const;
    void PrepareColumns();
    const TRow& RowAt(std::int32_t index);
    void LoadSamples(TRow& row);
    void FilterLinear(TRow& row) const;
    void FilterCubic(TRow& row) const;
    void FixCubicTies(TRow& row, std::size_t first, std::size_t end) const;
    void ChooseRows(std::size_t y);
    bool BlendBlock(std::size_t first, std::size_t count, Sample* out, Real tie_start) const;
    void MixBorders();
    void WriteRow(std::size_t y);
    void WritePixels(std::size_t y, std::size_t first, std::size_t end, Sample* out) const;
    void ComputeLinear(std::size_t y, std::size_t x, Sample* out) const;
    void ComputeCubic(std::size_t y, std::size_t x, Sample* out) const;
    Real TieStart(double margin) const { return static_cast<Real>(0.5 - margin); }

    TZmBitmap& source_;
    TZmBitmap& target_;
    const TResampleListener& listener_;
    bool cubic_;
    TEnlargedAxis columns_;
    TEnlargedAxis rows_;
    double scale_;
    double margin_;
    double row_margin_;
    std::vector<std::array<Real, 4>> taps_;  ///< per target column; linear: the first two
    std::vector<std::size_t> border_columns_;
    std::vector<Real> end_weights_;  ///< cubic: per target sample
    std::vector<Real> borders_;      ///< cubic: the border pieces' share, per target sample
    std::vector<Real> mixed_;        ///< cubic: the source row mixed vertically
    std::array<TRow, 4> ring_;       ///< row i in place i % 4
    std::array<const TRow*, 4> chosen_{};
    TLinearRows<Real> linear_rows_{};
    TCubicRows<Real> cubic_rows_{};
};

/// How far a result can lie from the stated one, in steps of a sample; 0 when they are the same.
/// A dozen roundings lie between samples and result.
template <typename Sample, std::size_t kChannels>
double TEnlarger<Sample, kChannels>::TieMargin() const {
    const double sums = columns_.LengthSum() * rows_.LengthSum();
    if (kLimit * sums * scale_ > kLimit + 0.3) {
        return 2;
    }
    const double largest = kLimit * sums * (cubic_ ? rows_.CubicSum() : 1.001);
    const int bits =
        columns_.LengthBits() + rows_.LengthBits() +
        (cubic_ ? 3 * rows_.FractionBits() : columns_.FractionBits() + rows_.FractionBits());
    int exponent = 0;
    const bool scale_is_exact = std::frexp(scale_, &exponent) == 0.5;
    if (scale_is_exact && largest * std::ldexp(1, bits) <= std::ldexp(1, kDigits)) {
        return 0;
    }
    // In double precision the stated form, of up to four pieces, rounds as much again.
    const double roundings = sizeof(Real) == sizeof(double) ? 64 : 16;
    return largest * scale_ * roundings * std::ldexp(1, -kDigits);
}

/// The same for the horizontal values of the cubic.
template <typename Sample, std::size_t kChannels>
double TEnlarger<Sample, kChannels>::CubicRowMargin() const {
    const double largest = kLimit * columns_.CubicSum();
    if (largest * std::ldexp(1, 3 * columns_.FractionBits()) <= std::ldexp(1, kDigits)) {
        return 0;
    }
    return largest * 16 * std::ldexp(1, -kDigits);
}

template <typename Sample, std::size_t kChannels>
void TEnlarger<Sample, kChannels>::PrepareColumns() {
    const auto width = static_cast<std::size_t>(target_.GetWidth());
    const auto samples = static_cast<std::int64_t>(width * kChannels);
    taps_ = MakeWorkBuffer<std::array<Real, 4>>(target_.GetWidth());
    if (cubic_) {
        end_weights_ = MakeWorkBuffer<Real>(samples);
        borders_ = MakeWorkBuffer<Real>(samples);
        mixed_ = MakeWorkBuffer<Real>(source_.GetWidth() * std::int64_t{kChannels});
    }
    for (std::size_t x = 0; x < width; ++x) {
        const TEnlargedPixel& pixel = columns_[x];
        if (pixel.has_border) {
            border_columns_.push_back(x);
        }
        if (!cubic_) {
            taps_[x][0] = static_cast<Real>(pixel.border + pixel.end * (1 - pixel.fraction));
            taps_[x][1] = static_cast<Real>(pixel.end * pixel.fraction);
            continue;
        }
        const std::array<double, 4> weights = CubicWeights(pixel.fraction);
        std::transform(weights.begin(), weights.end(), taps_[x].begin(),
                       [](double weight) { return static_cast<Real>(weight); });
        std::fill_n(end_weights_.begin() + static_cast<std::ptrdiff_t>(x * kChannels), kChannels,
                    static_cast<Real>(pixel.end * scale_));
    }
    const std::int64_t padded =
        (source_.GetWidth() + std::int64_t{kBefore + kBehind}) * std::int64_t{kChannels};
    for (TRow& row : ring_) {
        row.samples = MakeWorkBuffer<Real>(padded + 1);
        row.filtered = MakeWorkBuffer<Real>(samples + 1);
    }
}

template <typename Sample, std::size_t kChannels>
void TEnlarger<Sample, kChannels>::LoadSamples(TRow& row) {
    const auto* in = reinterpret_cast<const Sample*>(source_.GetScanLine(row.index));
    const std::size_t count = static_cast<std::size_t>(source_.GetWidth()) * kChannels;
    Real* out = row.samples.data() + kBefore * kChannels;
    if (in == nullptr) {
        std::fill(row.samples.begin(), row.samples.end(), Real{0});
        return;
    }
    for (std::size_t i = 0; i < count; ++i) {
        out[i] = in[i];
    }
    for (std::size_t c = 0; c < kChannels; ++c) {
        row.samples[c] = out[c];
        for (std::size_t i = 0; i < kBehind; ++i) {
            out[count + i * kChannels + c] = out[count - kChannels + c];
        }
    }
}

/// Three channels are filtered as four lanes, of which the last is overwritten by the next pixel.
template <typename Sample, std::size_t kChannels>
void TEnlarger<Sample, kChannels>::FilterLinear(TRow& row) const {
    Real* out = row.filtered.data();
    for (std::size_t x = 0; x < taps_.size(); ++x, out += kChannels) {
        const Real* pixel = row.Pixels() + static_cast<std::size_t>(columns_[x].index) * kChannels;
        const Real left = taps_[x][0];
        const Real right = taps_[x][1];
        Real lanes[kLanes];
        for (std::size_t lane = 0; lane < kLanes; ++lane) {
            lanes[lane] = left * pixel[lane] + right * pixel[kChannels + lane];
        }
        std::copy_n(lanes, kLanes, out);
    }
}

template <typename Sample, std::size_t kChannels>
void TEnlarger<Sample, kChannels>::FilterCubic(TRow& row) const {
    constexpr auto kMost = static_cast<Real>(kLimit);
    Real* out = row.filtered.data();
    for (std::size_t x = 0; x < taps_.size(); ++x, out += kChannels) {
        const Real* pixel =
            row.samples.data() + static_cast<std::size_t>(columns_[x].index) * kChannels;
        const std::array<Real, 4> taps = taps_[x];
        Real lanes[kLanes];
        for (std::size_t lane = 0; lane < kLanes; ++lane) {
            lanes[lane] = taps[0] * pixel[lane] + taps[1] * pixel[kChannels + lane] +
                          taps[2] * pixel[2 * kChannels + lane] +
                          taps[3] * pixel[3 * kChannels + lane];
        }
        std::copy_n(lanes, kLanes, out);
    }
    const std::size_t count = taps_.size() * kChannels;
    const Real tie_start = TieStart(row_margin_);
    Real* values = row.filtered.data();
    for (std::size_t first = 0; first < count; first += kTieBlock) {
        const std::size_t end = std::min(first + kTieBlock, count);
        int near_tie = 0;
        for (std::size_t i = first; i < end; ++i) {
            const Real value = std::min(std::max(values[i], Real{0}), kMost);
            near_tie |= std::fabs(value - RoundToWhole(value)) > tie_start ? 1 : 0;
            values[i] = value;
        }
        if (near_tie != 0) {
            FixCubicTies(row, first, end);
        }
        for (std::size_t i = first; i < end; ++i) {
            values[i] = RoundToWhole(values[i]);
        }
    }
}

/// Replaces the values near a tie by the stated integers.
template <typename Sample, std::size_t kChannels>
void TEnlarger<Sample, kChannels>::FixCubicTies(TRow& row, std::size_t first,
                                                std::size_t end) const {
    const Real tie_start = TieStart(row_margin_);
    for (std::size_t i = first; i < end; ++i) {
        Real& value = row.filtered[i];
        if (std::fabs(value - RoundToWhole(value)) > tie_start) {
            const TEnlargedPixel& pixel = columns_[i / kChannels];
            const Real* a = row.samples.data() + static_cast<std::size_t>(pixel.index) * kChannels +
                            i % kChannels;
            value = static_cast<Real>(RoundHalfEven(LimitedCubic(
                a[0], a[kChannels], a[2 * kChannels], a[3 * kChannels], pixel.fraction, kLimit)));
        }
    }
}

template <typename Sample, std::size_t kChannels>
const typename TEnlarger<Sample, kChannels>::TRow& TEnlarger<Sample, kChannels>::RowAt(
    std::int32_t index) {
    TRow& row = ring_[static_cast<std::size_t>(index) % ring_.size()];
    if (row.index != index) {
        row.index = index;
        LoadSamples(row);
        if (cubic_) {
            FilterCubic(row);
        } else {
            FilterLinear(row);
        }
    }
    return row;
}

/// The filtered rows and weights of a target row.
template <typename Sample, std::size_t kChannels>
void TEnlarger<Sample, kChannels>::ChooseRows(std::size_t y) {
    const TEnlargedPixel& pixel = rows_[y];
    const std::int32_t last = source_.GetHeight() - 1;
    for (std::int32_t i = cubic_ ? 0 : 1; i < (cubic_ ? 4 : 3); ++i) {
        const auto at = static_cast<std::size_t>(i);
        chosen_[at] = &RowAt(std::clamp(pixel.index - 1 + i, 0, last));
        cubic_rows_.rows[at] = chosen_[at]->filtered.data();
    }
    if (!cubic_) {
        linear_rows_.rows = {chosen_[1]->filtered.data(), chosen_[2]->filtered.data()};
        const double upper = pixel.border + pixel.end * (1 - pixel.fraction);
        linear_rows_.weights = {static_cast<Real>(upper * scale_),
                                static_cast<Real>(pixel.end * pixel.fraction * scale_)};
        return;
    }
    const std::array<double, 4> weights = CubicWeights(pixel.fraction);
    std::transform(weights.begin(), weights.end(), cubic_rows_.weights.begin(),
                   [](double weight) { return static_cast<Real>(weight); });
    cubic_rows_.limit = static_cast<Real>(kLimit);
    cubic_rows_.end = static_cast<Real>(pixel.end);
    cubic_rows_.border = static_cast<Real>(pixel.border);
}

/// The share of the pieces that end at a border between columns.
template <typename Sample, std::size_t kChannels>
void TEnlarger<Sample, kChannels>::MixBorders() {
    TCubicRows<Real> rows = cubic_rows_;
    for (std::size_t i = 0; i < rows.rows.size(); ++i) {
        rows.rows[i] = chosen_[i]->Pixels();
    }
    MixCubicRows(rows, mixed_.size(), mixed_.data());
    for (const std::size_t x : border_columns_) {
        const auto weight = static_cast<Real>(columns_[x].border * scale_);
        const Real* from = mixed_.data() + static_cast<std::size_t>(columns_[x].index) * kChannels;
        for (std::size_t c = 0; c < kChannels; ++c) {
            borders_[x * kChannels + c] = weight * from[c];
        }
    }
}

template <typename Sample, std::size_t kChannels>
bool TEnlarger<Sample, kChannels>::BlendBlock(std::size_t first, std::size_t count, Sample* out,
                                              Real tie_start) const {
    if (!cubic_) {
        TLinearRows<Real> rows = linear_rows_;
        rows.rows[0] += first;
        rows.rows[1] += first;
        return BlendLinearRows(rows, count, out, tie_start);
    }
    TCubicRows<Real> rows = cubic_rows_;
    for (const Real*& row : rows.rows) {
        row += first;
    }
    return BlendCubicRows(rows, end_weights_.data() + first, borders_.data() + first, count, out,
                          tie_start);
}

/// One pixel as the plain form has it.
template <typename Sample, std::size_t kChannels>
void TEnlarger<Sample, kChannels>::ComputeLinear(std::size_t y, std::size_t x, Sample* out) const {
    const TEnlargedPixel& row = rows_[y];
    const TEnlargedPixel& column = columns_[x];
    const std::size_t at = static_cast<std::size_t>(column.index) * kChannels;
    const auto value = [&](std::size_t c, double fx, double fy) {
        const Real* current = chosen_[1]->Pixels() + at + c;
        const Real* next = chosen_[2]->Pixels() + at + c;
        return ((1 - fx) * current[0] + fx * current[kChannels]) * (1 - fy) +
               ((1 - fx) * next[0] + fx * next[kChannels]) * fy;
    };
    for (std::size_t c = 0; c < kChannels; ++c) {
        double sum = 0;
        // A piece that ends at a border has the value at the start of the pixel beyond it.
        if (row.has_border) {
            if (column.has_border) {
                sum += column.border * row.border * value(c, 0, 0);
            }
            sum += column.end * row.border * value(c, column.fraction, 0);
        }
        if (column.has_border) {
            sum += column.border * row.end * value(c, 0, row.fraction);
        }
        sum += column.end * row.end * value(c, column.fraction, row.fraction);
        out[c] = ClampSample<Sample>(RoundHalfEven(sum * scale_));
    }
}

template <typename Sample, std::size_t kChannels>
void TEnlarger<Sample, kChannels>::ComputeCubic(std::size_t y, std::size_t x, Sample* out) const {
    const TEnlargedPixel& row = rows_[y];
    const TEnlargedPixel& column = columns_[x];
    for (std::size_t c = 0; c < kChannels; ++c) {
        const std::size_t border = static_cast<std::size_t>(column.index) * kChannels + c;
        const std::size_t end = x * kChannels + c;
        std::array<double, 4> borders{};
        std::array<double, 4> ends{};
        for (std::size_t i = 0; i < 4; ++i) {
            borders[i] = chosen_[i]->Pixels()[border];
            ends[i] = chosen_[i]->filtered[end];
        }
        const auto cubic = [&](const std::array<double, 4>& v) {
            return LimitedCubic(v[0], v[1], v[2], v[3], row.fraction, kLimit);
        };
        double sum = 0;
        if (row.has_border) {
            if (column.has_border) {
                sum += column.border * row.border * borders[1];
            }
            sum += column.end * row.border * ends[1];
        }
        if (column.has_border) {
            sum += column.border * row.end * cubic(borders);
        }
        sum += column.end * row.end * cubic(ends);
        out[c] = ClampSample<Sample>(RoundHalfEven(sum * scale_));
    }
}

/// Writes the pixels from `first` up to `end`. Where one is near a tie the halves are written
/// again, down to that pixel.
template <typename Sample, std::size_t kChannels>
void TEnlarger<Sample, kChannels>::WritePixels(std::size_t y, std::size_t first, std::size_t end,
                                               Sample* out) const {
    Sample* at = out + first * kChannels;
    if (!BlendBlock(first * kChannels, (end - first) * kChannels, at, TieStart(margin_))) {
        return;
    }
    if (end - first > 1) {
        const std::size_t middle = first + (end - first) / 2;
        WritePixels(y, first, middle, out);
        WritePixels(y, middle, end, out);
    } else if (cubic_) {
        ComputeCubic(y, first, at);
    } else {
        ComputeLinear(y, first, at);
    }
}

template <typename Sample, std::size_t kChannels>
void TEnlarger<Sample, kChannels>::WriteRow(std::size_t y) {
    constexpr std::size_t kPixels = kTieBlock / kChannels;
    auto* out = reinterpret_cast<Sample*>(target_.GetScanLine(static_cast<std::int32_t>(y)));
    for (std::size_t first = 0; out != nullptr && first < taps_.size(); first += kPixels) {
        WritePixels(y, first, std::min(first + kPixels, taps_.size()), out);
    }
}

template <typename Sample, std::size_t kChannels>
void TEnlarger<Sample, kChannels>::Run() {
    PrepareColumns();
    const std::int32_t height = target_.GetHeight();
    for (std::int32_t y = 0; y < height; ++y) {
        const auto row = static_cast<std::size_t>(y);
        ChooseRows(row);
        if (cubic_) {
            MixBorders();
        }
        WriteRow(row);
        if (listener_.on_progress) {
            const double done = (y + 1.0) / height * 100;
            listener_.on_progress(listener_.sender, TruncToInt(done));
        }
    }
}

template <typename Sample, std::size_t kChannels>
bool Enlarge(TZmBitmap& source, TZmBitmap& target, TAreaInterpolation interpolation,
             const TResampleListener& listener) {
    TEnlarger<Sample, kChannels> engine(source, target, interpolation, listener);
    if (!engine.IsPrecise()) {
        return false;
    }
    engine.Run();
    return true;
}

}  // namespace

bool EnlargeAreaFast(TZmBitmap& source, TZmBitmap& target, TAreaInterpolation interpolation,
                     const TResampleListener& listener) {
    switch (source.GetPixelFormat()) {
        case zm8g: return Enlarge<std::uint8_t, 1>(source, target, interpolation, listener);
        case zm24RGB: return Enlarge<std::uint8_t, 3>(source, target, interpolation, listener);
        case zm32RGB: return Enlarge<std::uint8_t, 4>(source, target, interpolation, listener);
        case zm16g: return Enlarge<std::uint16_t, 1>(source, target, interpolation, listener);
        case zm48RGB: return Enlarge<std::uint16_t, 3>(source, target, interpolation, listener);
        default: return false;
    }
}

}  // namespace zm
