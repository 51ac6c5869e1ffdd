// TZmQuantizer: which way a palette is found, and the answers to "which entry is this colour".

#include <algorithm>
#include <array>
#include <cstddef>
#include <cstdlib>
#include <optional>

#include "engine/bitmap/zmquantizer.h"
#include "engine/bitmap/zmrgbrows.h"
#include "engine/bitmap/zmrowconvert.h"
#include "engine/bitmap/zmxBitmaps.h"
#include "engine/foundation/zmnumbers.h"
#include "engine/foundation/zmsettings.h"
#include "engine/proc/neurquant_p.h"

namespace zm {
namespace {

constexpr std::int32_t kMinColors = 1;
constexpr std::int32_t kMaxColors = 1024;
constexpr std::int32_t kNeuralMethod = 0;
constexpr std::int32_t kBoxMethod = 1;
constexpr std::int32_t kAutomatic = -1;
// From this many colours on the automatic choice is the network.
constexpr std::int32_t kNeuralMinColors = 128;

std::uint32_t KeyOf(TRGB color) {
    return static_cast<std::uint32_t>(color.b | color.g << 8 | color.r << 16);
}

std::size_t SpreadKey(std::uint32_t key, std::uint32_t bits) {
    return (key * 2654435761u) >> (32 - bits);
}

// A set of colours that remembers the order in which they came; an open hash table.
class TColorList {
public:
    explicit TColorList(std::int32_t max_colors)
        : max_colors_(static_cast<std::size_t>(max_colors)), slots_(kSlots, kFree) {}

    // False when the colour is new and there is no room for it.
    bool Add(TRGB color) {
        std::int16_t& slot = SlotOf(color);
        if (slot != kFree) {
            return true;
        }
        if (colors_.size() >= max_colors_) {
            return false;
        }
        slot = static_cast<std::int16_t>(colors_.size());
        colors_.push_back(color);
        return true;
    }
    // Number of the colour, or of the first of the nearest ones.
    std::int32_t Find(TRGB color) {
        const std::int16_t slot = SlotOf(color);
        return slot != kFree ? slot : FindNearest(color);
    }
    const std::vector<TRGB>& Colors() const { return colors_; }

private:
    static constexpr std::uint32_t kSlotBits = 12;  // four slots for each colour at most
    static constexpr std::size_t kSlots = std::size_t{1} << kSlotBits;
    static constexpr std::int16_t kFree = -1;

    std::int16_t& SlotOf(TRGB color) {
        std::size_t at = SpreadKey(KeyOf(color), kSlotBits);
        while (slots_[at] != kFree && colors_[static_cast<std::size_t>(slots_[at])] != color) {
            at = (at + 1) % kSlots;
        }
        return slots_[at];
    }
    std::int32_t FindNearest(TRGB color) const {
        const auto distance = [color](TRGB entry) {
            return std::abs(entry.r - color.r) + std::abs(entry.g - color.g) +
                   std::abs(entry.b - color.b);
        };
        const auto nearest = std::min_element(colors_.begin(), colors_.end(), [&](TRGB a, TRGB b) {
            return distance(a) < distance(b);
        });
        return static_cast<std::int32_t>(nearest - colors_.begin());
    }

    std::size_t max_colors_;
    std::vector<TRGB> colors_;
    std::vector<std::int16_t> slots_;
};

// All answers given so far, for methods whose search is long. Colours near each other lie
// together, in blocks of 8 levels a channel that are made when first asked for. Cells without a
// block share block 0, which knows nothing: one test tells whether an answer is there.
class TAnswerMemo {
public:
    template <typename Search>
    std::int32_t Get(TRGB color, const Search& search) {
        const std::int32_t known = answers_[PlaceOfBlock(color) + PlaceOf(color)];
        return known != kUnknown ? known : Learn(color, search(color));
    }

private:
    using TBlockNumber = std::uint16_t;
    static constexpr std::size_t kCells = 32 * 32 * 32;
    static constexpr std::size_t kBlockSize = 8 * 8 * 8;
    static constexpr std::int16_t kUnknown = -1;

    std::int32_t Learn(TRGB color, std::int32_t answer) {
        TBlockNumber& number = block_numbers_[CellOf(color)];
        if (number == 0) {
            number = static_cast<TBlockNumber>(answers_.size() / kBlockSize);
            answers_.resize(answers_.size() + kBlockSize, kUnknown);
        }
        answers_[PlaceOfBlock(color) + PlaceOf(color)] = static_cast<std::int16_t>(answer);
        return answer;
    }
    std::size_t PlaceOfBlock(TRGB color) const {
        return std::size_t{block_numbers_[CellOf(color)]} * kBlockSize;
    }
    static std::size_t CellOf(TRGB color) {
        return static_cast<std::size_t>(color.b >> 3 | color.g >> 3 << 5 | color.r >> 3 << 10);
    }
    static std::size_t PlaceOf(TRGB color) {
        return static_cast<std::size_t>((color.b & 7) | (color.g & 7) << 3 | (color.r & 7) << 6);
    }

