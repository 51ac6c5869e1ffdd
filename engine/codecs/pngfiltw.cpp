// PNG writer: an adapter around libpng. It decides colour type and depth from the file parameters
// and hands over row after row; the image is never held a second time, except as the 1-bit copy
// of a file of two colours and while a palette is sought for colours of four bytes.

#include <png.h>

#include <algorithm>
#include <array>
#include <cstdlib>
#include <cstring>
#include <exception>
#include <memory>
#include <optional>
#include <utility>
#include <vector>

#include "engine/bitmap/zmmask.h"
#include "engine/bitmap/zmquantizer.h"
#include "engine/bitmap/zmrgbrows.h"
#include "engine/bitmap/zmxBitmaps.h"
#include "engine/codecs/colorcopy_p.h"
#include "engine/codecs/pngfilt.h"
#include "engine/codecs/pngfilt_p.h"
#include "engine/foundation/zmassert.h"
#include "engine/foundation/zmnumbers.h"
#include "engine/io/zmbufferedstreams.h"
#include "engine/io/zmioparams.h"

namespace zm {

namespace {

/// What a row of the file consists of.
enum class PngRowKind { kBits, kGray8, kGray16, kIndices, kColors, kColorsAndAlpha };

void PNGCBAPI WritePngBytes(png_structp png, png_bytep source, std::size_t count) {
    auto* session = static_cast<TPngSession*>(png_get_io_ptr(png));
    std::size_t done = 0;
    try {
        while (done < count && !session->ran_short) {
            const std::size_t left = count - done;
            const auto piece = static_cast<std::int32_t>(left < 0x40000000u ? left : 0x40000000u);
            const std::int32_t put = session->stream->Write(source + done, piece);
            session->ran_short = put < piece;
            done += put > 0 ? static_cast<std::size_t>(put) : 0;
        }
    } catch (...) {
        session->stream_raised = true;
    }
    if (done < count || session->stream_raised) {
        png_error(png, "write failed");
    }
}

/// The stream is flushed once, behind the last byte.
void PNGCBAPI FlushPngBytes(png_structp) {}

int FilterFlags(TIOPNGFilter filter) {
    switch (filter) {
        case ioPNG_FILTER_SUB: return PNG_FILTER_SUB;
        case ioPNG_FILTER_PAETH: return PNG_FILTER_PAETH;
        case ioPNG_FILTER_UP: return PNG_FILTER_UP;
        case ioPNG_FILTER_AVG: return PNG_FILTER_AVG;
        case ioPNG_FILTER_ALL: return PNG_ALL_FILTERS;
        default: return PNG_FILTER_NONE;
    }
}

/// A key without any printable Latin-1 character makes the library fail.
bool IsWritableKey(const std::string& key) {
    return std::any_of(key.begin(), key.end(), [](char c) {
        const auto code = static_cast<std::uint8_t>(c);
        return (code > 32 && code < 127) || code > 160;
    });
}

std::int32_t ColorDistance(TRGB a, TRGB b) {
    return std::abs(a.r - b.r) + std::abs(a.g - b.g) + std::abs(a.b - b.b);
}

png_uint_32 PixelsPerMeter(std::int32_t dpi) {
    return static_cast<png_uint_32>(RoundHalfEven(std::max(dpi, 0) * 100.0 / 2.54));
}

/// The alpha of an image, a byte a pixel, from a mask or from a plane. It is there when not all of
/// it is opaque.
class TPngAlpha {
public:
    TPngAlpha() = default;
    /// A mask of another size than the image's does not count.
    TPngAlpha(TZmMask& mask, TZmBitmap& bitmap);
    explicit TPngAlpha(TZmBitmap& bitmap);
    bool IsThere() const { return mask_ != nullptr || plane_ != nullptr; }
    /// Values of a row of the image, valid until the next call; nil when it cannot be reached.
    const std::uint8_t* GetRow(std::int32_t y);

private:
    const std::uint8_t* PadPlaneRow(std::int32_t y);

