#include "engine/foundation/zmutils_dircontent.h"

#include <algorithm>
#include <array>
#include <string_view>

#include "engine/foundation/zmstreams.h"
#include "engine/foundation/zmstrings.h"
#include "engine/platform/directories.h"

namespace zm {
namespace {

/// Whether a name fits a pattern. Remembers the last star only, so that the time is at most the
/// product of the lengths.
bool FitsPattern(std::u16string_view name, std::u16string_view pattern) {
    std::size_t at = 0;
    std::size_t in_pattern = 0;
    std::size_t star = std::u16string_view::npos;
    std::size_t star_end = 0;  // how much of the name the star has taken
    while (at < name.size()) {
        const char16_t wanted = in_pattern < pattern.size() ? pattern[in_pattern] : u'\0';
        if (wanted == u'*') {
            star = in_pattern++;
            star_end = at;
        } else if (in_pattern < pattern.size() && (wanted == u'?' || wanted == name[at])) {
            ++at;
            ++in_pattern;
        } else if (star != std::u16string_view::npos) {
            in_pattern = star + 1;
            at = ++star_end;
        } else {
            return false;
        }
    }
    return pattern.find_first_not_of(u'*', in_pattern) == std::u16string_view::npos;
}

/// The beginning of a shortcut file ([MS-SHLLINK] 2.1): header size, the class of shortcuts, the
/// flags, then the attributes of what it leads to, all little-endian.
constexpr std::size_t kLinkHeaderBytes = 28;
constexpr std::size_t kLinkAttributesOffset = 24;
constexpr std::uint8_t kLinkMagic[20] = {
    0x4C, 0x00, 0x00, 0x00,                          // 76 bytes of header
    0x01, 0x14, 0x02, 0x00, 0x00, 0x00, 0x00, 0x00,  // 00021401-0000-0000-C000-000000000046
    0xC0, 0x00, 0x00, 0x00, 0x00, 0x00, 0x00, 0x46,
};
constexpr std::uint8_t kDirectoryAttribute = 0x10;

bool LeadsToFolder(TStream& link) {
    std::array<std::uint8_t, kLinkHeaderBytes> header{};
    const auto wanted = static_cast<std::int32_t>(header.size());
    return link.Read(header.data(), wanted) == wanted &&
           std::equal(std::begin(kLinkMagic), std::end(kLinkMagic), header.begin()) &&
           (header[kLinkAttributesOffset] & kDirectoryAttribute) != 0;
}

}  // namespace

TZmDirContent::TZmDirContent(const std::u16string& dir, bool CheckDirLinks)
    : fDirectory(dir), fCheckLinks(CheckDirLinks) {
    std::u16string last = FileBaseName(dir);
    if (last.find_first_of(u"*?") != std::u16string::npos) {
        fDirectory = FileFolder(dir);
        fPattern = last == u"*.*" ? std::u16string() : FoldKeyCase(last);
    }
    fHandle = platform::OpenDirectory(fDirectory);
    if (!fDirectory.empty() && !platform::IsPathSeparator(fDirectory.back())) {
        fDirectory += u'/';  // every system takes it
    }
}

TZmDirContent::~TZmDirContent() = default;

bool TZmDirContent::IsFolderLink(const std::u16string& name) const {
    if (!fCheckLinks || !AsciiEqualNoCase(FileExtension(name), u".lnk")) {
        return false;
    }
    try {
        TFileStream link(fDirectory + name, fmOpenRead);
        return LeadsToFolder(link);
    } catch (const EFOpenError&) {
        return false;  // a shortcut that cannot be read is a plain file
    }
}

bool TZmDirContent::GetItem(std::u16string& sFilename, bool bGetFiles, bool bGetDirs,
                            bool bGetHidden) {
    platform::TDirectoryEntry entry;
    while (fHandle != nullptr && fHandle->Next(entry)) {
        if (!fPattern.empty() && !FitsPattern(FoldKeyCase(entry.name), fPattern)) {
            continue;
        }
        const bool is_dir = entry.is_folder || IsFolderLink(entry.name);
        if (!(is_dir ? bGetDirs : bGetFiles) || (entry.is_hidden && !bGetHidden)) {
            continue;
        }
        fIsDir = is_dir;
        fIsHidden = entry.is_hidden;
        fFileSizeBytes = entry.size_bytes;
        fCreateDate = entry.times.created_ns;
        fEditDate = entry.times.modified_ns;
        fAccessDate = entry.times.accessed_ns;
        sFilename = entry.name;
        return true;
    }
    return false;
}

void TZmDirContent::PopulateStrings(const std::u16string& path,
                                    std::vector<std::u16string>& strings, bool bGetFiles,
                                    bool bGetDirs, bool bGetHidden, bool bFullPath,
                                    bool CheckDirLinks) {
    TZmDirContent content(path, CheckDirLinks);
    std::u16string name;
    while (content.GetItem(name, bGetFiles, bGetDirs, bGetHidden)) {
        strings.push_back(bFullPath ? content.fDirectory + name : name);
    }
}

}  // namespace zm
