#include <gtest/gtest.h>

#include <algorithm>
#include <set>
#include <string>
#include <vector>

#include "engine/foundation/zmdefs.h"
#include "engine/foundation/zmstrings.h"
#include "engine/foundation/zmutils_dircontent.h"
#include "engine/foundation/zmutils_tempfile.h"
#include "engine/platform/files.h"
#include "tests/support/testfiles.h"
#include "tests/support/testmessage.h"

namespace zm {
namespace {

/// The first bytes of a shortcut file to something with these attributes.
std::vector<std::uint8_t> ShortcutTo(std::uint8_t attributes) {
    return {
        0x4C,       0x00, 0x00, 0x00,                          // header size
        0x01,       0x14, 0x02, 0x00, 0x00, 0x00, 0x00, 0x00,  // class of shortcuts
        0xC0,       0x00, 0x00, 0x00, 0x00, 0x00, 0x00, 0x46,  //
        0x00,       0x00, 0x00, 0x00,                          // flags
        attributes, 0x00, 0x00, 0x00,                          // attributes of the target
        0x00,       0x00, 0x00, 0x00,                          // more of the header
    };
}

class DirContent : public testing::Test {
protected:
    DirContent() {
        platform::CreateFolder(folder_.Name("sub"));
        platform::CreateFolder(folder_.Name("sub") + u"/inner");
        test::WriteFileBytes(folder_.File("One.PNG"), {1, 2, 3});
        test::WriteFileBytes(folder_.File("two.png.txt"), {});
        test::WriteFileBytes(folder_.File("to_folder.LNK"), ShortcutTo(0x10));
        test::WriteFileBytes(folder_.File("to_file.lnk"), ShortcutTo(0x20));
        test::WriteFileBytes(folder_.File("broken.lnk"), {0x4C, 0});
    }
    /// Names that fit, sorted.
    static std::string Names(const std::u16string& path, bool files, bool dirs,
                             bool links = false) {
        std::vector<std::u16string> names;
        TZmDirContent::PopulateStrings(path, names, files, dirs, /*bGetHidden=*/true,
                                       /*bFullPath=*/false, links);
        std::sort(names.begin(), names.end());
        std::string text;
        for (const auto& name : names) {
            text += Utf8FromUtf16(name) + " ";
        }
        return text;
    }
    std::u16string Path() const { return test::EngineName(folder_.Path()); }

    test::TempFolder folder_;
};

TEST_F(DirContent, GivesTheWantedKinds) {
    EXPECT_EQ(Names(Path(), true, true),
              "One.PNG broken.lnk sub to_file.lnk to_folder.LNK two.png.txt ");
    EXPECT_EQ(Names(Path(), false, true), "sub ");
    EXPECT_EQ(Names(Path(), false, true, /*links=*/true), "sub to_folder.LNK ");
    EXPECT_EQ(Names(Path(), true, false, /*links=*/true),
              "One.PNG broken.lnk to_file.lnk two.png.txt ");
    EXPECT_EQ(Names(Path(), false, false), "");
    EXPECT_EQ(Names(Path() + u"/missing", true, true), "");
}

TEST_F(DirContent, PatternsFitWholeNamesWithoutCase) {
    const std::pair<const char16_t*, const char*> cases[] = {
        {u"/*.png", "One.PNG "},
        {u"/*.png*", "One.PNG two.png.txt "},
        {u"/*.*", "One.PNG broken.lnk sub to_file.lnk to_folder.LNK two.png.txt "},
        {u"/???", "sub "},
        {u"/t*o*", "to_file.lnk to_folder.LNK two.png.txt "},
        {u"/*a*a*a*a*", ""},
    };
    for (const auto& [pattern, expected] : cases) {
        EXPECT_EQ(Names(Path() + pattern, true, true), expected) << Utf8FromUtf16(pattern);
    }
    std::vector<std::u16string> full_names;
    TZmDirContent::PopulateStrings(Path() + u"/*.png", full_names);
    ASSERT_EQ(full_names.size(), 1u);
    EXPECT_TRUE(platform::FileExists(full_names.front()));
}

TEST_F(DirContent, TellsSizeDatesAndKindOfEach) {
    platform::TFileTimes times;
    times.created_ns = times.accessed_ns = 1'000'000'000'000'000'000;
    times.modified_ns = 1'234'567'890'000'000'000;
    ASSERT_TRUE(platform::SetFileTimes(folder_.Name("One.PNG"), times));
    TZmDirContent content(Path());
    std::u16string name;
    std::set<std::u16string> seen;
    while (content.GetItem(name)) {
        EXPECT_TRUE(seen.insert(name).second);
        EXPECT_EQ(content.IsDir(), name == u"sub");
        EXPECT_FALSE(content.IsHidden());
        if (name == u"One.PNG") {
            EXPECT_EQ(content.FileSizeBytes(), 3);
            EXPECT_EQ(content.EditDate(), times.modified_ns);
            EXPECT_EQ(content.AccessDate(), times.accessed_ns);
            EXPECT_NE(content.CreateDate(), 0);
        }
    }
    EXPECT_EQ(seen.size(), 6u);
    EXPECT_FALSE(content.GetItem(name)) << "the end stays the end";
}

TEST(TemporaryFile, LivesAsLongAsItsStream) {
    const test::TempFolder folder;
    const std::u16string name = folder.Name("cache.tmp");
    test::WriteFileBytes(folder.File("cache.tmp"), {9, 9, 9, 9});
    {
        TZmTemporaryFileStream stream(name);
        EXPECT_EQ(stream.GetSize(), 0) << "emptied";
        EXPECT_EQ(stream.Write("abcdef", 6), 6);
        EXPECT_TRUE(platform::FileExists(name));
        EXPECT_EQ(stream.Seek(-2, soEnd), 4);
        char text[3] = {};
        EXPECT_EQ(stream.Read(text, 5), 2);
        EXPECT_STREQ(text, "ef");
    }
    EXPECT_TRUE(test::ListFolder(folder.Path()).empty());
}

TEST(TemporaryFile, RefusalsNameTheFile) {
    const test::TempFolder folder;
    for (const std::u16string& name : {folder.Name("no") + u"/such/\x00E4", folder.Name("")}) {
        EXPECT_EQ(test::MessageOf<EZmException>([&] { TZmTemporaryFileStream stream(name); }),
                  "Unable to create " + Utf8FromUtf16(name));
    }
    EXPECT_TRUE(platform::FolderExists(test::EngineName(folder.Path())));
}

}  // namespace
}  // namespace zm
