// Metafiles that other programs put on the clipboard.

#include <gtest/gtest.h>
#include <windows.h>

#include "engine/bitmap/zmxBitmaps.h"
#include "engine/foundation/zmsettings.h"
#include "engine/platform/clipboard.h"

namespace zm::test {
namespace {

/// Puts a metafile of the given size in hundredths of a millimetre there: red, all over.
void PutMetafile(LONG width, LONG height) {
    const RECT frame{0, 0, width, height};
    HDC const context = ::CreateEnhMetaFileW(nullptr, nullptr, &frame, nullptr);
    ASSERT_NE(context, nullptr);
    const auto pixels = [&](LONG size, int pixel_index, int mm_index) {
        return ::MulDiv(size, ::GetDeviceCaps(context, pixel_index),
                        100 * ::GetDeviceCaps(context, mm_index));
    };
    const RECT area{0, 0, pixels(width, HORZRES, HORZSIZE), pixels(height, VERTRES, VERTSIZE)};
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
    EXPECT_EQ(pasted.GetPixels(pasted.GetWidth() / 2, pasted.GetHeight() / 2), (TRGB{0, 0, 255}));
}

TEST(ClipboardMetafile, KeepsTheLimitsOfTheSettings) {
    PutMetafile(50'000'000, 1000);
    TZmBitmap pasted;
    if (pasted.PasteFromClipboard()) {
        EXPECT_LE(pasted.GetWidth(), ZmGlobalSettings().fMaxImageEMFSize);
        EXPECT_GE(pasted.GetHeight(), 1);
    } else {
        EXPECT_TRUE(pasted.IsEmpty());
    }
}

}  // namespace
}  // namespace zm::test
