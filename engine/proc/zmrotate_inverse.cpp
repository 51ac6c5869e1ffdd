// The inverse filter, plain: each target pixel is mapped back into the source and interpolated
// there, in double arithmetic throughout. Also the sizes and positions that its fast form and the
// nearest sample share.

#include <numbers>

#include "engine/proc/zmrotate_map_p.h"

namespace zm {
namespace {

double ToRadians(double angle) {
    return angle * std::numbers::pi / 180;
}

/// The law in its plainest form: every tap asks for its row anew.
template <std::size_t kChannels>
class TPlainInverse {
public:
    TPlainInverse(TZmBitmap& source, TTap<kChannels> background)
        : source_(source), background_(background) {}

    void Run(TZmBitmap& target, const TRotationMap& map, bool is_cubic,
             const TResampleListener& listener) {
        const auto read = [this](double i, double j) { return ReadTap(i, j); };
        const std::int32_t height = target.GetHeight();
        for (std::int32_t y = 0; y < height; ++y) {
            const TRotationMap::TRow row = map.Row(y);
            std::uint8_t* out = target.GetScanLine(y);
            for (std::int32_t x = 0; x < target.GetWidth(); ++x, out += kChannels) {
                const double source_x = map.SourceX(x, row);
                const double source_y = map.SourceY(x, row);
                if (is_cubic) {
                    BicubicPixel<kChannels>(read, source_x, source_y, out);
                } else {
                    BilinearPixel<kChannels>(read, source_x, source_y, out);
                }
            }
            if (listener.on_progress) {
                listener.on_progress(listener.sender, TruncToInt(y * (100.0 / height)));
            }
        }
    }

private:
    TTap<kChannels> ReadTap(double i, double j) const {
        if (!(i >= 0 && i < source_.GetWidth() && j >= 0 && j < source_.GetHeight())) {
            return background_;
        }
        const std::uint8_t* const pixel =
            source_.GetScanLine(TruncToInt(j)) + std::int64_t{TruncToInt(i)} * kChannels;
        TTap<kChannels> tap;
        std::copy_n(pixel, kChannels, tap.begin());
        return tap;
    }

    TZmBitmap& source_;
    TTap<kChannels> background_;
};

}  // namespace

TRotationMap::TRotationMap(TZmImageSize source, TZmImageSize target, double angle)
    : sine_(std::sin(ToRadians(angle))),
      cosine_(std::cos(ToRadians(angle))),
      ty_((target.height - 1.0) / 2),
      a_(MakeWorkBuffer<double>(target.width)),
      b_(MakeWorkBuffer<double>(target.width)) {
    const double cx = (source.width - 1.0) / 2;
    const double cy = (source.height - 1.0) / 2;
    const double tx = (target.width - 1.0) / 2;
    for (std::int32_t x = 0; x < target.width; ++x) {
        a_[static_cast<std::size_t>(x)] = (x - tx) * cosine_ + cx;
        b_[static_cast<std::size_t>(x)] = (x - tx) * sine_ + cy;
    }
}

std::optional<TZmImageSize> InverseFilterSize(TZmImageSize source, double angle) {
    const double right = source.width - 1.0;
    const double bottom = source.height - 1.0;
    const double cx = right / 2;
    const double cy = bottom / 2;
    const double sine = std::sin(-ToRadians(angle));
    const double cosine = std::cos(-ToRadians(angle));
    const double corners[4][2] = {{0, 0}, {right, 0}, {right, bottom}, {0, bottom}};
    double min_x = cx;
    double max_x = cx;
    double min_y = cy;
    double max_y = cy;
    for (const auto& [x, y] : corners) {
        const double turned_x = (x - cx) * cosine - (y - cy) * sine + cx;
        const double turned_y = (x - cx) * sine + (y - cy) * cosine + cy;
        min_x = std::min(min_x, turned_x);
        max_x = std::max(max_x, turned_x);
        min_y = std::min(min_y, turned_y);
        max_y = std::max(max_y, turned_y);
    }
    const TZmImageSize size{RoundHalfEven(max_x - min_x + 1), RoundHalfEven(max_y - min_y + 1)};
    if (size.width == kMaxInt32 || size.height == kMaxInt32) {
        return std::nullopt;
    }
    return size;
}

bool AllocateInverseTarget(TZmBitmap& source, TZmBitmap& target, double angle) {
    const auto size = InverseFilterSize({source.GetWidth(), source.GetHeight()}, angle);
    if (!size || !target.Allocate(size->width, size->height, source.GetPixelFormat()) ||
        target.GetPixelFormat() != source.GetPixelFormat()) {
        return false;
    }
    if (source.GetPixelFormat() == zm8p) {
        source.CopyPaletteTo(&target);
    }
    return true;
}

bool RotateInversePlain(TZmBitmap& source, TZmBitmap& target, double angle, TZmAntialiasMode mode,
                        TColor background, const TResampleListener& listener) {
    if (!AllocateInverseTarget(source, target, angle)) {
        return false;
    }
    const TRotationMap map({source.GetWidth(), source.GetHeight()},
                           {target.GetWidth(), target.GetHeight()}, angle);
    const bool is_cubic = mode == zmrBicubic;
    if (source.GetPixelFormat() == zm24RGB) {
        const TRGB rgb = RGBFromColor(background);
        TPlainInverse<3>(source, {rgb.b, rgb.g, rgb.r}).Run(target, map, is_cubic, listener);
    } else {
        const auto value = static_cast<std::uint8_t>(background & 255);
        TPlainInverse<1>(source, {value}).Run(target, map, is_cubic, listener);
    }
    return true;
}

}  // namespace zm
