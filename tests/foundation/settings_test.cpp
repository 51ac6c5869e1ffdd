#include "engine/foundation/zmsettings.h"

#include <gtest/gtest.h>

#include "engine/platform/screen.h"

namespace zm {
namespace {

/// Each case starts and ends without settings.
class Settings : public testing::Test {
protected:
    void SetUp() override { DestroySingletonInstance(); }
    void TearDown() override { DestroySingletonInstance(); }
};

std::int32_t initializer_runs = 0;

void CountRun(TZmZalmoGlobalSettings& settings) {
    ++initializer_runs;
    EXPECT_EQ(&ZmGlobalSettings(), &settings) << "the object in the making is the one";
}

class TCountingToolbar : public TZmToolbar {
public:
    void Update(bool full_update) override { updates += full_update ? 10 : 1; }
    int updates = 0;
};

/// The values that other rooms count on by their numbers.
TEST_F(Settings, DefaultsThatAreStoredAsNumbers) {
    const TZmZalmoGlobalSettings& settings = ZmGlobalSettings();
    EXPECT_EQ(static_cast<std::uint32_t>(settings.fPreviewImageBackgroundColor), 0xFF00000Fu);
    EXPECT_EQ(settings.fMViewExplorerThumbnailExts.size(), 89u);
    EXPECT_EQ(settings.MemoShortCuts[11], 0x4047);
    EXPECT_EQ(settings.fEXIFInteroperabilityIndexUsage, 2);
    EXPECT_EQ(settings.fDICOMWindowingStrategy, 2);
    EXPECT_EQ(zmosUnknown, 11);
    EXPECT_EQ(msNorwegian, kMsgLanguageCount - 1);
}

TEST_F(Settings, MachineValuesComeFromThePlatform) {
    const TZmZalmoGlobalSettings& settings = ZmGlobalSettings();
    const platform::TScreenTraits screen = platform::ScreenTraits();
    EXPECT_EQ(settings.fSystemDPIY, screen.dpi_y);
    EXPECT_EQ(settings.fVScrollWidth, screen.vertical_scroll_width);
    EXPECT_GE(settings.fSystemDPIX, 72);
    EXPECT_TRUE(settings.fUnicodeOS);
    if (!platform::SystemVersion()) {
        EXPECT_EQ(settings.fOpSys, zmosUnknown);
    }
}

TEST_F(Settings, InitialisersRunOncePerObject) {
    initializer_runs = 0;
    EXPECT_TRUE(AddSettingsInitializer(CountRun));
    EXPECT_EQ(initializer_runs, 0) << "there is no object yet";
    ZmGlobalSettings();
    EXPECT_TRUE(AddSettingsInitializer(CountRun));
    EXPECT_EQ(initializer_runs, 1);
    DestroySingletonInstance();
    ZmGlobalSettings();
    EXPECT_EQ(initializer_runs, 2);
}

TEST_F(Settings, LibraryEndsWithItsLastUser) {
    ZmInitializeLibrary();
    ZmInitializeLibrary();
    ZmGlobalSettings().fThumbnailSize = 1;
    ZmFinalizeLibrary();
    EXPECT_EQ(ZmGlobalSettings().fThumbnailSize, 1);
    ZmFinalizeLibrary();
    EXPECT_EQ(ZmGlobalSettings().fThumbnailSize, 250);
    ZmGlobalSettings().fThumbnailSize = 2;
    ZmFinalizeLibrary();
    EXPECT_EQ(ZmGlobalSettings().fThumbnailSize, 2) << "one too many does nothing";
}

TEST_F(Settings, LanguageFollowsTheLocale) {
    const struct {
        const char* locale;
        TMsgLanguage language;
    } rows[] = {
        {"", msEnglish},
        {"en_US.UTF-8", msEnglish},
        {"de_AT.UTF-8@euro", msGerman},
        {"pt-BR", msPortuguese},
        {"nb_NO", msNorwegian},
        {"hr-HR", msSerbian},
        {"zh_CN.UTF-8", msChinese},
        {"zh-TW", msChineseTraditionalBig5},
        {"zh-Hant-TW", msChineseTraditionalBig5},
        {"zh_HK", msSystem},
        {"zh", msSystem},
        {"fil-PH", msEnglish},
        {"FR", msFrench},
        {"eo", msEnglish},
    };
    for (const auto& row : rows) {
        EXPECT_EQ(MsgLanguageOfLocale(row.locale), row.language) << row.locale;
    }
    ZmGlobalSettings().fMsgLanguage = msItalian;
    EXPECT_EQ(ZmGlobalSettings().CurrentMsgLanguage(), msItalian);
    EXPECT_FALSE(ZmGlobalSettings().MsgLanguage_IsEnglish());
    EXPECT_EQ(ZmGlobalSettings().GetLanguages(/*full_only=*/true).size(), 16u);
    EXPECT_EQ(ZmGlobalSettings().GetLanguages(/*full_only=*/false).size(), 25u);
}

TEST_F(Settings, ToolbarsHearOfUpdatesWhileTheyAreKnown) {
    TCountingToolbar toolbar;
    TZmZalmoGlobalSettings& settings = ZmGlobalSettings();
    settings.AddToolbar(&toolbar);
    settings.AddToolbar(&toolbar);
    settings.UpdateToolbars(/*full_update=*/true);
    settings.UpdateToolbars(/*full_update=*/false);
    settings.RemoveToolbar(&toolbar);
    settings.UpdateToolbars(/*full_update=*/true);
    EXPECT_EQ(toolbar.updates, 11);
}

}  // namespace
}  // namespace zm
