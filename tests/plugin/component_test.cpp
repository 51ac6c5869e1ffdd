// The component model: declarations, the records made of them, and the functions that the host
// calls through the records.
#include "plugin/AFPlugin.h"

#include <gtest/gtest.h>

#include <map>
#include <memory>
#include <string>
#include <vector>

#include "plugin/AFPlugin_p.h"
#include "plugin/uVersionCompare.h"
#include "tests/plugin/testhost.h"
#include "tests/plugin/testplatform.h"

namespace zm::test {
namespace {

/// A component of the test's own with its host.
class ComponentTest : public testing::Test {
protected:
    ComponentTest() : plugin(std::make_unique<TAFPlugin>()) { AllowAnotherInitializeForTests(); }
    ~ComponentTest() override {
        plugin.reset();
        AllowAnotherInitializeForTests();
    }
    std::u16string Describe(TAFPluginInfo* info, const std::u16string& text) {
        plugin->GetActions().GetItem(0)->OnActionDescr =
            [&](TAction*, TAFActionParams&, std::u16string& Descr) { Descr = text; };
        return TPluginCaller(host, info).Describe(0, u"");
    }

    TTestHost host{hsLinked};
    std::unique_ptr<TAFPlugin> plugin;
};

TEST_F(ComponentTest, DefaultsOfANewDeclaration) {
    EXPECT_EQ(plugin->GetDescription(), u"New plugin for Quorvel");
    EXPECT_GE(plugin->GetID(), 50);
    plugin->SetDescription(u"");
    EXPECT_EQ(plugin->GetDescription(), u"New plugin for Quorvel");

    TAction& action = plugin->GetActions().Add();
    EXPECT_EQ(action.GetDisplayName(), u"New Action");
    EXPECT_TRUE(action.AllowNTService);
    EXPECT_EQ(action.ActionType, atSimple);
    action.SetName(u"");
    action.SetID(u"a_Mixed_1");
    EXPECT_EQ(action.GetName(), u"New Action");
    EXPECT_EQ(action.GetID(), u"A_MIXED_1");
    EXPECT_EQ(plugin->GetEvents().Add().GetName(), u"New Event");
    EXPECT_EQ(plugin->GetActions().Add().GetIndex(), 1);
}

TEST_F(ComponentTest, EmptyDeclarationHasNoRecords) {
    const TAFPluginInfo* info = plugin->Initialize(host.app_info);
    EXPECT_EQ(info->IsActions, 0);
    EXPECT_EQ(info->ActionsInfo, nullptr);
    EXPECT_EQ(info->IsEvents, 0);
    EXPECT_EQ(info->EventsInfo, nullptr);
    EXPECT_EQ(info->PluginConfig, nullptr);
    EXPECT_EQ(info->About, nullptr);
    EXPECT_EQ(info->ShutdownPlugin, nullptr);
    EXPECT_EQ(host.OutstandingBytes(), 0);
    EXPECT_NE(plugin->GetModuleFileName().find(u"plugin_test"), std::u16string::npos);
}

TEST_F(ComponentTest, RecordsTellTheDeclarationAndGoBack) {
    struct TCase {
        std::int32_t indent;
        std::int32_t expected_indent;
        TAFActionType type;
        bool allow_service;
    };
    constexpr TCase kCases[] = {
        {3, 1, atBeginLoop, true}, {0, 0, atSimple, false}, {-9, -1, atElseIf, true}};
    for (const TCase& row : kCases) {
        TAction& action = plugin->GetActions().Add();
        action.Indent = row.indent;
        action.ActionType = row.type;
        action.AllowNTService = row.allow_service;
        action.ScriptFunctionName = u"Function";
    }
    TEvent& event = plugin->GetEvents().Add();
    event.SetName(u"Arrival");
    event.SetID(u"e_arrival");

    const TAFPluginInfo* info = plugin->Initialize(host.app_info);
    EXPECT_EQ(info->IsActions, -1);
    ASSERT_EQ(info->ActionsInfo->ActionsCount, 3);
    for (std::int32_t index = 0; index < 3; ++index) {
        const TAFActionInfo* action = info->ActionsInfo->GetActionInfo(index);
        EXPECT_EQ(action->Indent, kCases[index].expected_indent);
        EXPECT_EQ(action->ActionType, kCases[index].type);
        EXPECT_EQ(action->AllowNTService, kCases[index].allow_service ? -1 : 0);
        EXPECT_EQ(std::u16string(action->ScriptFunctionName), u"Function");
        EXPECT_EQ(action->Name, plugin->GetActions().GetItem(index)->GetName().c_str());
    }
    EXPECT_EQ(info->IsEvents, -1);
    ASSERT_EQ(info->EventsInfo->EventsCount, 1);
    EXPECT_EQ(std::u16string(info->EventsInfo->GetEventInfo(0)->Name), u"Arrival");
    EXPECT_EQ(std::u16string(info->EventsInfo->GetEventInfo(0)->EventID), u"E_ARRIVAL");
    EXPECT_EQ(host.OutstandingBytes(),
              static_cast<std::int64_t>(3 * sizeof(TAFActionInfo) + sizeof(TAFEventInfo)));

    const TAFActionsInfo functions = *info->ActionsInfo;
    plugin.reset();
    EXPECT_EQ(host.OutstandingBytes(), 0);
    EXPECT_EQ(functions.GetActionInfo(0), nullptr) << "a function after the component's end";
}

/// Names of the handlers that the functions of the records ran, with their items' indexes.
TEST_F(ComponentTest, EachFunctionRunsItsOwnHandler) {
    std::vector<std::string> ran;
    const auto note = [&ran](const char* name) {
        return [&ran, name](auto* sender, auto&) {
            ran.push_back(name + std::to_string(sender->GetIndex()));
            return TLongBool{5};
        };
    };
    plugin->GetActions().Add();
    TAction& action = plugin->GetActions().Add();
    action.OnExecAction = note("exec");
    action.OnConfigAction = note("config");
    action.OnActionDelete = note("delete");
    action.OnJobStop = note("stop");
    TEvent& event = plugin->GetEvents().Add();
    event.OnConfigEvent = note("event config");
    event.OnStartEvent = note("event start");
    event.OnStopEvent = note("event stop");
    event.OnDeleteEvent = note("event delete");
    event.OnDuplicateEvent = note("event duplicate");
    event.OnEventDescr = [](TEvent*, TAFEventParams&, std::u16string& Descr) { Descr += u"!"; };
    plugin->GetEvents().Add();
    plugin->OnAbout = [&ran] { ran.push_back("about"); };
    plugin->OnPluginConfig = [&ran] { ran.push_back("plugin"); };
    plugin->OnShutdownPlugin = [&ran] { ran.push_back("shutdown"); };
    const TAFPluginInfo* info = plugin->Initialize(host.app_info);

    TAFActionParams params{};
    EXPECT_EQ(info->ActionsInfo->ExecAction(1, &params), 5);
    EXPECT_EQ(info->ActionsInfo->ConfigAction(1, &params), 5);
    info->ActionsInfo->DeleteAction(1, &params);
    info->ActionsInfo->JobStop(1, &params);
    const TAFEventsInfo& events = *info->EventsInfo;
    TAFEventParams event_params{};
    EXPECT_EQ(events.ConfigEvent(0, &event_params), 5);
    EXPECT_EQ(events.StartEvent(0, &event_params), 5);
    EXPECT_EQ(events.StartEvent(1, &event_params), kLongFalse);
    events.StopEvent(0, &event_params);
    events.DeleteEvent(0, &event_params);
    events.DuplicateEvent(0, &event_params);
    info->About();
    info->PluginConfig();
    info->ShutdownPlugin();
    EXPECT_EQ(ran,
              (std::vector<std::string>{"exec1", "config1", "delete1", "stop1", "event config0",
                                        "event start0", "event stop0", "event delete0",
                                        "event duplicate0", "about", "plugin", "shutdown"}));
    char16_t buffer[kDescriptionBufferLength];
    events.EventDescr(0, &event_params, buffer);
    EXPECT_EQ(std::u16string(buffer), u"New Event!");
}

TEST_F(ComponentTest, WithoutHandlerItemOrParametersNothingRuns) {
    TAction& action = plugin->GetActions().Add();
    plugin->GetActions().Add();
    action.OnExecAction = [](TAction*, TAFActionParams&) { return kLongTrue; };
    TAFPluginInfo* info = plugin->Initialize(host.app_info);
    const TAFActionsInfo& actions = *info->ActionsInfo;
    TAFActionParams params{};
    for (const std::int32_t index : {1, 2, -1, 2147483647, -2147483647}) {
        EXPECT_EQ(actions.ExecAction(index, &params), 0);
        EXPECT_EQ(actions.ConfigAction(index, &params), 0);
        actions.DeleteAction(index, &params);
        actions.JobStop(index, &params);
    }
    EXPECT_EQ(actions.ExecAction(0, nullptr), 0);
    EXPECT_EQ(actions.GetActionInfo(2), nullptr);
    EXPECT_EQ(actions.GetActionInfo(-1), nullptr);
    TPluginCaller caller(host, info);
    EXPECT_EQ(caller.Describe(1, u""), u"New Action");
    EXPECT_EQ(caller.Describe(2, u""), u"");
}

TEST_F(ComponentTest, DescriptionsAreCutFrom257) {
    plugin->GetActions().Add();
    TAFPluginInfo* info = plugin->Initialize(host.app_info);
    EXPECT_EQ(Describe(info, std::u16string(256, u'a')), std::u16string(256, u'a'));
    EXPECT_EQ(Describe(info, std::u16string(257, u'a')), std::u16string(253, u'a') + u"...");
    EXPECT_EQ(Describe(info, std::u16string(9999, u'b')), std::u16string(253, u'b') + u"...");
    EXPECT_EQ(Describe(info, u""), u"");
}

TEST_F(ComponentTest, HostWindowAnswersScaleAndSettings) {
    const std::u16string path = u"C:\\Host\\host.exe";
    std::u16string key = u"Software\\Host";
    std::intptr_t scale = 125;
    std::map<std::uintptr_t, std::int32_t> asked;
    TTestWindow window([&](std::uint32_t message, std::uintptr_t query, std::intptr_t lparam) {
        EXPECT_EQ(message, 24601u);
        EXPECT_EQ(lparam, 0);
        ++asked[query];
        switch (query) {
            case 0: return reinterpret_cast<std::intptr_t>(path.c_str());
            case 4: return std::intptr_t{0x1234};
            case 7: return reinterpret_cast<std::intptr_t>(key.c_str());
            default: return scale;
        }
    });
    host.app_info.WHandle = window.Handle();
    plugin->SetDescription(u" My Graphics ");
    plugin->Initialize(host.app_info);

    TQVPluginSettings settings;
    ReadPluginSettings(settings, *plugin);
    EXPECT_EQ(settings.RegRoot, 0x1234);
    EXPECT_EQ(settings.RegKey, u"Software\\Host\\MyGraphics");
    EXPECT_EQ(settings.AppPath, path);
    key = u"";
    ReadPluginSettings(settings, *plugin);
    EXPECT_EQ(settings.RegKey, u"");

    EXPECT_EQ(TAFPlugin().DefaultScale(), 100) << "without a window";
    constexpr std::int32_t kScales[][2] = {{99, 100},  {100, 100}, {125, 125}, {250, 250},
                                           {251, 100}, {-1, 100},  {0, 100}};
    for (const auto& row : kScales) {
        scale = row[0];
        EXPECT_EQ(plugin->DefaultScale(), row[1]);
    }
    EXPECT_EQ(asked[9], 7);
}

TEST(PluginTexts, TrailingSlash) {
    constexpr const char16_t* kCases[][2] = {
        {u"", u""}, {u"a\\", u"a\\"}, {u"c", u"c:\\"}, {u"7", u"7\\"}, {u"ab", u"ab\\"}};
    for (const auto& row : kCases) {
        EXPECT_EQ(IncludeTrailingSlash(row[0]), row[1]);
    }
}

TEST(VersionCompare, FieldsByFields) {
    struct TCase {
        const char16_t* a;
        const char16_t* b;
        std::int32_t expected;
    };
    constexpr TCase kCases[] = {
        {u"8.3", u"8.3.0.0", 0},      {u"8-3", u"8.3", 0},     {u"8..3", u"8.0.3", 0},
        {u"8.2.99.99", u"8.3", -1},   {u"10", u"8.3", 1},      {u"", u"0.0.0.0", 0},
        {u"8.3.0.0.9", u"8.3", 0},    {u"8.3.0.1", u"8.3", 1}, {u" 8.3", u"0.8.3", 0},
        {u"4294967296.5", u"0.5", 0}, {u"8.x3", u"8.0.3", 0},  {u"-8", u"0.8", 0},
        {u"8.\x0663", u"8.0", 0},  // other scripts' digits are none
    };
    for (const TCase& row : kCases) {
        EXPECT_EQ(CompareVersions(row.a, row.b), row.expected) << row.expected;
        EXPECT_EQ(CompareVersions(row.b, row.a), -row.expected);
    }
}

TEST(VersionCompare, AtMost100CharactersRemainAfterAField) {
    const std::u16string zeros(99, u'0');
    EXPECT_EQ(SplitVersion(u"1." + zeros + u"7")[1], 7);
    EXPECT_EQ(SplitVersion(u"1." + zeros + u"0" + u"7")[1], 0);
}

TEST(Icons, EveryActionHasItsOwnImage) {
    TLinkedPlugin linked;
    TActions& actions = linked.data_module->Plugin.GetActions();
    for (std::int32_t index = 0; index < actions.Count(); ++index) {
        const std::vector<std::uint8_t>& image = actions.GetItem(index)->GetIcon().FileImage();
        ASSERT_EQ(image.size(), 1406u);
        for (std::int32_t other = 0; other < index; ++other) {
            EXPECT_NE(image, actions.GetItem(other)->GetIcon().FileImage());
        }
    }
}

}  // namespace
}  // namespace zm::test
