#pragma once

#include <array>
#include <cstdint>
#include <optional>
#include <vector>

#include "engine/bitmap/zmxBitmaps.h"
#include "engine/foundation/zmdefs.h"
#include "engine/proc/zmresample.h"
#include "engine/proc/zmresample_p.h"

/// The engines of rotation and flips, for the dispatcher and the tests.
///
/// Common rules: `source` has pixels, is not virtual and is not `target`; engines allocate the
/// target, in the place that its settings tell, and copy the palette of zm8p. Alpha planes are
/// the caller's affair. False when there is no room. std::bad_alloc passes through.
namespace zm {

/// Quarter turns, counter-clockwise, 0 to 3.
using TQuarterTurns = std::int32_t;

/// Columns `begin` to `end` - 1.
struct TColumnSpan {
    std::int32_t begin = 0;
    std::int32_t end = 0;
    bool IsEmpty() const { return begin >= end; }
};

/// The rows of an image by number, for engines that jump between them. An image in memory gives
/// its own rows; of one in a file a number of rows is kept as copies.
class TSourceRows {
public:
    explicit TSourceRows(TZmBitmap& source);
    /// Makes rows `first` to `last` (inside the image, at most Capacity of them) ready.
    void Require(std::int32_t first, std::int32_t last);
    /// By row number; only rows that were required last are good.
    const std::uint8_t* const* Table() const { return rows_.data(); }
    bool IsDirect() const { return copies_.empty(); }
    /// Rows that can be ready at a time.
    std::int32_t Capacity() const { return capacity_; }

private:
    void Load(std::int32_t row);

