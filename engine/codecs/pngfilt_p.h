#pragma once

#include <png.h>

#include <csetjmp>
#include <cstddef>
#include <cstdint>

namespace zm {

class TStream;

/// What the library's callbacks share with the codec around them. The callbacks let no C++
/// exception into the library's frames: an exception of the stream is remembered here and ends
/// the library's work like any other error.
struct TPngSession {
    TStream* stream = nullptr;
    bool ran_short = false;      ///< the stream ended before the library had all it asked for
    bool stream_raised = false;  ///< the stream raised an exception
    /// While set, kept chunks may take `chunk_bytes_left` more bytes of memory.
    bool limits_chunk_memory = false;
    std::int64_t chunk_bytes_left = 0;
};

/// Error and warning callbacks. Errors leave the library through the last RunPngGuarded.
[[noreturn]] void PNGCBAPI LeavePngLibrary(png_structp png, png_const_charp message);
void PNGCBAPI IgnorePngWarning(png_structp png, png_const_charp message);

/// Memory callbacks; they count what kept chunks take.
png_voidp PNGCBAPI AllocatePngMemory(png_structp png, png_alloc_size_t size);
void PNGCBAPI FreePngMemory(png_structp png, png_voidp block);

/// Runs library calls; false when one of them failed. The step may call C++ code, and that may
/// raise, but where the library itself can fail no object with a destructor may be alive inside
/// the step.
template <typename Step>
[[nodiscard]] bool RunPngGuarded(png_structp png, const Step& step) {
    if (setjmp(png_jmpbuf(png)) != 0) {
        return false;
    }
    step();
    return true;
}

/// No side of an image is limited by the library: the codec has its own limit.
inline constexpr png_uint_32 kPngMaxSide = 0x7FFFFFFF;

inline constexpr std::int32_t kPngStreamBufferBytes = 65536;

}  // namespace zm
