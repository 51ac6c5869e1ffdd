// JPEG writer: an adapter around the JPEG library. Rows go to it one by one, brought into the
// library's input colours on the way; alpha is left out without blending.

#include <algorithm>
#include <array>
#include <cstdint>
#include <memory>
#include <vector>

#include "engine/bitmap/zmrgbrows.h"
#include "engine/bitmap/zmrowconvert.h"
#include "engine/bitmap/zmxBitmaps.h"
#include "engine/codecs/jpegfilt.h"
#include "engine/codecs/jpegfilt_p.h"
#include "engine/foundation/zmassert.h"
#include "engine/foundation/zmsettings.h"
#include "engine/foundation/zmstreams.h"
#include "engine/io/zmioparams.h"

#include <jerror.h>

namespace zm {

namespace {

constexpr std::int32_t kMaxDensity = 65535;

/// The library's destination over a stream.
struct TJpegDestination {
    jpeg_destination_mgr base;
    TStream* stream;
    bool has_failed;
    std::array<JOCTET, kJpegStreamBufferBytes> buffer;
};

TJpegDestination& DestinationOf(j_compress_ptr encoder) {
    return *reinterpret_cast<TJpegDestination*>(encoder->dest);
}

void EmptyBuffer(TJpegDestination& destination) {
    destination.base.next_output_byte = destination.buffer.data();
    destination.base.free_in_buffer = destination.buffer.size();
}

/// Hands bytes to the stream; an exception of the stream counts as a failed write.
void WriteOut(j_compress_ptr encoder, std::size_t count) {
    TJpegDestination& destination = DestinationOf(encoder);
    const auto wanted = static_cast<std::int32_t>(count);
    try {
        destination.has_failed =
            wanted > 0 && destination.stream->Write(destination.buffer.data(), wanted) != wanted;
    } catch (...) {
        destination.has_failed = true;
    }
    if (destination.has_failed) {
        LeaveJpegLibrary(reinterpret_cast<j_common_ptr>(encoder), JERR_FILE_WRITE);
    }
    EmptyBuffer(destination);
}

void InitDestination(j_compress_ptr encoder) {
    EmptyBuffer(DestinationOf(encoder));
}

boolean EmptyOutputBuffer(j_compress_ptr encoder) {
    WriteOut(encoder, DestinationOf(encoder).buffer.size());
    return TRUE;
}

void EndDestination(j_compress_ptr encoder) {
    const TJpegDestination& destination = DestinationOf(encoder);
    WriteOut(encoder, destination.buffer.size() - destination.base.free_in_buffer);
}

J_DCT_METHOD DctMethod(TIOJPEGDctMethod method) {
    return method == ioJPEG_IFAST ? JDCT_IFAST : method == ioJPEG_FLOAT ? JDCT_FLOAT : JDCT_ISLOW;
}

UINT16 Density(std::int32_t dpi, std::int32_t default_dpi) {
    return static_cast<UINT16>(std::clamp(dpi < 1 ? default_dpi : dpi, 1, kMaxDensity));
}

/// What the library gets and what it makes of it, by the wanted colour space.
struct TColorPlan {
    J_COLOR_SPACE file;
    J_COLOR_SPACE input;
    int input_components;
    TZmPixelFormat row_format;
};

TColorPlan PlanFor(TIOJPEGColorspace color_space) {
    switch (color_space) {
        case ioJPEG_GRAYLEV: return {JCS_GRAYSCALE, JCS_GRAYSCALE, 1, zm8g};
        case ioJPEG_YCbCr: return {JCS_YCbCr, JCS_EXT_BGR, 3, zm24RGB};
        case ioJPEG_CMYK: return {JCS_CMYK, JCS_CMYK, 4, zmCMYK};
        case ioJPEG_YCbCrK: return {JCS_YCCK, JCS_CMYK, 4, zmCMYK};
        default: return {JCS_RGB, JCS_EXT_BGR, 3, zm24RGB};
    }
}

class TJpegWriter {
public:
    TJpegWriter(TStream& stream, TZmBitmap& bitmap, TIOParams& params, TProgressRec& progress);
    ~TJpegWriter() { jpeg_destroy_compress(&encoder_); }
    TJpegWriter(const TJpegWriter&) = delete;
    TJpegWriter& operator=(const TJpegWriter&) = delete;

    /// Raises EZmJpegException on errors of the library that are not the stream's.
    [[nodiscard]] bool Write();

private:
    void PrepareRows();
    void SetUp();
    void SetSubsampling();
    void WriteMarkers();
    void LoopOverRows();
    const std::uint8_t* MakeRow(std::int32_t row);
    void RunLibrary();

