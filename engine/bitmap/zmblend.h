#pragma once

#include <cstdint>

#include "engine/foundation/zmdefs.h"

/// The ways in which a source pixel combines with a destination pixel before the two are mixed by
/// their alpha. The renderer and the readers of layered files name them.
namespace zm {

/// Render operations; the ordinal is passed as a byte and kept in files, so the order is fixed.
/// A is the source's channel, B the destination's.
enum TZmRenderOperation : std::uint8_t {
    zmlNormal,  ///< A
    zmlAdd,     ///< A + B, limited
    zmlSub,     ///< distance of A and B
    zmlDiv,     ///< B / A
    zmlMul,     ///< A * B / 256
    zmlOR,
    zmlAND,
    zmlXOR,
    zmlMAX,
    zmlMIN,
    zmlAverage,
    zmlScreen,
    zmlNegation,
    zmlExclusion,
    zmlOverlay,    ///< multiplies dark, screens light destinations
    zmlHardLight,  ///< multiplies dark, screens light sources
    zmlSoftLight,
    zmlXFader,
    zmlColorEdge,
    zmlColorBurn,
    zmlInverseColorDodge,
    zmlInverseColorBurn,
    zmlSoftDodge,
    zmlSoftBurn,
    zmlReflect,
    zmlGlow,
    zmlFreeze,
    zmlEat,
    zmlSubtractive,
    zmlInterpolation,
    zmlStamp,
    zmlRed,  ///< that channel of the source, the others stay
    zmlGreen,
    zmlBlue,
    zmlHue,  ///< that part of the source, the rest of the destination
    zmlSaturation,
    zmlColor,
    zmlLuminosity,
    zmlStereoBW,
    zmlStereoColor,
    zmlStereoColorDubois,
    zmlStereoEven,   ///< the source on even rows
    zmlStereoOdd,    ///< the source on odd rows
    zmlLuminosity2,  ///< luminance by YCbCr
};
inline constexpr int kRenderOperationCount = 44;

/// Replaces `dest` by the result of an operation on `source` and `dest`. `operation` is the
/// ordinal; from 44 on nothing happens. `row` is the low byte of the row number, which the stereo
/// operations ask for. Integer divisions truncate; what is not limited to 0 to 255 keeps its low
/// byte. zmlStereoBW takes the grey weights of the global settings.
///
/// Any thread.
void ZmBlendPixel(TRGB source, TRGB& dest, std::uint8_t operation, std::uint8_t row);

}  // namespace zm
