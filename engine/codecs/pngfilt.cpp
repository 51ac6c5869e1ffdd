// PNG reader: an adapter around libpng, which does the format (Portable Network Graphics, W3C
// Recommendation; big-endian). Here stand the choice of pixel format and transformations, and how
// alpha, palette, texts, resolution and background reach the bitmap and the file parameters. The
// chunks that carry EXIF blocks, profiles and international texts are kept for the rooms that know
// them. Frames of animations behind the first image are not read.

#include "engine/codecs/pngfilt.h"

#include <cstdlib>
#include <cstring>
#include <memory>
#include <new>

#include "engine/bitmap/zmrowconvert.h"
#include "engine/bitmap/zmxBitmaps.h"
#include "engine/codecs/accessscope_p.h"
#include "engine/codecs/pngfilt_p.h"
#include "engine/foundation/zmassert.h"
#include "engine/foundation/zmnumbers.h"
#include "engine/foundation/zmsettings.h"
#include "engine/io/zmbufferedstreams.h"
#include "engine/io/zmimagelimits.h"
#include "engine/io/zmioparams.h"

namespace zm {

namespace {

/// Memory that text, profiles and other kept chunks of one file may take together; a compressed
/// chunk can ask for a thousand times its own size.
constexpr std::int64_t kMaxKeptChunkBytes = std::int64_t{64} << 20;
/// Size of a single chunk, unpacked.
constexpr png_alloc_size_t kMaxChunkBytes = 32u << 20;

/// Room in front of each block for its size, keeping the alignment of the block.
constexpr std::size_t kBlockHeadBytes = 16;
static_assert(kBlockHeadBytes >= sizeof(std::size_t) &&
              kBlockHeadBytes % alignof(std::max_align_t) == 0);

void PNGCBAPI ReadPngBytes(png_structp png, png_bytep target, std::size_t count) {
    auto* session = static_cast<TPngSession*>(png_get_io_ptr(png));
    std::size_t done = 0;
    try {
        while (done < count && !session->ran_short) {
            const std::size_t left = count - done;
            const auto piece = static_cast<std::int32_t>(left < 0x40000000u ? left : 0x40000000u);
            const std::int32_t got = session->stream->Read(target + done, piece);
            session->ran_short = got < piece;
            done += got > 0 ? static_cast<std::size_t>(got) : 0;
        }
    } catch (...) {
        session->stream_raised = true;
    }
    if (done < count || session->stream_raised) {
        png_error(png, "read failed");
    }
}

std::uint8_t ScaleSampleTo8(std::uint32_t value, std::int32_t bit_depth) {
    if (bit_depth > 8) {
        return static_cast<std::uint8_t>(value >> 8);
    }
    const std::uint32_t highest = (1u << bit_depth) - 1;
    return static_cast<std::uint8_t>((value > highest ? highest : value) * 255 / highest);
}

/// Red first to blue first, in place. Whole words, which compilers turn into vector code.
void SwapRedAndBlue(std::uint8_t* row, std::size_t width) {
    for (std::size_t x = 0; x < width; ++x) {
        std::uint32_t pixel = 0;
        std::memcpy(&pixel, row + x * 4, 4);
        pixel = (pixel & 0xFF00FF00u) | (pixel >> 16 & 0xFF) | (pixel & 0xFF) << 16;
        std::memcpy(row + x * 4, &pixel, 4);
    }
}

void TakeAlphas(const std::uint8_t* source, std::uint8_t* alphas, std::size_t width) {
    for (std::size_t x = 0; x < width; ++x) {
        alphas[x] = source[x * 4 + 3];
    }
}

bool IsInternational(const png_text& text) {
    return text.compression > PNG_TEXT_COMPRESSION_zTXt;
}

std::size_t TextLength(const png_text& text) {
    return IsInternational(text) ? text.itxt_length : text.text_length;
}

class TPngReader {
public:
    TPngReader(TStream& stream, std::int64_t file_bytes, TZmBitmap& bitmap, TIOParams& params,
               TProgressRec& progress)
        : bitmap_(bitmap), params_(params), progress_(progress), file_bytes_(file_bytes) {
        session_.stream = &stream;
    }
    ~TPngReader() { png_destroy_read_struct(&png_, &info_, nullptr); }
    TPngReader(const TPngReader&) = delete;
    TPngReader& operator=(const TPngReader&) = delete;

