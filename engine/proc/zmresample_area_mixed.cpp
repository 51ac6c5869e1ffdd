// Area interpolation, fast form where one side shrinks and the other enlarges. It is the stated
// double arithmetic operation by operation, without the tests and neighbour searches of the plain
// form for each piece: what the interpolation gives is computed for whole rows, once.
//
// Where the width enlarges, a target pixel has one piece, or two with a source border between
// them. At a border both interpolations give exactly the sample behind it, which is the one that
// the second piece starts from.

#include <algorithm>
#include <array>
#include <cstddef>
#include <cstdint>
#include <type_traits>
#include <vector>

#include "engine/proc/zmresample_area_p.h"

namespace zm {
namespace {

/// What the two directions share: the walk down the rows, and the result of a row.
template <typename Sample>
class TMixedArea {
public:
    TMixedArea(TZmBitmap& source, TZmBitmap& target, TAreaInterpolation interpolation,
               const TResampleListener& listener)
        : source_(source),
          target_(target),
          listener_(listener),
          is_cubic_(interpolation == TAreaInterpolation::kCubic),
          channels_(static_cast<std::size_t>(source.GetChannelCount())),
          sx_(static_cast<double>(source.GetWidth()) / target.GetWidth()),
          sy_(static_cast<double>(source.GetHeight()) / target.GetHeight()),
          sums_(
              MakeWorkBuffer<double>(std::int64_t{target.GetWidth()} * source.GetChannelCount())) {}
    virtual ~TMixedArea() = default;

    void Run() {
        const std::int32_t height = target_.GetHeight();
        TAreaWalk walk(sy_, source_.GetHeight());
        double last = 0;
        for (std::int32_t y = 0; y < height;) {
            const TAreaStep step = walk.Next();
            const double length = step.position - last;
            last += length;
            AddRowPiece(step.index, step.ends_pixel ? step.position - step.index : 1.0, length);
            if (!step.ends_pixel) {
                continue;
            }
            WriteRow(y);
            ++y;
            if (listener_.on_progress) {
                const double done = static_cast<double>(y) / height * 100;
                listener_.on_progress(listener_.sender, TruncToInt(done));
            }
        }
    }

protected:
    static constexpr double kLimit = std::is_same_v<Sample, std::uint8_t> ? 255 : 65535;

    /// Adds a vertical piece of source row `index` to the sums of all target samples.
    virtual void AddRowPiece(std::int32_t index, double fraction, double length) = 0;

    void LoadRow(std::int32_t index, std::vector<double>& samples) {
        if (const auto* row = reinterpret_cast<const Sample*>(source_.GetScanLine(index));
            row != nullptr) {
            std::copy_n(row, samples.size(), samples.begin());
        }
    }
    std::vector<double> MakeSourceRow() const {
        return MakeWorkBuffer<double>(std::int64_t{source_.GetWidth()} *
                                      static_cast<std::int64_t>(channels_));
    }

