// Area interpolation, fast form: rfBilinear on zm8g and zm24RGB, both sides shrinking, or both
// enlarging without partial alpha.
//
// The sums of the plain form separate by axis: each target row is a weighted sum of source rows,
// each target pixel a weighted sum of columns of it. This form takes both sums in single
// precision, in whatever order is quick. With a bound for what that can differ from the stated
// double arithmetic, all pixels are decided but those near a rounding tie; these are computed
// again, exactly as the plain form does. Where every weight is a dyadic fraction of few bits (all
// whole factors by powers of 2, and the like) single precision is exact and nothing is left to
// decide.

#include <algorithm>
#include <cmath>
#include <cstring>
#include <utility>
#include <vector>

#include "engine/proc/zmresample_area_p.h"

namespace zm {
namespace {

/// Margins around a tie beyond this would leave too many pixels to the slow way.
constexpr double kMaxTieMargin = 0.01;
/// Bits behind the point that a weight may have to count as exact.
constexpr int kMaxExactBits = 10;
/// Samples that are checked for ties at a time.
constexpr std::size_t kTieBlock = 256;

/// A piece of a target pixel along an axis, as the plain form has it.
struct TAxisPiece {
    std::int32_t index = 0;
    double fraction = 0;
    double length = 0;
};

/// A source pixel's share in a target pixel along an axis.
struct TAxisTap {
    std::int32_t index = 0;
    float weight = 0;
};

/// Bits behind the point of a value; a large number when it has more than kMaxExactBits.
int BitsBehindPoint(double value) {
    for (int bits = 0; bits <= kMaxExactBits; ++bits) {
        const double scaled = std::ldexp(value, bits);
        if (scaled == std::floor(scaled)) {
            return bits;
        }
    }
    return 1000;
}

/// One direction: pieces and taps of every target pixel.
class TFastAxis {
public:
    TFastAxis(std::int32_t source_size, std::int32_t target_size);

    struct TTapRange {
        const TAxisTap* begin;
        const TAxisTap* end;
    };
    struct TPieceRange {
        const TAxisPiece* begin;
        const TAxisPiece* end;
    };
    TTapRange Taps(std::size_t target) const {
        return {taps_.data() + tap_starts_[target], taps_.data() + tap_starts_[target + 1]};
    }
    TPieceRange Pieces(std::size_t target) const {
        return {pieces_.data() + piece_starts_[target],
                pieces_.data() + piece_starts_[target + 1]};
    }
    double Step() const { return step_; }
    /// Bits behind the point that products of a weight and a fraction have.
    int ExactBits() const { return length_bits_ + fraction_bits_; }
    /// Largest sum of absolute weights, and number of taps, of a target pixel.
    double WeightSum() const { return weight_sum_; }
    std::size_t TapCount() const { return tap_count_; }

private:
    void AddPiece(TAxisPiece piece);
    void AddTap(std::int32_t index, double weight);
    void EndPixel();

