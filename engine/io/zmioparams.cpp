#include "engine/io/zmioparams.h"

#include <algorithm>
#include <chrono>
#include <cmath>

#include "engine/bitmap/zmpixelformats.h"
#include "engine/bitmap/zmxBitmaps.h"
#include "engine/foundation/zmstrings.h"
#include "engine/platform/clock.h"

namespace zm {

namespace {

TDateTime Today() {
    using namespace std::chrono;
    const platform::TLocalTime now = platform::LocalNow();
    const year_month_day date{year{now.year}, month{static_cast<unsigned>(now.month)},
                              day{static_cast<unsigned>(now.day)}};
    constexpr year_month_day kDayZero{year{1899}, month{12}, day{30}};
    return static_cast<TDateTime>((sys_days{date} - sys_days{kDayZero}).count());
}

std::unique_ptr<TZmBitmap> CloneBitmap(TZmBitmap* source) {
    return source == nullptr ? nullptr : std::make_unique<TZmBitmap>(*source);
}

/// One coordinate by its four fields; `letters` are those of its negative and positive side.
void FoldCoordinate(double& degrees, double& minutes, double& seconds, std::string& reference,
                    std::string_view letters) {
    constexpr double kSecondsPerMinute = 60;
    constexpr double kSecondsPerDegree = 3600;
    double total = degrees * kSecondsPerDegree + minutes * kSecondsPerMinute + seconds;
    if (!std::isfinite(total) || (total == 0 && reference.empty())) {
        return;
    }
    if (!reference.empty() && reference[0] == letters[0]) {
        total = -total;
    }
    reference = letters[total < 0 ? 0 : 1];
    total = std::abs(total);
    degrees = std::floor(total / kSecondsPerDegree);
    total -= degrees * kSecondsPerDegree;
    minutes = std::floor(total / kSecondsPerMinute);
    seconds = total - minutes * kSecondsPerMinute;
}

constexpr std::u16string_view kXmpKey = u"XMP";

const char* DefaultPSTitle() {
    return "No Title";
}

}  // namespace

TIOParams::TIOParams() {
    SetDefaultParams();
}

TIOParams::TIOParams(TZmBitmap* attach_to) : attached_bitmap_(attach_to) {
    SetDefaultParams();
    SetDpiX(ZmGlobalSettings().fDefaultDPIX);
    SetDpiY(ZmGlobalSettings().fDefaultDPIY);
}

TIOParams::TIOParams(TZmParamsOwner* attach_to) : attached_owner_(attach_to) {
    SetDefaultParams();
}

TIOParams::~TIOParams() = default;

TZmBitmap* TIOParams::AttachedBitmap() const {
    return attached_owner_ != nullptr ? attached_owner_->GetParamsBitmap() : attached_bitmap_;
}

void TIOParams::SetDefaultParams() {
    static_cast<TZmIOFields&>(*this) = TZmIOFields{};
    ResetEXIF();
    fDict.Clear();
    TakeSettings();
    fTGA_Date = Today();
    fImageIndex = 0;
    fImageCount = 0;
    if (TZmBitmap* bitmap = AttachedBitmap(); bitmap != nullptr) {
        fWidth = bitmap->GetWidth();
        fHeight = bitmap->GetHeight();
    }
    if (attached_bitmap_ == nullptr) {
        SetDpiX(ZmGlobalSettings().fDefaultDPIX);
        SetDpiY(ZmGlobalSettings().fDefaultDPIY);
    }
}

void TIOParams::TakeSettings() {
    const TZmZalmoGlobalSettings& settings = ZmGlobalSettings();
    const TIOParamDefaults& defaults = settings.fIOParamDefaults;
    fTIFF_LZWDecompFunc = settings.fDefTIFF_LZWDECOMPFUNC;
    fTIFF_LZWCompFunc = settings.fDefTIFF_LZWCOMPFUNC;
    fGIF_LZWDecompFunc = settings.fDefGIF_LZWDECOMPFUNC;
    fGIF_LZWCompFunc = settings.fDefGIF_LZWCOMPFUNC;
    fEnableAdjustOrientation = defaults.EnableAdjustOrientation;
    fTIFF_EnableAdjustOrientation = defaults.EnableAdjustOrientation;
    fJPEG_EnableAdjustOrientation = defaults.EnableAdjustOrientation;
    fJPEG_Quality = defaults.JPEG_Quality;
    fTIFF_JPEGQuality = defaults.JPEG_Quality;
    fDICOM_JPEGQuality = defaults.JPEG_Quality;
    fJPEG_DCTMethod = static_cast<TIOJPEGDctMethod>(defaults.JPEG_DCTMethod);
    fJPEG_Scale = static_cast<TIOJPEGScale>(defaults.JPEG_Scale);
    fDICOM_Range = static_cast<TZmDicomRange>(defaults.DICOM_Range);
    fPSD_LoadLayers = defaults.PSD_LoadLayers;
    fRAW_AutoAdjustColors = defaults.RAW_AutoAdjustColors;
    fRAW_HalfSize = defaults.RAW_HalfSize;
    fRAW_GetEmbeddedJpeg = defaults.RAW_GetEmbeddedJpeg;
    fRAW_EmbeddedJpegMinWidth = defaults.RAW_EmbeddedJpegMinWidth;
    fRAW_EmbeddedJpegMinHeight = defaults.RAW_EmbeddedJpegMinHeight;
    fRAW_EmbeddedJpegLoading =
        static_cast<TZmRAWEmbeddedJpegLoading>(defaults.RAW_EmbeddedJpegLoading);
    fRAW_Interpolation = static_cast<TZmRAWInterpolation>(defaults.RAW_Interpolation);
    fRAW_QuickInterpolate = defaults.RAW_QuickInterpolate;
    fRAW_UseAutoWB = defaults.RAW_UseAutoWB;
    fRAW_UseCameraWB = defaults.RAW_UseCameraWB;
}

void TIOParams::ResetInfo(TZmMetaInfoItems items) {
    const TZmMetaInfoItems wanted = items.IsEmpty() ? kAllMetaInfoItems : items;
    if (wanted.Contains(zmrIPTC)) {
        fIPTC_Info.Clear();
    }
    if (wanted.Contains(zmrJPEGMarkers)) {
        if (wanted.Contains(zmrICC)) {
            fJPEG_MarkerList.Clear();
        } else {
            fJPEG_MarkerList.ClearExcept(kMarkerApp2);
        }
    }
    if (wanted.Contains(zmrEXIF)) {
        ResetEXIF();
    }
    if (wanted.Contains(zmrDicomTags)) {
        fDICOM_RescaleIntercept = 0;
        fDICOM_RescaleSlope = 1;
        fDICOM_WindowCenter = 0;
        fDICOM_WindowWidth = 0;
    }
    if (wanted.Contains(zmrOtherTextMeta)) {
        ResetOtherTextMeta();
    }
    if (wanted.Contains(zmrXMP)) {
        SetXMP_Info({});
        fPNG_Chunks.DeleteXmp();
    }
    if (wanted.Contains(zmrICC)) {
        fPNG_Chunks.Delete(kPngChunkProfile);
    }
}

void TIOParams::ResetOtherTextMeta() {
    for (TStringList* list : {&fGIF_Comments, &fPNG_TextKeys, &fPNG_TextValues, &fPXM_Comments}) {
        list->clear();
    }
    for (std::string* text :
         {&fTIFF_DocumentName, &fTIFF_ImageDescription, &fTIFF_PageName, &fTGA_Descriptor,
          &fTGA_Author, &fTGA_ImageName, &fPS_Title, &fPDF_Title, &fPDF_Author, &fPDF_Subject,
          &fPDF_Keywords, &fPDF_Creator, &fPDF_Producer, &fRAW_Camera}) {
        text->clear();
    }
    fZMN_Description.clear();
    fWIC_CodecInfo = {};
    fPNG_Chunks.DeletePlainTexts();
}

bool TIOParams::HasOtherTextMeta() const {
    const bool has_lists = !fGIF_Comments.empty() || !fPNG_TextKeys.empty() ||
                           !fPNG_TextValues.empty() || !fPXM_Comments.empty();
    const bool has_wide = !fZMN_Description.empty() || !fWIC_CodecInfo.name.empty() ||
                          !fWIC_CodecInfo.author.empty() || !fWIC_CodecInfo.version.empty();
    const std::array texts{
        &fTIFF_DocumentName, &fTIFF_ImageDescription, &fTIFF_PageName, &fTGA_Descriptor,
        &fTGA_Author,        &fTGA_ImageName,         &fPDF_Title,     &fPDF_Author,
        &fPDF_Subject,       &fPDF_Keywords,          &fPDF_Creator,   &fPDF_Producer,
        &fRAW_Camera};
    const bool has_title = !fPS_Title.empty() && fPS_Title != DefaultPSTitle();
    return has_lists || has_wide || has_title ||
           std::any_of(texts.begin(), texts.end(),
                       [](const std::string* text) { return !text->empty(); });
}

TZmMetaInfoItems TIOParams::ContainsInfo() const {
    TZmMetaInfoItems items;
    if (fEXIF_HasEXIFData) {
        items.Include(zmrEXIF);
    }
    if (fIPTC_Info.Count() > 0) {
        items.Include(zmrIPTC);
    }
    if (fJPEG_MarkerList.Count() > 0) {
        items.Include(zmrJPEGMarkers);
    }
    if (!fXMP_Info.empty()) {
        items.Include(zmrXMP);
    }
    if (HasOtherTextMeta()) {
        items.Include(zmrOtherTextMeta);
    }
    return items;
}

void TIOParams::ResetEXIF() {
    static_cast<TZmExifFields&>(*this) = TZmExifFields{};
    fEXIF_Bitmap.reset();
    fPNG_Chunks.Delete(kPngChunkExif);
    for (std::int32_t i = 0; i < fJPEG_MarkerList.Count(); ++i) {
        if (fJPEG_MarkerList.GetMarkerType(i) == kMarkerApp1 &&
            IsExifMarkerData(fJPEG_MarkerList.GetMarkerData(i))) {
            fJPEG_MarkerList.DeleteMarker(i);
            return;
        }
    }
}

void TIOParams::Assign(const TIOParams& source) {
    if (this == &source) {
        return;
    }
    static_cast<TZmIOFields&>(*this) = source;
    static_cast<TZmExifFields&>(*this) = source;
    fEXIF_Bitmap = CloneBitmap(source.fEXIF_Bitmap.get());
    fDict.Assign(source.fDict);
    fImageIndex = source.fImageIndex;
    fImageCount = source.fImageCount;
    fDpiX = source.fDpiX;
    fDpiY = source.fDpiY;
}

void TIOParams::AssignCompressionInfo(const TIOParams& source) {
    fBitsPerSample = source.fBitsPerSample;
    fSamplesPerPixel = source.fSamplesPerPixel;
    fTIFF_Compression = source.fTIFF_Compression;
    fTIFF_PhotometInterpret = source.fTIFF_PhotometInterpret;
    fTIFF_PlanarConf = source.fTIFF_PlanarConf;
    fTIFF_LZWDecompFunc = source.fTIFF_LZWDecompFunc;
    fTIFF_LZWCompFunc = source.fTIFF_LZWCompFunc;
    fTIFF_EnableAdjustOrientation = source.fTIFF_EnableAdjustOrientation;
    fTIFF_JPEGQuality = source.fTIFF_JPEGQuality;
    fTIFF_JPEGColorSpace = source.fTIFF_JPEGColorSpace;
    fTIFF_ZIPCompression = source.fTIFF_ZIPCompression;
    fTIFF_StripCount = source.fTIFF_StripCount;
    fTIFF_FillOrder = source.fTIFF_FillOrder;
    fTIFF_Normalize32fImages = source.fTIFF_Normalize32fImages;
    fGIF_Interlaced = source.fGIF_Interlaced;
    fGIF_LZWDecompFunc = source.fGIF_LZWDecompFunc;
    fGIF_LZWCompFunc = source.fGIF_LZWCompFunc;
    fJPEG_ColorSpace = source.fJPEG_ColorSpace;
    fJPEG_Quality = source.fJPEG_Quality;
    fJPEG_DCTMethod = source.fJPEG_DCTMethod;
    fJPEG_CromaSubsampling = source.fJPEG_CromaSubsampling;
    fJPEG_OptimalHuffman = source.fJPEG_OptimalHuffman;
    fJPEG_Smooth = source.fJPEG_Smooth;
    fJPEG_Progressive = source.fJPEG_Progressive;
    fJ2000_ColorSpace = source.fJ2000_ColorSpace;
    fJ2000_Rate = source.fJ2000_Rate;
    fJ2000_ScalableBy = source.fJ2000_ScalableBy;
    fICO_Format = source.fICO_Format;
    fPNG_Interlaced = source.fPNG_Interlaced;
    fPNG_Filter = source.fPNG_Filter;
    fPNG_Compression = source.fPNG_Compression;
    fDICOM_Range = source.fDICOM_Range;
    fDICOM_JPEGQuality = source.fDICOM_JPEGQuality;
    fDICOM_J2000Rate = source.fDICOM_J2000Rate;
    fTGA_Compressed = source.fTGA_Compressed;
    fTGA_GrayLevel = source.fTGA_GrayLevel;
    fPS_Compression = source.fPS_Compression;
    fPDF_Compression = source.fPDF_Compression;
}

void TIOParams::OptimizeLoadingParams(std::int32_t display_width, std::int32_t display_height) {
    // Sides whose sum stays below this are previews, for which speed counts more than exactness.
    constexpr std::int64_t kPreviewSideSum = 500;
    constexpr std::int32_t kHalfRawSide = 1401;
    const TIOParamDefaults& defaults = ZmGlobalSettings().fIOParamDefaults;
    const auto settings_dct = static_cast<TIOJPEGDctMethod>(defaults.JPEG_DCTMethod);
    if (display_width < 1 || display_height < 1) {
        fJPEG_Scale = static_cast<TIOJPEGScale>(defaults.JPEG_Scale);
        fJPEG_DCTMethod = settings_dct;
        fRAW_HalfSize = defaults.RAW_HalfSize;
        fRAW_GetEmbeddedJpeg = defaults.RAW_GetEmbeddedJpeg;
        fRAW_EmbeddedJpegMinWidth = defaults.RAW_EmbeddedJpegMinWidth;
        fRAW_EmbeddedJpegMinHeight = defaults.RAW_EmbeddedJpegMinHeight;
        fRAW_EmbeddedJpegLoading =
            static_cast<TZmRAWEmbeddedJpegLoading>(defaults.RAW_EmbeddedJpegLoading);
        return;
    }
    fJPEG_Scale = ioJPEG_AUTOCALC;
    fWidth = display_width;
    fHeight = display_height;
    const std::int64_t side_sum = std::int64_t{display_width} + display_height;
    fJPEG_DCTMethod = side_sum >= kPreviewSideSum ? settings_dct : ioJPEG_IFAST;
    fRAW_HalfSize = display_width < kHalfRawSide && display_height < kHalfRawSide;
    fRAW_GetEmbeddedJpeg = true;
    fRAW_EmbeddedJpegMinWidth = display_width;
    fRAW_EmbeddedJpegMinHeight = display_height;
    fRAW_EmbeddedJpegLoading = zmrlScaled;
}

void TIOParams::UpdateBPSAndSPP(TZmPixelFormat format) {
    if (!IsImageFormat(format)) {
        return;
    }
    const TZmPixelFormatRow& row = PixelFormatInfo(format);
    fBitsPerSample = row.bit_count / row.channel_count;
    fSamplesPerPixel = row.channel_count;
    if (format == zm8g) {
        fJPEG_ColorSpace = ioJPEG_GRAYLEV;
    }
}

void TIOParams::FreeColorMap() {
    fColorMap = {};
    fColorMapCount = 0;
}

void TIOParams::AdjustGPSCoordinates() {
    constexpr std::string_view kLatitude = "SN";
    constexpr std::string_view kLongitude = "WE";
    FoldCoordinate(fEXIF_GPSLatitudeDegrees, fEXIF_GPSLatitudeMinutes, fEXIF_GPSLatitudeSeconds,
                   fEXIF_GPSLatitudeRef, kLatitude);
    FoldCoordinate(fEXIF_GPSLongitudeDegrees, fEXIF_GPSLongitudeMinutes, fEXIF_GPSLongitudeSeconds,
                   fEXIF_GPSLongitudeRef, kLongitude);
    FoldCoordinate(fEXIF_GPSDestLatitudeDegrees, fEXIF_GPSDestLatitudeMinutes,
                   fEXIF_GPSDestLatitudeSeconds, fEXIF_GPSDestLatitudeRef, kLatitude);
    FoldCoordinate(fEXIF_GPSDestLongitudeDegrees, fEXIF_GPSDestLongitudeMinutes,
                   fEXIF_GPSDestLongitudeSeconds, fEXIF_GPSDestLongitudeRef, kLongitude);
}

bool TIOParams::OwnerIsAborting() const {
    return attached_owner_ != nullptr && attached_owner_->GetAborting();
}

std::string TIOParams::ReadIPTCField(std::uint8_t record, std::uint8_t dataset) const {
    return fIPTC_Info.GetStrings(fIPTC_Info.IndexOf(record, dataset));
}

void TIOParams::WriteIPTCField(std::uint8_t record, std::uint8_t dataset, std::string_view text) {
    const std::int32_t index = fIPTC_Info.IndexOf(record, dataset);
    if (index < 0) {
        fIPTC_Info.AddStringItem(record, dataset, text);
    } else {
        fIPTC_Info.SetStrings(index, text);
    }
}

void TIOParams::ClearIPTCField(std::uint8_t record, std::uint8_t dataset) {
    fIPTC_Info.DeleteItem(fIPTC_Info.IndexOf(record, dataset));
}

std::string TIOParams::GetIPTC_Photoshop(std::uint8_t dataset) const {
    return ReadIPTCField(kIptcApplicationRecord, dataset);
}

void TIOParams::SetIPTC_Photoshop(std::uint8_t dataset, std::string_view text) {
    WriteIPTCField(kIptcApplicationRecord, dataset, text);
}

void TIOParams::SetXMP_Info(const std::string& packet) {
    if (packet == fXMP_Info && !packet.empty()) {
        return;
    }
    fXMP_Info = packet;
    fDict.Erase(kXmpKey);
    auto tree = std::make_unique<TZmDictionary>();
    if (!packet.empty() && tree->Parse(Utf16FromUtf8(packet))) {
        fDict.Insert(kXmpKey, std::move(tree));
    }
}

void TIOParams::SetImageIndex(std::int32_t index) {
    fImageIndex = index;
    fTIFF_ImageIndex = index;
    fDCX_ImageIndex = index;
    fGIF_ImageIndex = index;
    fICO_ImageIndex = index;
    fCUR_ImageIndex = index;
}

void TIOParams::SetImageCount(std::int32_t count) {
    fImageCount = count;
    fTIFF_ImageCount = count;
    fGIF_ImageCount = count;
    fAVI_FrameCount = count;
    fMEDIAFILE_FrameCount = count;
}

void TIOParams::SetDpiX(std::int32_t dpi) {
    fDpiX = dpi;
    fEXIF_XResolution = dpi;
}

void TIOParams::SetDpiY(std::int32_t dpi) {
    fDpiY = dpi;
    fEXIF_YResolution = dpi;
}

}  // namespace zm
