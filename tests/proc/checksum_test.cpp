// Whole results of every filter and rotation, as checksums worked out by a separate plain program
// from the rules of the engines: what the small pictures written out by hand leave open.

#include <gtest/gtest.h>

#include <array>

#include "engine/proc/zmresample.h"
#include "tests/proc/resample_support.h"

namespace zm::test {
namespace {

/// FNV-1a of the rows, without the unused bits of the last byte.
class TChecksum {
public:
    void Add(TZmBitmap& bitmap) {
        const std::int32_t row_bits = bitmap.GetWidth() * bitmap.GetBitCount();
        for (std::int32_t y = 0; y < bitmap.GetHeight(); ++y) {
            const std::uint8_t* const row = bitmap.GetScanLine(y);
            for (std::int32_t bit = 0; bit < row_bits; bit += 8) {
                const std::uint32_t used = row_bits - bit < 8 ? 0xFF00u >> (row_bits - bit) : 0xFFu;
                value_ = (value_ ^ (row[bit / 8] & used)) * 16777619u;
            }
        }
        if (bitmap.HasAlphaChannel()) {
            Add(*bitmap.GetAlphaChannel());
        }
    }
    std::uint32_t Value() const { return value_; }

private:
    std::uint32_t value_ = 2166136261u;
};

/// 24 by 11 pixels of noise; zm24RGB and zm32RGB with a plane of noise.
std::unique_ptr<TZmBitmap> MakeSource(TZmPixelFormat format) {
    auto bitmap = std::make_unique<TZmBitmap>(24, 11, format);
    FillContent(*bitmap, kNoiseContent, 1);
    if (format == zm24RGB || format == zm32RGB) {
        FillContent(*bitmap->GetAlphaChannel(), kNoiseContent, 2);
        bitmap->GetAlphaChannel()->SyncFull();
    }
    return bitmap;
}

TEST(Checksums, EveryFilter) {
    constexpr std::size_t kFilters = rfProjectWB + 1;  // the platform has the others
    const struct {
        TZmPixelFormat format;
        std::array<std::uint32_t, kFilters> sums;
    } kRows[] = {
        {zm1g,
         {0x17F5ACDD, 0xF7F12772, 0x7B4B1142, 0xA9768BFF, 0xCAEB6AFA, 0x3D8BA611, 0x2A3B2229,
          0x7B979F23, 0xF7F12772, 0x084045F4, 0x084045F4, 0x084045F4, 0x408488B4, 0x4E70D765}},
        {zm8g,
         {0x7546FD25, 0xB636F405, 0x3EAEF86C, 0x2E607010, 0x0CA5428E, 0xCBC5765B, 0x59C394C5,
          0xB3083A98, 0xB636F405, 0xAB5C1DA4, 0xF8A675BD, 0xDF2B58BA, 0xAB5C1DA4, 0xAB5C1DA4}},
        {zm16g,
         {0x80F0DA81, 0xFBBDE67C, 0x69A07828, 0x4BDEFAAE, 0x695B7114, 0xAD9E6BA0, 0x608334EC,
          0x3028EBDB, 0xFBBDE67C, 0x1683B061, 0x12AB53BE, 0x7C72DB30, 0x1683B061, 0x1683B061}},
        {zm24RGB,
         {0x98B1B469, 0x7B313344, 0x4C2707BF, 0xE62BC82A, 0x6DFAF028, 0x860C2D84, 0x0FB09D19,
          0xBF104716, 0x7B313344, 0xA610C3C5, 0xC2779DE8, 0x6660B4F2, 0x16E315E5, 0xD8AED0E1}},
        {zm48RGB,
         {0x8A429747, 0x81F22DEB, 0x8B711C9B, 0x58AD24E1, 0xA7632C39, 0xD4DC3AF4, 0x059132C6,
          0x2DABE80E, 0x81F22DEB, 0x5A241FAA, 0x1A4038BE, 0x7D68C7F1, 0xA5800086, 0x23FEF123}},
        {zm32RGB,
         {0x8A236F6F, 0x7C58046D, 0xE3DDA498, 0x8AAB2435, 0xFF882593, 0x334D8672, 0x502FB387,
          0x221A66BF, 0x7C58046D, 0x6755BC1A, 0x38F8BB4D, 0xDC906FF1, 0xB371EB0B, 0x71060D11}},
    };
    for (const auto& row : kRows) {
        for (std::size_t filter = 0; filter < kFilters; ++filter) {
            TChecksum sum;
            // Smaller, larger, and each side in its own direction; at last one side that stays.
            for (const TZmImageSize to :
                 {TZmImageSize{17, 5}, {17, 23}, {50, 5}, {50, 40}, {8, 11}}) {
                const auto source = MakeSource(row.format);
                const auto target = TargetFor(*source, to.width, to.height);
                ASSERT_TRUE(ResampleBitmapInto(*source, *target,
                                               static_cast<TResampleFilter>(filter), nullptr, {}));
                sum.Add(*target);
            }
            EXPECT_EQ(sum.Value(), row.sums[filter])
                << PixelFormatInfo(row.format).name << ", filter " << filter;
        }
    }
}

TEST(Checksums, EveryRotation) {
    const struct {
        TZmPixelFormat format;
        std::array<std::uint32_t, 4> sums;
    } kRows[] = {
        {zm1g, {0xBB467DD1, 0xB7202781, 0xB7202781, 0xB7202781}},
        {zm8g, {0xEC94A561, 0xEC94A561, 0xEC94A561, 0xEC94A561}},
        {zm24RGB, {0xDE1823E4, 0x40D4AAEB, 0x3F51E284, 0x5EED56F5}},
        {zm48RGB, {0xBB174D20, 0xBB174D20, 0xBB174D20, 0xBB174D20}},
    };
    for (const auto& row : kRows) {
        for (std::size_t mode = 0; mode < row.sums.size(); ++mode) {
            TChecksum sum;
            for (const double angle : {33.3, -100.0, 135.0, -7.25, 20.0}) {
                const auto image = MakeSource(row.format);
                image->Rotate(angle, static_cast<TZmAntialiasMode>(mode),
                              row.format == zm24RGB ? 0x3040F0 : 0);
                sum.Add(*image);
            }
            EXPECT_EQ(sum.Value(), row.sums[mode])
                << PixelFormatInfo(row.format).name << ", mode " << mode;
        }
    }
}

}  // namespace
}  // namespace zm::test