    TZmMask* mask_ = nullptr;
    TZmBitmap* plane_ = nullptr;
    std::vector<std::uint8_t> row_;  // empty where the source's own rows serve
};

TPngAlpha::TPngAlpha(TZmMask& mask, TZmBitmap& bitmap) {
    if (mask.GetFull() || mask.GetWidth() != bitmap.GetWidth() ||
        mask.GetHeight() != bitmap.GetHeight()) {
        return;
    }
    mask_ = &mask;
    if (mask.GetBitsPerPixel() != 8) {
        row_.resize(static_cast<std::size_t>(mask.GetWidth()));
    }
}

/// The plane's mark of being full may be out of date: its values decide.
TPngAlpha::TPngAlpha(TZmBitmap& bitmap) {
    TZmBitmap* const plane = bitmap.GetAlphaChannelRaw();
    if (plane == nullptr || plane->GetPixelFormat() != zm8g) {
        return;
    }
    const auto covered = static_cast<std::size_t>(std::min(plane->GetWidth(), bitmap.GetWidth()));
    const std::int32_t rows = std::min(plane->GetHeight(), bitmap.GetHeight());
    bool is_full = true;
    for (std::int32_t y = 0; is_full && y < rows; ++y) {
        const std::uint8_t* const row = plane->GetScanLine(y);
        is_full = row != nullptr &&
                  std::all_of(row, row + covered, [](std::uint8_t alpha) { return alpha == 255; });
    }
    if (is_full) {
        return;
    }
    plane_ = plane;
    if (plane->GetWidth() < bitmap.GetWidth() || plane->GetHeight() < bitmap.GetHeight()) {
        row_.resize(static_cast<std::size_t>(bitmap.GetWidth()));
    }
}

const std::uint8_t* TPngAlpha::GetRow(std::int32_t y) {
    if (plane_ != nullptr) {
        return row_.empty() ? plane_->GetScanLine(y) : PadPlaneRow(y);
    }
    const std::uint8_t* const mask_row = mask_->GetScanLine(y);
    if (row_.empty() || mask_row == nullptr) {
        return mask_row;
    }
    for (std::size_t x = 0; x < row_.size(); ++x) {
        row_[x] = (mask_row[x / 8] >> (7 - x % 8) & 1) != 0 ? 255 : 0;
    }
    return row_.data();
}

const std::uint8_t* TPngAlpha::PadPlaneRow(std::int32_t y) {
    std::fill(row_.begin(), row_.end(), std::uint8_t{255});
    if (y < plane_->GetHeight()) {
        const std::uint8_t* const values = plane_->GetScanLine(y);
        if (values == nullptr) {
            return nullptr;
        }
        const auto covered = static_cast<std::size_t>(plane_->GetWidth());
        std::memcpy(row_.data(), values, std::min(covered, row_.size()));
    }
    return row_.data();
}

class TPngWriter {
public:
    TPngWriter(TStream& stream, TZmBitmap& bitmap, TIOParams& params, TPngAlpha& alpha,
               TProgressRec& progress)
        : bitmap_(bitmap), params_(params), progress_(progress), alpha_(alpha) {
        session_.stream = &stream;
    }
    ~TPngWriter() { png_destroy_write_struct(&png_, &info_); }
    TPngWriter(const TPngWriter&) = delete;
    TPngWriter& operator=(const TPngWriter&) = delete;

    void Open();
    void ChooseLayout();
    [[nodiscard]] bool PrepareRows();
    [[nodiscard]] bool WriteHeader();
    [[nodiscard]] bool WriteRows();
    [[nodiscard]] bool WriteEnd();

private:
    bool PrepareBits();
    bool PreparePalette();
    void MapIndices();
    std::int32_t NearestEntry(TRGB color) const;
    std::int32_t QuantizedIndex(TRGB color);
    std::uint8_t PaletteIndex(TRGB color);
    void SetHeaderChunks();
    void SetPalette();
    void SetBackground();
    void CollectTexts();
    void LoopOverRows();
    const std::uint8_t* MakeRow(std::int32_t row);
    const std::uint8_t* MakeGrayRow(std::int32_t row);
    const std::uint8_t* MakeGray16Row(std::int32_t row);
    const std::uint8_t* MakeIndexRow(std::int32_t row);
    const std::uint8_t* MakeAlphaRow(std::int32_t row);

    TPngSession session_;
    png_structp png_ = nullptr;
    png_infop info_ = nullptr;
    TZmBitmap& bitmap_;
    TIOParams& params_;
    TProgressRec& progress_;
    TPngAlpha& alpha_;

