#include "engine/io/zmfileformats.h"

#include <algorithm>
#include <array>
#include <iterator>
#include <vector>

#include "engine/foundation/zmsettings.h"
#include "engine/foundation/zmstrings.h"

namespace zm {

const char* const kCameraRawWildcards =
    "*.CRW;*.CR2;*.CR3;*.DNG;*.NEF;*.RAW;*.RAF;*.X3F;*.ORF;*.SRF;*.MRW;*.DCR;*.BAY;*.PEF;*.SR2;"
    "*.ARW;*.KDC;*.MEF;*.3FR;*.K25;*.ERF;*.CAM;*.CS1;*.DC2;*.DCS;*.FFF;*.MDC;*.MOS;*.NRW;*.PTX;"
    "*.PXN;*.RDC;*.RW2;*.RWL;*.IIQ;*.SRW";

namespace {

/// What an internal row can do, and whether it needs the platform's imaging component.
enum TRowUse : std::uint8_t { kReadOnly = 1, kWriteOnly = 2, kReadWrite = 3, kNeedsPlatform = 4 };

struct TInternalRow {
    std::int32_t type;
    const char* full_name;
    const char* extensions;  // nil: made from the camera raw list
    std::uint8_t use;
    TPreviewParams page;
};

// The order is that of every loop over the formats: it decides ties among extensions and the
// order of dialog filters.
const std::array kInternalRows{
    TInternalRow{ioTIFF, "TIFF Image", "TIFF;TIF;FAX;G3N;G3F;XIF", kReadWrite,
                 TPreviewParams(ppTIFF)},
    TInternalRow{ioGIF, "GIF Image", "GIF", kReadWrite, TPreviewParams(ppGIF)},
    TInternalRow{ioJPEG, "JPEG Image", "JPEG;JPG;JPE;JIF;JFIF", kReadWrite, TPreviewParams(ppJPEG)},
    TInternalRow{ioPCX, "PaintBrush", "PCX", kReadWrite, TPreviewParams(ppPCX)},
    TInternalRow{ioBMP, "Windows Bitmap", "BMP;DIB;RLE", kReadWrite, TPreviewParams(ppBMP)},
    TInternalRow{ioBMPRAW, "Raw Bitmap", "", kReadWrite, {}},
    TInternalRow{ioICO, "Windows Icon", "ICO", kReadWrite, {}},
    TInternalRow{ioCUR, "Windows Cursor", "CUR", kReadOnly, {}},
    TInternalRow{ioPNG, "Portable Network Graphics", "PNG", kReadWrite, TPreviewParams(ppPNG)},
    TInternalRow{ioDICOM, "DICOM Medical Image", "DICOM;DCM;DIC;V2", kReadWrite, {}},
    TInternalRow{ioWMF, "Windows Metafile", "WMF", kReadOnly, {}},
    TInternalRow{ioEMF, "Enhanced Metafile", "EMF", kReadOnly, {}},
    TInternalRow{ioTGA, "Targa Image", "TARGA;TGA;VDA;ICB;VST;PIX", kReadWrite,
                 TPreviewParams(ppTGA)},
    TInternalRow{ioPXM, "Portable Pixmap", "PXM;PPM;PGM;PBM", kReadWrite, {}},
    TInternalRow{ioWBMP, "Wireless Bitmap", "WBMP", kReadWrite, {}},
    TInternalRow{ioJP2, "JPEG2000", "JP2", kReadWrite, TPreviewParams(ppJ2000)},
    TInternalRow{ioJ2K, "JPEG2000 Code Stream", "J2K;JPC;J2C", kReadWrite, TPreviewParams(ppJ2000)},
    TInternalRow{ioPS, "PostScript", "PS;EPS", kWriteOnly, {}},
    TInternalRow{ioPDF, "Adobe PDF", "PDF", kWriteOnly, {}},
    TInternalRow{ioDCX, "Multipage PCX", "DCX", kReadWrite, {}},
    TInternalRow{ioRAW, "Camera Raw Image", nullptr, kReadOnly, {}},
    TInternalRow{ioPSD, "Photoshop PSD", "PSD;PSB", kReadWrite, {}},
    TInternalRow{ioZMV, "Vector Objects File", "ZMV", kReadWrite, {}},
    TInternalRow{ioALL, "Vector Advanced File", "ALL", kReadWrite, {}},
    TInternalRow{ioLYR, "Zalmo Layers", "ZMN;ZALMO;LYR", kReadWrite, {}},
    TInternalRow{ioHDP, "Microsoft HD Photo", "WDP;HDP;JXR", kReadWrite | kNeedsPlatform, {}},
    TInternalRow{ioSVG, "Scalable Vector Graphics", "SVG", kWriteOnly, {}},
    TInternalRow{ioDDS, "DirectDraw Surface", "DDS", kReadWrite | kNeedsPlatform, {}},
    TInternalRow{ioHEIF,
                 "High Efficiency Image File",
                 "HEIC;HEIF;HEICS;AVCS;HEIFS",
                 kReadOnly | kNeedsPlatform,
                 {}},
    TInternalRow{ioWEBP, "WebP", "WEBP", kReadOnly | kNeedsPlatform, {}},
    TInternalRow{ioOtherWIC, "Other Windows Images", "", kReadOnly | kNeedsPlatform, {}},
};

// Internal rows are dispatched by their type. Their function pointers are never the way to a
// codec; they are there to be non-nil, so that one test answers for all rows.
void ReadInternalStub(TStream&, TZmBitmap&, TIOParams&, TProgressRec&, bool) {}
void WriteInternalStub(TStream&, TZmBitmap&, TIOParams&, TProgressRec&) {}
bool TryInternalStub(TStream&, std::int32_t) {
    return false;
}

/// A wildcard list with every "*." removed.
std::string ExtensionsOfWildcards(std::string_view wildcards) {
    std::string result;
    for (std::string& part : SplitText(wildcards, ';')) {
        const std::size_t skip = part.starts_with("*.") ? 2 : 0;
        result += (result.empty() ? "" : ";") + part.substr(skip);
    }
    return result;
}

std::shared_ptr<TZmFileFormatInfo> MakeRow(const TInternalRow& source) {
    auto row = std::make_shared<TZmFileFormatInfo>();
    row->FileType = source.type;
    row->FullName = source.full_name;
    row->Extensions = source.extensions != nullptr ? source.extensions
                                                   : ExtensionsOfWildcards(kCameraRawWildcards);
    row->InternalFormat = true;
    row->DialogPage = source.page;
    row->ReadFunction = (source.use & kReadOnly) != 0 ? ReadInternalStub : nullptr;
    row->WriteFunction = (source.use & kWriteOnly) != 0 ? WriteInternalStub : nullptr;
    row->TryFunction = TryInternalStub;
    return row;
}

void FillRegistry(TZmZalmoGlobalSettings& settings) {
    for (const TInternalRow& source : kInternalRows) {
        if ((source.use & kNeedsPlatform) == 0 || WICAvailable()) {
            settings.fFileFormats.push_back(MakeRow(source));
        }
    }
}

[[maybe_unused]] const bool kRegistryFilled = AddSettingsInitializer(FillRegistry);

/// Text of an extension as the rows have it, or empty when it can be in no row.
std::string BareExtension(std::u16string_view extension) {
    std::string text = AsciiLower(Utf8FromUtf16(extension));
    if (text.starts_with('.')) {
        text.erase(0, 1);
    }
    return text;
}

/// Extensions that the settings give to the platform's imaging component.
std::string OtherWICExtensions() {
    std::string text = ZmGlobalSettings().fWICFileTypes;
    std::erase_if(text, [](char c) { return c == '*' || c == '.'; });
    return AsciiUpper(text);
}

/// The row's extensions follow a setting that may change; the text is only touched when it did,
/// so that concurrent look-ups merely read.
void RebuildOtherWICExtensions(TZmFileFormatInfo& row) {
    const std::string text = OtherWICExtensions();
    if (row.Extensions != text) {
        row.Extensions = text;
    }
}

bool RowHasExtension(TZmFileFormatInfo& row, const std::string& lower_extension) {
    if (row.FileType == ioOtherWIC) {
        RebuildOtherWICExtensions(row);
    }
    const std::vector<std::string> parts = SplitText(row.Extensions, ';');
    return std::any_of(parts.begin(), parts.end(), [&](const std::string& part) {
        return AsciiLower(part) == lower_extension;
    });
}

std::vector<std::string> ExtensionsOfType(std::int32_t file_type) {
    const TZmFileFormatInfo* row = FindFormatInfo(file_type);
    if (row == nullptr || row->Extensions.empty()) {
        return {};
    }
    return SplitText(row->Extensions, ';');
}

bool BareExtensionIsIn(const std::string& lower_extension, std::string_view wildcards) {
    if (lower_extension.empty()) {
        return false;
    }
    const std::string pattern = "*." + lower_extension;
    const std::vector<std::string> parts = SplitText(wildcards, ';');
    return std::any_of(parts.begin(), parts.end(),
                       [&](const std::string& part) { return AsciiLower(part) == pattern; });
}

struct TSaveExtensions {
    const char* wildcards;
    std::int32_t type;
};

// Required: this chain differs from the registry. WIN is a Targa extension here and PIX is not,
// and XIF is not TIFF; existing jobs name their files by it.
constexpr std::array kSaveExtensionsBeforePdf{
    TSaveExtensions{"*.JPG;*.JPEG;*.JPE;*.JIF;*.JFIF", ioJPEG},
    TSaveExtensions{"*.JP2", ioJP2},
    TSaveExtensions{"*.J2K;*.JPC;*.J2C", ioJ2K},
    TSaveExtensions{"*.PCX", ioPCX},
    TSaveExtensions{"*.DCX", ioDCX},
    TSaveExtensions{"*.GIF", ioGIF},
    TSaveExtensions{"*.TIF;*.TIFF;*.FAX;*.G3F;*.G3N", ioTIFF},
    TSaveExtensions{"*.PNG", ioPNG},
    TSaveExtensions{"*.BMP;*.DIB;*.RLE", ioBMP},
    TSaveExtensions{"*.TGA;*.TARGA;*.VDA;*.ICB;*.VST;*.WIN", ioTGA},
    TSaveExtensions{"*.PXM;*.PBM;*.PGM;*.PPM", ioPXM},
    TSaveExtensions{"*.ICO", ioICO},
    TSaveExtensions{"*.WBMP", ioWBMP},
    TSaveExtensions{"*.PS;*.EPS", ioPS},
};

constexpr const char* kPdfWildcards = "*.PDF;*.PDFA;*.EPDF";

const std::array kSaveExtensionsAfterPdf{
    TSaveExtensions{"*.PSD;*.PSB", ioPSD},
    TSaveExtensions{"*.WDP;*.JXR;*.HDP", ioHDP},
    TSaveExtensions{"*.DDS", ioDDS},
    TSaveExtensions{"*.HEIC;*.HEIF;*.HEICS;*.AVCS;*.HEIFS", ioHEIF},
    TSaveExtensions{"*.WEBP", ioWEBP},
    TSaveExtensions{"*.DCM;*.DIC;*.DICOM;*.V2", ioDICOM},
    TSaveExtensions{"*.ALL", ioALL},
    TSaveExtensions{"*.ZMN;*.ZALMO;*.LYR", ioLYR},
    TSaveExtensions{"*.CUR", ioCUR},
    TSaveExtensions{"*.EMF", ioEMF},
    TSaveExtensions{"*.WMF", ioWMF},
    TSaveExtensions{"*.ZMV", ioZMV},
    TSaveExtensions{"*.SVG", ioSVG},
    TSaveExtensions{kCameraRawWildcards, ioRAW},
};

template <typename Table>
std::int32_t TypeInTable(const Table& table, const std::string& lower_extension) {
    for (const TSaveExtensions& row : table) {
        if (BareExtensionIsIn(lower_extension, row.wildcards)) {
            return row.type;
        }
    }
    return ioUnknown;
}

}  // namespace

bool WICAvailable() {
    return false;
}

void RegisterFileFormat(std::shared_ptr<TZmFileFormatInfo> row) {
    ZmGlobalSettings().fFileFormats.push_back(std::move(row));
}

void UnregisterFileFormat(std::int32_t file_type) {
    auto& rows = ZmGlobalSettings().fFileFormats;
    const auto found = std::find_if(rows.begin(), rows.end(), [file_type](const auto& row) {
        return row->FileType == file_type;
    });
    if (found != rows.end()) {
        rows.erase(found);
    }
}

void RefreshGIFFormatRow() {
    const TZmZalmoGlobalSettings& settings = ZmGlobalSettings();
    TZmFileFormatInfo* row = FindFormatInfo(ioGIF);
    if (row == nullptr) {
        return;
    }
    row->ReadFunction = settings.fDefGIF_LZWDECOMPFUNC != nullptr ? ReadInternalStub : nullptr;
    row->WriteFunction = settings.fDefGIF_LZWCOMPFUNC != nullptr ? WriteInternalStub : nullptr;
}

TZmFileFormatInfo* FindFormatInfo(std::int32_t file_type) {
    if (file_type == ioUnknown) {
        return nullptr;
    }
    for (const auto& row : ZmGlobalSettings().fFileFormats) {
        if (row->FileType == file_type) {
            if (file_type == ioOtherWIC) {
                RebuildOtherWICExtensions(*row);
            }
            return row.get();
        }
    }
    return nullptr;
}

TZmFileFormatInfo* FindFormatInfoByExtension(std::u16string_view extension) {
    const std::string bare = BareExtension(extension);
    if (bare.empty()) {
        return nullptr;
    }
    const std::string platform_types = AsciiUpper(ZmGlobalSettings().fWICFileTypes + ";");
    if (platform_types.find(AsciiUpper("." + bare + ";")) != std::string::npos) {
        return FindFormatInfo(ioOtherWIC);
    }
    for (const auto& row : ZmGlobalSettings().fFileFormats) {
        if (RowHasExtension(*row, bare)) {
            return row.get();
        }
    }
    return nullptr;
}

std::int32_t ExtensionToFileType(std::u16string_view extension) {
    if (const TZmFileFormatInfo* row = FindFormatInfoByExtension(extension); row != nullptr) {
        return row->FileType;
    }
    const std::string bare = BareExtension(extension);
    if (BareExtensionIsIn(bare, "*.MPE;*.MPG;*.MPEG")) {
        return ioMPEG;
    }
    return BareExtensionIsIn(bare, "*.WMV") ? ioWMV : ioUnknown;
}

std::int32_t FileNameToFileType(std::u16string_view file_name) {
    return ExtensionToFileType(FileExtension(file_name));
}

std::int32_t SaveExtensionToFileType(std::u16string_view file_name, bool allow_video) {
    return MatchesExtensionList(file_name, ZmGlobalSettings().fWICFileTypes)
               ? ioOtherWIC
               : BuiltInSaveType(file_name, allow_video);
}

std::int32_t BuiltInSaveType(std::u16string_view file_name, bool allow_video) {
    const std::string bare = BareExtension(FileExtension(file_name));
    if (const std::int32_t type = TypeInTable(kSaveExtensionsBeforePdf, bare); type != ioUnknown) {
        return type;
    }
    if (BareExtensionIsIn(bare, kPdfWildcards)) {
        return FindFormatInfo(ioPDF) != nullptr ? ioPDF : kPluginPdfType;
    }
    if (const std::int32_t type = TypeInTable(kSaveExtensionsAfterPdf, bare); type != ioUnknown) {
        return type;
    }
    return allow_video && BareExtensionIsIn(bare, "*.AVI") ? ioAVI : ioUnknown;
}

std::int32_t FileFormatExtensionCount(std::int32_t file_type) {
    return static_cast<std::int32_t>(ExtensionsOfType(file_type).size());
}

std::string FileFormatExtension(std::int32_t file_type, std::int32_t index) {
    const std::vector<std::string> extensions = ExtensionsOfType(file_type);
    if (index < 0 || static_cast<std::size_t>(index) >= extensions.size()) {
        return {};
    }
    return extensions[static_cast<std::size_t>(index)];
}

std::string FileFormatDefaultExtension(const TZmFileFormatInfo& row) {
    const std::string lower =
        AsciiLower(row.FileType == ioOtherWIC ? OtherWICExtensions() : row.Extensions);
    return lower.substr(0, lower.find(';'));
}

const char* FileTypeName(std::int32_t file_type) {
    static constexpr std::array kNames{"Unknown", "TIFF", "GIF",  "JPEG", "PCX", "BMP", "ICO",
                                       "CUR",     "PNG",  "WMF",  "EMF",  "TGA", "PXM", "JPEG 2000",
                                       "J2K",     "AVI",  "WBMP", "PS",   "PDF"};
    if (file_type < 0 || static_cast<std::size_t>(file_type) >= kNames.size()) {
        return kNames[0];
    }
    return kNames[static_cast<std::size_t>(file_type)];
}

bool MatchesExtensionList(std::u16string_view file_name, std::string_view wildcards) {
    return BareExtensionIsIn(BareExtension(FileExtension(file_name)), wildcards);
}

}  // namespace zm