    double step_;
    bool enlarging_;
    std::int32_t last_;
    std::vector<TAxisPiece> pieces_;
    std::vector<TAxisTap> taps_;
    std::vector<std::size_t> piece_starts_;
    std::vector<std::size_t> tap_starts_;
    int length_bits_ = 0;
    int fraction_bits_ = 0;
    double weight_sum_ = 0;
    std::size_t tap_count_ = 0;
};

TFastAxis::TFastAxis(std::int32_t source_size, std::int32_t target_size)
    : step_(static_cast<double>(source_size) / target_size),
      enlarging_(step_ < 1),
      last_(source_size - 1) {
    const std::int64_t count = static_cast<std::int64_t>(source_size) + target_size;
    RequireWorkMemory(count, sizeof(TAxisPiece) + 2 * sizeof(TAxisTap) + 2 * sizeof(std::size_t));
    pieces_.reserve(static_cast<std::size_t>(count));
    piece_starts_.assign(1, 0);
    tap_starts_.assign(1, 0);
    TAreaWalk walk(step_, source_size);
    double last = 0;
    for (std::int32_t pixel = 0; pixel < target_size;) {
        const TAreaStep step = walk.Next();
        const double length = step.position - last;
        last += length;
        const double fraction = step.ends_pixel ? step.position - step.index : 1.0;
        AddPiece(TAxisPiece{step.index, fraction, length});
        if (step.ends_pixel) {
            EndPixel();
            ++pixel;
        }
    }
}

void TFastAxis::AddPiece(TAxisPiece piece) {
    // Adding 0 times a sample changes no sum.
    if (piece.length == 0) {
        return;
    }
    pieces_.push_back(piece);
    length_bits_ = std::max(length_bits_, BitsBehindPoint(piece.length));
    if (!enlarging_) {
        AddTap(piece.index, piece.length);
        return;
    }
    fraction_bits_ = std::max(fraction_bits_, BitsBehindPoint(piece.fraction));
    AddTap(piece.index, piece.length * (1 - piece.fraction));
    AddTap(std::min(piece.index + 1, last_), piece.length * piece.fraction);
}

/// Adds a tap to the present target pixel, joined with the last one of the same source pixel.
/// Joining rounds once more, which the bound allows for; exact weights stay exact.
void TFastAxis::AddTap(std::int32_t index, double weight) {
    if (weight == 0) {
        return;
    }
    if (taps_.size() > tap_starts_.back() && taps_.back().index == index) {
        const double joined = static_cast<double>(taps_.back().weight) + weight;
        taps_.back().weight = static_cast<float>(joined);
    } else {
        taps_.push_back(TAxisTap{index, static_cast<float>(weight)});
    }
}

void TFastAxis::EndPixel() {
    double sum = 0;
    for (std::size_t i = tap_starts_.back(); i < taps_.size(); ++i) {
        sum += std::fabs(static_cast<double>(taps_[i].weight));
    }
    weight_sum_ = std::max(weight_sum_, sum);
    tap_count_ = std::max(tap_count_, taps_.size() - tap_starts_.back());
    piece_starts_.push_back(pieces_.size());
    tap_starts_.push_back(taps_.size());
}

/// How far a single-precision result can lie from the stated one, in steps of a sample; 0 when
/// they are the same. More than 1 when the result could leave the range of a sample by so much
/// that rounding does not bring it back (extreme ratios, where the slack of the borders counts).
double TieMargin(const TFastAxis& columns, const TFastAxis& rows, double scale) {
    const double largest = 255 * columns.WeightSum() * rows.WeightSum();
    if (largest * scale > 255.3) {
        return 2;
    }
    const int bits = columns.ExactBits() + rows.ExactBits();
    int exponent = 0;
    const bool scale_is_exact = std::frexp(scale, &exponent) == 0.5;
    if (bits < 24 && largest * std::ldexp(1, bits) <= 16777216 && scale_is_exact) {
        return 0;
    }
    // Each tap rounds its weight (joined ones twice), a product and a sum; four times the unit
    // 2^-24 of those roundings, and some for the scale, are a generous bound.
    const auto taps = static_cast<double>(columns.TapCount() + rows.TapCount());
    return largest * scale * (4 * taps + 16) * std::ldexp(1, -24);
}

/// sums[i] (+)= the rows' samples times their weights.
template <std::size_t kRows, bool kFresh>
void AddWeightedRows(const std::uint8_t* const* rows, const float* weights,
                     float* __restrict sums, std::size_t count) {
    for (std::size_t i = 0; i < count; ++i) {
        float sum = kFresh ? 0.0f : sums[i];
        for (std::size_t k = 0; k < kRows; ++k) {
            sum += weights[k] * static_cast<float>(rows[k][i]);
        }
        sums[i] = sum;
    }
}

constexpr std::size_t kMaxRowsAtOnce = 4;

template <bool kFresh>
void AddRowBatch(std::size_t row_count, const std::uint8_t* const* rows, const float* weights,
                 float* sums, std::size_t count) {
    switch (row_count) {
        case 1: AddWeightedRows<1, kFresh>(rows, weights, sums, count); break;
        case 2: AddWeightedRows<2, kFresh>(rows, weights, sums, count); break;
        case 3: AddWeightedRows<3, kFresh>(rows, weights, sums, count); break;
        default: AddWeightedRows<4, kFresh>(rows, weights, sums, count); break;
    }
}

/// Rounds to the nearest integer, ties to even, values of 0 to 255: beyond 2^23 single precision
/// has no fraction left.
inline float RoundSample(float value) {
    constexpr float kShift = 12582912.0f;
    return (value + kShift) - kShift;
}

/// Writes rounded samples; true when one lies within the margin of a tie. No value is far enough
/// outside 0 to 255 to round to anything else.
bool RoundSamples(const float* __restrict values, std::uint8_t* __restrict out,
                  std::size_t count, float tie_start) {
    unsigned near_tie = 0;
    for (std::size_t i = 0; i < count; ++i) {
        const float rounded = RoundSample(values[i]);
        near_tie |= static_cast<unsigned>(std::fabs(values[i] - rounded) > tie_start);
        out[i] = static_cast<std::uint8_t>(static_cast<std::int32_t>(rounded));
    }
    return near_tie != 0;
}

template <std::size_t kChannels>
class TFastArea {
public:
    TFastArea(TZmBitmap& source, TZmBitmap& target, const TResampleListener& listener)
        : source_(source),
          target_(target),
          listener_(listener),
          columns_(source.GetWidth(), target.GetWidth()),
          rows_(source.GetHeight(), target.GetHeight()),
          scale_(1 / (columns_.Step() * rows_.Step())),
          margin_(TieMargin(columns_, rows_, scale_)),
          enlarging_(columns_.Step() < 1),
          rows_stay_valid_(source.GetLocation() != zmFile && !source.GetIsVirtual()) {}

