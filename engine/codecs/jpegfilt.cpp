// JPEG reader: an adapter around the JPEG library (ITU-T T.81, JFIF, Adobe's CMYK files). The
// library decodes; here stand the source over a stream, how markers, resolution and colour space
// reach the file parameters, how a scale is chosen, and what counts as a failure. Lossless and
// hierarchical files, and samples of more than 8 bits, are not supported by the library.

#include "engine/codecs/jpegfilt.h"

#include <algorithm>
#include <array>
#include <memory>
#include <span>
#include <vector>

#include "engine/bitmap/zmrowconvert.h"
#include "engine/bitmap/zmxBitmaps.h"
#include "engine/codecs/accessscope_p.h"
#include "engine/codecs/jpegfilt_p.h"
#include "engine/foundation/zmassert.h"
#include "engine/foundation/zmnumbers.h"
#include "engine/foundation/zmsettings.h"
#include "engine/io/zmbufferedstreams.h"
#include "engine/io/zmimagelimits.h"
#include "engine/io/zmioparams.h"
#include "engine/metadata/zmmetahooks.h"

#include <jerror.h>

namespace zm {

namespace {

/// Positions at which an image may start: files with a little junk in front are common.
constexpr std::int32_t kStartPositions = 150;

/// Scans of a progressive file: at most 1000, and fewer for large images, each scan costing a
/// walk over all coefficients; 40 are always allowed, honest files have 10 to 20.
constexpr std::int64_t kScanPixelBudget = std::int64_t{1} << 31;
constexpr std::int64_t kMinScanLimit = 40;
constexpr std::int64_t kMaxScanLimit = 1000;

constexpr std::int32_t kThumbnailSide = 300;

}  // namespace

std::int32_t FindJpegStart(TStream& stream) {
    std::array<std::uint8_t, kStartPositions + 2> bytes{};
    const std::int32_t got = stream.Read(bytes.data(), static_cast<std::int32_t>(bytes.size()));
    for (std::int32_t i = 0; i + 2 < got; ++i) {
        const std::uint8_t* at = bytes.data() + i;
        if (at[0] == 0xFF && at[1] == 0xD8 && at[2] == 0xFF) {
            return i;
        }
    }
    return -1;
}

namespace {

/// The library's source over a stream. Behind the end of the data it makes up one end marker, so
/// that complete images without one load; asked again, it fails.
struct TJpegSource {
    jpeg_source_mgr base;
    TStream* stream;
    std::int64_t bytes_left;  // of a limited image; negative for no limit
    std::array<JOCTET, kJpegStreamBufferBytes> buffer;
};

TJpegSource& SourceOf(j_decompress_ptr decoder) {
    return *reinterpret_cast<TJpegSource*>(decoder->src);
}

TJpegErrors& ErrorsOf(j_decompress_ptr decoder) {
    return *reinterpret_cast<TJpegErrors*>(decoder->err);
}

/// Bytes put into the buffer; 0 at the end, -1 when the stream raised.
std::int32_t FetchBytes(TJpegSource& source) {
    const auto room = static_cast<std::int64_t>(source.buffer.size());
    const std::int64_t wanted = source.bytes_left < 0 ? room : std::min(room, source.bytes_left);
    try {
        const std::int32_t got =
            source.stream->Read(source.buffer.data(), static_cast<std::int32_t>(wanted));
        if (source.bytes_left >= 0) {
            source.bytes_left -= got;
        }
        return std::max(got, 0);
    } catch (...) {
        return -1;
    }
}

/// An arithmetic decoder takes missing data for zeros without a word, so an end inside a scan
/// cannot be told from a missing end marker later.
bool EndIsInsideArithmeticScan(j_decompress_ptr decoder) {
    return decoder->arith_code && decoder->input_scan_number > 0 &&
           decoder->input_iMCU_row < decoder->total_iMCU_rows;
}

boolean FillInputBuffer(j_decompress_ptr decoder) {
    TJpegSource& source = SourceOf(decoder);
    const std::int32_t got = FetchBytes(source);
    if (got < 0) {
        LeaveJpegLibrary(reinterpret_cast<j_common_ptr>(decoder), JERR_FILE_READ);
    }
    source.base.next_input_byte = source.buffer.data();
    source.base.bytes_in_buffer = static_cast<std::size_t>(got);
    if (got > 0) {
        return TRUE;
    }
    TJpegErrors& errors = ErrorsOf(decoder);
    if (errors.input_ended || EndIsInsideArithmeticScan(decoder)) {
        LeaveJpegLibrary(reinterpret_cast<j_common_ptr>(decoder), JERR_INPUT_EOF);
    }
    errors.input_ended = true;
    source.buffer[0] = 0xFF;
    source.buffer[1] = JPEG_EOI;
    source.base.bytes_in_buffer = 2;
    return TRUE;
}

void SkipInputData(j_decompress_ptr decoder, long count) {
    TJpegSource& source = SourceOf(decoder);
    while (count > 0) {
        if (source.base.bytes_in_buffer == 0) {
            FillInputBuffer(decoder);
        }
        const std::size_t piece =
            std::min(static_cast<std::size_t>(count), source.base.bytes_in_buffer);
        source.base.next_input_byte += piece;
        source.base.bytes_in_buffer -= piece;
        count -= static_cast<long>(piece);
    }
}

void IgnoreSourceCall(j_decompress_ptr) {}

/// Watches the scans that the library reads before the first row.
struct TJpegMonitor {
    jpeg_progress_mgr base;
    std::int64_t scan_limit;
    const bool* aborting;
};

void WatchScans(j_common_ptr library) {
    const auto* monitor = reinterpret_cast<const TJpegMonitor*>(library->progress);
    const auto* decoder = reinterpret_cast<j_decompress_ptr>(library);
    if (decoder->input_scan_number > monitor->scan_limit) {
        LeaveJpegLibrary(library, JERR_BAD_PROGRESSION);
    }
    if (*monitor->aborting) {
        LeaveJpegLibrary(library, JERR_TOO_LITTLE_DATA);
    }
}

std::int32_t DpiFromDensity(UINT16 density, UINT8 unit) {
    return unit == 2 ? TruncToInt(density * 2.54) : density;
}

J_DCT_METHOD DctMethod(TIOJPEGDctMethod method) {
    switch (method) {
        case ioJPEG_IFAST: return JDCT_IFAST;
        case ioJPEG_FLOAT: return JDCT_FLOAT;
        default: return JDCT_ISLOW;
    }
}

/// The largest denominator with which both sides still reach the wanted ones.
std::int32_t AutoDenominator(const TIOParams& params, std::int64_t width, std::int64_t height) {
    if (params.fWidth < 1 || params.fHeight < 1) {
        return 1;
    }
    for (const std::int32_t denominator : {8, 4, 2}) {
        if (width >= std::int64_t{params.fWidth} * denominator &&
            height >= std::int64_t{params.fHeight} * denominator) {
            return denominator;
        }
    }
    return 1;
}

std::int32_t ScaleDenominator(const TIOParams& params, std::int64_t width, std::int64_t height) {
    switch (params.fJPEG_Scale) {
        case ioJPEG_HALF: return 2;
        case ioJPEG_QUARTER: return 4;
        case ioJPEG_EIGHTH: return 8;
        case ioJPEG_AUTOCALC: return AutoDenominator(params, width, height);
        default: return 1;
    }
}

class TJpegReader {
public:
    TJpegReader(TStream& stream, std::int64_t file_bytes, std::int64_t byte_limit,
                TIOParams& params, TProgressRec& progress);
    ~TJpegReader();
    TJpegReader(const TJpegReader&) = delete;
    TJpegReader& operator=(const TJpegReader&) = delete;

