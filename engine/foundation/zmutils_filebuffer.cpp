#include "engine/foundation/zmutils_filebuffer.h"

#include <algorithm>
#include <cstring>

#include "engine/foundation/zmassert.h"
#include "engine/foundation/zmnumbers.h"
#include "engine/foundation/zmsettings.h"
#include "engine/platform/memory.h"
#include "engine/platform/tempmapping.h"

namespace zm {
namespace {

/// Windows begin at multiples of this; they are small where addresses are scarce.
constexpr std::int64_t kWindowStep = sizeof(void*) == 4 ? (4 << 20) : (16 << 20);
/// A window reaches so far into the next one that a row across the border, whichever way rows
/// are walked, lies in one of the two.
constexpr std::int64_t kWindowBytes = kWindowStep + kWindowStep / 8;
/// Windows without use that stay mapped for later requests.
constexpr std::size_t kKeptIdleWindows = 4;
constexpr std::int32_t kCopyBytes = 1 << 20;

std::int64_t AlignDown(std::int64_t position, std::int64_t alignment) {
    return position & ~(alignment - 1);
}

}  // namespace

/// A mapped range of the file.
struct TZmFileBuffer::TWindow {
    TWindow(platform::TTemporaryMapping& file, std::int64_t start, std::int64_t size_bytes)
        : owner(file),
          position(start),
          size(size_bytes),
          address(static_cast<std::uint8_t*>(
              file.MapWindow(start, static_cast<std::size_t>(size_bytes)))) {}
    ~TWindow() {
        if (address != nullptr) {
            owner.UnmapWindow(address, static_cast<std::size_t>(size));
        }
    }
    TWindow(const TWindow&) = delete;
    TWindow& operator=(const TWindow&) = delete;
    bool Covers(std::int64_t start, std::int64_t size_bytes) const {
        return start >= position && start + size_bytes <= position + size;
    }

