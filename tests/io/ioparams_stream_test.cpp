#include <gtest/gtest.h>

#include <algorithm>
#include <cstring>
#include <functional>
#include <string>
#include <vector>

#include "engine/bitmap/zmxBitmaps.h"
#include "engine/foundation/zmsettings.h"
#include "engine/foundation/zmstreams.h"
#include "engine/io/zmfieldstreams.h"
#include "engine/io/zmioparams.h"
#include "engine/io/zmioparams_fields_p.h"
#include "engine/io/zmioparams_types_p.h"
#include "tests/support/testfiles.h"
#include "tests/support/testmessage.h"

namespace zm {
namespace {

using TBytes = std::vector<std::uint8_t>;

constexpr std::int32_t kLastVersion = 91;

/// The bytes of one field in the stream form.
TBytes FieldBytes(TIOParams& params, const TZmIOField& field) {
    TMemoryStream stream;
    TZmFieldWriter writer(stream);
    field.type->save(field.address(params), writer);
    return stream.Bytes();
}

template <typename TValue>
TValue* As(TIOParams& params, const TZmIOField& field) {
    return field.type == &kFieldType<TValue> ? static_cast<TValue*>(field.address(params))
                                             : nullptr;
}

/// Another value than the default, different for each row.
void ChangeField(TIOParams& params, const TZmIOField& field, std::int32_t row) {
    if (auto* number = As<std::int32_t>(params, field)) {
        *number += 1000 + row;
    } else if (auto* real = As<double>(params, field)) {
        *real += row + 0.25;
    } else if (auto* flag = As<bool>(params, field)) {
        *flag = !*flag;
    } else if (auto* text = As<std::string>(params, field)) {
        *text = "text \x80" + std::to_string(row);
    } else if (auto* wide = As<std::u16string>(params, field)) {
        *wide = u"wide \u20AC" + std::u16string(static_cast<std::size_t>(row % 7), u'x');
    } else if (auto* color = As<TRGB>(params, field)) {
        *color = TRGB{1, 2, static_cast<std::uint8_t>(row)};
    } else if (auto* lines = As<TStringList>(params, field)) {
        *lines = {"first", "", std::to_string(row)};
    } else if (auto* bytes = As<TBytes>(params, field)) {
        *bytes = {9, 0, static_cast<std::uint8_t>(row)};
    } else if (field.type->last_ordinal >= 0) {
        // An enumeration; those of one value keep it.
        auto* ordinal = static_cast<std::uint8_t*>(field.address(params));
        *ordinal = static_cast<std::uint8_t>(*ordinal == field.type->last_ordinal
                                                 ? *ordinal - (*ordinal > 0 ? 1 : 0)
                                                 : field.type->last_ordinal);
    }
}

void ChangeAllFields(TIOParams& params) {
    std::int32_t row = 0;
    for (const TZmIOField& field : TZmIOFieldTable::Stored()) {
        ChangeField(params, field, row++);
    }
    params.fFileName = u"folder/n\u00E4me.tif";
    params.fColorMap = {TRGB{1, 2, 3}, TRGB{4, 5, 6}};
    params.fColorMapCount = 2;
    params.fJPEG_MarkerList.AddMarker(0xE2, TBytes{1, 2, 3});
    params.fJPEG_MarkerList.AddMarker(0xFE, TBytes{});
    params.fIPTC_Info.AddStringItem(2, 120, "caption");
    params.ICO_Sizes[15] = {7, 8};
    params.ICO_BitCount[0] = 32;
    params.fRAW_UserWhiteBalance = {1, 2, 3, 4.5};
    params.fDict.Insert(u"key", u"value");
}

/// Loads from behind the magic; the place where the reading ended.
std::int64_t LoadBytes(TIOParams& params, const TBytes& bytes) {
    TBorrowedMemoryStream stream(bytes.data(), static_cast<std::int64_t>(bytes.size()));
    params.LoadFromStream(stream, /*check_magic=*/false);
    return stream.GetPosition();
}

bool IsBlock(const TZmIOField& field) {
    return field.type >= kBlockFieldTypes && field.type < kBlockFieldTypes + kParamsBlockCount;
}

class IOParamsStream : public ::testing::Test {
protected:
    void SetUp() override { ChangeAllFields(params_); }
    void TearDown() override { DestroySingletonInstance(); }

