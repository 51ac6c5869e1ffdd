#pragma once

#include <cstdint>

#include "engine/io/zalmoio_codecs_p.h"

/// Metafiles as images: they are drawn at their own size, or at the wanted one.
namespace zm {

/// How a metafile becomes pixels.
struct TMetafileImport {
    /// Pixels. Values below 1 follow the other side's enlargement; both below 1: the own size.
    std::int32_t width = 0;
    std::int32_t height = 0;
    /// Whether what is not drawn on becomes transparent instead of white.
    bool with_alpha = false;
};

/// Reads the rest of the stream as a metafile and draws it, in zm24RGB. Both sides are kept within
/// fMaxImageEMFSize and the area within fMaxImageEMFMatrixSize of the settings, proportions kept.
/// Ends in `Aborting` where the system cannot play it, and without memory.
void ReadMetafile(TZmLoadCall& call, const TMetafileImport& import);

}  // namespace zm
