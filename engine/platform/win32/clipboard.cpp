#include "engine/platform/clipboard.h"

#include <windows.h>

#include <limits>
#include <new>
#include <vector>

#include "engine/platform/win32/support_p.h"

namespace zm::platform {
namespace {

/// A movable block of the system's, freed with this object unless the system took it.
class TMovableBlock {
public:
    explicit TMovableBlock(std::size_t size_bytes)
        : handle_(::GlobalAlloc(GMEM_MOVEABLE, size_bytes)) {}
    ~TMovableBlock() {
        if (handle_ != nullptr) {
            ::GlobalFree(handle_);
        }
    }
    TMovableBlock(const TMovableBlock&) = delete;
    TMovableBlock& operator=(const TMovableBlock&) = delete;

    HGLOBAL Get() const { return handle_; }
    void GiveAway() { handle_ = nullptr; }

private:
    HGLOBAL handle_;
};

/// The bytes of a block while it is locked; nil when it cannot be.
class TBlockLock {
public:
    explicit TBlockLock(HGLOBAL block)
        : block_(block), bytes_(static_cast<std::uint8_t*>(::GlobalLock(block))) {}
    ~TBlockLock() {
        if (bytes_ != nullptr) {
            ::GlobalUnlock(block_);
        }
    }
    TBlockLock(const TBlockLock&) = delete;
    TBlockLock& operator=(const TBlockLock&) = delete;

    std::uint8_t* Bytes() const { return bytes_; }

private:
    HGLOBAL block_;
    std::uint8_t* bytes_;
};

bool FillMovableBlock(HGLOBAL block, std::size_t size_bytes, const TFillBlock& fill) {
    const TBlockLock lock(block);
    return lock.Bytes() != nullptr && fill({lock.Bytes(), size_bytes});
}

/// The clipboard opened for a window of its own, which nobody sees and which gets messages only:
/// without a window, emptying leaves the clipboard without an owner and setting fails.
class TSystemClipboard : public TClipboard {
public:
    ~TSystemClipboard() override {
        CloseIfOpen();
        if (window_ != nullptr) {
            ::DestroyWindow(window_);
        }
    }

    bool TryOpen() {
        window_ = ::CreateWindowExW(0, L"STATIC", L"", 0, 0, 0, 0, 0, HWND_MESSAGE, nullptr,
                                    nullptr, nullptr);
        is_open_ = window_ != nullptr && ::OpenClipboard(window_) != FALSE;
        return is_open_;
    }

    bool Empty() override { return ::EmptyClipboard() != FALSE; }

    bool SetBlock(TClipboardFormat format, std::int64_t size_bytes,
                  const TFillBlock& fill) override {
        constexpr auto kMostBytes = std::numeric_limits<std::ptrdiff_t>::max();
        if (size_bytes < 1 || size_bytes > kMostBytes) {
            return false;
        }
        TMovableBlock block(static_cast<std::size_t>(size_bytes));
        if (block.Get() == nullptr ||
            !FillMovableBlock(block.Get(), static_cast<std::size_t>(size_bytes), fill) ||
            ::SetClipboardData(format, block.Get()) == nullptr) {
            return false;
        }
        block.GiveAway();
        return true;
    }

    bool IsAvailable(TClipboardFormat format) override {
        return ::IsClipboardFormatAvailable(format) != FALSE;
    }

    bool UseBlock(TClipboardFormat format, std::int64_t max_bytes, const TUseBlock& use) override {
        HANDLE const data = ::GetClipboardData(format);
        if (data == nullptr) {
            return false;
        }
        if (format == kClipboardEnhMetafile) {
            return UseMetafile(static_cast<HENHMETAFILE>(data), max_bytes, use);
        }
        const std::size_t size_bytes = ::GlobalSize(data);
        const TBlockLock lock(data);
        return lock.Bytes() != nullptr && size_bytes > 0 && use({lock.Bytes(), size_bytes});
    }

    bool Close() override { return CloseIfOpen(); }

private:
    static bool UseMetafile(HENHMETAFILE metafile, std::int64_t max_bytes, const TUseBlock& use) {
        const UINT size_bytes = ::GetEnhMetaFileBits(metafile, 0, nullptr);
        if (size_bytes == 0 || std::int64_t{size_bytes} > max_bytes) {
            return false;
        }
        std::vector<std::uint8_t> bytes;
        try {
            bytes.resize(size_bytes);
        } catch (const std::bad_alloc&) {
            return false;
        }
        return ::GetEnhMetaFileBits(metafile, size_bytes, bytes.data()) == size_bytes && use(bytes);
    }

    bool CloseIfOpen() {
        const bool was_open = is_open_;
        is_open_ = false;
        return was_open && ::CloseClipboard() != FALSE;
    }

    HWND window_ = nullptr;
    bool is_open_ = false;
};

}  // namespace

TClipboardFormat ClipboardFormatNamed(const std::u16string& name) {
    return ::RegisterClipboardFormatW(WideOf(name));
}

std::unique_ptr<TClipboard> TClipboard::Open() {
    auto clipboard = std::make_unique<TSystemClipboard>();
    if (!clipboard->TryOpen()) {
        return nullptr;
    }
    return clipboard;
}

}  // namespace zm::platform