    /// A stream of a version, made of the rows that it has.
    TBytes StreamOfVersion(std::int32_t version) {
        TMemoryStream stream;
        TZmFieldWriter writer(stream);
        writer.S32(version);
        if (version >= 51) {
            writer.WriteWideText(u"{\"key\":\"value\"}");
        }
        if (version >= 43) {
            writer.S32(0);
        }
        for (const TZmIOField& field : TZmIOFieldTable::Stored()) {
            if (field.since <= version) {
                field.type->save(field.address(params_), writer);
            }
        }
        return stream.Bytes();
    }

    TIOParams params_;
    TIOParams defaults_;
};

TEST_F(IOParamsStream, EveryFieldComesBack) {
    TMemoryStream stream;
    params_.SaveToStream(stream);
    stream.SetPosition(0);
    TIOParams loaded;
    loaded.fNativePixelFormat = true;
    loaded.LoadFromStream(stream, /*check_magic=*/true);
    EXPECT_EQ(stream.GetSize(), stream.GetPosition());
    for (const TZmIOField& field : TZmIOFieldTable::Stored()) {
        EXPECT_EQ(FieldBytes(params_, field), FieldBytes(loaded, field)) << field.name;
        const bool has_one_value = IsBlock(field) || field.type->last_ordinal == 0;
        EXPECT_TRUE(has_one_value || FieldBytes(params_, field) != FieldBytes(defaults_, field))
            << field.name << " is not tested";
    }
    EXPECT_EQ(params_.fFileName, loaded.fFileName);
    EXPECT_EQ(params_.fColorMap, loaded.fColorMap);
    EXPECT_EQ(params_.ICO_Sizes, loaded.ICO_Sizes);
    EXPECT_EQ("caption", loaded.ReadIPTCField(2, 120));
    EXPECT_EQ(u"value", loaded.fDict.GetString(u"key"));
    EXPECT_EQ(loaded.GetDpiX(), loaded.fEXIF_XResolution);
    EXPECT_TRUE(loaded.fNativePixelFormat);  // not of the stream: stays
}

TEST_F(IOParamsStream, StartsWithMagicVersionDictionaryAndEmptyExif) {
    TMemoryStream stream;
    params_.SaveToStream(stream);
    using namespace std::string_literals;
    std::string head = "\17\0\0\0ZMIOPARAMSMAGIC\133\0\0\0\17\0\0\0"s;  // 15 bytes; version 91
    for (const char c : "{\"key\":\"value\"}"s) {                       // 15 characters
        head += {c, '\0'};
    }
    head += "\0\0\0\0\20\0\0\0fold"s;  // no EXIF; the file name, single-byte
    ASSERT_GT(stream.Bytes().size(), head.size());
    EXPECT_TRUE(std::equal(head.begin(), head.end(), stream.Bytes().begin()));
}

TEST_F(IOParamsStream, OldVersionsReadTheirFieldsAndNoMore) {
    // Version 1: seven JPEG fields and the codec's three texts.
    const TBytes bytes{1, 0, 0, 0, 1, 77,  0, 0, 0, 2, 1, 5, 0, 0, 0, 1,
                       3, 1, 0, 0, 0, 'n', 0, 0, 0, 0, 0, 0, 0, 0, 0};
    TIOParams loaded;
    loaded.fWidth = 55;
    loaded.fDict.Insert(u"old", 1);
    EXPECT_EQ(static_cast<std::int64_t>(bytes.size()), LoadBytes(loaded, bytes));
    EXPECT_EQ(ioJPEG_GRAYLEV, loaded.fJPEG_ColorSpace);
    EXPECT_EQ(77, loaded.fJPEG_Quality);
    EXPECT_EQ(ioJPEG_FLOAT, loaded.fJPEG_DCTMethod);
    EXPECT_TRUE(loaded.fJPEG_OptimalHuffman);
    EXPECT_EQ(5, loaded.fJPEG_Smooth);
    EXPECT_EQ(ioJPEG_QUARTER, loaded.fJPEG_Scale);
    EXPECT_EQ(u"n", loaded.fWIC_CodecInfo.name);
    EXPECT_EQ(0, loaded.fWidth);
    EXPECT_TRUE(loaded.fDict.IsEmpty());
}

TEST_F(IOParamsStream, EachVersionHasItsFields) {
    for (std::int32_t version = 0; version <= kLastVersion; ++version) {
        const TBytes bytes = StreamOfVersion(version);
        TIOParams loaded;
        ChangeAllFields(loaded);
        EXPECT_EQ(static_cast<std::int64_t>(bytes.size()), LoadBytes(loaded, bytes)) << version;
        EXPECT_EQ(version >= 51, loaded.fDict.HasKey(u"key")) << version;
        for (const TZmIOField& field : TZmIOFieldTable::Stored()) {
            TIOParams& expected = field.since <= version ? params_ : defaults_;
            ASSERT_EQ(FieldBytes(expected, field), FieldBytes(loaded, field))
                << field.name << " in version " << version;
        }
    }
}

TEST_F(IOParamsStream, AStreamThatEndsEarlyLeavesDefaults) {
    const TBytes bytes = StreamOfVersion(kLastVersion);
    for (std::size_t size = 0; size < bytes.size(); ++size) {
        TIOParams loaded;
        LoadBytes(loaded, TBytes(bytes.begin(), bytes.begin() + static_cast<std::ptrdiff_t>(size)));
        bool has_ended = false;
        for (const TZmIOField& field : TZmIOFieldTable::Stored()) {
            const TBytes value = FieldBytes(loaded, field);
            // Lists keep the items that are whole.
            const bool is_list = field.type == &kMarkersFieldType || field.type == &kIptcFieldType;
            has_ended = has_ended || (value != FieldBytes(params_, field));
            if (has_ended && !is_list) {
                ASSERT_EQ(FieldBytes(defaults_, field), value) << field.name << " at " << size;
            }
        }
    }
}

TEST_F(IOParamsStream, LengthsAndOrdinalsAreNotBelieved) {
    // Version 25: no dictionary, no EXIF; a file name of 2^31 - 1 bytes, then of -1 bytes.
    for (const std::uint8_t high : TBytes{0x7F, 0xFF}) {
        TIOParams loaded;
        LoadBytes(loaded, {25, 0, 0, 0, 0xFF, 0xFF, 0xFF, high, 1, 2, 3});
        EXPECT_TRUE(loaded.fFileName.empty());
        EXPECT_EQ(8, loaded.fBitsPerSample);
    }
    TIOParams loaded;
    LoadBytes(loaded, {1, 0, 0, 0, 200, 77, 0, 0, 0});  // no such colour space
    EXPECT_EQ(ioJPEG_YCbCr, loaded.fJPEG_ColorSpace);
    EXPECT_EQ(77, loaded.fJPEG_Quality);
}

TEST_F(IOParamsStream, OtherFilesAreRefused) {
    const TBytes jpeg{0xFF, 0xD8, 0xFF, 0xE0, 0, 16, 'J', 'F', 'I', 'F', 0};
    TBorrowedMemoryStream stream(jpeg.data(), static_cast<std::int64_t>(jpeg.size()));
    TIOParams loaded;
    EXPECT_EQ(
        "Invalid TIOParams stream. You cannot use TIOParams.LoadFromStream or LoadFromFile "
        "to load parameters from image files.",
        test::MessageOf<EZmException>([&] { loaded.LoadFromStream(stream, true); }));
}

TEST_F(IOParamsStream, FilesAndBlocksOfOtherRooms) {
    const test::TempFolder folder;
    ParamsBlockHook(kBlockInputICC) = {[](TIOParams&) {
                                           return TBytes{4, 5};
                                       },
                                       [](TIOParams& params, std::span<const std::uint8_t> bytes) {
                                           params.fXMP_Info.assign(bytes.begin(), bytes.end());
                                       }};
    params_.SaveToFile(folder.Name("a.params"));
    TIOParams loaded;
    loaded.LoadFromFile(folder.Name("a.params"), /*check_magic=*/true);
    ParamsBlockHook(kBlockInputICC) = {};
    EXPECT_EQ("\4\5", loaded.fXMP_Info);
    EXPECT_EQ(params_.fWIC_CodecInfo.version, loaded.fWIC_CodecInfo.version);
    EXPECT_THROW(loaded.LoadFromFile(folder.Name("none"), true), EFOpenError);
}

}  // namespace
}  // namespace zm
