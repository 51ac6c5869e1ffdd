#pragma once

#include <cstdint>
#include <functional>
#include <span>
#include <vector>

#include "engine/bitmap/zmpixelformats.h"

namespace zm {

class TIOParams;

/// One row through a colour profile. False when the profile cannot do it: the caller then takes
/// the plain conversion. The rows do not overlap.
using TZmProfileRow =
    std::function<bool(const std::uint8_t* source, std::uint8_t* target, std::int32_t width)>;

/// What the rooms of EXIF blocks and colour profiles do for the codecs. Each may be nil: the codec
/// then leaves that step out. The bytes come from untrusted files; nothing is raised but for want
/// of memory.
struct TZmMetadataHooks {
    /// Fills the EXIF fields, the thumbnail included, from a block without its prefix. False when
    /// the block is none.
    bool (*read_exif)(TIOParams& params, std::span<const std::uint8_t> block) = nullptr;
    /// Makes a file's profile the input profile. False when it is not valid.
    bool (*read_input_profile)(TIOParams& params, std::span<const std::uint8_t> profile) = nullptr;
    /// Makes an input profile of the colour space that fEXIF_InteropIndex names. False when it
    /// names none.
    bool (*make_interop_profile)(TIOParams& params) = nullptr;
    /// Rows of the input profile's colours into those of a bitmap; empty when there is no way.
    TZmProfileRow (*open_profile_rows)(TIOParams& params, TZmPixelFormat source,
                                       TZmPixelFormat target) = nullptr;
    /// The profile that a file of this type is to carry; empty for none.
    std::vector<std::uint8_t> (*output_profile)(TIOParams& params,
                                                std::int32_t file_type) = nullptr;
    /// Brings the marker list up to the fields before a JPEG is saved: IPTC, EXIF and XMP blocks
    /// replace those that the list holds.
    void (*prepare_jpeg_markers)(TIOParams& params) = nullptr;
};

/// The hooks in force; installed during set-up, before any thread uses a codec.
TZmMetadataHooks& MetadataHooks();

}  // namespace zm
