// Area interpolation, fast form where both sides shrink: every piece then contributes its source
// pixel, under rfBilinear and rfBicubic alike.
//
// The sums of the plain form separate by axis: each target row is a weighted sum of source rows,
// each target pixel a weighted sum of columns of it. This form takes both sums in whatever order
// is quick, in single precision for bytes and double for 16-bit samples and for bytes of which so
// many come together that single precision would not do. With a bound for what that can differ from
// the stated double arithmetic, all pixels are decided but those near a rounding tie; these are
// computed again, exactly as the plain form does. Where every weight is a dyadic fraction of few
// bits (whole factors that are powers of 2, say) this is exact and nothing is left to decide.

#include <algorithm>
#include <cmath>
#include <limits>
#include <type_traits>
#include <vector>

#include "engine/proc/zmresample_area_p.h"

namespace zm {
namespace {

/// A piece of a target pixel along an axis, as the plain form has it.
struct TAxisPiece {
    std::int32_t index = 0;
    double length = 0;
};

/// One direction: pieces and taps of every target pixel.
template <typename Real>
class TFastAxis {
public:
    TFastAxis(std::int32_t source_size, std::int32_t target_size);

    struct TTapRange {
        const TAxisTap<Real>* begin;
        const TAxisTap<Real>* end;
    };
    struct TPieceRange {
        const TAxisPiece* begin;
        const TAxisPiece* end;
    };
    TTapRange Taps(std::size_t target) const {
        return {taps_.data() + tap_starts_[target], taps_.data() + tap_starts_[target + 1]};
    }
    /// All taps; for bytes.
    TAxisTaps AllTaps() const { return {taps_.data(), tap_starts_.data(), tap_starts_.size() - 1}; }
    TPieceRange Pieces(std::size_t target) const {
        return {pieces_.data() + piece_starts_[target], pieces_.data() + piece_starts_[target + 1]};
    }
    double Step() const { return step_; }
    /// Bits behind the point that the weights have.
    int ExactBits() const { return length_bits_; }
    /// Largest sum of absolute weights, and number of taps, of a target pixel.
    double WeightSum() const { return weight_sum_; }
    std::size_t TapCount() const { return tap_count_; }

private:
    void AddPiece(TAxisPiece piece);
    void AddTap(std::int32_t index, double weight);
    void EndPixel();

