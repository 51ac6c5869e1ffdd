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
#include <utility>
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

/// One piece of a target pixel along an axis.
struct TEnlargedPiece {
    std::int32_t index = 0;
    double fraction = 0;
    double length = 0;
};
/// The pieces in their order; the first is empty where there is no border.
std::array<TEnlargedPiece, 2> PiecesOf(const TEnlargedPixel& pixel) {
    return {{{pixel.index - 1, 1.0, pixel.has_border ? pixel.border : 0},
             {pixel.index, pixel.fraction, pixel.end}}};
}

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
    /// `alpha`: a partly transparent plane, for the linear form of three channels; nil otherwise.
    TEnlarger(TZmBitmap& source, TZmBitmap& target, TZmBitmap* alpha,
              TAreaInterpolation interpolation, const TResampleListener& listener)
        : source_(source),
          target_(target),
          alpha_(alpha),
          listener_(listener),
          cubic_(interpolation == TAreaInterpolation::kCubic),
          columns_(source.GetWidth(), target.GetWidth()),
          rows_(source.GetHeight(), target.GetHeight()),
          scale_(1 / (columns_.Step() * rows_.Step())),
          margin_(TieMargin()),
          row_margin_(cubic_ ? CubicRowMargin() : 0),
          sample_count_(static_cast<std::size_t>(target.GetWidth()) * kChannels) {}

    bool IsPrecise() const {
        return columns_.IsRegular() && rows_.IsRegular() && margin_ <= kMaxTieMargin &&
               row_margin_ <= kMaxTieMargin;
    }
    void Run();

private:
    using Real = TAreaReal<Sample>;
    static constexpr double kLimit = std::numeric_limits<Sample>::max();
    static constexpr int kDigits = std::numeric_limits<Real>::digits;
    /// Pixels repeated before and behind a row.
    static constexpr std::size_t kBefore = 1;
    static constexpr std::size_t kBehind = 2;

    /// A source row and its horizontal values: the weighted sums of both pieces (linear), or the
    /// integers of the last piece (cubic).
    struct TRow {
        std::int32_t index = -1;
        std::vector<Real> samples;
        std::vector<Real> filtered;
        std::vector<std::uint8_t> alpha;
        const Real* Pixels() const { return samples.data() + kBefore * kChannels; }
    };

    /// Where a source pixel, its right neighbour and the two below differ in alpha.
    struct TEdges {
        std::int32_t index = -1;
        bool any = false;
        std::vector<std::uint8_t> at;
    };

    double TieMargin() const;
    double CubicRowMargin() const;
    void PrepareColumns();
    const TRow& RowAt(std::int32_t index);
    void PrepareWeights(std::size_t x);
    void LoadSamples(TRow& row);
    void FilterLinear(TRow& row) const;
    void FilterCubic(TRow& row);
    void ChooseRows(std::size_t y);
    void MixBorders();
    void WriteRow(std::size_t y);
    void ComputeLinear(std::size_t y, std::size_t x, Sample* out) const;
    void ComputeCubic(std::size_t y, std::size_t x, Sample* out) const;
    const TEdges& EdgesBelow(std::int32_t index);
    void WriteAlphaEdges(std::size_t y, Sample* out);
    void ComputeAlphaEdge(std::size_t y, std::size_t x, Sample* out);
    void AddEdgePiece(const TEnlargedPiece& row, const TEnlargedPiece& column, double* sums);
    TTieList<Real> NoTies(double margin) {
        return TTieList<Real>{static_cast<Real>(0.5 - margin), ties_.data()};
    }

    TZmBitmap& source_;
    TZmBitmap& target_;
    TZmBitmap* alpha_;
    const TResampleListener& listener_;
    bool cubic_;
    TEnlargedAxis columns_;
    TEnlargedAxis rows_;
    double scale_;
    double margin_;
    double row_margin_;
    std::size_t sample_count_;  ///< of a target row
    TSpreadPlan plan_;
    std::array<std::vector<Real>, 4> taps_;  ///< per target sample; linear: the first two
    std::vector<Real> border_weights_;       ///< cubic: of the border piece, per target sample
    std::vector<Real> end_weights_;          ///< cubic: of the last piece, per target sample
    std::vector<Real> borders_;              ///< cubic: the border pieces' share
    std::vector<Real> mixed_;                ///< cubic: the source row mixed vertically
    std::vector<std::uint32_t> ties_;
    std::array<TRow, 4> ring_;     ///< row i in place i % 4
    std::array<TEdges, 2> edges_;  ///< those below row i in place i % 2
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
    const auto padded = static_cast<std::int64_t>(sample_count_ + kAreaPadding);
    const std::size_t tap_count = cubic_ ? 4 : 2;
    for (std::size_t k = 0; k < tap_count; ++k) {
        taps_[k] = MakeWorkBuffer<Real>(padded);
    }
    if (cubic_) {
        border_weights_ = MakeWorkBuffer<Real>(padded);
        end_weights_ = MakeWorkBuffer<Real>(padded);
        borders_ = MakeWorkBuffer<Real>(padded);
        mixed_ = MakeWorkBuffer<Real>(source_.GetWidth() * std::int64_t{kChannels} +
                                      std::int64_t{kAreaPadding});
    }
    ties_ = MakeWorkBuffer<std::uint32_t>(padded);
    auto sources = MakeWorkBuffer<std::int32_t>(static_cast<std::int64_t>(sample_count_));
    for (std::size_t i = 0; i < sample_count_; ++i) {
        sources[i] = static_cast<std::int32_t>(
            static_cast<std::size_t>(columns_[i / kChannels].index) * kChannels + i % kChannels);
    }
    for (std::size_t x = 0; x * kChannels < sample_count_; ++x) {
        PrepareWeights(x);
    }
    plan_ = MakeSpreadPlan<Real>(std::move(sources));
    const std::int64_t source_samples =
        (source_.GetWidth() + std::int64_t{kBefore + kBehind}) * std::int64_t{kChannels};
    for (TRow& row : ring_) {
        row.samples = MakeWorkBuffer<Real>(source_samples + std::int64_t{kAreaPadding});
        row.filtered = MakeWorkBuffer<Real>(padded);
    }
}

