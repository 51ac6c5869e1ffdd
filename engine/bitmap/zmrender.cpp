/// The pixel transfer routines: a reader for each source format, which makes RGB of a pixel, and
/// the row loops that all readers share. The plain loop goes pixel by pixel as the rule is
/// stated; the fast one splits a row into reading, render operation and mixing.

#include <algorithm>
#include <array>
#include <cmath>
#include <cstring>

#include "engine/bitmap/zmblend_p.h"
#include "engine/bitmap/zmpixelformats.h"
#include "engine/bitmap/zmrender_p.h"
#include "engine/bitmap/zmrender_readers_p.h"
#include "engine/foundation/zmnumbers.h"

namespace zm {
namespace {

/// One destination row of a transfer.
struct TRenderRow {
    const std::uint8_t* source = nullptr;
    const std::uint8_t* alpha = nullptr;  ///< by source column; nil: all opaque
    std::int32_t alpha_width = 0;         ///< columns from here on are opaque
    TRGB* dest = nullptr;                 ///< first pixel of the area
    std::int32_t width = 0;
    std::int32_t source_y = 0;
    std::uint8_t number = 0;  ///< low byte of the destination row
};

/// Room for the steps of the fast loop, one row each.
struct TRenderBuffers {
    std::vector<TRGB> colors;
    std::vector<TRGB> blended;
    std::vector<std::uint8_t> alpha;
};

std::uint8_t AlphaAt(const TRenderRow& row, std::int32_t column) {
    return row.alpha != nullptr && column < row.alpha_width ? row.alpha[column] : 255;
}

/// The weight of a pixel: alpha under its ceiling, times opacity, truncated.
std::uint8_t WeightOf(std::uint8_t alpha, const TZmRenderTransfer& transfer) {
    const std::int32_t limited = std::min<std::int32_t>(alpha, transfer.transparency);
    return static_cast<std::uint8_t>(TruncToInt(limited * transfer.opacity));
}

/// Weights of all alpha values, and the product and shift that give the same ones, where they
/// do: for those mixing runs in vectors.
class TWeights {
public:
    explicit TWeights(const TZmRenderTransfer& transfer) {
        rule_.limit = static_cast<std::uint8_t>(std::clamp(transfer.transparency, 0, 255));
        rule_.factor_q16 =
            static_cast<std::uint32_t>(TruncToInt(std::ceil(transfer.opacity * 65536.0)));
        for (std::size_t alpha = 0; alpha < table_.size(); ++alpha) {
            const auto byte = static_cast<std::uint8_t>(alpha);
            table_[alpha] = WeightOf(byte, transfer);
            has_rule_ = has_rule_ && table_[alpha] == rule_.WeightOf(byte);
        }
    }

