#include <utility>

#include "actions/uImageList.h"
#include "engine/foundation/zmnumbers.h"
#include "engine/proc/zalmoproc.h"

namespace zm {
namespace {

constexpr std::int32_t kErrorInvalidValues = 2;
constexpr TColor kWhite = 0xFFFFFF;
constexpr std::int32_t kUnitPercent = 1;
constexpr std::int32_t kMethodLongAndShortSide = 1;
constexpr std::int32_t kActionRotate = 0;
constexpr std::int32_t kActionFlipHorizontally = 1;
constexpr std::int32_t kActionFlipVertically = 2;

/// Percentage of a side in the 32-bit arithmetic that stored steps count on, truncated.
std::int32_t PercentWrapped(std::int32_t percent, std::int32_t dimension) {
    return WrapMul32(percent, dimension) / 100;
}

/// A side of Crop or AddBorder in pixels, before the sign is looked at. A percentage that leaves
/// 32 bits is limited to them.
std::int32_t SideValue(const IStepParams& params, const std::u16string& key,
                       std::int32_t dimension) {
    const std::int32_t value = ExpandedInteger(params, key, u"0");
    if (params.GetInteger(u"u" + key) <= 0) {
        return value;
    }
    return SaturateToInt32(std::int64_t{dimension} * value / 100);
}

/// A negative value counts from the far edge.
std::int32_t CropValue(const IStepParams& params, const std::u16string& key,
                       std::int32_t dimension) {
    const std::int32_t value = SideValue(params, key, dimension);
    return value < 0 ? value + dimension : value;
}

std::int32_t BorderValue(const IStepParams& params, const std::u16string& key,
                         std::int32_t dimension) {
    const std::int32_t value = SideValue(params, key, dimension);
    return value < 0 ? 0 : value;
}

}  // namespace

bool TQVImageList::Resize(const IStepParams& params) {
    TZmBitmap* bitmap = JobBitmap(params.GetTaskId());
    if (bitmap == nullptr) {
        return false;
    }
    const std::int32_t calc_method = params.GetInteger(u"calc_method");
    std::int32_t width = ExpandedInteger(params, u"image_w", u"0");
    std::int32_t height = ExpandedInteger(params, u"image_h", u"0");
    // Required: the product is the processor's, so that two negative numbers pass, and the test
    // stands before the percentages, which may then give 0.
    if (WrapMul32(width, height) <= 0) {
        return false;
    }
    const bool keep_aspect_ratio = params.GetBoolDef(u"keep_aspect_ratio", true);
    if (params.GetInteger(u"units_w") == kUnitPercent) {
        width = PercentWrapped(width, bitmap->GetWidth());
    }
    if (params.GetInteger(u"units_h") == kUnitPercent) {
        height = PercentWrapped(height, bitmap->GetHeight());
    }
    if (calc_method == kMethodLongAndShortSide && bitmap->GetHeight() > bitmap->GetWidth()) {
        std::swap(width, height);
    }
    TZalmoProc proc(/*has_owner=*/false);
    proc.SetAttachedZmBitmap(bitmap);
    proc.Resample(width, height, rfBilinear, keep_aspect_ratio);
    return true;
}

bool TQVImageList::Crop(const IStepParams& params) {
    TZmBitmap* bitmap = JobBitmap(params.GetTaskId());
    if (bitmap == nullptr) {
        return false;
    }
    const std::int32_t left = CropValue(params, u"l", bitmap->GetWidth());
    const std::int32_t top = CropValue(params, u"t", bitmap->GetHeight());
    const std::int32_t right = CropValue(params, u"r", bitmap->GetWidth());
    const std::int32_t bottom = CropValue(params, u"b", bitmap->GetHeight());
    if (right <= left || bottom <= top) {
        ReportJobError(params.GetTaskId(), kErrorInvalidValues, u"Invalid values");
        return false;
    }
    return bitmap->Crop(left, top, right - 1, bottom - 1, kWhite);
}

bool TQVImageList::AddBorder(const IStepParams& params) {
    TZmBitmap* bitmap = JobBitmap(params.GetTaskId());
    if (bitmap == nullptr) {
        return false;
    }
    const std::int32_t width = bitmap->GetWidth();
    const std::int32_t height = bitmap->GetHeight();
    const std::int32_t left = BorderValue(params, u"l", width);
    const std::int32_t top = BorderValue(params, u"t", height);
    const std::int32_t right = BorderValue(params, u"r", width);
    const std::int32_t bottom = BorderValue(params, u"b", height);
    const TColor color = params.GetInteger(u"color");
    return bitmap->Crop(-left, -top, SaturateToInt32(std::int64_t{width} + right - 1),
                        SaturateToInt32(std::int64_t{height} + bottom - 1), color);
}

bool TQVImageList::Rotate(const IStepParams& params) {
    TZmBitmap* bitmap = JobBitmap(params.GetTaskId());
    if (bitmap == nullptr) {
        return false;
    }
    switch (params.GetInteger(u"action")) {
        case kActionRotate: {
            // Required: an angle of 0, the default, counts as a failed step.
            const std::int32_t angle = ExpandedInteger(params, u"angle", u"0");
            if (angle == 0) {
                return false;
            }
            // Steps count degrees clockwise, bitmaps counter-clockwise.
            bitmap->Rotate(-static_cast<double>(angle), zmrBilinear, kWhite);
            return true;
        }
        case kActionFlipHorizontally: bitmap->Flip(fdHorizontal); return true;
        case kActionFlipVertically: bitmap->Flip(fdVertical); return true;
        default: return false;
    }
}

}  // namespace zm
