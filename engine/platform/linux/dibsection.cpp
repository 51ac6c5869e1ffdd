#include "engine/platform/dibsection.h"

#include <cstdlib>
#include <new>
#include <utility>

namespace zm::platform {
namespace {

/// There is no drawing system to share with: the pixels are the process's own. Memory that the
/// system hands out zeroed is not written here, so that a large picture of which little is drawn
/// costs little.
class TMemorySection : public TDibSection {
public:
    explicit TMemorySection(std::size_t pixel_bytes)
        : pixels_(static_cast<std::uint8_t*>(std::calloc(pixel_bytes, 1))) {}
    ~TMemorySection() override { std::free(pixels_); }
    bool IsValid() const { return pixels_ != nullptr; }
    std::uint8_t* Bits() override { return pixels_; }
    void* DeviceContext() const override { return nullptr; }
    void* Handle() const override { return nullptr; }

private:
    std::uint8_t* const pixels_;
};

}  // namespace

std::unique_ptr<TDibSection> TDibSection::Create(const void* bitmap_info, std::size_t pixel_bytes) {
    if (bitmap_info == nullptr || pixel_bytes == 0) {
        return nullptr;
    }
    std::unique_ptr<TMemorySection> section(new (std::nothrow) TMemorySection(pixel_bytes));
    return section != nullptr && section->IsValid() ? std::move(section) : nullptr;
}

}  // namespace zm::platform
