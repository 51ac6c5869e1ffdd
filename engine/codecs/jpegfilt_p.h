#pragma once

#include <cstdio>
// The library's header needs <cstdio> before it.
#include <jpeglib.h>

#include <csetjmp>
#include <cstdint>
#include <span>
#include <string>
#include <vector>

#include "engine/metadata/zmmarkers.h"

#ifndef JCS_EXTENSIONS
#error "A JPEG library with the extended colour spaces (blue first) is needed."
#endif

namespace zm {

class TIOParams;
class TStream;
class TZmBitmap;

/// Messages of the JPEG library have numbers 0 to 124. The numbering is that of the library's
/// 6b line with its cropping extension, so it stays the same whatever library is linked.
inline constexpr std::int32_t kJpegMessageCount = 125;

/// The one error that raises nothing: the application stopped before the last row.
inline constexpr std::int32_t kJpegTooFewRows = 68;

/// Number of a message code of the linked library; codes that the numbering does not know keep
/// their value, which is above kJpegMessageCount - 1.
std::int32_t JpegMessageNumber(int library_code);

/// The library's wording with "?" for each parameter; "Corrupted" for a number outside 0 to 124.
std::string JpegMessageText(std::int32_t number);

/// Error state around the library: fatal errors leave it through the last RunJpegGuarded,
/// warnings are counted. The first member is what the library knows.
struct TJpegErrors {
    jpeg_error_mgr base;
    std::jmp_buf jump;
    int fatal_code = 0;  ///< message code of the library
    std::int32_t warning_total = 0;
    std::int32_t warning_number = 0;  ///< of the last warning, as JpegMessageNumber gives it
    bool input_ended = false;         ///< the source has begun to make up an end marker
};

/// Prepares the state and its callbacks for a new object of the library.
jpeg_error_mgr* InitJpegErrors(TJpegErrors& errors);

/// Raises EZmJpegException with the text of the fatal error; nothing for kJpegTooFewRows.
void RaiseJpegError(const TJpegErrors& errors);

/// Leaves the library with a message code that has no parameters.
[[noreturn]] void LeaveJpegLibrary(j_common_ptr library, int code);

/// Runs library calls; false when one of them met a fatal error. The step may call C++ code, and
/// that may raise, but where the library itself can fail no object with a destructor may be alive
/// inside the step.
template <typename Step>
[[nodiscard]] bool RunJpegGuarded(TJpegErrors& errors, const Step& step) {
    if (setjmp(errors.jump) != 0) {
        return false;
    }
    step();
    return true;
}

/// As RunJpegGuarded, with the failure raised.
template <typename Step>
[[nodiscard]] bool RunJpegOrRaise(TJpegErrors& errors, const Step& step) {
    const bool is_done = RunJpegGuarded(errors, step);
    if (!is_done) {
        RaiseJpegError(errors);
    }
    return is_done;
}

inline constexpr std::int32_t kJpegStreamBufferBytes = 65536;

/// Offset of the first FF D8 FF within the positions at which an image may start, or -1. Leaves the
/// stream anywhere.
std::int32_t FindJpegStart(TStream& stream);

/// Most bytes of a marker behind its length word.
inline constexpr std::size_t kJpegMarkerDataBytes = 65533;

/// What the reader has to know of a file's metadata.
struct TJpegMetadata {
    std::int32_t orientation = 1;    ///< 1 to 8
    bool has_input_profile = false;  ///< rows may go through MetadataHooks().open_profile_rows
};

/// Takes the metadata out of `params.fJPEG_MarkerList` into the other fields: IPTC, EXIF, XMP,
/// profile, in this order. The resolution stands in `params` already.
TJpegMetadata ReadJpegMetadata(TIOParams& params);

/// Turns the image upright and makes fields and EXIF markers say so. False without room.
[[nodiscard]] bool ApplyJpegOrientation(TZmBitmap& bitmap, TIOParams& params,
                                        std::int32_t orientation);

/// The markers of a file to be written: the output profile, then the list without the marker that
/// the library writes by itself.
TZmMarkerList JpegMarkersToWrite(TIOParams& params);

/// Whether a marker holds resource blocks, of which IPTC is one.
bool IsJpegResourceMarker(std::uint8_t type, std::span<const std::uint8_t> data);

/// Whether a marker is a piece of a colour profile.
bool IsJpegProfileMarker(std::uint8_t type, std::span<const std::uint8_t> data);
/// A profile from its pieces, which may stand in any order; empty when one lacks, comes twice or
/// disagrees.
std::vector<std::uint8_t> JoinJpegProfile(const TZmMarkerList& markers);
/// Appends the pieces of a profile; a profile that is too large for 255 pieces is left out.
void CutJpegProfile(std::span<const std::uint8_t> profile, TZmMarkerList& markers);

}  // namespace zm
