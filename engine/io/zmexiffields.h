#pragma once

#include <array>
#include <cstdint>
#include <string>

namespace zm {

/// The EXIF block of an image as named fields, one for each tag of the EXIF standard (JEITA
/// CP-3451), after which they are named. The initial values are those of an image without the
/// tag: empty texts, and numbers that no writer puts into a file (-1 or -1000 where 0 is a
/// value). Text is single-byte unless wide; rationals are doubles.
struct TZmExifFields {
    bool fEXIF_HasEXIFData = false;  ///< the file had a block, or one is to be written

    // Main directory.
    std::int32_t fEXIF_Orientation = 1;
    std::string fEXIF_ImageDescription;
    std::string fEXIF_Make;
    std::string fEXIF_Model;
    double fEXIF_XResolution = 0;  ///< follows TIOParams::SetDpiX
    double fEXIF_YResolution = 0;  ///< follows TIOParams::SetDpiY
    std::int32_t fEXIF_ResolutionUnit = 2;
    std::string fEXIF_Software;
    std::string fEXIF_Artist;
    std::string fEXIF_DateTime;
    std::array<double, 2> fEXIF_WhitePoint{-1, -1};
    std::array<double, 6> fEXIF_PrimaryChromaticities{-1, -1, -1, -1, -1, -1};
    std::array<double, 3> fEXIF_YCbCrCoefficients{-1, -1, -1};
    std::int32_t fEXIF_YCbCrPositioning = -1;
    std::array<double, 6> fEXIF_ReferenceBlackWhite{-1, -1, -1, -1, -1, -1};
    std::string fEXIF_Copyright;

    // EXIF directory.
    double fEXIF_ExposureTime = -1;
    double fEXIF_FNumber = -1;
    std::int32_t fEXIF_ExposureProgram = -1;
    std::array<std::int32_t, 2> fEXIF_ISOSpeedRatings{};
    std::string fEXIF_ExifVersion;
    std::string fEXIF_DateTimeOriginal;
    std::string fEXIF_DateTimeDigitized;
    double fEXIF_CompressedBitsPerPixel = 0;
    double fEXIF_ShutterSpeedValue = -1;
    double fEXIF_ApertureValue = -1;
    double fEXIF_BrightnessValue = -1000;
    double fEXIF_ExposureBiasValue = -1000;
    double fEXIF_MaxApertureValue = -1000;
    double fEXIF_SubjectDistance = -1;
    std::int32_t fEXIF_MeteringMode = -1;
    std::int32_t fEXIF_LightSource = -1;
    std::int32_t fEXIF_Flash = -1;
    double fEXIF_FocalLength = -1;
    std::string fEXIF_SubsecTime;
    std::string fEXIF_SubsecTimeOriginal;
    std::string fEXIF_SubsecTimeDigitized;
    std::string fEXIF_FlashPixVersion;
    std::int32_t fEXIF_ColorSpace = -1;
    std::int32_t fEXIF_ExifImageWidth = 0;
    std::int32_t fEXIF_ExifImageHeight = 0;
    std::string fEXIF_RelatedSoundFile;
    double fEXIF_FocalPlaneXResolution = -1;
    double fEXIF_FocalPlaneYResolution = -1;
    std::int32_t fEXIF_FocalPlaneResolutionUnit = -1;
    double fEXIF_ExposureIndex = -1;
    std::int32_t fEXIF_SensingMethod = -1;
    std::int32_t fEXIF_FileSource = -1;
    std::int32_t fEXIF_SceneType = -1;
    std::u16string fEXIF_UserComment;
    std::string fEXIF_UserCommentCode;  ///< 8 bytes that tell the comment's character set
    std::int32_t fEXIF_XPRating = -1;
    std::u16string fEXIF_XPTitle;
    std::u16string fEXIF_XPComment;
    std::u16string fEXIF_XPAuthor;
    std::u16string fEXIF_XPKeywords;
    std::u16string fEXIF_XPSubject;
    std::int32_t fEXIF_ExposureMode = -1;
    std::int32_t fEXIF_WhiteBalance = -1;
    double fEXIF_DigitalZoomRatio = -1;
    std::int32_t fEXIF_FocalLengthIn35mmFilm = -1;
    std::int32_t fEXIF_SceneCaptureType = -1;
    std::int32_t fEXIF_GainControl = -1;
    std::int32_t fEXIF_Contrast = -1;
    std::int32_t fEXIF_Saturation = -1;
    std::int32_t fEXIF_Sharpness = -1;
    std::int32_t fEXIF_SubjectDistanceRange = -1;
    std::string fEXIF_ImageUniqueID;

    // GPS directory.
    std::string fEXIF_GPSVersionID;  ///< dotted decimal
    std::string fEXIF_GPSLatitudeRef;
    double fEXIF_GPSLatitudeDegrees = 0;
    double fEXIF_GPSLatitudeMinutes = 0;
    double fEXIF_GPSLatitudeSeconds = 0;
    std::string fEXIF_GPSLongitudeRef;
    double fEXIF_GPSLongitudeDegrees = 0;
    double fEXIF_GPSLongitudeMinutes = 0;
    double fEXIF_GPSLongitudeSeconds = 0;
    std::string fEXIF_GPSAltitudeRef;
    double fEXIF_GPSAltitude = 0;
    double fEXIF_GPSTimeStampHour = 0;
    double fEXIF_GPSTimeStampMinute = 0;
    double fEXIF_GPSTimeStampSecond = 0;
    std::string fEXIF_GPSSatellites;
    std::string fEXIF_GPSStatus;
    std::string fEXIF_GPSMeasureMode;
    double fEXIF_GPSDOP = 0;
    std::string fEXIF_GPSSpeedRef;
    double fEXIF_GPSSpeed = 0;
    std::string fEXIF_GPSTrackRef;
    double fEXIF_GPSTrack = 0;
    std::string fEXIF_GPSImgDirectionRef;
    double fEXIF_GPSImgDirection = 0;
    std::string fEXIF_GPSMapDatum;
    std::string fEXIF_GPSDestLatitudeRef;
    double fEXIF_GPSDestLatitudeDegrees = 0;
    double fEXIF_GPSDestLatitudeMinutes = 0;
    double fEXIF_GPSDestLatitudeSeconds = 0;
    std::string fEXIF_GPSDestLongitudeRef;
    double fEXIF_GPSDestLongitudeDegrees = 0;
    double fEXIF_GPSDestLongitudeMinutes = 0;
    double fEXIF_GPSDestLongitudeSeconds = 0;
    std::string fEXIF_GPSDestBearingRef;
    double fEXIF_GPSDestBearing = 0;
    std::string fEXIF_GPSDestDistanceRef;
    double fEXIF_GPSDestDistance = 0;
    std::string fEXIF_GPSDateStamp;

    // Interoperability directory and later additions to the standard.
    std::string fEXIF_InteropIndex;
    std::string fEXIF_InteropVersion;
    std::string fEXIF_CameraOwnerName;
    std::string fEXIF_BodySerialNumber;
    std::string fEXIF_LensMake;
    std::string fEXIF_LensModel;
    std::string fEXIF_LensSerialNumber;
    double fEXIF_Gamma = -1;
    std::array<std::int32_t, 4> fEXIF_SubjectArea{-1, -1, -1, -1};
    std::int32_t fEXIF_SubjectLocationX = -1;
    std::int32_t fEXIF_SubjectLocationY = -1;
};

}  // namespace zm
