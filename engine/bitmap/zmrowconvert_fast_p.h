#pragma once

#include <cstdint>

#include "engine/bitmap/zmrowconvert.h"

/// Fast twins of plain row loops, chosen for the processor at hand. Each gives the same bytes as
/// its plain one and touches the same bytes, whatever the width and the addresses.
namespace zm {

/// The twin of FindPlainRowFunction(from, to), or nil when there is none or the processor has
/// none of the instructions that it needs.
TZmRowFunction FindFastRowFunction(TZmPixelFormat from, TZmPixelFormat to);

/// The twin of a row function that stores past the caches, for rows of large targets whose lines
/// need not be read first; the caller ends with hwy::FlushStream. Nil when there is none: a row
/// function with a move of the row that it made is then as good.
TZmRowFunction FindStreamingRowFunction(TZmPixelFormat from, TZmPixelFormat to);

/// Sets bit x where `gray[x]` is above `levels[x % 8]`, and clears it elsewhere; runs over whole
/// bytes of eight pixels and returns how many pixels that were (a multiple of 8, at most
/// `width`).
using TZmBitsAboveFunction = std::int32_t (*)(const std::uint8_t* gray, std::uint8_t* dest,
                                              std::int32_t width, const std::uint8_t* levels);

/// The function for the processor at hand, or nil.
TZmBitsAboveFunction FindFastBitsAbove();

/// Palette to colours, four bytes at a time; plain code that any processor runs.
void Row8pTo24Fast(const std::uint8_t* source, std::uint8_t* dest, std::int32_t width,
                   const TZmRowContext& context);

}  // namespace zm
