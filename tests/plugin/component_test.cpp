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

TEST_F(ComponentTest, ASecondInitializeIsRefused) {
    plugin->Initialize(host.app_info);
    TAFPlugin second;
    try {
        second.Initialize(host.app_info);
        FAIL() << "accepted";
    } catch (const EPluginException& error) {
        EXPECT_STREQ(error.what(), "Project can have only one component TAFPlugin");
    }
    EXPECT_EQ(PluginInstance(), plugin.get());
}

/// Name of the handler that each function of the record ran, with its item's index.
TEST_F(ComponentTest, EachActionFunctionRunsItsOwnHandler) {
    std::vector<std::string> ran;
    const auto note = [&ran](const char* name) {
        return [&ran, name](TAction* sender, TAFActionParams&) {
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
    plugin->OnAbout = [&ran] { ran.push_back("about"); };
    plugin->OnPluginConfig = [&ran] { ran.push_back("plugin"); };
    plugin->OnShutdownPlugin = [&ran] { ran.push_back("shutdown"); };
    const TAFPluginInfo* info = plugin->Initialize(host.app_info);
    const TAFActionsInfo& actions = *info->ActionsInfo;
    TAFActionParams params{};
    EXPECT_EQ(actions.ExecAction(1, &params), 5);
    EXPECT_EQ(actions.ConfigAction(1, &params), 5);
    actions.DeleteAction(1, &params);
    actions.JobStop(1, &params);
    info->About();
    info->PluginConfig();
    info->ShutdownPlugin();
    EXPECT_EQ(ran, (std::vector<std::string>{"exec1", "config1", "delete1", "stop1", "about",
                                             "plugin", "shutdown"}));
}

TEST_F(ComponentTest, EachEventFunctionRunsItsOwnHandler) {
    std::vector<std::string> ran;
    const auto note = [&ran](const char* name) {
        return [&ran, name](TEvent*, TAFEventParams& params) {
            ran.push_back(name + std::to_string(params.JobID));
            return kLongTrue;
        };
    };
    TEvent& event = plugin->GetEvents().Add();
    event.OnConfigEvent = note("config");
    event.OnStartEvent = note("start");
    event.OnStopEvent = note("stop");
    event.OnDeleteEvent = note("delete");
    event.OnDuplicateEvent = note("duplicate");
    event.OnEventDescr = [](TEvent*, TAFEventParams&, std::u16string& Descr) { Descr += u"!"; };
    plugin->GetEvents().Add();
    const TAFEventsInfo& events = *plugin->Initialize(host.app_info)->EventsInfo;
    TAFEventParams params{};
    params.JobID = 3;
    EXPECT_EQ(events.ConfigEvent(0, &params), kLongTrue);
    EXPECT_EQ(events.StartEvent(0, &params), kLongTrue);
    events.StopEvent(0, &params);
    events.DeleteEvent(0, &params);
    events.DuplicateEvent(0, &params);
    EXPECT_EQ(ran,
              (std::vector<std::string>{"config3", "start3", "stop3", "delete3", "duplicate3"}));
    char16_t buffer[kDescriptionBufferLength];
    events.EventDescr(0, &params, buffer);
    EXPECT_EQ(std::u16string(buffer), u"New Event!");
    EXPECT_EQ(events.StartEvent(1, &params), kLongFalse);
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

    constexpr std::int32_t kScales[][2] = {{99, 100},  {100, 100}, {125, 125}, {250, 250},
                                           {251, 100}, {-1, 100},  {0, 100}};
    for (const auto& row : kScales) {
        scale = row[0];
        EXPECT_EQ(plugin->DefaultScale(), row[1]);
    }
    EXPECT_EQ(asked[9], 7);
}

TEST_F(ComponentTest, WithoutAWindowEverythingIsEmpty) {
    plugin->Initialize(host.app_info);
    TQVPluginSettings settings;
    settings.AppPath = u"old";
    ReadPluginSettings(settings, *plugin);
    EXPECT_EQ(settings.AppPath, u"");
    EXPECT_EQ(settings.RegKey, u"");
    EXPECT_EQ(plugin->DefaultScale(), 100);
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