    double step_;
    std::vector<TAxisPiece> pieces_;
    std::vector<TAxisTap<Real>> taps_;
    std::vector<std::size_t> piece_starts_;
    std::vector<std::size_t> tap_starts_;
    int length_bits_ = 0;
    double weight_sum_ = 0;
    std::size_t tap_count_ = 0;
};

template <typename Real>
TFastAxis<Real>::TFastAxis(std::int32_t source_size, std::int32_t target_size)
    : step_(static_cast<double>(source_size) / target_size) {
    const std::int64_t count = static_cast<std::int64_t>(source_size) + target_size;
    RequireWorkMemory(count, sizeof(TAxisPiece) + sizeof(TAxisTap<Real>) + 2 * sizeof(std::size_t));
    pieces_.reserve(static_cast<std::size_t>(count));
    piece_starts_.assign(1, 0);
    tap_starts_.assign(1, 0);
    TAreaWalk walk(step_, source_size);
    double last = 0;
    for (std::int32_t pixel = 0; pixel < target_size;) {
        const TAreaStep step = walk.Next();
        const double length = step.position - last;
        last += length;
        AddPiece(TAxisPiece{step.index, length});
        if (step.ends_pixel) {
            EndPixel();
            ++pixel;
        }
    }
}

template <typename Real>
void TFastAxis<Real>::AddPiece(TAxisPiece piece) {
    // Adding 0 times a sample changes no sum.
    if (piece.length == 0) {
        return;
    }
    pieces_.push_back(piece);
    length_bits_ = std::max(length_bits_, BitsBehindPoint(piece.length));
    AddTap(piece.index, piece.length);
}

/// Adds a tap to the present target pixel, joined with the last one of the same source pixel.
/// Joining rounds once more, which the bound allows for; exact weights stay exact.
template <typename Real>
void TFastAxis<Real>::AddTap(std::int32_t index, double weight) {
    if (weight == 0) {
        return;
    }
    if (taps_.size() > tap_starts_.back() && taps_.back().index == index) {
        const double joined = static_cast<double>(taps_.back().weight) + weight;
        taps_.back().weight = static_cast<Real>(joined);
    } else {
        taps_.push_back({index, static_cast<Real>(weight)});
    }
}

template <typename Real>
void TFastAxis<Real>::EndPixel() {
    double sum = 0;
    for (std::size_t i = tap_starts_.back(); i < taps_.size(); ++i) {
        sum += std::fabs(static_cast<double>(taps_[i].weight));
    }
    weight_sum_ = std::max(weight_sum_, sum);
    tap_count_ = std::max(tap_count_, taps_.size() - tap_starts_.back());
    piece_starts_.push_back(pieces_.size());
    tap_starts_.push_back(taps_.size());
}

/// How far a result of the fast arithmetic can lie from the stated one, in steps of a sample; 0
/// when they are the same. More than 1 when the result could leave the range of a sample by so
/// much that rounding does not bring it back (extreme ratios, where the slack of the borders
/// counts).
template <typename Real>
double TieMargin(const TFastAxis<Real>& columns, const TFastAxis<Real>& rows, double limit,
                 double scale) {
    const double largest = limit * columns.WeightSum() * rows.WeightSum();
    if (largest * scale > limit + 0.3) {
        return 2;
    }
    constexpr int kDigits = std::numeric_limits<Real>::digits;
    const int bits = columns.ExactBits() + rows.ExactBits();
    int exponent = 0;
    const bool scale_is_exact = std::frexp(scale, &exponent) == 0.5;
    if (largest * std::ldexp(1, bits) <= std::ldexp(1, kDigits) && scale_is_exact) {
        return 0;
    }
    // Each tap rounds its weight (joined ones twice), a product and a sum; four times the unit
    // of those roundings, and some for the scale, are a generous bound. In double precision the
    // stated form rounds as much again.
    const auto taps = static_cast<double>(columns.TapCount() + rows.TapCount());
    const double stated = sizeof(Real) == sizeof(double) ? static_cast<double>(columns.TapCount()) *
                                                               static_cast<double>(rows.TapCount())
                                                         : 0;
    return largest * scale * (4 * (taps + stated) + 16) * std::ldexp(1, -kDigits);
}

/// Writes rounded samples; true when one lies within the margin of a tie. No value is far enough
/// outside the range to round to anything else.
template <typename Sample, typename Real>
bool RoundSamples(const Real* __restrict values, Sample* __restrict out, std::size_t count,
                  Real tie_start) {
    unsigned near_tie = 0;
    for (std::size_t i = 0; i < count; ++i) {
        const Real rounded = RoundToWhole(values[i]);
        near_tie |= static_cast<unsigned>(std::fabs(values[i] - rounded) > tie_start);
        out[i] = static_cast<Sample>(static_cast<std::int32_t>(rounded));
    }
    return near_tie != 0;
}

template <typename Sample, std::size_t kChannels, typename Real>
class TFastArea {
public:
    TFastArea(TZmBitmap& source, TZmBitmap& target, const TResampleListener& listener)
        : source_(source),
          target_(target),
          listener_(listener),
          columns_(source.GetWidth(), target.GetWidth()),
          rows_(source.GetHeight(), target.GetHeight()),
          scale_(1 / (columns_.Step() * rows_.Step())),
          margin_(TieMargin(columns_, rows_, double{std::numeric_limits<Sample>::max()}, scale_)),
          rows_stay_valid_(source.GetLocation() != zmFile && !source.GetIsVirtual()) {}

    bool IsPrecise() const { return margin_ <= kMaxTieMargin; }
    void Run();

private:
    /// Source rows that are read side by side: more would crowd the cache.
    static constexpr std::size_t kMaxRowsAtOnce = 8;
    /// Numbers behind a row, for whole vector reads and writes.
    static constexpr std::size_t kPadding = 4;

    const Sample* SourceRow(std::int32_t index) {
        return reinterpret_cast<const Sample*>(source_.GetScanLine(index));
    }
    void SumSourceRows(std::size_t y);
    void SumColumns();
    void FinishRow(std::size_t y);
    void CollectTies(std::size_t first, std::size_t end);
    void ComputeTies(std::size_t y, Sample* out);
    void AddTiePieces(const TAxisPiece& row);

