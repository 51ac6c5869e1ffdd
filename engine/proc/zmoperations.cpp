// The one table of operation captions.

#include "engine/proc/zmoperations.h"

#include <array>

namespace zm {
namespace {

struct TOperationRow {
    std::int32_t operation;
    const char16_t* caption;
};

constexpr std::array<TOperationRow, 9> kOperations{{
    {kOperationConvertColors, u"Convert to %d colors"},
    {kOperationFlipHorizontal, u"Flip Horizontal"},
    {kOperationFlipVertical, u"Flip Vertical"},
    {kOperationNegative, u"Negative"},
    {kOperationResample, u"Resize Image"},
    {kOperationRotate, u"Rotate"},
    {kOperationText, u"Insert Text"},
    {kOperationConvertPixels, u"Convert Pixels"},
    {kOperationConvertToPalette, u"Convert to Palette"},
}};

}  // namespace

std::u16string OperationCaption(std::int32_t operation) {
    for (const TOperationRow& row : kOperations) {
        if (row.operation == operation) {
            return row.caption;
        }
    }
    return {};
}

}  // namespace zm