    std::uint8_t Of(std::uint8_t alpha) const { return table_[alpha]; }
    /// Mixes pixels by alpha; without a rule the bytes of `alpha` become the weights.
    void MixByAlpha(const TRGB* colors, std::uint8_t* alpha, TRGB* dest, std::int32_t width) const {
        if (!has_rule_) {
            for (std::int32_t x = 0; x < width; ++x) {
                alpha[x] = table_[alpha[x]];
            }
        }
        MixRow(colors, alpha, has_rule_ ? rule_ : TMixRule{}, dest, width);
    }
    /// The same where alpha is not to be changed; only with a rule.
    void MixByPlane(const TRGB* colors, const std::uint8_t* alpha, TRGB* dest,
                    std::int32_t width) const {
        MixRow(colors, alpha, rule_, dest, width);
    }
    bool HasRule() const { return has_rule_; }

private:
    TMixRule rule_;
    bool has_rule_ = true;
    std::array<std::uint8_t, 256> table_{};
};

// The plain loop.

template <bool kIsBlending, typename Reader>
void RenderRowPlain(const TRenderRow& row, const Reader& reader,
                    const TZmRenderTransfer& transfer) {
    for (std::int32_t x = 0; x < row.width; ++x) {
        const std::int32_t column = transfer.columns[x];
        TRGB& dest = row.dest[x];
        TRGB color = reader.Read(row.source, column, row.source_y);
        if (transfer.operation != zmlNormal) {
            TRGB blended = dest;
            ZmBlendPixel(color, blended, transfer.operation, row.number);
            color = blended;
        }
        if constexpr (kIsBlending) {
            const std::uint8_t weight = WeightOf(AlphaAt(row, column), transfer);
            color = TRGB{MixChannel(color.b, dest.b, weight), MixChannel(color.g, dest.g, weight),
                         MixChannel(color.r, dest.r, weight)};
        }
        dest = color;
    }
}

// The fast loop.

/// Source columns that follow one another, so that runs need no table.
bool IsOneToOne(const std::int32_t* columns, std::int32_t width) {
    for (std::int32_t x = 1; x < width; ++x) {
        if (columns[x] != columns[x - 1] + 1) {
            return false;
        }
    }
    return true;
}

/// How the whole of a transfer runs in rows.
struct TFastPlan {
    TFastPlan(const TZmRenderTransfer& transfer, std::int32_t width)
        : is_one_to_one(IsOneToOne(transfer.columns, width)), weights(transfer) {}
    bool is_one_to_one;
    TWeights weights;
};

/// The alpha of the row's pixels in a buffer.
void GatherAlpha(const TRenderRow& row, const TZmRenderTransfer& transfer, const TFastPlan& plan,
                 std::uint8_t* alpha) {
    if (!plan.is_one_to_one) {
        for (std::int32_t x = 0; x < row.width; ++x) {
            alpha[x] = AlphaAt(row, transfer.columns[x]);
        }
        return;
    }
    const std::int32_t first = transfer.columns[0];
    const std::int32_t covered =
        row.alpha == nullptr ? 0 : std::clamp(row.alpha_width - first, 0, row.width);
    if (covered > 0) {
        std::memcpy(alpha, row.alpha + first, static_cast<std::size_t>(covered));
    }
    std::memset(alpha + covered, 255, static_cast<std::size_t>(row.width - covered));
}

void MixRowByAlpha(const TRGB* colors, const TRenderRow& row, const TZmRenderTransfer& transfer,
                   const TFastPlan& plan, TRenderBuffers& buffers) {
    if (transfer.plane == nullptr) {
        // The row of alpha holds one value throughout.
        MixRowEvenly(colors, plan.weights.Of(AlphaAt(row, transfer.columns[0])), row.dest,
                     row.width);
        return;
    }
    const std::int32_t last = transfer.columns[row.width - 1];
    if (plan.is_one_to_one && plan.weights.HasRule() && last < row.alpha_width) {
        plan.weights.MixByPlane(colors, row.alpha + transfer.columns[0], row.dest, row.width);
        return;
    }
    GatherAlpha(row, transfer, plan, buffers.alpha.data());
    plan.weights.MixByAlpha(colors, buffers.alpha.data(), row.dest, row.width);
}

/// The row's source pixels, in the buffer or where they are.
template <typename Reader>
const TRGB* ReadColors(const TRenderRow& row, const Reader& reader,
                       const TZmRenderTransfer& transfer, const TFastPlan& plan,
                       TRenderBuffers& buffers) {
    const std::int32_t first = transfer.columns[0];
    const TRGB* const run = plan.is_one_to_one ? reader.FindRun(row.source, first) : nullptr;
    if (run != nullptr) {
        return run;
    }
    TRGB* const colors = buffers.colors.data();
    if (!plan.is_one_to_one || !reader.ReadRun(row.source, first, row.width, colors)) {
        reader.ReadRow(row.source, transfer.columns, row.width, row.source_y, colors);
    }
    return colors;
}

template <bool kIsBlending, typename Reader>
void RenderRowFast(const TRenderRow& row, const Reader& reader, const TZmRenderTransfer& transfer,
                   const TFastPlan& plan, TRenderBuffers& buffers) {
    const TRGB* const colors = ReadColors(row, reader, transfer, plan, buffers);
    const auto width = static_cast<std::size_t>(row.width);
    if (transfer.operation == zmlNormal) {
        if constexpr (kIsBlending) {
            MixRowByAlpha(colors, row, transfer, plan, buffers);
        } else {
            std::memcpy(static_cast<void*>(row.dest), colors, width * sizeof(TRGB));
        }
        return;
    }
    if constexpr (kIsBlending) {
        std::copy_n(row.dest, width, buffers.blended.begin());
        BlendRow(colors, buffers.blended.data(), row.width, transfer.operation, row.number);
        MixRowByAlpha(buffers.blended.data(), row, transfer, plan, buffers);
    } else {
        BlendRow(colors, row.dest, row.width, transfer.operation, row.number);
    }
}

// The image.

/// Whether two runs of bytes share one; the fast loop needs them apart.
bool Overlap(const void* a, std::int64_t a_bytes, const void* b, std::int64_t b_bytes) {
    const auto first = reinterpret_cast<std::uintptr_t>(a);
    const auto second = reinterpret_cast<std::uintptr_t>(b);
    return a != nullptr && first < second + static_cast<std::uint64_t>(b_bytes) &&
           second < first + static_cast<std::uint64_t>(a_bytes);
}

void CopyRowAbove(const TZmRenderTransfer& transfer, std::int32_t y) {
    const TRowHold above(*transfer.destination, y - 1);
    const TRowHold row(*transfer.destination, y);
    if (above.Get() != nullptr && row.Get() != nullptr) {
        const std::int64_t offset = std::int64_t{transfer.area.left} * 3;
        const auto bytes = static_cast<std::size_t>(transfer.area.right - transfer.area.left) * 3;
        std::memcpy(row.Get() + offset, above.Get() + offset, bytes);
    }
}

/// Rows of the alpha plane, or the one row that stands for it.
class TAlphaRows {
public:
    explicit TAlphaRows(const TZmRenderTransfer& transfer)
        : plane_(transfer.plane),
          row_alpha_(transfer.row_alpha),
          width_(plane_ != nullptr ? plane_->GetWidth() : kMaxInt32) {}

