// Resources of a PE module ("PE Format" of Microsoft, sections "COFF File Header", "Optional
// Header", "Section Table" and "The .rsrc Section"). All numbers are little-endian. The resource
// directory is a tree of three levels: types, names, languages. Not read: 16-bit modules, modules
// inside archives.
#include "engine/foundation/zmutils_peresources_p.h"

#include <algorithm>
#include <span>

#include "engine/foundation/zmnumbers.h"

namespace zm {

using platform::TResource;
using platform::TResourceName;
using platform::TResourceType;

namespace {

constexpr std::uint16_t kDosMagic = 0x5A4D;     // "MZ"
constexpr std::uint32_t kPeMagic = 0x00004550;  // "PE", two zeros
constexpr std::uint16_t kOptionalMagic32 = 0x10B;
constexpr std::uint16_t kOptionalMagic64 = 0x20B;
constexpr std::size_t kDosHeaderBytes = 64;
constexpr std::size_t kPeOffsetField = 60;     // in the DOS header
constexpr std::size_t kCoffHeaderBytes = 24;   // with the magic before it
constexpr std::size_t kHeaderBytesField = 60;  // in the optional header
constexpr std::size_t kDataDirectory32 = 96;   // in the optional header
constexpr std::size_t kDataDirectory64 = 112;
constexpr std::size_t kResourceDirectoryIndex = 2;
constexpr std::size_t kSectionHeaderBytes = 40;
constexpr std::size_t kDirectoryHeaderBytes = 16;
constexpr std::size_t kDirectoryEntryBytes = 8;
constexpr std::size_t kDataEntryBytes = 16;
constexpr std::uint32_t kHighBit = 0x80000000;  // a text name; a directory further down
constexpr std::size_t kMaxSections = 96;        // more than that no system loads
constexpr std::int64_t kMaxTreeBytes = 16 << 20;
constexpr std::int64_t kMinReadCost = 64;  // a small read costs a call of the system too

/// Fields at places inside a block; what lies outside reads as 0.
std::uint16_t U16At(std::span<const std::uint8_t> bytes, std::size_t offset) {
    if (bytes.size() < 2 || offset > bytes.size() - 2) {
        return 0;
    }
    return static_cast<std::uint16_t>(bytes[offset] | bytes[offset + 1] << 8);
}

std::uint32_t U32At(std::span<const std::uint8_t> bytes, std::size_t offset) {
    return U16At(bytes, offset) | static_cast<std::uint32_t>(U16At(bytes, offset + 2)) << 16;
}

/// The block of a file, or none when it is not wholly inside.
std::vector<std::uint8_t> ReadBlock(TStream& stream, std::int64_t position, std::size_t count) {
    const auto bytes = static_cast<std::int64_t>(count);
    const std::int64_t size = stream.GetSize();
    if (position > size || bytes > size - position || !FitsAddressSpace(bytes)) {
        return {};
    }
    std::vector<std::uint8_t> block(count);
    stream.SetPosition(position);
    for (std::size_t done = 0; done < count;) {
        const std::size_t piece = std::min<std::size_t>(count - done, 1 << 30);
        const std::int32_t got = stream.Read(block.data() + done, static_cast<std::int32_t>(piece));
        if (got < 1) {
            return {};
        }
        done += static_cast<std::size_t>(got);
    }
    return block;
}

struct TSection {
    std::uint32_t address = 0;
    std::uint32_t file_bytes = 0;
    std::uint32_t file_offset = 0;
};

/// Where the parts of a module lie in its file.
struct TPeLayout {
    std::uint32_t resource_address = 0;  ///< 0: no resources
    std::uint32_t header_bytes = 0;      ///< addresses below this are places in the file itself
    std::vector<TSection> sections;
};

std::vector<TSection> ReadSections(TStream& module, std::int64_t position, std::size_t count) {
    const auto table =
        ReadBlock(module, position, std::min(count, kMaxSections) * kSectionHeaderBytes);
    std::vector<TSection> sections;
    for (std::size_t at = 0; at < table.size(); at += kSectionHeaderBytes) {
        sections.push_back({.address = U32At(table, at + 12),
                            .file_bytes = U32At(table, at + 16),
                            .file_offset = U32At(table, at + 20)});
    }
    return sections;
}

TPeLayout ReadLayout(TStream& module) {
    TPeLayout layout;
    const auto dos = ReadBlock(module, 0, kDosHeaderBytes);
    if (U16At(dos, 0) != kDosMagic) {
        return layout;
    }
    const std::int64_t pe = U32At(dos, kPeOffsetField);
    const auto coff = ReadBlock(module, pe, kCoffHeaderBytes);
    if (U32At(coff, 0) != kPeMagic) {
        return layout;
    }
    const std::size_t optional_bytes = U16At(coff, 20);
    const std::int64_t optional_position = pe + static_cast<std::int64_t>(kCoffHeaderBytes);
    const auto optional = ReadBlock(module, optional_position, optional_bytes);
    const std::uint16_t magic = U16At(optional, 0);
    if (magic != kOptionalMagic32 && magic != kOptionalMagic64) {
        return layout;
    }
    const std::size_t table = magic == kOptionalMagic32 ? kDataDirectory32 : kDataDirectory64;
    if (U32At(optional, table - 4) > kResourceDirectoryIndex) {
        layout.resource_address = U32At(optional, table + kResourceDirectoryIndex * 8);
    }
    layout.header_bytes = U32At(optional, kHeaderBytesField);
    layout.sections = ReadSections(
        module, optional_position + static_cast<std::int64_t>(optional_bytes), U16At(coff, 6));
    return layout;
}

/// Bytes at a relative virtual address, or none when a section's part of the file does not hold
/// them all.
std::vector<std::uint8_t> ReadAtAddress(TStream& module, const TPeLayout& layout,
                                        std::uint64_t address, std::size_t count) {
    for (const TSection& section : layout.sections) {
        if (address < section.address || address - section.address >= section.file_bytes) {
            continue;
        }
        const std::uint64_t inside = address - section.address;
        if (count > section.file_bytes - inside) {
            return {};
        }
        return ReadBlock(module, static_cast<std::int64_t>(section.file_offset + inside), count);
    }
    return {};
}

/// One entry of a directory of the tree.
struct TTreeEntry {
    TResourceName name;
    bool is_directory = false;
    std::uint32_t offset = 0;  ///< from the beginning of the tree
};

/// Reads the tree with a limit on the bytes read in all.
class TTreeReader {
public:
    TTreeReader(TStream& module, const TPeLayout& layout) : module_(module), layout_(layout) {}
    std::vector<TTreeEntry> ReadDirectory(std::uint32_t offset);
    /// The data of the entry itself, or of the first language below it; false when there is none.
    bool ReadData(const TTreeEntry& entry, TResource& resource);
    /// Whether everything was there and of its level.
    bool IsSound() const { return is_sound_; }
    void MarkFault() { is_sound_ = false; }

private:
    std::vector<std::uint8_t> Read(std::uint32_t offset, std::size_t count);
    TResourceName ReadName(std::uint32_t field);

