#pragma once

#include <algorithm>
#include <cstddef>
#include <cstdint>
#include <type_traits>
#include <vector>

#include "engine/bitmap/zmxBitmaps.h"
#include "engine/foundation/zmdefs.h"
#include "engine/foundation/zmnumbers.h"

/// The engines behind the resampling dispatcher, for it and the tests.
///
/// Common rules: both images have a size, and `source` is not `target`. A target whose format
/// does not fit is allocated anew in the engine's own. False when there is no room for that or
/// the formats do not apply; the target's pixels are then undefined. No engine changes `source`.
/// Each image is read or written one row at a time, so that file-backed images work.
namespace zm {

/// Who hears of the progress of an operation.
struct TResampleListener {
    void* sender = nullptr;
    TZmBitmapProgressEvent on_progress;
};

/// Reports Trunc(units * per_unit) to a listener whenever that number changes.
class TPercentReporter {
public:
    TPercentReporter(const TResampleListener& listener, double per_unit)
        : listener_(listener), per_unit_(per_unit) {}
    void Report(std::int64_t units) {
        if (!listener_.on_progress) {
            return;
        }
        const std::int32_t percent = TruncToInt(static_cast<double>(units) * per_unit_);
        if (percent != percentage_) {
            percentage_ = percent;
            listener_.on_progress(listener_.sender, percent);
        }
    }

private:
    const TResampleListener& listener_;
    double per_unit_;
    std::int32_t percentage_ = 0;
};

/// Sets the data access of an image for the duration of a scope.
class TAccessGuard {
public:
    TAccessGuard(TZmBitmap& bitmap, TZmDataAccess access) : bitmap_(bitmap), old_(bitmap.fAccess) {
        bitmap_.fAccess = access;
    }
    ~TAccessGuard() { bitmap_.fAccess = old_; }
    TAccessGuard(const TAccessGuard&) = delete;
    TAccessGuard& operator=(const TAccessGuard&) = delete;

private:
    TZmBitmap& bitmap_;
    TZmDataAccess old_;
};

/// A zero-filled work buffer. Raises std::bad_alloc for a count that the address space, or the
/// memory of the machine, cannot hold, before the system would start to swap for it.
template <typename T>
std::vector<T> MakeWorkBuffer(std::int64_t count);
void RequireWorkMemory(std::int64_t count, std::int64_t element_bytes);

template <typename T>
std::vector<T> MakeWorkBuffer(std::int64_t count) {
    RequireWorkMemory(count, static_cast<std::int64_t>(sizeof(T)));
    return std::vector<T>(static_cast<std::size_t>(count));
}

/// A value limited to the range of an 8-bit or 16-bit sample.
template <typename Sample>
constexpr Sample ClampSample(std::int32_t value) {
    if constexpr (std::is_same_v<Sample, std::uint8_t>) {
        return Clamp8(value);
    } else {
        return Clamp16(value);
    }
}

/// Within these limits a sum of bytes times weights, and half more, is exact in single precision,
/// and TQuotient right.
inline constexpr std::int64_t kMaxFloatSum = 1 << 22;
inline constexpr std::int32_t kMaxFloatDivisor = 8192;

/// The truncated quotient by a divisor, limited to a byte, as a product. Half a unit away from
/// zero keeps whole quotients off the rounding: the exact value then lies 0.5 / divisor or more
/// from an integer, that is 6e-5, and the product's error is below 256 / 2^23, that is 3.1e-5.
/// Larger quotients are limited, and so are all of the other sign.
class TQuotient {
public:
    explicit TQuotient(std::int32_t divisor)
        : half_(divisor < 0 ? -0.5f : 0.5f), reciprocal_(1.0f / static_cast<float>(divisor)) {}
    float Half() const { return half_; }
    float Reciprocal() const { return reciprocal_; }
    std::uint8_t operator()(float sum) const {
        const float value = (sum + half_) * reciprocal_;
        return static_cast<std::uint8_t>(
            static_cast<std::int32_t>(std::min(std::max(value, 0.0f), 255.0f)));
    }

private:
    float half_;
    float reciprocal_;
};

/// Rounds to the nearest integer, ties to even, values within 2^22 for float and 2^31 for
/// double: beyond the shift there is
/// no fraction left.
inline float RoundToWhole(float value) {
    constexpr float kShift = 12582912.0f;
    return (value + kShift) - kShift;
}
inline double RoundToWhole(double value) {
    constexpr double kShift = 6755399441055744.0;
    return (value + kShift) - kShift;
}

/// Samples that are checked for ties at a time.
inline constexpr std::size_t kTieBlock = 256;

/// Bits behind the point that a value may have to count as exact.
inline constexpr int kMaxExactBits = 10;
/// Bits behind the point of a value; a large number when it has more than kMaxExactBits.
int BitsBehindPoint(double value);

/// Gives a new bitmap, which is to replace the image of `owner` or to stand beside it, the place
/// settings of `owner`. The image of a platform bitmap is made in memory.
void TakePlaceSettings(TZmBitmap& owner, TZmBitmap& result);

/// Brings a target into a format, keeping its size; the pixels are then undefined.
[[nodiscard]] bool FitTargetFormat(TZmBitmap& target, TZmPixelFormat format);

/// Copies the nearest sample, every pixel format; target format that of the source.
[[nodiscard]] bool ResampleNearest(TZmBitmap& source, TZmBitmap& target);

/// How the area engine reads between samples.
enum class TAreaInterpolation : std::uint8_t { kLinear, kCubic };

/// Area interpolation of rfBilinear and rfBicubic: equal formats, zm8g, zm24RGB, zm32RGB (8-bit
/// samples), zm16g, zm48RGB (16-bit samples). `alpha`: a zm8g plane of the source's size, or nil;
/// 8-bit samples only. Takes a fast form where there is one.
[[nodiscard]] bool ResampleArea(TZmBitmap& source, TZmBitmap& target, TZmBitmap* alpha,
                                TAreaInterpolation interpolation,
                                const TResampleListener& listener);

/// The plain form of ResampleArea: the law that the fast forms are measured against.
[[nodiscard]] bool ResampleAreaPlain(TZmBitmap& source, TZmBitmap& target, TZmBitmap* alpha,
                                     TAreaInterpolation interpolation,
                                     const TResampleListener& listener);

/// Whether a fast form stands for the plain one here: everywhere but for zm32RGB enlarged linearly
/// both ways.
bool HasFastArea(TZmBitmap& source, TZmBitmap& target, TAreaInterpolation interpolation);
/// The fast form; gives the same bytes. Only where HasFastArea says so.
[[nodiscard]] bool ResampleAreaFast(TZmBitmap& source, TZmBitmap& target, TZmBitmap* alpha,
                                    TAreaInterpolation interpolation,
                                    const TResampleListener& listener);

/// The plain form of an engine, with its divisions, or the fast one with the same bytes.
enum class TResampleForm : std::uint8_t { kPlain, kFast };

/// Two-pass separable filter with integer weights, rfTriangle to rfLinear: zm24RGB (worker
/// threads), zm8g, zm16g to the same format and zm1g to zm24RGB.
[[nodiscard]] bool ResampleKernel(TZmBitmap& source, TZmBitmap& target, TResampleFilter filter,
                                  const TResampleListener& listener,
                                  TResampleForm form = TResampleForm::kFast);

/// Integer-plane linear filter, shrinking by means: zm24RGB, zm8g, zm16g to the same format and
/// zm1g to zm24RGB. `inclusive_rect` limits the target pixels computed; nil, or one with right
/// and bottom -1, means all. (A zm1g source computes all in any case.)
[[nodiscard]] bool ResampleFastLinear(TZmBitmap& source, TZmBitmap& target,
                                      const TRect* inclusive_rect,
                                      const TResampleListener& listener,
                                      TResampleForm form = TResampleForm::kFast);

/// One tap of a kernel.
struct TContributor {
    std::int32_t pixel = 0;   ///< source coordinate, inside the image
    std::int32_t weight = 0;  ///< 256 is 1.0
};

/// The taps of a row of target pixels as pairs of neighbouring source pixels: those of pixel x
/// are `pairs` firsts[x] up to firsts[x + 1], the first of them starts[x] pairs from the left.
/// A pair holds two weights of 16 bits, that of the left pixel low.
struct TPairRow {
    const std::int32_t* pairs = nullptr;
    const std::size_t* firsts = nullptr;
    const std::size_t* starts = nullptr;
    const TQuotient* quotients = nullptr;
    std::size_t count = 0;
};
/// Rows that FilterPairs24 filters together, 1 to kMaxPairRows: the more, the wider the vectors.
inline constexpr std::size_t kMaxPairRows = 4;
std::size_t PairRowsAtOnce();
/// Numbers that a pair of pixels takes in the work area: three pairs of samples and two zeros.
inline constexpr std::size_t kPairNumbers = 8;
/// Lays out row `slot` of the rows that are filtered together: `pairs` pairs of three-byte
/// pixels. Reads two bytes behind the last pair.
void SpreadPairs24(const std::uint8_t* in, std::size_t pairs, std::size_t slot, std::int16_t* area);
/// Filters the rows laid out in `area`, which starts at a multiple of 64 bytes; row i goes to
/// `out` + i * `out_step`, with one byte written behind the last pixel. Exact within kMaxFloatSum.
void FilterPairs24(const TPairRow& row, const std::int16_t* area, std::uint8_t* out,
                   std::size_t out_step);

/// Rows of bytes with their weights, and the divisor of the weighted sum.
struct TWeightedRows {
    const std::uint8_t* const* rows = nullptr;
    const float* weights = nullptr;
    std::size_t row_count = 0;
    TQuotient quotient;
};
/// out = the rows' weighted sum, divided and limited. Exact within kMaxFloatSum.
void MixByteRows(const TWeightedRows& rows, std::size_t count, std::uint8_t* out);

/// A span of source columns, with the reciprocal of its length.
struct TMeanSpan {
    std::int32_t left = 0;
    std::int32_t count = 0;
    float reciprocal = 0;
};
/// Truncating means of spans of three-byte pixels, of kMaxFloatDivisor pixels at most. Reads one
/// byte behind the last span and writes one number behind the last mean.
void MeanSpans24(const std::uint8_t* in, const TMeanSpan* spans, std::size_t count,
                 std::int32_t* out);

/// Longest window whose mean is a product with MeanFactor.
inline constexpr std::size_t kMaxWindow = 9;
static_assert(255 * kMaxWindow * kMaxWindow < 65536);

/// Short spans of three-byte pixels, of `longest` or one pixel less. For each its place in the row,
/// from where 16 bytes can be read; the factor of its mean, four times over; and which bytes stand
/// for its last pair of pixels, the first of which is pixel (longest - 1) / 2 * 2.
struct TShortSpans {
    const std::uint32_t* places = nullptr;
    const std::uint32_t* factors = nullptr;
    const std::uint8_t* last_pairs = nullptr;
    std::size_t longest = 0;
    std::size_t count = 0;
};
/// Longest span that 16 bytes hold.
inline constexpr std::size_t kMaxShortSpan = 5;
/// Bytes of `last_pairs` for a span.
inline constexpr std::size_t kPairBytes = 16;
/// Numbers that MeanShortSpans24 may write behind the last mean.
inline constexpr std::size_t kMeanPadding = 16;
/// Whether this processor moves bytes about inside vectors.
bool HasShortSpans();
/// Truncating means of the first spans; returns how many.
std::size_t MeanShortSpans24(const std::uint8_t* in, const TShortSpans& spans, std::int32_t* out);
/// Factor of a mean of `length` numbers of 8 bits, at most kMaxWindow of them: the upper half of
/// the product with their sum is the truncated quotient. It is 65536 / length rounded up, less
/// than `length` too much a unit, so that a quotient is too large by less than
/// 255 * length^2 / 65536 / length, which is below the 1 / length that would reach the next
/// integer.
constexpr std::uint16_t MeanFactor(std::size_t length) {
    return static_cast<std::uint16_t>((65535 + length) / length);
}

/// Means of all the windows of a row: of `shortest` pixels and, if `longest` is one more, of
/// that too. Lengths are 2 to kMaxWindow; a pixel is `step` bytes.
struct TMeanWindows {
    std::size_t step = 0;
    std::size_t shortest = 0;
    std::size_t longest = 0;
};
/// Bytes that a row must have for MeanWindowsOfRow.
inline constexpr std::size_t kMinWindowRow = 128;
/// out[i] = the truncating mean of the window that starts with in[i]; the longer windows follow
/// at out[bytes + i]. Windows that the longest does not fit behind are left out.
void MeanWindowsOfRow(const std::uint8_t* in, std::size_t bytes, const TMeanWindows& windows,
                      std::uint8_t* out);
/// Four numbers from each place, the next ones over the fourth: three-byte pixels gathered.
void PickPixels24(const std::uint8_t* in, const std::uint32_t* places, std::size_t count,
                  std::int32_t* out);

/// sums += numbers.
void AddInts(const std::int32_t* numbers, std::size_t count, std::int32_t* sums);
/// Sums within kMaxFloatSum, divided.
void DivideInts(const std::int32_t* sums, std::size_t count, const TQuotient& quotient,
                std::uint8_t* out);

/// Two rows of integers of -1024 to 1024 and a fraction between them.
struct TBlendRows {
    const std::int32_t* upper = nullptr;
    const std::int32_t* lower = nullptr;
    float fraction = 0;
    float tie_start = 0.5f;
};
/// Writes blended, rounded and limited samples; true when a value lies further than `tie_start`
/// from its integer.
bool BlendIntRows(const TBlendRows& rows, std::size_t count, std::uint8_t* out);

/// The zm1g form of ResampleFastLinear.
[[nodiscard]] bool ResampleBitsFastLinear(TZmBitmap& source, TZmBitmap& target);
/// zm1g to zm24RGB greys, shrinking: the share of set bits in each target pixel's footprint.
[[nodiscard]] bool ReduceBits(TZmBitmap& source, TZmBitmap& target);

/// rfProjectBW and rfProjectWB: zm24RGB or zm1g to zm1g, keeping black (white) features.
[[nodiscard]] bool ResampleProjection(TZmBitmap& source, TZmBitmap& target, TResampleFilter filter);

/// Whether the platform's scaler is asked first, or ours does all.
enum class TScalerChoice : std::uint8_t { kPlatform, kOwn };
/// rfWICNearestNeighbor, rfWICLinear, rfWICCubic, rfWICFant: every format to itself, but zm1g
/// and zm8p to zm24RGB.
[[nodiscard]] bool ResampleScaler(TZmBitmap& source, TZmBitmap& target, TResampleFilter filter,
                                  TScalerChoice choice = TScalerChoice::kPlatform);

}  // namespace zm