    const std::uint8_t* GetRow(std::int32_t y) {
        if (plane_ == nullptr) {
            return row_alpha_;
        }
        return y < plane_->GetHeight() ? plane_->GetScanLine(y) : nullptr;
    }
    std::int32_t GetWidth() const { return width_; }
    /// Bytes of a row that GetRow gave, for the test whether rows overlap.
    std::int64_t GetRowBytes() const { return plane_ != nullptr ? width_ : 0; }

private:
    TZmBitmap* plane_;
    const std::uint8_t* row_alpha_;
    std::int32_t width_;
};

TRenderBuffers MakeBuffers(const TZmRenderTransfer& transfer, std::size_t width) {
    TRenderBuffers buffers;
    if (transfer.loop == TRenderLoop::kFast) {
        buffers.colors.resize(width);
        buffers.blended.resize(transfer.operation != zmlNormal ? width : 0);
        buffers.alpha.resize(width);
    }
    return buffers;
}

/// All rows of a transfer, from the top.
template <bool kIsBlending, typename Reader>
class TRowRenderer {
public:
    TRowRenderer(TZmBitmap& source, const TZmRenderTransfer& transfer, const Reader& reader)
        : source_(source),
          transfer_(transfer),
          reader_(reader),
          width_(transfer.area.right - transfer.area.left),
          source_bytes_(source.GetRowLen()),
          plan_(transfer, width_),
          alpha_rows_(transfer),
          buffers_(MakeBuffers(transfer, static_cast<std::size_t>(width_))) {}

