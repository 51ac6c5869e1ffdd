// Kernel engine: a two-pass separable filter with integer weights of 8 fractional bits.
//
// The mapping aligns the first and the last pixels of source and target; there is no half-pixel
// offset. Rows are filtered horizontally into a work plane (worker threads for zm24RGB), then
// the plane vertically into the target.

#include <algorithm>
#include <array>
#include <cmath>
#include <cstdlib>
#include <cstring>
#include <memory>
#include <numbers>
#include <optional>
#include <vector>

#include "engine/foundation/zmutils_threadpool.h"
#include "engine/proc/zmresample_p.h"

namespace zm {
namespace {

// Kernels. `x` is signed: rfNearest is not symmetric.

double KernelTriangle(double x) {
    const double t = std::fabs(x);
    return t < 1 ? 1 - t : 0;
}

double KernelHermite(double x) {
    const double t = std::fabs(x);
    return t < 1 ? (2 * t - 3) * (t * t) + 1 : 0;
}

double KernelBell(double x) {
    const double t = std::fabs(x);
    if (t < 0.5) {
        return 0.75 - t * t;
    }
    return t < 1.5 ? 0.5 * ((t - 1.5) * (t - 1.5)) : 0;
}

double KernelBSpline(double x) {
    const double t = std::fabs(x);
    if (t < 1) {
        return 0.5 * (t * t * t) - t * t + 2.0 / 3;
    }
    const double u = 2 - t;
    return t < 2 ? 1.0 / 6 * (u * u * u) : 0;
}

double Sinc(double u) {
    const double angle = std::numbers::pi * u;
    return u == 0 ? 1 : std::sin(angle) / angle;
}

double KernelLanczos3(double x) {
    const double t = std::fabs(x);
    return t < 3 ? Sinc(t) * Sinc(t / 3) : 0;
}

double KernelMitchell(double x) {
    const double t = std::fabs(x);
    if (t < 1) {
        return (7 * (t * t * t) - 12 * (t * t) + 16.0 / 3) / 6;
    }
    return t < 2 ? (-(7.0 / 3) * (t * t * t) + 12 * (t * t) - 20 * t + 32.0 / 3) / 6 : 0;
}

double KernelNearest(double x) {
    return x > -0.5 && x <= 0.5 ? 1 : 0;
}

double KernelLinear(double x) {
    if (x > -1 && x < 0) {
        return 1 + x;
    }
    return x >= 0 && x < 1 ? 1 - x : 0;
}

struct TKernel {
    double (*function)(double x);
    double radius;
};

/// Indexed by TResampleFilter; rfNone has no kernel.
constexpr std::array<TKernel, 9> kKernels{{
    {nullptr, 0},
    {KernelTriangle, 1.0},
    {KernelHermite, 1.0},
    {KernelBell, 1.5},
    {KernelBSpline, 2.0},
    {KernelLanczos3, 3.0},
    {KernelMitchell, 2.0},
    {KernelNearest, 1.0},
    {KernelLinear, 1.0},
}};

/// The taps of one target column or row.
struct TCList {
    const TContributor* p = nullptr;
    std::int32_t n = 0;
    std::int32_t divisor = 256;
    const float* weights = nullptr;  ///< those of `p`
};

/// The tap lists of one direction.
class TTapTable {
public:
    TTapTable(const TKernel& kernel, std::int32_t source_size, std::int32_t target_size);
    std::int32_t Count() const { return static_cast<std::int32_t>(divisors_.size()); }
    /// Sums of bytes are whole numbers that single precision holds, and TQuotient divides them.
    bool FitsFloat() const { return fits_float_; }
    const std::vector<TQuotient>& Quotients() const { return quotients_; }
    TCList operator[](std::int32_t index) const {
        const auto i = static_cast<std::size_t>(index);
        return TCList{taps_.data() + starts_[i],
                      static_cast<std::int32_t>(starts_[i + 1] - starts_[i]), divisors_[i],
                      weights_.data() + starts_[i]};
    }

private:
    void ReserveTaps(std::int32_t target_size, double width);
    void AddTaps(const TKernel& kernel, double center, double width, double fscale);
    void AddTap(std::int64_t pixel, std::int32_t weight);
    void EndList(std::size_t list);

