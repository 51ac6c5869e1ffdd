#pragma once

#include <array>
#include <cstdint>
#include <string>
#include <vector>

#include "engine/foundation/zmdefs.h"
#include "engine/foundation/zmsettings.h"
#include "engine/io/zmioenums.h"
#include "engine/metadata/zmiptc.h"
#include "engine/metadata/zmmarkers.h"
#include "engine/metadata/zmpngchunks.h"

namespace zm {

using TStringList = std::vector<std::string>;

/// A moment as days since 30 December 1899, the fraction being the time of day.
using TDateTime = double;

struct TZmIconSize {
    std::int32_t width = 0;
    std::int32_t height = 0;
    friend bool operator==(const TZmIconSize&, const TZmIconSize&) = default;
};

/// Name, author and version of the platform codec that read a file.
struct TZmWICCodecInfo {
    std::u16string name;
    std::u16string author;
    std::u16string version;
};

/// The fields of all formats side by side, grouped by prefix, in a form that copies as a value.
/// Where a default comes from the global settings, TIOParams::SetDefaultParams puts it in; the
/// values here are the settings' own defaults.
struct TZmIOFields {
    // General.
    std::int32_t fBitsPerSample = 8;
    std::u16string fFileName;  ///< last file
    std::int32_t fSamplesPerPixel = 3;
    std::int32_t fWidth = 0;  ///< as in the file
    std::int32_t fHeight = 0;
    std::int32_t fFileType = 0;
    bool fGetThumbnail = false;  ///< load the embedded thumbnail where one exists
    bool fGetMetaData = true;    ///< read metadata while loading
    bool fIsResource = false;    ///< true during a load from resources
    bool fEnableAdjustOrientation = false;
    std::int32_t fOriginalWidth = 0;  ///< before scaled loading
    std::int32_t fOriginalHeight = 0;
    bool fNativePixelFormat = false;  ///< keep the file's pixel format instead of zm24RGB
    std::vector<TRGB> fColorMap;      ///< palette of the file
    std::int32_t fColorMapCount = 0;  ///< entries of fColorMap in use

    // TIFF.
    TIOTIFFCompression fTIFF_Compression = ioTIFF_UNCOMPRESSED;
    std::int32_t fTIFF_ImageIndex = 0;
    std::int32_t fTIFF_SubIndex = -1;
    TIOTIFFPhotometInterpret fTIFF_PhotometInterpret = ioTIFF_RGB;
    std::int32_t fTIFF_PlanarConf = 1;
    std::int32_t fTIFF_NewSubfileType = 0;
    std::int32_t fTIFF_XPos = 0;
    std::int32_t fTIFF_YPos = 0;
    std::int32_t fTIFF_GetTile = -1;
    std::string fTIFF_DocumentName;
    std::string fTIFF_ImageDescription;
    std::string fTIFF_PageName;
    std::int32_t fTIFF_PageNumber = -1;
    std::int32_t fTIFF_PageCount = -1;
    std::int32_t fTIFF_ImageCount = 0;
    std::int32_t fTIFF_Orientation = 1;
    TTIFFLZWDecompFunc fTIFF_LZWDecompFunc = nullptr;
    TTIFFLZWCompFunc fTIFF_LZWCompFunc = nullptr;
    bool fTIFF_EnableAdjustOrientation = false;
    std::int32_t fTIFF_JPEGQuality = 80;
    TIOJPEGColorspace fTIFF_JPEGColorSpace = ioJPEG_YCbCr;
    std::int32_t fTIFF_FillOrder = 1;
    std::int32_t fTIFF_ZIPCompression = 1;
    std::int32_t fTIFF_StripCount = 0;
    TIOByteOrder fTIFF_ByteOrder = ioLittleEndian;
    std::vector<std::uint8_t> fTIFF_PhotoshopImageResources;
    std::vector<std::uint8_t> fTIFF_PhotoshopImageSourceData;
    bool fTIFF_BigTIFF = false;
    bool fTIFF_Normalize32fImages = true;

    // DCX.
    std::int32_t fDCX_ImageIndex = 0;