    TZmBitmap& source_;
    TZmBitmap& target_;
    const TResampleListener& listener_;
    bool is_cubic_;
    std::size_t channels_;
    double sx_;
    double sy_;
    std::vector<double> sums_;

private:
    void WriteRow(std::int32_t y) {
        const double scale = 1 / (sx_ * sy_);
        auto* const out = reinterpret_cast<Sample*>(target_.GetScanLine(y));
        for (std::size_t i = 0; i < sums_.size() && out != nullptr; ++i) {
            const double value = std::min(std::max(RoundToWhole(sums_[i] * scale), 0.0), kLimit);
            out[i] = static_cast<Sample>(static_cast<std::int32_t>(value));
        }
        std::fill(sums_.begin(), sums_.end(), 0.0);
    }
};

/// The width enlarges, the height shrinks: what a source row gives is the same for each of its
/// vertical pieces.
template <typename Sample>
class TWiderArea : public TMixedArea<Sample> {
public:
    TWiderArea(TZmBitmap& source, TZmBitmap& target, TAreaInterpolation interpolation,
               const TResampleListener& listener)
        : TMixedArea<Sample>(source, target, interpolation, listener),
          row_(this->MakeSourceRow()),
          columns_(MakeWorkBuffer<TColumn>(target.GetWidth())) {
        for (auto* numbers : {&border_lengths_, &end_lengths_, &borders_, &ends_}) {
            *numbers = MakeWorkBuffer<double>(static_cast<std::int64_t>(this->sums_.size()));
        }
        TAreaWalk walk(this->sx_, source.GetWidth());
        double last = 0;
        for (std::size_t x = 0; x < columns_.size(); ++x) {
            AddColumn(walk, x, last);
        }
    }

protected:
    void AddRowPiece(std::int32_t index, double /*fraction*/, double length) override {
        if (index != row_index_) {
            row_index_ = index;
            this->LoadRow(index, row_);
            InterpolateRow();
        }
        double* const sums = this->sums_.data();
        for (std::size_t i = 0; i < this->sums_.size(); ++i) {
            // A pixel without a border has a first piece of length 0.
            const double first = sums[i] + border_lengths_[i] * length * borders_[i];
            sums[i] = first + end_lengths_[i] * length * ends_[i];
        }
    }

private:
    /// The samples around the end of a target pixel, inside the image, and their weights there.
    struct TColumn {
        std::array<std::size_t, 4> taps{};
        std::array<double, 4> weights{};
    };

    void AddColumn(TAreaWalk& walk, std::size_t x, double& last) {
        TAreaStep step = walk.Next();
        double border = 0;
        double end = step.position - last;
        last += end;
        if (!step.ends_pixel) {
            border = end;
            step = walk.Next();
            end = step.position - last;
            last += end;
        }
        TColumn& column = columns_[x];
        for (std::int32_t k = 0; k < 4; ++k) {
            const std::int32_t place =
                std::clamp(step.index - 1 + k, 0, this->source_.GetWidth() - 1);
            column.taps[static_cast<std::size_t>(k)] =
                static_cast<std::size_t>(place) * this->channels_;
        }
        const double fraction = step.position - step.index;
        column.weights = this->is_cubic_ ? CubicWeights(fraction)
                                         : std::array<double, 4>{0, 1 - fraction, fraction, 0};
        const auto first = static_cast<std::ptrdiff_t>(x * this->channels_);
        std::fill_n(border_lengths_.begin() + first, this->channels_, border);
        std::fill_n(end_lengths_.begin() + first, this->channels_, end);
    }

    void InterpolateRow() {
        std::size_t i = 0;
        for (const TColumn& column : columns_) {
            for (std::size_t c = 0; c < this->channels_; ++c, ++i) {
                const double* const samples = row_.data() + c;
                const double here = samples[column.taps[1]];
                const double right = samples[column.taps[2]];
                borders_[i] = here;
                ends_[i] =
                    this->is_cubic_
                        ? MixCubic({samples[column.taps[0]], here, right, samples[column.taps[3]]},
                                   column.weights, this->kLimit)
                        : column.weights[1] * here + column.weights[2] * right;
            }
        }
    }

