#include "engine/platform/dibsection.h"

#include <new>
#include <vector>

namespace zm::platform {
namespace {

/// There is no drawing system to share with: the pixels are the process's own.
class TMemorySection : public TDibSection {
public:
    explicit TMemorySection(std::size_t pixel_bytes) : pixels_(pixel_bytes) {}
    std::uint8_t* Bits() override { return pixels_.data(); }
    void* DeviceContext() const override { return nullptr; }
    void* Handle() const override { return nullptr; }

private:
    std::vector<std::uint8_t> pixels_;
};

}  // namespace

std::unique_ptr<TDibSection> TDibSection::Create(const void* bitmap_info, std::size_t pixel_bytes) {
    if (bitmap_info == nullptr || pixel_bytes == 0) {
        return nullptr;
    }
    try {
        return std::make_unique<TMemorySection>(pixel_bytes);
    } catch (const std::bad_alloc&) {
        return nullptr;
    }
}

}  // namespace zm::platform
