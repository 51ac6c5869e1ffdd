// The key=value text of a step: reading, hostile texts, and the way back into the host's block.
#include "plugin/uQVPluginUtils.h"

#include <gtest/gtest.h>

#include <optional>
#include <string>

#include "engine/foundation/zmnumbers.h"
#include "plugin/AFPlugin.h"
#include "tests/plugin/testhost.h"
#include "tests/support/testmessage.h"

namespace zm::test {
namespace {

TQVPluginParams Parse(const std::u16string& text) {
    TAFActionParams params{};
    params.PPtr = const_cast<char16_t*>(text.c_str());
    params.Size = 2;  // not consulted
    return TQVPluginParams(params);
}

/// The text that the parameters write.
std::u16string Written(const TQVPluginParams& params) {
    TAFActionParams record{};
    params.ToActionParams(record);
    std::u16string text(static_cast<const char16_t*>(record.PPtr));
    EXPECT_EQ(static_cast<std::size_t>(record.Size), (text.size() + 1) * 2);
    HostFreeMemory(&record.PPtr, record.Size);
    return text;
}

TEST(Params, FirstLineOfAKeyWinsWithoutCase) {
    const auto params = Parse(u"junk\r\nName=a=b\nname=second\rÄrger=1\r\n=nokey\r\nx=");
    EXPECT_EQ(params.GetString(u"NAME"), u"a=b");
    EXPECT_EQ(params.GetString(u"ärGER"), u"1");
    EXPECT_FALSE(params.ParamExist(u"junk"));
    EXPECT_FALSE(params.ParamExist(u"nam"));
    EXPECT_TRUE(params.ParamExist(u"x"));
    EXPECT_EQ(params.GetStringDef(u"x", u"default"), u"");
    EXPECT_EQ(params.GetStringDef(u"y", u"default"), u"default");
}

TEST(Params, RecordFieldsAreTaken) {
    TAFActionParams action{};
    action.TaskID = 0xFFFFFFFE;
    action.StepNum = 12;
    action.IsRemote = 4;
    const TQVPluginParams step(action);
    EXPECT_EQ(step.GetParamsType(), ptAction);
    EXPECT_EQ(step.GetTaskId(), -2);
    EXPECT_EQ(step.GetStepNum(), 12);
    EXPECT_TRUE(step.GetIsRemote());
    EXPECT_FALSE(step.ParamExist(u"")) << "a nil text is empty";

    TAFEventParams event{};
    event.JobID = 5;
    event.UniqueID = 9;
    const TQVPluginParams trigger(event);
    EXPECT_EQ(trigger.GetParamsType(), ptEvent);
    EXPECT_EQ(trigger.GetTaskId(), 5);
    EXPECT_EQ(trigger.GetUniqueId(), 9);
    EXPECT_FALSE(trigger.GetIsRemote());
}

TEST(Params, IntegersAndBooleansFallBackAsStated) {
    struct TCase {
        const char16_t* value;  ///< nil: the key is missing
        std::optional<std::int32_t> integer;
        bool with_false;
        bool with_true;
    };
    constexpr TCase kCases[] = {
        {nullptr, {}, false, true},
        {u"", {}, false, true},
        {u"0", 0, false, false},
        {u"1", 1, true, true},
        {u"-7", -7, true, true},
        {u"abc", {}, false, false},
        {u"1.5", {}, false, false},
        {u"2147483647", 2147483647, true, true},
        {u"-2147483648", kMinInt32, true, true},
        {u"2147483648", {}, false, false},
        {u"99999999999999999999999", {}, false, false},
        {u"\xD800", {}, false, false},
    };
    for (const TCase& row : kCases) {
        const std::u16string text = row.value == nullptr ? u"" : std::u16string(u"k=") + row.value;
        const auto params = Parse(text);
        EXPECT_EQ(params.GetIntegerDef(u"k", 42), row.integer.value_or(42));
        EXPECT_EQ(params.GetInteger(u"k"), row.integer.value_or(0));
        EXPECT_EQ(params.GetBoolDef(u"k", false), row.with_false);
        EXPECT_EQ(params.GetBoolDef(u"k", true), row.with_true);
        EXPECT_EQ(params.GetBool(u"k"), row.with_false);
    }
}

TEST(Params, SettersReplaceAppendAndRemove) {
    TLinkedPlugin plugin;
    auto params = Parse(u"a=1\r\nb=2\r\nA=3\r\n");
    params.SetString(u"A", u"x=y");
    params.SetInteger(u"new", -5);
    params.SetBool(u"b", true);
    EXPECT_EQ(Written(params), u"a=x=y\r\nb=1\r\nA=3\r\nnew=-5\r\n");
    params.SetString(u"a", u"");
    params.SetString(u"missing", u"");
    EXPECT_EQ(Written(params), u"b=1\r\nA=3\r\nnew=-5\r\n");
}

TEST(Params, ListsAreCountAndItems) {
    TLinkedPlugin plugin;
    auto params = Parse(u"");
    params.SetStrings(u"n", {u"", u"one", u"", u"three"});
    EXPECT_EQ(Written(params), u"n_count=4\r\nn_1=one\r\nn_3=three\r\n");
    EXPECT_EQ(params.GetStrings(u"N"), u"one\r\n\r\nthree");
    params.SetStrings(u"n", {u"only"});
    EXPECT_EQ(params.GetStrings(u"n"), u"only");
    EXPECT_TRUE(params.ParamExist(u"n_3")) << "lines of a longer list stay";
    params.SetStrings(u"n", {});
    EXPECT_EQ(params.GetString(u"n_count"), u"0");
    EXPECT_EQ(params.GetStringsDef(u"n", u"none"), u"none");
    EXPECT_EQ(Parse(u"l_count=-3\r\nl_0=x").GetStringsDef(u"l", u"none"), u"none");
    EXPECT_EQ(Parse(u"l_count=2\r\nl_00=x\r\nl_+1=y").GetStringsDef(u"l", u"none"), u"none");
}

TEST(Params, WriteBackAccountsForEveryByte) {
    TLinkedPlugin plugin;
    const std::int64_t before = plugin.host.OutstandingBytes();
    TTestStep step(plugin.host, u"a=1\r\nb=2");
    TQVPluginParams params(step.params);
    params.SetString(u"c", u"three");
    params.ToActionParams(step.params);
    EXPECT_EQ(step.Text(), u"a=1\r\nb=2\r\nc=three\r\n");
    EXPECT_EQ(step.params.Size, (5 + 5 + 9 + 1) * 2);
    EXPECT_EQ(plugin.host.OutstandingBytes(), before + step.params.Size);

    params.Clear();
    params.ToActionParams(step.params);
    EXPECT_EQ(step.params.Size, 2);
    EXPECT_EQ(step.Text(), u"");
    EXPECT_EQ(plugin.host.OutstandingBytes(), before + 2);

    plugin.host.refuse_from_bytes = 1;
    EXPECT_THROW(params.ToActionParams(step.params), std::bad_alloc);
    EXPECT_EQ(step.params.PPtr, nullptr);
    EXPECT_EQ(step.params.Size, 0);
}

TEST(Params, EventsAndActionsAreNotMixedUp) {
    TLinkedPlugin plugin;
    TAFActionParams action{};
    TAFEventParams event{};
    EXPECT_EQ(MessageOf([&] { TQVPluginParams(event).ToActionParams(action); }),
              "This is NOT action parameters");
    EXPECT_EQ(MessageOf([&] { TQVPluginParams(action).ToEventParams(event); }),
              "This is NOT triggering event parameters");
    TQVPluginParams(event).ToEventParams(event);
    EXPECT_EQ(event.Size, 2);
    HostFreeMemory(&event.PPtr, event.Size);
}

TEST(Params, HostileTextsEndInDefaults) {
    const std::u16string megabyte(1 << 20, u'v');
    EXPECT_EQ(Parse(u"k=" + megabyte).GetString(u"k"), megabyte);
    EXPECT_EQ(Parse(megabyte).GetString(u"k"), u"");
    EXPECT_EQ(Parse(std::u16string(1 << 20, u'\n') + u"k=v").GetString(u"k"), u"v");
    const std::u16string joined = Parse(u"l_count=2147483647\r\nl_0=first").GetStrings(u"l");
    EXPECT_EQ(joined.size(), 5 + 2 * (static_cast<std::size_t>(kMaxListItems) - 1));
}

}  // namespace
}  // namespace zm::test
