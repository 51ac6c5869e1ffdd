// The box-split palette: starting from the whole colour cube at 5 bits a channel, the box of the
// largest variance is cut in two where the halves vary least, until there are enough boxes.

#include <algorithm>
#include <cstddef>

#include "engine/bitmap/zmrgbrows.h"
#include "engine/foundation/zmassert.h"
#include "engine/foundation/zmnumbers.h"
#include "engine/proc/neurquant_p.h"

namespace zm {
namespace {

constexpr std::int32_t kDroppedBits = 3;
constexpr std::size_t kCells = 32 * 32 * 32;
// Sum of variances that stands for a split that cannot be made; real sums stay far below.
constexpr double kNoSplit = 17523.6;
constexpr std::size_t kRedChannel = 0;
constexpr std::size_t kGreenChannel = 1;
constexpr std::size_t kBlueChannel = 2;

std::size_t CellOf(std::int32_t red, std::int32_t green, std::int32_t blue) {
    return static_cast<std::size_t>(blue | green << 5 | red << 10);
}

std::size_t Bin(std::int32_t level) {
    return static_cast<std::size_t>(level);
}

}  // namespace

TBoxPalette::TBoxPalette(TZmBitmap& source, std::int32_t color_count) : histogram_(kCells, 0) {
    ZM_ASSERT(color_count >= 1 && color_count <= 1024);
    CountPixels(source);
    boxes_.reserve(static_cast<std::size_t>(color_count));
    boxes_.push_back(MakeWholeBox());
    SplitBoxes(color_count);
    FillTable();
}

void TBoxPalette::CountPixels(TZmBitmap& source) {
    TZmRgbRows rows(source);
    const std::int32_t width = source.GetWidth();
    for (std::int32_t y = 0; y < source.GetHeight(); ++y) {
        const TRGB* row = rows.GetRow(y);
        if (row == nullptr) {
            continue;
        }
        for (std::int32_t x = 0; x < width; ++x) {
            ++histogram_[CellOfColor(row[x])];
        }
        pixel_count_ += width;
    }
}

TBoxPalette::TBox TBoxPalette::MakeWholeBox() const {
    TBox box;
    AddCells(box);
    UpdateStatistics(box);
    return box;
}

// Counts the pixels within the box's limits into its marginal histograms.
void TBoxPalette::AddCells(TBox& box) const {
    for (std::int32_t r = box.low[kRedChannel]; r < box.high[kRedChannel]; ++r) {
        for (std::int32_t g = box.low[kGreenChannel]; g < box.high[kGreenChannel]; ++g) {
            for (std::int32_t b = box.low[kBlueChannel]; b < box.high[kBlueChannel]; ++b) {
                const std::int64_t pixels = histogram_[CellOf(r, g, b)];
                box.bins[kRedChannel][Bin(r)] += pixels;
                box.bins[kGreenChannel][Bin(g)] += pixels;
                box.bins[kBlueChannel][Bin(b)] += pixels;
                box.count += pixels;
            }
        }
    }
}

// Means, and the variance as the box's share of the whole image's: the sum over the channels of
// the squared distances from the mean, per pixel of the image. Summed over halves it tells how
// much error a split leaves.
void TBoxPalette::UpdateStatistics(TBox& box) const {
    box.variance = 0;
    if (box.count == 0) {
        return;
    }
    for (std::size_t channel = 0; channel < 3; ++channel) {
        std::int64_t weighted_sum = 0;
        for (std::int32_t i = box.low[channel]; i < box.high[channel]; ++i) {
            weighted_sum += i * box.bins[channel][Bin(i)];
        }
        const double mean = static_cast<double>(weighted_sum) / static_cast<double>(box.count);
        double squares = 0;
        for (std::int32_t i = box.low[channel]; i < box.high[channel]; ++i) {
            const double distance = i - mean;
            squares += distance * distance * static_cast<double>(box.bins[channel][Bin(i)]);
        }
        box.mean[channel] = mean;
        box.variance += squares;
    }
    box.variance /= static_cast<double>(pixel_count_);
}

// The lower half's last level: the best score of the trial cuts between the middles of the box's
// limits and its mean; -1 when a half would be empty.
// Required: the count runs from the box's low limit, but the weighted sum only from the first
// trial cut, and is divided by the count of the whole box; palettes of existing jobs depend on it.
std::int32_t TBoxPalette::FindCut(const TBox& box, std::size_t channel) {
    const std::int32_t low = box.low[channel];
    const std::int32_t high = box.high[channel];
    const double mean = box.mean[channel];
    const std::int32_t first = RoundHalfEven((low + mean) / 2);
    const std::int32_t last = std::min(RoundHalfEven((mean + high) / 2), high - 1);
    const auto total = static_cast<double>(box.count);
    std::int64_t count = 0;
    for (std::int32_t i = low; i < first; ++i) {
        count += box.bins[channel][Bin(i)];
    }
    std::int64_t weighted_sum = 0;
    double best_score = -1;
    std::int32_t cut = -1;
    for (std::int32_t i = first; i <= last; ++i) {
        count += box.bins[channel][Bin(i)];
        weighted_sum += i * box.bins[channel][Bin(i)];
        if (count == box.count) {
            break;
        }
        const double part = static_cast<double>(count);
        const double difference = mean - static_cast<double>(weighted_sum) / total;
        const double score = part / (total - part) * difference * difference;
        if (score > best_score) {
            best_score = score;
            cut = count > 0 ? i : -1;
        }
    }
    return cut;
}

TBoxPalette::TSplit TBoxPalette::TrySplit(const TBox& box, std::size_t channel) const {
    const std::int32_t cut = FindCut(box, channel);
    TSplit split;
    split.variance_sum = kNoSplit;
    if (cut < 0) {
        return split;
    }
    split.lower.low = split.upper.low = box.low;
    split.lower.high = split.upper.high = box.high;
    split.lower.high[channel] = split.upper.low[channel] = cut + 1;
    AddCells(split.lower);
    AddCells(split.upper);
    UpdateStatistics(split.lower);
    UpdateStatistics(split.upper);
    split.variance_sum = split.lower.variance + split.upper.variance;
    return split;
}

// Red is tried first, then green, then blue: the first of equal splits wins.
bool TBoxPalette::SplitBox(std::size_t index) {
    TSplit best;
    best.variance_sum = kNoSplit;
    for (const std::size_t channel : {kRedChannel, kGreenChannel, kBlueChannel}) {
        TSplit split = TrySplit(boxes_[index], channel);
        if (split.variance_sum < best.variance_sum) {
            best = split;
        }
    }
    if (best.variance_sum >= kNoSplit) {
        boxes_[index].variance = 0;
        return false;
    }
    boxes_[index] = best.lower;
    boxes_.push_back(best.upper);
    return true;
}

void TBoxPalette::SplitBoxes(std::int32_t color_count) {
    while (GetBoxCount() < color_count) {
        const auto widest =
            std::max_element(boxes_.begin(), boxes_.end(),
                             [](const TBox& a, const TBox& b) { return a.variance < b.variance; });
        if (!(widest->variance > 0)) {
            return;
        }
        SplitBox(static_cast<std::size_t>(widest - boxes_.begin()));
    }
}

void TBoxPalette::FillTable() {
    table_.assign(kCells, 0);
    for (std::size_t i = 0; i < boxes_.size(); ++i) {
        const TBox& box = boxes_[i];
        for (std::int32_t r = box.low[kRedChannel]; r < box.high[kRedChannel]; ++r) {
            for (std::int32_t g = box.low[kGreenChannel]; g < box.high[kGreenChannel]; ++g) {
                for (std::int32_t b = box.low[kBlueChannel]; b < box.high[kBlueChannel]; ++b) {
                    table_[CellOf(r, g, b)] = static_cast<std::uint16_t>(i);
                }
            }
        }
    }
    histogram_.clear();
    histogram_.shrink_to_fit();
}

void TBoxPalette::WritePalette(std::vector<TRGB>& color_map) const {
    const auto level = [](double mean) {
        return static_cast<std::uint8_t>(RoundHalfEven(mean) << kDroppedBits);
    };
    for (std::size_t i = 0; i < boxes_.size(); ++i) {
        const std::array<double, 3>& mean = boxes_[i].mean;
        color_map[i] =
            TRGB{level(mean[kBlueChannel]), level(mean[kGreenChannel]), level(mean[kRedChannel])};
    }
}

}  // namespace zm
