// Run-length coding of 4-bit and 8-bit bitmaps (RLE4, RLE8): pairs of bytes, a count and a value,
// or a zero and a command (end of line, end of bitmap, a jump, a run of literal pixels).

#include <algorithm>

#include "engine/codecs/bmpfilt_p.h"

namespace zm {
namespace {

constexpr std::uint8_t kEndOfLine = 0;
constexpr std::uint8_t kEndOfBitmap = 1;
constexpr std::uint8_t kDelta = 2;
constexpr std::size_t kMaxRun = 255;
// A pending stretch of literals longer than this is written out at once.
constexpr std::size_t kMaxPendingLiterals = 255;

class TRleDecoder {
public:
    TRleDecoder(const TBmpRleImage& image, const TBmpRowSink& sink, const TBmpRowStep& step)
        : data_(image.data),
          is_rle4_(image.compression == kBmpRle4),
          last_column_(static_cast<std::size_t>(image.width) - 1),
          height_(image.height),
          sink_(sink),
          step_(step),
          indices_(static_cast<std::size_t>(image.width), 0) {}

    TBmpStatus Decode();

private:
    enum class TNext : std::uint8_t { kGoOn, kComplete, kStopped };

    bool Take(std::uint8_t& value);
    TNext DecodeEscape(std::uint8_t command);
    void DecodeRun(std::uint8_t count, std::uint8_t value);
    void DecodeLiterals(std::uint8_t count);
    bool MoveUp(std::int32_t rows);
    void PutPixel(std::uint8_t index);
    void FinishRows();

