// The scaler behind the four rfWIC filters: the platform's where it has one. Elsewhere, and for
// zmCIELab, whose signed channels platforms do not know, it is our own choice:
//   rfWICNearestNeighbor  the sample whose cell holds the target pixel's centre
//   rfWICLinear           linear between the two samples around the centre
//   rfWICCubic            four-point cubic (Catmull-Rom) around the centre
//   rfWICFant             average over the target pixel's footprint, both ways
// Pixels are cells there and their centres are aligned, unlike in the other engines. Each channel
// is filtered by itself in double precision, first down the columns, then along the row; only
// rfWICFant takes more than four source pixels along an axis.

#include <algorithm>
#include <cmath>
#include <cstring>
#include <optional>
#include <vector>

#include "engine/platform/imagescaler.h"
#include "engine/proc/zmresample_p.h"

namespace zm {
namespace {

struct TScalerTap {
    std::int32_t pixel = 0;
    double weight = 0;
};

/// Taps of one target pixel along an axis; weights add up to 1 but for rounding.
using TScalerTaps = std::vector<TScalerTap>;

double CatmullRom(double x) {
    const double t = std::fabs(x);
    if (t < 1) {
        return (1.5 * t - 2.5) * t * t + 1;
    }
    return t < 2 ? ((-0.5 * t + 2.5) * t - 4) * t + 2 : 0;
}

/// How one axis is sampled.
class TScalerAxis {
public:
    TScalerAxis(TResampleFilter filter, std::int32_t source_size, std::int32_t target_size)
        : filter_(filter),
          last_(source_size - 1),
          step_(static_cast<double>(source_size) / target_size) {}

    void FindTaps(std::int32_t index, TScalerTaps& taps) const {
        taps.clear();
        switch (filter_) {
            case rfWICNearestNeighbor: Add(taps, TruncToInt((index + 0.5) * step_), 1); break;
            case rfWICLinear: FindLinear((index + 0.5) * step_ - 0.5, taps); break;
            case rfWICCubic: FindCubic((index + 0.5) * step_ - 0.5, taps); break;
            default: FindArea(index * step_, (index + 1.0) * step_, taps); break;
        }
    }

private:
    void Add(TScalerTaps& taps, std::int32_t pixel, double weight) const {
        taps.push_back(TScalerTap{std::clamp(pixel, 0, last_), weight});
    }

    void FindLinear(double position, TScalerTaps& taps) const {
        const double base = std::floor(position);
        const double fraction = position - base;
        Add(taps, TruncToInt(base), 1 - fraction);
        if (fraction > 0) {
            Add(taps, TruncToInt(base + 1), fraction);
        }
    }

    void FindCubic(double position, TScalerTaps& taps) const {
        const double base = std::floor(position);
        for (int k = -1; k <= 2; ++k) {
            Add(taps, TruncToInt(base + k), CatmullRom(position - (base + k)));
        }
    }

    void FindArea(double start, double end, TScalerTaps& taps) const {
        const std::int32_t first = std::min(TruncToInt(start), last_);
        const std::int32_t limit = std::min(TruncToInt(std::ceil(end)), last_ + 1);
        for (std::int32_t pixel = first; pixel < limit || pixel == first; ++pixel) {
            const double from = std::max(start, static_cast<double>(pixel));
            const double to = std::min(end, static_cast<double>(pixel) + 1);
            Add(taps, pixel, (to - from) / step_);
        }
    }

    TResampleFilter filter_;
    std::int32_t last_;
    double step_;
};

/// How the channels of a format lie in memory.
enum TSampleKind : std::uint8_t { kBytes, kLab, kWords, kFloats };

TSampleKind SampleKind(TZmPixelFormat format) {
    switch (format) {
        case zmCIELab: return kLab;
        case zm16g:
        case zm48RGB: return kWords;
        case zm32f: return kFloats;
        default: return kBytes;
    }
}

template <typename Sample>
Sample ReadSample(const std::uint8_t* row, std::size_t index) {
    Sample sample;
    std::memcpy(&sample, row + index * sizeof(Sample), sizeof(Sample));
    return sample;
}

double SampleValue(const std::uint8_t* row, std::size_t index, TSampleKind kind) {
    switch (kind) {
        case kLab: return index % 3 == 0 ? row[index] : ReadSample<std::int8_t>(row, index);
        case kWords: return ReadSample<std::uint16_t>(row, index);
        case kFloats: return static_cast<double>(ReadSample<float>(row, index));
        default: return row[index];
    }
}

template <typename Sample>
void PutSample(std::uint8_t* row, std::size_t index, Sample value) {
    std::memcpy(row + index * sizeof(Sample), &value, sizeof(Sample));
}

void StoreSample(std::uint8_t* row, std::size_t index, TSampleKind kind, double value) {
    switch (kind) {
        case kLab:
            if (index % 3 != 0) {
                const std::int32_t rounded = RoundHalfEven(value);
                PutSample(row, index, static_cast<std::int8_t>(std::clamp(rounded, -128, 127)));
                break;
            }
            row[index] = Clamp8(RoundHalfEven(value));
            break;
        case kWords: PutSample(row, index, Clamp16(RoundHalfEven(value))); break;
        case kFloats: PutSample(row, index, static_cast<float>(value)); break;
        default: row[index] = Clamp8(RoundHalfEven(value)); break;
    }
}

class TScaler {
public:
    TScaler(TZmBitmap& source, TZmBitmap& target, TResampleFilter filter)
        : source_(source),
          target_(target),
          columns_(filter, source.GetWidth(), target.GetWidth()),
          rows_(filter, source.GetHeight(), target.GetHeight()),
          kind_(SampleKind(source.GetPixelFormat())),
          channels_(static_cast<std::size_t>(source.GetChannelCount())),
          sums_(MakeWorkBuffer<double>(static_cast<std::int64_t>(source.GetWidth()) *
                                       source.GetChannelCount())) {}

