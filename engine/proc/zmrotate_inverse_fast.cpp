// The inverse filter, fast: the same formulas by runs of columns. What no tap of a column touches
// is filled, what lies well inside runs without tests, and only the rim goes tap by tap.

#include <cstring>

#include "engine/proc/zmrotate_map_p.h"

namespace zm {
namespace {

/// Distance of the taps from the position's whole part.
struct TTapReach {
    std::int32_t before = 0;
    std::int32_t behind = 0;
};
constexpr TTapReach kBilinearReach{0, 1};
constexpr TTapReach kBicubicReach{1, 2};

/// Target pixels that are worked on together.
constexpr std::int32_t kTileColumns = 128;
constexpr std::int32_t kBlockRows = 32;
/// How early the cache is told of source pixels.
constexpr std::int32_t kRowsAhead = 8;
/// Pixels that the vectors make at a time, and what they need behind the last ones.
constexpr std::int32_t kVectorPixels = 4;
constexpr std::int32_t kVectorRoom = 2;

template <std::size_t kChannels>
class TFastInverse {
public:
    TFastInverse(TZmBitmap& source, TZmBitmap& target, const TRotationMap& map, bool is_cubic,
                 TTap<kChannels> background)
        : target_(target),
          map_(map),
          is_cubic_(is_cubic),
          background_(background),
          width_(source.GetWidth()),
          height_(source.GetHeight()),
          rows_(source),
          reach_(is_cubic ? kBicubicReach : kBilinearReach) {
        const TTapReach reach = reach_;
        touched_ = {-static_cast<double>(reach.behind), width_ + static_cast<double>(reach.before),
                    -static_cast<double>(reach.behind),
                    height_ + static_cast<double>(reach.before)};
        // Vectors read a byte beyond a tap: the last column of pixels is left out.
        const double beyond = reach.behind + (kChannels == 3 ? 1.0 : 0.0);
        inside_ = {static_cast<double>(reach.before), width_ - beyond,
                   static_cast<double>(reach.before), height_ - static_cast<double>(reach.behind)};
        if (rows_.IsDirect() && height_ > 1) {
            ahead_ = FindAhead();
        }
    }

    void Run(const TResampleListener& listener) {
        const std::int32_t height = target_.GetHeight();
        // All rows of a block are at hand only in memory.
        const bool is_in_memory = rows_.IsDirect() && target_.GetLocation() != zmFile;
        const std::int32_t block = is_in_memory ? kBlockRows : height;
        for (std::int32_t top = 0; top < height;) {
            const std::int32_t bottom = top + std::min(block, height - top);
            if (is_in_memory) {
                FillBlock(top, bottom);
            } else {
                FillByTiles(top, bottom);
            }
            for (std::int32_t y = top; y < bottom && listener.on_progress; ++y) {
                listener.on_progress(listener.sender, TruncToInt(y * (100.0 / height)));
            }
            top = bottom;
        }
    }

private:
    /// One target row, by what its columns touch.
    struct TRowPlan {
        TRotationMap::TRow row;
        std::uint8_t* out = nullptr;
        TColumnSpan touched;
        TColumnSpan inside;
    };

    /// What the source of a column moves by over kRowsAhead target rows, in bytes. Only ever used
    /// as a hint, so that rows need not lie in one block.
    std::uintptr_t FindAhead() const {
        const TRotationMap::TRow one = map_.Row(0);
        const TRotationMap::TRow next = map_.Row(1);
        const auto stride =
            static_cast<std::intptr_t>(reinterpret_cast<std::uintptr_t>(rows_.Table()[1]) -
                                       reinterpret_cast<std::uintptr_t>(rows_.Table()[0]));
        const std::int32_t rows_ahead = RoundHalfEven((next.q - one.q) * kRowsAhead);
        const std::int32_t columns_back = RoundHalfEven((next.p - one.p) * kRowsAhead);
        return static_cast<std::uintptr_t>(stride) * static_cast<std::uintptr_t>(rows_ahead) -
               static_cast<std::uintptr_t>(columns_back) * kChannels;
    }