    // GIF.
    std::string fGIF_Version = "GIF89a";
    std::int32_t fGIF_ImageIndex = 0;
    std::int32_t fGIF_XPos = 0;
    std::int32_t fGIF_YPos = 0;
    std::int32_t fGIF_DelayTime = 0;  ///< hundredths of a second
    bool fGIF_FlagTranspColor = false;
    TRGB fGIF_TranspColor;
    bool fGIF_Interlaced = false;
    std::int32_t fGIF_WinWidth = 0;
    std::int32_t fGIF_WinHeight = 0;
    TRGB fGIF_Background;
    std::int32_t fGIF_Ratio = 0;
    std::int32_t fGIF_ImageCount = 0;
    TStringList fGIF_Comments;
    TZmGIFAction fGIF_Action = ioGIF_DrawBackground;
    bool fGIF_RAWLoad = false;
    TGIFLZWDecompFunc fGIF_LZWDecompFunc = nullptr;
    TGIFLZWCompFunc fGIF_LZWCompFunc = nullptr;

    // JPEG.
    TIOJPEGColorspace fJPEG_ColorSpace = ioJPEG_YCbCr;
    std::int32_t fJPEG_Quality = 80;
    TIOJPEGDctMethod fJPEG_DCTMethod = ioJPEG_ISLOW;
    TIOJPEGCromaSubsampling fJPEG_CromaSubsampling = ioJPEG_HIGH;
    bool fJPEG_OptimalHuffman = false;
    bool fJPEG_Progressive = false;
    bool fJPEG_GetExifThumbnail = false;
    std::int32_t fJPEG_Smooth = 0;
    std::int32_t fJPEG_WarningTot = 0;   ///< warnings of the last load
    std::int32_t fJPEG_WarningCode = 0;  ///< the last one's message number
    TIOJPEGScale fJPEG_Scale = ioJPEG_FULLSIZE;
    TZmMarkerList fJPEG_MarkerList;
    std::int32_t fJPEG_ScaleUsed = 1;  ///< denominator of the last load
    bool fJPEG_EnableAdjustOrientation = false;

    // JPEG 2000.
    TIOJ2000ColorSpace fJ2000_ColorSpace = ioJ2000_RGB;
    double fJ2000_Rate = 0.95;
    TIOJ2000ScalableBy fJ2000_ScalableBy = ioJ2000_Rate;
    std::int32_t fJ2000_SubSamplingH = 1;
    std::int32_t fJ2000_SubSamplingV = 1;
    std::int32_t fJ2000_Reduce = 0;
    double fJ2000_Quality = 100;

    // PCX, BMP, ICO, CUR.
    std::int32_t fPCX_Version = 5;
    TIOPCXCompression fPCX_Compression = ioPCX_RLE;
    TIOBMPVersion fBMP_Version = ioBMP_BM3;
    TIOBMPCompression fBMP_Compression = ioBMP_UNCOMPRESSED;
    bool fBMP_HandleTransparency = false;
    std::int32_t fICO_ImageIndex = 0;
    TRGB fICO_Background{255, 255, 255};
    TIOICOFormat fICO_Format = zmifICO;
    std::array<TZmIconSize, 16> ICO_Sizes{};
    std::array<std::int32_t, 16> ICO_BitCount{8};
    std::int32_t fCUR_ImageIndex = 0;
    std::int32_t fCUR_XHotSpot = 0;
    std::int32_t fCUR_YHotSpot = 0;
    TRGB fCUR_Background{255, 255, 255};

    // PNG.
    bool fPNG_Interlaced = false;
    TRGB fPNG_Background;
    TIOPNGFilter fPNG_Filter = ioPNG_FILTER_NONE;
    std::int32_t fPNG_Compression = 5;
    TStringList fPNG_TextKeys;  ///< the key of each line of fPNG_TextValues
    TStringList fPNG_TextValues;
    TZmPngChunkList fPNG_Chunks;  ///< metadata chunks of the last PNG file

    // DICOM.
    double fDICOM_WindowCenterOffset = 0;
    TZmDicomRange fDICOM_Range = zmdrAdjust;
    std::int32_t fDICOM_JPEGQuality = 80;
    double fDICOM_J2000Rate = 0.07;
    double fDICOM_RescaleIntercept = 0;
    double fDICOM_RescaleSlope = 1;
    double fDICOM_WindowCenter = 0;
    double fDICOM_WindowWidth = 0;
    TZmDicomCompression fDICOM_Compression = zmdcUncompressed;
    bool fDICOM_ContainsImage = true;

