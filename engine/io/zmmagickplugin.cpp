#include "engine/io/zmmagickplugin.h"

#include <algorithm>
#include <array>
#include <cstddef>
#include <cstdint>
#include <memory>
#include <new>
#include <string>
#include <vector>

#include "engine/bitmap/zmrgbrows.h"
#include "engine/bitmap/zmxBitmaps.h"
#include "engine/foundation/zmnumbers.h"
#include "engine/foundation/zmstreams.h"
#include "engine/foundation/zmstrings.h"
#include "engine/io/zmfileformats.h"
#include "engine/io/zmimagelimits.h"
#include "engine/io/zmioparams.h"
#include "engine/platform/module.h"

namespace zm {

namespace {

struct TMagickRow {
    std::int32_t type;
    const char* full_name;
    const char* extensions;  // the first is also the library's name of the format
    bool is_writable;        // kept with the table; registration does not look at it
};

constexpr std::array kMagickRows{
    TMagickRow{8193, "Flexible Image Transport System", "FITS;FTS", true},
    TMagickRow{8194, "Photo CD Image", "PCD;PCDS", true},
    TMagickRow{8195, "Printer Control Language", "PCL", true},
    TMagickRow{8196, "Portable Document Format", "PDF;PDFA;EPDF", true},
    TMagickRow{8197, "Joint Bi-level Image Experts Group Interchange Format", "BIE", true},
    TMagickRow{8198, "Cineon Image File", "CIN", true},
    TMagickRow{8199, "High Dynamic Range File", "EXR", true},
    TMagickRow{8200, "Multi-face Font Package", "DFONT", false},
    TMagickRow{8201, "DPX 2.0 Image", "DPX", true},
    TMagickRow{8202, "Joint Bi-level Image Experts Group Format", "JBIG;JBG", true},
    TMagickRow{8203, "JPEG Network Graphics", "JNG", true},
    TMagickRow{8204, "MPEG Video Stream", "M2V;MOV;MPEG;MPG", true},
    TMagickRow{8205, "MATLAB Level 5 Image Format", "MAT", true},
    TMagickRow{8206, "Magick Image File Format", "MIFF", true},
    TMagickRow{8207, "Multiple-Image Network Graphics", "MNG", true},
    TMagickRow{8208, "MPEG-4 Video", "MP4;M4V", true},
    TMagickRow{8209, "ImageMagick SVG Renderer", "MSVG", true},
    TMagickRow{8210, "Embrid Embroidery Format", "PES", false},
    TMagickRow{8211, "PostScript", "PS;EPS;EPSF;EPSI;EPI;EPT", true},
    TMagickRow{8212, "Continuous Acquisition and Life-cycle Support Image", "CALS", false},
    TMagickRow{8213, "Pyramid Encoded TIFF", "PTIF", true},
    TMagickRow{8214, "Scalable Vector Graphics", "SVG;SVGZ", true},
    TMagickRow{8215, "GIMP image", "XCF", false},
    TMagickRow{8216, "Microsoft XML Paper Specification", "XPS", false},
};

/// Names of the libraries' files: those of Windows in pairs of which the second is found by the
/// first, then those of Linux by version.
constexpr std::array kLibraryNames{
    "CORE_RL_wand_.dll",         "CORE_RL_MagickWand_.dll",       "libMagickWand-6.Q16.so.6",
    "libMagickWand-6.Q16.so.7",  "libMagickWand-6.Q16HDRI.so.6",  "libMagickWand-6.Q16HDRI.so.7",
    "libMagickWand-7.Q16.so.10", "libMagickWand-7.Q16HDRI.so.10",
};
constexpr const char* kCoreLibraryNames[] = {"CORE_RL_magick_.dll", "CORE_RL_MagickCore_.dll"};

/// The libraries' C interface, as far as it is used. Its Booleans are integers; the storage type
/// of one byte a sample is 1.
using TWand = void;
using TMagickBoolean = int;
constexpr int kByteSamples = 1;

struct TMagickLibrary {
    std::unique_ptr<platform::TLibrary> core;
    std::unique_ptr<platform::TLibrary> wand;
    void (*genesis)() = nullptr;
    TWand* (*new_wand)() = nullptr;
    TWand* (*destroy_wand)(TWand* wand) = nullptr;
    TMagickBoolean (*set_format)(TWand* wand, const char* format) = nullptr;
    TMagickBoolean (*set_image_format)(TWand* wand, const char* format) = nullptr;
    TMagickBoolean (*ping_blob)(TWand* wand, const void* blob, std::size_t size) = nullptr;
    TMagickBoolean (*read_blob)(TWand* wand, const void* blob, std::size_t size) = nullptr;
    std::size_t (*image_count)(TWand* wand) = nullptr;
    TMagickBoolean (*set_index)(TWand* wand, std::ptrdiff_t index) = nullptr;
    std::size_t (*width)(TWand* wand) = nullptr;
    std::size_t (*height)(TWand* wand) = nullptr;
    TMagickBoolean (*has_alpha)(TWand* wand) = nullptr;
    TMagickBoolean (*export_pixels)(TWand* wand, std::ptrdiff_t x, std::ptrdiff_t y,
                                    std::size_t columns, std::size_t rows, const char* map,
                                    int storage, void* pixels) = nullptr;
    TMagickBoolean (*constitute)(TWand* wand, std::size_t columns, std::size_t rows,
                                 const char* map, int storage, const void* pixels) = nullptr;
    char* (*image_format)(TWand* wand) = nullptr;
    unsigned char* (*image_blob)(TWand* wand, std::size_t* length) = nullptr;
    void* (*relinquish)(void* memory) = nullptr;
    bool is_ready = false;
};

template <typename TFunction>
bool Bind(platform::TLibrary& library, const char* name, TFunction& function) {
    function = reinterpret_cast<TFunction>(library.FindSymbol(name));
    return function != nullptr;
}

bool BindAll(TMagickLibrary& magick) {
    platform::TLibrary& wand = *magick.wand;
    return Bind(wand, "MagickWandGenesis", magick.genesis) &&
           Bind(wand, "NewMagickWand", magick.new_wand) &&
           Bind(wand, "DestroyMagickWand", magick.destroy_wand) &&
           Bind(wand, "MagickSetFormat", magick.set_format) &&
           Bind(wand, "MagickSetImageFormat", magick.set_image_format) &&
           Bind(wand, "MagickPingImageBlob", magick.ping_blob) &&
           Bind(wand, "MagickReadImageBlob", magick.read_blob) &&
           Bind(wand, "MagickGetNumberImages", magick.image_count) &&
           Bind(wand, "MagickSetIteratorIndex", magick.set_index) &&
           Bind(wand, "MagickGetImageWidth", magick.width) &&
           Bind(wand, "MagickGetImageHeight", magick.height) &&
           Bind(wand, "MagickGetImageAlphaChannel", magick.has_alpha) &&
           Bind(wand, "MagickExportImagePixels", magick.export_pixels) &&
           Bind(wand, "MagickConstituteImage", magick.constitute) &&
           Bind(wand, "MagickGetImageFormat", magick.image_format) &&
           Bind(wand, "MagickGetImageBlob", magick.image_blob) &&
           Bind(wand, "MagickRelinquishMemory", magick.relinquish);
}

TMagickLibrary* LoadMagick() {
    auto magick = std::make_unique<TMagickLibrary>();
    std::string error_text;
    for (const char* name : kCoreLibraryNames) {
        if (magick->core == nullptr) {
            magick->core = platform::LoadInstalledLibrary(name, error_text);
        }
    }
    for (const char* name : kLibraryNames) {
        magick->wand = platform::LoadInstalledLibrary(name, error_text);
        if (magick->wand != nullptr && BindAll(*magick)) {
            magick->genesis();
            magick->is_ready = true;
            break;
        }
    }
    return magick.release();
}

/// Loaded once and kept: the library has clean-up of its own that runs at the process's end.
TMagickLibrary& Magick() {
    static TMagickLibrary* const magick = LoadMagick();
    return *magick;
}

/// The names of a type's format; empty for a type that is not in the table.
std::string ExtensionsOfType(std::int32_t type) {
    for (const TMagickRow& row : kMagickRows) {
        if (row.type == type) {
            return row.extensions;
        }
    }
    return {};
}

/// The library's name of a type's format.
std::string FormatOfType(std::int32_t type) {
    const std::string extensions = ExtensionsOfType(type);
    return extensions.substr(0, extensions.find(';'));
}

class TWandHandle {
public:
    TWandHandle() : wand_(Magick().new_wand()) {}
    ~TWandHandle() {
        if (wand_ != nullptr) {
            Magick().destroy_wand(wand_);
        }
    }
    TWandHandle(const TWandHandle&) = delete;
    TWandHandle& operator=(const TWandHandle&) = delete;
    TWand* Get() const { return wand_; }

private:
    TWand* wand_;
};

/// The bytes from the stream's position to its end.
std::vector<std::uint8_t> RestOf(TStream& stream) {
    constexpr std::int32_t kPieceBytes = 1 << 16;
    std::vector<std::uint8_t> bytes;
    for (;;) {
        const std::size_t filled = bytes.size();
        bytes.resize(filled + kPieceBytes);
        const std::int32_t got = stream.Read(bytes.data() + filled, kPieceBytes);
        bytes.resize(filled + static_cast<std::size_t>(std::max(got, 0)));
        if (got < 1) {
            return bytes;
        }
    }
}

/// Header, size check, image: the library allocates nothing for pixels before the check.
bool PingImage(TWand* wand, const std::vector<std::uint8_t>& bytes, const std::string& format,
               TIOParams& params) {
    const TMagickLibrary& magick = Magick();
    if (wand == nullptr) {
        return false;
    }
    magick.set_format(wand, format.c_str());
    if (magick.ping_blob(wand, bytes.data(), bytes.size()) == 0) {
        return false;
    }
    const auto count = static_cast<std::int64_t>(magick.image_count(wand));
    params.SetImageCount(SaturateToInt32(count));
    const std::int64_t index =
        std::clamp<std::int64_t>(params.GetImageIndex(), 0, std::max<std::int64_t>(count, 1) - 1);
    if (magick.set_index(wand, static_cast<std::ptrdiff_t>(index)) == 0) {
        return false;
    }
    constexpr std::int32_t kBitsPerPixel = 32;
    const auto width = static_cast<std::int64_t>(magick.width(wand));
    const auto height = static_cast<std::int64_t>(magick.height(wand));
    if (!ImageSizeIsAcceptable(width, height, kBitsPerPixel,
                               static_cast<std::int64_t>(bytes.size()))) {
        return false;
    }
    params.fWidth = params.fOriginalWidth = static_cast<std::int32_t>(width);
    params.fHeight = params.fOriginalHeight = static_cast<std::int32_t>(height);
    params.fBitsPerSample = 8;
    params.fSamplesPerPixel = 3;
    params.FreeColorMap();
    return true;
}

bool CopyRows(TWand* wand, TZmBitmap& bitmap, const char* map, TProgressRec* progress) {
    const auto width = static_cast<std::size_t>(bitmap.GetWidth());
    for (std::int32_t y = 0; y < bitmap.GetHeight(); ++y) {
        std::uint8_t* row = bitmap.GetScanLine(y);
        if (row == nullptr ||
            Magick().export_pixels(wand, 0, y, width, 1, map, kByteSamples, row) == 0) {
            return false;
        }
        if (progress != nullptr && !StepProgress(*progress, y + 1)) {
            return false;
        }
    }
    return true;
}

bool ReadImage(const std::vector<std::uint8_t>& bytes, const std::string& format, TZmBitmap& bitmap,
               TIOParams& params, TProgressRec& progress) {
    const TMagickLibrary& magick = Magick();
    const TWandHandle wand;
    if (wand.Get() == nullptr) {
        return false;
    }
    magick.set_format(wand.Get(), format.c_str());
    if (magick.read_blob(wand.Get(), bytes.data(), bytes.size()) == 0) {
        return false;
    }
    const auto count = static_cast<std::ptrdiff_t>(magick.image_count(wand.Get()));
    const auto index = std::clamp<std::ptrdiff_t>(params.GetImageIndex(), 0,
                                                  std::max<std::ptrdiff_t>(count, 1) - 1);
    magick.set_index(wand.Get(), index);
    // What was read need not have the size that the header told.
    const auto width = static_cast<std::int64_t>(magick.width(wand.Get()));
    const auto height = static_cast<std::int64_t>(magick.height(wand.Get()));
    if (width > kMaxInt32 || height > kMaxInt32 ||
        !bitmap.Allocate(static_cast<std::int32_t>(width), static_cast<std::int32_t>(height),
                         zm24RGB)) {
        return false;
    }
    params.fWidth = bitmap.GetWidth();
    params.fHeight = bitmap.GetHeight();
    progress.val = 0;
    progress.per1 = 100.0 / bitmap.GetHeight();
    if (!CopyRows(wand.Get(), bitmap, "BGR", &progress)) {
        return false;
    }
    if (magick.has_alpha(wand.Get()) != 0) {
        TZmBitmap* plane = bitmap.GetAlphaChannel();
        if (plane == nullptr || !CopyRows(wand.Get(), *plane, "A", nullptr)) {
            return false;
        }
        plane->SyncFull();
    }
    return true;
}

void ReadThroughMagick(TStream& stream, TZmBitmap& bitmap, TIOParams& params,
                       TProgressRec& progress, bool preview) {
    const std::string format = FormatOfType(params.fFileType);
    const std::vector<std::uint8_t> bytes = RestOf(stream);
    bool is_read = !format.empty() && !bytes.empty();
    if (is_read) {
        const TWandHandle wand;
        is_read = PingImage(wand.Get(), bytes, format, params);
    }
    if (is_read && !preview) {
        is_read = ReadImage(bytes, format, bitmap, params, progress);
    }
    if (!is_read) {
        *progress.Aborting = true;
    }
}

/// The image as one block of blue, green and red bytes; empty without room.
std::vector<TRGB> PixelsOf(TZmBitmap& bitmap) {
    const std::int64_t count = std::int64_t{bitmap.GetWidth()} * bitmap.GetHeight();
    if (!FitsAddressSpace(count * static_cast<std::int64_t>(sizeof(TRGB)))) {
        return {};
    }
    std::vector<TRGB> pixels;
    pixels.reserve(static_cast<std::size_t>(count));
    TZmRgbRows rows(bitmap);
    for (std::int32_t y = 0; y < bitmap.GetHeight(); ++y) {
        const TRGB* row = rows.GetRow(y);
        if (row == nullptr) {
            return {};
        }
        pixels.insert(pixels.end(), row, row + bitmap.GetWidth());
    }
    return pixels;
}

bool WriteImage(TStream& stream, TZmBitmap& bitmap, const std::string& format) {
    const TMagickLibrary& magick = Magick();
    const std::vector<TRGB> pixels = PixelsOf(bitmap);
    const TWandHandle wand;
    if (pixels.empty() || format.empty() || wand.Get() == nullptr) {
        return false;
    }
    const auto width = static_cast<std::size_t>(bitmap.GetWidth());
    const auto height = static_cast<std::size_t>(bitmap.GetHeight());
    if (magick.constitute(wand.Get(), width, height, "BGR", kByteSamples, pixels.data()) == 0 ||
        magick.set_image_format(wand.Get(), format.c_str()) == 0) {
        return false;
    }
    std::size_t length = 0;
    const std::unique_ptr<unsigned char, void* (*)(void*)> blob(
        magick.image_blob(wand.Get(), &length), magick.relinquish);
    if (blob == nullptr || length == 0) {
        return false;
    }
    stream.WriteBuffer(blob.get(), length);
    return true;
}

void WriteThroughMagick(TStream& stream, TZmBitmap& bitmap, TIOParams& params,
                        TProgressRec& progress) {
    if (!WriteImage(stream, bitmap, FormatOfType(params.fFileType))) {
        *progress.Aborting = true;
    }
}

/// The library goes by the contents before it goes by the name that it is given: what it found
/// must be the type asked for.
bool IsOfType(TStream& stream, std::int32_t file_type) {
    const std::vector<std::uint8_t> bytes = RestOf(stream);
    const TWandHandle wand;
    TIOParams params;
    if (bytes.empty() || !PingImage(wand.Get(), bytes, FormatOfType(file_type), params)) {
        return false;
    }
    const std::unique_ptr<char, void* (*)(void*)> found(Magick().image_format(wand.Get()),
                                                        Magick().relinquish);
    const std::vector<std::string> names = SplitText(ExtensionsOfType(file_type), ';');
    return found != nullptr && std::find(names.begin(), names.end(), found.get()) != names.end();
}

/// A file without room in memory is of no type: finding a type raises nothing.
bool TryThroughMagick(TStream& stream, std::int32_t file_type) {
    try {
        return IsOfType(stream, file_type);
    } catch (const std::bad_alloc&) {
        return false;
    }
}

std::shared_ptr<TZmFileFormatInfo> MakeRow(const TMagickRow& source) {
    auto row = std::make_shared<TZmFileFormatInfo>();
    row->FileType = source.type;
    row->FullName = source.full_name;
    row->Extensions = source.extensions;
    row->ReadFunction = ReadThroughMagick;
    row->WriteFunction = WriteThroughMagick;
    row->TryFunction = TryThroughMagick;
    return row;
}

}  // namespace

bool TZmMiscPluginsImageMagick::IsAvailable() {
    return Magick().is_ready;
}

bool TZmMiscPluginsImageMagick::RegisterPlugin() {
    if (!IsAvailable()) {
        return false;
    }
    for (const TMagickRow& source : kMagickRows) {
        const bool is_taken =
            source.type == kPluginPdfWriteType && FindFormatInfo(kPluginPdfType) != nullptr;
        if (!is_taken) {
            RegisterFileFormat(MakeRow(source));
        }
    }
    UnregisterFileFormat(ioPDF);
    UnregisterFileFormat(ioPS);
    return true;
}

}  // namespace zm