    jpeg_compress_struct encoder_ = {};
    TJpegErrors errors_ = {};
    std::unique_ptr<TJpegDestination> destination_;
    TZmBitmap& bitmap_;
    const TIOParams& params_;
    const TZmMarkerList markers_;
    TProgressRec& progress_;
    TColorPlan plan_;
    TZmRgbRows rgb_rows_;
    TZmRowContext context_;
    TZmRowFunction convert_ = nullptr;  // from RGB rows; nil when they serve as they are
    bool takes_rows_as_they_are_ = false;
    std::vector<std::uint8_t> row_;
    bool rows_done_ = false;
};

TJpegWriter::TJpegWriter(TStream& stream, TZmBitmap& bitmap, TIOParams& params,
                         TProgressRec& progress)
    : destination_(std::make_unique<TJpegDestination>()),
      bitmap_(bitmap),
      params_(params),
      markers_(JpegMarkersToWrite(params)),
      progress_(progress),
      plan_(PlanFor(params.fJPEG_ColorSpace)),
      rgb_rows_(bitmap),
      context_(MakeRowContext(nullptr)) {
    encoder_.err = InitJpegErrors(errors_);
    destination_->base.init_destination = InitDestination;
    destination_->base.empty_output_buffer = EmptyOutputBuffer;
    destination_->base.term_destination = EndDestination;
    destination_->stream = &stream;
}

void TJpegWriter::PrepareRows() {
    // Required: inks are made from the colours even where the image has inks of its own, so that
    // a file is the same whatever format the picture came in.
    takes_rows_as_they_are_ =
        plan_.row_format != zmCMYK && bitmap_.GetPixelFormat() == plan_.row_format;
    if (takes_rows_as_they_are_ || plan_.row_format == zm24RGB) {
        return;
    }
    convert_ = FindRowFunction(zm24RGB, plan_.row_format);
    ZM_ASSERT(convert_ != nullptr);
    row_.resize(static_cast<std::size_t>(bitmap_.GetWidth()) *
                static_cast<std::size_t>(plan_.input_components));
}

void TJpegWriter::SetUp() {
    jpeg_create_compress(&encoder_);
    encoder_.dest = &destination_->base;
    encoder_.image_width = static_cast<JDIMENSION>(bitmap_.GetWidth());
    encoder_.image_height = static_cast<JDIMENSION>(bitmap_.GetHeight());
    encoder_.input_components = plan_.input_components;
    encoder_.in_color_space = plan_.input;
    jpeg_set_defaults(&encoder_);
    jpeg_set_colorspace(&encoder_, plan_.file);
    const TZmZalmoGlobalSettings& settings = ZmGlobalSettings();
    encoder_.density_unit = 1;
    encoder_.X_density = Density(params_.GetDpiX(), settings.fDefaultDPIX);
    encoder_.Y_density = Density(params_.GetDpiY(), settings.fDefaultDPIY);
    encoder_.dct_method = DctMethod(params_.fJPEG_DCTMethod);
    encoder_.optimize_coding = params_.fJPEG_OptimalHuffman ? TRUE : FALSE;
    encoder_.smoothing_factor = std::clamp(params_.fJPEG_Smooth, 0, 100);
    jpeg_set_quality(&encoder_, params_.fJPEG_Quality, TRUE);
    if (plan_.file == JCS_YCbCr) {
        SetSubsampling();
    }
    if (plan_.file == JCS_CMYK) {
        encoder_.write_Adobe_marker = TRUE;
    }
    if (params_.fJPEG_Progressive) {
        jpeg_simple_progression(&encoder_);
    }
}

void TJpegWriter::SetSubsampling() {
    const TIOJPEGCromaSubsampling subsampling = params_.fJPEG_CromaSubsampling;
    encoder_.comp_info[0].h_samp_factor = subsampling == ioJPEG_NONE ? 1 : 2;
    encoder_.comp_info[0].v_samp_factor = subsampling == ioJPEG_HIGH ? 2 : 1;
    for (int component = 1; component < 3; ++component) {
        encoder_.comp_info[component].h_samp_factor = 1;
        encoder_.comp_info[component].v_samp_factor = 1;
    }
}

void TJpegWriter::WriteMarkers() {
    for (std::int32_t i = 0; i < markers_.Count(); ++i) {
        const auto data = markers_.GetMarkerData(i);
        jpeg_write_marker(&encoder_, markers_.GetMarkerType(i), data.data(),
                          static_cast<unsigned>(data.size()));
    }
}

/// One row in the library's input colours; nil when the image's row cannot be reached.
const std::uint8_t* TJpegWriter::MakeRow(std::int32_t row) {
    if (takes_rows_as_they_are_) {
        return bitmap_.GetScanLine(row);
    }
    const auto* colors = reinterpret_cast<const std::uint8_t*>(rgb_rows_.GetRow(row));
    if (colors == nullptr || convert_ == nullptr) {
        return colors;
    }
    convert_(colors, row_.data(), bitmap_.GetWidth(), context_);
    return row_.data();
}

void TJpegWriter::LoopOverRows() {
    const std::int32_t height = bitmap_.GetHeight();
    progress_.val = 0;
    progress_.per1 = 100.0 / height;
    for (std::int32_t row = 0; row < height; ++row) {
        const std::uint8_t* bytes = MakeRow(row);
        if (bytes == nullptr) {
            return;
        }
        JSAMPROW library_row = const_cast<JSAMPROW>(bytes);  // the library only reads it
        jpeg_write_scanlines(&encoder_, &library_row, 1);
        if (!StepProgress(progress_, row + 1)) {
            return;
        }
    }
    rows_done_ = true;
}

/// Runs inside the guard: no object with a destructor lives here while the library works.
void TJpegWriter::RunLibrary() {
    SetUp();
    jpeg_start_compress(&encoder_, TRUE);
    WriteMarkers();
    LoopOverRows();
    if (rows_done_) {
        jpeg_finish_compress(&encoder_);
    }
}

bool TJpegWriter::Write() {
    PrepareRows();
    const bool is_run = RunJpegGuarded(errors_, [this] { RunLibrary(); });
    if (!is_run && !destination_->has_failed) {
        RaiseJpegError(errors_);
    }
    return is_run && rows_done_;
}

}  // namespace

void WriteJPEGStream(TStream& stream, TZmBitmap& bitmap, TIOParams& params,
                     TProgressRec& progress) {
    if (bitmap.IsEmpty()) {
        return;
    }
    TJpegWriter writer(stream, bitmap, params, progress);
    if (!writer.Write()) {
        *progress.Aborting = true;
    }
}

}  // namespace zm
