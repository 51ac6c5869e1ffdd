#include <utility>

#include "engine/foundation/zmdefs.h"
#include "engine/foundation/zmstrings.h"
#include "engine/io/zmioparams_rows_p.h"

// The fields and views that have a text key and are not in the stream form: the EXIF block, which
// the stream holds as a whole, second names, and values that are computed.
namespace zm {

namespace {

/// Entry `kIndex` of a field that is an array.
template <auto kMember, std::size_t kIndex>
void* AddressOfItem(TIOParams& params) {
    return &(params.*kMember)[kIndex];
}

/// Degrees with their fraction, negative to the south and to the west.
std::u16string TextOfPlace(double degrees, double minutes, double seconds, bool is_negative) {
    constexpr double kMinutesPerDegree = 60;
    constexpr double kSecondsPerDegree = 3600;
    const double place = degrees + minutes / kMinutesPerDegree + seconds / kSecondsPerDegree;
    return TextOfValue(is_negative ? -place : place);
}

/// A value that is computed from the whole parameters and cannot be set.
constexpr TZmFieldType ComputedType(const char* name, std::u16string (*text)(void* params)) {
    return {name, -1, nullptr, nullptr, nullptr, text, nullptr};
}

constexpr TZmFieldType kLatitudeType = ComputedType("double", [](void* value) {
    const auto& params = *static_cast<const TIOParams*>(value);
    return TextOfPlace(params.fEXIF_GPSLatitudeDegrees, params.fEXIF_GPSLatitudeMinutes,
                       params.fEXIF_GPSLatitudeSeconds,
                       params.fEXIF_GPSLatitudeRef.starts_with('S'));
});

constexpr TZmFieldType kLongitudeType = ComputedType("double", [](void* value) {
    const auto& params = *static_cast<const TIOParams*>(value);
    return TextOfPlace(params.fEXIF_GPSLongitudeDegrees, params.fEXIF_GPSLongitudeMinutes,
                       params.fEXIF_GPSLongitudeSeconds,
                       params.fEXIF_GPSLongitudeRef.starts_with('W'));
});

constexpr TZmFieldType kAbortingType = ComputedType("Boolean", [](void* value) {
    return TextOfValue(static_cast<const TIOParams*>(value)->OwnerIsAborting());
});

/// The first entry; GetProperty reaches the others by a number behind the key.
constexpr TZmFieldType kColorMapItemType = ComputedType("colour", [](void* value) {
    const auto& params = *static_cast<const TIOParams*>(value);
    return params.fColorMap.empty() ? std::u16string() : TextOfValue(params.fColorMap[0]);
});

/// The packet has been set as a plain text: parses it.
void RefreshXmp(TIOParams& params) {
    const std::string packet = std::exchange(params.fXMP_Info, {});
    params.SetXMP_Info(packet);
}

}  // namespace

#define ZM_TEXT_ROW(field, key, use, changed) ZM_FIELD_ROW(field, key, kNotStored, use, changed)
#define ZM_TEXT_FIELD(field, use) ZM_TEXT_ROW(field, nullptr, use, nullptr)
#define ZM_SECOND_KEY(field, key, use) ZM_TEXT_ROW(field, key, use, nullptr)
#define ZM_ITEM(field, index, type, key)                                                    \
    {                                                                                       \
#field "[" #index "]", key, &kFieldType < type>, AddressOfItem < &TIOParams::field, \
            index>, kNotStored, kReadWriteKey, nullptr                                      \
    }
#define ZM_COMPUTED(name, key, type) \
    { name, key, &type, WholeParams, kNotStored, kReadKey, nullptr }

const TZmIOField TZmIOFieldTable::kNotStoredRows[] = {
    // General.
    ZM_SECOND_KEY(fNativePixelFormat, "ISNATIVEPIXELFORMAT", kReadWriteKey),
    ZM_TEXT_FIELD(fColorMapCount, kReadKey),
    ZM_COMPUTED("fColorMap", "COLORMAPITEM", kColorMapItemType),
    ZM_TEXT_ROW(fXMP_Info, nullptr, kReadWriteKey, RefreshXmp),
    ZM_COMPUTED("the owner's Aborting", "ABORTING", kAbortingType),
    // GIF and JPEG.
    ZM_SECOND_KEY(fGIF_FlagTranspColor, "GIF_TRANSPARENT", kReadWriteKey),
    ZM_SECOND_KEY(fOriginalWidth, "JPEG_ORIGINALWIDTH", kReadKey),
    ZM_SECOND_KEY(fOriginalHeight, "JPEG_ORIGINALHEIGHT", kReadKey),
    ZM_SECOND_KEY(fJPEG_ScaleUsed, "JPEG_SCALE_USED", kReadKey),
    ZM_TEXT_FIELD(fTIFF_EnableAdjustOrientation, kReadWriteKey),
    ZM_TEXT_FIELD(fJPEG_WarningTot, kReadKey),
    ZM_TEXT_FIELD(fJPEG_WarningCode, kReadKey),
    ZM_TEXT_FIELD(fEXIF_HasEXIFData, kReadWriteKey),
    ZM_TEXT_FIELD(fEXIF_Orientation, kReadWriteKey),
    ZM_TEXT_FIELD(fEXIF_ImageDescription, kReadWriteKey),
    ZM_TEXT_FIELD(fEXIF_Make, kReadWriteKey),
    ZM_TEXT_FIELD(fEXIF_Model, kReadWriteKey),
    ZM_TEXT_FIELD(fEXIF_XResolution, kReadWriteKey),
    ZM_TEXT_FIELD(fEXIF_YResolution, kReadWriteKey),
    ZM_TEXT_FIELD(fEXIF_ResolutionUnit, kReadWriteKey),
    ZM_TEXT_FIELD(fEXIF_Software, kReadWriteKey),
    ZM_TEXT_FIELD(fEXIF_Artist, kReadWriteKey),
    ZM_TEXT_FIELD(fEXIF_DateTime, kReadWriteKey),
    ZM_TEXT_FIELD(fEXIF_YCbCrPositioning, kReadWriteKey),
    ZM_TEXT_FIELD(fEXIF_Copyright, kReadWriteKey),
    ZM_TEXT_FIELD(fEXIF_ExposureTime, kReadWriteKey),
    ZM_TEXT_FIELD(fEXIF_FNumber, kReadWriteKey),
    ZM_TEXT_FIELD(fEXIF_ExposureProgram, kReadWriteKey),
    ZM_TEXT_FIELD(fEXIF_ExifVersion, kReadWriteKey),
    ZM_TEXT_FIELD(fEXIF_DateTimeOriginal, kReadWriteKey),
    ZM_TEXT_FIELD(fEXIF_DateTimeDigitized, kReadWriteKey),
    ZM_TEXT_FIELD(fEXIF_CompressedBitsPerPixel, kReadWriteKey),
    ZM_TEXT_FIELD(fEXIF_ShutterSpeedValue, kReadWriteKey),
    ZM_TEXT_FIELD(fEXIF_ApertureValue, kReadWriteKey),
    ZM_TEXT_FIELD(fEXIF_BrightnessValue, kReadWriteKey),
    ZM_TEXT_FIELD(fEXIF_ExposureBiasValue, kReadWriteKey),
    ZM_TEXT_FIELD(fEXIF_MaxApertureValue, kReadWriteKey),
    ZM_TEXT_FIELD(fEXIF_SubjectDistance, kReadWriteKey),
    ZM_TEXT_FIELD(fEXIF_MeteringMode, kReadWriteKey),
    ZM_TEXT_FIELD(fEXIF_LightSource, kReadWriteKey),
    ZM_TEXT_FIELD(fEXIF_Flash, kReadWriteKey),
    ZM_TEXT_FIELD(fEXIF_FocalLength, kReadWriteKey),
    ZM_TEXT_FIELD(fEXIF_SubsecTime, kReadWriteKey),
    ZM_TEXT_FIELD(fEXIF_SubsecTimeOriginal, kReadWriteKey),
    ZM_TEXT_FIELD(fEXIF_SubsecTimeDigitized, kReadWriteKey),
    ZM_TEXT_FIELD(fEXIF_FlashPixVersion, kReadWriteKey),
    ZM_TEXT_FIELD(fEXIF_ColorSpace, kReadWriteKey),
    ZM_TEXT_FIELD(fEXIF_ExifImageWidth, kReadWriteKey),
    ZM_TEXT_FIELD(fEXIF_ExifImageHeight, kReadWriteKey),
    ZM_TEXT_FIELD(fEXIF_RelatedSoundFile, kReadWriteKey),
    ZM_TEXT_FIELD(fEXIF_FocalPlaneXResolution, kReadWriteKey),
    ZM_TEXT_FIELD(fEXIF_FocalPlaneYResolution, kReadWriteKey),
    ZM_TEXT_FIELD(fEXIF_FocalPlaneResolutionUnit, kReadWriteKey),
    ZM_TEXT_FIELD(fEXIF_ExposureIndex, kReadWriteKey),
    ZM_TEXT_FIELD(fEXIF_SensingMethod, kReadWriteKey),
    ZM_TEXT_FIELD(fEXIF_FileSource, kReadWriteKey),
    ZM_TEXT_FIELD(fEXIF_SceneType, kReadWriteKey),
    ZM_TEXT_FIELD(fEXIF_UserComment, kReadWriteKey),
    ZM_TEXT_FIELD(fEXIF_UserCommentCode, kReadWriteKey),
    ZM_TEXT_FIELD(fEXIF_XPRating, kReadWriteKey),
    ZM_TEXT_FIELD(fEXIF_XPTitle, kReadWriteKey),
    ZM_TEXT_FIELD(fEXIF_XPComment, kReadWriteKey),
    ZM_TEXT_FIELD(fEXIF_XPAuthor, kReadWriteKey),
    ZM_TEXT_FIELD(fEXIF_XPKeywords, kReadWriteKey),
    ZM_TEXT_FIELD(fEXIF_XPSubject, kReadWriteKey),
    ZM_TEXT_FIELD(fEXIF_ExposureMode, kReadWriteKey),
    ZM_TEXT_FIELD(fEXIF_WhiteBalance, kReadWriteKey),
    ZM_TEXT_FIELD(fEXIF_DigitalZoomRatio, kReadWriteKey),
    ZM_TEXT_FIELD(fEXIF_FocalLengthIn35mmFilm, kReadWriteKey),
    ZM_TEXT_FIELD(fEXIF_SceneCaptureType, kReadWriteKey),
    ZM_TEXT_FIELD(fEXIF_GainControl, kReadWriteKey),
    ZM_TEXT_FIELD(fEXIF_Contrast, kReadWriteKey),
    ZM_TEXT_FIELD(fEXIF_Saturation, kReadWriteKey),
    ZM_TEXT_FIELD(fEXIF_Sharpness, kReadWriteKey),
    ZM_TEXT_FIELD(fEXIF_SubjectDistanceRange, kReadWriteKey),
    ZM_TEXT_FIELD(fEXIF_ImageUniqueID, kReadWriteKey),
    ZM_TEXT_FIELD(fEXIF_GPSVersionID, kReadWriteKey),
    ZM_TEXT_FIELD(fEXIF_GPSLatitudeRef, kReadWriteKey),
    ZM_TEXT_FIELD(fEXIF_GPSLatitudeDegrees, kReadWriteKey),
    ZM_TEXT_FIELD(fEXIF_GPSLatitudeMinutes, kReadWriteKey),
    ZM_TEXT_FIELD(fEXIF_GPSLatitudeSeconds, kReadWriteKey),
    ZM_TEXT_FIELD(fEXIF_GPSLongitudeRef, kReadWriteKey),
    ZM_TEXT_FIELD(fEXIF_GPSLongitudeDegrees, kReadWriteKey),
    ZM_TEXT_FIELD(fEXIF_GPSLongitudeMinutes, kReadWriteKey),
    ZM_TEXT_FIELD(fEXIF_GPSLongitudeSeconds, kReadWriteKey),
    ZM_TEXT_FIELD(fEXIF_GPSAltitudeRef, kReadWriteKey),
    ZM_TEXT_FIELD(fEXIF_GPSAltitude, kReadWriteKey),
    ZM_TEXT_FIELD(fEXIF_GPSTimeStampHour, kReadWriteKey),
    ZM_TEXT_FIELD(fEXIF_GPSTimeStampMinute, kReadWriteKey),
    ZM_TEXT_FIELD(fEXIF_GPSTimeStampSecond, kReadWriteKey),
    ZM_TEXT_FIELD(fEXIF_GPSSatellites, kReadWriteKey),
    ZM_TEXT_FIELD(fEXIF_GPSStatus, kReadWriteKey),
    ZM_TEXT_FIELD(fEXIF_GPSMeasureMode, kReadWriteKey),
    ZM_TEXT_FIELD(fEXIF_GPSDOP, kReadWriteKey),
    ZM_TEXT_FIELD(fEXIF_GPSSpeedRef, kReadWriteKey),
    ZM_TEXT_FIELD(fEXIF_GPSSpeed, kReadWriteKey),
    ZM_TEXT_FIELD(fEXIF_GPSTrackRef, kReadWriteKey),
    ZM_TEXT_FIELD(fEXIF_GPSTrack, kReadWriteKey),
    ZM_TEXT_FIELD(fEXIF_GPSImgDirectionRef, kReadWriteKey),
    ZM_TEXT_FIELD(fEXIF_GPSImgDirection, kReadWriteKey),
    ZM_TEXT_FIELD(fEXIF_GPSMapDatum, kReadWriteKey),
    ZM_TEXT_FIELD(fEXIF_GPSDestLatitudeRef, kReadWriteKey),
    ZM_TEXT_FIELD(fEXIF_GPSDestLatitudeDegrees, kReadWriteKey),
    ZM_TEXT_FIELD(fEXIF_GPSDestLatitudeMinutes, kReadWriteKey),
    ZM_TEXT_FIELD(fEXIF_GPSDestLatitudeSeconds, kReadWriteKey),
    ZM_TEXT_FIELD(fEXIF_GPSDestLongitudeRef, kReadWriteKey),
    ZM_TEXT_FIELD(fEXIF_GPSDestLongitudeDegrees, kReadWriteKey),
    ZM_TEXT_FIELD(fEXIF_GPSDestLongitudeMinutes, kReadWriteKey),
    ZM_TEXT_FIELD(fEXIF_GPSDestLongitudeSeconds, kReadWriteKey),
    ZM_TEXT_FIELD(fEXIF_GPSDestBearingRef, kReadWriteKey),
    ZM_TEXT_FIELD(fEXIF_GPSDestBearing, kReadWriteKey),
    ZM_TEXT_FIELD(fEXIF_GPSDestDistanceRef, kReadWriteKey),
    ZM_TEXT_FIELD(fEXIF_GPSDestDistance, kReadWriteKey),
    ZM_TEXT_FIELD(fEXIF_GPSDateStamp, kReadWriteKey),
    ZM_TEXT_FIELD(fEXIF_InteropIndex, kReadWriteKey),
    ZM_TEXT_FIELD(fEXIF_InteropVersion, kReadWriteKey),
    ZM_TEXT_FIELD(fEXIF_CameraOwnerName, kReadWriteKey),
    ZM_TEXT_FIELD(fEXIF_BodySerialNumber, kReadWriteKey),
    ZM_TEXT_FIELD(fEXIF_LensMake, kReadWriteKey),
    ZM_TEXT_FIELD(fEXIF_LensModel, kReadWriteKey),
    ZM_TEXT_FIELD(fEXIF_LensSerialNumber, kReadWriteKey),
    ZM_TEXT_FIELD(fEXIF_Gamma, kReadWriteKey),
    ZM_TEXT_FIELD(fEXIF_SubjectLocationX, kReadWriteKey),
    ZM_TEXT_FIELD(fEXIF_SubjectLocationY, kReadWriteKey),
    ZM_SECOND_KEY(fEXIF_HasEXIFData, "EXIF_HASEXIF", kReadWriteKey),
    ZM_ITEM(fEXIF_ISOSpeedRatings, 0, std::int32_t, "EXIF_ISOSPEEDRATINGS0"),
    ZM_ITEM(fEXIF_ISOSpeedRatings, 1, std::int32_t, "EXIF_ISOSPEEDRATINGS1"),
    ZM_ITEM(fEXIF_WhitePoint, 0, double, "EXIF_WHITEPOINT0"),
    ZM_ITEM(fEXIF_WhitePoint, 1, double, "EXIF_WHITEPOINT1"),
    ZM_ITEM(fEXIF_YCbCrCoefficients, 0, double, "EXIF_YCBCRCOEFFICIENTS0"),
    ZM_ITEM(fEXIF_YCbCrCoefficients, 1, double, "EXIF_YCBCRCOEFFICIENTS1"),
    ZM_ITEM(fEXIF_YCbCrCoefficients, 2, double, "EXIF_YCBCRCOEFFICIENTS2"),
    ZM_COMPUTED("the latitude in degrees", "EXIF_GPSLATITUDE", kLatitudeType),
    ZM_COMPUTED("the longitude in degrees", "EXIF_GPSLONGITUDE", kLongitudeType),
};

#undef ZM_TEXT_ROW
#undef ZM_TEXT_FIELD
#undef ZM_SECOND_KEY
#undef ZM_ITEM
#undef ZM_COMPUTED

std::span<const TZmIOField> TZmIOFieldTable::NotStored() {
    return kNotStoredRows;
}

std::string KeyOfField(const TZmIOField& field) {
    if (field.use == kNoKey || field.key != nullptr) {
        return field.key != nullptr ? field.key : "";
    }
    std::string_view name = field.name;
    if (name.starts_with('f')) {
        name.remove_prefix(1);
    }
    return AsciiUpper(name);
}

}  // namespace zm
