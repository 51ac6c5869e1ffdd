// Projection: reductions to 1 bit in which thin features survive. rfProjectBW keeps black ones,
// rfProjectWB white ones.

#include <algorithm>
#include <cstring>
#include <vector>

#include "engine/proc/zmresample_p.h"

namespace zm {
namespace {

class TProjection {
public:
    TProjection(TZmBitmap& source, TZmBitmap& target, bool keep_black);
    void Run();

private:
    void MarkRow(const std::uint8_t* row);
    void WriteRow(std::int32_t y);

    TZmBitmap& source_;
    TZmBitmap& target_;
    bool keep_black_;
    bool color_;
    std::vector<std::int32_t> columns_;
    std::vector<std::uint8_t> marks_;  ///< per source column: a feature was found
    std::vector<std::uint8_t> output_;
};

TProjection::TProjection(TZmBitmap& source, TZmBitmap& target, bool keep_black)
    : source_(source),
      target_(target),
      keep_black_(keep_black),
      color_(source.GetPixelFormat() == zm24RGB),
      columns_(MakeWorkBuffer<std::int32_t>(target.GetWidth())),
      marks_(MakeWorkBuffer<std::uint8_t>(source.GetWidth())),
      output_((columns_.size() + 7) / 8) {
    const double rx = static_cast<double>(source.GetWidth()) / target.GetWidth();
    for (std::size_t x = 0; x < columns_.size(); ++x) {
        columns_[x] = std::min(TruncToInt(static_cast<double>(x) * rx), source.GetWidth() - 1);
    }
}

/// A black feature has all three channels below 128, a white one all three above; 128 is neither.
void TProjection::MarkRow(const std::uint8_t* row) {
    for (std::size_t x = 0; x < marks_.size(); ++x) {
        bool found;
        if (color_) {
            const std::uint8_t* pixel = row + 3 * x;
            const auto [low, high] = std::minmax({pixel[0], pixel[1], pixel[2]});
            found = keep_black_ ? high < 128 : low > 128;
        } else {
            const bool set = (row[x >> 3] >> (7 - (x & 7)) & 1) != 0;
            found = set != keep_black_;
        }
        marks_[x] = static_cast<std::uint8_t>(marks_[x] | static_cast<unsigned>(found));
    }
}

void TProjection::WriteRow(std::int32_t y) {
    std::fill(output_.begin(), output_.end(), keep_black_ ? std::uint8_t{255} : std::uint8_t{0});
    for (std::size_t x = 0; x < columns_.size(); ++x) {
        const std::int32_t first = x > 0 ? columns_[x - 1] : 0;
        const std::int32_t last = x > 0 ? columns_[x] : 0;
        const auto begin = marks_.begin() + first;
        if (std::find(begin, marks_.begin() + last + 1, 1) != marks_.begin() + last + 1) {
            output_[x >> 3] = static_cast<std::uint8_t>(output_[x >> 3] ^ (0x80u >> (x & 7)));
        }
    }
    if (std::uint8_t* row = target_.GetScanLine(y); row != nullptr) {
        std::memcpy(row, output_.data(), output_.size());
    }
}

void TProjection::Run() {
    const TAccessGuard reading(source_, zmdRead);
    const TAccessGuard writing(target_, zmdWrite);
    const std::int32_t last_row = source_.GetHeight() - 1;
    const double ry = static_cast<double>(source_.GetHeight()) / target_.GetHeight();
    for (std::int32_t y = 0; y < target_.GetHeight(); ++y) {
        const std::int32_t first = y > 0 ? TruncToInt((y - 1) * ry) : 0;
        const std::int32_t last = y > 0 ? std::min(TruncToInt(y * ry), last_row) : 0;
        std::fill(marks_.begin(), marks_.end(), std::uint8_t{0});
        for (std::int32_t row = std::min(first, last); row <= last; ++row) {
            if (const std::uint8_t* pixels = source_.GetScanLine(row); pixels != nullptr) {
                MarkRow(pixels);
            }
        }
        WriteRow(y);
    }
}

}  // namespace

bool ResampleProjection(TZmBitmap& source, TZmBitmap& target, TResampleFilter filter) {
    const TZmPixelFormat format = source.GetPixelFormat();
    if (source.IsEmpty() || target.IsEmpty() || (format != zm24RGB && format != zm1g) ||
        !FitTargetFormat(target, zm1g)) {
        return false;
    }
    TProjection(source, target, filter == rfProjectBW).Run();
    return true;
}

}  // namespace zm