    std::int64_t source_size_;
    bool fits_float_ = true;
    std::vector<TContributor> taps_;
    std::vector<float> weights_;
    std::vector<TQuotient> quotients_;
    std::vector<std::size_t> starts_;
    std::vector<std::int32_t> divisors_;
};

TTapTable::TTapTable(const TKernel& kernel, std::int32_t source_size, std::int32_t target_size)
    : source_size_(source_size) {
    const bool aligned = source_size != 1 && target_size != 1;
    const double scale = aligned ? (target_size - 1.0) / (source_size - 1.0)
                                 : static_cast<double>(target_size) / source_size;
    const bool enlarging = scale >= 1;
    const double width = enlarging ? kernel.radius : kernel.radius / scale;
    const double fscale = enlarging ? 1 : 1 / scale;
    starts_ = MakeWorkBuffer<std::size_t>(static_cast<std::int64_t>(target_size) + 1);
    divisors_ = MakeWorkBuffer<std::int32_t>(target_size);
    // No kernel exceeds 1: from here on all weights round to 0.
    constexpr double kNoWeights = 512;
    if (fscale < kNoWeights) {
        ReserveTaps(target_size, width);
    }
    for (std::int32_t i = 0; i < target_size; ++i) {
        if (fscale < kNoWeights) {
            AddTaps(kernel, i / scale, width, fscale);
        }
        EndList(static_cast<std::size_t>(i));
    }
}

/// Room for all taps at once, or none at all: lists of a row at the limit take gigabytes.
void TTapTable::ReserveTaps(std::int32_t target_size, double width) {
    const std::int64_t longest = std::int64_t{TruncToInt(2 * width)} + 3;
    const std::int64_t count = target_size * longest;
    RequireWorkMemory(count, sizeof(TContributor) + sizeof(float));
    taps_.reserve(static_cast<std::size_t>(count));
    weights_.reserve(static_cast<std::size_t>(count));
}

void TTapTable::EndList(std::size_t list) {
    starts_[list + 1] = taps_.size();
    std::int32_t sum = 0;
    std::int64_t largest = 0;
    for (std::size_t tap = starts_[list]; tap < taps_.size(); ++tap) {
        sum += taps_[tap].weight;
        largest += std::abs(std::int64_t{taps_[tap].weight}) * 255;
    }
    // A sum of 0 divides by 256. (Shifting the sum right by 8 bits, as the vertical pass may be
    // told, differs for negative sums only, and those become 0.)
    divisors_[list] = sum != 0 ? sum : 256;
    quotients_.emplace_back(divisors_[list]);
    fits_float_ = fits_float_ && largest <= kMaxFloatSum && std::abs(sum) <= kMaxFloatDivisor;
}

void TTapTable::AddTaps(const TKernel& kernel, double center, double width, double fscale) {
    const auto first = static_cast<std::int64_t>(std::floor(center - width));
    const auto last = static_cast<std::int64_t>(std::ceil(center + width));
    for (std::int64_t j = first; j <= last; ++j) {
        const double x = (center - static_cast<double>(j)) / fscale;
        AddTap(j, RoundHalfEven(kernel.function(x) * 256 / fscale));
    }
}

/// Stores a tap, its pixel reflected at the edges; taps of weight 0 are dropped.
void TTapTable::AddTap(std::int64_t pixel, std::int32_t weight) {
    if (weight == 0) {
        return;
    }
    if (pixel < 0) {
        pixel = -pixel;
    } else if (pixel >= source_size_) {
        pixel = 2 * source_size_ - pixel - 1;
    }
    pixel = std::clamp<std::int64_t>(pixel, 0, source_size_ - 1);
    taps_.push_back(TContributor{static_cast<std::int32_t>(pixel), weight});
    weights_.push_back(static_cast<float>(weight));
}

template <typename Sample, std::size_t kChannels>
void FilterRow(const Sample* in, Sample* out, const TTapTable& contrib) {
    for (std::int32_t x = 0; x < contrib.Count(); ++x) {
        const TCList list = contrib[x];
        std::array<std::int32_t, kChannels> sums{};
        for (std::int32_t i = 0; i < list.n; ++i) {
            const Sample* pixel = in + static_cast<std::size_t>(list.p[i].pixel) * kChannels;
            for (std::size_t c = 0; c < kChannels; ++c) {
                sums[c] += pixel[c] * list.p[i].weight;
            }
        }
        for (std::size_t c = 0; c < kChannels; ++c) {
            *out++ = ClampSample<Sample>(sums[c] / list.divisor);
        }
    }
}

/// The tap lists as pairs of neighbouring pixels. Taps that reflection has put on one pixel are
/// joined, and gaps get weights of 0: integer sums do not change by that.
class TPairTable {
public:
    explicit TPairTable(const TTapTable& contrib);
    TPairRow Row() const {
        return TPairRow{pairs_.data(), firsts_.data(), starts_.data(), quotients_.data(),
                        starts_.size()};
    }

private:
    void AddPairs(const TCList& list);