    TZmBitmap& source_;
    std::vector<const std::uint8_t*> rows_;
    std::int32_t capacity_ = 0;
    std::size_t row_bytes_ = 0;
    std::vector<std::uint8_t> copies_;
    std::vector<std::int32_t> held_;  // row in each place of copies_; -1 none
};

/// Bytes that the pixels of a row take, without padding.
std::size_t PixelBytes(TZmBitmap& bitmap);

// Quarter turns.

/// Copies the image turned by `turns` quarters (1 to 3). Blocks that fit the cache.
[[nodiscard]] bool TurnQuarters(TZmBitmap& source, TZmBitmap& target, TQuarterTurns turns);
/// The plain form, a sample at a time: the law.
[[nodiscard]] bool TurnQuartersPlain(TZmBitmap& source, TZmBitmap& target, TQuarterTurns turns);

/// Columns `column` to `column` + 3 of `count` rows of three-byte pixels as four lines, in blocks
/// of four rows; returns the rows done. Reads 16 bytes of each row; the lines need room for four
/// bytes behind, which are overwritten.
std::int32_t TurnColumns24(const std::uint8_t* const* rows, std::int32_t count, std::size_t column,
                           std::uint8_t* const* lines);

// Flips.

/// Writes the `width` samples of a row in reverse order to `out`; the two do not overlap.
/// `bit_count` is that of a pixel format. Unused bits of the last byte become 0.
void ReverseRow(const std::uint8_t* row, std::int32_t width, std::int32_t bit_count,
                std::uint8_t* out);
/// The plain form.
void ReverseRowPlain(const std::uint8_t* row, std::int32_t width, std::int32_t bit_count,
                     std::uint8_t* out);
/// Pixels of three bytes in blocks of vectors: writes the last pixels of the row first to `out`
/// and returns how many it did.
std::int32_t ReverseBlocks24(const std::uint8_t* row, std::int32_t width, std::uint8_t* out);

// Mapping back: the inverse filter and the nearest sample.

/// Where the pixels of a turned image come from.
class TRotationMap {
public:
    TRotationMap(TZmImageSize source, TZmImageSize target, double angle);
    /// What a target row adds to the positions of the columns.
    struct TRow {
        double p = 0;
        double q = 0;
    };
    TRow Row(std::int32_t y) const { return {(y - ty_) * sine_, (y - ty_) * cosine_}; }
    double SourceX(std::int32_t x, TRow row) const {
        return a_[static_cast<std::size_t>(x)] - row.p;
    }
    double SourceY(std::int32_t x, TRow row) const {
        return b_[static_cast<std::size_t>(x)] + row.q;
    }
    const double* A() const { return a_.data(); }
    const double* B() const { return b_.data(); }
    /// Source rows that neighbouring columns lie apart.
    double RowsPerColumn() const { return sine_ < 0 ? -sine_ : sine_; }

private:
    double sine_ = 0;
    double cosine_ = 0;
    double ty_ = 0;
    std::vector<double> a_;
    std::vector<double> b_;
};

/// Size of the result of the inverse filter; nothing when a side leaves 32 bits.
std::optional<TZmImageSize> InverseFilterSize(TZmImageSize source, double angle);

/// The inverse filter with zmrBicubic, or zmrBilinear for every other mode: zm24RGB, zm8g and
/// zm8p to the same format, other formats to zm24RGB. An 8-bit image takes the low byte of
/// `background`. Taps outside the image read as the background.
[[nodiscard]] bool RotateInverse(TZmBitmap& source, TZmBitmap& target, double angle,
                                 TZmAntialiasMode mode, TColor background,
                                 const TResampleListener& listener);
/// The plain form, for zm24RGB, zm8g and zm8p.
[[nodiscard]] bool RotateInversePlain(TZmBitmap& source, TZmBitmap& target, double angle,
                                      TZmAntialiasMode mode, TColor background,
                                      const TResampleListener& listener);

/// A run of target pixels whose taps all lie inside the image, none in the last column.
struct TRotationRun {
    const double* a = nullptr;  ///< of the run's first column
    const double* b = nullptr;
    TRotationMap::TRow row;
    const std::uint8_t* const* rows = nullptr;
    std::uint8_t* out = nullptr;
    std::int32_t count = 0;
    /// From a source pixel to one that a target row further down will need soon: the cache is
    /// told of it.
    std::uintptr_t ahead = 0;
};
/// The first pixels of a run of zm24RGB, in blocks of vectors; returns how many.
std::int32_t BilinearRun24(const TRotationRun& run);
std::int32_t BicubicRun24(const TRotationRun& run);

/// The nearest sample, every format, angles that are no whole quarters.
[[nodiscard]] bool RotateNearest(TZmBitmap& source, TZmBitmap& target, double angle,
                                 TColor background, const TResampleListener& listener);
/// The plain form.
[[nodiscard]] bool RotateNearestPlain(TZmBitmap& source, TZmBitmap& target, double angle,
                                      TColor background, const TResampleListener& listener);

// Three shears.

/// An angle as the shears take it: held to 1/1000 degree, as quarter turns and a rest of -45 to
/// 45 degrees. Not-a-number and what overflows count as 0.
struct TShearAngle {
    TQuarterTurns turns = 0;
    double rest = 0;
};
TShearAngle SplitShearAngle(double angle);

/// The sizes on the way through the shears.
struct TShearGeometry {
    std::int32_t width = 0;  ///< source
    std::int32_t height = 0;
    std::int32_t w1 = 0;  ///< width after the first shear
    std::int32_t o2 = 0;  ///< offset of the second
    std::int32_t h3 = 0;  ///< height after the second, and of the result
    std::int32_t o3 = 0;  ///< offset of the third
    std::int32_t w3 = 0;  ///< width of the result
    double tangent = 0;
    double sine = 0;
    bool is_negative = false;
};
/// Nothing when a size leaves 32 bits. `rest` as in TShearAngle, not 0.
std::optional<TShearGeometry> FindShearGeometry(TZmImageSize source, double rest);

/// How far a line is moved: whole pixels, and 4096ths of the next.
struct TShearShift {
    std::int32_t whole = 0;
    std::int32_t fraction_q12 = 0;
};
TShearShift FindShearShift(double distance);
/// Of row y in the first shear, column x in the second, row y in the third.
TShearShift FirstShift(const TShearGeometry& geometry, std::int32_t y);
TShearShift SecondShift(const TShearGeometry& geometry, std::int32_t x);
TShearShift ThirdShift(const TShearGeometry& geometry, std::int32_t y);

/// zm24RGB and zm8g with antialiasing, zm1g without. `rest` is not 0. zm8g takes the low byte
/// of the background, zm1g sets its bits for any value but 0.
[[nodiscard]] bool RotateByShears(TZmBitmap& source, TZmBitmap& target, double rest,
                                  TColor background, const TResampleListener& listener);
/// The plain form, three passes over images in memory.
[[nodiscard]] bool RotateByShearsPlain(TZmBitmap& source, TZmBitmap& target, double rest,
                                       TColor background, const TResampleListener& listener);

/// Mixes bytes with those before them: current + ((before - current) * f + 2048) >> 12, with one
/// fraction f of 4096ths for each byte, or `fraction` for all when `fractions` is nil. Blocks of
/// vectors; returns the bytes done.
std::int32_t ShearBlocks(const std::uint8_t* before, const std::uint8_t* current,
                         const std::int16_t* fractions, std::int16_t fraction, std::uint8_t* out,
                         std::int32_t byte_count);

/// The bytes of a pixel of zm24RGB, zm8g or (0 or 1) zm1g for a background colour.
std::array<std::uint8_t, 3> ShearBackground(TZmPixelFormat format, TColor background);

}  // namespace zm
