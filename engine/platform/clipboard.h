#pragma once

#include <cstddef>
#include <cstdint>
#include <functional>
#include <memory>
#include <span>
#include <string>

/// The system's clipboard: blocks of bytes, one a format, shared with other programs.
///
/// Where the system has none of its own, formats go by the names that programs there use:
/// kClipboardDib as "image/bmp" (a file header before the block), one registered as "PNG" as
/// "image/png", others under the name they are registered by. What this process put there is
/// served as long as it lives, and given to a clipboard manager at its end when one runs. Without
/// a display, the clipboard is one within the process.
namespace zm::platform {

/// A number of the system's own, or one that ClipboardFormatNamed gave.
using TClipboardFormat = std::uint32_t;
/// A packed device-independent bitmap.
inline constexpr TClipboardFormat kClipboardDib = 8;
/// An enhanced metafile, as the bytes of its file. Read only, and not on all systems.
inline constexpr TClipboardFormat kClipboardEnhMetafile = 14;

/// The number of a format that programs agree on by name, the same for the same name; 0 on
/// failure. Any thread.
TClipboardFormat ClipboardFormatNamed(const std::u16string& name);

using TFillBlock = std::function<bool(std::span<std::uint8_t> block)>;
using TUseBlock = std::function<bool(std::span<const std::uint8_t> block)>;

/// The clipboard while it is open; at most one on the whole system, or, where the system does not
/// know of opening, in the process. Closes with its end. Belongs to the thread that opened it.
/// No call waits without a bound, whatever other programs do.
class TClipboard {
public:
    /// One try. Nil while it is open elsewhere, and where there is none.
    static std::unique_ptr<TClipboard> Open();
    virtual ~TClipboard() = default;
    TClipboard(const TClipboard&) = delete;
    TClipboard& operator=(const TClipboard&) = delete;

    /// Drops all that is there; what is set from now on is ours.
    virtual bool Empty() = 0;
    /// Puts a block of at least one byte there, after Empty. `fill` writes it, from its first
    /// byte on, and tells whether it could; the block is freed here only when setting failed.
    virtual bool SetBlock(TClipboardFormat format, std::int64_t size_bytes,
                          const TFillBlock& fill) = 0;
    virtual bool IsAvailable(TClipboardFormat format) = 0;
    /// Hands the block to `use`, for the length of that call, and passes its answer on. A block
    /// may be longer than what was set. False without asking when there is none, and when a block
    /// that has to be copied from another program comes too slowly or exceeds `max_bytes`.
    virtual bool UseBlock(TClipboardFormat format, std::int64_t max_bytes,
                          const TUseBlock& use) = 0;
    /// False when what was set is not there for others. Nothing else may be called afterwards.
    virtual bool Close() = 0;

protected:
    TClipboard() = default;
};

}  // namespace zm::platform