    void Run() {
        TScalerTaps taps;
        for (std::int32_t y = 0; y < target_.GetHeight(); ++y) {
            rows_.FindTaps(y, taps);
            SumRows(taps);
            if (std::uint8_t* out = target_.GetScanLine(y); out != nullptr) {
                WriteRow(out, taps);
            }
        }
    }

private:
    void SumRows(const TScalerTaps& taps) {
        std::fill(sums_.begin(), sums_.end(), 0.0);
        for (const TScalerTap& tap : taps) {
            const std::uint8_t* row = source_.GetScanLine(tap.pixel);
            if (row == nullptr) {
                continue;
            }
            for (std::size_t i = 0; i < sums_.size(); ++i) {
                sums_[i] += SampleValue(row, i, kind_) * tap.weight;
            }
        }
    }

    void WriteRow(std::uint8_t* out, TScalerTaps& taps) {
        for (std::int32_t x = 0; x < target_.GetWidth(); ++x) {
            columns_.FindTaps(x, taps);
            for (std::size_t channel = 0; channel < channels_; ++channel) {
                double value = 0;
                for (const TScalerTap& tap : taps) {
                    value += sums_[static_cast<std::size_t>(tap.pixel) * channels_ + channel] *
                             tap.weight;
                }
                StoreSample(out, static_cast<std::size_t>(x) * channels_ + channel, kind_, value);
            }
        }
    }

    TZmBitmap& source_;
    TZmBitmap& target_;
    TScalerAxis columns_;
    TScalerAxis rows_;
    TSampleKind kind_;
    std::size_t channels_;
    std::vector<double> sums_;
};

/// How the platform's scaler takes a format; nothing where it does not.
std::optional<platform::TScalerLayout> PlatformLayout(TZmPixelFormat format) {
    switch (format) {
        case zm8g: return platform::TScalerLayout::kOneByte;
        case zm16g: return platform::TScalerLayout::kOneWord;
        case zm24RGB: return platform::TScalerLayout::kThreeBytes;
        case zm32f: return platform::TScalerLayout::kOneFloat;
        case zmCMYK:
        case zm32RGB: return platform::TScalerLayout::kFourBytes;
        case zm48RGB: return platform::TScalerLayout::kThreeWords;
        default: return std::nullopt;
    }
}

/// Both images in the format.
bool ScaleByPlatform(TZmBitmap& source, TZmBitmap& target, TResampleFilter filter) {
    const auto layout = PlatformLayout(source.GetPixelFormat());
    if (!layout) {
        return false;
    }
    platform::TScalerRequest request;
    request.layout = *layout;
    request.mode = static_cast<platform::TScalerMode>(filter - rfWICNearestNeighbor);
    request.source_width = source.GetWidth();
    request.source_height = source.GetHeight();
    request.target_width = target.GetWidth();
    request.target_height = target.GetHeight();
    request.source_row = [&source](std::int32_t y) { return source.GetScanLine(y); };
    request.target_row = [&target](std::int32_t y) { return target.GetScanLine(y); };
    return platform::ScaleImage(request);
}

/// Palette indices and bits cannot be averaged: such an image goes through zm24RGB.
bool ScaleAsColor(TZmBitmap& source, TZmBitmap& target, TResampleFilter filter,
                  TScalerChoice choice) {
    TZmBitmap colors;
    if (!colors.Allocate(source.GetWidth(), source.GetHeight(), zm24RGB)) {
        return false;
    }
    colors.CopyAndConvertFormat(&source);
    return ResampleScaler(colors, target, filter, choice);
}

}  // namespace

bool ResampleScaler(TZmBitmap& source, TZmBitmap& target, TResampleFilter filter,
                    TScalerChoice choice) {
    if (source.IsEmpty() || target.IsEmpty()) {
        return false;
    }
    const TZmPixelFormat format = source.GetPixelFormat();
    if (format == zm8p || format == zm1g) {
        return ScaleAsColor(source, target, filter, choice);
    }
    if (!FitTargetFormat(target, format)) {
        return false;
    }
    if (choice == TScalerChoice::kOwn || !ScaleByPlatform(source, target, filter)) {
        TScaler(source, target, filter).Run();
    }
    return true;
}

}  // namespace zm
