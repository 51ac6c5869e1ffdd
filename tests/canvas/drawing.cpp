#include "tests/canvas/drawing.h"

#include <gtest/gtest.h>

#include <algorithm>

namespace zm::test {

TDrawing::TDrawing(std::int32_t width, std::int32_t height, TBitmapPixelFormat format,
                   bool anti_alias, bool use_library) {
    EXPECT_TRUE(bitmap.SetSize(width, height, format));
    zm_canvas = std::make_unique<TZmCanvas>(canvas, anti_alias, use_library, &bitmap);
    zm_canvas->GetPen().SetColor(kRed);
    zm_canvas->GetBrush().SetColor(kBlue);
}

TRGBA TDrawing::PixelAt(std::int32_t x, std::int32_t y) {
    zm_canvas->Flush();
    const std::uint8_t* const row = bitmap.GetScanLine(y);
    const bool has_alpha = bitmap.GetPixelFormat() == pf32bit;
    const std::uint8_t* const p = row + (has_alpha ? 4 : 3) * x;
    return TRGBA{p[0], p[1], p[2], has_alpha ? p[3] : std::uint8_t{0}};
}

std::uint32_t TDrawing::ColorAt(std::int32_t x, std::int32_t y) {
    const TRGBA pixel = PixelAt(x, y);
    return static_cast<std::uint32_t>(pixel.r << 16 | pixel.g << 8 | pixel.b);
}

double TDrawing::CoveredArea() {
    double sum = 0;
    for (std::int32_t y = 0; y < bitmap.GetHeight(); ++y) {
        for (std::int32_t x = 0; x < bitmap.GetWidth(); ++x) {
            sum += PixelAt(x, y).a;
        }
    }
    return sum / 255;
}

bool TDrawing::IsAllOrNothing() {
    for (std::int32_t i = 0; i < bitmap.GetWidth() * bitmap.GetHeight(); ++i) {
        const std::uint8_t alpha = PixelAt(i % bitmap.GetWidth(), i / bitmap.GetWidth()).a;
        if (alpha != 0 && alpha != 255) {
            return false;
        }
    }
    return true;
}

TRect TDrawing::InkBounds() {
    TRect bounds{bitmap.GetWidth(), bitmap.GetHeight(), 0, 0};
    for (std::int32_t y = 0; y < bitmap.GetHeight(); ++y) {
        for (std::int32_t x = 0; x < bitmap.GetWidth(); ++x) {
            if (PixelAt(x, y) != TRGBA{}) {
                bounds = TRect{std::min(bounds.left, x), std::min(bounds.top, y),
                               std::max(bounds.right, x + 1), std::max(bounds.bottom, y + 1)};
            }
        }
    }
    return bounds.left < bounds.right ? bounds : TRect{};
}

bool ShapesHaveCoverage() {
    static const bool has_coverage = [] {
        TDrawing drawing(10, 10);
        drawing.zm_canvas->DrawLine(0, 4.5, 10, 4.5);
        return !drawing.IsAllOrNothing();
    }();
    return has_coverage;
}

}  // namespace zm::test