    platform::TTemporaryMapping& owner;
    std::int64_t position;
    std::int64_t size;
    std::uint8_t* address;
    std::uint32_t use_count = 0;  // mappings handed out
    std::uint64_t last_use = 0;
};

TZmFileBuffer::TZmFileBuffer() = default;

TZmFileBuffer::~TZmFileBuffer() {
    DeAllocate();
}

bool TZmFileBuffer::AllocateFile(std::int64_t size_bytes, const std::string& descriptor,
                                 bool use_disk) {
    DeAllocate();
    if (size_bytes < 1) {
        return false;
    }
    descriptor_ = descriptor;
    if (!use_disk && FitsAddressSpace(size_bytes)) {
        memory_ = static_cast<std::uint8_t*>(
            platform::SystemHeapAllocate(static_cast<std::size_t>(size_bytes)));
    }
    if (memory_ == nullptr) {
        file_ = platform::CreateTemporaryMapping(ZmGlobalSettings().fDefTempPath, descriptor,
                                                 size_bytes);
    }
    size_bytes_ = IsAllocated() ? size_bytes : 0;
    return IsAllocated();
}

bool TZmFileBuffer::ReAllocateMemory(std::int64_t new_size_bytes) {
    if (!FitsAddressSpace(new_size_bytes)) {
        return false;
    }
    auto* const block = static_cast<std::uint8_t*>(
        platform::SystemHeapAllocate(static_cast<std::size_t>(new_size_bytes)));
    if (block == nullptr) {
        return false;
    }
    std::memcpy(block, memory_, static_cast<std::size_t>(std::min(size_bytes_, new_size_bytes)));
    platform::SystemHeapFree(memory_, static_cast<std::size_t>(size_bytes_));
    memory_ = block;
    return true;
}

bool TZmFileBuffer::ReAllocateFile(std::int64_t new_size_bytes) {
    if (!IsAllocated() || new_size_bytes < 1 || !mappings_.empty()) {
        return false;
    }
    DropWindows();
    const bool changed =
        memory_ != nullptr ? ReAllocateMemory(new_size_bytes) : file_->Resize(new_size_bytes);
    if (changed) {
        size_bytes_ = new_size_bytes;
    }
    return changed;
}

void TZmFileBuffer::DropIdleWindows(std::size_t kept) {
    const auto is_idle = [](const auto& window) { return window->use_count == 0; };
    auto idle = static_cast<std::size_t>(std::count_if(windows_.begin(), windows_.end(), is_idle));
    while (idle > kept) {
        // The least recently used one; windows in use sort behind all others.
        const auto oldest =
            std::min_element(windows_.begin(), windows_.end(), [&](const auto& a, const auto& b) {
                return is_idle(a) != is_idle(b) ? is_idle(a) : a->last_use < b->last_use;
            });
        windows_.erase(oldest);
        --idle;
    }
}

void TZmFileBuffer::DropWindows() {
    mappings_.clear();
    windows_.clear();
}

TZmFileBuffer::TWindow* TZmFileBuffer::FindWindow(std::int64_t position, std::int64_t size_bytes) {
    for (const auto& window : windows_) {
        if (window->Covers(position, size_bytes)) {
            return window.get();
        }
    }
    return nullptr;
}

TZmFileBuffer::TWindow* TZmFileBuffer::MapNewWindow(std::int64_t position,
                                                    std::int64_t size_bytes) {
    if (!FitsAddressSpace(size_bytes)) {
        return nullptr;
    }
    auto window = std::make_unique<TWindow>(*file_, position, size_bytes);
    if (window->address == nullptr) {
        return nullptr;
    }
    windows_.push_back(std::move(window));
    return windows_.back().get();
}

/// A new window for a request: the aligned one around it, or, when it crosses that one's end, one
/// that begins as near before it as the system allows. Where addresses have run short, all idle
/// windows go and the new one is as small as the request.
TZmFileBuffer::TWindow* TZmFileBuffer::OpenWindow(std::int64_t position, std::int64_t size_bytes) {
    const std::int64_t end = position + size_bytes;
    const std::int64_t nearest =
        AlignDown(position, static_cast<std::int64_t>(platform::WindowAlignment()));
    const std::int64_t around = AlignDown(position, kWindowStep);
    const std::int64_t start = end - around <= kWindowBytes ? around : nearest;
    const std::int64_t wanted = std::max(kWindowBytes, end - start);
    DropIdleWindows(kKeptIdleWindows - 1);
    TWindow* window = MapNewWindow(start, std::min(size_bytes_ - start, wanted));
    if (window == nullptr) {
        DropIdleWindows(0);
        window = MapNewWindow(nearest, end - nearest);
    }
    return window;
}

void* TZmFileBuffer::Map(std::int64_t position, std::int64_t size_bytes, TZmDataAccess) {
    const bool inside = position >= 0 && size_bytes >= 1 && position < size_bytes_ &&
                        size_bytes <= size_bytes_ - position;
    if (!inside) {
        return nullptr;
    }
    if (memory_ != nullptr) {
        ++mappings_[memory_ + position].count;
        return memory_ + position;
    }
    TWindow* window = FindWindow(position, size_bytes);
    if (window == nullptr) {
        window = OpenWindow(position, size_bytes);
    }
    if (window == nullptr) {
        return nullptr;
    }
    void* const address = window->address + (position - window->position);
    TMapping& mapping = mappings_[address];
    mapping.window = window;
    ++mapping.count;
    ++window->use_count;
    window->last_use = ++use_clock_;
    return address;
}

void TZmFileBuffer::UnMap(void* pointer) {
    const auto found = mappings_.find(pointer);
    if (found == mappings_.end()) {
        return;
    }
    TWindow* const window = found->second.window;
    if (--found->second.count == 0) {
        mappings_.erase(found);
    }
    if (window != nullptr) {
        ZM_ASSERT(window->use_count > 0);
        if (--window->use_count == 0) {
            DropIdleWindows(kKeptIdleWindows);
        }
    }
}

void TZmFileBuffer::UnMapAll() {
    mappings_.clear();
    for (const auto& window : windows_) {
        window->use_count = 0;
    }
    DropIdleWindows(kKeptIdleWindows);
}

bool TZmFileBuffer::IsAllocated() const {
    return file_ != nullptr || memory_ != nullptr;
}

void TZmFileBuffer::DeAllocate() {
    DropWindows();
    file_.reset();
    if (memory_ != nullptr) {
        platform::SystemHeapFree(memory_, static_cast<std::size_t>(size_bytes_));
        memory_ = nullptr;
    }
    size_bytes_ = 0;
}

bool TZmFileBuffer::CopyInto(TZmFileBuffer& target) {
    for (std::int64_t done = 0; done < size_bytes_; done += kCopyBytes) {
        const std::int64_t piece = std::min<std::int64_t>(kCopyBytes, size_bytes_ - done);
        void* const from = Map(done, piece, zmdRead);
        void* const to = target.Map(done, piece, zmdWrite);
        const bool mapped = from != nullptr && to != nullptr;
        if (mapped) {
            std::memcpy(to, from, static_cast<std::size_t>(piece));
        }
        UnMap(from);
        target.UnMap(to);
        if (!mapped) {
            return false;
        }
    }
    return true;
}

bool TZmFileBuffer::CopyTo(TZmFileBuffer& target) {
    if (&target == this) {
        return IsAllocated();
    }
    const bool use_disk = memory_ == nullptr;
    return IsAllocated() && target.AllocateFile(size_bytes_, descriptor_, use_disk) &&
           CopyInto(target);
}

bool TZmFileBuffer::CopyTo(TStream& target) {
    for (std::int64_t done = 0; done < size_bytes_; done += kCopyBytes) {
        const auto piece =
            static_cast<std::int32_t>(std::min<std::int64_t>(kCopyBytes, size_bytes_ - done));
        void* const from = Map(done, piece, zmdRead);
        const bool written = from != nullptr && target.Write(from, piece) == piece;
        UnMap(from);
        if (!written) {
            return false;
        }
    }
    return IsAllocated();
}

bool TZmFileBuffer::CopyFrom(TStream& source, std::int64_t size_bytes) {
    const bool use_disk = memory_ == nullptr;
    if (!AllocateFile(size_bytes, std::string(descriptor_), use_disk)) {
        return false;
    }
    for (std::int64_t done = 0; done < size_bytes_; done += kCopyBytes) {
        const auto piece =
            static_cast<std::int32_t>(std::min<std::int64_t>(kCopyBytes, size_bytes_ - done));
        void* const to = Map(done, piece, zmdWrite);
        const bool read = to != nullptr && source.Read(to, piece) == piece;
        UnMap(to);
        if (!read) {
            return false;
        }
    }
    return true;
}

std::size_t TZmFileBuffer::MappedWindowCount() const {
    return windows_.size();
}

}  // namespace zm