    TZmBitmap& source_;
    TZmBitmap& target_;
    const TResampleListener& listener_;
    TFastAxis<Real> columns_;
    TFastAxis<Real> rows_;
    double scale_;
    double margin_;
    bool rows_stay_valid_;
    std::vector<const Sample*> summed_rows_;
    std::vector<Real> summed_weights_;
    std::vector<Real> row_sums_;  ///< padded
    std::vector<Real> values_;    ///< padded
    std::vector<std::size_t> ties_;
    std::vector<double> tie_sums_;
};

/// The row sums of a target row, in source columns.
template <typename Sample, std::size_t kChannels, typename Real>
void TFastArea<Sample, kChannels, Real>::SumSourceRows(std::size_t y) {
    const typename TFastAxis<Real>::TTapRange taps = rows_.Taps(y);
    const std::size_t count = row_sums_.size() - kPadding;
    TSumStart start = TSumStart::kFresh;
    const auto add = [&] {
        const TSummedRows<Sample, Real> rows{summed_rows_.data(), summed_weights_.data(),
                                             summed_rows_.size()};
        SumWeightedRows(rows, count, start, row_sums_.data());
        summed_rows_.clear();
        summed_weights_.clear();
        start = TSumStart::kGoOn;
    };
    for (const TAxisTap<Real>* tap = taps.begin; tap != taps.end; ++tap) {
        const Sample* row = SourceRow(tap->index);
        if (row == nullptr) {
            continue;
        }
        summed_rows_.push_back(row);
        summed_weights_.push_back(tap->weight);
        if (!rows_stay_valid_ || summed_rows_.size() == kMaxRowsAtOnce) {
            add();
        }
    }
    if (!summed_rows_.empty() || start == TSumStart::kFresh) {
        add();
    }
}

/// Target samples from the row sums.
template <typename Sample, std::size_t kChannels, typename Real>
void TFastArea<Sample, kChannels, Real>::SumColumns() {
    const auto scale = static_cast<Real>(scale_);
    if constexpr (kChannels == 3 && std::is_same_v<Real, float>) {
        SumPixels3(columns_.AllTaps(), row_sums_.data(), scale, values_.data());
        return;
    }
    const Real* sums = row_sums_.data();
    Real* out = values_.data();
    const auto width = static_cast<std::size_t>(target_.GetWidth());
    for (std::size_t x = 0; x < width; ++x) {
        const typename TFastAxis<Real>::TTapRange taps = columns_.Taps(x);
        Real lanes[kChannels] = {};
        for (const TAxisTap<Real>* tap = taps.begin; tap != taps.end; ++tap) {
            const Real* pixel = sums + static_cast<std::size_t>(tap->index) * kChannels;
            for (std::size_t lane = 0; lane < kChannels; ++lane) {
                lanes[lane] += tap->weight * pixel[lane];
            }
        }
        for (std::size_t lane = 0; lane < kChannels; ++lane) {
            out[lane] = lanes[lane] * scale;
        }
        out += kChannels;
    }
}

/// Notes the pixels of a stretch of samples that have a sample near a tie.
template <typename Sample, std::size_t kChannels, typename Real>
void TFastArea<Sample, kChannels, Real>::CollectTies(std::size_t first, std::size_t end) {
    const auto tie_start = static_cast<Real>(0.5 - margin_);
    for (std::size_t i = first; i < end; ++i) {
        const std::size_t pixel = i / kChannels;
        if (std::fabs(values_[i] - RoundToWhole(values_[i])) > tie_start &&
            (ties_.empty() || ties_.back() != pixel)) {
            ties_.push_back(pixel);
        }
    }
}

/// One vertical piece of all noted pixels, in the order and the arithmetic of the plain form.
template <typename Sample, std::size_t kChannels, typename Real>
void TFastArea<Sample, kChannels, Real>::AddTiePieces(const TAxisPiece& row) {
    const Sample* current = SourceRow(row.index);
    if (current == nullptr) {
        return;
    }
    double* sums = tie_sums_.data();
    for (const std::size_t x : ties_) {
        const typename TFastAxis<Real>::TPieceRange pieces = columns_.Pieces(x);
        for (const TAxisPiece* piece = pieces.begin; piece != pieces.end; ++piece) {
            const double weight = piece->length * row.length;
            const Sample* pixel = current + static_cast<std::size_t>(piece->index) * kChannels;
            for (std::size_t c = 0; c < kChannels; ++c) {
                sums[c] += weight * pixel[c];
            }
        }
        sums += kChannels;
    }
}

/// Computes the noted pixels of a row as the plain form does.
template <typename Sample, std::size_t kChannels, typename Real>
void TFastArea<Sample, kChannels, Real>::ComputeTies(std::size_t y, Sample* out) {
    tie_sums_.assign(ties_.size() * kChannels, 0.0);
    const typename TFastAxis<Real>::TPieceRange pieces = rows_.Pieces(y);
    for (const TAxisPiece* piece = pieces.begin; piece != pieces.end; ++piece) {
        AddTiePieces(*piece);
    }
    const double* sum = tie_sums_.data();
    for (const std::size_t x : ties_) {
        for (std::size_t c = 0; c < kChannels; ++c) {
            out[x * kChannels + c] = ClampSample<Sample>(RoundHalfEven(*sum++ * scale_));
        }
    }
    ties_.clear();
}

template <typename Sample, std::size_t kChannels, typename Real>
void TFastArea<Sample, kChannels, Real>::FinishRow(std::size_t y) {
    auto* out = reinterpret_cast<Sample*>(target_.GetScanLine(static_cast<std::int32_t>(y)));
    if (out == nullptr) {
        return;
    }
    const std::size_t count = static_cast<std::size_t>(target_.GetWidth()) * kChannels;
    // Without a margin the difference never exceeds one half.
    const auto tie_start = static_cast<Real>(margin_ > 0 ? 0.5 - margin_ : 0.5);
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

template <typename Sample, std::size_t kChannels, typename Real>
void TFastArea<Sample, kChannels, Real>::Run() {
    const auto channels = static_cast<std::int64_t>(kChannels);
    row_sums_ = MakeWorkBuffer<Real>(source_.GetWidth() * channels + std::int64_t{kPadding});
    values_ = MakeWorkBuffer<Real>(target_.GetWidth() * channels + std::int64_t{kPadding});
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

template <typename Sample, std::size_t kChannels, typename Real>
bool ShrinkIn(TZmBitmap& source, TZmBitmap& target, const TResampleListener& listener) {
    TFastArea<Sample, kChannels, Real> engine(source, target, listener);
    if (!engine.IsPrecise()) {
        return false;
    }
    engine.Run();
    return true;
}

template <typename Sample, std::size_t kChannels>
bool Shrink(TZmBitmap& source, TZmBitmap& target, const TResampleListener& listener) {
    return ShrinkIn<Sample, kChannels, TAreaReal<Sample>>(source, target, listener) ||
           (sizeof(Sample) == 1 && ShrinkIn<Sample, kChannels, double>(source, target, listener));
}

}  // namespace

bool IsOpaquePlane(TZmBitmap& alpha) {
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

int BitsBehindPoint(double value) {
    for (int bits = 0; bits <= kMaxExactBits; ++bits) {
        const double scaled = std::ldexp(value, bits);
        if (scaled == std::floor(scaled)) {
            return bits;
        }
    }
    return 1000;
}

bool ShrinkAreaFast(TZmBitmap& source, TZmBitmap& target, const TResampleListener& listener) {
    switch (source.GetPixelFormat()) {
        case zm8g: return Shrink<std::uint8_t, 1>(source, target, listener);
        case zm24RGB: return Shrink<std::uint8_t, 3>(source, target, listener);
        case zm32RGB: return Shrink<std::uint8_t, 4>(source, target, listener);
        case zm16g: return Shrink<std::uint16_t, 1>(source, target, listener);
        case zm48RGB: return Shrink<std::uint16_t, 3>(source, target, listener);
        default: return false;
    }
}

bool HasFastArea(TZmBitmap& source, TZmBitmap& target, TAreaInterpolation interpolation) {
    const TZmPixelFormat format = source.GetPixelFormat();
    const bool known = format == zm8g || format == zm24RGB || format == zm32RGB ||
                       format == zm16g || format == zm48RGB;
    if (!known || source.IsEmpty() || target.IsEmpty()) {
        return false;
    }
    const bool wider = target.GetWidth() > source.GetWidth();
    const bool higher = target.GetHeight() > source.GetHeight();
    return !wider || !higher || interpolation == TAreaInterpolation::kCubic || format != zm32RGB;
}

bool ResampleAreaFast(TZmBitmap& source, TZmBitmap& target, TZmBitmap* alpha,
                      TAreaInterpolation interpolation, const TResampleListener& listener) {
    if (!FitTargetFormat(target, source.GetPixelFormat())) {
        return false;
    }
    const bool wider = target.GetWidth() > source.GetWidth();
    const bool higher = target.GetHeight() > source.GetHeight();
    bool done = false;
    if (wider != higher) {
        done = MixAreaFast(source, target, interpolation, listener);
    } else if (wider) {
        done = EnlargeAreaFast(source, target, alpha, interpolation, listener);
    } else {
        done = ShrinkAreaFast(source, target, listener);
    }
    return done || ResampleAreaPlain(source, target, alpha, interpolation, listener);
}

}  // namespace zm
