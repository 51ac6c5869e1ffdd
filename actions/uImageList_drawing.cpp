#include <algorithm>

#include "actions/uImageList.h"
#include "engine/foundation/zmstrings.h"
#include "engine/platform/files.h"
#include "engine/proc/zalmoproc.h"

namespace zm {
namespace {

constexpr std::int32_t kPositionStart = 0;
constexpr std::int32_t kPositionCenter = 1;
constexpr std::int32_t kPositionEnd = 2;
constexpr std::int32_t kPositionCustom = 3;
constexpr std::int32_t kOpaquePercent = 100;
constexpr std::int32_t kNoTransparency = 255;
constexpr std::int32_t kDefaultFontSize = 16;

/// Keys of the position on one axis.
struct TAxisKeys {
    const char16_t* mode;
    const char16_t* custom;
};
constexpr TAxisKeys kAxisX{u"x_pos", u"custom_x"};
constexpr TAxisKeys kAxisY{u"y_pos", u"custom_y"};

/// A position by its mode; `center` and `end` stand for these two modes.
std::int32_t PositionValue(const IStepParams& params, const TAxisKeys& axis, std::int32_t center,
                           std::int32_t end) {
    switch (params.GetIntegerDef(axis.mode, kPositionCustom)) {
        case kPositionStart: return 0;
        case kPositionCenter: return center;
        case kPositionEnd: return end;
        default: return ExpandedInteger(params, axis.custom, u"0");
    }
}

/// The position of a picture; one that is larger than the place gets a negative one.
std::int32_t PicturePosition(const IStepParams& params, const TAxisKeys& axis, std::int32_t place,
                             std::int32_t size) {
    return PositionValue(params, axis, (place - size) / 2, place - size);
}

/// The text measures itself, so that the action hands keywords on.
std::int32_t TextPosition(const IStepParams& params, const TAxisKeys& axis) {
    return PositionValue(params, axis, TextPosCenter, TextPosEnd);
}

double OpacityValue(const IStepParams& params) {
    const std::u16string text = ExpandVariables(params.GetStringDef(u"opacity", u"100"));
    const std::int32_t percent = ParseInteger(text).value_or(kOpaquePercent);
    return std::clamp(percent / 100.0, 0.0, 1.0);
}

}  // namespace

bool TQVImageList::TextOut(const IStepParams& params) {
    TZmBitmap* bitmap = JobBitmap(params.GetTaskId());
    if (bitmap == nullptr) {
        return false;
    }
    TZalmoProc proc(/*has_owner=*/false);
    const std::u16string font_name = params.GetStringDef(u"font_name", u"Tahoma");
    const std::int32_t font_size = params.GetIntegerDef(u"font_size", kDefaultFontSize);
    const TColor font_color = params.GetInteger(u"font_color");
    const auto styles = static_cast<TFontStyles>(params.GetInteger(u"font_styles") & 0xFF);
    const std::u16string text = ExpandVariables(params.GetString(u"text"));
    const std::int32_t x = TextPosition(params, kAxisX);
    const std::int32_t y = TextPosition(params, kAxisY);
    proc.SetAttachedZmBitmap(bitmap);
    proc.TextOut(x, y, text, font_name, font_size, font_color, styles, /*Angle=*/0,
                 /*bAntiAlias=*/true, /*bAutoEnlarge=*/false);
    proc.SetAttachedZmBitmap(nullptr);
    return true;
}

bool TQVImageList::DrawImage(const IStepParams& params) {
    TZmBitmap* bitmap = JobBitmap(params.GetTaskId());
    if (bitmap == nullptr) {
        return false;
    }
    const std::u16string name = ExpandVariables(params.GetString(u"image_file"));
    if (!platform::FileExists(name)) {
        return false;
    }
    TZmBitmap source;
    if (!source.Read(name, nullptr, /*check_unknown=*/true) || source.IsEmpty()) {
        return false;
    }
    const std::int32_t width = source.GetWidth();
    const std::int32_t height = source.GetHeight();
    const std::int32_t x = PicturePosition(params, kAxisX, bitmap->GetWidth(), width);
    const std::int32_t y = PicturePosition(params, kAxisY, bitmap->GetHeight(), height);
    const double opacity = OpacityValue(params);
    // Rendering writes three bytes a pixel. The plane of the image stays as it is, so that what
    // is drawn on transparent places stays unseen.
    if (!bitmap->SetPixelFormat(zm24RGB)) {
        return false;
    }
    source.RenderToTZmBitmapEx(bitmap, x, y, width, height, 0, 0, width, height,
                               /*bEnableAlpha=*/true, kNoTransparency, rfBilinear, zmlNormal,
                               opacity);
    return true;
}

}  // namespace zm