    std::vector<std::int32_t> pairs_;
    std::vector<std::size_t> firsts_;
    std::vector<std::size_t> starts_;
    std::vector<TQuotient> quotients_;
    std::vector<std::int32_t> weights_;  ///< those of the list at hand
};

TPairTable::TPairTable(const TTapTable& contrib) : quotients_(contrib.Quotients()) {
    firsts_.reserve(quotients_.size() + 1);
    starts_.reserve(quotients_.size());
    firsts_.push_back(0);
    for (std::int32_t i = 0; i < contrib.Count(); ++i) {
        AddPairs(contrib[i]);
    }
}

void TPairTable::AddPairs(const TCList& list) {
    std::int32_t first = 0;
    std::int32_t last = -1;
    if (list.n > 0) {
        const auto [low, high] = std::minmax_element(
            list.p, list.p + list.n,
            [](const TContributor& a, const TContributor& b) { return a.pixel < b.pixel; });
        first = low->pixel & ~1;
        last = high->pixel | 1;
    }
    weights_.assign(static_cast<std::size_t>(last + 1 - first), 0);
    for (std::int32_t i = 0; i < list.n; ++i) {
        weights_[static_cast<std::size_t>(list.p[i].pixel - first)] += list.p[i].weight;
    }
    for (std::size_t i = 0; i < weights_.size(); i += 2) {
        const auto left = static_cast<std::uint16_t>(weights_[i]);
        const auto right = static_cast<std::uint32_t>(weights_[i + 1]) << 16;
        pairs_.push_back(static_cast<std::int32_t>(right | left));
    }
    starts_.push_back(static_cast<std::size_t>(first) / 2);
    firsts_.push_back(pairs_.size());
}

/// Filters rows of zm24RGB, several at a time: FilterRow's bytes, by pairs.
class TPairFilter {
public:
    TPairFilter(const TPairTable& table, std::int32_t width)
        : table_(table),
          row_bytes_(static_cast<std::size_t>(width) * 3),
          pairs_((static_cast<std::size_t>(width) + 1) / 2),
          area_(MakeWorkBuffer<std::int16_t>(AllRows(pairs_) * std::int64_t{kPairNumbers} +
                                             std::int64_t{kAlign / sizeof(std::int16_t)})),
          out_step_(table.Row().count * 3 + 1),
          out_(MakeWorkBuffer<std::uint8_t>(AllRows(out_step_) + 1)) {
        const auto address = reinterpret_cast<std::uintptr_t>(area_.data());
        aligned_ = area_.data() + (kAlign - address % kAlign) % kAlign / sizeof(std::int16_t);
    }
    /// Takes a source row into place `slot`.
    void Load(const std::uint8_t* in, std::size_t slot);
    void Filter() { FilterPairs24(table_.Row(), aligned_, out_.data(), out_step_); }
    /// Gives the filtered row of place `slot`.
    void Store(std::size_t slot, std::uint8_t* out) const {
        std::memcpy(out, out_.data() + slot * out_step_, out_step_ - 1);
    }

private:
    static constexpr std::size_t kAlign = 64;

