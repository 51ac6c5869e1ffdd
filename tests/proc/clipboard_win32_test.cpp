// Metafiles that other programs put on the clipboard.

#include <gtest/gtest.h>
#include <windows.h>

#include "engine/bitmap/zmxBitmaps.h"
#include "engine/foundation/zmsettings.h"
#include "engine/platform/clipboard.h"

namespace zm::test {
namespace {

/// Puts a metafile of the given size in hundredths of a millimetre there: its left half is red.
void PutMetafile(LONG width, LONG height) {
    const RECT frame{0, 0, width, height};
    HDC const context = ::CreateEnhMetaFileW(nullptr, nullptr, &frame, nullptr);
    ASSERT_NE(context, nullptr);
    const auto pixels = [&](LONG size, int pixel_index, int mm_index) {
        return ::MulDiv(size, ::GetDeviceCaps(context, pixel_index),
                        100 * ::GetDeviceCaps(context, mm_index));
    };
    const RECT area{0, 0, pixels(width / 2, HORZRES, HORZSIZE), pixels(height, VERTRES, VERTSIZE)};
    HBRUSH const brush = ::CreateSolidBrush(RGB(255, 0, 0));
    ::FillRect(context, &area, brush);
    ::DeleteObject(brush);
    HENHMETAFILE const metafile = ::CloseEnhMetaFile(context);
    HWND const window = ::CreateWindowExW(0, L"STATIC", L"", 0, 0, 0, 0, 0, HWND_MESSAGE, nullptr,
                                          nullptr, nullptr);
    ASSERT_TRUE(::OpenClipboard(window));
    ::EmptyClipboard();
    const bool is_set = ::SetClipboardData(CF_ENHMETAFILE, metafile) != nullptr;
    ::CloseClipboard();
    ::DestroyWindow(window);
    ASSERT_TRUE(is_set);
}

TEST(ClipboardMetafile, IsDrawnAtItsOwnSize) {
    PutMetafile(2000, 1000);
    TZmBitmap pasted;
    ASSERT_TRUE(pasted.PasteFromClipboard());
    EXPECT_EQ(pasted.GetPixelFormat(), zm24RGB);
    EXPECT_FALSE(pasted.HasAlphaChannel());
    EXPECT_NEAR(pasted.GetWidth(), 2 * pasted.GetHeight(), 3);
    EXPECT_GE(pasted.GetHeight(), 10);
    const std::int32_t middle = pasted.GetWidth() / 2;
    const std::int32_t bottom = pasted.GetHeight() - 2;
    for (const std::int32_t y : {1, bottom}) {
        EXPECT_EQ(pasted.GetPixels(1, y), (TRGB{0, 0, 255}));
        EXPECT_EQ(pasted.GetPixels(middle - 2, y), (TRGB{0, 0, 255}));
        EXPECT_EQ(pasted.GetPixels(middle + 2, y), (TRGB{255, 255, 255}));
    }
}

TEST(ClipboardMetafile, KeepsTheLimitsOfTheSettings) {
    TZmBitmap pasted;
    PutMetafile(1'000'000, 1000);  // ten metres
    ASSERT_TRUE(pasted.PasteFromClipboard());
    EXPECT_EQ(pasted.GetWidth(), ZmGlobalSettings().fMaxImageEMFSize);
    EXPECT_NEAR(pasted.GetHeight(), pasted.GetWidth() / 1000, 1);
    PutMetafile(1000, 1'000'000);
    ASSERT_TRUE(pasted.PasteFromClipboard());
    EXPECT_EQ(pasted.GetHeight(), ZmGlobalSettings().fMaxImageEMFSize);

    const auto area = ZmGlobalSettings().fMaxImageEMFMatrixSize;
    ZmGlobalSettings().fMaxImageEMFMatrixSize = 5000;
    PutMetafile(20'000, 20'000);
    EXPECT_TRUE(pasted.PasteFromClipboard());
    ZmGlobalSettings().fMaxImageEMFMatrixSize = area;
    EXPECT_NEAR(pasted.GetWidth(), 70, 2);
    EXPECT_LE(pasted.GetWidth() * pasted.GetHeight(), 5000);

    PutMetafile(0x7FFFFFFF, 0x7FFFFFFF);  // a frame that no device has
    TZmBitmap image(3, 3, zm8g);
    if (image.PasteFromClipboard()) {
        EXPECT_LE(image.GetWidth(), ZmGlobalSettings().fMaxImageEMFSize);
    } else {
        EXPECT_EQ(image.GetWidth(), 3);
    }
}

}  // namespace
}  // namespace zm::test