    void Run() {
        const std::int32_t* source_y = transfer_.rows;
        for (std::int32_t y = transfer_.area.top; y < transfer_.area.bottom; ++y, ++source_y) {
            const bool is_first = y == transfer_.area.top;
            if (transfer_.solid_background && !is_first && source_y[-1] == *source_y) {
                CopyRowAbove(transfer_, y);
            } else {
                RenderRow(y, *source_y);
            }
        }
    }

private:
    void RenderRow(std::int32_t y, std::int32_t source_y) {
        // The destination first: a source may be a view of the same file-backed image.
        const TRowHold to(*transfer_.destination, y);
        const TRowHold from(source_, source_y);
        if (from.Get() == nullptr || to.Get() == nullptr) {
            return;
        }
        TRenderRow row;
        row.source = from.Get();
        row.source_y = source_y;
        row.dest = reinterpret_cast<TRGB*>(to.Get()) + transfer_.area.left;
        row.width = width_;
        row.number = static_cast<std::uint8_t>(y & 255);
        if constexpr (kIsBlending) {
            row.alpha = alpha_rows_.GetRow(source_y);
            row.alpha_width = row.alpha != nullptr ? alpha_rows_.GetWidth() : 0;
        }
        if (transfer_.loop == TRenderLoop::kFast && IsApart(row)) {
            RenderRowFast<kIsBlending>(row, reader_, transfer_, plan_, buffers_);
        } else {
            RenderRowPlain<kIsBlending>(row, reader_, transfer_);
        }
    }

    /// Whether the destination's pixels share no byte with what is read.
    bool IsApart(const TRenderRow& row) const {
        const std::int64_t dest_bytes = std::int64_t{width_} * 3;
        return !Overlap(row.source, source_bytes_, row.dest, dest_bytes) &&
               !Overlap(row.alpha, alpha_rows_.GetRowBytes(), row.dest, dest_bytes);
    }

