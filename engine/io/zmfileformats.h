#pragma once

#include <cstdint>
#include <memory>
#include <string>
#include <string_view>

#include "engine/foundation/zmdefs.h"
#include "engine/io/zmfiletypes.h"
#include "engine/io/zmprogress.h"

/// The format registry: one table of the file types that exist, and the look-ups over it.
///
/// The rows live in ZmGlobalSettings().fFileFormats, filled before the settings are first used.
/// There is no lock: rows are registered during set-up, before any thread loads.
namespace zm {

class TIOParams;
class TStream;
class TZmBitmap;

/// Page of the saving-parameters dialog; ordinals are bits of TPreviewParams.
enum TPreviewParam : std::uint8_t {
    ppALL,
    ppAUTO,
    ppJPEG,
    ppTIFF,
    ppGIF,
    ppBMP,
    ppPCX,
    ppPNG,
    ppTGA,
    ppJ2000,
};

/// A set of pages.
class TPreviewParams {
public:
    constexpr TPreviewParams() = default;
    template <typename... Pages>
    constexpr explicit TPreviewParams(Pages... pages) : bits_(((1u << pages) | ... | 0u)) {}
    constexpr bool Contains(TPreviewParam page) const { return (bits_ >> page & 1u) != 0; }
    constexpr std::uint32_t Bits() const { return bits_; }

private:
    std::uint32_t bits_ = 0;
};

/// Reads an image; with `preview` only the parameters are filled. Failure: `*progress.Aborting`.
using TZmReadImageStream = void (*)(TStream& stream, TZmBitmap& bitmap, TIOParams& params,
                                    TProgressRec& progress, bool preview);
using TZmWriteImageStream = void (*)(TStream& stream, TZmBitmap& bitmap, TIOParams& params,
                                     TProgressRec& progress);
/// Whether the stream holds an image of the type. It may move the stream.
using TZmTryImageStream = bool (*)(TStream& stream, std::int32_t file_type);

/// A row of the registry.
struct TZmFileFormatInfo {
    std::int32_t FileType = ioUnknown;
    std::string FullName;    ///< for dialog filters
    std::string Extensions;  ///< upper case, no dots, joined by ";"; the first is the default
    /// Compiled in: the driver dispatches by type, and the function pointers only tell by being
    /// non-nil what the type can do.
    bool InternalFormat = false;
    TPreviewParams DialogPage;
    TZmReadImageStream ReadFunction = nullptr;    ///< nil: cannot be read
    TZmWriteImageStream WriteFunction = nullptr;  ///< nil: cannot be written
    TZmTryImageStream TryFunction = nullptr;      ///< nil: no test of the contents
};

/// Extensions of the camera raw formats as a wildcard list ("*.CRW;*.CR2;...").
extern const char* const kCameraRawWildcards;

/// Whether the platform's imaging component can decode for us. The engine binds none, so the
/// rows that need it are absent.
bool WICAvailable();

/// Appends a row.
void RegisterFileFormat(std::shared_ptr<TZmFileFormatInfo> row);
/// Removes the first row of the type; an unknown type does nothing.
void UnregisterFileFormat(std::int32_t file_type);
/// Sets the GIF row's pointers by whether its LZW coders are installed in the settings.
void RefreshGIFFormatRow();

/// First row of the type; nil for 0 or an unknown type. Valid until the row is unregistered.
TZmFileFormatInfo* FindFormatInfo(std::int32_t file_type);
/// First row that has the extension (with or without its dot, any case). Extensions listed in
/// the settings' fWICFileTypes belong to ioOtherWIC before all others. Nil when there is none;
/// an empty extension has none.
TZmFileFormatInfo* FindFormatInfoByExtension(std::u16string_view extension);
/// Type of an extension, video types included; 0 when unknown.
std::int32_t ExtensionToFileType(std::u16string_view extension);
std::int32_t FileNameToFileType(std::u16string_view file_name);
/// Type that a save under this name takes: a chain of its own, which differs from the registry.
/// ioAVI only with `allow_video`. 0 when unknown.
std::int32_t SaveExtensionToFileType(std::u16string_view file_name, bool allow_video = false);
/// The same without the types that the settings give to the platform's imaging component.
std::int32_t BuiltInSaveType(std::u16string_view file_name, bool allow_video = false);

std::int32_t FileFormatExtensionCount(std::int32_t file_type);
/// Extension by index, upper case; empty outside.
std::string FileFormatExtension(std::int32_t file_type, std::int32_t index);
/// Default extension of a row, lower case, without dot.
std::string FileFormatDefaultExtension(const TZmFileFormatInfo& row);
/// Short name of a type ("JPEG"), for lists; "Unknown" outside 0 to 18.
const char* FileTypeName(std::int32_t file_type);

/// Whether the extension of a file name is in a wildcard list ("*.TIF;*.TIFF"), in any case.
bool MatchesExtensionList(std::u16string_view file_name, std::string_view wildcards);

}  // namespace zm
