// The built module through its one entry, as a host meets it.
#include <gtest/gtest.h>

#include <cstdint>
#include <filesystem>
#include <string>

#include "engine/foundation/zmstrings.h"
#include "tests/plugin/testhost.h"
#include "tests/plugin/testplatform.h"
#include "tests/support/testfiles.h"

namespace zm::test {
namespace {

struct TActionFacts {
    const char16_t* name;
    const char16_t* id;
};
constexpr TActionFacts kActions[] = {
    {u"Open Image", u"A_GRAPHICS_OPEN_IMAGE"},
    {u"Save Image", u"A_GRAPHICS_SAVE_IMAGE"},
    {u"Resize Image", u"A_GRAPHICS_RESIZE_IMAGE"},
    {u"Crop Image", u"A_GRAPHICS_CROP_IMAGE"},
    {u"Rotate Image", u"A_GRAPHICS_ROTATE_IMAGE"},
    {u"Draw Text on Image", u"A_GRAPHICS_DRAW_TEXT_ON_IMAGE"},
    {u"Draw Image on Image", u"A_GRAPHICS_DRAW_IMAGE_ON_IMAGE"},
    {u"Add Border to Image", u"A_GRAPHICS_ADD_BORDER_TO_IMAGE"},
};

class ContractTest : public testing::Test {
protected:
    void SetUp() override {
        ASSERT_NE(LoadedModule().caller, nullptr);
        ASSERT_NE(LoadedModule().caller->Info(), nullptr) << "the module refused its host";
    }
    TPluginCaller& Caller() { return *LoadedModule().caller; }
    TTestHost& Host() { return LoadedModule().host; }
};

TEST_F(ContractTest, VersionGate) {
    constexpr const char16_t* kRefused[] = {u"8.2.99.99", u"8.2",  u"7.9",  u"",
                                            u"abc",       u"v8.3", u".8.3", u"0008"};
    constexpr const char16_t* kAccepted[] = {u"8.3", u"8.3.0.0", u"8-3", u"8.10", u"10"};
    TAFAppInfo info = Host().app_info;
    for (const char16_t* version : kRefused) {
        info.Ver = version;
        EXPECT_EQ(LoadedModule().entry(&info), nullptr) << Utf8FromUtf16(version);
    }
    info.Ver = nullptr;
    EXPECT_EQ(LoadedModule().entry(&info), nullptr);
    EXPECT_EQ(LoadedModule().entry(nullptr), nullptr);
    // Past the gate stands the rule that a process initialises the component once.
    for (const char16_t* version : kAccepted) {
        info.Ver = version;
        const TForeignCatch caught = CatchAsForeignHost([&] { LoadedModule().entry(&info); });
        EXPECT_TRUE(caught.is_platform_kind) << Utf8FromUtf16(version);
        EXPECT_EQ(caught.message, u"Project can have only one component TAFPlugin");
    }
    EXPECT_EQ(Caller().Describe(gaRotateImage, u""), u"Rotate image by ? degrees")
        << "the accepted record stays in use";
}

/// A copy of the file is a module of its own, which can be loaded afresh and unloaded.
TEST(ContractUnload, EveryLoadStartsAnewAndGivesAllMemoryBack) {
    TempFolder folder;
    const std::filesystem::path copy = folder.File("Copy.qvp");
    std::filesystem::copy_file(ZM_MODULE_DIR "/Graphics.qvp", copy);
    for (const char16_t* version : {u"8.3", u"8.3.0.0", u"8-3", u"10"}) {
        TTestHost host(hsLinked);
        host.app_info.Ver = version;
        std::string error_text;
        const auto library = platform::LoadLibraryFile(EngineName(copy), error_text);
        ASSERT_NE(library, nullptr) << error_text;
        const auto entry = reinterpret_cast<TInitQVPlugin>(library->FindSymbol(kInitQVPluginName));
        TAFPluginInfo* info = entry(&host.app_info);
        ASSERT_NE(info, nullptr) << Utf8FromUtf16(version);
        EXPECT_FALSE(TPluginCaller(host, info).Exec(gaSaveImage, u""));
        EXPECT_EQ(host.OutstandingBlocks(), 8);
        info->ShutdownPlugin();
    }
}

TEST_F(ContractTest, PluginRecord) {
    const TAFPluginInfo& info = *Caller().Info();
    EXPECT_EQ(info.ID, 550383872);
    EXPECT_EQ(std::u16string(info.Descr), u"Graphics");
    EXPECT_EQ(info.PluginConfig, nullptr);
    EXPECT_EQ(info.About, nullptr);
    EXPECT_NE(info.ShutdownPlugin, nullptr);
    EXPECT_EQ(info.Icon != nullptr, IconsHaveHandles());
    EXPECT_EQ(info.IsActions, -1);
    EXPECT_EQ(info.IsEvents, 0);
    EXPECT_EQ(info.EventsInfo, nullptr);
    EXPECT_EQ(info.ActionsInfo->ActionsCount, 8);
}

TEST_F(ContractTest, ActionRecords) {
    for (std::int32_t index = 0; index < kGraphicsActionCount; ++index) {
        const TAFActionInfo* info = Caller().Actions().GetActionInfo(index);
        ASSERT_NE(info, nullptr);
        EXPECT_EQ(std::u16string(info->Name), kActions[index].name);
        EXPECT_EQ(std::u16string(info->ActionID), kActions[index].id);
        EXPECT_EQ(info->AllowNTService, -1);
        EXPECT_EQ(info->Indent, 0);
        EXPECT_EQ(info->ActionType, 0);
        EXPECT_EQ(std::u16string(info->ScriptFunctionName), u"");
        EXPECT_EQ(info->Icon != nullptr, IconsHaveHandles());
    }
}

TEST_F(ContractTest, HostHeapHoldsExactlyTheRecords) {
    EXPECT_EQ(Host().OutstandingBlocks(), 8);
    EXPECT_EQ(Host().OutstandingBytes(), static_cast<std::int64_t>(8 * sizeof(TAFActionInfo)));
    Caller().Exec(gaOpenImage, u"image_file={a missing variable}");
    Caller().Describe(gaSaveImage, u"image_file=x");
    EXPECT_EQ(Host().OutstandingBlocks(), 8);
    EXPECT_EQ(Host().HeapFaults(), 0);
}

TEST_F(ContractTest, EmptyTextRunsEveryActionWithDefaults) {
    for (std::int32_t index = 0; index < kGraphicsActionCount; ++index) {
        EXPECT_FALSE(Caller().Exec(index, u"", 900));
        TAFActionParams params{};
        EXPECT_EQ(Caller().Actions().ExecAction(index, &params), 0);
    }
}

// Within the table ConfigAction may show a form, which waits for a user.
TEST_F(ContractTest, IndexOutsideTheTableRunsNothing) {
    for (const std::int32_t index : {kGraphicsActionCount, -1, 1000000, -1000000}) {
        TTestStep step(Host(), u"image_file=a\r\nb");
        const TAFActionParams before = step.params;
        EXPECT_EQ(Caller().Actions().ExecAction(index, &step.params), 0);
        EXPECT_EQ(Caller().Actions().ConfigAction(index, &step.params), 0);
        EXPECT_EQ(step.params.PPtr, before.PPtr);
        EXPECT_EQ(step.params.Size, before.Size);
        EXPECT_EQ(step.Text(), u"image_file=a\r\nb");
        EXPECT_EQ(Caller().Describe(index, u""), u"");
        EXPECT_EQ(Caller().Actions().GetActionInfo(index), nullptr);
        Caller().JobStop(index);
    }
}

TEST_F(ContractTest, DeletingStepsAndShutdownAreHarmless) {
    TTestStep step(Host(), u"image_file=a");
    for (std::int32_t index = 0; index < kGraphicsActionCount; ++index) {
        Caller().Actions().DeleteAction(index, &step.params);
    }
    Caller().Info()->ShutdownPlugin();
    Caller().Info()->ShutdownPlugin();
    EXPECT_EQ(Caller().Describe(gaSaveImage, u"dest=1"), u"Save image to Clipboard");
}

}  // namespace
}  // namespace zm::test