    TZmBitmap& source_;
    const TZmRenderTransfer& transfer_;
    const Reader& reader_;
    std::int32_t width_;
    std::int64_t source_bytes_;
    TFastPlan plan_;
    TAlphaRows alpha_rows_;
    TRenderBuffers buffers_;
};

template <typename Reader>
void TransferRows(TZmBitmap& source, const TZmRenderTransfer& transfer, const Reader& reader) {
    TRowRenderer<false, Reader>(source, transfer, reader).Run();
}

template <typename Reader>
void BlendRows(TZmBitmap& source, const TZmRenderTransfer& transfer, const Reader& reader) {
    TRowRenderer<true, Reader>(source, transfer, reader).Run();
}

using TGray8Reader = TGrayReader<std::uint8_t>;
using TGray16Reader = TGrayReader<std::uint16_t>;
using TCMYKReader = TConvertingReader<4>;
using TCIELabReader = TConvertingReader<3>;

}  // namespace

void TZmBitmapRendering::TransferPixels_zm1g(const TZmRenderTransfer& transfer) {
    TransferRows(Self(), transfer, TBitReader());
}

void TZmBitmapRendering::BlendPixels_zm1g(const TZmRenderTransfer& transfer) {
    BlendRows(Self(), transfer, TBitReader());
}

void TZmBitmapRendering::TransferPixels_zm8p(const TZmRenderTransfer& transfer) {
    if (GetPaletteLen() > 0) {
        TransferRows(Self(), transfer, TPaletteReader(GetPaletteArray()));
    }
}

void TZmBitmapRendering::BlendPixels_zm8p(const TZmRenderTransfer& transfer) {
    if (GetPaletteLen() > 0) {
        BlendRows(Self(), transfer, TPaletteReader(GetPaletteArray()));
    }
}

void TZmBitmapRendering::TransferPixels_zm8g(const TZmRenderTransfer& transfer) {
    TransferRows(Self(), transfer, TGray8Reader(fBlackValue, fWhiteValue));
}

void TZmBitmapRendering::BlendPixels_zm8g(const TZmRenderTransfer& transfer) {
    BlendRows(Self(), transfer, TGray8Reader(fBlackValue, fWhiteValue));
}

void TZmBitmapRendering::TransferPixels_zm16g(const TZmRenderTransfer& transfer) {
    TransferRows(Self(), transfer, TGray16Reader(fBlackValue, fWhiteValue));
}

void TZmBitmapRendering::BlendPixels_zm16g(const TZmRenderTransfer& transfer) {
    BlendRows(Self(), transfer, TGray16Reader(fBlackValue, fWhiteValue));
}

void TZmBitmapRendering::TransferPixels_zm24RGB(const TZmRenderTransfer& transfer) {
    TransferRows(Self(), transfer, TColorReader<zm24RGB>(*this));
}

void TZmBitmapRendering::BlendPixels_zm24RGB(const TZmRenderTransfer& transfer) {
    BlendRows(Self(), transfer, TColorReader<zm24RGB>(*this));
}

void TZmBitmapRendering::TransferPixels_zm32f(const TZmRenderTransfer& transfer) {
    TransferRows(Self(), transfer, TFloatReader(fBlackValue, fWhiteValue));
}

void TZmBitmapRendering::BlendPixels_zm32f(const TZmRenderTransfer& transfer) {
    BlendRows(Self(), transfer, TFloatReader(fBlackValue, fWhiteValue));
}

void TZmBitmapRendering::TransferPixels_zmCMYK(const TZmRenderTransfer& transfer) {
    TransferRows(Self(), transfer, TCMYKReader(zmCMYK));
}

void TZmBitmapRendering::BlendPixels_zmCMYK(const TZmRenderTransfer& transfer) {
    BlendRows(Self(), transfer, TCMYKReader(zmCMYK));
}

void TZmBitmapRendering::TransferPixels_zm48RGB(const TZmRenderTransfer& transfer) {
    TransferRows(Self(), transfer, TColorReader<zm48RGB>(*this));
}

void TZmBitmapRendering::BlendPixels_zm48RGB(const TZmRenderTransfer& transfer) {
    BlendRows(Self(), transfer, TColorReader<zm48RGB>(*this));
}

void TZmBitmapRendering::TransferPixels_zmCIELab(const TZmRenderTransfer& transfer) {
    TransferRows(Self(), transfer, TCIELabReader(zmCIELab));
}

void TZmBitmapRendering::BlendPixels_zmCIELab(const TZmRenderTransfer& transfer) {
    BlendRows(Self(), transfer, TCIELabReader(zmCIELab));
}

void TZmBitmapRendering::TransferPixels_zm32RGB(const TZmRenderTransfer& transfer) {
    TransferRows(Self(), transfer, TColorReader<zm32RGB>());
}

void TZmBitmapRendering::BlendPixels_zm32RGB(const TZmRenderTransfer& transfer) {
    BlendRows(Self(), transfer, TColorReader<zm32RGB>());
}

void TZmBitmapRendering::TransferPixels_any(const TZmRenderTransfer& transfer) {
    TransferRows(Self(), transfer, TAnyReader(Self()));
}

void TZmBitmapRendering::BlendPixels_any(const TZmRenderTransfer& transfer) {
    BlendRows(Self(), transfer, TAnyReader(Self()));
}

/// The routine of the source's format.
void TZmBitmapRendering::TransferPixels(const TZmRenderTransfer& transfer, bool is_blending) {
    switch (GetPixelFormat()) {
        case zm1g: return is_blending ? BlendPixels_zm1g(transfer) : TransferPixels_zm1g(transfer);
        case zm8p: return is_blending ? BlendPixels_zm8p(transfer) : TransferPixels_zm8p(transfer);
        case zm8g: return is_blending ? BlendPixels_zm8g(transfer) : TransferPixels_zm8g(transfer);
        case zm16g:
            return is_blending ? BlendPixels_zm16g(transfer) : TransferPixels_zm16g(transfer);
        case zm24RGB:
            return is_blending ? BlendPixels_zm24RGB(transfer) : TransferPixels_zm24RGB(transfer);
        case zm32f:
            return is_blending ? BlendPixels_zm32f(transfer) : TransferPixels_zm32f(transfer);
        case zmCMYK:
            return is_blending ? BlendPixels_zmCMYK(transfer) : TransferPixels_zmCMYK(transfer);
        case zm48RGB:
            return is_blending ? BlendPixels_zm48RGB(transfer) : TransferPixels_zm48RGB(transfer);
        case zmCIELab:
            return is_blending ? BlendPixels_zmCIELab(transfer) : TransferPixels_zmCIELab(transfer);
        case zm32RGB:
            return is_blending ? BlendPixels_zm32RGB(transfer) : TransferPixels_zm32RGB(transfer);
        default: return is_blending ? BlendPixels_any(transfer) : TransferPixels_any(transfer);
    }
}

}  // namespace zm