template <typename Sample, std::size_t kChannels>
void TEnlarger<Sample, kChannels>::PrepareWeights(std::size_t x) {
    const TEnlargedPixel& pixel = columns_[x];
    const auto set = [x](std::vector<Real>& row, double weight) {
        std::fill_n(row.begin() + static_cast<std::ptrdiff_t>(x * kChannels), kChannels,
                    static_cast<Real>(weight));
    };
    if (!cubic_) {
        set(taps_[0], pixel.border + pixel.end * (1 - pixel.fraction));
        set(taps_[1], pixel.end * pixel.fraction);
        return;
    }
    const std::array<double, 4> weights = CubicWeights(pixel.fraction);
    for (std::size_t k = 0; k < weights.size(); ++k) {
        set(taps_[k], weights[k]);
    }
    set(border_weights_, pixel.border * scale_);
    set(end_weights_, pixel.end * scale_);
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

template <typename Sample, std::size_t kChannels>
void TEnlarger<Sample, kChannels>::FilterLinear(TRow& row) const {
    const TSpreadRow<Real, 2> taps{row.Pixels(), kChannels, {taps_[0].data(), taps_[1].data()}};
    SpreadRow(plan_, taps, row.filtered.data());
}

/// The integers of the cubic; those near a tie by the stated arithmetic.
template <typename Sample, std::size_t kChannels>
void TEnlarger<Sample, kChannels>::FilterCubic(TRow& row) {
    // The cubic's first tap is the pixel on the left, where the padded row starts.
    const TSpreadRow<Real, 4> taps{
        row.samples.data(),
        kChannels,
        {taps_[0].data(), taps_[1].data(), taps_[2].data(), taps_[3].data()}};
    TTieList<Real> ties = NoTies(row_margin_);
    SpreadCubicRow(plan_, taps, static_cast<Real>(kLimit), row.filtered.data(), ties);
    for (std::size_t n = 0; n < ties.count; ++n) {
        const std::size_t i = ties_[n];
        if (i < sample_count_) {
            const TEnlargedPixel& pixel = columns_[i / kChannels];
            const Real* a = row.samples.data() + static_cast<std::size_t>(pixel.index) * kChannels +
                            i % kChannels;
            row.filtered[i] = static_cast<Real>(RoundHalfEven(LimitedCubic(
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
        if (alpha_ != nullptr) {
            const std::uint8_t* values = alpha_->GetScanLine(index);
            const auto width = static_cast<std::size_t>(source_.GetWidth());
            row.alpha.assign(width, 255);
            if (values != nullptr) {
                std::copy_n(values, width, row.alpha.begin());
            }
        }
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
    MixCubicRows(rows, mixed_.size() - kAreaPadding, mixed_.data());
    const TSpreadRow<Real, 1> taps{mixed_.data(), kChannels, {border_weights_.data()}};
    SpreadRow(plan_, taps, borders_.data());
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

// Alpha edges. There the plain form takes one pixel's colour for a piece instead of the blend.

template <typename Sample, std::size_t kChannels>
const typename TEnlarger<Sample, kChannels>::TEdges& TEnlarger<Sample, kChannels>::EdgesBelow(
    std::int32_t index) {
    TEdges& edges = edges_[static_cast<std::size_t>(index) % edges_.size()];
    if (edges.index != index) {
        edges.index = index;
        const auto& upper = RowAt(index).alpha;
        const auto& lower = RowAt(std::min(index + 1, source_.GetHeight() - 1)).alpha;
        edges.at.resize(upper.size());
        unsigned any = 0;
        for (std::size_t x = 0; x < upper.size(); ++x) {
            const std::size_t right = std::min(x + 1, upper.size() - 1);
            const unsigned differ = static_cast<unsigned>(upper[x] ^ upper[right]) |
                                    static_cast<unsigned>(upper[x] ^ lower[x]) |
                                    static_cast<unsigned>(upper[x] ^ lower[right]);
            edges.at[x] = static_cast<std::uint8_t>(differ);
            any |= differ;
        }
        edges.any = any != 0;
    }
    return edges;
}

/// Writes the pixels of a target row that have a piece at an alpha edge once more.
template <typename Sample, std::size_t kChannels>
void TEnlarger<Sample, kChannels>::WriteAlphaEdges(std::size_t y, Sample* out) {
    const TEnlargedPixel& row = rows_[y];
    const TEdges& below = EdgesBelow(row.index);
    const TEdges& above = row.has_border ? EdgesBelow(row.index - 1) : below;
    if (!below.any && !above.any) {
        return;
    }
    for (std::size_t x = 0; x * kChannels < sample_count_; ++x) {
        const TEnlargedPixel& column = columns_[x];
        const auto here = static_cast<std::size_t>(column.index);
        const std::size_t before = column.has_border ? here - 1 : here;
        if ((below.at[here] | below.at[before] | above.at[here] | above.at[before]) != 0) {
            ComputeAlphaEdge(y, x, out + x * kChannels);
        }
    }
}

/// One pixel as the plain form has it.
template <typename Sample, std::size_t kChannels>
void TEnlarger<Sample, kChannels>::ComputeAlphaEdge(std::size_t y, std::size_t x, Sample* out) {
    double sums[kChannels] = {};
    for (const TEnlargedPiece& row : PiecesOf(rows_[y])) {
        for (const TEnlargedPiece& column : PiecesOf(columns_[x])) {
            if (row.length != 0 && column.length != 0) {
                AddEdgePiece(row, column, sums);
            }
        }
    }
    for (std::size_t c = 0; c < kChannels; ++c) {
        out[c] = ClampSample<Sample>(RoundHalfEven(sums[c] * scale_));
    }
}

template <typename Sample, std::size_t kChannels>
void TEnlarger<Sample, kChannels>::AddEdgePiece(const TEnlargedPiece& row,
                                                const TEnlargedPiece& column, double* sums) {
    const TRow& current = RowAt(row.index);
    const TRow& next = RowAt(std::min(row.index + 1, source_.GetHeight() - 1));
    const auto x = static_cast<std::size_t>(column.index);
    const std::size_t right = std::min(x + 1, current.alpha.size() - 1);
    const std::array<std::uint8_t, 4> alpha{current.alpha[x], current.alpha[right], next.alpha[x],
                                            next.alpha[right]};
    const std::array<const Real*, 4> pixels{
        current.Pixels() + x * kChannels, current.Pixels() + right * kChannels,
        next.Pixels() + x * kChannels, next.Pixels() + right * kChannels};
    const int strongest = StrongestAlpha(alpha);
    const double fx = column.fraction;
    const double fy = row.fraction;
    for (std::size_t c = 0; c < kChannels; ++c) {
        std::array<double, 4> v{};
        for (std::size_t i = 0; i < v.size(); ++i) {
            v[i] = pixels[strongest < 0 ? i : static_cast<std::size_t>(strongest)][c];
        }
        const double value =
            ((1 - fx) * v[0] + fx * v[1]) * (1 - fy) + ((1 - fx) * v[2] + fx * v[3]) * fy;
        sums[c] += column.length * row.length * value;
    }
}

/// Writes a target row, then the pixels near a tie or at an alpha edge once more.
template <typename Sample, std::size_t kChannels>
void TEnlarger<Sample, kChannels>::WriteRow(std::size_t y) {
    auto* out = reinterpret_cast<Sample*>(target_.GetScanLine(static_cast<std::int32_t>(y)));
    if (out == nullptr) {
        return;
    }
    TTieList<Real> ties = NoTies(margin_);
    if (cubic_) {
        BlendCubicRows(cubic_rows_, end_weights_.data(), borders_.data(), sample_count_, out, ties);
    } else {
        BlendLinearRows(linear_rows_, sample_count_, out, ties);
    }
    std::size_t next = 0;  // pixels below are done
    for (std::size_t n = 0; n < ties.count; ++n) {
        const std::size_t x = ties_[n] / kChannels;
        if (x < next) {
            continue;
        }
        if (cubic_) {
            ComputeCubic(y, x, out + x * kChannels);
        } else {
            ComputeLinear(y, x, out + x * kChannels);
        }
        next = x + 1;
    }
    if (alpha_ != nullptr) {
        WriteAlphaEdges(y, out);
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
bool Enlarge(TZmBitmap& source, TZmBitmap& target, TZmBitmap* alpha,
             TAreaInterpolation interpolation, const TResampleListener& listener) {
    TEnlarger<Sample, kChannels> engine(source, target, alpha, interpolation, listener);
    if (!engine.IsPrecise()) {
        return false;
    }
    engine.Run();
    return true;
}

}  // namespace

bool EnlargeAreaFast(TZmBitmap& source, TZmBitmap& target, TZmBitmap* alpha,
                     TAreaInterpolation interpolation, const TResampleListener& listener) {
    const bool heeds_alpha = interpolation == TAreaInterpolation::kLinear &&
                             source.GetPixelFormat() == zm24RGB && alpha != nullptr &&
                             !IsOpaquePlane(*alpha);
    TZmBitmap* const plane = heeds_alpha ? alpha : nullptr;
    switch (source.GetPixelFormat()) {
        case zm8g: return Enlarge<std::uint8_t, 1>(source, target, plane, interpolation, listener);
        case zm24RGB:
            return Enlarge<std::uint8_t, 3>(source, target, plane, interpolation, listener);
        case zm32RGB:
            return Enlarge<std::uint8_t, 4>(source, target, plane, interpolation, listener);
        case zm16g:
            return Enlarge<std::uint16_t, 1>(source, target, plane, interpolation, listener);
        case zm48RGB:
            return Enlarge<std::uint16_t, 3>(source, target, plane, interpolation, listener);
        default: return false;
    }
}

}  // namespace zm
