#pragma once

#include <cstdint>

/// Enumerations of the file parameters. Their ordinals are persisted and travel as numbers in
/// the text form of the parameters, so the orders are fixed.
namespace zm {

enum TIOTIFFCompression : std::uint8_t {
    ioTIFF_UNCOMPRESSED,
    ioTIFF_CCITT1D,
    ioTIFF_G3FAX1D,
    ioTIFF_G3FAX2D,
    ioTIFF_G4FAX,
    ioTIFF_LZW,
    ioTIFF_OLDJPEG,
    ioTIFF_JPEG,
    ioTIFF_PACKBITS,
    ioTIFF_ZIP,
    ioTIFF_DEFLATE,
    ioTIFF_UNKNOWN,
};

enum TIOTIFFPhotometInterpret : std::uint8_t {
    ioTIFF_WHITEISZERO,
    ioTIFF_BLACKISZERO,
    ioTIFF_RGB,
    ioTIFF_RGBPALETTE,
    ioTIFF_TRANSPMASK,
    ioTIFF_CMYK,
    ioTIFF_YCBCR,
    ioTIFF_CIELAB,
};

enum TIOByteOrder : std::uint8_t { ioBigEndian, ioLittleEndian };

enum TIOJPEGColorspace : std::uint8_t {
    ioJPEG_RGB,
    ioJPEG_GRAYLEV,
    ioJPEG_YCbCr,
    ioJPEG_CMYK,
    ioJPEG_YCbCrK,
};

enum TIOJPEGDctMethod : std::uint8_t { ioJPEG_ISLOW, ioJPEG_IFAST, ioJPEG_FLOAT };

/// Chroma samples per luma sample: half across, half both ways, all.
enum TIOJPEGCromaSubsampling : std::uint8_t { ioJPEG_MEDIUM, ioJPEG_HIGH, ioJPEG_NONE };

enum TIOJPEGScale : std::uint8_t {
    ioJPEG_AUTOCALC,  ///< the smallest scale that still covers fWidth by fHeight
    ioJPEG_FULLSIZE,
    ioJPEG_HALF,
    ioJPEG_QUARTER,
    ioJPEG_EIGHTH,
};

enum TIOJ2000ColorSpace : std::uint8_t { ioJ2000_GRAYLEV, ioJ2000_RGB, ioJ2000_YCbCr };
enum TIOJ2000ScalableBy : std::uint8_t { ioJ2000_Rate, ioJ2000_Resolution };

enum TIOPCXCompression : std::uint8_t { ioPCX_UNCOMPRESSED, ioPCX_RLE };

enum TIOBMPVersion : std::uint8_t {
    ioBMP_BM,
    ioBMP_BM3,
    ioBMP_BMOS2V1,
    ioBMP_BMOS2V2,
    ioBMP_V4,
    ioBMP_V5,
};
enum TIOBMPCompression : std::uint8_t { ioBMP_UNCOMPRESSED, ioBMP_RLE };

enum TIOICOFormat : std::uint8_t { zmifICO, zmifPNG };

enum TIOPNGFilter : std::uint8_t {
    ioPNG_FILTER_NONE,
    ioPNG_FILTER_SUB,
    ioPNG_FILTER_PAETH,
    ioPNG_FILTER_UP,
    ioPNG_FILTER_AVG,
    ioPNG_FILTER_ALL,
};

enum TZmGIFAction : std::uint8_t {
    ioGIF_None,
    ioGIF_DontRemove,
    ioGIF_DrawBackground,
    ioGIF_RestorePrev,
};

enum TZmDicomRange : std::uint8_t { zmdrAdjust, zmdrSetBlackWhite };

enum TZmDicomCompression : std::uint8_t {
    zmdcUncompressed_Implicit,
    zmdcUncompressed,
    zmdcUncompressed_BE,
    zmdcRLE,
    zmdcLSJPEG1,
    zmdcLSJPEG2,
    zmdcJPEG,
    zmdcJPEG12Bit,
    zmdcJPEG2000,
    zmdcLosslessJPEG2000,
};

enum TIOPSCompression : std::uint8_t { ioPS_RLE, ioPS_G4FAX, ioPS_G3FAX2D, ioPS_JPEG };

enum TIOPDFCompression : std::uint8_t {
    ioPDF_UNCOMPRESSED,
    ioPDF_RLE,
    ioPDF_G4FAX,
    ioPDF_G3FAX2D,
    ioPDF_JPEG,
    ioPDF_LZW,
};

enum TZmRAWInterpolation : std::uint8_t {
    zmRAWInterpolationLinear,
    zmRAWInterpolationVNG,
    zmRAWInterpolationPPG,
    zmRAWInterpolationAHD,
    zmRAWInterpolationDCB,
};
enum TZmRAWOutputColorSpace : std::uint8_t {
    zmrcsRAW,
    zmrcsSRGB,
    zmrcsADOBE,
    zmrcsWIDE,
    zmrcsPROPHOTO,
    zmrcsXYZ,
};
enum TZmRAWEmbeddedJpegLoading : std::uint8_t { zmrlDefault, zmrlScaled, zmrlWIC };
/// Treatment of overexposed areas; values above zmRAWHighlightClip are the raw engine's own.
enum TZmRAWHighlight : std::uint8_t { zmRAWHighlightClip };

/// Layout of a headerless bitmap; the default of each is its first value.
enum TIOBMPRAWChannelOrder : std::uint8_t { coRGB, coBGR };
enum TIOBMPRAWPlanes : std::uint8_t { plInterleaved, plPlanar };
enum TIOBMPRAWDataFormat : std::uint8_t { dfBinary };

/// Kinds of information that travel with an image; ordinals are bits of TZmMetaInfoItems.
enum TZmMetaInfoItem : std::uint8_t {
    zmrAnnotations,
    zmrDicomTags,
    zmrEXIF,
    zmrICC,
    zmrIPTC,
    zmrJPEGMarkers,
    zmrXMP,
    zmrOtherTextMeta,
};

/// A set of kinds. Where it selects what to reset, the empty set means all.
class TZmMetaInfoItems {
public:
    constexpr TZmMetaInfoItems() = default;
    template <typename... Items>
    constexpr explicit TZmMetaInfoItems(Items... items) : bits_(((1u << items) | ... | 0u)) {}
    constexpr bool Contains(TZmMetaInfoItem item) const { return (bits_ >> item & 1u) != 0; }
    constexpr bool IsEmpty() const { return bits_ == 0; }
    constexpr void Include(TZmMetaInfoItem item) { bits_ |= 1u << item; }
    friend constexpr bool operator==(TZmMetaInfoItems, TZmMetaInfoItems) = default;

private:
    std::uint32_t bits_ = 0;
};

inline constexpr TZmMetaInfoItems kAllMetaInfoItems(zmrAnnotations, zmrDicomTags, zmrEXIF, zmrICC,
                                                    zmrIPTC, zmrJPEGMarkers, zmrXMP,
                                                    zmrOtherTextMeta);

}  // namespace zm
