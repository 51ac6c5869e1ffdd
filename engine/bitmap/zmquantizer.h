#pragma once

#include <cstddef>
#include <cstdint>
#include <memory>
#include <vector>

#include "engine/foundation/zmdefs.h"

namespace zm {

class TZmBitmap;

/// Finds a palette of up to NCol colours for one bitmap and then answers which entry belongs to
/// a colour. Declared here for the conversions and the codecs; the methods (a self-organising
/// network, and a variance-based split of a 32-level colour cube) live with the processing.
///
/// A zm24RGB image with few colours keeps them exactly; a grey image gets an even ramp; a zm8p
/// image keeps its own palette. Which method serves the others, and how thoroughly, follows
/// fColorReductionAlgorithm and fColorReductionQuality of the settings.
///
/// Not thread-safe: GetRGBIndex remembers its answers.
class TZmQuantizer {
public:
    /// Fills `color_map` (resized to `color_count` entries, limited to 1 to 1024; entries not in
    /// use are black; who writes a palette to a file asks for 256 at most). The bitmap is only
    /// read, and only here.
    TZmQuantizer(TZmBitmap& source, std::vector<TRGB>& color_map, std::int32_t color_count);
    ~TZmQuantizer();
    TZmQuantizer(const TZmQuantizer&) = delete;
    TZmQuantizer& operator=(const TZmQuantizer&) = delete;
    /// Palette index of a colour: with exact colours the nearest of them, on a grey image
    /// Trunc(red * NCol / 256), with a zm8p image the first entry of that very colour or else
    /// the size of its palette, which is no index.
    std::int32_t GetRGBIndex(TRGB color);
    /// GetRGBIndex of `count` colours in a row, in a fraction of the time.
    void GetRGBIndexes(const TRGB* colors, std::size_t count, std::uint16_t* indexes);
    /// Entries in use.
    std::int32_t GetFoundColors() const;
    /// The bitmap was grey.
    bool GetGrayScale() const;

private:
    struct TState;
    std::unique_ptr<TState> fState;
};

/// Reduces an image to two colours: `bits` becomes a zm1g copy, `dark` and `light` the two
/// colours that its clear and set bits stand for; dark is the one of the smaller grey value. An
/// image of a single colour gets black or white beside it. False, and `bits` empty, when the
/// image is empty or has more than two colours; the caller then converts by threshold.
bool ReduceToTwoColors(TZmBitmap& source, TZmBitmap& bits, TRGB& dark, TRGB& light);

}  // namespace zm