    TRowPlan PlanRow(std::int32_t y, TColumnSpan span) {
        const auto same = [](double position) { return position; };
        TRowPlan plan;
        plan.row = map_.Row(y);
        plan.out = target_.GetScanLine(y);
        plan.touched = FindSpan(map_, plan.row, span, touched_, same);
        if (plan.touched.IsEmpty()) {
            plan.touched = {span.end, span.end};
        }
        plan.inside = FindSpan(map_, plan.row, plan.touched, inside_, same);
        if (plan.inside.IsEmpty()) {
            plan.inside = {plan.touched.end, plan.touched.end};
        }
        return plan;
    }

    /// All of a row but its inside.
    void FillOutside(const TRowPlan& plan, TColumnSpan span) {
        FillBackground(plan.out, {span.begin, plan.touched.begin});
        FillRim(plan.row, plan.out, {plan.touched.begin, plan.inside.begin});
        FillRim(plan.row, plan.out, {plan.inside.end, plan.touched.end});
        FillBackground(plan.out, {plan.touched.end, span.end});
    }

    /// Rows in memory: the inside goes by tiles whose source stays in the nearest cache.
    void FillBlock(std::int32_t top, std::int32_t bottom) {
        const TColumnSpan all{0, target_.GetWidth()};
        plans_.clear();
        for (std::int32_t y = top; y < bottom; ++y) {
            plans_.push_back(PlanRow(y, all));
            FillOutside(plans_.back(), all);
        }
        for (std::int32_t left = 0; left < all.end;) {
            const std::int32_t right = left + std::min(kTileColumns, all.end - left);
            for (const TRowPlan& plan : plans_) {
                FillTileRow(plan, left, right);
            }
            left = right;
        }
    }

    /// The inside of a row from where a tile begins to where it ends, both moved so that runs are
    /// whole vectors.
    void FillTileRow(const TRowPlan& plan, std::int32_t left, std::int32_t right) {
        const TColumnSpan inside = plan.inside;
        const auto place = [inside](std::int32_t x) {
            const std::int32_t clamped = std::clamp(x, inside.begin, inside.end);
            return clamped == inside.end
                       ? clamped
                       : inside.begin + (clamped - inside.begin) / kVectorPixels * kVectorPixels;
        };
        FillInside(plan.row, plan.out, {place(left), place(right)}, inside.end);
    }

    /// A file is read as few times as may be: all rows of a tile before the next tile.
    void FillByTiles(std::int32_t top, std::int32_t bottom) {
        const std::int32_t width = target_.GetWidth();
        const std::int32_t tile = TileColumns(rows_, map_, width);
        for (std::int32_t left = 0; left < width;) {
            const TColumnSpan span{left, left + std::min(tile, width - left)};
            for (std::int32_t y = top; y < bottom; ++y) {
                const TRowPlan plan = PlanRow(y, span);
                if (!plan.touched.IsEmpty()) {
                    RequireRowsOf(rows_, map_, plan.row, plan.touched, reach_.before, reach_.behind,
                                  height_);
                }
                FillOutside(plan, span);
                FillInside(plan.row, plan.out, plan.inside, plan.inside.end);
            }
            left = span.end;
        }
    }

    void FillBackground(std::uint8_t* out, TColumnSpan span) const {
        std::uint8_t* pixel = out + static_cast<std::size_t>(span.begin) * kChannels;
        if (std::all_of(background_.begin(), background_.end(),
                        [this](std::uint8_t byte) { return byte == background_[0]; })) {
            std::memset(pixel, background_[0],
                        static_cast<std::size_t>(span.end - span.begin) * kChannels);
            return;
        }
        for (std::int32_t x = span.begin; x < span.end; ++x, pixel += kChannels) {
            std::copy(background_.begin(), background_.end(), pixel);
        }
    }

