#pragma once

#include <string>

#include "tests/actions/formsupport.h"
#include "tests/plugin/testhost.h"
#include "tests/views/formuser.h"

namespace zm::test {

/// Steps of the built plug-in, configured in its real dialogs.
class RealForms : public testing::Test {
protected:
    void SetUp() override {
        if (!HasDisplay()) {
            GTEST_SKIP() << "there is no display to open windows on";
        }
    }
    /// Configures a step while the user acts; the text afterwards. A block that stays is the same
    /// one, byte for byte.
    static std::u16string Configure(std::int32_t action, const std::u16string& text,
                                    TLongBool result) {
        TLoadedModule& module = LoadedModule();
        TTestStep step(module.host, text);
        const TAFActionParams before = step.params;
        EXPECT_EQ(module.caller->Actions().ConfigAction(action, &step.params), result);
        EXPECT_TRUE(result != 0 ||
                    (step.params.PPtr == before.PPtr && step.params.Size == before.Size));
        EXPECT_EQ(module.host.HeapFaults(), 0);
        EXPECT_TRUE(module.host.Lines().empty());
        return step.Text();
    }

    TUser user;
};

}  // namespace zm::test
