// Area interpolation (rfBilinear, rfBicubic), plain form.
//
// Every target pixel is the average over its footprint in the source. The footprint is cut into
// pieces at the source pixel borders; each piece contributes the value that the interpolation
// gives at the end of the piece, weighted by the piece's area. Double precision throughout, in
// exactly this order of operations: other forms must give the same bytes.
//
// Only four source rows are held, so that huge images need no second plane.

#include <algorithm>
#include <array>
#include <cmath>
#include <cstring>
#include <type_traits>
#include <vector>

#include "engine/proc/zmresample_area_p.h"

namespace zm {
namespace {

/// Which directions enlarge (E) or shrink (S), horizontal first.
enum TAreaMode : std::uint8_t { kModeEE = 0, kModeES = 1, kModeSE = 2, kModeSS = 3 };

TAreaMode AreaMode(double sx, double sy) {
    if (sx < 1) {
        return sy < 1 ? kModeEE : kModeES;
    }
    return sy < 1 ? kModeSE : kModeSS;
}

double CubicInner(double u) {
    const double v = std::fabs(u);
    return v * v * v - 2 * (v * v) + 1;
}

double CubicOuter(double u) {
    const double v = std::fabs(u);
    return -(v * v * v) + 5 * (v * v) - 8 * v + 4;
}

/// Sample offsets of a source column's neighbours in a row, limited to the image.
struct TColumns {
    std::size_t left = 0;
    std::size_t here = 0;
    std::size_t right = 0;
    std::size_t right2 = 0;
};

template <typename Sample>
class TAreaEngine {
public:
    TAreaEngine(TZmBitmap& source, TZmBitmap& target, TZmBitmap* alpha,
                TAreaInterpolation interpolation, const TResampleListener& listener);
    void Run();

private:
    static constexpr double kLimit = std::is_same_v<Sample, std::uint8_t> ? 255 : 65535;

    /// A source row with the alpha that belongs to it.
    struct TRow {
        std::vector<Sample> samples;
        std::vector<std::uint8_t> alpha;
    };

    void LoadRow(TRow& row, std::int32_t index);
    void ChooseRows(std::int32_t index);
    void RotateRows(std::int32_t index);
    TColumns ColumnsAt(std::int32_t column) const;
    void AddRowPiece(double fy, double height);
    void AddPiece(double* sums, const TColumns& at, double fx, double fy, double weight) const;
    double LinearValue(const TColumns& at, std::size_t channel, double fx, double fy) const;
    double CubicValue(const TColumns& at, std::size_t channel, double fx, double fy) const;
    double CubicInRow(const TRow& row, const TColumns& at, std::size_t channel, double fx) const;
    void AddAtAlphaEdge(double* sums, const TColumns& at, double fx, double fy,
                        double weight) const;
    void WriteRow(std::int32_t y);
    void ReportRows(std::int32_t rows_done) const;

