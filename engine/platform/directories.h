#pragma once

#include <cstdint>
#include <memory>
#include <string>

#include "engine/platform/files.h"

/// What folders hold.
namespace zm::platform {

struct TDirectoryEntry {
    std::u16string name;  ///< without the folder
    bool is_folder = false;
    bool is_hidden = false;       ///< by attribute; where there is none, by a leading dot
    std::int64_t size_bytes = 0;  ///< 0 for folders
    TFileTimes times;
};

/// The entries of a folder, without "." and "..", in the order of the system. Links are followed;
/// one that leads nowhere is an entry of its own. One thread at a time.
class TDirectoryReader {
public:
    virtual ~TDirectoryReader() = default;
    /// False past the last entry. An entry that vanishes meanwhile is left out.
    virtual bool Next(TDirectoryEntry& entry) = 0;
};

/// Opens a folder (empty: the current one); nil when there is none or it must not be read.
std::unique_ptr<TDirectoryReader> OpenDirectory(const std::u16string& folder);

}  // namespace zm::platform
