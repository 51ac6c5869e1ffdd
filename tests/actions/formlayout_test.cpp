// Geometry that all views share: the declared places and what is computed from them.
#include "actions/uActionFormLayout.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <string>

#include "tests/actions/formsupport.h"

namespace zm::test {
namespace {

bool Overlap(const TRect& a, const TRect& b) {
    return a.left < b.right && b.left < a.right && a.top < b.bottom && b.top < a.bottom;
}

bool Inside(const TRect& inner, std::int32_t width, std::int32_t height) {
    return inner.left >= 0 && inner.top >= 0 && inner.right <= width && inner.bottom <= height &&
           inner.left < inner.right && inner.top < inner.bottom;
}

bool operator==(const TRect& a, const TRect& b) {
    return a.left == b.left && a.top == b.top && a.right == b.right && a.bottom == b.bottom;
}

/// No control covers another or leaves the area.
void ExpectApart(const TActionFormDesign& form, std::int32_t scale, std::int32_t width,
                 std::int32_t height) {
    for (const TFormControl& one : form.controls) {
        const TRect place = PlaceControl(form, one, scale, width, height);
        EXPECT_TRUE(Inside(place, width, height)) << testing::PrintToString(one.name);
        for (const TFormControl& other : form.controls) {
            if (&one != &other) {
                EXPECT_FALSE(Overlap(place, PlaceControl(form, other, scale, width, height)))
                    << testing::PrintToString(one.name) << testing::PrintToString(other.name);
            }
        }
    }
}

TEST(FormLayout, ControlsLieApartAtEveryScale) {
    for (const TActionFormDesign* form : AllForms()) {
        for (const std::int32_t scale : {100, 125, 150, 175, 250}) {
            ExpectApart(*form, scale, ScaleLength(form->client_width, scale),
                        ScaleLength(form->client_height, scale));
        }
    }
    // The sizeable form at its smallest width, without a frame of 16 pixels, and enlarged.
    ExpectApart(TextOnImageForm(), 100, 404 - 16, 399);
    ExpectApart(TextOnImageForm(), 100, 1200, 900);
}

TEST(FormLayout, AnchorsOfTheSizeableForm) {
    const TActionFormDesign& design = TextOnImageForm();
    const TActionForm form(design);
    const auto growth = [&](const char16_t* name) {
        const auto& control = design.controls[static_cast<std::size_t>(form.IndexOf(name))];
        TRect place = PlaceControl(design, control, 100, 562 + 10, 399 + 5);
        return TRect{place.left - control.bounds.left, place.top - control.bounds.top,
                     place.right - control.bounds.right, place.bottom - control.bounds.bottom};
    };
    EXPECT_TRUE(growth(u"panSample") == (TRect{0, 0, 10, 5}));
    EXPECT_TRUE(growth(u"edtText") == (TRect{0, 0, 10, 0}));
    EXPECT_TRUE(growth(u"btnSelectFont") == (TRect{10, 0, 10, 0}));
    EXPECT_TRUE(growth(u"edtCustomX") == (TRect{0, 5, 0, 5}));
    EXPECT_TRUE(growth(u"btnOk") == (TRect{10, 5, 10, 5}));
    EXPECT_TRUE(growth(u"SpeedButton1") == (TRect{0, 5, 0, 5}));
    const auto& panel = design.controls[static_cast<std::size_t>(form.IndexOf(u"panSample"))];
    const TRect tiny = PlaceControl(design, panel, 100, 1, 1);
    EXPECT_GE(tiny.right, tiny.left);
    EXPECT_GE(tiny.bottom, tiny.top);
}

TEST(FormLayout, TabOrderGoesByRowsWithLabelsBeforeTheirFields) {
    const auto names = [](const TActionFormDesign& design) {
        std::u16string text;
        for (const std::int32_t index : TabOrder(design)) {
            text += design.controls[static_cast<std::size_t>(index)].name + u" ";
        }
        return text;
    };
    EXPECT_EQ(names(ResizeImageForm()),
              u"rgCalcMethod lblWidth edtImageW cbUnitsW lblHeight edtImageH cbUnitsH "
              u"cbKeepAspectRatio SpeedButton1 btnOk btnCancel ");
    EXPECT_EQ(names(TextOnImageForm()),
              u"lblText edtText lblSample btnSelectFont panSample lblXPos cbXPos lblCustomX "
              u"edtCustomX lblYPos cbYPos lblCustomY edtCustomY SpeedButton1 btnOk btnCancel ");
    EXPECT_EQ(names(SaveImageForm()),
              u"rgDest lblImageFile edtImageFile btnSelectFile lblImageFormat cbImageFormat "
              u"cbSaveMeta SpeedButton1 btnOk btnCancel ");
}

TEST(FormLayout, RadioItemsFillRowsInColumns) {
    TFormControl grid;
    grid.bounds = {0, 0, 120, 68};
    grid.columns = 2;
    grid.items = {u"a", u"b", u"c"};
    EXPECT_TRUE(RadioItemPlaces(grid, 100)[2] == (TRect{10, 40, 60, 60}));
    EXPECT_TRUE(RadioItemPlaces(grid, 250)[1] == (TRect{150, 50, 275, 100}));
}

TEST(FormLayout, CaptionsAndFonts) {
    EXPECT_EQ(PlainCaption(u"Max &Width && &Height&"), u"Max Width & Height&");
    EXPECT_EQ(ScaleLength(3, 150), 5);
    const TFormFont shown = FontToShow({std::u16string(5000, u'f'), -3, 7, 0xFF});
    EXPECT_EQ(shown, (TFormFont{std::u16string(31, u'f'), 1, 7, 15}));
    EXPECT_EQ(FontToShow({u"F", 2147483647, 0, 0}).size, 400);
}

}  // namespace
}  // namespace zm::test
