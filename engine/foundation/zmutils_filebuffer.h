#pragma once

#include <cstdint>
#include <memory>
#include <string>
#include <unordered_map>
#include <vector>

#include "engine/foundation/zmdefs.h"
#include "engine/foundation/zmstreams.h"

namespace zm {

namespace platform {
class TTemporaryMapping;
}

/// A block of bytes in a temporary file of which windows are mapped into memory. The file lives
/// in `fDefTempPath` of the settings, or the system's folder for temporary files when that is
/// empty, and goes with the object. Not thread-safe.
///
/// Map serves a request out of a window that is mapped already whenever one covers it (windows
/// begin at multiples of 16 MiB, 4 MiB where addresses have 32 bits, and reach an eighth of that
/// into the next), so that walking rows up or down costs a system call only once a window. A
/// request that no aligned window can hold gets one of its own. A window stays mapped while any
/// pointer into it is in use; of the others the four used last stay.
class TZmFileBuffer {
public:
    TZmFileBuffer();
    ~TZmFileBuffer();
    TZmFileBuffer(const TZmFileBuffer&) = delete;
    TZmFileBuffer& operator=(const TZmFileBuffer&) = delete;

    /// Makes a file of `size_bytes` zero bytes; an earlier file is dropped. `descriptor` becomes
    /// part of the file's name. With `use_disk` false the bytes may stay in memory. False when
    /// the size is below 1 or there is no room.
    [[nodiscard]] bool AllocateFile(std::int64_t size_bytes, const std::string& descriptor,
                                    bool use_disk);
    /// Changes the size; bytes up to the smaller size are kept. All mappings must be released.
    [[nodiscard]] bool ReAllocateFile(std::int64_t new_size_bytes);
    /// Address of byte `position`, valid for `size_bytes` bytes until UnMap; nil when the range
    /// is not inside the file or cannot be mapped.
    void* Map(std::int64_t position, std::int64_t size_bytes, TZmDataAccess access);
    /// Releases one mapping made by Map; a pointer that is not mapped is ignored.
    void UnMap(void* pointer);
    void UnMapAll();
    bool IsAllocated() const;
    std::int64_t GetSize() const { return size_bytes_; }
    void DeAllocate();
    /// Copy of all bytes; false when the target cannot be made or written.
    [[nodiscard]] bool CopyTo(TZmFileBuffer& target);
    [[nodiscard]] bool CopyTo(TStream& target);
    [[nodiscard]] bool CopyFrom(TStream& source, std::int64_t size_bytes);
    /// Windows mapped now; for tests of the window rule.
    std::size_t MappedWindowCount() const;

private:
    struct TWindow;
    struct TMapping {
        TWindow* window = nullptr;
        std::uint32_t count = 0;
    };
    TWindow* FindWindow(std::int64_t position, std::int64_t size_bytes);
    TWindow* OpenWindow(std::int64_t position, std::int64_t size_bytes);
    TWindow* MapNewWindow(std::int64_t position, std::int64_t size_bytes);
    void DropIdleWindows(std::size_t kept);
    void DropWindows();
    bool CopyInto(TZmFileBuffer& target);
    bool ReAllocateMemory(std::int64_t new_size_bytes);

    std::unique_ptr<platform::TTemporaryMapping> file_;
    std::uint8_t* memory_ = nullptr;  ///< all bytes, when they are not in a file
    std::vector<std::unique_ptr<TWindow>> windows_;
    std::unordered_map<void*, TMapping> mappings_;
    std::int64_t size_bytes_ = 0;
    std::uint64_t use_clock_ = 0;
    std::string descriptor_;
};

}  // namespace zm