    std::vector<TBlockNumber> block_numbers_ = std::vector<TBlockNumber>(kCells);  // 0: none yet
    std::vector<std::int16_t> answers_ = std::vector<std::int16_t>(kBlockSize, kUnknown);
};

// The distinct colours of an image, or nothing when there are more than `max_colors`.
std::optional<TColorList> CollectColors(TZmBitmap& source, std::int32_t max_colors) {
    TColorList list(max_colors);
    TZmRgbRows rows(source);
    const std::int32_t width = source.GetWidth();
    for (std::int32_t y = 0; y < source.GetHeight(); ++y) {
        const TRGB* row = rows.GetRow(y);
        for (std::int32_t x = 0; row != nullptr && x < width; ++x) {
            const bool is_repeated = x > 0 && row[x] == row[x - 1];
            if (!is_repeated && !list.Add(row[x])) {
                return std::nullopt;
            }
        }
    }
    return list;
}

std::int32_t ChooseMethod(std::int32_t color_count) {
    const std::int32_t setting = ZmGlobalSettings().fColorReductionAlgorithm;
    if (setting == kAutomatic) {
        return color_count >= kNeuralMinColors ? kNeuralMethod : kBoxMethod;
    }
    return setting == kBoxMethod ? kBoxMethod : kNeuralMethod;
}

}  // namespace

struct TZmQuantizer::TState {
    std::int32_t fMethod = kNeuralMethod;
    bool fGrayScale = false;
    std::int32_t fNCol = 0;
    std::int32_t fFoundColors = 0;
    std::optional<TColorList> fSQ;  // the exact colours, when they are few
    std::unique_ptr<TNeuralPalette> neural;
    std::unique_ptr<TBoxPalette> boxes;
    std::vector<TRGB> own_palette;  // of a zm8p source
    TAnswerMemo memo;