    TStream& module_;
    const TPeLayout& layout_;
    std::int64_t bytes_left_ = kMaxTreeBytes;
    bool is_sound_ = true;
};

std::vector<std::uint8_t> TTreeReader::Read(std::uint32_t offset, std::size_t count) {
    const auto cost = std::max(static_cast<std::int64_t>(count), kMinReadCost);
    if (cost > bytes_left_) {
        MarkFault();
        return {};
    }
    bytes_left_ -= cost;
    const std::uint64_t address = std::uint64_t{layout_.resource_address} + offset;
    auto bytes = ReadAtAddress(module_, layout_, address, count);
    is_sound_ = is_sound_ && bytes.size() == count;
    return bytes;
}

TResourceName TTreeReader::ReadName(std::uint32_t field) {
    TResourceName name;
    name.is_number = (field & kHighBit) == 0;
    if (name.is_number) {
        name.number = field;
        return name;
    }
    const std::uint32_t offset = field & ~kHighBit;
    const std::size_t length = U16At(Read(offset, 2), 0);
    const auto bytes = Read(offset + 2, length * 2);
    for (std::size_t at = 0; at < bytes.size(); at += 2) {
        name.text += static_cast<char16_t>(U16At(bytes, at));
    }
    return name;
}

std::vector<TTreeEntry> TTreeReader::ReadDirectory(std::uint32_t offset) {
    const auto header = Read(offset, kDirectoryHeaderBytes);
    const std::size_t count = std::size_t{U16At(header, 12)} + U16At(header, 14);
    const auto table = Read(offset + static_cast<std::uint32_t>(kDirectoryHeaderBytes),
                            count * kDirectoryEntryBytes);
    std::vector<TTreeEntry> entries;
    for (std::size_t at = 0; at < table.size(); at += kDirectoryEntryBytes) {
        const std::uint32_t target = U32At(table, at + 4);
        entries.push_back({.name = ReadName(U32At(table, at)),
                           .is_directory = (target & kHighBit) != 0,
                           .offset = target & ~kHighBit});
    }
    return entries;
}

bool TTreeReader::ReadData(const TTreeEntry& entry, TResource& resource) {
    std::uint32_t offset = entry.offset;
    if (entry.is_directory) {
        const auto languages = ReadDirectory(entry.offset);
        if (languages.empty() || languages.front().is_directory) {
            MarkFault();
            return false;
        }
        offset = languages.front().offset;
    }
    const auto data = Read(offset, kDataEntryBytes);
    resource.data_address = U32At(data, 0);
    resource.data_bytes = U32At(data, 4);
    return !data.empty();
}

class TFileModule : public platform::TResourceModule {
public:
    explicit TFileModule(const std::u16string& file_name) : file_(file_name, fmOpenRead) {}
    std::vector<TResourceType> ReadTypes() override { return ReadPeResources(file_); }
    std::vector<std::uint8_t> ReadData(const TResource& resource) override {
        return ReadPeResourceData(file_, resource);
    }

private:
    TFileStream file_;
};

}  // namespace

std::vector<TResourceType> ReadPeResources(TStream& module, bool* is_sound) {
    std::vector<TResourceType> types;
    const TPeLayout layout = ReadLayout(module);
    if (is_sound != nullptr) {
        *is_sound = false;
    }
    if (layout.resource_address == 0) {
        return types;
    }
    TTreeReader reader(module, layout);
    for (const TTreeEntry& type : reader.ReadDirectory(0)) {
        if (!type.is_directory) {
            reader.MarkFault();
            continue;
        }
        types.push_back({.name = type.name, .resources = {}});
        for (const TTreeEntry& entry : reader.ReadDirectory(type.offset)) {
            TResource resource;
            resource.name = entry.name;
            if (reader.ReadData(entry, resource)) {
                types.back().resources.push_back(std::move(resource));
            }
        }
    }
    if (is_sound != nullptr) {
        *is_sound = reader.IsSound() && layout.resource_address >= layout.header_bytes;
    }
    return types;
}

std::vector<std::uint8_t> ReadPeResourceData(TStream& module, const TResource& resource) {
    return ReadAtAddress(module, ReadLayout(module), resource.data_address, resource.data_bytes);
}

std::unique_ptr<platform::TResourceModule> OpenPeFile(const std::u16string& file_name) {
    try {
        return std::make_unique<TFileModule>(file_name);
    } catch (const EFOpenError&) {
        return nullptr;
    }
}

}  // namespace zm
