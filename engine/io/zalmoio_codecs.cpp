#include <algorithm>

#include "engine/bitmap/zmmask.h"
#include "engine/bitmap/zmxBitmaps.h"
#include "engine/codecs/bmpfilt.h"
#include "engine/codecs/jpegfilt.h"
#include "engine/codecs/pngfilt.h"
#include "engine/codecs/wbmpfilt.h"
#include "engine/io/zalmoio_codecs_p.h"
#include "engine/io/zalmoio_metafile_p.h"
#include "engine/io/zmfiletypes.h"
#include "engine/io/zmioparams.h"
#include "engine/metadata/zmmetahooks.h"

// The codecs by file type, and what each takes from the parameters and from the driver.
namespace zm {

namespace {

void ReadBMP(TZmLoadCall& call) {
    ReadBMPStream(call.stream, call.bitmap, /*byte_limit=*/0,
                  /*ignore_alpha=*/!call.params.fBMP_HandleTransparency, call.alpha,
                  /*no_file_header=*/false, call.params_only, call.progress, call.params);
}

void WriteBMP(TZmSaveCall& call) {
    WriteBMPStream(call.stream, call.bitmap, call.params, call.params.fBMP_HandleTransparency,
                   call.progress);
}

/// The background is the driver's own: it goes into the file's parameters and comes back.
void ReadPNG(TZmLoadCall& call) {
    if (!call.params_only) {
        call.params.fPNG_Background = RGBFromColor(call.background);
    }
    ReadPNGStream(call.stream, call.bitmap, call.params, call.params_only, call.progress);
    if (!call.params_only) {
        call.background = ColorFromRGB(call.params.fPNG_Background);
    }
}

void WritePNG(TZmSaveCall& call) {
    call.params.fPNG_Background = RGBFromColor(call.background);
    WritePNGStreamWithAlpha(call.stream, call.bitmap, call.params, call.progress);
    call.background = ColorFromRGB(call.params.fPNG_Background);
}

void ReadJPEG(TZmLoadCall& call) {
    TJpegReadOptions options;
    options.native_format = call.params.fNativePixelFormat;
    options.params_only = call.params_only;
    ReadJPEGStream(call.stream, call.bitmap, options, call.progress, call.params);
}

void WriteJPEG(TZmSaveCall& call) {
    if (const auto prepare = MetadataHooks().prepare_jpeg_markers; prepare != nullptr) {
        prepare(call.params);
    }
    WriteJPEGStream(call.stream, call.bitmap, call.params, call.progress);
}

void ReadWBMP(TZmLoadCall& call) {
    ReadWBMPStream(call.stream, call.bitmap, call.params, call.params_only, call.progress);
}

void WriteWBMP(TZmSaveCall& call) {
    WriteWBMPStream(call.stream, call.bitmap, call.progress);
}

void ReadMetafileAtItsSize(TZmLoadCall& call) {
    ReadMetafile(call, TMetafileImport{});
}

constexpr TZmPixelFormatSet kAllFormats;

constexpr TZmLoadCodec kLoadCodecs[] = {
    {ioBMP, ReadBMP},
    {ioJPEG, ReadJPEG},
    {ioPNG, ReadPNG},
    {ioWBMP, ReadWBMP},
    {ioWMF, ReadMetafileAtItsSize},
    {ioEMF, ReadMetafileAtItsSize},
};

constexpr TZmSaveCodec kSaveCodecs[] = {
    {ioBMP, kAllFormats, WriteBMP},
    {ioJPEG, kAllFormats, WriteJPEG},
    {ioPNG, kAllFormats, WritePNG},
    {ioWBMP, kAllFormats, WriteWBMP},
};

template <typename TTable>
auto FindRow(const TTable& table, std::int32_t file_type) {
    const auto found = std::find_if(std::begin(table), std::end(table),
                                    [file_type](const auto& row) { return row.type == file_type; });
    return found == std::end(table) ? nullptr : found;
}

}  // namespace

const TZmLoadCodec* FindLoadCodec(std::int32_t file_type) {
    return FindRow(kLoadCodecs, file_type);
}

const TZmSaveCodec* FindInternalSaveCodec(std::int32_t file_type) {
    return FindRow(kSaveCodecs, file_type);
}

}  // namespace zm
