// Configuration through the host's contract, with a toolkit that the test plays.
#include <gtest/gtest.h>

#include <functional>
#include <string>

#include "engine/platform/hostboundary.h"
#include "plugin/AFPlugin_p.h"
#include "tests/actions/formsupport.h"
#include "tests/plugin/testhost.h"
#include "tests/plugin/testplatform.h"

namespace zm::test {
namespace {

class TTestToolkit : public IActionFormToolkit {
public:
    bool ShowModal(IActionForm& form, const TFormShowOptions& options,
                   std::u16string& reason) override {
        shown.push_back(form.Design().class_name);
        last_options = options;
        reason = refusal;
        user(form);
        return refusal.empty();
    }

    std::vector<std::u16string> shown;
    TFormShowOptions last_options;
    std::u16string refusal;
    std::function<void(IActionForm&)> user = [](IActionForm&) {};
};

TTestToolkit* toolkit = nullptr;

IActionFormToolkit* FindToolkit(std::u16string& reason) {
    reason = u"no toolkit here.";
    return toolkit;
}

std::int32_t FindControl(const IActionForm& form, const char16_t* name) {
    return static_cast<const TActionForm&>(form).IndexOf(name);
}

void PressOk(IActionForm& form) {
    form.PressButton(FindControl(form, u"btnOk"));
}

class ConfigureTest : public testing::Test {
protected:
    ConfigureTest() {
        toolkit = &test_toolkit;
        InstallFormToolkit(&FindToolkit);
    }
    ~ConfigureTest() override {
        InstallFormToolkit(nullptr);
        toolkit = nullptr;
    }
    /// Configures a step with this text; the text afterwards. A block that stays is the same one.
    std::u16string Configure(std::int32_t action, const std::u16string& text, TLongBool result) {
        TTestStep step(plugin.host, text);
        const TAFActionParams before = step.params;
        EXPECT_EQ(plugin.caller->Actions().ConfigAction(action, &step.params), result);
        EXPECT_TRUE(result != 0 ||
                    (step.params.PPtr == before.PPtr && step.params.Size == before.Size));
        EXPECT_EQ(plugin.host.HeapFaults(), 0);
        return step.Text();
    }

    TLinkedPlugin plugin;
    TTestToolkit test_toolkit;
};

TEST_F(ConfigureTest, EveryActionShowsItsForm) {
    for (std::int32_t action = -1; action <= kGraphicsActionCount; ++action) {
        Configure(action, u"", 0);
    }
    std::vector<std::u16string> names;
    for (const TActionFormDesign* form : AllForms()) {
        names.push_back(form->class_name);
    }
    EXPECT_EQ(test_toolkit.shown, names);
    EXPECT_TRUE(plugin.host.Lines().empty());
}

TEST_F(ConfigureTest, ConfirmedSettingsReplaceTheBlock) {
    test_toolkit.user = [](IActionForm& form) {
        form.SetText(FindControl(form, u"edtAngle"), u"{angle}");
        PressOk(form);
    };
    EXPECT_EQ(Configure(gaRotateImage, u"other=1\r\nANGLE=5\r\n", -1),
              u"action=0\r\nangle={angle}\r\n");
}

TEST_F(ConfigureTest, CancelAndAFailedCheckLeaveTheBlock) {
    const std::u16string odd = u"image_file=a\nb\r=c\r\n\r\nsource=9";
    test_toolkit.user = [](IActionForm& form) {
        form.SetText(FindControl(form, u"edtImageFile"), u"changed");
        form.PressButton(FindControl(form, u"btnCancel"));
    };
    EXPECT_EQ(Configure(gaOpenImage, odd, 0), odd);
    test_toolkit.user = [](IActionForm& form) {
        form.SetText(FindControl(form, u"edtImageFile"), u"");
        PressOk(form);
    };
    EXPECT_EQ(Configure(gaOpenImage, odd, 0), odd);
}

TEST_F(ConfigureTest, AnErrorOfTheToolkitPassesToTheHost) {
    test_toolkit.user = [](IActionForm&) { throw std::bad_alloc(); };
    TTestStep step(plugin.host, u"l=4");
    const void* block = step.params.PPtr;
    std::u16string message;
    EXPECT_FALSE(platform::CallCatchingHostExceptions(
        [&] { plugin.caller->Actions().ConfigAction(gaCropImage, &step.params); }, message));
    EXPECT_EQ(step.params.PPtr, block);
    EXPECT_EQ(step.Text(), u"l=4");
    EXPECT_EQ(plugin.host.HeapFaults(), 0);
}

TEST_F(ConfigureTest, WithoutAWindowTheLogTellsWhy) {
    test_toolkit.refusal = u"no display.";
    test_toolkit.user = &PressOk;
    EXPECT_EQ(Configure(gaCropImage, u"l=4", 0), u"l=4");
    toolkit = nullptr;
    EXPECT_EQ(Configure(gaCropImage, u"l=4", 0), u"l=4");
    InstallFormToolkit(nullptr);
    EXPECT_EQ(Configure(gaCropImage, u"l=4", 0), u"l=4");
    EXPECT_EQ(plugin.host.Lines(),
              (std::vector<THostLine>{
                  {2, u"The settings dialog cannot be shown: no display."},
                  {2, u"The settings dialog cannot be shown: no toolkit here."},
                  {2, u"The settings dialog cannot be shown: this program brings no dialogs."}}));
}

TEST_F(ConfigureTest, ScaleAndWindowComeFromTheHost) {
    const TTestWindow window([](std::uint32_t message, std::uintptr_t query, std::intptr_t) {
        return message == kHostQueryMessage && query == hqFormScale ? 175 : 0;
    });
    TTestHost windowed(hsModule);
    windowed.app_info.WHandle = window.Handle();
    plugin.data_module.reset();
    AllowAnotherInitializeForTests();
    TDM data_module;
    TAFPluginInfo* info = data_module.Init(windowed.app_info);
    TAFActionParams params{};
    EXPECT_EQ(info->ActionsInfo->ConfigAction(gaCropImage, &params), 0);
    EXPECT_EQ(test_toolkit.last_options.scale_percent, 175);
    EXPECT_EQ(test_toolkit.last_options.main_window, window.Handle());
}

}  // namespace
}  // namespace zm::test