    [[nodiscard]] bool Open();
    [[nodiscard]] bool ReadHeader();
    void FillParams();
    [[nodiscard]] bool SizeIsAcceptable() const;
    [[nodiscard]] bool SetTransformations();
    [[nodiscard]] bool PrepareBitmap();
    [[nodiscard]] bool ReadRows();
    [[nodiscard]] bool ReadEnd();

private:
    bool IsPalette() const { return color_type_ == PNG_COLOR_TYPE_PALETTE; }
    bool IsGray() const { return (color_type_ & PNG_COLOR_MASK_COLOR) == 0; }
    bool IsNative() const;
    bool HasAlpha() const;
    bool SwapsColors() const;
    TZmPixelFormat TargetFormat() const;
    void RequestTransformations();
    void CollectTexts();
    void KeepText(const png_text& text);
    void KeepProfile();
    void KeepExif();
    void FillBackground();
    void FillResolution();
    void FillColorMap();
    bool PreparePlane();
    bool PrepareRowBuffer();
    void LoopOverRows();
    bool AllRowsWereRead() const;
    bool FinishLastRow();
    std::uint8_t* RowTarget(std::int32_t pass, std::int32_t row);
    bool SplitRow(std::uint8_t* source, std::int32_t row);

    TPngSession session_;
    png_structp png_ = nullptr;
    png_infop info_ = nullptr;
    TZmBitmap& bitmap_;
    TIOParams& params_;
    TProgressRec& progress_;
    std::int64_t file_bytes_;