    bool IsPrecise() const { return margin_ <= kMaxTieMargin; }
    void Run();

private:
    void SumSourceRows(std::size_t y);
    void SumColumns();
    void FinishRow(std::size_t y);
    void CollectTies(std::size_t first, std::size_t end);
    void ComputeTies(std::size_t y, std::uint8_t* out);
    void AddTiePieces(const TAxisPiece& row);
    const std::uint8_t* StableRow(std::int32_t index, std::vector<std::uint8_t>& copy);

    TZmBitmap& source_;
    TZmBitmap& target_;
    const TResampleListener& listener_;
    TFastAxis columns_;
    TFastAxis rows_;
    double scale_;
    double margin_;
    bool enlarging_;
    bool rows_stay_valid_;
    std::vector<float> row_sums_;  ///< source width, and some behind for whole vector reads
    std::vector<float> values_;    ///< target width, and some behind for whole vector writes
    std::vector<std::size_t> ties_;
    std::vector<double> tie_sums_;
    std::vector<std::uint8_t> row_copy_;
    std::vector<std::uint8_t> next_row_copy_;
};

/// The row sums of a target row, in source columns.
template <std::size_t kChannels>
void TFastArea<kChannels>::SumSourceRows(std::size_t y) {
    const TFastAxis::TTapRange taps = rows_.Taps(y);
    const std::size_t count = row_sums_.size() - kMaxRowsAtOnce;
    const std::size_t at_once = rows_stay_valid_ ? kMaxRowsAtOnce : 1;
    bool fresh = true;
    for (const TAxisTap* tap = taps.begin; tap != taps.end;) {
        const std::uint8_t* rows[kMaxRowsAtOnce];
        float weights[kMaxRowsAtOnce];
        std::size_t n = 0;
        for (; n < at_once && tap != taps.end; ++tap) {
            rows[n] = source_.GetScanLine(tap->index);
            weights[n] = tap->weight;
            n += rows[n] != nullptr ? 1 : 0;
        }
        if (n > 0 && fresh) {
            AddRowBatch<true>(n, rows, weights, row_sums_.data(), count);
            fresh = false;
        } else if (n > 0) {
            AddRowBatch<false>(n, rows, weights, row_sums_.data(), count);
        }
    }
    if (fresh) {
        std::fill(row_sums_.begin(), row_sums_.end(), 0.0f);
    }
}

/// Target samples from the row sums. Three channels are filtered as four lanes, of which the
/// last is overwritten by the next pixel.
template <std::size_t kChannels>
void TFastArea<kChannels>::SumColumns() {
    constexpr std::size_t kLanes = kChannels == 3 ? 4 : 1;
    const auto scale = static_cast<float>(scale_);
    const float* sums = row_sums_.data();
    float* out = values_.data();
    const auto width = static_cast<std::size_t>(target_.GetWidth());
    for (std::size_t x = 0; x < width; ++x) {
        const TFastAxis::TTapRange taps = columns_.Taps(x);
        float lanes[kLanes] = {};
        for (const TAxisTap* tap = taps.begin; tap != taps.end; ++tap) {
            const float* pixel = sums + static_cast<std::size_t>(tap->index) * kChannels;
            for (std::size_t lane = 0; lane < kLanes; ++lane) {
                lanes[lane] += tap->weight * pixel[lane];
            }
        }
        for (std::size_t lane = 0; lane < kLanes; ++lane) {
            out[lane] = lanes[lane] * scale;
        }
        out += kChannels;
    }
}

/// Notes the pixels of a stretch of samples that have a sample near a tie.
template <std::size_t kChannels>
void TFastArea<kChannels>::CollectTies(std::size_t first, std::size_t end) {
    const auto tie_start = static_cast<float>(0.5 - margin_);
    for (std::size_t i = first; i < end; ++i) {
        const std::size_t pixel = i / kChannels;
        if (std::fabs(values_[i] - RoundSample(values_[i])) > tie_start &&
            (ties_.empty() || ties_.back() != pixel)) {
            ties_.push_back(pixel);
        }
    }
}

template <std::size_t kChannels>
const std::uint8_t* TFastArea<kChannels>::StableRow(std::int32_t index,
                                                    std::vector<std::uint8_t>& copy) {
    const std::uint8_t* row = source_.GetScanLine(index);
    if (rows_stay_valid_ && row != nullptr) {
        return row;
    }
    copy.assign(static_cast<std::size_t>(source_.GetWidth()) * kChannels, 0);
    if (row != nullptr) {
        std::memcpy(copy.data(), row, copy.size());
    }
    return copy.data();
}

/// One vertical piece of all noted pixels, in the order and the arithmetic of the plain form.
template <std::size_t kChannels>
void TFastArea<kChannels>::AddTiePieces(const TAxisPiece& row) {
    const std::int32_t last_row = source_.GetHeight() - 1;
    const auto last_column = static_cast<std::size_t>(source_.GetWidth()) - 1;
    const std::uint8_t* current = StableRow(row.index, row_copy_);
    const std::uint8_t* next =
        enlarging_ && row.index < last_row ? StableRow(row.index + 1, next_row_copy_) : current;
    const double fy = row.fraction;
    double* sums = tie_sums_.data();
    for (const std::size_t x : ties_) {
        const TFastAxis::TPieceRange pieces = columns_.Pieces(x);
        for (const TAxisPiece* piece = pieces.begin; piece != pieces.end; ++piece) {
            const double weight = piece->length * row.length;
            const double fx = piece->fraction;
            const auto column = static_cast<std::size_t>(piece->index);
            const std::size_t here = column * kChannels;
            const std::size_t right = std::min(column + 1, last_column) * kChannels;
            for (std::size_t c = 0; c < kChannels; ++c) {
                const double value =
                    enlarging_ ? ((1 - fx) * current[here + c] + fx * current[right + c]) *
                                         (1 - fy) +
                                     ((1 - fx) * next[here + c] + fx * next[right + c]) * fy
                               : current[here + c];
                sums[c] += weight * value;
            }
        }
        sums += kChannels;
    }
}

/// Computes the noted pixels of a row as the plain form does.
template <std::size_t kChannels>
void TFastArea<kChannels>::ComputeTies(std::size_t y, std::uint8_t* out) {
    tie_sums_.assign(ties_.size() * kChannels, 0.0);
    const TFastAxis::TPieceRange pieces = rows_.Pieces(y);
    for (const TAxisPiece* piece = pieces.begin; piece != pieces.end; ++piece) {
        AddTiePieces(*piece);
    }
    const double* sum = tie_sums_.data();
    for (const std::size_t x : ties_) {
        for (std::size_t c = 0; c < kChannels; ++c) {
            out[x * kChannels + c] = Clamp8(RoundHalfEven(*sum++ * scale_));
        }
    }
    ties_.clear();
}

template <std::size_t kChannels>
void TFastArea<kChannels>::FinishRow(std::size_t y) {
    std::uint8_t* out = target_.GetScanLine(static_cast<std::int32_t>(y));
    if (out == nullptr) {
        return;
    }
    const std::size_t count = static_cast<std::size_t>(target_.GetWidth()) * kChannels;
    // Without a margin the difference never exceeds one half.
    const auto tie_start = static_cast<float>(margin_ > 0 ? 0.5 - margin_ : 0.5);
    for (std::size_t first = 0; first < count; first += kTieBlock) {
        const std::size_t n = std::min(kTieBlock, count - first);
        if (RoundSamples(values_.data() + first, out + first, n, tie_start)) {
            CollectTies(first, first + n);
        }
    }
    if (!ties_.empty()) {
        ComputeTies(y, out);
    }
}

template <std::size_t kChannels>
void TFastArea<kChannels>::Run() {
    const auto channels = static_cast<std::int64_t>(kChannels);
    row_sums_ = MakeWorkBuffer<float>(source_.GetWidth() * channels + kMaxRowsAtOnce);
    values_ = MakeWorkBuffer<float>(target_.GetWidth() * channels + kMaxRowsAtOnce);
    const std::int32_t height = target_.GetHeight();
    for (std::int32_t y = 0; y < height; ++y) {
        const auto row = static_cast<std::size_t>(y);
        SumSourceRows(row);
        SumColumns();
        FinishRow(row);
        if (listener_.on_progress) {
            const double done = (y + 1.0) / height * 100;
            listener_.on_progress(listener_.sender, TruncToInt(done));
        }
    }
}

/// Runs the fast form where it is precise enough.
template <std::size_t kChannels>
bool RunFastArea(TZmBitmap& source, TZmBitmap& target, const TResampleListener& listener) {
    TFastArea<kChannels> engine(source, target, listener);
    if (!engine.IsPrecise()) {
        return ResampleAreaPlain(source, target, nullptr, TAreaInterpolation::kLinear, listener);
    }
    engine.Run();
    return true;
}

bool IsOpaque(TZmBitmap& alpha) {
    if (alpha.GetFull()) {
        return true;
    }
    for (std::int32_t y = 0; y < alpha.GetHeight(); ++y) {
        const std::uint8_t* row = alpha.GetScanLine(y);
        const std::uint8_t* end = row != nullptr ? row + alpha.GetWidth() : row;
        if (std::find_if(row, end, [](std::uint8_t value) { return value != 255; }) != end) {
            return false;
        }
    }
    return true;
}

}  // namespace

bool HasFastArea(TZmBitmap& source, TZmBitmap& target, TZmBitmap* alpha,
                 TAreaInterpolation interpolation) {
    const TZmPixelFormat format = source.GetPixelFormat();
    if (interpolation != TAreaInterpolation::kLinear || (format != zm8g && format != zm24RGB) ||
        source.IsEmpty() || target.IsEmpty()) {
        return false;
    }
    const bool wider = target.GetWidth() > source.GetWidth();
    const bool higher = target.GetHeight() > source.GetHeight();
    if (wider != higher) {
        return false;
    }
    return !wider || alpha == nullptr || format == zm8g || IsOpaque(*alpha);
}

bool ResampleAreaFast(TZmBitmap& source, TZmBitmap& target, const TResampleListener& listener) {
    if (!FitTargetFormat(target, source.GetPixelFormat())) {
        return false;
    }
    if (source.GetPixelFormat() == zm24RGB) {
        return RunFastArea<3>(source, target, listener);
    }
    return RunFastArea<1>(source, target, listener);
}

}  // namespace zm
