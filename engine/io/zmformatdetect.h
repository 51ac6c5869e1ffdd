#pragma once

#include <cstdint>
#include <string>

#include "engine/io/zmfiletypes.h"

/// What type of image a stream or a named file really holds.
namespace zm {

class TStream;

/// How a file's extension and its contents are reconciled.
enum TZmFindFormatMethod : std::uint8_t {
    zmfmContentOnly,
    zmfmContentMatchingExtension,  ///< 0 unless the extension agrees
    zmfmContentElseExtension,      ///< the extension where the contents tell nothing
};

/// Type of the image at the stream's position, by signature tests in a fixed order of which the
/// first that holds decides; 0 when none does. The position is left where it was. Reads a few
/// KiB at most, unless a test that has already recognised its format needs to look further.
std::int32_t FindStreamFormat(TStream& stream);

/// Type of a file. 0 for an empty name or a file that does not exist; a file that cannot be
/// opened raises EFOpenError. Plug-in rows win by their extension whatever the contents are, and
/// camera raw files, which look like TIFF, keep the type of their extension.
std::int32_t FindFileFormat(const std::u16string& file_name, TZmFindFormatMethod method);

}  // namespace zm