    std::vector<double> row_;
    std::int32_t row_index_ = -1;
    std::vector<TColumn> columns_;
    // For each target sample: lengths of the piece up to the border and of the last one, and what
    // the interpolation gives at their ends.
    std::vector<double> border_lengths_;
    std::vector<double> end_lengths_;
    std::vector<double> borders_;
    std::vector<double> ends_;
};

/// The width shrinks, the height enlarges: what a vertical piece gives is interpolated for the
/// whole source row, and then summed by target pixels.
template <typename Sample, std::size_t kChannels>
class THigherArea : public TMixedArea<Sample> {
public:
    THigherArea(TZmBitmap& source, TZmBitmap& target, TAreaInterpolation interpolation,
                const TResampleListener& listener)
        : TMixedArea<Sample>(source, target, interpolation, listener),
          values_(this->MakeSourceRow()) {
        for (TRow& row : rows_) {
            row.samples = this->MakeSourceRow();
        }
        const std::int64_t count = std::int64_t{source.GetWidth()} + target.GetWidth();
        RequireWorkMemory(count, sizeof(TPiece) + sizeof(std::size_t));
        pieces_.reserve(static_cast<std::size_t>(count));
        TAreaWalk walk(this->sx_, source.GetWidth());
        double last = 0;
        while (piece_ends_.size() < static_cast<std::size_t>(target.GetWidth())) {
            const TAreaStep step = walk.Next();
            const double length = step.position - last;
            last += length;
            pieces_.push_back({static_cast<std::size_t>(step.index) * kChannels, length});
            if (step.ends_pixel) {
                piece_ends_.push_back(pieces_.size());
            }
        }
    }

protected:
    void AddRowPiece(std::int32_t index, double fraction, double length) override {
        InterpolateRows(index, fraction);
        double* sums = this->sums_.data();
        std::size_t i = 0;
        for (const std::size_t end : piece_ends_) {
            std::array<double, kChannels> pixel;
            std::copy_n(sums, kChannels, pixel.begin());
            for (; i < end; ++i) {
                const double weight = pieces_[i].length * length;
                const double* const value = values_.data() + pieces_[i].place;
                for (std::size_t c = 0; c < kChannels; ++c) {
                    pixel[c] += weight * value[c];
                }
            }
            sums = std::copy(pixel.begin(), pixel.end(), sums);
        }
    }

private:
    struct TRow {
        std::int32_t index = -1;
        std::vector<double> samples;
    };
    struct TPiece {
        std::size_t place = 0;
        double length = 0;
    };

    /// A source row; neighbours up to three rows away stay with it.
    const double* SourceRow(std::int32_t index) {
        index = std::clamp(index, 0, this->source_.GetHeight() - 1);
        TRow& row = rows_[static_cast<std::size_t>(index) % rows_.size()];
        if (row.index != index) {
            row.index = index;
            this->LoadRow(index, row.samples);
        }
        return row.samples.data();
    }

    void InterpolateRows(std::int32_t index, double fraction) {
        const double* const here = SourceRow(index);
        const double* const below = SourceRow(index + 1);
        if (!this->is_cubic_) {
            for (std::size_t i = 0; i < values_.size(); ++i) {
                values_[i] = here[i] * (1 - fraction) + below[i] * fraction;
            }
            return;
        }
        const double* const above = SourceRow(index - 1);
        const double* const below2 = SourceRow(index + 2);
        const std::array<double, 4> weights = CubicWeights(fraction);
        for (std::size_t i = 0; i < values_.size(); ++i) {
            values_[i] = MixCubic({above[i], here[i], below[i], below2[i]}, weights, this->kLimit);
        }
    }

    std::array<TRow, 4> rows_;
    std::vector<double> values_;
    std::vector<TPiece> pieces_;
    std::vector<std::size_t> piece_ends_;  ///< of each target pixel
};

template <typename Sample, std::size_t kChannels>
void MixArea(TZmBitmap& source, TZmBitmap& target, TAreaInterpolation interpolation,
             const TResampleListener& listener) {
    if (target.GetWidth() > source.GetWidth()) {
        TWiderArea<Sample>(source, target, interpolation, listener).Run();
    } else {
        THigherArea<Sample, kChannels>(source, target, interpolation, listener).Run();
    }
}

}  // namespace

bool MixAreaFast(TZmBitmap& source, TZmBitmap& target, TAreaInterpolation interpolation,
                 const TResampleListener& listener) {
    switch (source.GetPixelFormat()) {
        case zm8g: MixArea<std::uint8_t, 1>(source, target, interpolation, listener); return true;
        case zm24RGB:
            MixArea<std::uint8_t, 3>(source, target, interpolation, listener);
            return true;
        case zm32RGB:
            MixArea<std::uint8_t, 4>(source, target, interpolation, listener);
            return true;
        case zm16g: MixArea<std::uint16_t, 1>(source, target, interpolation, listener); return true;
        case zm48RGB:
            MixArea<std::uint16_t, 3>(source, target, interpolation, listener);
            return true;
        default: return false;
    }
}

}  // namespace zm
