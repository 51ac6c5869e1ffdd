#pragma once

#include <cstddef>
#include <cstdint>
#include <memory>

/// Pictures in the system's device-independent form.
namespace zm::platform {

/// Pixels that the system's drawing calls and this process share: bottom row first, rows of whole
/// 32-bit words, zero at the start. Where the system has no such calls they lie in plain memory.
/// Belongs to one thread at a time.
class TDibSection {
public:
    /// `bitmap_info` is an info header of 40 bytes with its colour table behind it, uncompressed
    /// and with a positive height; `pixel_bytes` are the bytes that it describes. Nil when the
    /// system has no room.
    static std::unique_ptr<TDibSection> Create(const void* bitmap_info, std::size_t pixel_bytes);
    virtual ~TDibSection() = default;
    TDibSection(const TDibSection&) = delete;
    TDibSection& operator=(const TDibSection&) = delete;

    /// The first byte of the bottom row. Drawing of the system is complete when this returns.
    virtual std::uint8_t* Bits() = 0;
    /// The memory device context with the section selected, and the section's handle; nil where
    /// the system has none.
    virtual void* DeviceContext() const = 0;
    virtual void* Handle() const = 0;

protected:
    TDibSection() = default;
};

}  // namespace zm::platform
