#include "engine/foundation/zmutils_resources.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <string>
#include <vector>

#include "engine/foundation/zmutils_peresources_p.h"
#include "tests/support/testfiles.h"

namespace zm {
namespace {

using TBytes = std::vector<std::uint8_t>;

constexpr std::size_t kTreeStart = 0x140;  // in the file
constexpr std::uint32_t kTreeAddress = 0x3000;

/// Little-endian bytes, one after the other.
class TWriter {
public:
    TWriter& Word(std::uint32_t value) {
        bytes_.push_back(static_cast<std::uint8_t>(value));
        bytes_.push_back(static_cast<std::uint8_t>(value >> 8));
        return *this;
    }
    TWriter& Long(std::uint32_t value) { return Word(value & 0xFFFF).Word(value >> 16); }
    TWriter& Text(std::string_view text) {
        bytes_.insert(bytes_.end(), text.begin(), text.end());
        return *this;
    }
    TWriter& Wide(std::string_view text) {
        Word(static_cast<std::uint32_t>(text.size()));
        for (const char character : text) {
            Word(static_cast<std::uint8_t>(character));
        }
        return *this;
    }
    TWriter& ZerosTo(std::size_t size) {
        bytes_.resize(size);
        return *this;
    }
    /// Characteristics, time, version; then the counts of named and numbered entries.
    TWriter& Directory(std::uint32_t named, std::uint32_t numbered) {
        return Long(0).Long(0).Long(0).Word(named).Word(numbered);
    }
    TWriter& Entry(std::uint32_t name, std::uint32_t target) { return Long(name).Long(target); }
    /// Address, size, code page, reserved.
    TWriter& Data(std::uint32_t offset, std::uint32_t size) {
        return Long(kTreeAddress + offset).Long(size).Long(0).Long(0);
    }
    std::size_t Size() const { return bytes_.size(); }
    TBytes Take() { return std::move(bytes_); }

private:
    TBytes bytes_;
};

constexpr std::uint32_t kDown = 0x80000000;  // a directory further down; a text name

/// Three types: "DATA" with #7 in two languages, icons #1 and #2, and the icon group "MAIN" of
/// the frames #2 and #1.
TBytes ResourceTree() {
    TWriter tree;
    // clang-format off
    tree.Directory(1, 2)               // 000: the types
        .Entry(kDown | 0x130, kDown | 0x28)
        .Entry(3, kDown | 0x40)
        .Entry(14, kDown | 0x60)
        .Directory(0, 1)               // 028: names of "DATA"
        .Entry(7, kDown | 0x78)
        .Directory(0, 2)               // 040: names of icons
        .Entry(1, kDown | 0x98)
        .Entry(2, kDown | 0xB0)
        .Directory(1, 0)               // 060: names of icon groups
        .Entry(kDown | 0x13A, kDown | 0xC8)
        .Directory(0, 2)               // 078: languages of "DATA" #7
        .Entry(0x407, 0xE0)
        .Entry(0x409, 0xF0)
        .Directory(0, 1)               // 098: of icon #1
        .Entry(0x409, 0x100)
        .Directory(0, 1)               // 0B0: of icon #2
        .Entry(0x409, 0x110)
        .Directory(0, 1)               // 0C8: of the group
        .Entry(0x409, 0x120)
        .Data(0x144, 5)                // 0E0
        .Data(0x149, 3)                // 0F0
        .Data(0x14C, 2)                // 100
        .Data(0x14E, 3)                // 110
        .Data(0x152, 34)               // 120
        .Wide("DATA")                  // 130
        .Wide("MAIN")                  // 13A
        .Text("first")                 // 144
        .Text("2nd")                   // 149
        .Text("i1")                    // 14C
        .Text("ic2")                   // 14E
        .ZerosTo(0x152);
    tree.Word(0).Word(1).Word(2)       // 152: reserved, icons, two frames
        .Word(0x1010).Word(0)          // 16 by 16, colours, reserved
        .Word(1).Word(32).Long(3)      // planes, bits, bytes
        .Word(2)                       // resource number
        .Word(0x2020).Word(0).Word(1).Word(32).Long(2)
        .Word(1);
    // clang-format on
    EXPECT_EQ(tree.Size(), 0x174u);
    return tree.Take();
}

/// A module with one section before the resources' one.
TBytes ModuleWith(const TBytes& tree, bool wide) {
    const std::uint32_t fixed_bytes = wide ? 112 : 96;
    TWriter module;
    // clang-format off
    module.Text("MZ").ZerosTo(60).Long(64);                // DOS header, offset of the next
    module.Text(std::string_view("PE\0\0", 4))             // 40
        .Word(wide ? 0x8664 : 0x14C)                       // machine
        .Word(2)                                           // sections
        .Long(0).Long(0).Long(0)                           // time, symbols, their count
        .Word(fixed_bytes + 24).Word(0x2102)               // size of the next, characteristics
        .Word(wide ? 0x20B : 0x10B);                       // 58: optional header
    module.ZerosTo(0x58 + fixed_bytes - 4)
        .Long(3)                                           // directories
        .Long(0).Long(0).Long(0).Long(0)                   // exports, imports
        .Long(kTreeAddress).Long(0x174);                   // resources
    module.Text(std::string_view(".text\0\0\0", 8))
        .Long(16).Long(0x1000).Long(16).Long(0x100)        // size, address, bytes, offset
        .Long(0).Long(0).Long(0).Long(0);                  // relocations, lines, flags
    module.Text(std::string_view(".rsrc\0\0\0", 8))
        .Long(0x174).Long(kTreeAddress).Long(static_cast<std::uint32_t>(tree.size()))
        .Long(kTreeStart)
        .Long(0).Long(0).Long(0).Long(0);
    // clang-format on
    EXPECT_LE(module.Size(), kTreeStart);
    module.ZerosTo(kTreeStart).Text({reinterpret_cast<const char*>(tree.data()), tree.size()});
    return module.Take();
}

std::string TextOf(const TBytes& bytes) {
    return {bytes.begin(), bytes.end()};
}

class Resources : public testing::Test {
protected:
    std::u16string Written(const TBytes& bytes) {
        test::WriteFileBytes(folder_.File("module.dll"), bytes);
        return folder_.Name("module.dll");
    }
    test::TempFolder folder_;
};

TEST_F(Resources, ReadsTypesNamesAndBytesOfBothWidths) {
    for (const bool wide : {false, true}) {
        const TZmResourceExtractor extractor(Written(ModuleWith(ResourceTree(), wide)));
        ASSERT_EQ(extractor.GetTypesCount(), 3) << wide;
        EXPECT_EQ(extractor.GetTypes(0), u"DATA");
        EXPECT_EQ(extractor.GetTypes(1), u"#3");
        EXPECT_EQ(extractor.GetFriendlyTypes(0), u"DATA");
        EXPECT_EQ(extractor.GetFriendlyTypes(1), u"Icon");
        EXPECT_EQ(extractor.GetFriendlyTypes(2), u"Icon Group");
        EXPECT_EQ(extractor.IndexOfType(u"icon group"), 2);
        EXPECT_EQ(extractor.IndexOfType(u"#3"), 1);
        EXPECT_EQ(extractor.IndexOfType(u"Bitmap"), -1);
        EXPECT_EQ(extractor.GetNamesCount(1), 2);
        EXPECT_EQ(extractor.GetNames(1, 1), u"#2");
        EXPECT_EQ(extractor.GetNames(2, 0), u"MAIN");
        EXPECT_EQ(TextOf(extractor.GetBuffer(0, 0)), "first") << "of two languages";
        EXPECT_EQ(TextOf(extractor.GetBuffer(1, 1)), "ic2");
    }
}

TEST_F(Resources, GroupsAndTheirFrames) {
    TZmResourceExtractor extractor(Written(ModuleWith(ResourceTree(), false)));
    EXPECT_TRUE(extractor.GetIsGroup(2));
    EXPECT_FALSE(extractor.GetIsGroup(1));
    EXPECT_TRUE(extractor.GetIsGrouped(1));
    EXPECT_FALSE(extractor.GetIsGrouped(0));
    EXPECT_EQ(extractor.GetFramesCount(2, 0), 2);
    EXPECT_EQ(extractor.GetFramesCount(1, 0), 0);
    EXPECT_EQ(TextOf(extractor.GetFrameBuffer(2, 0, 0)), "ic2");
    EXPECT_EQ(TextOf(extractor.GetFrameBuffer(2, 0, 1)), "i1");
    EXPECT_TRUE(extractor.GetFrameBuffer(2, 0, 2).empty());
    std::int32_t type = -1;
    std::int32_t group = -1;
    std::int32_t frame = -1;
    ASSERT_TRUE(extractor.GetGroupAndFrame(1, 0, type, group, frame));
    EXPECT_EQ(type * 100 + group * 10 + frame, 201);
    EXPECT_FALSE(extractor.GetGroupAndFrame(0, 0, type, group, frame));
    const TZmResourceBookmark* const bookmark = extractor.GetResourceBookmark(2, 0, 1);
    ASSERT_NE(bookmark, nullptr);
    EXPECT_EQ(TextOf(extractor.GetBuffer(*bookmark)), "i1");
    EXPECT_EQ(extractor.GetResourceBookmark(2, 0, 1), bookmark);
    EXPECT_EQ(extractor.GetBuffer(*extractor.GetResourceBookmark(2, 0)).size(), 34u);
    EXPECT_EQ(extractor.GetResourceBookmark(2, 0, 2), nullptr);
    for (const std::int32_t index : {-1, 3, INT32_MAX, INT32_MIN}) {
        EXPECT_EQ(extractor.GetTypes(index), u"");
        EXPECT_EQ(extractor.GetNames(0, index), u"");
        EXPECT_TRUE(extractor.GetBuffer(index, 0).empty());
        EXPECT_TRUE(extractor.GetFrameBuffer(2, index, 0).empty());
        EXPECT_TRUE(extractor.GetFrameBuffer(2, 0, index).empty());
    }
}

TEST_F(Resources, FilesThatAreNoModulesHaveNone) {
    EXPECT_EQ(TZmResourceExtractor(folder_.Name("missing")).GetTypesCount(), 0);
    for (const TBytes& bytes : {TBytes{}, TBytes{'M', 'Z'}, TBytes(1000, 0xFF)}) {
        EXPECT_EQ(TZmResourceExtractor(Written(bytes)).GetTypesCount(), 0);
    }
}

/// Everything that can be asked; gives the sum of the bytes.
std::size_t ReadAll(const TBytes& bytes) {
    TBorrowedMemoryStream module(bytes.data(), static_cast<std::int64_t>(bytes.size()));
    std::size_t total = 0;
    for (const platform::TResourceType& type : ReadPeResources(module)) {
        for (const platform::TResource& resource : type.resources) {
            total += ReadPeResourceData(module, resource).size() + resource.name.text.size();
        }
    }
    return total;
}

TEST_F(Resources, CutAndSpoiltModulesGiveAtMostWhatIsThere) {
    const TBytes whole = ModuleWith(ResourceTree(), false);
    ASSERT_EQ(ReadAll(whole), 5u + 2 + 3 + 34 + 4);
    for (std::size_t size = 0; size < whole.size(); ++size) {
        EXPECT_LT(ReadAll(TBytes(whole.begin(), whole.begin() + static_cast<int>(size))), 48u);
    }
    for (std::size_t at = 0; at < whole.size(); ++at) {
        for (const int value : {0x00, 0x7F, 0x80, 0xFF}) {
            TBytes spoilt = whole;
            spoilt[at] = static_cast<std::uint8_t>(value);
            EXPECT_LE(ReadAll(spoilt), 4 * whole.size()) << at;
        }
    }
}

TEST_F(Resources, SpoiltHeadersDoNoHarmThroughTheSystem) {
    const TBytes whole = ModuleWith(ResourceTree(), false);
    for (std::size_t at = 0x58; at < kTreeStart + 0x28; ++at) {  // to the end of the types
        TBytes spoilt = whole;
        spoilt[at] = 0xFF;
        const TZmResourceExtractor extractor(Written(spoilt));
        for (std::int32_t type = 0; type < extractor.GetTypesCount(); ++type) {
            EXPECT_LE(extractor.GetBuffer(type, 0).size(), whole.size()) << at;
        }
    }
}

TEST_F(Resources, TablesThatPointAtThemselvesEnd) {
    TWriter tree;
    tree.Directory(0xFFFF, 0xFFFF);
    for (int i = 0; i < 2 * 0xFFFF; ++i) {
        // Each its own name and type; names point at the table too.
        tree.Entry(i % 2 == 0 ? kDown | 12 : static_cast<std::uint32_t>(i), kDown);
    }
    EXPECT_EQ(ReadAll(ModuleWith(tree.Take(), false)), 0u) << "no data at the third level";
    TWriter small;
    small.Directory(0, 1).Entry(1, kDown);
    EXPECT_EQ(ReadAll(ModuleWith(small.Take(), true)), 0u);
}

}  // namespace
}  // namespace zm