    [[nodiscard]] bool ReadHeader();
    void FillResolution();
    void CollectMarkers();
    void ChooseColors(const TJpegReadOptions& options);
    void UseProfile(TZmProfileRow rows) { profile_rows_ = std::move(rows); }
    [[nodiscard]] bool GoesThroughProfile(bool has_profile) const;
    [[nodiscard]] TZmPixelFormat FileFormat() const;
    [[nodiscard]] TZmPixelFormat TargetFormat() const { return format_; }
    [[nodiscard]] bool ChooseScale();
    [[nodiscard]] bool SizeIsAcceptable();
    [[nodiscard]] bool Start();
    [[nodiscard]] bool PrepareBitmap(TZmBitmap& bitmap);
    [[nodiscard]] bool ReadRows(TZmBitmap& bitmap);
    [[nodiscard]] bool Finish();

    std::int32_t ImageWidth() const { return static_cast<std::int32_t>(decoder_.image_width); }
    std::int32_t ImageHeight() const { return static_cast<std::int32_t>(decoder_.image_height); }

private:
    void InitSource(TStream& stream, std::int64_t byte_limit);
    void InitMonitor();
    bool ScansAreComplete() const;
    void FinishRow(std::uint8_t* bitmap_row, std::int32_t width);
    void LoopOverRows(TZmBitmap& bitmap);

