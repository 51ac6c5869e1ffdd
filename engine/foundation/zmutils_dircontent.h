#pragma once

#include <cstdint>
#include <memory>
#include <string>
#include <vector>

namespace zm {

namespace platform {
class TDirectoryReader;
}

/// A walk over a folder, not over the folders below it. The fields speak of the last item that
/// GetItem gave. One thread at a time.
class TZmDirContent {
public:
    /// `dir` is a folder, or a folder and a pattern in which "*" stands for any characters and
    /// "?" for one ("photos/*.png"; "*.*" is every name); letters match without case. A folder
    /// that cannot be read has no items. With `CheckDirLinks` a name ending in ".LNK" that is a
    /// shortcut to a folder counts as a folder.
    explicit TZmDirContent(const std::u16string& dir, bool CheckDirLinks = false);
    ~TZmDirContent();
    TZmDirContent(const TZmDirContent&) = delete;
    TZmDirContent& operator=(const TZmDirContent&) = delete;

    /// The next name of the wanted kinds, without its folder, in the system's order; false when
    /// there is no more. "." and ".." are no items.
    bool GetItem(std::u16string& sFilename, bool bGetFiles = true, bool bGetDirs = true,
                 bool bGetHidden = true);

    bool IsDir() const { return fIsDir; }
    bool IsHidden() const { return fIsHidden; }
    std::int64_t FileSizeBytes() const { return fFileSizeBytes; }
    /// Nanoseconds since 1970-01-01 UTC: creation, last change, last access.
    std::int64_t CreateDate() const { return fCreateDate; }
    std::int64_t EditDate() const { return fEditDate; }
    std::int64_t AccessDate() const { return fAccessDate; }

    /// Adds all names of the wanted kinds to `strings`, with their folder when `bFullPath`.
    static void PopulateStrings(const std::u16string& path, std::vector<std::u16string>& strings,
                                bool bGetFiles = true, bool bGetDirs = true, bool bGetHidden = true,
                                bool bFullPath = true, bool CheckDirLinks = false);

private:
    bool IsFolderLink(const std::u16string& name) const;

    std::unique_ptr<platform::TDirectoryReader> fHandle;  ///< nil when nothing can be read
    std::u16string fDirectory;                            ///< with trailing separator, or empty
    std::u16string fPattern;                              ///< empty: every name
    bool fCheckLinks;
    bool fIsDir = false;
    bool fIsHidden = false;
    std::int64_t fFileSizeBytes = 0;
    std::int64_t fCreateDate = 0;
    std::int64_t fEditDate = 0;
    std::int64_t fAccessDate = 0;
};

}  // namespace zm
