#include "engine/platform/dibsection.h"

#include <windows.h>

namespace zm::platform {
namespace {

class TGdiSection : public TDibSection {
public:
    TGdiSection() : context_(::CreateCompatibleDC(nullptr)) {}
    ~TGdiSection() override {
        if (previous_ != nullptr) {
            ::SelectObject(context_, previous_);
        }
        if (section_ != nullptr) {
            ::DeleteObject(section_);
        }
        if (context_ != nullptr) {
            ::DeleteDC(context_);
        }
    }

    bool Open(const void* bitmap_info) {
        if (context_ == nullptr) {
            return false;
        }
        section_ = ::CreateDIBSection(context_, static_cast<const BITMAPINFO*>(bitmap_info),
                                      DIB_RGB_COLORS, &bits_, nullptr, 0);
        if (section_ == nullptr || bits_ == nullptr) {
            return false;
        }
        previous_ = ::SelectObject(context_, section_);
        return true;
    }

    std::uint8_t* Bits() override {
        ::GdiFlush();
        return static_cast<std::uint8_t*>(bits_);
    }
    void* DeviceContext() const override { return context_; }
    void* Handle() const override { return section_; }

private:
    HDC context_ = nullptr;
    HBITMAP section_ = nullptr;
    HGDIOBJ previous_ = nullptr;
    void* bits_ = nullptr;
};

}  // namespace

std::unique_ptr<TDibSection> TDibSection::Create(const void* bitmap_info, std::size_t pixel_bytes) {
    if (bitmap_info == nullptr || pixel_bytes == 0) {
        return nullptr;
    }
    auto section = std::make_unique<TGdiSection>();
    if (!section->Open(bitmap_info)) {
        return nullptr;
    }
    return section;
}

}  // namespace zm::platform
