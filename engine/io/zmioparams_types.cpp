#include <algorithm>

#include "engine/foundation/zmdefs.h"
#include "engine/foundation/zmstreams.h"
#include "engine/foundation/zmstrings.h"
#include "engine/io/zmioparams_types_p.h"

namespace zm {

namespace {

constexpr std::u16string_view kTrueText = u"true";
constexpr std::u16string_view kFalseText = u"false";
constexpr std::int32_t kTextLengthBytes = 4;
constexpr std::int32_t kColorBytes = 3;

std::u16string_view TrimBlanks(std::u16string_view text) {
    const std::size_t first = text.find_first_not_of(u' ');
    if (first == std::u16string_view::npos) {
        return {};
    }
    return text.substr(first, text.find_last_not_of(u' ') - first + 1);
}

TIOParams& ParamsOf(void* params) {
    return *static_cast<TIOParams*>(params);
}

void SaveColorMap(void* value, TZmFieldWriter& writer) {
    const TIOParams& params = ParamsOf(value);
    const auto entries = static_cast<std::int64_t>(params.fColorMap.size());
    const auto count =
        static_cast<std::int32_t>(std::clamp<std::int64_t>(params.fColorMapCount, 0, entries));
    writer.S32(count);
    for (std::int32_t i = 0; i < count; ++i) {
        SaveValue(writer, params.fColorMap[static_cast<std::size_t>(i)]);
    }
}

void LoadColorMap(void* value, TZmFieldReader& reader) {
    TIOParams& params = ParamsOf(value);
    const std::int32_t count = reader.ReadCount(kColorBytes);
    if (count < 0) {
        return;
    }
    std::vector<TRGB> colors;  // grows as they come: a stream may only claim to be long
    for (std::int32_t i = 0; i < count && !reader.HasFailed(); ++i) {
        LoadValue(reader, colors.emplace_back());
    }
    if (!reader.HasFailed()) {
        params.fColorMap = std::move(colors);
        params.fColorMapCount = count;
    }
}

void AssignColorMap(void* target, void* source) {
    ParamsOf(target).fColorMap = ParamsOf(source).fColorMap;
    ParamsOf(target).fColorMapCount = ParamsOf(source).fColorMapCount;
}

/// A store of items in the stream form of its own class, which reads through a stream: the bytes
/// of the list are taken from the reader item by item.
template <typename TList>
void SaveList(void* value, TZmFieldWriter& writer) {
    TMemoryStream stream;
    static_cast<const TList*>(value)->SaveToStream(stream);
    writer.WriteBytes(stream.Bytes());
}

template <typename TList>
void AssignList(void* target, void* source) {
    *static_cast<TList*>(target) = *static_cast<TList*>(source);
}

void LoadMarkers(void* value, TZmFieldReader& reader) {
    static_cast<TZmMarkerList*>(value)->LoadFromReader(reader);
}

void LoadIptc(void* value, TZmFieldReader& reader) {
    static_cast<TZmIPTCInfoList*>(value)->LoadFromReader(reader);
}

template <TZmParamsBlock kBlock>
void SaveBlock(void* value, TZmFieldWriter& writer) {
    const auto save = ParamsBlockHook(kBlock).save;
    writer.WriteBlock(save != nullptr ? save(ParamsOf(value)) : std::vector<std::uint8_t>());
}

template <TZmParamsBlock kBlock>
void LoadBlock(void* value, TZmFieldReader& reader) {
    std::vector<std::uint8_t> bytes;
    const auto load = ParamsBlockHook(kBlock).load;
    if (reader.ReadBlock(bytes) && load != nullptr) {
        load(ParamsOf(value), bytes);
    }
}

template <TZmParamsBlock kBlock>
constexpr TZmFieldType BlockType() {
    return {"block", -1,     SaveBlock<kBlock>, LoadBlock<kBlock>, [](void*, void*) {},
            nullptr, nullptr};
}

}  // namespace

const TZmFieldType kFileNameFieldType = {
    "text",
    -1,
    [](void* value, TZmFieldWriter& writer) {
        SaveValue(writer, Utf8FromUtf16(*static_cast<std::u16string*>(value)));
    },
    [](void* value, TZmFieldReader& reader) {
        std::string text;
        if (reader.ReadText(text)) {
            *static_cast<std::u16string*>(value) = Utf16FromUtf8(text);
        }
    },
    AssignList<std::u16string>,
    nullptr,
    nullptr,
};
const TZmFieldType kMarkersFieldType = {
    "marker list", -1,     SaveList<TZmMarkerList>, LoadMarkers, AssignList<TZmMarkerList>,
    nullptr,       nullptr};
const TZmFieldType kIptcFieldType = {
    "IPTC list", -1,     SaveList<TZmIPTCInfoList>, LoadIptc, AssignList<TZmIPTCInfoList>,
    nullptr,     nullptr};
const TZmFieldType kColorMapFieldType = {"colours",      -1,      SaveColorMap, LoadColorMap,
                                         AssignColorMap, nullptr, nullptr};
const TZmFieldType kBlockFieldTypes[kParamsBlockCount] = {
    BlockType<kBlockExif>(),       BlockType<kBlockDicomTags>(), BlockType<kBlockImagingAnnot>(),
    BlockType<kBlockZalmoAnnot>(), BlockType<kBlockInputICC>(),  BlockType<kBlockOutputICC>(),
    BlockType<kBlockDefaultICC>(),
};

TZmParamsBlockHook& ParamsBlockHook(TZmParamsBlock block) {
    static TZmParamsBlockHook hooks[kParamsBlockCount];
    return hooks[block];
}

void SaveValue(TZmFieldWriter& writer, std::int32_t value) {
    writer.S32(value);
}

void SaveValue(TZmFieldWriter& writer, double value) {
    writer.F64(value);
}

void SaveValue(TZmFieldWriter& writer, bool value) {
    writer.U8(value ? 1 : 0);
}

/// In the byte order that the record has in memory.
void SaveValue(TZmFieldWriter& writer, TRGB value) {
    const std::uint8_t bytes[kColorBytes] = {value.b, value.g, value.r};
    writer.WriteBytes(bytes);
}

void SaveValue(TZmFieldWriter& writer, TZmIconSize value) {
    writer.S32(value.width);
    writer.S32(value.height);
}

void SaveValue(TZmFieldWriter& writer, const std::string& value) {
    writer.WriteText(value);
}

void SaveValue(TZmFieldWriter& writer, const std::u16string& value) {
    writer.WriteWideText(value);
}

void SaveValue(TZmFieldWriter& writer, const TStringList& value) {
    writer.S32(static_cast<std::int32_t>(value.size()));
    for (const std::string& line : value) {
        writer.WriteText(line);
    }
}

void SaveValue(TZmFieldWriter& writer, const std::vector<std::uint8_t>& value) {
    writer.WriteBlock(value);
}

void LoadValue(TZmFieldReader& reader, std::int32_t& value) {
    const std::int32_t read = reader.S32();
    value = reader.HasFailed() ? value : read;
}

void LoadValue(TZmFieldReader& reader, double& value) {
    const double read = reader.F64();
    value = reader.HasFailed() ? value : read;
}

void LoadValue(TZmFieldReader& reader, bool& value) {
    const std::uint8_t read = reader.U8();
    value = reader.HasFailed() ? value : read != 0;
}

void LoadValue(TZmFieldReader& reader, TRGB& value) {
    std::uint8_t bytes[kColorBytes];
    if (reader.ReadBytes(bytes, sizeof(bytes))) {
        value = TRGB{bytes[0], bytes[1], bytes[2]};
    }
}

void LoadValue(TZmFieldReader& reader, TZmIconSize& value) {
    const std::int32_t width = reader.S32();
    const std::int32_t height = reader.S32();
    value = reader.HasFailed() ? value : TZmIconSize{width, height};
}

void LoadValue(TZmFieldReader& reader, std::string& value) {
    reader.ReadText(value);
}

void LoadValue(TZmFieldReader& reader, std::u16string& value) {
    reader.ReadWideText(value);
}

void LoadValue(TZmFieldReader& reader, TStringList& value) {
    const std::int32_t count = reader.ReadCount(kTextLengthBytes);
    TStringList lines;
    for (std::int32_t i = 0; i < count; ++i) {
        std::string line;
        if (!reader.ReadText(line)) {
            return;
        }
        lines.push_back(std::move(line));
    }
    value = reader.HasFailed() ? value : std::move(lines);
}

void LoadValue(TZmFieldReader& reader, std::vector<std::uint8_t>& value) {
    reader.ReadBlock(value);
}

std::u16string TextOfValue(std::int32_t value) {
    return IntegerToText(value);
}

std::u16string TextOfValue(double value) {
    return DoubleToNeutralText(value);
}

std::u16string TextOfValue(bool value) {
    return std::u16string(value ? kTrueText : kFalseText);
}

std::u16string TextOfValue(TRGB value) {
    return IntegerToText(ColorFromRGB(value));
}

std::u16string TextOfValue(const std::string& value) {
    return Utf16FromUtf8(value);
}

std::u16string TextOfValue(const std::u16string& value) {
    return value;
}

bool ParseValue(std::u16string_view text, std::int32_t& value) {
    const auto number = ParseInteger(text);
    value = number.value_or(value);
    return number.has_value();
}

bool ParseValue(std::u16string_view text, double& value) {
    const auto number = NeutralTextToDouble(TrimBlanks(text));
    value = number.value_or(value);
    return number.has_value();
}

/// The two words in any case, or a number, of which 0 is False.
bool ParseValue(std::u16string_view text, bool& value) {
    const std::u16string word = AsciiLower(TrimBlanks(text));
    const auto number = ParseInteger(std::u16string_view(word));
    if (!number && word != kTrueText && word != kFalseText) {
        return false;
    }
    value = number ? *number != 0 : word == kTrueText;
    return true;
}

bool ParseValue(std::u16string_view text, TRGB& value) {
    const auto number = ParseInteger(text);
    value = RGBFromColor(number.value_or(ColorFromRGB(value)));
    return number.has_value();
}

bool ParseValue(std::u16string_view text, std::string& value) {
    value = Utf8FromUtf16(text);
    return true;
}

bool ParseValue(std::u16string_view text, std::u16string& value) {
    value = text;
    return true;
}

}  // namespace zm
