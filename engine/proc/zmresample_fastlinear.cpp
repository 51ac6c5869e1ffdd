// Fast linear engine: integer samples, filtered first horizontally, then vertically. Shrinking
// takes plain means; enlarging interpolates between two samples.
//
// Columns and rows are aligned differently: a column's left neighbour is rounded, a row's upper
// neighbour truncated.
// Required: the fraction of a column that rounds up is negative and extrapolates, so that an
// enlarged ramp is not monotone; existing jobs depend on it.
//
// The horizontally filtered rows are needed in rising order, two at a time: they are made on
// demand instead of as a whole plane.

#include <algorithm>
#include <array>
#include <cstring>
#include <iterator>
#include <vector>

#include "engine/proc/zmresample_p.h"

namespace zm {
namespace {

/// Means over more rows or columns than this keep to whole-number division.
constexpr std::int32_t kMaxMeanLength = 4096;

/// Where one target column comes from.
struct TColumnSpan {
    std::int32_t left = 0;
    std::int32_t right = 0;  ///< shrinking: the last column of the mean
    double frac = 0;         ///< enlarging: distance from `left`, -0.5 to 0.5
};

/// The part of the target to compute, inclusive.
TRect LimitRect(const TRect* rect, std::int32_t width, std::int32_t height) {
    if (rect == nullptr || (rect->right == -1 && rect->bottom == -1)) {
        return TRect{0, 0, width - 1, height - 1};
    }
    return TRect{std::clamp(rect->left, 0, width - 1), std::clamp(rect->top, 0, height - 1),
                 std::clamp(rect->right, 0, width - 1), std::clamp(rect->bottom, 0, height - 1)};
}

TColumnSpan MakeSpan(std::int32_t x, double scale, std::int32_t source_width,
                     std::int32_t target_width) {
    const double position = x / scale;
    const std::int32_t next = std::min(x == kMaxInt32 ? x : x + 1, target_width - 1);
    TColumnSpan span;
    span.left = std::min(RoundHalfEven(position), source_width - 1);
    span.frac = position - span.left;
    span.right = std::clamp(RoundHalfEven(next / scale + 1e-10), span.left, source_width - 1);
    return span;
}

template <typename Sample, std::size_t kChannels>
class TFastLinear {
public:
    TFastLinear(TZmBitmap& source, TZmBitmap& target, const TRect* rect,
                const TResampleListener& listener, TResampleForm form);
    void Run();

private:
    /// A horizontally filtered source row.
    struct TFilteredRow {
        std::int32_t index = -1;
        std::vector<std::int32_t> samples;
    };

    const std::vector<std::int32_t>& FilteredRow(std::int32_t index);
    void PrepareMeans();
    void PrepareWindows();
    void PrepareShortSpans();
    void FindPlaces(std::size_t reach_bytes, std::size_t longer_offset);
    void FilterRow(const Sample* in, std::int32_t* out);
    void ShrinkSpans(std::size_t first, const Sample* in, std::int32_t* out) const;
    void ShrinkRowByShortSpans(const Sample* in, std::int32_t* out) const;
    void ShrinkRowByWindows(const Sample* in, std::int32_t* out);
    void EnlargeRow(const Sample* in, std::int32_t* out) const;
    void EnlargeRowFast(const Sample* in, std::int32_t* out) const;
    void MeanRow(std::int32_t y);
    void MeanRows(std::int32_t top, std::int32_t bottom);
    void MeanRowsFast(std::int32_t top, std::int32_t bottom);
    void BlendRow(std::int32_t y);
    void BlendRows(const std::int32_t* a, const std::int32_t* b, double f);
    void BlendBytes(const std::int32_t* a, const std::int32_t* b, double f);
    void WriteRow(std::int32_t y);