    TZmBitmap& source_;
    TZmBitmap& target_;
    TZmBitmap* alpha_;
    const TResampleListener& listener_;
    bool cubic_;
    std::int32_t source_width_;
    std::int32_t source_height_;
    std::int32_t target_width_;
    std::int32_t target_height_;
    std::size_t channels_;
    double sx_;
    double sy_;
    TAreaMode mode_;
    std::size_t written_channels_;
    std::vector<double> pieces_;
    std::vector<double> sums_;
    std::vector<Sample> output_;
    TRow previous_buffer_;
    TRow current_buffer_;
    TRow next_buffer_;
    TRow next2_buffer_;
    // The rows in force for the present vertical piece, limited to the image.
    const TRow* previous_ = nullptr;
    const TRow* current_ = nullptr;
    const TRow* next_ = nullptr;
    const TRow* next2_ = nullptr;
};

template <typename Sample>
TAreaEngine<Sample>::TAreaEngine(TZmBitmap& source, TZmBitmap& target, TZmBitmap* alpha,
                                 TAreaInterpolation interpolation,
                                 const TResampleListener& listener)
    : source_(source),
      target_(target),
      alpha_(std::is_same_v<Sample, std::uint8_t> ? alpha : nullptr),
      listener_(listener),
      cubic_(interpolation == TAreaInterpolation::kCubic),
      source_width_(source.GetWidth()),
      source_height_(source.GetHeight()),
      target_width_(target.GetWidth()),
      target_height_(target.GetHeight()),
      channels_(static_cast<std::size_t>(source.GetChannelCount())),
      sx_(static_cast<double>(source_width_) / target_width_),
      sy_(static_cast<double>(source_height_) / target_height_),
      mode_(AreaMode(sx_, sy_)),
      written_channels_(channels_),
      pieces_(MakeAreaPieces(sx_, source_width_, target_width_)),
      sums_(MakeWorkBuffer<double>(static_cast<std::int64_t>(target_width_) *
                                   source.GetChannelCount())),
      output_(sums_.size()) {
    // Required: enlarging zm32RGB linearly in both directions fills channel 0 alone, the others
    // stay 0; existing jobs depend on it.
    if (!cubic_ && mode_ == kModeEE && channels_ == 4) {
        written_channels_ = 1;
    }
    const std::int64_t samples =
        static_cast<std::int64_t>(source_width_) * source.GetChannelCount();
    for (TRow* row : {&previous_buffer_, &current_buffer_, &next_buffer_, &next2_buffer_}) {
        row->samples = MakeWorkBuffer<Sample>(samples);
        row->alpha.assign(alpha_ != nullptr ? static_cast<std::size_t>(source_width_) : 0, 255);
    }
}

template <typename Sample>
void TAreaEngine<Sample>::LoadRow(TRow& row, std::int32_t index) {
    if (index >= source_height_) {
        return;
    }
    if (const std::uint8_t* pixels = source_.GetScanLine(index); pixels != nullptr) {
        std::memcpy(row.samples.data(), pixels, row.samples.size() * sizeof(Sample));
    }
    if (alpha_ != nullptr) {
        if (const std::uint8_t* values = alpha_->GetScanLine(index); values != nullptr) {
            std::memcpy(row.alpha.data(), values, row.alpha.size());
        }
    }
}

template <typename Sample>
void TAreaEngine<Sample>::ChooseRows(std::int32_t index) {
    current_ = &current_buffer_;
    previous_ = index > 0 ? &previous_buffer_ : current_;
    next_ = source_height_ - 1 > index ? &next_buffer_ : current_;
    next2_ = source_height_ - 1 > index + 1 ? &next2_buffer_ : next_;
}

/// Moves on to source row `index`.
template <typename Sample>
void TAreaEngine<Sample>::RotateRows(std::int32_t index) {
    std::swap(previous_buffer_, current_buffer_);
    std::swap(current_buffer_, next_buffer_);
    std::swap(next_buffer_, next2_buffer_);
    LoadRow(next2_buffer_, index + 2);
}

template <typename Sample>
TColumns TAreaEngine<Sample>::ColumnsAt(std::int32_t column) const {
    const std::size_t here = static_cast<std::size_t>(column) * channels_;
    TColumns at{here, here, here, here};
    if (column > 0) {
        at.left = here - channels_;
    }
    if (source_width_ - 1 > column) {
        at.right = here + channels_;
    }
    at.right2 = source_width_ - 1 > column + 1 ? here + 2 * channels_ : at.right;
    return at;
}

template <typename Sample>
double TAreaEngine<Sample>::LinearValue(const TColumns& at, std::size_t channel, double fx,
                                        double fy) const {
    const Sample* current = current_->samples.data() + channel;
    const Sample* next = next_->samples.data() + channel;
    switch (mode_) {
        case kModeEE:
            return ((1 - fx) * current[at.here] + fx * current[at.right]) * (1 - fy) +
                   ((1 - fx) * next[at.here] + fx * next[at.right]) * fy;
        case kModeES: return (1 - fx) * current[at.here] + fx * current[at.right];
        case kModeSE: return current[at.here] * (1 - fy) + next[at.here] * fy;
        default: return current[at.here];
    }
}

template <typename Sample>
double TAreaEngine<Sample>::CubicInRow(const TRow& row, const TColumns& at, std::size_t channel,
                                       double fx) const {
    const Sample* samples = row.samples.data() + channel;
    return LimitedCubic(samples[at.left], samples[at.here], samples[at.right], samples[at.right2],
                        fx, kLimit);
}

template <typename Sample>
double TAreaEngine<Sample>::CubicValue(const TColumns& at, std::size_t channel, double fx,
                                       double fy) const {
    switch (mode_) {
        case kModeEE: {
            const double a = RoundHalfEven(CubicInRow(*previous_, at, channel, fx));
            const double b = RoundHalfEven(CubicInRow(*current_, at, channel, fx));
            const double c = RoundHalfEven(CubicInRow(*next_, at, channel, fx));
            const double d = RoundHalfEven(CubicInRow(*next2_, at, channel, fx));
            return LimitedCubic(a, b, c, d, fy, kLimit);
        }
        case kModeES: return CubicInRow(*current_, at, channel, fx);
        case kModeSE: {
            const std::size_t i = at.here + channel;
            return LimitedCubic(previous_->samples[i], current_->samples[i], next_->samples[i],
                                next2_->samples[i], fy, kLimit);
        }
        default: return current_->samples[at.here + channel];
    }
}

/// Linear enlargement of zm24RGB with alpha.
/// Required: where alpha changes, the piece takes one pixel's colour instead of the blend, so
/// that the colour of transparent pixels does not bleed into opaque ones. The formula runs all
/// the same, on four equal colours.
template <typename Sample>
void TAreaEngine<Sample>::AddAtAlphaEdge(double* sums, const TColumns& at, double fx, double fy,
                                         double weight) const {
    const std::size_t here = at.here / channels_;
    const std::size_t right = at.right / channels_;
    const int strongest = StrongestAlpha(
        {current_->alpha[here], current_->alpha[right], next_->alpha[here], next_->alpha[right]});
    for (std::size_t channel = 0; channel < channels_; ++channel) {
        double value = 0;
        if (strongest < 0) {
            value = LinearValue(at, channel, fx, fy);
        } else {
            const TRow& row = strongest < 2 ? *current_ : *next_;
            const std::size_t column = (strongest & 1) != 0 ? at.right : at.here;
            const double color = row.samples[column + channel];
            value =
                ((1 - fx) * color + fx * color) * (1 - fy) + ((1 - fx) * color + fx * color) * fy;
        }
        sums[channel] += weight * value;
    }
}

template <typename Sample>
void TAreaEngine<Sample>::AddPiece(double* sums, const TColumns& at, double fx, double fy,
                                   double weight) const {
    if (alpha_ != nullptr && !cubic_ && mode_ == kModeEE && channels_ == 3) {
        AddAtAlphaEdge(sums, at, fx, fy, weight);
        return;
    }
    for (std::size_t channel = 0; channel < written_channels_; ++channel) {
        const double value =
            cubic_ ? CubicValue(at, channel, fx, fy) : LinearValue(at, channel, fx, fy);
        sums[channel] += weight * value;
    }
}

/// Adds one vertical piece of all target pixels of the row.
template <typename Sample>
void TAreaEngine<Sample>::AddRowPiece(double fy, double height) {
    TAreaWalk walk(sx_, source_width_);
    double* sums = sums_.data();
    std::size_t piece = 0;
    for (std::int32_t pixels_left = target_width_; pixels_left > 0; ++piece) {
        const TAreaStep step = walk.Next();
        const double fx = step.ends_pixel ? step.position - step.index : 1.0;
        AddPiece(sums, ColumnsAt(step.index), fx, fy, pieces_[piece] * height);
        if (step.ends_pixel) {
            sums += channels_;
            --pixels_left;
        }
    }
}

template <typename Sample>
void TAreaEngine<Sample>::WriteRow(std::int32_t y) {
    const double scale = 1 / (sx_ * sy_);
    for (std::size_t i = 0; i < sums_.size(); ++i) {
        const std::int32_t value = RoundHalfEven(sums_[i] * scale);
        if constexpr (std::is_same_v<Sample, std::uint8_t>) {
            output_[i] = Clamp8(value);
        } else {
            output_[i] = Clamp16(value);
        }
        sums_[i] = 0;
    }
    if (std::uint8_t* row = target_.GetScanLine(y); row != nullptr) {
        std::memcpy(row, output_.data(), output_.size() * sizeof(Sample));
    }
}

template <typename Sample>
void TAreaEngine<Sample>::ReportRows(std::int32_t rows_done) const {
    if (listener_.on_progress) {
        const double done = static_cast<double>(rows_done) / target_height_ * 100;
        listener_.on_progress(listener_.sender, TruncToInt(done));
    }
}

template <typename Sample>
void TAreaEngine<Sample>::Run() {
    LoadRow(current_buffer_, 0);
    LoadRow(next_buffer_, 1);
    LoadRow(next2_buffer_, 2);
    TAreaWalk walk(sy_, source_height_);
    double last = 0;
    for (std::int32_t y = 0; y < target_height_;) {
        const TAreaStep step = walk.Next();
        const double height = step.position - last;
        last += height;
        ChooseRows(step.index);
        AddRowPiece(step.ends_pixel ? step.position - step.index : 1.0, height);
        if (step.ends_pixel) {
            WriteRow(y);
            ++y;
            ReportRows(y);
        } else {
            RotateRows(step.index + 1);
        }
    }
}

}  // namespace

int StrongestAlpha(const std::array<std::uint8_t, 4>& alpha) {
    const std::uint8_t lowest = *std::min_element(alpha.begin(), alpha.end());
    for (int i = 3; i >= 0; --i) {
        if (alpha[static_cast<std::size_t>(i)] > lowest) {
            return i;
        }
    }
    return -1;
}

std::array<double, 4> CubicWeights(double t) {
    return {CubicOuter(1 + t), CubicInner(t), CubicInner(t - 1), CubicOuter(t - 2)};
}

double LimitedCubic(double a, double b, double c, double d, double t, double limit) {
    return MixCubic({a, b, c, d}, CubicWeights(t), limit);
}

std::vector<double> MakeAreaPieces(double step, std::int32_t source_size,
                                   std::int32_t target_size) {
    const std::int64_t count = static_cast<std::int64_t>(source_size) + target_size;
    std::vector<double> pieces = MakeWorkBuffer<double>(count);
    TAreaWalk walk(step, source_size);
    double last = 0;
    for (double& piece : pieces) {
        piece = walk.Next().position - last;
        last += piece;
    }
    return pieces;
}

bool ResampleAreaPlain(TZmBitmap& source, TZmBitmap& target, TZmBitmap* alpha,
                       TAreaInterpolation interpolation, const TResampleListener& listener) {
    const TZmPixelFormat format = source.GetPixelFormat();
    if (source.IsEmpty() || target.IsEmpty() || !FitTargetFormat(target, format)) {
        return false;
    }
    if (format == zm8g || format == zm24RGB || format == zm32RGB) {
        TAreaEngine<std::uint8_t>(source, target, alpha, interpolation, listener).Run();
        return true;
    }
    if (format == zm16g || format == zm48RGB) {
        TAreaEngine<std::uint16_t>(source, target, nullptr, interpolation, listener).Run();
        return true;
    }
    return false;
}

bool ResampleArea(TZmBitmap& source, TZmBitmap& target, TZmBitmap* alpha,
                  TAreaInterpolation interpolation, const TResampleListener& listener) {
    if (HasFastArea(source, target, interpolation)) {
        return ResampleAreaFast(source, target, alpha, interpolation, listener);
    }
    return ResampleAreaPlain(source, target, alpha, interpolation, listener);
}

}  // namespace zm
