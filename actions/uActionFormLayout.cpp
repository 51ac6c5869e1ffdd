#include "actions/uActionFormLayout.h"

#include <algorithm>
#include <numeric>
#include <string_view>
#include <tuple>

namespace zm {
namespace {

// Inside a radio group, at 96 dpi.
constexpr std::int32_t kGroupTitleHeight = 20;
constexpr std::int32_t kGroupSideMargin = 10;
constexpr std::int32_t kGroupBottomMargin = 8;
/// Room that a radio button's mark and gap take, in characters of its text.
constexpr std::int32_t kRadioMarkCharacters = 6;

constexpr std::size_t kMaxFaceNameLength = 31;  // a platform font record has 32 with the zero
constexpr std::int32_t kMaxFontPoints = 400;

TRect ScaleRect(const TRect& rect, std::int32_t scale_percent) {
    return {ScaleLength(rect.left, scale_percent), ScaleLength(rect.top, scale_percent),
            ScaleLength(rect.right, scale_percent), ScaleLength(rect.bottom, scale_percent)};
}

/// Moves the ends of a span along with the far side of an area that has grown by `growth`.
void AnchorSpan(std::int32_t& near_end, std::int32_t& far_end, bool keeps_near, bool keeps_far,
                std::int32_t growth) {
    if (keeps_far) {
        far_end += growth;
        near_end += keeps_near ? 0 : growth;
    }
    far_end = std::max(far_end, near_end);
}

std::vector<std::int32_t> ColumnWeights(const TFormControl& group) {
    const auto columns = static_cast<std::size_t>(std::max(group.columns, 1));
    std::vector<std::int32_t> weights(columns, 0);
    for (std::size_t item = 0; item < group.items.size(); ++item) {
        const auto length = static_cast<std::int32_t>(PlainCaption(group.items[item]).size());
        std::int32_t& weight = weights[item % columns];
        weight = std::max(weight, length + kRadioMarkCharacters);
    }
    return weights;
}

/// Left ends of the columns and the right end of the last.
std::vector<std::int32_t> ColumnEdges(const TFormControl& group) {
    const std::vector<std::int32_t> weights = ColumnWeights(group);
    const std::int32_t total = std::max(std::accumulate(weights.begin(), weights.end(), 0), 1);
    const std::int32_t width = group.bounds.right - group.bounds.left - 2 * kGroupSideMargin;
    std::vector<std::int32_t> edges{kGroupSideMargin};
    std::int32_t passed = 0;
    for (const std::int32_t weight : weights) {
        passed += weight;
        edges.push_back(kGroupSideMargin + width * passed / total);
    }
    return edges;
}

}  // namespace

std::int32_t ScaleLength(std::int32_t length, std::int32_t scale_percent) {
    return (length * scale_percent + 50) / 100;
}

TRect PlaceControl(const TActionFormDesign& design, const TFormControl& control,
                   std::int32_t scale_percent, std::int32_t client_width,
                   std::int32_t client_height) {
    TRect place = ScaleRect(control.bounds, scale_percent);
    const auto has = [&control](TFormAnchors side) { return (control.anchors & side) != 0; };
    AnchorSpan(place.left, place.right, has(faLeft), has(faRight),
               client_width - ScaleLength(design.client_width, scale_percent));
    AnchorSpan(place.top, place.bottom, has(faTop), has(faBottom),
               client_height - ScaleLength(design.client_height, scale_percent));
    return place;
}

std::vector<TRect> RadioItemPlaces(const TFormControl& group, std::int32_t scale_percent) {
    const std::vector<std::int32_t> edges = ColumnEdges(group);
    const std::size_t columns = edges.size() - 1;
    const auto rows = static_cast<std::int32_t>((group.items.size() + columns - 1) / columns);
    const std::int32_t height =
        group.bounds.bottom - group.bounds.top - kGroupTitleHeight - kGroupBottomMargin;
    std::vector<TRect> places;
    for (std::size_t item = 0; item < group.items.size(); ++item) {
        const auto row = static_cast<std::int32_t>(item / columns);
        const TRect bounds{edges[item % columns], kGroupTitleHeight + height * row / rows,
                           edges[item % columns + 1],
                           kGroupTitleHeight + height * (row + 1) / rows};
        places.push_back(ScaleRect(bounds, scale_percent));
    }
    return places;
}

std::vector<std::int32_t> TabOrder(const TActionFormDesign& design) {
    const std::vector<TFormControl>& controls = design.controls;
    const auto place = [&controls](std::int32_t index) -> const TFormControl& {
        const TFormControl& own = controls[static_cast<std::size_t>(index)];
        for (const TFormControl& control : controls) {
            if (!own.focus_control.empty() && control.name == own.focus_control) {
                return control;
            }
        }
        return own;
    };
    // Controls of one row share their middle; of a label and the control that it names, which
    // have one place here, the label is first.
    const auto rank = [&](std::int32_t index) {
        const TRect& bounds = place(index).bounds;
        const bool names_nothing = controls[static_cast<std::size_t>(index)].focus_control.empty();
        return std::make_tuple(bounds.top + bounds.bottom, bounds.left, names_nothing);
    };
    std::vector<std::int32_t> order(controls.size());
    std::iota(order.begin(), order.end(), 0);
    std::stable_sort(order.begin(), order.end(),
                     [&](std::int32_t a, std::int32_t b) { return rank(a) < rank(b); });
    return order;
}

std::u16string PlainCaption(std::u16string_view caption) {
    std::u16string plain;
    for (std::size_t index = 0; index < caption.size(); ++index) {
        if (caption[index] == u'&' && index + 1 < caption.size()) {
            ++index;
        }
        plain += caption[index];
    }
    return plain;
}

TFormFont FontToShow(const TFormFont& font) {
    TFormFont shown = font;
    shown.name.resize(std::min(shown.name.size(), kMaxFaceNameLength));
    shown.size = std::clamp(shown.size, 1, kMaxFontPoints);
    shown.styles &= ffBold | ffItalic | ffUnderline | ffStrikeOut;
    return shown;
}

}  // namespace zm