    void FillPalette(TZmBitmap& source, std::vector<TRGB>& color_map);
    bool TakeExactColors(TZmBitmap& source, std::vector<TRGB>& color_map);
    void TakeOwnPalette(TZmBitmap& source, std::vector<TRGB>& color_map);
    void MakeGrayRamp(std::vector<TRGB>& color_map) const;
    void RunMethod(TZmBitmap& source, std::vector<TRGB>& color_map);
    std::int32_t FindInOwnPalette(TRGB color) const;
    // Calls `use` with the function that looks one colour up. A caller with many colours goes
    // through them inside `use`, which is compiled once for each kind of look-up.
    template <typename Use>
    void WithLookup(const Use& use);
};

bool TZmQuantizer::TState::TakeExactColors(TZmBitmap& source, std::vector<TRGB>& color_map) {
    fSQ = CollectColors(source, fNCol);
    if (!fSQ) {
        return false;
    }
    std::copy(fSQ->Colors().begin(), fSQ->Colors().end(), color_map.begin());
    fFoundColors = static_cast<std::int32_t>(fSQ->Colors().size());
    return true;
}

void TZmQuantizer::TState::TakeOwnPalette(TZmBitmap& source, std::vector<TRGB>& color_map) {
    own_palette = source.GetPaletteArray();
    const std::size_t count = std::min(own_palette.size(), color_map.size());
    std::copy_n(own_palette.begin(), count, color_map.begin());
}

void TZmQuantizer::TState::MakeGrayRamp(std::vector<TRGB>& color_map) const {
    for (std::int32_t i = 0; i < fNCol; ++i) {
        const std::uint8_t gray = Clamp8(TruncToInt(256.0 / fNCol * i));
        color_map[static_cast<std::size_t>(i)] = TRGB{gray, gray, gray};
    }
}

void TZmQuantizer::TState::RunMethod(TZmBitmap& source, std::vector<TRGB>& color_map) {
    fMethod = ChooseMethod(fNCol);
    if (fMethod == kBoxMethod) {
        boxes = std::make_unique<TBoxPalette>(source, fNCol);
        boxes->WritePalette(color_map);
        fFoundColors = boxes->GetBoxCount();
        return;
    }
    neural =
        std::make_unique<TNeuralPalette>(source, fNCol, ZmGlobalSettings().fColorReductionQuality);
    neural->WritePalette(color_map);
}

void TZmQuantizer::TState::FillPalette(TZmBitmap& source, std::vector<TRGB>& color_map) {
    const TZmPixelFormat format = source.GetPixelFormat();
    fGrayScale = source.IsGrayScale();
    if (!fGrayScale && format == zm24RGB && TakeExactColors(source, color_map)) {
        return;
    }
    if (format == zm8p) {
        TakeOwnPalette(source, color_map);
    } else if (fGrayScale) {
        MakeGrayRamp(color_map);
    } else {
        RunMethod(source, color_map);
    }
}

std::int32_t TZmQuantizer::TState::FindInOwnPalette(TRGB color) const {
    return static_cast<std::int32_t>(std::find(own_palette.begin(), own_palette.end(), color) -
                                     own_palette.begin());
}

TZmQuantizer::TZmQuantizer(TZmBitmap& source, std::vector<TRGB>& color_map,
                           std::int32_t color_count)
    : fState(std::make_unique<TState>()) {
    fState->fNCol = std::clamp(color_count, kMinColors, kMaxColors);
    fState->fFoundColors = fState->fNCol;
    color_map.assign(static_cast<std::size_t>(fState->fNCol), TRGB{});
    if (source.IsEmpty()) {
        fState->fFoundColors = 0;
        return;
    }
    fState->FillPalette(source, color_map);
}

TZmQuantizer::~TZmQuantizer() = default;

template <typename Use>
void TZmQuantizer::TState::WithLookup(const Use& use) {
    if (fSQ) {
        use([this](TRGB color) { return fSQ->Find(color); });
    } else if (fGrayScale) {
        use([this](TRGB color) { return color.r * fNCol / 256; });
    } else if (neural) {
        const auto search = [this](TRGB color) { return neural->FindIndex(color); };
        use([&](TRGB color) { return memo.Get(color, search); });
    } else if (boxes) {
        use([this](TRGB color) { return boxes->FindIndex(color); });
    } else if (!own_palette.empty()) {
        const auto search = [this](TRGB color) { return FindInOwnPalette(color); };
        use([&](TRGB color) { return memo.Get(color, search); });
    } else {
        use([](TRGB /*color*/) { return 0; });
    }
}

std::int32_t TZmQuantizer::GetRGBIndex(TRGB color) {
    std::int32_t index = 0;
    fState->WithLookup([&](const auto& find) { index = find(color); });
    return index;
}

void TZmQuantizer::GetRGBIndexes(const TRGB* colors, std::size_t count, std::uint16_t* indexes) {
    fState->WithLookup([&](const auto& find) {
        std::transform(colors, colors + count, indexes,
                       [&](TRGB color) { return static_cast<std::uint16_t>(find(color)); });
    });
}

std::int32_t TZmQuantizer::GetFoundColors() const {
    return fState->fFoundColors;
}

bool TZmQuantizer::GetGrayScale() const {
    return fState->fGrayScale;
}

namespace {

// The two colours in the order dark, light; a single one gets its opposite beside it.
std::array<TRGB, 2> OrderTwoColors(const std::vector<TRGB>& colors) {
    const TZmRowContext context = MakeRowContext(nullptr);
    if (colors.size() == 1) {
        const bool is_light = GrayByCoef(colors[0], context) >= 128;
        return is_light ? std::array{TRGB{}, colors[0]}
                        : std::array{colors[0], TRGB{255, 255, 255}};
    }
    const bool in_order = GrayByCoef(colors[0], context) <= GrayByCoef(colors[1], context);
    return in_order ? std::array{colors[0], colors[1]} : std::array{colors[1], colors[0]};
}

// Set bits where the row has the light colour.
void MarkColor(const TRGB* source, std::int32_t width, TRGB light, std::uint8_t* dest) {
    for (std::int32_t x = 0; x < width; ++x) {
        if (source[x] == light) {
            dest[x / 8] = static_cast<std::uint8_t>(dest[x / 8] | 0x80 >> (x % 8));
        }
    }
}

}  // namespace

bool ReduceToTwoColors(TZmBitmap& source, TZmBitmap& bits, TRGB& dark, TRGB& light) {
    bits.FreeImage(/*free_alpha=*/true);
    if (source.IsEmpty()) {
        return false;
    }
    const std::optional<TColorList> list = CollectColors(source, 2);
    if (!list || list->Colors().empty() ||
        !bits.Allocate(source.GetWidth(), source.GetHeight(), zm1g)) {
        return false;
    }
    const std::array<TRGB, 2> colors = OrderTwoColors(list->Colors());
    TZmRgbRows rows(source);
    const auto row_bytes = static_cast<std::size_t>(bits.GetRowLen());
    for (std::int32_t y = 0; y < source.GetHeight(); ++y) {
        const TRGB* from = rows.GetRow(y);
        std::uint8_t* to = bits.GetScanLine(y);
        if (from == nullptr || to == nullptr) {
            bits.FreeImage(/*free_alpha=*/true);
            return false;
        }
        std::fill_n(to, row_bytes, std::uint8_t{0});
        MarkColor(from, source.GetWidth(), colors[1], to);
    }
    dark = colors[0];
    light = colors[1];
    return true;
}

}  // namespace zm
