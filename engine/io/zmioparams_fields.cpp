#include "engine/io/zmioparams_rows_p.h"

// The fields that the stream form holds, in its order. The number of a row is the first version
// that has the field.
namespace zm {

namespace {

void SetterOfDpiX(TIOParams& params) {
    params.SetDpiX(params.GetDpiX());
}

void SetterOfDpiY(TIOParams& params) {
    params.SetDpiY(params.GetDpiY());
}

void SetterOfImageIndex(TIOParams& params) {
    params.SetImageIndex(params.GetImageIndex());
}

constexpr TZmIOField BlockField(const char* name, TZmParamsBlock block, std::int32_t since) {
    return {name, nullptr, &kBlockFieldTypes[block], WholeParams, since, kNoKey, nullptr};
}

}  // namespace

#define ZM_FIELD(field, since, use) ZM_FIELD_ROW(field, nullptr, since, use, nullptr)
#define ZM_FIELD_KEY(field, key, since, use) ZM_FIELD_ROW(field, key, since, use, nullptr)
#define ZM_FIELD_SETTER(field, since, setter) \
    ZM_FIELD_ROW(field, nullptr, since, kReadWriteKey, setter)
#define ZM_CODEC_TEXT(part, key, since)                                                    \
    {                                                                                      \
        "fWIC_CodecInfo." #part, key, &kFieldType<std::u16string>,                         \
            [](TIOParams& params) -> void* { return &params.fWIC_CodecInfo.part; }, since, \
            kReadKey, nullptr                                                              \
    }

const TZmIOField TZmIOFieldTable::kStored[] = {
    // General.
    {"fFileName", nullptr, &kFileNameFieldType, AddressOf<&TIOParams::fFileName>, 25, kNoKey,
     nullptr},
    ZM_FIELD(fFileType, 25, kNoKey),
    ZM_FIELD(fBitsPerSample, 25, kReadWriteKey),
    ZM_FIELD(fSamplesPerPixel, 25, kReadWriteKey),
    ZM_FIELD(fWidth, 25, kReadWriteKey),
    ZM_FIELD(fHeight, 25, kReadWriteKey),
    ZM_FIELD_SETTER(fDpiX, 25, SetterOfDpiX),
    ZM_FIELD_SETTER(fDpiY, 25, SetterOfDpiY),
    {"fColorMap", nullptr, &kColorMapFieldType, WholeParams, 25, kNoKey, nullptr},
    ZM_FIELD_SETTER(fImageIndex, 25, SetterOfImageIndex),
    ZM_FIELD(fImageCount, 25, kReadKey),
    ZM_FIELD(fGetThumbnail, 25, kReadWriteKey),
    ZM_FIELD(fGetMetaData, 80, kReadWriteKey),
    ZM_FIELD(fEnableAdjustOrientation, 38, kReadWriteKey),
    ZM_FIELD(fIsResource, 44, kReadWriteKey),
    // TIFF.
    ZM_FIELD(fTIFF_Compression, 47, kReadWriteKey),
    ZM_FIELD(fTIFF_ImageIndex, 47, kReadWriteKey),
    // Required: the key lacks the second R; scripts spell it so.
    ZM_FIELD_KEY(fTIFF_PhotometInterpret, "TIFF_PHOTOMETINTEPRET", 47, kReadWriteKey),
    ZM_FIELD(fTIFF_PlanarConf, 47, kReadWriteKey),
    ZM_FIELD(fTIFF_NewSubfileType, 47, kReadWriteKey),
    ZM_FIELD(fTIFF_XPos, 4, kReadWriteKey),
    ZM_FIELD(fTIFF_YPos, 4, kReadWriteKey),
    ZM_FIELD(fTIFF_DocumentName, 4, kReadWriteKey),
    ZM_FIELD(fTIFF_ImageDescription, 4, kReadWriteKey),
    ZM_FIELD(fTIFF_PageName, 4, kReadWriteKey),
    ZM_FIELD(fTIFF_PageNumber, 4, kReadWriteKey),
    ZM_FIELD(fTIFF_PageCount, 4, kReadWriteKey),
    ZM_FIELD(fTIFF_ImageCount, 4, kReadKey),
    ZM_FIELD(fTIFF_Orientation, 6, kReadWriteKey),
    ZM_FIELD(fTIFF_JPEGQuality, 10, kReadWriteKey),
    ZM_FIELD(fTIFF_JPEGColorSpace, 16, kReadWriteKey),
    ZM_FIELD(fTIFF_FillOrder, 26, kReadWriteKey),
    ZM_FIELD(fTIFF_ZIPCompression, 30, kReadWriteKey),
    ZM_FIELD(fTIFF_SubIndex, 31, kReadWriteKey),
    ZM_FIELD(fTIFF_ByteOrder, 32, kReadWriteKey),
    ZM_FIELD(fTIFF_GetTile, 40, kReadWriteKey),
    ZM_FIELD(fTIFF_StripCount, 46, kReadWriteKey),
    ZM_FIELD(fTIFF_BigTIFF, 51, kReadWriteKey),
    ZM_FIELD(fTIFF_Normalize32fImages, 90, kReadWriteKey),
    ZM_FIELD(fTIFF_PhotoshopImageResources, 4, kNoKey),
    ZM_FIELD(fTIFF_PhotoshopImageSourceData, 4, kNoKey),
    // GIF.
    ZM_FIELD(fGIF_Version, 4, kReadWriteKey),
    ZM_FIELD(fGIF_ImageIndex, 4, kReadWriteKey),
    ZM_FIELD(fGIF_XPos, 4, kReadWriteKey),
    ZM_FIELD(fGIF_YPos, 4, kReadWriteKey),
    ZM_FIELD(fGIF_DelayTime, 4, kReadWriteKey),
    ZM_FIELD(fGIF_FlagTranspColor, 4, kReadWriteKey),
    ZM_FIELD(fGIF_TranspColor, 4, kReadWriteKey),
    ZM_FIELD(fGIF_Interlaced, 4, kReadWriteKey),
    ZM_FIELD(fGIF_WinWidth, 4, kReadWriteKey),
    ZM_FIELD(fGIF_WinHeight, 4, kReadWriteKey),
    ZM_FIELD(fGIF_Background, 4, kReadWriteKey),
    ZM_FIELD(fGIF_Ratio, 4, kReadWriteKey),
    ZM_FIELD(fGIF_ImageCount, 4, kReadKey),
    ZM_FIELD(fGIF_Comments, 12, kNoKey),
    ZM_FIELD(fGIF_Action, 12, kReadWriteKey),
    ZM_FIELD(fGIF_RAWLoad, 49, kReadWriteKey),
    // JPEG.
    ZM_FIELD(fJPEG_ColorSpace, 1, kReadWriteKey),
    ZM_FIELD(fJPEG_Quality, 1, kReadWriteKey),
    ZM_FIELD(fJPEG_DCTMethod, 1, kReadWriteKey),
    ZM_FIELD(fJPEG_OptimalHuffman, 1, kReadWriteKey),
    ZM_FIELD(fJPEG_Smooth, 1, kReadWriteKey),
    ZM_FIELD(fJPEG_Progressive, 1, kReadWriteKey),
    ZM_FIELD(fJPEG_Scale, 1, kReadWriteKey),
    {"fJPEG_MarkerList", nullptr, &kMarkersFieldType, AddressOf<&TIOParams::fJPEG_MarkerList>, 7,
     kNoKey, nullptr},
    ZM_FIELD(fOriginalWidth, 7, kReadKey),
    ZM_FIELD(fOriginalHeight, 7, kReadKey),
    ZM_FIELD(fJPEG_EnableAdjustOrientation, 20, kReadWriteKey),
    ZM_FIELD(fJPEG_GetExifThumbnail, 20, kReadWriteKey),
    ZM_FIELD(fJPEG_CromaSubsampling, 39, kReadWriteKey),
    // JPEG 2000.
    ZM_FIELD(fJ2000_ColorSpace, 8, kReadWriteKey),
    ZM_FIELD(fJ2000_Rate, 8, kReadWriteKey),
    ZM_FIELD(fJ2000_ScalableBy, 8, kReadWriteKey),
    ZM_FIELD(fJ2000_SubSamplingH, 83, kReadWriteKey),
    ZM_FIELD(fJ2000_SubSamplingV, 83, kReadWriteKey),
    ZM_FIELD(fJ2000_Reduce, 83, kReadWriteKey),
    ZM_FIELD(fJ2000_Quality, 83, kReadWriteKey),
    // PCX, BMP, ICO, CUR.
    ZM_FIELD(fPCX_Version, 28, kReadWriteKey),
    ZM_FIELD(fPCX_Compression, 28, kReadWriteKey),
    ZM_FIELD(fBMP_Version, 28, kReadWriteKey),
    ZM_FIELD(fBMP_Compression, 28, kReadWriteKey),
    ZM_FIELD(fBMP_HandleTransparency, 28, kReadWriteKey),
    ZM_FIELD(fICO_ImageIndex, 3, kReadWriteKey),
    ZM_FIELD(fICO_Background, 3, kReadWriteKey),
    ZM_FIELD(ICO_Sizes, 11, kNoKey),
    ZM_FIELD(ICO_BitCount, 11, kNoKey),
    ZM_FIELD(fICO_Format, 87, kReadWriteKey),
    ZM_FIELD(fCUR_ImageIndex, 3, kReadWriteKey),
    ZM_FIELD(fCUR_XHotSpot, 3, kReadWriteKey),
    ZM_FIELD(fCUR_YHotSpot, 3, kReadWriteKey),
    ZM_FIELD(fCUR_Background, 3, kReadWriteKey),
    // PNG.
    ZM_FIELD(fPNG_Interlaced, 48, kReadWriteKey),
    ZM_FIELD(fPNG_Background, 48, kReadWriteKey),
    ZM_FIELD(fPNG_Filter, 48, kReadWriteKey),
    ZM_FIELD(fPNG_Compression, 48, kReadWriteKey),
    ZM_FIELD(fPNG_TextKeys, 48, kNoKey),
    ZM_FIELD(fPNG_TextValues, 48, kNoKey),
    // DICOM.
    BlockField("fDICOM_Tags", kBlockDicomTags, 48),
    ZM_FIELD(fDICOM_WindowCenterOffset, 48, kNoKey),
    ZM_FIELD(fDICOM_Range, 48, kNoKey),
    ZM_FIELD(fDICOM_Compression, 50, kNoKey),
    ZM_FIELD(fDICOM_JPEGQuality, 50, kNoKey),
    ZM_FIELD(fDICOM_J2000Rate, 50, kNoKey),
    ZM_FIELD(fDICOM_RescaleIntercept, 52, kNoKey),
    ZM_FIELD(fDICOM_RescaleSlope, 52, kNoKey),
    ZM_FIELD(fDICOM_WindowCenter, 62, kNoKey),
    ZM_FIELD(fDICOM_WindowWidth, 62, kNoKey),
    ZM_FIELD(fDICOM_ContainsImage, 91, kNoKey),
    // PSD, HD Photo.
    ZM_FIELD(fPSD_LoadLayers, 27, kReadWriteKey),
    ZM_FIELD(fPSD_ReplaceLayers, 34, kReadWriteKey),
    ZM_FIELD(fPSD_HasPremultipliedAlpha, 36, kReadKey),
    ZM_FIELD(fPSD_LargeDocumentFormat, 51, kReadWriteKey),
    ZM_FIELD(fPSD_SelectLayer, 76, kReadWriteKey),
    ZM_FIELD(fPSD_HasMergedImage, 76, kReadKey),
    ZM_FIELD(fHDP_ImageQuality, 41, kReadWriteKey),
    ZM_FIELD(fHDP_Lossless, 41, kReadWriteKey),
    // TGA.
    ZM_FIELD(fTGA_XPos, 3, kReadWriteKey),
    ZM_FIELD(fTGA_YPos, 3, kReadWriteKey),
    ZM_FIELD(fTGA_Compressed, 3, kReadWriteKey),
    ZM_FIELD(fTGA_Descriptor, 3, kReadWriteKey),
    ZM_FIELD(fTGA_Author, 3, kReadWriteKey),
    ZM_FIELD(fTGA_ImageName, 3, kReadWriteKey),
    ZM_FIELD(fTGA_Date, 3, kReadWriteKey),
    ZM_FIELD(fTGA_Background, 3, kReadWriteKey),
    ZM_FIELD(fTGA_AspectRatio, 3, kReadWriteKey),
    ZM_FIELD(fTGA_Gamma, 3, kReadWriteKey),
    ZM_FIELD(fTGA_GrayLevel, 3, kReadWriteKey),
    // IPTC, PXM, AVI.
    {"fIPTC_Info", nullptr, &kIptcFieldType, AddressOf<&TIOParams::fIPTC_Info>, 6, kNoKey, nullptr},
    ZM_FIELD(fPXM_Comments, 6, kNoKey),
    ZM_FIELD(fAVI_FrameCount, 6, kReadKey),
    ZM_FIELD(fAVI_FrameDelayTime, 45, kReadWriteKey),
    // PS, PDF, DCX.
    ZM_FIELD(fPS_PaperWidth, 14, kReadWriteKey),
    ZM_FIELD(fPS_PaperHeight, 14, kReadWriteKey),
    ZM_FIELD(fPS_Compression, 14, kReadWriteKey),
    ZM_FIELD(fPS_Title, 14, kReadWriteKey),
    ZM_FIELD(fPDF_PaperWidth, 14, kReadWriteKey),
    ZM_FIELD(fPDF_PaperHeight, 14, kReadWriteKey),
    ZM_FIELD(fPDF_Compression, 14, kReadWriteKey),
    ZM_FIELD(fPDF_Title, 14, kReadWriteKey),
    ZM_FIELD(fPDF_Author, 14, kReadWriteKey),
    ZM_FIELD(fPDF_Subject, 14, kReadWriteKey),
    ZM_FIELD(fPDF_Keywords, 14, kReadWriteKey),
    ZM_FIELD(fPDF_Creator, 14, kReadWriteKey),
    ZM_FIELD(fPDF_Producer, 14, kReadWriteKey),
    ZM_FIELD(fPDF_PageMargin, 76, kReadWriteKey),
    ZM_FIELD(fDCX_ImageIndex, 18, kReadWriteKey),
    // Annotations, colour profiles.
    BlockField("fImagingAnnot", kBlockImagingAnnot, 18),
    BlockField("fZalmoAnnot", kBlockZalmoAnnot, 18),
    BlockField("fInputICC", kBlockInputICC, 18),
    BlockField("fOutputICC", kBlockOutputICC, 18),
    BlockField("fDefaultICC", kBlockDefaultICC, 18),
    // Camera raw.
    ZM_FIELD(fRAW_HalfSize, 18, kReadWriteKey),
    ZM_FIELD(fRAW_Gamma, 18, kReadWriteKey),
    ZM_FIELD(fRAW_Bright, 18, kReadWriteKey),
    ZM_FIELD(fRAW_RedScale, 18, kReadWriteKey),
    ZM_FIELD(fRAW_BlueScale, 18, kReadWriteKey),
    ZM_FIELD(fRAW_QuickInterpolate, 18, kReadWriteKey),
    ZM_FIELD(fRAW_UseAutoWB, 18, kReadWriteKey),
    ZM_FIELD(fRAW_UseCameraWB, 18, kReadWriteKey),
    ZM_FIELD(fRAW_FourColorRGB, 18, kReadWriteKey),
    ZM_FIELD(fRAW_Camera, 18, kReadKey),
    ZM_FIELD(fRAW_ExtraParams, 18, kReadWriteKey),
    ZM_FIELD(fRAW_GetExifThumbnail, 18, kReadWriteKey),
    ZM_FIELD(fRAW_GammaToeSlope, 76, kReadWriteKey),
    ZM_FIELD(fRAW_AutoBright, 76, kReadWriteKey),
    ZM_FIELD(fRAW_Highlight, 76, kReadWriteKey),
    ZM_FIELD(fRAW_Interpolation, 76, kReadWriteKey),
    ZM_FIELD(fRAW_OutputColorSpace, 80, kReadWriteKey),
    ZM_FIELD(fRAW_GetEmbeddedJpeg, 80, kReadWriteKey),
    ZM_FIELD(fRAW_UserWhiteBalance, 80, kNoKey),
    ZM_FIELD(fRAW_EmbeddedJpegMinWidth, 91, kReadWriteKey),
    ZM_FIELD(fRAW_EmbeddedJpegMinHeight, 91, kReadWriteKey),
    ZM_FIELD(fRAW_EmbeddedJpegLoading, 91, kReadWriteKey),
    ZM_FIELD(fRAW_AutoAdjustColors, 22, kReadWriteKey),
    // Media files, headerless bitmaps, layers, SVG, platform codecs.
    ZM_FIELD(fMEDIAFILE_FrameCount, 21, kReadKey),
    ZM_FIELD(fMEDIAFILE_FrameDelayTime, 45, kReadWriteKey),
    ZM_FIELD(fBMPRAW_ChannelOrder, 23, kReadWriteKey),
    ZM_FIELD(fBMPRAW_Planes, 23, kReadWriteKey),
    ZM_FIELD(fBMPRAW_RowAlign, 23, kReadWriteKey),
    ZM_FIELD(fBMPRAW_HeaderSize, 23, kReadWriteKey),
    ZM_FIELD(fBMPRAW_DataFormat, 42, kReadWriteKey),
    ZM_FIELD(fZMN_Compression, 70, kReadWriteKey),
    ZM_FIELD(fZMN_Description, 70, kReadWriteKey),
    ZM_FIELD(fZMN_LayerCount, 70, kReadKey),
    ZM_FIELD(fZMN_Version, 70, kReadKey),
    ZM_FIELD(fZMN_GetThumbnail, 70, kReadWriteKey),
    ZM_FIELD(fZMN_StoreBackground, 81, kReadWriteKey),
    ZM_FIELD(fSVG_ImageCompression, 70, kReadWriteKey),
    ZM_CODEC_TEXT(name, "WIC_CODECINFONAME", 0),
    ZM_CODEC_TEXT(author, "WIC_CODECINFOAUTHOR", 0),
    ZM_CODEC_TEXT(version, "WIC_CODECINFOVERSION", 0),
};

#undef ZM_FIELD
#undef ZM_FIELD_KEY
#undef ZM_FIELD_SETTER
#undef ZM_CODEC_TEXT

std::span<const TZmIOField> TZmIOFieldTable::Stored() {
    return kStored;
}

}  // namespace zm
