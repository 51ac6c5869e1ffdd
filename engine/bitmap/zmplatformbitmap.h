#pragma once

#include <cstdint>
#include <memory>
#include <vector>

#include "engine/foundation/zmdefs.h"
#include "engine/platform/dibsection.h"
#include "engine/platform/drawing.h"

namespace zm {

/// Pixel layouts that a platform bitmap can hold.
enum TBitmapPixelFormat : std::uint8_t { pfNone, pf1bit, pf8bit, pf24bit, pf32bit };

/// The platform bitmap behind the place `zmTBitmap`: an object with a size, one of four layouts,
/// row pointers and a colour table. Its pixels are a device-independent bitmap, rows bottom-up and
/// aligned to 32 bits, that the platform can draw on.
class TBitmap {
public:
    /// Changes layout and size; pixels become 0. False without room, and the size is then 0.
    [[nodiscard]] bool SetSize(std::int32_t width, std::int32_t height, TBitmapPixelFormat format);
    std::int32_t GetWidth() const { return width_; }
    std::int32_t GetHeight() const { return height_; }
    TBitmapPixelFormat GetPixelFormat() const { return format_; }
    /// Address of a row, top row 0; stable until SetSize.
    std::uint8_t* GetScanLine(std::int32_t row);
    /// 256 entries; used by pf8bit (and the first two by pf1bit).
    std::vector<TRGB>& ColorTable() { return color_table_; }
    /// What the platform's drawing takes; its section changes with SetSize and is nil at size 0.
    platform::TDrawTarget GetDrawTarget();
    /// Another number after each SetSize: addresses alone may come back with other pixels.
    std::uint32_t GetGeneration() const { return generation_; }
    bool GetModified() const { return modified_; }
    void SetModified(bool modified) { modified_ = modified; }

private:
    std::int32_t width_ = 0;
    std::int32_t height_ = 0;
    std::int64_t row_len_ = 0;
    TBitmapPixelFormat format_ = pfNone;
    bool modified_ = false;
    std::uint32_t generation_ = 0;
    std::unique_ptr<platform::TDibSection> section_;
    std::vector<TRGB> color_table_ = std::vector<TRGB>(256);
};

}  // namespace zm
