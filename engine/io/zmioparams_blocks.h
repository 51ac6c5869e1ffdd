#pragma once

#include <cstdint>
#include <span>
#include <vector>

namespace zm {

class TIOParams;

/// Parts of the parameters' stream form whose bytes rooms above this one make and read.
enum TZmParamsBlock : std::uint8_t {
    kBlockExif,  ///< a TIFF stream without an image
    kBlockDicomTags,
    kBlockImagingAnnot,
    kBlockZalmoAnnot,
    kBlockInputICC,
    kBlockOutputICC,
    kBlockDefaultICC,
};
inline constexpr int kParamsBlockCount = 7;

/// How a block is made and read. Either may be nil: the block is then written empty, and skipped
/// when read.
struct TZmParamsBlockHook {
    std::vector<std::uint8_t> (*save)(TIOParams& params) = nullptr;
    /// Takes the bytes in, which come from an untrusted stream and may be empty.
    void (*load)(TIOParams& params, std::span<const std::uint8_t> bytes) = nullptr;
};

/// The hook of a block; it is installed during set-up, before any thread uses parameters.
TZmParamsBlockHook& ParamsBlockHook(TZmParamsBlock block);

}  // namespace zm
