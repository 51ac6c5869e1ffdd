#pragma once

#include <array>
#include <cstddef>
#include <cstdint>
#include <vector>

#include "engine/foundation/zmdefs.h"

/// The two palette methods behind TZmQuantizer.
namespace zm {

class TZmBitmap;

/// How many pixels stand for one in the training of the network: 1 (all) to 30. `quality` is 0
/// to 100, or -1 for a value that follows the number of pixels.
std::int32_t NeuralSamplingFactor(std::int32_t quality, std::int64_t pixel_count);

/// Distance in pixels between samples, prime to 3 * pixel_count.
std::int32_t NeuralStep(std::int64_t pixel_count);

/// Shifts of the contest: frequencies decay by 1 in 2^kBetaShift, biases count 1 in 2^kBiasShift.
inline constexpr int kBetaShift = 10;
inline constexpr int kBiasShift = 12;
/// A neuron's number travels in the low bits of its distance, so that the smaller one wins a tie.
inline constexpr int kContestNumberBits = 11;
/// Neurons come in whole blocks of this many.
inline constexpr std::size_t kContestBlock = 16;
/// Channel value of the neurons that fill the last block: too far away to win anything.
inline constexpr std::int32_t kContestFarAway = 200000;

/// The arrays of a contest; `count` is a multiple of kContestBlock.
struct TContestView {
    const std::int32_t* blue;
    const std::int32_t* green;
    const std::int32_t* red;
    std::int32_t* freq;
    std::int32_t* bias;
    std::size_t count;
};

struct TContestResult {
    std::int32_t closest = 0;  ///< the neuron of the least distance
    std::int32_t winner = 0;   ///< the neuron of the least distance less bias
    friend bool operator==(const TContestResult&, const TContestResult&) = default;
};

/// Finds both and lets all frequencies decay into the biases. Values are -4080 to 4080 around
/// the sample, biases below 2^27.
TContestResult RunContestPlain(const TContestView& neurons, std::int32_t b, std::int32_t g,
                               std::int32_t r);
/// The same in vectors, the same numbers.
TContestResult RunContest(const TContestView& neurons, std::int32_t b, std::int32_t g,
                          std::int32_t r);

/// Moves values toward a target: value i by powers[i] / 2^18 of the way, truncating toward zero.
/// Values and target are 0 to 4080, powers 0 to 2^18. Whole blocks of kContestBlock numbers are
/// read and written behind both starts, at least `count` of them.
void MoveToward(std::int32_t* values, const std::int32_t* powers, std::size_t count,
                std::int32_t target);

/// A one-dimensional self-organising map trained with samples of the image, in integer
/// arithmetic: channels have 4 fractional bits, the learning rate 10, radius 6.
class TNeuralPalette {
public:
    /// Trains the network at once. `color_count` is 1 to 1024; the image is not empty.
    TNeuralPalette(TZmBitmap& source, std::int32_t color_count, std::int32_t quality);
    /// Entry i is neuron i.
    void WritePalette(std::vector<TRGB>& color_map) const;
    /// Neuron nearest to a colour by the sum of absolute differences.
    std::int32_t FindIndex(TRGB color) const;

private:
    struct TEntry {
        std::int32_t b = 0;
        std::int32_t g = 0;
        std::int32_t r = 0;
        std::int32_t index = 0;
    };

    void Train(TZmBitmap& source, std::int32_t sampling_factor);
    std::int32_t Contest(std::int32_t b, std::int32_t g, std::int32_t r);
    void MoveWinner(std::int32_t neuron, const TEntry& sample);
    void MoveNeighbours(std::int32_t neuron, const TEntry& sample);
    void RebuildRadiusPower();
    void Finish();
    void BuildGreenIndex();

    std::int32_t count_;
    // One array per channel lets the contest run over whole vectors of neurons.
    std::vector<std::int32_t> blue_;
    std::vector<std::int32_t> green_;
    std::vector<std::int32_t> red_;
    std::vector<std::int32_t> freq_;
    std::vector<std::int32_t> bias_;
    // Of the neurons from radius - 1 below the winner to radius - 1 above it, with 0 for itself.
    std::vector<std::int32_t> radius_power_;
    std::int32_t alpha_ = 0;
    std::int32_t radius_ = 0;     // in neurons; 0 moves the winner only
    std::vector<TEntry> sorted_;  // by green
    std::array<std::int32_t, 256> green_index_{};
};

/// Splits the colour cube, at 5 bits a channel, into boxes of small variance.
class TBoxPalette {
public:
    /// Counts and splits at once. `color_count` is 1 to 1024; the image is not empty.
    TBoxPalette(TZmBitmap& source, std::int32_t color_count);
    std::int32_t GetBoxCount() const { return static_cast<std::int32_t>(boxes_.size()); }
    /// Entry i is the mean colour of box i; entries behind the last box are left alone.
    void WritePalette(std::vector<TRGB>& color_map) const;
    /// Box that the colour lies in.
    std::int32_t FindIndex(TRGB color) const { return table_[CellOfColor(color)]; }

private:
    static constexpr std::int32_t kLevels = 32;

    struct TBox {
        std::array<std::int32_t, 3> low{};                            // inclusive
        std::array<std::int32_t, 3> high{kLevels, kLevels, kLevels};  // exclusive
        std::int64_t count = 0;
        std::array<double, 3> mean{};
        std::array<std::array<std::int64_t, kLevels>, 3> bins{};
        double variance = 0;
    };
    struct TSplit {
        TBox lower;
        TBox upper;
        double variance_sum = 0;
    };

    static std::size_t CellOfColor(TRGB color) {
        return static_cast<std::size_t>(color.b >> 3 | color.g >> 3 << 5 | color.r >> 3 << 10);
    }
    void CountPixels(TZmBitmap& source);
    TBox MakeWholeBox() const;
    void AddCells(TBox& box) const;
    void UpdateStatistics(TBox& box) const;
    static std::int32_t FindCut(const TBox& box, std::size_t channel);
    TSplit TrySplit(const TBox& box, std::size_t channel) const;
    bool SplitBox(std::size_t index);
    void SplitBoxes(std::int32_t color_count);
    void FillTable();

    std::int64_t pixel_count_ = 0;
    std::vector<std::int64_t> histogram_;  // freed when the table is filled
    std::vector<TBox> boxes_;
    std::vector<std::uint16_t> table_;  // cell to box
};

}  // namespace zm
