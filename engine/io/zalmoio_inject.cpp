#include <functional>
#include <memory>
#include <vector>

#include "engine/bitmap/zmxBitmaps.h"
#include "engine/codecs/jpegfilt.h"
#include "engine/foundation/zmstreams.h"
#include "engine/io/zalmoio.h"
#include "engine/metadata/zmmetahooks.h"
#include "engine/proc/zmresample.h"

// Metadata put into files that stay as they are otherwise, and thumbnails made for them.
namespace zm {

namespace {

std::vector<std::uint8_t> IptcBlock(TIOParams& params) {
    return params.fIPTC_Info.SaveToStandardBuffer(/*with_resource_header=*/true);
}

/// The block of the marker list, which is brought up to the fields first.
std::vector<std::uint8_t> ExifBlock(TIOParams& params) {
    if (const auto prepare = MetadataHooks().prepare_jpeg_markers; prepare != nullptr) {
        prepare(params);
    }
    const TZmMarkerList& markers = params.fJPEG_MarkerList;
    for (std::int32_t i = 0; i < markers.Count(); ++i) {
        const auto data = markers.GetMarkerData(i);
        if (markers.GetMarkerType(i) == kMarkerApp1 && IsExifMarkerData(data)) {
            return {data.begin(), data.end()};
        }
    }
    return {};
}

using TExchange = std::function<bool(TStream& input, TStream& output)>;

bool ExchangeInFile(const std::u16string& file_name, const TExchange& exchange) {
    auto input = std::make_unique<TFileStream>(file_name, fmOpenRead);
    TZmSaveFileStream output(file_name);
    const bool is_copied = exchange(*input, output);
    input.reset();  // an open file cannot be replaced everywhere
    return is_copied && output.Commit();
}

}  // namespace

bool TZalmoIO::InjectJpegIPTC(const std::u16string& file_name) {
    fAborting = true;  // stands when the file cannot be opened
    return RunOrFail([&] {
        fAborting = !ExchangeInFile(file_name, [this](TStream& input, TStream& output) {
            return InjectJpegIPTCStream(input, output);
        });
        return !fAborting;
    });
}

bool TZalmoIO::InjectJpegIPTCStream(TStream& input, TStream& output) {
    fAborting = true;
    return RunOrFail([&] {
        fAborting = !ExchangeJpegBlock(input, output, kJpegBlockIptc, IptcBlock(*GetParams()));
        return !fAborting;
    });
}

bool TZalmoIO::InjectJpegEXIF(const std::u16string& file_name) {
    fAborting = true;
    return RunOrFail([&] {
        fAborting = !ExchangeInFile(file_name, [this](TStream& input, TStream& output) {
            return InjectJpegEXIFStream(input, output);
        });
        return !fAborting;
    });
}

bool TZalmoIO::InjectJpegEXIFStream(TStream& input, TStream& output) {
    fAborting = true;
    return RunOrFail([&] {
        fAborting = !ExchangeJpegBlock(input, output, kJpegBlockExif, ExifBlock(*GetParams()));
        return !fAborting;
    });
}

bool TIOParams::UpdateEXIFThumbnail(std::int32_t Width, std::int32_t Height,
                                    TResampleFilter ResampleFilter) {
    TZmBitmap* const source = AttachedBitmap();
    if (source == nullptr || source->IsEmpty() || Width < 1 || Height < 1) {
        return false;
    }
    // Thumbnails are JPEG images: they have the colours of one and no alpha.
    TZmBitmap colors;
    colors.AssignImage(source);
    colors.RemoveAlphaChannel(/*merge=*/false, /*background=*/0);
    auto thumbnail = std::make_unique<TZmBitmap>();
    if (colors.IsEmpty() || !colors.SetPixelFormat(zm24RGB) ||
        !thumbnail->Allocate(Width, Height, zm24RGB) ||
        !ResampleBitmapInto(colors, *thumbnail, ResampleFilter, nullptr, {})) {
        return false;
    }
    fEXIF_Bitmap = std::move(thumbnail);
    return true;
}

}  // namespace zm