    TZmBitmap& source_;
    TZmBitmap& target_;
    std::int32_t source_height_;
    std::int32_t source_width_;
    std::int32_t target_height_;
    bool is_fast_;
    TRect rect_;
    double scale_x_;
    double scale_y_;
    std::vector<TColumnSpan> spans_;
    std::array<TFilteredRow, 2> rows_;
    std::vector<TMeanSpan> means_;        ///< fast form of shrinking zm24RGB far
    std::vector<std::uint8_t> row_copy_;  ///< for it: a row with a byte behind
    TMeanWindows windows_;                ///< fast form of shrinking bytes a little
    std::vector<std::uint32_t> places_;   ///< of the leading spans, in the row or its window means
    std::vector<std::uint8_t> window_means_;
    std::vector<std::uint32_t> factors_;  ///< these two for short spans of zm24RGB
    std::vector<std::uint8_t> last_pairs_;
    std::vector<std::int32_t> fast_sums_;  ///< fast form of vertical means
    std::vector<std::int64_t> sums_;
    std::vector<Sample> output_;
    TPercentReporter reporter_;
    std::int64_t units_done_ = 0;
};

template <typename Sample, std::size_t kChannels>
TFastLinear<Sample, kChannels>::TFastLinear(TZmBitmap& source, TZmBitmap& target, const TRect* rect,
                                            const TResampleListener& listener, TResampleForm form)
    : source_(source),
      target_(target),
      source_height_(source.GetHeight()),
      source_width_(source.GetWidth()),
      target_height_(target.GetHeight()),
      is_fast_(form == TResampleForm::kFast),
      rect_(LimitRect(rect, target.GetWidth(), target.GetHeight())),
      scale_x_(static_cast<double>(target.GetWidth()) / source.GetWidth()),
      scale_y_(static_cast<double>(target.GetHeight()) / source.GetHeight()),
      reporter_(listener,
                100 / (static_cast<double>(source.GetHeight()) + target.GetHeight() + 0.5)) {
    const std::int64_t columns =
        std::max<std::int64_t>(static_cast<std::int64_t>(rect_.right) - rect_.left + 1, 0);
    const auto samples = columns * static_cast<std::int64_t>(kChannels);
    spans_ = MakeWorkBuffer<TColumnSpan>(columns);
    for (std::size_t i = 0; i < spans_.size(); ++i) {
        spans_[i] = MakeSpan(rect_.left + static_cast<std::int32_t>(i), scale_x_, source_width_,
                             target.GetWidth());
    }
    for (TFilteredRow& row : rows_) {
        row.samples = MakeWorkBuffer<std::int32_t>(samples + std::int64_t{kMeanPadding});
    }
    PrepareWindows();
    PrepareMeans();
    sums_ = MakeWorkBuffer<std::int64_t>(scale_y_ > 1 ? 0 : samples);
    output_ = MakeWorkBuffer<Sample>(samples);
}

std::size_t LengthOf(const TColumnSpan& span) {
    return static_cast<std::size_t>(span.right - span.left) + 1;
}

/// Neighbouring spans differ by a pixel in length. Where they are short, the means of all windows
/// of both lengths are sooner made, by whole vectors, than those wanted one by one; and very short
/// ones are summed several at a time. Only the last span, or the last few, may be of another kind.
template <typename Sample, std::size_t kChannels>
void TFastLinear<Sample, kChannels>::PrepareWindows() {
    if (!is_fast_ || sizeof(Sample) != 1 || scale_x_ > 1 || spans_.size() < 2) {
        return;
    }
    const auto ends = std::minmax_element(
        spans_.begin(), spans_.end() - 1,
        [](const TColumnSpan& a, const TColumnSpan& b) { return LengthOf(a) < LengthOf(b); });
    windows_ = TMeanWindows{kChannels, LengthOf(*ends.first), LengthOf(*ends.second)};
    if (windows_.shortest < 2 || windows_.longest > kMaxWindow ||
        windows_.longest > windows_.shortest + 1) {
        return;
    }
    const std::size_t row_bytes = static_cast<std::size_t>(source_width_) * kChannels;
    if (kChannels == 3 && windows_.longest <= kMaxShortSpan && HasShortSpans()) {
        PrepareShortSpans();
    } else if (row_bytes >= kMinWindowRow) {
        FindPlaces(windows_.longest * kChannels, row_bytes);
        window_means_ = MakeWorkBuffer<std::uint8_t>(static_cast<std::int64_t>(row_bytes) * 2 + 1);
    }
}

/// Notes the leading spans behind whose start there are `reach_bytes`; those of the greater length
/// lie `longer_offset` further.
template <typename Sample, std::size_t kChannels>
void TFastLinear<Sample, kChannels>::FindPlaces(std::size_t reach_bytes,
                                                std::size_t longer_offset) {
    const std::size_t row_bytes = static_cast<std::size_t>(source_width_) * kChannels;
    for (const TColumnSpan& span : spans_) {
        const std::size_t place = static_cast<std::size_t>(span.left) * kChannels;
        const bool is_short = LengthOf(span) == windows_.shortest;
        if ((!is_short && LengthOf(span) != windows_.longest) || reach_bytes > row_bytes ||
            place > row_bytes - reach_bytes) {
            break;
        }
        places_.push_back(static_cast<std::uint32_t>(place + (is_short ? 0 : longer_offset)));
    }
}

template <typename Sample, std::size_t kChannels>
void TFastLinear<Sample, kChannels>::PrepareShortSpans() {
    constexpr std::uint8_t kNone = 128;  // stands for a zero
    FindPlaces(kPairBytes, 0);
    const std::size_t first_pixel = (windows_.longest - 1) / 2 * 2;
    for (std::size_t i = 0; i < places_.size(); ++i) {
        const std::size_t length = LengthOf(spans_[i]);
        factors_.insert(factors_.end(), 4, MeanFactor(length));
        const auto byte_of = [&](std::size_t pixel, std::size_t channel) {
            return pixel < length ? static_cast<std::uint8_t>(pixel * 3 + channel) : kNone;
        };
        for (std::size_t c = 0; c < 3; ++c) {
            const std::uint8_t words[] = {byte_of(first_pixel, c), kNone,
                                          byte_of(first_pixel + 1, c), kNone};
            last_pairs_.insert(last_pairs_.end(), std::begin(words), std::end(words));
        }
        last_pairs_.insert(last_pairs_.end(), 4, kNone);
    }
}

/// The spans for the vector loop, where that applies.
template <typename Sample, std::size_t kChannels>
void TFastLinear<Sample, kChannels>::PrepareMeans() {
    const auto is_long = [](const TColumnSpan& span) {
        return span.right - span.left >= kMaxMeanLength;
    };
    if (!is_fast_ || kChannels != 3 || sizeof(Sample) != 1 || scale_x_ > 1 || !places_.empty() ||
        std::any_of(spans_.begin(), spans_.end(), is_long)) {
        return;
    }
    means_.reserve(spans_.size());
    for (const TColumnSpan& span : spans_) {
        const std::int32_t count = span.right - span.left + 1;
        means_.push_back(TMeanSpan{span.left, count, 1.0f / static_cast<float>(count)});
    }
    row_copy_.assign(static_cast<std::size_t>(source_width_) * kChannels + 1, 0);
}

/// Each channel becomes the truncating mean of its span, from span `first` on.
template <typename Sample, std::size_t kChannels>
void TFastLinear<Sample, kChannels>::ShrinkSpans(std::size_t first, const Sample* in,
                                                 std::int32_t* out) const {
    out += first * kChannels;
    for (std::size_t i = first; i < spans_.size(); ++i) {
        const TColumnSpan& span = spans_[i];
        std::array<std::int64_t, kChannels> sums{};
        const Sample* pixel = in + static_cast<std::size_t>(span.left) * kChannels;
        for (std::int32_t column = span.left; column <= span.right; ++column) {
            for (std::size_t c = 0; c < kChannels; ++c) {
                sums[c] += *pixel++;
            }
        }
        const std::int64_t count = static_cast<std::int64_t>(span.right) - span.left + 1;
        for (const std::int64_t sum : sums) {
            *out++ = static_cast<std::int32_t>(sum / count);
        }
    }
}

template <typename Sample, std::size_t kChannels>
void TFastLinear<Sample, kChannels>::ShrinkRowByWindows(const Sample* in, std::int32_t* out) {
    if constexpr (sizeof(Sample) == 1) {
        MeanWindowsOfRow(in, static_cast<std::size_t>(source_width_) * kChannels, windows_,
                         window_means_.data());
        if constexpr (kChannels == 3) {
            PickPixels24(window_means_.data(), places_.data(), places_.size(), out);
        } else {
            std::transform(places_.begin(), places_.end(), out,
                           [this](std::uint32_t place) { return window_means_[place]; });
        }
        ShrinkSpans(places_.size(), in, out);
    }
}

template <typename Sample, std::size_t kChannels>
void TFastLinear<Sample, kChannels>::ShrinkRowByShortSpans(const Sample* in,
                                                           std::int32_t* out) const {
    if constexpr (sizeof(Sample) == 1 && kChannels == 3) {
        const TShortSpans spans{places_.data(), factors_.data(), last_pairs_.data(),
                                windows_.longest, places_.size()};
        ShrinkSpans(MeanShortSpans24(in, spans, out), in, out);
    }
}

template <typename Sample, std::size_t kChannels>
void TFastLinear<Sample, kChannels>::EnlargeRow(const Sample* in, std::int32_t* out) const {
    for (const TColumnSpan& span : spans_) {
        const std::int32_t next = std::min(span.left + 1, source_width_ - 1);
        const Sample* a = in + static_cast<std::size_t>(span.left) * kChannels;
        const Sample* b = in + static_cast<std::size_t>(next) * kChannels;
        for (std::size_t c = 0; c < kChannels; ++c) {
            *out++ = RoundHalfEven(a[c] + (b[c] - a[c]) * span.frac);
        }
    }
}

/// EnlargeRow with the rounding that the compiler can put into vectors; the same double
/// arithmetic.
template <typename Sample, std::size_t kChannels>
void TFastLinear<Sample, kChannels>::EnlargeRowFast(const Sample* in, std::int32_t* out) const {
    for (const TColumnSpan& span : spans_) {
        const std::int32_t next = std::min(span.left + 1, source_width_ - 1);
        const Sample* a = in + static_cast<std::size_t>(span.left) * kChannels;
        const Sample* b = in + static_cast<std::size_t>(next) * kChannels;
        for (std::size_t c = 0; c < kChannels; ++c) {
            *out++ = static_cast<std::int32_t>(RoundToWhole(a[c] + (b[c] - a[c]) * span.frac));
        }
    }
}

template <typename Sample, std::size_t kChannels>
void TFastLinear<Sample, kChannels>::FilterRow(const Sample* in, std::int32_t* out) {
    if (!factors_.empty()) {
        ShrinkRowByShortSpans(in, out);
    } else if (!places_.empty()) {
        ShrinkRowByWindows(in, out);
    } else if (!means_.empty()) {
        std::memcpy(row_copy_.data(), in, row_copy_.size() - 1);
        MeanSpans24(row_copy_.data(), means_.data(), means_.size(), out);
    } else if (scale_x_ <= 1) {
        ShrinkSpans(0, in, out);
    } else if (is_fast_) {
        EnlargeRowFast(in, out);
    } else {
        EnlargeRow(in, out);
    }
}

template <typename Sample, std::size_t kChannels>
const std::vector<std::int32_t>& TFastLinear<Sample, kChannels>::FilteredRow(std::int32_t index) {
    for (const TFilteredRow& row : rows_) {
        if (row.index == index) {
            return row.samples;
        }
    }
    TFilteredRow& row = rows_[0].index < rows_[1].index ? rows_[0] : rows_[1];
    row.index = index;
    const auto* in = reinterpret_cast<const Sample*>(source_.GetScanLine(index));
    if (in != nullptr) {
        FilterRow(in, row.samples.data());
    }
    reporter_.Report(++units_done_);
    return row.samples;
}

/// Vertical shrinking: truncating means over filtered rows.
template <typename Sample, std::size_t kChannels>
void TFastLinear<Sample, kChannels>::MeanRow(std::int32_t y) {
    const double next = std::min<double>(static_cast<double>(y) + 1, target_height_ - 1);
    const std::int32_t top = std::min(RoundHalfEven(y / scale_y_), source_height_ - 1);
    const std::int32_t bottom = std::clamp(RoundHalfEven(next / scale_y_), top, source_height_ - 1);
    if (is_fast_ && sizeof(Sample) == 1 && bottom - top < kMaxMeanLength) {
        MeanRowsFast(top, bottom);
    } else {
        MeanRows(top, bottom);
    }
}

template <typename Sample, std::size_t kChannels>
void TFastLinear<Sample, kChannels>::MeanRows(std::int32_t top, std::int32_t bottom) {
    std::fill(sums_.begin(), sums_.end(), 0);
    for (std::int32_t row = top; row <= bottom; ++row) {
        const std::vector<std::int32_t>& samples = FilteredRow(row);
        for (std::size_t i = 0; i < sums_.size(); ++i) {
            sums_[i] += samples[i];
        }
    }
    const std::int64_t count = static_cast<std::int64_t>(bottom) - top + 1;
    for (std::size_t i = 0; i < sums_.size(); ++i) {
        output_[i] = ClampSample<Sample>(static_cast<std::int32_t>(sums_[i] / count));
    }
}

/// MeanRows for bytes: the sums stay small, and the division becomes a product.
template <typename Sample, std::size_t kChannels>
void TFastLinear<Sample, kChannels>::MeanRowsFast(std::int32_t top, std::int32_t bottom) {
    fast_sums_.assign(output_.size(), 0);
    for (std::int32_t row = top; row <= bottom; ++row) {
        AddInts(FilteredRow(row).data(), fast_sums_.size(), fast_sums_.data());
    }
    if constexpr (sizeof(Sample) == 1) {
        DivideInts(fast_sums_.data(), fast_sums_.size(), TQuotient(bottom - top + 1),
                   output_.data());
    }
}

/// Vertical enlarging: a blend of two filtered rows.
template <typename Sample, std::size_t kChannels>
void TFastLinear<Sample, kChannels>::BlendRow(std::int32_t y) {
    const double position = y / scale_y_;
    const std::int32_t top = std::min(TruncToInt(position), source_height_ - 1);
    const double f = position - top;
    const std::int32_t* a = FilteredRow(top).data();
    const std::int32_t* b = FilteredRow(std::min(top + 1, source_height_ - 1)).data();
    if (is_fast_ && sizeof(Sample) == 1) {
        BlendBytes(a, b, f);
    } else {
        BlendRows(a, b, f);
    }
}

template <typename Sample, std::size_t kChannels>
void TFastLinear<Sample, kChannels>::BlendRows(const std::int32_t* a, const std::int32_t* b,
                                               double f) {
    for (std::size_t i = 0; i < output_.size(); ++i) {
        output_[i] = ClampSample<Sample>(RoundHalfEven(a[i] + (b[i] - a[i]) * f));
    }
}

/// BlendRows for bytes in single precision; blocks with a value near a tie are computed again. A
/// fraction of few bits makes that arithmetic exact; otherwise three roundings of numbers below
/// 512 lie between rows and value.
template <typename Sample, std::size_t kChannels>
void TFastLinear<Sample, kChannels>::BlendBytes(const std::int32_t* a, const std::int32_t* b,
                                                double f) {
    if constexpr (sizeof(Sample) == 1) {
        TBlendRows rows;
        rows.fraction = static_cast<float>(f);
        rows.tie_start = BitsBehindPoint(f) <= kMaxExactBits ? 0.5f : 0.5f - 0.0002f;
        for (std::size_t first = 0; first < output_.size(); first += kTieBlock) {
            const std::size_t count = std::min(kTieBlock, output_.size() - first);
            rows.upper = a + first;
            rows.lower = b + first;
            if (!BlendIntRows(rows, count, output_.data() + first)) {
                continue;
            }
            for (std::size_t i = first; i < first + count; ++i) {
                output_[i] = Clamp8(RoundHalfEven(a[i] + (b[i] - a[i]) * f));
            }
        }
    }
}

template <typename Sample, std::size_t kChannels>
void TFastLinear<Sample, kChannels>::WriteRow(std::int32_t y) {
    if (std::uint8_t* row = target_.GetScanLine(y); row != nullptr) {
        const std::size_t pixel_bytes = kChannels * sizeof(Sample);
        std::memcpy(row + static_cast<std::size_t>(rect_.left) * pixel_bytes, output_.data(),
                    output_.size() * sizeof(Sample));
    }
    reporter_.Report(++units_done_);
}

template <typename Sample, std::size_t kChannels>
void TFastLinear<Sample, kChannels>::Run() {
    for (std::int32_t y = rect_.top; y <= rect_.bottom; ++y) {
        if (scale_y_ > 1) {
            BlendRow(y);
        } else {
            MeanRow(y);
        }
        WriteRow(y);
    }
    // Rows that nothing asked for count as done.
    const std::int64_t all_units = static_cast<std::int64_t>(source_height_) + target_height_;
    while (units_done_ < all_units) {
        reporter_.Report(++units_done_);
    }
}

}  // namespace

bool ResampleFastLinear(TZmBitmap& source, TZmBitmap& target, const TRect* inclusive_rect,
                        const TResampleListener& listener, TResampleForm form) {
    if (source.IsEmpty() || target.IsEmpty()) {
        return false;
    }
    const TZmPixelFormat format = source.GetPixelFormat();
    if (format == zm1g) {
        return ResampleBitsFastLinear(source, target);
    }
    if ((format != zm24RGB && format != zm8g && format != zm16g) ||
        !FitTargetFormat(target, format)) {
        return false;
    }
    if (source.GetWidth() == target.GetWidth() && source.GetHeight() == target.GetHeight()) {
        target.AssignEx(&source, /*with_params=*/false);
    } else if (format == zm24RGB) {
        TFastLinear<std::uint8_t, 3>(source, target, inclusive_rect, listener, form).Run();
    } else if (format == zm16g) {
        TFastLinear<std::uint16_t, 1>(source, target, inclusive_rect, listener, form).Run();
    } else {
        TFastLinear<std::uint8_t, 1>(source, target, inclusive_rect, listener, form).Run();
    }
    return true;
}

}  // namespace zm