    /// Of all rows that are filtered together; more than size_t holds is for the buffer to refuse.
    static std::int64_t AllRows(std::size_t of_one) {
        return static_cast<std::int64_t>(of_one) * static_cast<std::int64_t>(PairRowsAtOnce());
    }

    const TPairTable& table_;
    std::size_t row_bytes_;
    std::size_t pairs_;
    std::vector<std::int16_t> area_;
    std::int16_t* aligned_;
    std::size_t out_step_;
    std::vector<std::uint8_t> out_;
};

void TPairFilter::Load(const std::uint8_t* in, std::size_t slot) {
    // The last pairs are taken from a copy: a pair's reading goes two bytes beyond it.
    constexpr std::size_t kTailPairs = 2;
    const std::size_t body = pairs_ > kTailPairs ? pairs_ - kTailPairs : 0;
    SpreadPairs24(in, body, slot, aligned_);
    std::array<std::uint8_t, kTailPairs * 6 + 2> tail{};
    std::memcpy(tail.data(), in + body * 6, row_bytes_ - body * 6);
    SpreadPairs24(tail.data(), pairs_ - body, slot,
                  aligned_ + body * PairRowsAtOnce() * kPairNumbers);
}

/// A row of bytes in single precision, one channel: FilterRow's bytes.
void FilterGrayRowFast(const std::uint8_t* in, std::uint8_t* out, const TTapTable& contrib,
                       std::vector<float>& samples) {
    std::copy_n(in, samples.size(), samples.begin());
    for (std::int32_t x = 0; x < contrib.Count(); ++x) {
        const TCList list = contrib[x];
        float sum = 0;
        for (std::int32_t i = 0; i < list.n; ++i) {
            sum += list.weights[i] * samples[static_cast<std::size_t>(list.p[i].pixel)];
        }
        out[x] = TQuotient(list.divisor)(sum);
    }
}

/// The sums of one target row over the rows of the work plane.
template <typename Sample>
void SumRows(TZmBitmap& work, const TCList& list, std::vector<std::int32_t>& sums) {
    std::fill(sums.begin(), sums.end(), 0);
    for (std::int32_t i = 0; i < list.n; ++i) {
        const std::uint8_t* bytes = work.GetScanLine(list.p[i].pixel);
        if (bytes == nullptr) {
            continue;
        }
        const auto* row = reinterpret_cast<const Sample*>(bytes);
        const std::int32_t weight = list.p[i].weight;
        for (std::size_t k = 0; k < sums.size(); ++k) {
            sums[k] += row[k] * weight;
        }
    }
}

/// FilterColumns for bytes, the same bytes. The rows of a list are read side by side, so the
/// plane must not be file-backed.
template <bool kGrayToColor>
void FilterColumnsFast(TZmBitmap& work, TZmBitmap& target, const TTapTable& contrib,
                       TPercentReporter& reporter) {
    const std::int64_t count = std::int64_t{work.GetWidth()} * work.GetChannelCount();
    std::vector<std::uint8_t> gray = MakeWorkBuffer<std::uint8_t>(kGrayToColor ? count : 0);
    std::vector<const std::uint8_t*> rows;
    std::vector<float> weights;
    for (std::int32_t y = 0; y < target.GetHeight(); ++y) {
        const TCList list = contrib[y];
        rows.clear();
        weights.clear();
        for (std::int32_t i = 0; i < list.n; ++i) {
            if (const std::uint8_t* row = work.GetScanLine(list.p[i].pixel); row != nullptr) {
                rows.push_back(row);
                weights.push_back(list.weights[i]);
            }
        }
        std::uint8_t* out = target.GetScanLine(y);
        if (out == nullptr) {
            continue;
        }
        const TWeightedRows mixed{rows.data(), weights.data(), rows.size(),
                                  TQuotient(list.divisor)};
        MixByteRows(mixed, static_cast<std::size_t>(count), kGrayToColor ? gray.data() : out);
        for (const std::uint8_t value : gray) {
            out = std::fill_n(out, 3, value);
        }
        reporter.Report(static_cast<std::int64_t>(y) + work.GetHeight() + 1);
    }
}

/// The vertical pass, from the work plane to the target. With `kGrayToColor` each work sample
/// becomes the three channels of a pixel.
template <typename Sample, bool kGrayToColor>
void FilterColumns(TZmBitmap& work, TZmBitmap& target, const TTapTable& contrib,
                   TPercentReporter& reporter) {
    std::vector<std::int32_t> sums = MakeWorkBuffer<std::int32_t>(
        static_cast<std::int64_t>(work.GetWidth()) * work.GetChannelCount());
    for (std::int32_t y = 0; y < target.GetHeight(); ++y) {
        const TCList list = contrib[y];
        SumRows<Sample>(work, list, sums);
        auto* out = reinterpret_cast<Sample*>(target.GetScanLine(y));
        if (out == nullptr) {
            continue;
        }
        for (const std::int32_t sum : sums) {
            const Sample value = ClampSample<Sample>(sum / list.divisor);
            for (int copy = 0; copy < (kGrayToColor ? 3 : 1); ++copy) {
                *out++ = value;
            }
        }
        reporter.Report(static_cast<std::int64_t>(y) + work.GetHeight() + 1);
    }
}

/// What all horizontal workers share.
struct TResampleHorizSharedFields {
    std::int32_t ThreadsCount = 1;
    const TTapTable* contrib = nullptr;
    const TPairTable* pairs = nullptr;  ///< nil where the plain form is to run
    TZmBitmap* Src = nullptr;
    TZmBitmap* Work = nullptr;
    TPercentReporter* reporter = nullptr;
    /// Row addresses, taken before the workers start; empty for a single worker, which asks the
    /// images row by row.
    std::vector<const std::uint8_t*> src_rows;
    std::vector<std::uint8_t*> work_rows;
};

/// Filters a band of source rows. Only the worker with index 0 reports progress, as if the
/// others were as far.
class TResampleHorizThread : public TZmExecutor {
public:
    TResampleHorizThread(bool use_thread, std::int32_t start_y, std::int32_t row_count,
                         std::int32_t thread_index, const TResampleHorizSharedFields& shared)
        : TZmExecutor(use_thread),
          shared_(shared),
          start_y_(start_y),
          row_count_(row_count),
          thread_index_(thread_index) {}