    png_uint_32 width_ = 0;
    png_uint_32 height_ = 0;
    int bit_depth_ = 0;
    int color_type_ = 0;
    int interlace_ = 0;
    int passes_ = 1;
    int texts_taken_ = 0;
    TZmBitmap* plane_ = nullptr;
    std::unique_ptr<std::uint8_t[]> row_buffer_;  // one row, or all of an interlaced image
    std::size_t buffer_row_bytes_ = 0;
    TZmRowFunction split_colors_ = nullptr;
    bool rows_done_ = false;
    bool end_is_missing_ = false;
};

bool TPngReader::Open() {
    png_ = png_create_read_struct_2(PNG_LIBPNG_VER_STRING, &session_, LeavePngLibrary,
                                    IgnorePngWarning, &session_, AllocatePngMemory, FreePngMemory);
    if (png_ == nullptr) {
        return false;
    }
    info_ = png_create_info_struct(png_);
    if (info_ == nullptr) {
        return false;
    }
    png_set_read_fn(png_, &session_, ReadPngBytes);
    png_set_user_limits(png_, kPngMaxSide, kPngMaxSide);
    png_set_chunk_malloc_max(png_, kMaxChunkBytes);
    png_set_benign_errors(png_, 1);
    return true;
}

bool TPngReader::ReadHeader() {
    session_.chunk_bytes_left = kMaxKeptChunkBytes;
    session_.limits_chunk_memory = true;
    const bool is_read = RunPngGuarded(png_, [this] { png_read_info(png_, info_); });
    session_.limits_chunk_memory = false;
    return is_read && png_get_IHDR(png_, info_, &width_, &height_, &bit_depth_, &color_type_,
                                   &interlace_, nullptr, nullptr) != 0;
}

/// Palette and grey files of whole bytes or words keep their pixels when the caller wants that.
bool TPngReader::IsNative() const {
    return params_.fNativePixelFormat && (bit_depth_ == 8 || bit_depth_ == 16) &&
           (IsPalette() || color_type_ == PNG_COLOR_TYPE_GRAY);
}

/// Whether rows arrive with a fourth channel.
bool TPngReader::HasAlpha() const {
    if (IsNative()) {
        return false;
    }
    if ((color_type_ & PNG_COLOR_MASK_ALPHA) != 0) {
        return true;
    }
    const bool has_transparency = png_get_valid(png_, info_, PNG_INFO_tRNS) != 0;
    return has_transparency && (bit_depth_ > 1 || IsPalette());
}

/// Rows that are split are swapped on the way, faster than the library does it; not those of an
/// interlaced image, which go back to it in the next pass.
bool TPngReader::SwapsColors() const {
    return HasAlpha() && interlace_ == PNG_INTERLACE_NONE;
}

TZmPixelFormat TPngReader::TargetFormat() const {
    if (bit_depth_ == 1 && !IsPalette()) {
        return zm1g;
    }
    if (!IsNative()) {
        return zm24RGB;
    }
    if (IsPalette()) {
        return zm8p;
    }
    return bit_depth_ == 8 ? zm8g : zm16g;
}

void TPngReader::FillParams() {
    params_.fPNG_TextKeys.clear();
    params_.fPNG_TextValues.clear();
    params_.fPNG_Chunks.Clear();
    CollectTexts();
    KeepProfile();
    KeepExif();
    FillBackground();
    params_.SetImageCount(1);
    params_.fWidth = params_.fOriginalWidth = static_cast<std::int32_t>(width_);
    params_.fHeight = params_.fOriginalHeight = static_cast<std::int32_t>(height_);
    params_.fBitsPerSample = IsPalette() ? 8 : bit_depth_;
    const bool has_alpha_samples = (color_type_ & PNG_COLOR_MASK_ALPHA) != 0;
    const std::int32_t color_samples = IsPalette() || IsGray() ? 1 : 3;
    params_.fSamplesPerPixel = color_samples + (has_alpha_samples ? 1 : 0);
    FillResolution();
    FillColorMap();
    params_.fPNG_Interlaced = interlace_ != PNG_INTERLACE_NONE;
}

/// Adds the text chunks that came since the last call, in their order.
void TPngReader::CollectTexts() {
    png_textp texts = nullptr;
    int count = 0;
    png_get_text(png_, info_, &texts, &count);
    for (; texts_taken_ < count; ++texts_taken_) {
        const png_text& text = texts[texts_taken_];
        params_.fPNG_TextKeys.emplace_back(text.key);
        params_.fPNG_TextValues.emplace_back(text.text != nullptr ? text.text : "",
                                             text.text != nullptr ? TextLength(text) : 0);
        KeepText(text);
    }
}

void TPngReader::KeepText(const png_text& text) {
    if (!params_.fGetMetaData || !IsInternational(text)) {
        return;
    }
    TZmPngChunk chunk;
    chunk.kind = kPngChunkText;
    chunk.key = text.key;
    chunk.language = text.lang != nullptr ? text.lang : "";
    chunk.translated_key = text.lang_key != nullptr ? text.lang_key : "";
    if (text.text != nullptr) {
        chunk.data.assign(text.text, text.text + TextLength(text));
    }
    params_.fPNG_Chunks.Add(std::move(chunk));
}

void TPngReader::KeepProfile() {
    png_charp name = nullptr;
    png_bytep profile = nullptr;
    png_uint_32 size = 0;
    int compression = 0;
    if (!params_.fGetMetaData ||
        png_get_iCCP(png_, info_, &name, &compression, &profile, &size) == 0) {
        return;
    }
    TZmPngChunk chunk;
    chunk.kind = kPngChunkProfile;
    chunk.key = name;
    chunk.data.assign(profile, profile + size);
    params_.fPNG_Chunks.Add(std::move(chunk));
}

/// The chunk may stand on either side of the image data.
void TPngReader::KeepExif() {
    png_bytep block = nullptr;
    png_uint_32 size = 0;
    const bool is_kept = params_.fPNG_Chunks.Find(kPngChunkExif) != nullptr;
    if (is_kept || !params_.fGetMetaData || png_get_eXIf_1(png_, info_, &size, &block) == 0) {
        return;
    }
    TZmPngChunk chunk;
    chunk.kind = kPngChunkExif;
    chunk.data.assign(block, block + size);
    params_.fPNG_Chunks.Add(std::move(chunk));
}

/// Grey and RGB backgrounds count in the file's own depth; libpng has looked up that of a
/// palette file in the palette already.
void TPngReader::FillBackground() {
    png_color_16p background = nullptr;
    if (png_get_bKGD(png_, info_, &background) == 0 || background == nullptr) {
        return;
    }
    const int depth = IsPalette() ? 8 : bit_depth_;
    if (IsGray()) {
        const std::uint8_t gray = ScaleSampleTo8(background->gray, depth);
        params_.fPNG_Background = TRGB{gray, gray, gray};
        return;
    }
    params_.fPNG_Background =
        TRGB{ScaleSampleTo8(background->blue, depth), ScaleSampleTo8(background->green, depth),
             ScaleSampleTo8(background->red, depth)};
}

void TPngReader::FillResolution() {
    const auto dpi_of = [](png_uint_32 pixels_per_meter, std::int32_t default_dpi) {
        const std::int32_t dpi = RoundHalfEven(pixels_per_meter / 100.0 * 2.54);
        return dpi == 0 ? default_dpi : dpi;
    };
    const TZmZalmoGlobalSettings& settings = ZmGlobalSettings();
    params_.SetDpiX(dpi_of(png_get_x_pixels_per_meter(png_, info_), settings.fDefaultDPIX));
    params_.SetDpiY(dpi_of(png_get_y_pixels_per_meter(png_, info_), settings.fDefaultDPIY));
}

void TPngReader::FillColorMap() {
    png_colorp palette = nullptr;
    int count = 0;
    if (!IsPalette() || png_get_PLTE(png_, info_, &palette, &count) == 0) {
        return;
    }
    params_.FreeColorMap();
    for (int i = 0; i < count; ++i) {
        params_.fColorMap.push_back(TRGB{palette[i].blue, palette[i].green, palette[i].red});
    }
    params_.fColorMapCount = count;
}

bool TPngReader::SizeIsAcceptable() const {
    std::int32_t bits = PixelFormatInfo(TargetFormat()).bit_count;
    if (HasAlpha()) {
        const bool buffers_image = interlace_ != PNG_INTERLACE_NONE;
        bits += buffers_image ? 8 + 32 : 8;
    }
    // The library keeps rows in the file's own depth, two of them and one in transformation.
    const std::int32_t file_bits = png_get_channels(png_, info_) * bit_depth_;
    return ImageSizeIsAcceptable(width_, height_, bits, file_bytes_) &&
           ImageSizeIsAcceptable(width_, 3, file_bits, file_bytes_);
}

void TPngReader::RequestTransformations() {
    if (IsNative()) {
        if (bit_depth_ == 16) {
            png_set_swap(png_);
        }
    } else {
        if (IsPalette()) {
            png_set_palette_to_rgb(png_);
        } else if (IsGray() && bit_depth_ > 1 && bit_depth_ < 8) {
            png_set_expand_gray_1_2_4_to_8(png_);
        }
        if (bit_depth_ == 16) {
            png_set_strip_16(png_);
        }
        if (bit_depth_ > 1 && bit_depth_ < 8) {
            png_set_packing(png_);
        }
        if (IsGray() && bit_depth_ > 1) {
            png_set_gray_to_rgb(png_);
        }
        if ((bit_depth_ > 1 || IsPalette()) && !SwapsColors()) {
            png_set_bgr(png_);
        }
        if (HasAlpha()) {
            png_set_tRNS_to_alpha(png_);
        }
    }
    passes_ = png_set_interlace_handling(png_);
    png_read_update_info(png_, info_);
}

bool TPngReader::SetTransformations() {
    return RunPngGuarded(png_, [this] { RequestTransformations(); });
}

bool TPngReader::PrepareBitmap() {
    const auto width = static_cast<std::int32_t>(width_);
    const auto height = static_cast<std::int32_t>(height_);
    const TZmPixelFormat format = TargetFormat();
    bitmap_.RemoveAlphaChannel(/*merge=*/false, 0);
    if (!bitmap_.Allocate(width, height, format)) {
        return false;
    }
    const std::int32_t bits = HasAlpha() ? 32 : PixelFormatInfo(format).bit_count;
    const std::int64_t needed_bytes = (std::int64_t{width} * bits + 7) / 8;
    buffer_row_bytes_ = png_get_rowbytes(png_, info_);
    if (static_cast<std::int64_t>(buffer_row_bytes_) != needed_bytes) {
        return false;
    }
    if (format == zm8p) {
        for (std::int32_t i = 0; i < 256; ++i) {
            const bool is_used = i < params_.fColorMapCount;
            bitmap_.SetPalette(i,
                               is_used ? params_.fColorMap[static_cast<std::size_t>(i)] : TRGB{});
        }
        bitmap_.SetPaletteUsed(params_.fColorMapCount);
    }
    return !HasAlpha() || (PreparePlane() && PrepareRowBuffer());
}

bool TPngReader::PreparePlane() {
    plane_ = bitmap_.GetAlphaChannel();
    if (plane_ == nullptr || plane_->GetWidth() != bitmap_.GetWidth() ||
        plane_->GetHeight() != bitmap_.GetHeight()) {
        return false;
    }
    plane_->SetFull(false);
    split_colors_ = FindRowFunction(zm32RGB, zm24RGB);
    ZM_ASSERT(split_colors_ != nullptr);
    return true;
}

/// A pass of an interlaced image adds to the rows of the passes before, so these are all kept.
bool TPngReader::PrepareRowBuffer() {
    const std::int64_t rows = passes_ > 1 ? height_ : 1;
    const auto bytes = CheckedMul(static_cast<std::int64_t>(buffer_row_bytes_), rows);
    if (!bytes || !FitsAddressSpace(*bytes)) {
        return false;
    }
    row_buffer_.reset(new (std::nothrow) std::uint8_t[static_cast<std::size_t>(*bytes)]());
    return row_buffer_ != nullptr;
}

std::uint8_t* TPngReader::RowTarget(std::int32_t pass, std::int32_t row) {
    if (row_buffer_ != nullptr) {
        const std::size_t index = passes_ > 1 ? static_cast<std::size_t>(row) : 0;
        return row_buffer_.get() + index * buffer_row_bytes_;
    }
    std::uint8_t* target = bitmap_.GetScanLine(row);
    if (target != nullptr && pass == 0 && bitmap_.GetPixelFormat() == zm1g) {
        target[buffer_row_bytes_ - 1] = 0;  // the library leaves bits behind the last pixel alone
    }
    return target;
}

bool TPngReader::SplitRow(std::uint8_t* source, std::int32_t row) {
    std::uint8_t* colors = bitmap_.GetScanLine(row);
    std::uint8_t* alphas = plane_->GetScanLine(row);
    if (colors == nullptr || alphas == nullptr) {
        return false;
    }
    if (SwapsColors()) {
        SwapRedAndBlue(source, width_);
    }
    split_colors_(source, colors, static_cast<std::int32_t>(width_), MakeRowContext(nullptr));
    TakeAlphas(source, alphas, width_);
    return true;
}

/// Runs inside the guard: no object with a destructor lives here.
void TPngReader::LoopOverRows() {
    const auto height = static_cast<std::int32_t>(height_);
    std::int64_t units_done = 0;
    for (std::int32_t pass = 0; pass < passes_; ++pass) {
        for (std::int32_t row = 0; row < height; ++row) {
            std::uint8_t* target = RowTarget(pass, row);
            if (target == nullptr) {
                return;
            }
            png_read_row(png_, target, nullptr);
            const bool is_touched =
                passes_ == 1 || PNG_ROW_IN_INTERLACE_PASS(static_cast<png_uint_32>(row), pass);
            if (row_buffer_ != nullptr && is_touched && !SplitRow(target, row)) {
                return;
            }
            if (!StepProgress(progress_, ++units_done)) {
                return;
            }
        }
    }
    rows_done_ = true;
}

/// The library looks for the end of the image data behind the last row of the last pass, so a
/// missing end shows there, with that row already delivered.
bool TPngReader::AllRowsWereRead() const {
    return interlace_ == PNG_INTERLACE_NONE ? png_get_current_row_number(png_) >= height_
                                            : png_get_current_pass_number(png_) >= 7;
}

/// What LoopOverRows had still to do when the library left at the last row.
bool TPngReader::FinishLastRow() {
    end_is_missing_ = true;
    const auto last = static_cast<std::int32_t>(height_) - 1;
    const bool is_split = row_buffer_ == nullptr || SplitRow(RowTarget(passes_ - 1, last), last);
    return is_split && StepProgress(progress_, std::int64_t{height_} * passes_);
}

bool TPngReader::ReadRows() {
    progress_.val = 0;
    progress_.per1 = 100.0 / (static_cast<double>(height_) * passes_);
    const TZmDataAccess access = passes_ == 1 ? zmdWrite : zmdReadWrite;
    const TAccessScope access_scope(bitmap_, access);
    if (RunPngGuarded(png_, [this] { LoopOverRows(); })) {
        return rows_done_;
    }
    const bool only_ran_short = session_.ran_short && !session_.stream_raised;
    return only_ran_short && AllRowsWereRead() && FinishLastRow();
}

/// Behind complete rows a missing end is no failure; damage is.
bool TPngReader::ReadEnd() {
    if (end_is_missing_) {
        return true;
    }
    session_.chunk_bytes_left = kMaxKeptChunkBytes;
    session_.limits_chunk_memory = true;
    const bool is_read = RunPngGuarded(png_, [this] { png_read_end(png_, info_); });
    CollectTexts();
    KeepExif();
    return is_read || (session_.ran_short && !session_.stream_raised);
}

bool ReadPng(TStream& stream, TZmBitmap& bitmap, TIOParams& params, bool params_only,
             TProgressRec& progress) {
    const std::int64_t file_bytes = stream.GetSize() - stream.GetPosition();
    TZmBufferedReadStream buffered(&stream, kPngStreamBufferBytes,
                                   /*use_relative_position=*/true);
    TPngReader reader(buffered, file_bytes, bitmap, params, progress);
    if (!reader.Open() || !reader.ReadHeader()) {
        return false;
    }
    reader.FillParams();
    if (params_only) {
        return true;
    }
    return reader.SizeIsAcceptable() && reader.SetTransformations() && reader.PrepareBitmap() &&
           reader.ReadRows() && reader.ReadEnd();
}

}  // namespace

void PNGCBAPI LeavePngLibrary(png_structp png, png_const_charp) {
    png_longjmp(png, 1);
}

void PNGCBAPI IgnorePngWarning(png_structp, png_const_charp) {}

png_voidp PNGCBAPI AllocatePngMemory(png_structp png, png_alloc_size_t size) {
    auto* session = static_cast<TPngSession*>(png_get_mem_ptr(png));
    const bool fits_address_space = size <= static_cast<std::size_t>(-1) / 2;
    if (!fits_address_space || (session->limits_chunk_memory &&
                                static_cast<std::int64_t>(size) > session->chunk_bytes_left)) {
        return nullptr;
    }
    auto* block = static_cast<std::uint8_t*>(std::malloc(size + kBlockHeadBytes));
    if (block == nullptr) {
        return nullptr;
    }
    std::memcpy(block, &size, sizeof(size));
    session->chunk_bytes_left -= static_cast<std::int64_t>(size);
    return block + kBlockHeadBytes;
}

void PNGCBAPI FreePngMemory(png_structp png, png_voidp block) {
    if (block == nullptr) {
        return;
    }
    auto* head = static_cast<std::uint8_t*>(block) - kBlockHeadBytes;
    png_alloc_size_t size = 0;
    std::memcpy(&size, head, sizeof(size));
    static_cast<TPngSession*>(png_get_mem_ptr(png))->chunk_bytes_left +=
        static_cast<std::int64_t>(size);
    std::free(head);
}

void ReadPNGStream(TStream& stream, TZmBitmap& bitmap, TIOParams& params, bool params_only,
                   TProgressRec& progress) {
    try {
        if (!ReadPng(stream, bitmap, params, params_only, progress)) {
            *progress.Aborting = true;
        }
    } catch (...) {
        // Readers report by the flag alone, whatever the stream or the memory ran into.
        *progress.Aborting = true;
    }
}

}  // namespace zm
