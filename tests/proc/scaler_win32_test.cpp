// The system's scaler behind the rfWIC filters.

#include <gtest/gtest.h>

#include <stdexcept>

#include "engine/platform/imagescaler.h"
#include "engine/proc/zmresample_p.h"
#include "tests/proc/resample_support.h"

namespace zm::test {
namespace {

using platform::ScaleImage;
using platform::TScalerLayout;
using platform::TScalerRequest;

TEST(ScaleImageTest, TakesEveryLayoutRowByRow) {
    constexpr std::size_t kPixelBytes[] = {1, 2, 4, 3, 6, 4};
    for (std::size_t layout = 0; layout < std::size(kPixelBytes); ++layout) {
        // Two rows of two pixels become four of four: each pixel twice, both ways.
        const std::size_t bytes = kPixelBytes[layout];
        std::vector<std::uint8_t> rows[2];
        for (std::size_t i = 0; i < 2 * bytes; ++i) {
            rows[0].push_back(static_cast<std::uint8_t>(i < bytes ? 10 : 60));
            rows[1].push_back(static_cast<std::uint8_t>(i < bytes ? 20 : 63));
        }
        std::vector<std::uint8_t> target[4];
        TScalerRequest request;
        request.layout = static_cast<TScalerLayout>(layout);
        request.source_width = request.source_height = 2;
        request.target_width = request.target_height = 4;
        request.source_row = [&](std::int32_t y) { return rows[y].data(); };
        request.target_row = [&](std::int32_t y) {
            target[y].resize(4 * bytes);
            return target[y].data();
        };
        ASSERT_TRUE(ScaleImage(request)) << layout;
        for (std::size_t y = 0; y < 4; ++y) {
            EXPECT_EQ(target[y].front(), rows[y / 2].front()) << layout << ", row " << y;
            EXPECT_EQ(target[y].back(), rows[y / 2].back()) << layout << ", row " << y;
        }
    }
}

TEST(ScaleImageTest, ExceptionsOfARowPassThrough) {
    TScalerRequest request;
    request.source_width = request.source_height = 3;
    request.target_width = request.target_height = 5;
    request.source_row = [](std::int32_t) -> const std::uint8_t* {
        throw std::runtime_error("row");
    };
    request.target_row = [](std::int32_t) -> std::uint8_t* { return nullptr; };
    EXPECT_THROW((void)ScaleImage(request), std::runtime_error);
}

}  // namespace
}  // namespace zm::test
