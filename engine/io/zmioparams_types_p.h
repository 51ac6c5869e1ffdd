#pragma once

#include <array>
#include <cstdint>
#include <span>
#include <string>
#include <string_view>
#include <type_traits>
#include <vector>

#include "engine/io/zmfieldstreams.h"
#include "engine/io/zmioparams_blocks.h"
#include "engine/io/zmioparams_fields_p.h"

/// How each type of field travels: in the stream form and as text.
namespace zm {

/// Last ordinal of an enumeration: values above it are not taken from outside.
template <typename TEnum>
inline constexpr std::uint8_t kLastOrdinal = 0;
template <>
inline constexpr std::uint8_t kLastOrdinal<TIOTIFFCompression> = ioTIFF_UNKNOWN;
template <>
inline constexpr std::uint8_t kLastOrdinal<TIOTIFFPhotometInterpret> = ioTIFF_CIELAB;
template <>
inline constexpr std::uint8_t kLastOrdinal<TIOByteOrder> = ioLittleEndian;
template <>
inline constexpr std::uint8_t kLastOrdinal<TIOJPEGColorspace> = ioJPEG_YCbCrK;
template <>
inline constexpr std::uint8_t kLastOrdinal<TIOJPEGDctMethod> = ioJPEG_FLOAT;
template <>
inline constexpr std::uint8_t kLastOrdinal<TIOJPEGCromaSubsampling> = ioJPEG_NONE;
template <>
inline constexpr std::uint8_t kLastOrdinal<TIOJPEGScale> = ioJPEG_EIGHTH;
template <>
inline constexpr std::uint8_t kLastOrdinal<TIOJ2000ColorSpace> = ioJ2000_YCbCr;
template <>
inline constexpr std::uint8_t kLastOrdinal<TIOJ2000ScalableBy> = ioJ2000_Resolution;
template <>
inline constexpr std::uint8_t kLastOrdinal<TIOPCXCompression> = ioPCX_RLE;
template <>
inline constexpr std::uint8_t kLastOrdinal<TIOBMPVersion> = ioBMP_V5;
template <>
inline constexpr std::uint8_t kLastOrdinal<TIOBMPCompression> = ioBMP_RLE;
template <>
inline constexpr std::uint8_t kLastOrdinal<TIOICOFormat> = zmifPNG;
template <>
inline constexpr std::uint8_t kLastOrdinal<TIOPNGFilter> = ioPNG_FILTER_ALL;
template <>
inline constexpr std::uint8_t kLastOrdinal<TZmGIFAction> = ioGIF_RestorePrev;
template <>
inline constexpr std::uint8_t kLastOrdinal<TZmDicomRange> = zmdrSetBlackWhite;
template <>
inline constexpr std::uint8_t kLastOrdinal<TZmDicomCompression> = zmdcLosslessJPEG2000;
template <>
inline constexpr std::uint8_t kLastOrdinal<TIOPSCompression> = ioPS_JPEG;
template <>
inline constexpr std::uint8_t kLastOrdinal<TIOPDFCompression> = ioPDF_LZW;
template <>
inline constexpr std::uint8_t kLastOrdinal<TZmRAWInterpolation> = zmRAWInterpolationDCB;
template <>
inline constexpr std::uint8_t kLastOrdinal<TZmRAWOutputColorSpace> = zmrcsXYZ;
template <>
inline constexpr std::uint8_t kLastOrdinal<TZmRAWEmbeddedJpegLoading> = zmrlWIC;
template <>  // clip, leave, blend, and rebuild from 3 to 9
inline constexpr std::uint8_t kLastOrdinal<TZmRAWHighlight> = 9;
template <>
inline constexpr std::uint8_t kLastOrdinal<TIOBMPRAWChannelOrder> = coBGR;
template <>
inline constexpr std::uint8_t kLastOrdinal<TIOBMPRAWPlanes> = plPlanar;
template <>
inline constexpr std::uint8_t kLastOrdinal<TIOBMPRAWDataFormat> = dfBinary;

// The forms of each type. A load that fails, and a text that is no value, leave the value;
// ParseValue tells whether it was one.
void SaveValue(TZmFieldWriter& writer, std::int32_t value);
void SaveValue(TZmFieldWriter& writer, double value);
void SaveValue(TZmFieldWriter& writer, bool value);
void SaveValue(TZmFieldWriter& writer, TRGB value);
void SaveValue(TZmFieldWriter& writer, TZmIconSize value);
void SaveValue(TZmFieldWriter& writer, const std::string& value);
void SaveValue(TZmFieldWriter& writer, const std::u16string& value);
void SaveValue(TZmFieldWriter& writer, const TStringList& value);
void SaveValue(TZmFieldWriter& writer, const std::vector<std::uint8_t>& value);
void LoadValue(TZmFieldReader& reader, std::int32_t& value);
void LoadValue(TZmFieldReader& reader, double& value);
void LoadValue(TZmFieldReader& reader, bool& value);
void LoadValue(TZmFieldReader& reader, TRGB& value);
void LoadValue(TZmFieldReader& reader, TZmIconSize& value);
void LoadValue(TZmFieldReader& reader, std::string& value);
void LoadValue(TZmFieldReader& reader, std::u16string& value);
void LoadValue(TZmFieldReader& reader, TStringList& value);
void LoadValue(TZmFieldReader& reader, std::vector<std::uint8_t>& value);

std::u16string TextOfValue(std::int32_t value);
std::u16string TextOfValue(double value);
std::u16string TextOfValue(bool value);
std::u16string TextOfValue(TRGB value);
std::u16string TextOfValue(const std::string& value);
std::u16string TextOfValue(const std::u16string& value);
bool ParseValue(std::u16string_view text, std::int32_t& value);
bool ParseValue(std::u16string_view text, double& value);
bool ParseValue(std::u16string_view text, bool& value);
bool ParseValue(std::u16string_view text, TRGB& value);
bool ParseValue(std::u16string_view text, std::string& value);
bool ParseValue(std::u16string_view text, std::u16string& value);

template <typename TEnum>
requires std::is_enum_v<TEnum>
void SaveValue(TZmFieldWriter& writer, TEnum value) {
    writer.U8(static_cast<std::uint8_t>(value));
}

template <typename TEnum>
requires std::is_enum_v<TEnum>
void LoadValue(TZmFieldReader& reader, TEnum& value) {
    const std::uint8_t ordinal = reader.U8();
    if (!reader.HasFailed() && ordinal <= kLastOrdinal<TEnum>) {
        value = static_cast<TEnum>(ordinal);
    }
}

template <typename TEnum>
requires std::is_enum_v<TEnum> std::u16string TextOfValue(TEnum value) {
    return TextOfValue(static_cast<std::int32_t>(value));
}

template <typename TEnum>
requires std::is_enum_v<TEnum>
bool ParseValue(std::u16string_view text, TEnum& value) {
    std::int32_t ordinal = -1;
    if (!ParseValue(text, ordinal) || ordinal < 0 || ordinal > kLastOrdinal<TEnum>) {
        return false;
    }
    value = static_cast<TEnum>(ordinal);
    return true;
}

template <typename TItem, std::size_t kCount>
void SaveValue(TZmFieldWriter& writer, const std::array<TItem, kCount>& value) {
    for (const TItem& item : value) {
        SaveValue(writer, item);
    }
}

/// All items or none.
template <typename TItem, std::size_t kCount>
void LoadValue(TZmFieldReader& reader, std::array<TItem, kCount>& value) {
    std::array<TItem, kCount> items = value;
    for (TItem& item : items) {
        LoadValue(reader, item);
    }
    if (!reader.HasFailed()) {
        value = items;
    }
}

template <typename TValue>
consteval const char* NameOfType() {
    if constexpr (std::is_same_v<TValue, std::int32_t>) {
        return "integer";
    } else if constexpr (std::is_same_v<TValue, double>) {
        return "double";
    } else if constexpr (std::is_same_v<TValue, bool>) {
        return "Boolean";
    } else if constexpr (std::is_same_v<TValue, TRGB>) {
        return "colour";
    } else if constexpr (std::is_same_v<TValue, std::string>) {
        return "text";
    } else if constexpr (std::is_same_v<TValue, std::u16string>) {
        return "wide text";
    } else if constexpr (std::is_same_v<TValue, TStringList>) {
        return "lines";
    } else if constexpr (std::is_same_v<TValue, std::vector<std::uint8_t>>) {
        return "bytes";
    } else if constexpr (std::is_enum_v<TValue>) {
        return "ordinal";
    } else if constexpr (std::is_same_v<TValue, std::array<TZmIconSize, 16>>) {
        return "16 pairs of integers";
    } else if constexpr (std::is_same_v<TValue, std::array<std::int32_t, 16>>) {
        return "16 integers";
    } else {
        static_assert(std::is_same_v<TValue, std::array<double, 4>>, "a type without a name");
        return "4 doubles";
    }
}

template <typename TValue>
concept THasText = requires(const TValue& value) {
    TextOfValue(value);
};

template <typename TValue>
consteval TZmFieldType MakeFieldType() {
    TZmFieldType type{};
    type.name = NameOfType<TValue>();
    type.last_ordinal = -1;
    if constexpr (std::is_enum_v<TValue>) {
        type.last_ordinal = kLastOrdinal<TValue>;
    }
    type.save = [](void* value, TZmFieldWriter& writer) {
        SaveValue(writer, *static_cast<TValue*>(value));
    };
    type.load = [](void* value, TZmFieldReader& reader) {
        LoadValue(reader, *static_cast<TValue*>(value));
    };
    type.assign = [](void* target, void* source) {
        *static_cast<TValue*>(target) = *static_cast<TValue*>(source);
    };
    if constexpr (THasText<TValue>) {
        type.text = [](void* value) { return TextOfValue(*static_cast<TValue*>(value)); };
        type.parse = [](void* value, std::u16string_view text) {
            return ParseValue(text, *static_cast<TValue*>(value));
        };
    }
    return type;
}

template <typename TValue>
inline constexpr TZmFieldType kFieldType = MakeFieldType<TValue>();

// Types of rows whose value is no single field of a common type. The address of those that say
// so is the parameters object itself.
extern const TZmFieldType kFileNameFieldType;  ///< wide text, stored single-byte
extern const TZmFieldType kMarkersFieldType;
extern const TZmFieldType kIptcFieldType;
extern const TZmFieldType kColorMapFieldType;  ///< whole parameters: count and entries
extern const TZmFieldType kBlockFieldTypes[kParamsBlockCount];  ///< whole parameters

}  // namespace zm
