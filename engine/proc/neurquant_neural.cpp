// The neural palette: neurons on a line compete for each sampled colour; the winner and, while
// the radius lasts, its neighbours move toward it. A bias gives neurons that seldom win a better
// chance.

#include <algorithm>
#include <cstddef>
#include <cstdlib>
#include <utility>

#include "engine/bitmap/zmrgbrows.h"
#include "engine/foundation/zmassert.h"
#include "engine/foundation/zmnumbers.h"
#include "engine/proc/neurquant_p.h"

namespace zm {
namespace {

constexpr std::int32_t kColorBits = 4;        // fraction of a channel
constexpr std::int32_t kInitialFreq = 65536;  // shared by all neurons
constexpr std::int32_t kFreqStep = 64;
constexpr std::int32_t kBiasStep = 65536;
constexpr std::int32_t kInitialAlpha = 1024;  // stands for 1
constexpr std::int32_t kRadiusShift = 6;
constexpr std::int32_t kRadiusDecay = 30;
constexpr std::int32_t kMaxNeurons = 1024;
constexpr std::int64_t kMinPixelsToSkip = 2000;

std::size_t At(std::int32_t index) {
    return static_cast<std::size_t>(index);
}

std::size_t WholeBlocks(std::int32_t neuron_count) {
    return (At(neuron_count) + kContestBlock - 1) / kContestBlock * kContestBlock;
}

// Where the samples are taken: a walk by a step that shares no factor with the image's size.
class TSampler {
public:
    explicit TSampler(TZmBitmap& source)
        : pixels_(source),
          width_(source.GetWidth()),
          height_(source.GetHeight()),
          total_(std::int64_t{width_} * height_),
          step_(NeuralStep(total_)) {}

    std::int64_t Total() const { return total_; }
    TRGB Next() {
        if (next_ == ahead_.size()) {
            std::generate(ahead_.begin(), ahead_.end(), [this] { return Read(); });
            next_ = 0;
        }
        return ahead_[next_++];
    }

private:
    TRGB Read() {
        // An image smaller than the step is left behind by the walk: the row wraps.
        const auto y = static_cast<std::int32_t>(position_ / width_ % height_);
        const auto x = static_cast<std::int32_t>(position_ % width_);
        position_ += step_;
        if (position_ >= total_) {
            position_ -= total_;
        }
        return pixels_.GetPixel(x, y);
    }