    void Execute() override {
        if (shared_.pairs != nullptr) {
            FilterByPairs(*shared_.pairs);
            return;
        }
        for (std::int32_t y = start_y_; y < start_y_ + row_count_; ++y) {
            const std::uint8_t* in = SourceRow(y);
            std::uint8_t* out = WorkRow(y);
            if (in != nullptr && out != nullptr) {
                FilterRow<std::uint8_t, 3>(in, out, *shared_.contrib);
            }
            Report(y);
        }
    }

private:
    void FilterByPairs(const TPairTable& pairs) {
        TPairFilter filter(pairs, shared_.Src->GetWidth());
        const auto at_once = static_cast<std::int32_t>(PairRowsAtOnce());
        const std::int32_t end = start_y_ + row_count_;
        for (std::int32_t first = start_y_; first < end; first += at_once) {
            const std::int32_t stop = std::min(first + at_once, end);
            for (std::int32_t y = first; y < stop; ++y) {
                if (const std::uint8_t* in = SourceRow(y); in != nullptr) {
                    filter.Load(in, static_cast<std::size_t>(y - first));
                }
            }
            filter.Filter();
            for (std::int32_t y = first; y < stop; ++y) {
                if (std::uint8_t* out = WorkRow(y); out != nullptr) {
                    filter.Store(static_cast<std::size_t>(y - first), out);
                }
                Report(y);
            }
        }
    }
    const std::uint8_t* SourceRow(std::int32_t y) const {
        return shared_.src_rows.empty() ? shared_.Src->GetScanLine(y)
                                        : shared_.src_rows[static_cast<std::size_t>(y)];
    }
    std::uint8_t* WorkRow(std::int32_t y) const {
        return shared_.work_rows.empty() ? shared_.Work->GetScanLine(y)
                                         : shared_.work_rows[static_cast<std::size_t>(y)];
    }
    void Report(std::int32_t y) const {
        if (thread_index_ == 0) {
            shared_.reporter->Report(static_cast<std::int64_t>(shared_.ThreadsCount) * y + 1);
        }
    }