    template <typename Reader>
    void FillPixels(const Reader& read, TRotationMap::TRow row, std::uint8_t* out,
                    TColumnSpan span) const {
        out += static_cast<std::size_t>(span.begin) * kChannels;
        for (std::int32_t x = span.begin; x < span.end; ++x, out += kChannels) {
            if (is_cubic_) {
                BicubicPixel<kChannels>(read, map_.SourceX(x, row), map_.SourceY(x, row), out);
            } else {
                BilinearPixel<kChannels>(read, map_.SourceX(x, row), map_.SourceY(x, row), out);
            }
        }
    }

    void FillRim(TRotationMap::TRow row, std::uint8_t* out, TColumnSpan span) const {
        const auto read = [this](double i, double j) {
            const bool is_inside = i >= 0 && i < width_ && j >= 0 && j < height_;
            return is_inside ? ReadTap(TruncToInt(i), TruncToInt(j)) : background_;
        };
        FillPixels(read, row, out, span);
    }

    /// Columns `span` of a row; those up to `room_end` are filled later, if not now.
    void FillInside(TRotationMap::TRow row, std::uint8_t* out, TColumnSpan span,
                    std::int32_t room_end) const {
        if (span.IsEmpty()) {
            return;
        }
        if (kChannels == 3) {
            const TRotationRun run{map_.A() + span.begin,
                                   map_.B() + span.begin,
                                   row,
                                   rows_.Table(),
                                   out + static_cast<std::size_t>(span.begin) * kChannels,
                                   std::min(span.end + kVectorRoom, room_end) - span.begin,
                                   ahead_};
            span.begin += is_cubic_ ? BicubicRun24(run) : BilinearRun24(run);
        }
        const auto read = [this](double i, double j) {
            return ReadTap(RoundInside(i), RoundInside(j));
        };
        FillPixels(read, row, out, span);
    }

    TTap<kChannels> ReadTap(std::int32_t i, std::int32_t j) const {
        const std::uint8_t* const pixel =
            rows_.Table()[static_cast<std::size_t>(j)] + static_cast<std::size_t>(i) * kChannels;
        TTap<kChannels> tap;
        std::copy_n(pixel, kChannels, tap.begin());
        return tap;
    }

    TZmBitmap& target_;
    const TRotationMap& map_;
    bool is_cubic_;
    TTap<kChannels> background_;
    std::int32_t width_;
    std::int32_t height_;
    TSourceRows rows_;
    std::uintptr_t ahead_ = 0;
    std::vector<TRowPlan> plans_;
    TTapReach reach_;
    TPositionBounds touched_;
    TPositionBounds inside_;
};

bool IsFilterFormat(TZmPixelFormat format) {
    return format == zm24RGB || format == zm8g || format == zm8p;
}

}  // namespace

bool RotateInverse(TZmBitmap& source, TZmBitmap& target, double angle, TZmAntialiasMode mode,
                   TColor background, const TResampleListener& listener) {
    if (!IsFilterFormat(source.GetPixelFormat())) {
        TZmBitmap copy;
        copy.AssignEx(&source, /*with_params=*/false);
        copy.RemoveAlphaChannel(/*merge=*/false, 0);
        return !copy.IsEmpty() && copy.SetPixelFormat(zm24RGB) &&
               RotateInverse(copy, target, angle, mode, background, listener);
    }
    if (!AllocateInverseTarget(source, target, angle)) {
        return false;
    }
    const TAccessGuard reading(source, zmdRead);
    const TRotationMap map({source.GetWidth(), source.GetHeight()},
                           {target.GetWidth(), target.GetHeight()}, angle);
    const bool is_cubic = mode == zmrBicubic;
    if (source.GetPixelFormat() == zm24RGB) {
        const TRGB rgb = RGBFromColor(background);
        TFastInverse<3>(source, target, map, is_cubic, {rgb.b, rgb.g, rgb.r}).Run(listener);
    } else {
        const auto value = static_cast<std::uint8_t>(background & 255);
        TFastInverse<1>(source, target, map, is_cubic, {value}).Run(listener);
    }
    return true;
}

}  // namespace zm