    TZmRgbRows pixels_;
    std::int32_t width_;
    std::int32_t height_;
    std::int64_t total_;
    std::int32_t step_;
    std::int64_t position_ = 0;
    // Pixels far apart wait for memory; read one after the other, many do so at the same time.
    std::array<TRGB, 64> ahead_{};
    std::size_t next_ = ahead_.size();
};

}  // namespace

TContestResult RunContestPlain(const TContestView& neurons, std::int32_t b, std::int32_t g,
                               std::int32_t r) {
    TContestResult result;
    std::int32_t least_distance = kMaxInt32;
    std::int32_t least_biased = kMaxInt32;
    for (std::size_t i = 0; i < neurons.count; ++i) {
        const std::int32_t distance = std::abs(neurons.blue[i] - b) +
                                      std::abs(neurons.green[i] - g) + std::abs(neurons.red[i] - r);
        if (distance < least_distance) {
            least_distance = distance;
            result.closest = static_cast<std::int32_t>(i);
        }
        const std::int32_t biased = distance - (neurons.bias[i] >> kBiasShift);
        if (biased < least_biased) {
            least_biased = biased;
            result.winner = static_cast<std::int32_t>(i);
        }
        const std::int32_t decay = neurons.freq[i] >> kBetaShift;
        neurons.freq[i] -= decay;
        neurons.bias[i] += decay << kBetaShift;
    }
    return result;
}

std::int32_t NeuralSamplingFactor(std::int32_t quality, std::int64_t pixel_count) {
    constexpr std::int32_t kMaxFactor = 30;
    if (quality != -1) {
        const std::int32_t factor = TruncToInt((100.0 - quality) / 100.0 * 29.0);
        return std::clamp(factor, 0, kMaxFactor - 1) + 1;
    }
    if (pixel_count < kMinPixelsToSkip) {
        return 1;
    }
    const double excess = static_cast<double>(pixel_count - kMinPixelsToSkip);
    return std::clamp(RoundHalfEven(excess * 13.0 / 148000.0 + 2.0), 1, kMaxFactor);
}

std::int32_t NeuralStep(std::int64_t pixel_count) {
    for (const std::int32_t prime : {499, 491, 487}) {
        if (pixel_count % prime != 0) {  // 3 has no share in it: the primes are larger
            return prime;
        }
    }
    return 503;
}

TNeuralPalette::TNeuralPalette(TZmBitmap& source, std::int32_t color_count, std::int32_t quality)
    : count_(color_count),
      blue_(WholeBlocks(color_count) + kContestBlock, kContestFarAway),
      green_(blue_),
      red_(blue_),
      freq_(blue_.size(), 0),
      bias_(blue_.size(), 0) {
    ZM_ASSERT(color_count >= 1 && color_count <= kMaxNeurons);
    for (std::int32_t i = 0; i < count_; ++i) {
        blue_[At(i)] = green_[At(i)] = red_[At(i)] = i * 4096 / count_;
        freq_[At(i)] = kInitialFreq / count_;
    }
    const std::int64_t pixel_count = std::int64_t{source.GetWidth()} * source.GetHeight();
    Train(source, NeuralSamplingFactor(quality, pixel_count));
    Finish();
}

void TNeuralPalette::Train(TZmBitmap& source, std::int32_t sampling_factor) {
    TSampler sampler(source);
    const std::int32_t alpha_decay = 30 + (sampling_factor - 1) / 3;
    const std::int64_t samples = sampler.Total() * 3 / (sampling_factor * 3);
    const std::int64_t delta = std::max<std::int64_t>(samples / 100, 1);
    std::int32_t scaled_radius = (count_ >> 3) << kRadiusShift;
    const auto take_radius = [&] {
        radius_ = scaled_radius >> kRadiusShift;
        radius_ = radius_ < 2 ? 0 : radius_;
        RebuildRadiusPower();
    };
    alpha_ = kInitialAlpha;
    take_radius();
    for (std::int64_t i = 1; i <= samples; ++i) {
        const TRGB color = sampler.Next();
        const TEntry sample{color.b << kColorBits, color.g << kColorBits, color.r << kColorBits, 0};
        const std::int32_t winner = Contest(sample.b, sample.g, sample.r);
        MoveWinner(winner, sample);
        MoveNeighbours(winner, sample);
        if (i % delta == 0) {
            alpha_ -= alpha_ / alpha_decay;
            scaled_radius -= scaled_radius / kRadiusDecay;
            take_radius();
        }
    }
}

// The power falls from the winner outward with the square of the distance.
void TNeuralPalette::RebuildRadiusPower() {
    radius_power_.assign(2 * At(radius_) + kContestBlock, 0);
    const std::int32_t square = radius_ * radius_;
    for (std::int32_t i = 1; i < radius_; ++i) {
        const std::int32_t power = (square - i * i) * 256 / square * alpha_;
        radius_power_[At(radius_ - 1 - i)] = power;
        radius_power_[At(radius_ - 1 + i)] = power;
    }
}

std::int32_t TNeuralPalette::Contest(std::int32_t b, std::int32_t g, std::int32_t r) {
    const TContestView neurons{blue_.data(), green_.data(), red_.data(),
                               freq_.data(), bias_.data(),  WholeBlocks(count_)};
    const TContestResult result = RunContest(neurons, b, g, r);
    freq_[At(result.closest)] += kFreqStep;
    bias_[At(result.closest)] -= kBiasStep;
    return result.winner;
}

void TNeuralPalette::MoveWinner(std::int32_t neuron, const TEntry& sample) {
    const auto move = [this](std::int32_t& value, std::int32_t target) {
        value -= (value - target) * alpha_ / kInitialAlpha;
    };
    move(blue_[At(neuron)], sample.b);
    move(green_[At(neuron)], sample.g);
    move(red_[At(neuron)], sample.r);
}

void TNeuralPalette::MoveNeighbours(std::int32_t neuron, const TEntry& sample) {
    if (radius_ == 0) {
        return;
    }
    const std::int32_t first = std::max(neuron - (radius_ - 1), 0);
    const std::int32_t last = std::min(neuron + (radius_ - 1), count_ - 1);
    const std::int32_t* const powers = &radius_power_[At(first - neuron + radius_ - 1)];
    const std::size_t count = At(last - first + 1);
    MoveToward(&blue_[At(first)], powers, count, sample.b);
    MoveToward(&green_[At(first)], powers, count, sample.g);
    MoveToward(&red_[At(first)], powers, count, sample.r);
}

void TNeuralPalette::Finish() {
    const auto round = [](std::int32_t value) {
        return std::min((value + (1 << (kColorBits - 1))) >> kColorBits, 255);
    };
    sorted_.reserve(At(count_));
    for (std::int32_t i = 0; i < count_; ++i) {
        sorted_.push_back({round(blue_[At(i)]), round(green_[At(i)]), round(red_[At(i)]), i});
    }
    BuildGreenIndex();
}

// Selection sort by green (its order among equals is part of the result), and on the way the
// place where a search for each green value starts: the middle of its run, or, for a value that
// no neuron has, the start of the next run.
void TNeuralPalette::BuildGreenIndex() {
    std::int32_t previous = 0;
    std::int32_t run_start = 0;
    for (std::int32_t i = 0; i < count_; ++i) {
        const auto rest = sorted_.begin() + i;
        std::iter_swap(
            rest, std::min_element(rest, sorted_.end(),
                                   [](const TEntry& a, const TEntry& b) { return a.g < b.g; }));
        const std::int32_t green = rest->g;
        if (green != previous) {
            green_index_[At(previous)] = (run_start + i) >> 1;
            std::fill(green_index_.begin() + previous + 1, green_index_.begin() + green, i);
            previous = green;
            run_start = i;
        }
    }
    green_index_[At(previous)] = (run_start + count_ - 1) >> 1;
    std::fill(green_index_.begin() + previous + 1, green_index_.end(), count_ - 1);
}

void TNeuralPalette::WritePalette(std::vector<TRGB>& color_map) const {
    for (const TEntry& entry : sorted_) {
        color_map[At(entry.index)] =
            TRGB{static_cast<std::uint8_t>(entry.b), static_cast<std::uint8_t>(entry.g),
                 static_cast<std::uint8_t>(entry.r)};
    }
}

std::int32_t TNeuralPalette::FindIndex(TRGB color) const {
    std::int32_t best_distance = 1000;  // above the largest, 3 * 255
    std::int32_t best = 0;
    // False when the green difference alone rules out all neurons further on.
    const auto consider = [&](std::int32_t at) {
        const TEntry& entry = sorted_[At(at)];
        std::int32_t distance = std::abs(entry.g - color.g);
        if (distance >= best_distance) {
            return false;
        }
        distance += std::abs(entry.b - color.b) + std::abs(entry.r - color.r);
        if (distance < best_distance) {
            best_distance = distance;
            best = entry.index;
        }
        return true;
    };
    std::int32_t up = green_index_[color.g];
    std::int32_t down = up - 1;
    while (up < count_ || down >= 0) {
        if (up < count_) {
            up = consider(up) ? up + 1 : count_;
        }
        if (down >= 0) {
            down = consider(down) ? down - 1 : -1;
        }
    }
    return best;
}

}  // namespace zm