    const TResampleHorizSharedFields& shared_;
    std::int32_t start_y_;
    std::int32_t row_count_;
    std::int32_t thread_index_;
};

/// One worker for images whose rows cannot be addressed at the same time.
std::int32_t CountThreads(TZmBitmap& source, TZmBitmap& work) {
    if (source.GetLocation() == zmFile || work.GetLocation() == zmFile || source.GetIsVirtual()) {
        return 1;
    }
    return std::max(1, ZmThreadsForSize(source.GetWidth(), source.GetHeight()));
}

void CollectRows(TResampleHorizSharedFields& shared) {
    for (std::int32_t y = 0; y < shared.Src->GetHeight(); ++y) {
        shared.src_rows.push_back(shared.Src->GetScanLine(y));
        shared.work_rows.push_back(shared.Work->GetScanLine(y));
    }
}

void FilterRowsOfColor(TZmBitmap& source, TZmBitmap& work, const TTapTable& contrib,
                       TResampleForm form, TPercentReporter& reporter) {
    TResampleHorizSharedFields shared;
    shared.ThreadsCount = CountThreads(source, work);
    shared.contrib = &contrib;
    std::optional<TPairTable> pairs;
    if (form == TResampleForm::kFast && contrib.FitsFloat()) {
        pairs.emplace(contrib);
        shared.pairs = &*pairs;
    }
    shared.Src = &source;
    shared.Work = &work;
    shared.reporter = &reporter;
    const bool use_thread = shared.ThreadsCount >= 2;
    if (use_thread) {
        CollectRows(shared);
    }
    const std::int32_t rows = source.GetHeight() / shared.ThreadsCount;
    TZmThreadPool pool;
    for (std::int32_t i = 0; i < shared.ThreadsCount; ++i) {
        const bool is_last = i == shared.ThreadsCount - 1;
        const std::int32_t count = is_last ? source.GetHeight() - rows * i : rows;
        pool.Add(std::make_unique<TResampleHorizThread>(use_thread, rows * i, count, i, shared));
    }
    pool.Join();
}

/// The horizontal pass of the one-channel forms, on the calling thread. A zm1g source gives
/// samples of 0 and 255.
template <typename Sample>
void FilterRowsOfGray(TZmBitmap& source, TZmBitmap& work, const TTapTable& contrib,
                      TResampleForm form, TPercentReporter& reporter) {
    const bool bits = source.GetPixelFormat() == zm1g;
    const bool is_fast = form == TResampleForm::kFast && contrib.FitsFloat();
    std::vector<float> numbers = MakeWorkBuffer<float>(is_fast ? source.GetWidth() : 0);
    std::vector<Sample> unpacked(bits ? static_cast<std::size_t>(source.GetWidth()) : 0);
    for (std::int32_t y = 0; y < source.GetHeight(); ++y) {
        const std::uint8_t* in = source.GetScanLine(y);
        std::uint8_t* out = work.GetScanLine(y);
        if (in == nullptr || out == nullptr) {
            continue;
        }
        for (std::size_t x = 0; x < unpacked.size(); ++x) {
            unpacked[x] = (in[x >> 3] >> (7 - (x & 7)) & 1) != 0 ? 255 : 0;
        }
        const auto* samples = bits ? unpacked.data() : reinterpret_cast<const Sample*>(in);
        if constexpr (sizeof(Sample) == 1) {
            if (is_fast) {
                FilterGrayRowFast(samples, out, contrib, numbers);
                reporter.Report(static_cast<std::int64_t>(y) + 1);
                continue;
            }
        }
        FilterRow<Sample, 1>(samples, reinterpret_cast<Sample*>(out), contrib);
        reporter.Report(static_cast<std::int64_t>(y) + 1);
    }
}

/// Format of the work plane; the target's too, but for zm1g, which gives colour.
TZmPixelFormat WorkFormat(TZmPixelFormat source_format) {
    return source_format == zm1g ? zm8g : source_format;
}

void FilterAllRows(TZmBitmap& source, TZmBitmap& work, const TTapTable& columns, TResampleForm form,
                   TPercentReporter& reporter) {
    switch (source.GetPixelFormat()) {
        case zm24RGB: FilterRowsOfColor(source, work, columns, form, reporter); break;
        case zm16g: FilterRowsOfGray<std::uint16_t>(source, work, columns, form, reporter); break;
        default: FilterRowsOfGray<std::uint8_t>(source, work, columns, form, reporter); break;
    }
}

void FilterAllColumns(TZmPixelFormat format, TZmBitmap& work, TZmBitmap& target,
                      const TTapTable& rows, TResampleForm form, TPercentReporter& reporter) {
    const bool fast =
        form == TResampleForm::kFast && rows.FitsFloat() && work.GetLocation() != zmFile;
    if (format == zm16g) {
        FilterColumns<std::uint16_t, false>(work, target, rows, reporter);
    } else if (format == zm1g && fast) {
        FilterColumnsFast<true>(work, target, rows, reporter);
    } else if (format == zm1g) {
        FilterColumns<std::uint8_t, true>(work, target, rows, reporter);
    } else if (fast) {
        FilterColumnsFast<false>(work, target, rows, reporter);
    } else {
        FilterColumns<std::uint8_t, false>(work, target, rows, reporter);
    }
}

}  // namespace

bool ResampleKernel(TZmBitmap& source, TZmBitmap& target, TResampleFilter filter,
                    const TResampleListener& listener, TResampleForm form) {
    const TZmPixelFormat format = source.GetPixelFormat();
    const bool known = format == zm24RGB || format == zm8g || format == zm16g || format == zm1g;
    if (!known || filter < rfTriangle || filter > rfLinear || source.IsEmpty() ||
        target.IsEmpty() || !FitTargetFormat(target, format == zm1g ? zm24RGB : format)) {
        return false;
    }
    const TKernel& kernel = kKernels[filter];
    const double per1 = 100 / (static_cast<double>(target.GetWidth()) + source.GetHeight() + 0.5);
    TZmBitmap work;
    if (!work.Allocate(target.GetWidth(), source.GetHeight(), WorkFormat(format))) {
        return false;
    }
    TPercentReporter reporter(listener, per1);
    {
        const TTapTable columns(kernel, source.GetWidth(), target.GetWidth());
        FilterAllRows(source, work, columns, form, reporter);
    }
    const TTapTable rows(kernel, source.GetHeight(), target.GetHeight());
    FilterAllColumns(format, work, target, rows, form, reporter);
    return true;
}

}  // namespace zm
