#include "host/qvvariables.h"

#include <gtest/gtest.h>

namespace zm::qvrun {
namespace {

TJobVariables Sample() {
    TJobVariables variables;
    variables.file = u"photos/summer/sea.view.JPG";
    variables.out = u"out";
    variables.index = 7;
    variables.date = u"2026-11-21";
    variables.time = u"14-05-09";
    variables.user[u"size"] = u"{file}";
    variables.user[u"name"] = u"mine";
    return variables;
}

TEST(Variables, Table) {
    const TJobVariables variables = Sample();
    const std::pair<std::u16string, std::u16string> cases[] = {
        {u"", u""},
        {u"plain }{ text", u"plain }{ text"},
        {u"{file}", u"photos/summer/sea.view.JPG"},
        {u"{dir}/x", u"photos/summer/x"},
        {u"{ext}|{index}|{out}", u"JPG|7|out"},
        {u"{date}T{time}", u"2026-11-21T14-05-09"},
        {u"{name}", u"mine"},    // --set wins over the built-in one
        {u"{size}", u"{file}"},  // and is not expanded again
        {u"{unknown}{index}", u"{unknown}7"},
        {u"{{index}}", u"{7}"},
        {u"{index", u"{index"},
        {u"{env:ZM_SURELY_NOT_SET}|", u"|"},
    };
    for (const auto& [text, expected] : cases) {
        EXPECT_EQ(ExpandJobText(text, variables), expected);
    }
}

TEST(Variables, PartsOfPlainNames) {
    TJobVariables variables;
    variables.file = u"sea.view.png";
    EXPECT_EQ(ExpandJobText(u"{dir}|{name}|{ext}", variables), u".|sea.view|png");
    variables.file = u"/root/noextension";
    EXPECT_EQ(ExpandJobText(u"{dir}|{name}|{ext}", variables), u"/root|noextension|");
    variables.file = u"";
    EXPECT_EQ(ExpandJobText(u"{file}|{dir}|{name}|{ext}", variables), u"|.||");
}

TEST(Variables, ClockHasItsFixedForm) {
    TJobVariables variables;
    SetVariablesClock(variables);
    EXPECT_EQ(variables.date.size(), 10u);
    EXPECT_EQ(variables.time.size(), 8u);
    EXPECT_EQ(variables.date[4], u'-');
    EXPECT_EQ(variables.time[2], u'-');
}

}  // namespace
}  // namespace zm::qvrun
