#include "engine/platform/clipboard.h"

#include <algorithm>
#include <limits>
#include <mutex>
#include <new>
#include <utility>
#include <vector>

#include "engine/foundation/zmstrings.h"
#include "engine/platform/linux/clipboard_x11_p.h"
#include "engine/platform/linux/support_p.h"

namespace zm::platform {
namespace {

/// Numbers of registered formats, as elsewhere.
constexpr TClipboardFormat kFirstRegistered = 0xC000;
constexpr std::size_t kMostRegistered = 0x4000;

struct TFormatNames {
    std::mutex mutex;
    std::vector<std::string> names;
};

TFormatNames& FormatNames() {
    static TFormatNames names;
    return names;
}

std::string RegisteredName(TClipboardFormat format) {
    TFormatNames& known = FormatNames();
    const std::lock_guard lock(known.mutex);
    const std::size_t index = format - kFirstRegistered;
    return format >= kFirstRegistered && index < known.names.size() ? known.names[index]
                                                                    : std::string();
}

/// The process's side of the clipboard. Its end hands the selection over.
struct TProcessClipboard {
    std::mutex open;            ///< held while the clipboard is open
    TClipboardContent content;  ///< without a display
    TXSelectionOwner owner;
};

TProcessClipboard& ProcessClipboard() {
    static TProcessClipboard clipboard;
    return clipboard;
}

const TClipboardItem* FindItem(const TClipboardContent& content, TClipboardFormat format) {
    const auto found = std::find_if(content.begin(), content.end(),
                                    [&](const auto& item) { return item.format == format; });
    return found != content.end() ? &*found : nullptr;
}

/// Content of our own is at hand as it was set; that of other programs is read when asked for.
/// What is set becomes visible to others when the clipboard closes, all at once: clipboard
/// managers read as soon as they see a new owner.
class TLinuxClipboard : public TClipboard {
public:
    explicit TLinuxClipboard(std::unique_lock<std::mutex> lock) : lock_(std::move(lock)) {
        TWriteSignalGuard guard;
        TProcessClipboard& process = ProcessClipboard();
        connection_ = TXConnection::Connect();
        if (connection_ == nullptr) {
            content_ = process.content;
            return;
        }
        const xcb_window_t owner = connection_->SelectionOwner(connection_->Atom("CLIPBOARD"));
        content_ = process.owner.ContentOf(owner);
        if (content_.empty() && owner != XCB_NONE) {
            reader_ = std::make_unique<TXSelectionReader>(*connection_);
        }
        guard.Consume();
    }
    ~TLinuxClipboard() override { CloseIfOpen(); }

    bool Empty() override {
        content_.clear();
        reader_.reset();
        is_ours_ = true;
        return true;
    }

    bool SetBlock(TClipboardFormat format, std::int64_t size_bytes,
                  const TFillBlock& fill) override {
        if (!is_ours_ || size_bytes < 1 ||
            size_bytes > std::numeric_limits<std::ptrdiff_t>::max()) {
            return false;
        }
        std::shared_ptr<std::vector<std::uint8_t>> block;
        try {
            block =
                std::make_shared<std::vector<std::uint8_t>>(static_cast<std::size_t>(size_bytes));
        } catch (const std::bad_alloc&) {
            return false;
        }
        if (!fill(*block)) {
            return false;
        }
        std::erase_if(content_, [&](const auto& item) { return item.format == format; });
        content_.push_back({format, std::move(block)});
        return true;
    }

    bool IsAvailable(TClipboardFormat format) override {
        return FindItem(content_, format) != nullptr ||
               (reader_ != nullptr && reader_->IsAvailable(format));
    }

    bool UseBlock(TClipboardFormat format, std::int64_t max_bytes, const TUseBlock& use) override {
        if (reader_ != nullptr) {
            const std::vector<std::uint8_t> bytes = reader_->Read(format, max_bytes);
            return !bytes.empty() && use(bytes);
        }
        const TClipboardItem* const item = FindItem(content_, format);
        return item != nullptr && use(*item->bytes);
    }

    bool Close() override { return CloseIfOpen(); }

private:
    bool CloseIfOpen() {
        if (!lock_.owns_lock()) {
            return false;
        }
        TProcessClipboard& process = ProcessClipboard();
        bool is_there = true;
        if (is_ours_ && connection_ != nullptr) {
            is_there = process.owner.Publish(content_);
        } else if (is_ours_) {
            process.content = std::move(content_);
        }
        lock_.unlock();
        return is_there;
    }

    std::unique_lock<std::mutex> lock_;
    /// Open to the end: a display that loses its last program may start anew, and lose the
    /// selection owner that is just coming.
    std::unique_ptr<TXConnection> connection_;
    bool is_ours_ = false;
    TClipboardContent content_;
    std::unique_ptr<TXSelectionReader> reader_;
};

}  // namespace

std::vector<std::string> TargetNamesOf(TClipboardFormat format) {
    if (format == kClipboardDib) {
        return {"image/bmp", "image/x-bmp", "image/x-MS-bmp"};
    }
    const std::string name = RegisteredName(format);
    if (name.empty()) {
        return {};
    }
    return {name == "PNG" ? "image/png" : name};
}

TClipboardFormat ClipboardFormatNamed(const std::u16string& name) {
    const std::string wanted = Utf8FromUtf16(name);
    TFormatNames& known = FormatNames();
    const std::lock_guard lock(known.mutex);
    const auto found = std::find(known.names.begin(), known.names.end(), wanted);
    const auto index = static_cast<std::size_t>(found - known.names.begin());
    if (found == known.names.end()) {
        constexpr std::size_t kMostNameBytes = 255;
        if (wanted.empty() || wanted.size() > kMostNameBytes || index >= kMostRegistered) {
            return 0;
        }
        known.names.push_back(wanted);
    }
    return kFirstRegistered + static_cast<TClipboardFormat>(index);
}

std::unique_ptr<TClipboard> TClipboard::Open() {
    std::unique_lock lock(ProcessClipboard().open, std::try_to_lock);
    if (!lock.owns_lock()) {
        return nullptr;
    }
    return std::make_unique<TLinuxClipboard>(std::move(lock));
}

}  // namespace zm::platform
