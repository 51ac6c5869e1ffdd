#include "actions/uActionDescriptions.h"

#include <algorithm>
#include <array>

#include "actions/uColorNames.h"

namespace zm {
namespace {

/// A number as stored with the sign of its unit.
std::u16string Measure(const IStepParams& params, std::u16string_view key,
                       std::u16string_view unit_key) {
    const char16_t* unit = params.GetInteger(unit_key) != 0 ? u"%" : u"px";
    return params.GetStringDef(key, u"?") + unit;
}

struct TSides {
    std::u16string left;
    std::u16string top;
    std::u16string right;
    std::u16string bottom;
};

TSides ReadSides(const IStepParams& params) {
    return {Measure(params, u"l", u"ul"), Measure(params, u"t", u"ut"),
            Measure(params, u"r", u"ur"), Measure(params, u"b", u"ub")};
}

/// Open and Save: `prefix` and the place, which `place_key` chooses; empty for a place that does
/// not exist.
std::u16string PlaceText(const IStepParams& params, std::u16string_view place_key,
                         const std::u16string& prefix) {
    switch (params.GetInteger(place_key)) {
        case 0: return prefix + QuotedString(params.GetStringDef(u"image_file", u"<empty>"));
        case 1: return prefix + u"Clipboard";
        default: return {};
    }
}

}  // namespace

std::u16string QuotedString(std::u16string_view text) {
    std::u16string quoted = u"'";
    for (const char16_t character : text) {
        quoted.append(character == u'\'' ? 2 : 1, character);
    }
    return quoted + u"'";
}

void DescribeOpenImage(const IStepParams& params, std::u16string& Descr) {
    Descr = PlaceText(params, u"source", u"Open image from ");
}

void DescribeSaveImage(const IStepParams& params, std::u16string& Descr) {
    Descr = PlaceText(params, u"dest", u"Save image to ");
}

void DescribeResizeImage(const IStepParams& params, std::u16string& Descr) {
    Descr = u"Resize image to " + Measure(params, u"image_w", u"units_w") + u" x " +
            Measure(params, u"image_h", u"units_h");
    if (params.GetBoolDef(u"keep_aspect_ratio", true)) {
        Descr += u" (keep aspect ratio)";
    }
}

void DescribeCropImage(const IStepParams& params, std::u16string& Descr) {
    const TSides sides = ReadSides(params);
    Descr = u"Crop image (" + sides.left + u", " + sides.top + u") - (" + sides.right + u", " +
            sides.bottom + u")";
}

void DescribeRotateImage(const IStepParams& params, std::u16string& Descr) {
    switch (params.GetInteger(u"action")) {
        case 1: Descr = u"Flip image horizontally"; break;
        case 2: Descr = u"Flip image vertically"; break;
        default:
            Descr = u"Rotate image by " + params.GetStringDef(u"angle", u"?") + u" degrees";
            break;
    }
}

void DescribeTextOnImage(const IStepParams& params, std::u16string& Descr) {
    Descr = u"Draw \"" + params.GetStringDef(u"text", u"?") + u"\" on image";
}

void DescribeImageOnImage(const IStepParams& params, std::u16string& Descr) {
    Descr = u"Draw \"" + params.GetStringDef(u"image_file", u"?") + u"\" on image";
}

void DescribeAddBorder(const IStepParams& params, std::u16string& Descr) {
    const TSides sides = ReadSides(params);
    Descr = u"Add " + ColorDescription(params.GetInteger(u"color")) + u" border";
    if (sides.left == sides.top && sides.left == sides.right && sides.left == sides.bottom) {
        Descr += u" (width: " + sides.left + u")";
    } else {
        Descr += u" (left: " + sides.left + u", top: " + sides.top + u", right: " + sides.right +
                 u", bottom: " + sides.bottom + u")";
    }
}

}  // namespace zm