    std::span<const std::uint8_t> data_;
    std::size_t position_ = 0;
    bool is_rle4_;
    std::size_t last_column_;
    std::int32_t height_;
    const TBmpRowSink& sink_;
    const TBmpRowStep& step_;
    std::vector<std::uint8_t> indices_;  // of row row_
    std::int32_t row_ = 0;
    std::size_t column_ = 0;
};

bool TRleDecoder::Take(std::uint8_t& value) {
    if (position_ >= data_.size()) {
        return false;
    }
    value = data_[position_++];
    return true;
}

// Required: pixels past the end of a row overwrite the last one instead of being dropped. Files
// whose runs are a pixel too long are common, and jobs compare their last column.
void TRleDecoder::PutPixel(std::uint8_t index) {
    indices_[column_] = index;
    column_ = std::min(column_ + 1, last_column_);
}

void TRleDecoder::DecodeRun(std::uint8_t count, std::uint8_t value) {
    for (std::uint8_t i = 0; i < count; ++i) {
        if (!is_rle4_) {
            PutPixel(value);
        } else {
            PutPixel(static_cast<std::uint8_t>(i % 2 == 0 ? value >> 4 : value & 15));
        }
    }
}

void TRleDecoder::DecodeLiterals(std::uint8_t count) {
    const std::size_t used = is_rle4_ ? (count + 1u) / 2 : count;
    const std::size_t padded = (used + 1) & ~std::size_t{1};
    for (std::size_t i = 0; i < count; ++i) {
        const std::size_t at = position_ + (is_rle4_ ? i / 2 : i);
        if (at >= data_.size()) {
            break;
        }
        const std::uint8_t value = data_[at];
        if (!is_rle4_) {
            PutPixel(value);
        } else {
            PutPixel(static_cast<std::uint8_t>(i % 2 == 0 ? value >> 4 : value & 15));
        }
    }
    position_ += std::min(padded, data_.size() - position_);
}

// Hands the present row over, and empty ones for the rows jumped across. False behind the last.
bool TRleDecoder::MoveUp(std::int32_t rows) {
    for (; rows > 0 && row_ < height_; --rows) {
        sink_(row_, indices_.data());
        std::fill(indices_.begin(), indices_.end(), std::uint8_t{0});
        ++row_;
    }
    return row_ < height_;
}

TRleDecoder::TNext TRleDecoder::DecodeEscape(std::uint8_t command) {
    std::uint8_t dx = 0;
    std::uint8_t dy = 0;
    switch (command) {
        case kEndOfLine:
            column_ = 0;
            if (!MoveUp(1)) {
                return TNext::kComplete;
            }
            return step_(row_) ? TNext::kGoOn : TNext::kStopped;
        case kEndOfBitmap: return TNext::kComplete;
        case kDelta:
            if (!Take(dx) || !Take(dy)) {
                return TNext::kGoOn;
            }
            column_ = std::min(column_ + dx, last_column_);
            return MoveUp(dy) ? TNext::kGoOn : TNext::kComplete;
        default: DecodeLiterals(command); return TNext::kGoOn;
    }
}

void TRleDecoder::FinishRows() {
    while (row_ < height_) {
        MoveUp(1);
    }
}

TBmpStatus TRleDecoder::Decode() {
    auto next = step_(0) ? TNext::kGoOn : TNext::kStopped;
    std::uint8_t count = 0;
    std::uint8_t value = 0;
    while (next == TNext::kGoOn && Take(count) && Take(value)) {
        if (count == 0) {
            next = DecodeEscape(value);
        } else {
            DecodeRun(count, value);
        }
    }
    const bool reached_last_row = row_ >= height_ - 1;
    FinishRows();
    if (next == TNext::kStopped) {
        return TBmpStatus::kStopped;
    }
    return next == TNext::kComplete || reached_last_row ? TBmpStatus::kOk : TBmpStatus::kTruncated;
}

// What differs between the two encoders: how a run and a piece of literals look.
class TRle8Form {
public:
    static void WriteRun(std::size_t count, std::uint8_t value, std::vector<std::uint8_t>& output) {
        output.push_back(static_cast<std::uint8_t>(count));
        output.push_back(value);
    }
    static void WriteLiterals(std::span<const std::uint8_t> piece,
                              std::vector<std::uint8_t>& output) {
        if (piece.size() < 3) {  // a zero and a count below 3 would be a command
            for (const std::uint8_t value : piece) {
                WriteRun(1, value, output);
            }
            return;
        }
        output.push_back(0);
        output.push_back(static_cast<std::uint8_t>(piece.size()));
        output.insert(output.end(), piece.begin(), piece.end());
        if (piece.size() % 2 != 0) {
            output.push_back(0);
        }
    }
};

class TRle4Form {
public:
    static void WriteRun(std::size_t count, std::uint8_t value, std::vector<std::uint8_t>& output) {
        output.push_back(static_cast<std::uint8_t>(count));
        output.push_back(PackPair(value, value));
    }
    static void WriteLiterals(std::span<const std::uint8_t> piece,
                              std::vector<std::uint8_t>& output) {
        const std::size_t count = piece.size();
        if (count < 3) {
            output.push_back(static_cast<std::uint8_t>(count));
            output.push_back(PackPair(piece[0], count == 2 ? piece[1] : std::uint8_t{0}));
            return;
        }
        output.push_back(0);
        output.push_back(static_cast<std::uint8_t>(count));
        for (std::size_t i = 0; i < count; i += 2) {
            output.push_back(PackPair(piece[i], i + 1 < count ? piece[i + 1] : std::uint8_t{0}));
        }
        if ((count + 1) / 2 % 2 != 0) {
            output.push_back(0);
        }
    }

private:
    static std::uint8_t PackPair(std::uint8_t high, std::uint8_t low) {
        return static_cast<std::uint8_t>((high & 15) << 4 | (low & 15));
    }
};

template <typename Form>
void FlushLiterals(std::span<const std::uint8_t> literals, std::vector<std::uint8_t>& output) {
    while (!literals.empty()) {
        const std::size_t count = std::min(literals.size(), kMaxRun);
        Form::WriteLiterals(literals.first(count), output);
        literals = literals.subspan(count);
    }
}

// Behind the run of equal pixels that starts at `begin`, at most kMaxRun pixels long.
std::size_t FindRunEnd(std::span<const std::uint8_t> indices, std::size_t begin) {
    std::size_t end = begin + 1;
    while (end < indices.size() && end - begin < kMaxRun && indices[end] == indices[begin]) {
        ++end;
    }
    return end;
}

template <typename Form>
void EncodeRow(std::span<const std::uint8_t> indices, std::vector<std::uint8_t>& output) {
    std::size_t position = 0;
    std::size_t literal_start = 0;
    while (position < indices.size()) {
        if (position - literal_start > kMaxPendingLiterals) {
            FlushLiterals<Form>(indices.subspan(literal_start, position - literal_start), output);
            literal_start = position;
        }
        const std::size_t run_end = FindRunEnd(indices, position);
        if (run_end - position == 1) {
            ++position;
            continue;
        }
        FlushLiterals<Form>(indices.subspan(literal_start, position - literal_start), output);
        Form::WriteRun(run_end - position, indices[position], output);
        position = run_end;
        literal_start = run_end;
    }
    FlushLiterals<Form>(indices.subspan(literal_start), output);
    output.push_back(0);
    output.push_back(kEndOfLine);
}

}  // namespace

TBmpStatus DecodeBmpRle(const TBmpRleImage& image, const TBmpRowSink& sink,
                        const TBmpRowStep& step) {
    return TRleDecoder(image, sink, step).Decode();
}

void EncodeBmpRle8Row(std::span<const std::uint8_t> indices, std::vector<std::uint8_t>& output) {
    EncodeRow<TRle8Form>(indices, output);
}

void EncodeBmpRle4Row(std::span<const std::uint8_t> indices, std::vector<std::uint8_t>& output) {
    EncodeRow<TRle4Form>(indices, output);
}

}  // namespace zm