    jpeg_decompress_struct decoder_ = {};
    TJpegErrors errors_ = {};
    TJpegMonitor monitor_ = {};
    std::unique_ptr<TJpegSource> source_;
    TIOParams& params_;
    TProgressRec& progress_;
    std::int64_t file_bytes_;
    TZmPixelFormat format_ = zm24RGB;
    std::vector<std::uint8_t> file_row_;  // only when rows are converted on their way
    TZmRowFunction convert_cmyk_ = nullptr;
    TZmProfileRow profile_rows_;
    bool rows_done_ = false;
};

TJpegReader::TJpegReader(TStream& stream, std::int64_t file_bytes, std::int64_t byte_limit,
                         TIOParams& params, TProgressRec& progress)
    : source_(std::make_unique<TJpegSource>()),
      params_(params),
      progress_(progress),
      file_bytes_(file_bytes) {
    decoder_.err = InitJpegErrors(errors_);
    InitSource(stream, byte_limit);
}

/// Leaves the stream behind what the library used, the parameters with the warnings' count.
TJpegReader::~TJpegReader() {
    jpeg_destroy_decompress(&decoder_);
    params_.fJPEG_WarningTot = errors_.warning_total;
    params_.fJPEG_WarningCode = errors_.warning_number;
    if (!errors_.input_ended) {
        try {
            source_->stream->Seek(-static_cast<std::int64_t>(source_->base.bytes_in_buffer),
                                  soCurrent);
        } catch (...) {
            // The stream's position is lost with the stream; the caller's flag is set already.
        }
    }
}

void TJpegReader::InitSource(TStream& stream, std::int64_t byte_limit) {
    source_->base.init_source = IgnoreSourceCall;
    source_->base.fill_input_buffer = FillInputBuffer;
    source_->base.skip_input_data = SkipInputData;
    source_->base.resync_to_restart = jpeg_resync_to_restart;
    source_->base.term_source = IgnoreSourceCall;
    source_->stream = &stream;
    source_->bytes_left = byte_limit;
}

/// The one stage whose failure may find a library object that is not set up.
bool TJpegReader::ReadHeader() {
    return RunJpegOrRaise(errors_, [this] {
        jpeg_create_decompress(&decoder_);
        decoder_.src = &source_->base;
        jpeg_save_markers(&decoder_, JPEG_COM, 0xFFFF);
        for (int number = 0; number < 16; ++number) {
            jpeg_save_markers(&decoder_, JPEG_APP0 + number, 0xFFFF);
        }
        jpeg_read_header(&decoder_, TRUE);
    });
}

void TJpegReader::FillResolution() {
    params_.SetDpiX(DpiFromDensity(decoder_.X_density, decoder_.density_unit));
    params_.SetDpiY(DpiFromDensity(decoder_.Y_density, decoder_.density_unit));
}

/// All but the first APP0: its content is the library's business, which writes its own.
void TJpegReader::CollectMarkers() {
    params_.fJPEG_MarkerList.Clear();
    bool is_first_app0 = true;
    for (auto* marker = decoder_.marker_list; marker != nullptr; marker = marker->next) {
        if (marker->marker == JPEG_APP0 && is_first_app0) {
            is_first_app0 = false;
            continue;
        }
        params_.fJPEG_MarkerList.AddMarker(marker->marker,
                                           std::span(marker->data, marker->data_length));
    }
}

void TJpegReader::ChooseColors(const TJpegReadOptions& options) {
    params_.SetImageCount(1);
    params_.fBitsPerSample = 8;
    params_.fSamplesPerPixel = decoder_.num_components;
    decoder_.out_color_space = JCS_EXT_BGR;
    format_ = zm24RGB;
    switch (decoder_.jpeg_color_space) {
        case JCS_GRAYSCALE:
            params_.fJPEG_ColorSpace = ioJPEG_GRAYLEV;
            if (options.native_format) {
                decoder_.out_color_space = JCS_GRAYSCALE;
                format_ = zm8g;
            }
            break;
        case JCS_RGB: params_.fJPEG_ColorSpace = ioJPEG_RGB; break;
        case JCS_YCbCr:
            params_.fJPEG_ColorSpace = ioJPEG_YCbCr;
            if (options.keep_ycbcr) {
                decoder_.out_color_space = JCS_YCbCr;
            }
            break;
        case JCS_CMYK:
        case JCS_YCCK:
            params_.fJPEG_ColorSpace =
                decoder_.jpeg_color_space == JCS_CMYK ? ioJPEG_CMYK : ioJPEG_YCbCrK;
            decoder_.out_color_space = JCS_CMYK;
            format_ = options.native_format ? zmCMYK : zm24RGB;
            break;
        default:
            throw EZmJpegException(JpegMessageText(JpegMessageNumber(JERR_CONVERSION_NOTIMPL)));
    }
}

/// Format of the rows that the library delivers.
TZmPixelFormat TJpegReader::FileFormat() const {
    return decoder_.out_color_space == JCS_CMYK ? zmCMYK : format_;
}

/// Ink amounts that are to be kept, and samples that are no colours yet, are left alone.
bool TJpegReader::GoesThroughProfile(bool has_profile) const {
    return has_profile && ZmGlobalSettings().fEnableCMS && format_ != zmCMYK &&
           decoder_.out_color_space != JCS_YCbCr;
}

bool TJpegReader::ChooseScale() {
    decoder_.dct_method = DctMethod(params_.fJPEG_DCTMethod);
    params_.fJPEG_Progressive = decoder_.progressive_mode != FALSE;
    params_.fOriginalWidth = ImageWidth();
    params_.fOriginalHeight = ImageHeight();
    params_.fJPEG_ScaleUsed = ScaleDenominator(params_, ImageWidth(), ImageHeight());
    decoder_.scale_num = 1;
    decoder_.scale_denom = static_cast<unsigned>(params_.fJPEG_ScaleUsed);
    return RunJpegOrRaise(errors_, [this] { jpeg_calc_output_dimensions(&decoder_); });
}

/// A file of several scans makes the library keep all coefficients, 16 bits each, beside the
/// bitmap.
bool TJpegReader::SizeIsAcceptable() {
    const std::int32_t bits = PixelFormatInfo(format_).bit_count;
    const bool keeps_coefficients = jpeg_has_multiple_scans(&decoder_) != FALSE;
    return ImageSizeIsAcceptable(decoder_.output_width, decoder_.output_height, bits,
                                 file_bytes_) &&
           (!keeps_coefficients ||
            ImageSizeIsAcceptable(decoder_.image_width, decoder_.image_height,
                                  16 * decoder_.num_components, file_bytes_));
}

void TJpegReader::InitMonitor() {
    const std::int64_t pixels = std::int64_t{ImageWidth()} * ImageHeight();
    monitor_.base.progress_monitor = WatchScans;
    monitor_.scan_limit = std::clamp(kScanPixelBudget / std::max<std::int64_t>(pixels, 1),
                                     kMinScanLimit, kMaxScanLimit);
    monitor_.aborting = progress_.Aborting;
    decoder_.progress = &monitor_.base;
}

/// Whether what came before the end of the data is the whole of every component.
bool TJpegReader::ScansAreComplete() const {
    if (decoder_.input_iMCU_row < decoder_.total_iMCU_rows) {
        return false;
    }
    for (int component = 0; component < decoder_.num_components; ++component) {
        if (decoder_.comp_info[component].quant_table == nullptr) {
            return false;
        }
        if (decoder_.coef_bits != nullptr) {
            const int* precision = decoder_.coef_bits[component];
            if (!std::all_of(precision, precision + DCTSIZE2, [](int bit) { return bit == 0; })) {
                return false;
            }
        }
    }
    return true;
}

bool TJpegReader::Start() {
    InitMonitor();
    const bool has_started = RunJpegOrRaise(errors_, [this] { jpeg_start_decompress(&decoder_); });
    const bool is_cut =
        errors_.input_ended && jpeg_has_multiple_scans(&decoder_) != FALSE && !ScansAreComplete();
    return has_started && !is_cut;
}

bool TJpegReader::PrepareBitmap(TZmBitmap& bitmap) {
    const auto width = static_cast<std::int32_t>(decoder_.output_width);
    const auto height = static_cast<std::int32_t>(decoder_.output_height);
    bitmap.RemoveAlphaChannel(/*merge=*/false, 0);
    if (!bitmap.Allocate(width, height, format_)) {
        return false;
    }
    if (FileFormat() != format_) {
        convert_cmyk_ = FindRowFunction(zmCMYK, zm24RGB);
        ZM_ASSERT(convert_cmyk_ != nullptr);
    }
    if (convert_cmyk_ != nullptr || profile_rows_) {
        const std::int32_t bits = PixelFormatInfo(FileFormat()).bit_count;
        file_row_.resize(static_cast<std::size_t>(width) * static_cast<std::size_t>(bits / 8));
    }
    return true;
}

/// From the row that the library delivered to the bitmap's.
void TJpegReader::FinishRow(std::uint8_t* bitmap_row, std::int32_t width) {
    if (profile_rows_ && profile_rows_(file_row_.data(), bitmap_row, width)) {
        return;
    }
    // Required: the ink amounts of CMYK files are taken as stored inverted, 255 for no ink, as the
    // great majority of such files has them; that is also the form of zmCMYK.
    if (convert_cmyk_ != nullptr) {
        convert_cmyk_(file_row_.data(), bitmap_row, width, MakeRowContext(nullptr));
    } else {
        std::copy(file_row_.begin(), file_row_.end(), bitmap_row);
    }
}

/// Runs inside the guard: no object with a destructor lives here while the library works.
void TJpegReader::LoopOverRows(TZmBitmap& bitmap) {
    const std::int32_t height = bitmap.GetHeight();
    const std::int32_t width = bitmap.GetWidth();
    for (std::int32_t row = 0; row < height; ++row) {
        std::uint8_t* bitmap_row = bitmap.GetScanLine(row);
        if (bitmap_row == nullptr) {
            return;
        }
        JSAMPROW target = file_row_.empty() ? bitmap_row : file_row_.data();
        if (jpeg_read_scanlines(&decoder_, &target, 1) != 1) {
            return;
        }
        if (!file_row_.empty()) {
            FinishRow(bitmap_row, width);
        }
        if (!StepProgress(progress_, row + 1)) {
            return;
        }
    }
    rows_done_ = true;
}

bool TJpegReader::ReadRows(TZmBitmap& bitmap) {
    progress_.val = 0;
    progress_.per1 = 100.0 / bitmap.GetHeight();
    const TAccessScope access_scope(bitmap, zmdWrite);
    return RunJpegOrRaise(errors_, [&] { LoopOverRows(bitmap); }) && rows_done_;
}

/// Behind complete rows a missing end marker is no failure.
bool TJpegReader::Finish() {
    const bool is_finished = RunJpegGuarded(errors_, [this] { jpeg_finish_decompress(&decoder_); });
    if (!is_finished && !errors_.input_ended) {
        RaiseJpegError(errors_);
    }
    return true;
}

/// The rows' way through the input profile is opened last, when the rows are sure to come.
void OpenProfile(TJpegReader& reader, TIOParams& params, bool has_profile) {
    const auto open = MetadataHooks().open_profile_rows;
    if (open != nullptr && reader.GoesThroughProfile(has_profile)) {
        reader.UseProfile(open(params, reader.FileFormat(), reader.TargetFormat()));
    }
}

bool DecodeImage(TJpegReader& reader, TZmBitmap& bitmap, const TJpegMetadata& metadata,
                 TIOParams& params) {
    if (!reader.SizeIsAcceptable() || !reader.Start()) {
        return false;
    }
    OpenProfile(reader, params, metadata.has_input_profile);
    if (!reader.PrepareBitmap(bitmap) || !reader.ReadRows(bitmap) || !reader.Finish()) {
        return false;
    }
    if (params.fJPEG_EnableAdjustOrientation &&
        !ApplyJpegOrientation(bitmap, params, metadata.orientation)) {
        return false;
    }
    if (params.fJPEG_Scale != ioJPEG_AUTOCALC) {  // there the two fields are the wanted size
        params.fWidth = bitmap.GetWidth();
        params.fHeight = bitmap.GetHeight();
    }
    return true;
}

bool ReadJpeg(TStream& stream, TZmBitmap& bitmap, const TJpegReadOptions& options,
              TProgressRec& progress, TIOParams& params) {
    params.fJPEG_WarningTot = 0;
    params.fJPEG_WarningCode = 0;
    const std::int64_t file_bytes = stream.GetSize() - stream.GetPosition();
    TZmBufferedReadStream buffered(&stream, kJpegStreamBufferBytes,
                                   /*use_relative_position=*/true);
    const std::int32_t offset = FindJpegStart(buffered);
    buffered.SetPosition(std::max(offset, 0));
    if (offset < 0) {
        return false;
    }
    const std::int64_t byte_limit =
        options.byte_limit < 0 ? -1 : std::max<std::int64_t>(options.byte_limit - offset, 0);
    TJpegReader reader(buffered, file_bytes, byte_limit, params, progress);
    if (!reader.ReadHeader()) {
        return false;
    }
    reader.FillResolution();
    reader.CollectMarkers();
    TJpegMetadata metadata;
    if (options.read_metadata && params.fGetMetaData) {
        metadata = ReadJpegMetadata(params);
    }
    reader.ChooseColors(options);
    if (!reader.ChooseScale()) {
        return false;
    }
    if (options.params_only) {
        params.fWidth = reader.ImageWidth();
        params.fHeight = reader.ImageHeight();
        return true;
    }
    return DecodeImage(reader, bitmap, metadata, params);
}

/// Sizes in the parameters, which are a wish before a load and a fact after it.
struct TSavedSizes {
    explicit TSavedSizes(const TIOParams& params)
        : width(params.fWidth),
          height(params.fHeight),
          original_width(params.fOriginalWidth),
          original_height(params.fOriginalHeight) {}
    void Restore(TIOParams& params) const {
        params.fWidth = width;
        params.fHeight = height;
        params.fOriginalWidth = original_width;
        params.fOriginalHeight = original_height;
    }
    std::int32_t width;
    std::int32_t height;
    std::int32_t original_width;
    std::int32_t original_height;
};

/// The embedded thumbnail when there is one; else a small decode when the scale is left to the
/// reader; else the image itself.
bool ReadThumbnail(TStream& stream, TZmBitmap& bitmap, const TJpegReadOptions& options,
                   TProgressRec& progress, TIOParams& params) {
    const std::int64_t start = stream.GetPosition();
    const TSavedSizes saved(params);
    TJpegReadOptions header_only = options;
    header_only.params_only = true;
    if (!ReadJpeg(stream, bitmap, header_only, progress, params)) {
        return false;
    }
    if (params.fEXIF_Bitmap != nullptr && !params.fEXIF_Bitmap->IsEmpty()) {
        bitmap.AssignImage(params.fEXIF_Bitmap.get());
        return true;
    }
    stream.SetPosition(start);
    saved.Restore(params);
    if (params.fJPEG_Scale != ioJPEG_AUTOCALC) {
        return ReadJpeg(stream, bitmap, options, progress, params);
    }
    params.fWidth = kThumbnailSide;
    params.fHeight = kThumbnailSide;
    const bool is_read = ReadJpeg(stream, bitmap, options, progress, params);
    params.fWidth = saved.width;
    params.fHeight = saved.height;
    return is_read;
}

}  // namespace

void ReadJPEGStream(TStream& stream, TZmBitmap& bitmap, const TJpegReadOptions& options,
                    TProgressRec& progress, TIOParams& params) {
    const bool wants_thumbnail = params.fJPEG_GetExifThumbnail && !options.params_only;
    try {
        const auto read = wants_thumbnail ? ReadThumbnail : ReadJpeg;
        if (!read(stream, bitmap, options, progress, params)) {
            *progress.Aborting = true;
        }
    } catch (...) {
        // Readers report by the flag alone; the text of the library's error goes no further.
        *progress.Aborting = true;
    }
}

}  // namespace zm