    PngRowKind kind_ = PngRowKind::kColors;
    int color_type_ = PNG_COLOR_TYPE_RGB;
    int bit_depth_ = 8;
    std::unique_ptr<TZmBitmap> two_colors_;  // 1-bit copy of a source of another format
    std::unique_ptr<TZmQuantizer> quantizer_;
    std::vector<TRGB> color_map_;
    std::int32_t colors_used_ = 0;
    std::array<std::uint8_t, 256> moved_index_{};  // of the indices of a zm8p image with alpha
    TRGB last_color_;
    std::int32_t last_index_ = -1;
    std::optional<TZmRgbRows> rgb_rows_;
    std::vector<std::uint8_t> row_;
    std::vector<png_text> texts_;
    bool rows_done_ = false;
};

void TPngWriter::Open() {
    png_ = png_create_write_struct_2(PNG_LIBPNG_VER_STRING, &session_, LeavePngLibrary,
                                     IgnorePngWarning, &session_, AllocatePngMemory, FreePngMemory);
    if (png_ != nullptr) {
        info_ = png_create_info_struct(png_);
    }
    if (info_ == nullptr) {
        throw EZmException("Error on creating PNG");
    }
    png_set_write_fn(png_, &session_, WritePngBytes, FlushPngBytes);
    png_set_user_limits(png_, kPngMaxSide, kPngMaxSide);
}

/// One sample a pixel: 1 bit, or grey, or a palette of 8 bits; grey images keep 16 bits when
/// asked. More samples: RGB of 8 bits.
void TPngWriter::ChooseLayout() {
    if (params_.fSamplesPerPixel != 1) {
        kind_ = alpha_.IsThere() ? PngRowKind::kColorsAndAlpha : PngRowKind::kColors;
        color_type_ = alpha_.IsThere() ? PNG_COLOR_TYPE_RGB_ALPHA : PNG_COLOR_TYPE_RGB;
        return;
    }
    if (params_.fBitsPerSample == 1) {
        kind_ = PngRowKind::kBits;
        color_type_ = PNG_COLOR_TYPE_GRAY;
        bit_depth_ = 1;
    } else if (!alpha_.IsThere() && bitmap_.IsGrayScale()) {
        color_type_ = PNG_COLOR_TYPE_GRAY;
        bit_depth_ = params_.fBitsPerSample > 8 ? 16 : 8;
        kind_ = bit_depth_ == 16 ? PngRowKind::kGray16 : PngRowKind::kGray8;
    } else {
        color_type_ = PNG_COLOR_TYPE_PALETTE;
        kind_ = PngRowKind::kIndices;
    }
}

bool TPngWriter::PrepareRows() {
    const auto width = static_cast<std::size_t>(bitmap_.GetWidth());
    if (kind_ == PngRowKind::kBits) {
        return bitmap_.GetPixelFormat() == zm1g || PrepareBits();
    }
    if (kind_ == PngRowKind::kIndices && !PreparePalette()) {
        return false;
    }
    rgb_rows_.emplace(bitmap_);
    const bool has_four = kind_ == PngRowKind::kColorsAndAlpha;
    row_.resize(width * (has_four ? 4 : kind_ == PngRowKind::kGray16 ? 2 : 1));
    return true;
}

/// The two colours themselves where there are no more, else black and white by the format
/// conversion. That may change the format of its source, so it works on a copy.
bool TPngWriter::PrepareBits() {
    two_colors_ = std::make_unique<TZmBitmap>();
    TRGB dark;
    TRGB light;
    if (ReduceToTwoColors(bitmap_, *two_colors_, dark, light)) {
        return true;
    }
    two_colors_ = std::make_unique<TZmBitmap>();
    two_colors_->SetDefaultDitherMethod(bitmap_.GetDefaultDitherMethod());
    two_colors_->AssignImage(&bitmap_);
    two_colors_->RemoveAlphaChannel(/*merge=*/false, 0);
    return two_colors_->SetPixelFormat(zm1g);
}

/// With alpha entry 0 stands for what is transparent, and the others move up by one. Colours of
/// four bytes count as those of three, of which the quantizer keeps each when they are few.
bool TPngWriter::PreparePalette() {
    const TZmPixelFormat format = bitmap_.GetPixelFormat();
    TZmBitmap colors;
    if (format == zm32RGB && !CopyColors(bitmap_, colors)) {
        return false;
    }
    const std::int32_t wanted = alpha_.IsThere() ? 255 : 256;
    quantizer_ =
        std::make_unique<TZmQuantizer>(format == zm32RGB ? colors : bitmap_, color_map_, wanted);
    const auto present = static_cast<std::int32_t>(color_map_.size());
    const std::int32_t found = format == zm8p ? wanted : quantizer_->GetFoundColors();
    colors_used_ = std::max(1, std::min({found, wanted, present}));
    color_map_.resize(static_cast<std::size_t>(colors_used_));
    if (format == zm8p && alpha_.IsThere()) {
        MapIndices();
    }
    return true;
}

/// The last entry of a full palette has no place beside the transparent one.
void TPngWriter::MapIndices() {
    for (std::int32_t i = 0; i < 256; ++i) {
        const std::int32_t entry = i < colors_used_ ? i : NearestEntry(bitmap_.GetPalette(i));
        moved_index_[static_cast<std::size_t>(i)] = static_cast<std::uint8_t>(entry + 1);
    }
}

std::int32_t TPngWriter::NearestEntry(TRGB color) const {
    const auto nearest = std::min_element(
        color_map_.begin(), color_map_.end(),
        [color](TRGB a, TRGB b) { return ColorDistance(a, color) < ColorDistance(b, color); });
    return static_cast<std::int32_t>(nearest - color_map_.begin());
}

/// A colour that the quantizer does not know goes to the nearest one.
std::int32_t TPngWriter::QuantizedIndex(TRGB color) {
    const std::int32_t index = quantizer_->GetRGBIndex(color);
    return index >= 0 && index < colors_used_ ? index : NearestEntry(color);
}

std::uint8_t TPngWriter::PaletteIndex(TRGB color) {
    if (last_index_ < 0 || color != last_color_) {
        last_index_ = QuantizedIndex(color) + (alpha_.IsThere() ? 1 : 0);
        last_color_ = color;
    }
    return static_cast<std::uint8_t>(last_index_);
}

void TPngWriter::SetPalette() {
    png_color entries[256] = {};
    int count = 0;
    const auto add = [&entries, &count](TRGB color) {
        entries[count++] = png_color{color.r, color.g, color.b};
    };
    if (alpha_.IsThere()) {
        add(params_.fPNG_Background);
        const png_byte transparent = 0;
        png_set_tRNS(png_, info_, &transparent, 1, nullptr);
    }
    for (const TRGB color : color_map_) {
        add(color);
    }
    png_set_PLTE(png_, info_, entries, count);
}

void TPngWriter::SetBackground() {
    const TRGB color = params_.fPNG_Background;
    png_color_16 background = {};
    background.red = color.r;
    background.green = color.g;
    background.blue = color.b;
    background.gray = color.r;
    if (kind_ == PngRowKind::kBits) {
        background.gray = (color.r + color.g + color.b) / 3 >= 128 ? 1 : 0;
    } else if (kind_ == PngRowKind::kGray16) {
        background.gray = static_cast<png_uint_16>(color.r * 257);
    } else if (kind_ == PngRowKind::kIndices && !alpha_.IsThere()) {
        background.index = PaletteIndex(color);  // with alpha entry 0 is the background itself
    }
    png_set_bKGD(png_, info_, &background);
}

/// Runs inside the guard.
void TPngWriter::SetHeaderChunks() {
    png_set_IHDR(png_, info_, static_cast<png_uint_32>(bitmap_.GetWidth()),
                 static_cast<png_uint_32>(bitmap_.GetHeight()), bit_depth_, color_type_,
                 params_.fPNG_Interlaced ? PNG_INTERLACE_ADAM7 : PNG_INTERLACE_NONE,
                 PNG_COMPRESSION_TYPE_DEFAULT, PNG_FILTER_TYPE_DEFAULT);
    if (kind_ == PngRowKind::kIndices) {
        SetPalette();
    }
    png_set_pHYs(png_, info_, PixelsPerMeter(params_.GetDpiX()), PixelsPerMeter(params_.GetDpiY()),
                 PNG_RESOLUTION_METER);
    png_set_filter(png_, PNG_FILTER_TYPE_BASE, FilterFlags(params_.fPNG_Filter));
    SetBackground();
    png_set_compression_level(png_, std::clamp(params_.fPNG_Compression, -1, 9));
    if (!texts_.empty()) {
        png_set_text(png_, info_, texts_.data(), static_cast<int>(texts_.size()));
    }
    png_write_info(png_, info_);
    if (kind_ == PngRowKind::kColors || kind_ == PngRowKind::kColorsAndAlpha) {
        png_set_bgr(png_);
    }
    if (bit_depth_ == 16) {
        png_set_swap(png_);
    }
}

/// Plain texts, in Latin-1; those that came from a file as international ones stay that.
void TPngWriter::CollectTexts() {
    const std::size_t count =
        std::min(params_.fPNG_TextKeys.size(), params_.fPNG_TextValues.size());
    for (std::size_t i = 0; i < count; ++i) {
        std::string& key = params_.fPNG_TextKeys[i];
        std::string& value = params_.fPNG_TextValues[i];
        if (!IsWritableKey(key)) {
            continue;
        }
        png_text text = {};
        text.compression = PNG_TEXT_COMPRESSION_NONE;
        text.key = key.data();
        text.text = value.data();
        text.text_length = value.size();
        if (const TZmPngChunk* kept = params_.fPNG_Chunks.FindText(key, value); kept != nullptr) {
            text.compression = PNG_ITXT_COMPRESSION_NONE;
            text.itxt_length = std::exchange(text.text_length, 0);
            text.lang = const_cast<png_charp>(kept->language.c_str());  // only read
            text.lang_key = const_cast<png_charp>(kept->translated_key.c_str());
        }
        texts_.push_back(text);
    }
}

bool TPngWriter::WriteHeader() {
    CollectTexts();
    return RunPngGuarded(png_, [this] { SetHeaderChunks(); });
}

const std::uint8_t* TPngWriter::MakeGrayRow(std::int32_t row) {
    if (bitmap_.GetPixelFormat() == zm8g) {
        return bitmap_.GetScanLine(row);
    }
    const TRGB* colors = rgb_rows_->GetRow(row);
    if (colors == nullptr) {
        return nullptr;
    }
    for (std::size_t x = 0; x < row_.size(); ++x) {
        row_[x] = colors[x].r;
    }
    return row_.data();
}

const std::uint8_t* TPngWriter::MakeGray16Row(std::int32_t row) {
    if (bitmap_.GetPixelFormat() == zm16g) {
        return bitmap_.GetScanLine(row);
    }
    const TRGB* colors = rgb_rows_->GetRow(row);
    if (colors == nullptr) {
        return nullptr;
    }
    for (std::size_t i = 0; i < row_.size(); ++i) {
        row_[i] = colors[i / 2].r;  // a byte times 257 is that byte twice
    }
    return row_.data();
}

const std::uint8_t* TPngWriter::MakeIndexRow(std::int32_t row) {
    const bool has_indices = bitmap_.GetPixelFormat() == zm8p;
    const std::uint8_t* indices = has_indices ? bitmap_.GetScanLine(row) : nullptr;
    if (has_indices && !alpha_.IsThere()) {
        return indices;
    }
    const TRGB* colors = has_indices ? nullptr : rgb_rows_->GetRow(row);
    const std::uint8_t* alpha_row = alpha_.IsThere() ? alpha_.GetRow(row) : nullptr;
    if ((indices == nullptr && colors == nullptr) || (alpha_.IsThere() && alpha_row == nullptr)) {
        return nullptr;
    }
    for (std::size_t x = 0; x < row_.size(); ++x) {
        const bool is_opaque = alpha_row == nullptr || alpha_row[x] == 255;
        row_[x] = !is_opaque    ? std::uint8_t{0}
                  : has_indices ? moved_index_[indices[x]]
                                : PaletteIndex(colors[x]);
    }
    return row_.data();
}

const std::uint8_t* TPngWriter::MakeAlphaRow(std::int32_t row) {
    const TRGB* colors = rgb_rows_->GetRow(row);
    const std::uint8_t* alpha_row = alpha_.GetRow(row);
    if (colors == nullptr || alpha_row == nullptr) {
        return nullptr;
    }
    std::uint8_t* target = row_.data();
    const std::int32_t width = bitmap_.GetWidth();
    for (std::int32_t x = 0; x < width; ++x) {
        target[0] = colors[x].b;
        target[1] = colors[x].g;
        target[2] = colors[x].r;
        target[3] = alpha_row[x];
        target += 4;
    }
    return row_.data();
}

/// One row as the file has it; nil when the image's row cannot be reached.
const std::uint8_t* TPngWriter::MakeRow(std::int32_t row) {
    switch (kind_) {
        case PngRowKind::kBits:
            return (two_colors_ != nullptr ? *two_colors_ : bitmap_).GetScanLine(row);
        case PngRowKind::kGray8: return MakeGrayRow(row);
        case PngRowKind::kGray16: return MakeGray16Row(row);
        case PngRowKind::kIndices: return MakeIndexRow(row);
        case PngRowKind::kColorsAndAlpha: return MakeAlphaRow(row);
        default: return reinterpret_cast<const std::uint8_t*>(rgb_rows_->GetRow(row));
    }
}

/// Runs inside the guard: no object with a destructor lives here while the library works.
void TPngWriter::LoopOverRows() {
    const int passes = png_set_interlace_handling(png_);
    const std::int32_t height = bitmap_.GetHeight();
    progress_.val = 0;
    progress_.per1 = 100.0 / (static_cast<double>(height) * passes);
    const std::uint8_t* row_bytes = nullptr;
    std::int64_t units_done = 0;
    for (int pass = 0; pass < passes; ++pass) {
        for (std::int32_t row = 0; row < height; ++row) {
            // The library skips rows that are no part of the pass, whatever they hold.
            const bool is_needed = passes == 1 || row_bytes == nullptr ||
                                   PNG_ROW_IN_INTERLACE_PASS(static_cast<png_uint_32>(row), pass);
            if (is_needed) {
                row_bytes = MakeRow(row);
            }
            if (row_bytes == nullptr) {
                return;
            }
            png_write_row(png_, row_bytes);
            if (!StepProgress(progress_, ++units_done)) {
                return;
            }
        }
    }
    rows_done_ = true;
}

bool TPngWriter::WriteRows() {
    return RunPngGuarded(png_, [this] { LoopOverRows(); }) && rows_done_;
}

bool TPngWriter::WriteEnd() {
    return RunPngGuarded(png_, [this] { png_write_end(png_, nullptr); });
}

bool WritePng(TPngWriter& writer) {
    writer.ChooseLayout();
    return writer.PrepareRows() && writer.WriteHeader() && writer.WriteRows() && writer.WriteEnd();
}

void WriteGuarded(TStream& stream, TZmBitmap& bitmap, TIOParams& params, TPngAlpha& alpha,
                  TProgressRec& progress) {
    bool is_written = false;
    TZmBufferedWriteStream buffered(&stream, kPngStreamBufferBytes);
    TPngWriter writer(buffered, bitmap, params, alpha, progress);
    writer.Open();
    try {
        is_written = !bitmap.IsEmpty() && WritePng(writer);
        buffered.Seek(0, soCurrent);  // forces the buffered bytes out
    } catch (const std::exception&) {
        // The stream or the memory gave up: reported by the flag, like any failed write.
        is_written = false;
    }
    if (!is_written || buffered.HasFailed()) {
        *progress.Aborting = true;
    }
}

}  // namespace

void WritePNGStream(TStream& stream, TZmBitmap& bitmap, TIOParams& params, TZmMask* alpha,
                    TProgressRec& progress) {
    TPngAlpha rows = alpha != nullptr ? TPngAlpha(*alpha, bitmap) : TPngAlpha();
    WriteGuarded(stream, bitmap, params, rows, progress);
}

void WritePNGStreamWithAlpha(TStream& stream, TZmBitmap& bitmap, TIOParams& params,
                             TProgressRec& progress) {
    TPngAlpha rows(bitmap);
    WriteGuarded(stream, bitmap, params, rows, progress);
}

}  // namespace zm
