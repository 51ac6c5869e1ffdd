#pragma once

#include <cstdint>

/// File types: plain integers that settings and streams persist. 0 is unknown.
namespace zm {

inline constexpr std::int32_t ioUnknown = 0;
inline constexpr std::int32_t ioTIFF = 1;
inline constexpr std::int32_t ioGIF = 2;
inline constexpr std::int32_t ioJPEG = 3;
inline constexpr std::int32_t ioPCX = 4;
inline constexpr std::int32_t ioBMP = 5;
inline constexpr std::int32_t ioICO = 6;
inline constexpr std::int32_t ioCUR = 7;
inline constexpr std::int32_t ioPNG = 8;
inline constexpr std::int32_t ioWMF = 9;
inline constexpr std::int32_t ioEMF = 10;
inline constexpr std::int32_t ioTGA = 11;
inline constexpr std::int32_t ioPXM = 12;
inline constexpr std::int32_t ioJP2 = 13;
inline constexpr std::int32_t ioJ2K = 14;
inline constexpr std::int32_t ioAVI = 15;  ///< no registry row
inline constexpr std::int32_t ioWBMP = 16;
inline constexpr std::int32_t ioPS = 17;
inline constexpr std::int32_t ioPDF = 18;
inline constexpr std::int32_t ioDCX = 19;
inline constexpr std::int32_t ioRAW = 20;
inline constexpr std::int32_t ioBMPRAW = 21;
inline constexpr std::int32_t ioWMV = 22;   ///< no registry row
inline constexpr std::int32_t ioMPEG = 23;  ///< no registry row
inline constexpr std::int32_t ioPSD = 24;
inline constexpr std::int32_t ioZMV = 25;
inline constexpr std::int32_t ioLYR = 26;
inline constexpr std::int32_t ioALL = 27;
inline constexpr std::int32_t ioDICOM = 28;
inline constexpr std::int32_t ioHDP = 29;
inline constexpr std::int32_t ioSVG = 31;  ///< no format has the value 30
inline constexpr std::int32_t ioDDS = 32;
inline constexpr std::int32_t ioHEIF = 33;
inline constexpr std::int32_t ioWEBP = 34;
inline constexpr std::int32_t ioOtherWIC = 99;

/// Rows of outside plug-ins that the driver honours by number.
inline constexpr std::int32_t kPluginPdfWriteType = 8196;
inline constexpr std::int32_t kPluginSvgType = 8214;
inline constexpr std::int32_t kPluginPdfType = 8222;
inline constexpr std::int32_t kPluginSvgReaderType = 4118;

}  // namespace zm