    // TGA.
    std::int32_t fTGA_XPos = 0;
    std::int32_t fTGA_YPos = 0;
    bool fTGA_Compressed = true;
    std::string fTGA_Descriptor;
    std::string fTGA_Author;
    TDateTime fTGA_Date = 0;  ///< SetDefaultParams puts in the present day
    std::string fTGA_ImageName;
    TRGB fTGA_Background;
    double fTGA_AspectRatio = 1;
    double fTGA_Gamma = 2.2;
    bool fTGA_GrayLevel = false;

    // Text metadata that is no format's own.
    TZmIPTCInfoList fIPTC_Info;
    TStringList fPXM_Comments;
    std::string fXMP_Info;  ///< the packet as it came

    // Video.
    std::int32_t fAVI_FrameCount = 0;
    double fAVI_FrameDelayTime = 0;  ///< milliseconds
    std::int32_t fMEDIAFILE_FrameCount = 0;
    double fMEDIAFILE_FrameDelayTime = 0;

    // PostScript and PDF; paper sizes and margins in points.
    std::int32_t fPS_PaperWidth = 595;
    std::int32_t fPS_PaperHeight = 842;
    TIOPSCompression fPS_Compression = ioPS_G4FAX;
    std::string fPS_Title = "No Title";
    std::int32_t fPDF_PaperWidth = 595;
    std::int32_t fPDF_PaperHeight = 842;
    std::int32_t fPDF_PageMargin = 0;
    TIOPDFCompression fPDF_Compression = ioPDF_G4FAX;
    std::string fPDF_Title;
    std::string fPDF_Author;
    std::string fPDF_Subject;
    std::string fPDF_Keywords;
    std::string fPDF_Creator;
    std::string fPDF_Producer;

    // Camera raw.
    bool fRAW_HalfSize = false;
    double fRAW_Gamma = 2.222;
    double fRAW_GammaToeSlope = 4.5;
    double fRAW_Bright = 1;
    double fRAW_RedScale = 1;
    double fRAW_BlueScale = 1;
    bool fRAW_QuickInterpolate = true;
    TZmRAWInterpolation fRAW_Interpolation = zmRAWInterpolationLinear;
    bool fRAW_UseAutoWB = false;
    bool fRAW_UseCameraWB = false;
    bool fRAW_FourColorRGB = false;
    TZmRAWOutputColorSpace fRAW_OutputColorSpace = zmrcsSRGB;
    bool fRAW_GetEmbeddedJpeg = false;
    TZmRAWEmbeddedJpegLoading fRAW_EmbeddedJpegLoading = zmrlDefault;
    std::int32_t fRAW_EmbeddedJpegMinWidth = 800;
    std::int32_t fRAW_EmbeddedJpegMinHeight = 800;
    std::string fRAW_Camera;
    bool fRAW_GetExifThumbnail = false;
    bool fRAW_AutoAdjustColors = false;
    std::string fRAW_ExtraParams;
    bool fRAW_AutoBright = true;
    TZmRAWHighlight fRAW_Highlight = zmRAWHighlightClip;
    std::array<double, 4> fRAW_UserWhiteBalance{};

    // Headerless bitmap.
    TIOBMPRAWChannelOrder fBMPRAW_ChannelOrder = coRGB;
    TIOBMPRAWPlanes fBMPRAW_Planes = plInterleaved;
    std::int32_t fBMPRAW_RowAlign = 8;    ///< bits
    std::int32_t fBMPRAW_HeaderSize = 0;  ///< bytes to skip
    TIOBMPRAWDataFormat fBMPRAW_DataFormat = dfBinary;

    // Layered documents, HD Photo, layers files, SVG, platform codecs.
    bool fPSD_LoadLayers = false;
    bool fPSD_ReplaceLayers = true;
    bool fPSD_HasPremultipliedAlpha = false;
    bool fPSD_HasMergedImage = true;
    bool fPSD_LargeDocumentFormat = false;
    std::string fPSD_SelectLayer;
    double fHDP_ImageQuality = 0.9;
    bool fHDP_Lossless = false;
    std::int32_t fZMN_Compression = -1;
    std::u16string fZMN_Description;
    bool fZMN_GetThumbnail = false;
    bool fZMN_StoreBackground = true;
    std::int32_t fZMN_LayerCount = 0;
    std::int32_t fZMN_Version = 0;
    std::int32_t fSVG_ImageCompression = 8;
    TZmWICCodecInfo fWIC_CodecInfo;
};

}  // namespace zm
