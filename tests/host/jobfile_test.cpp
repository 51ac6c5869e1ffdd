#include "host/qvjobfile.h"

#include <gtest/gtest.h>

namespace zm::qvrun {
namespace {

TEST(JobFile, KeepsLinesExactlyAsAHostStoresThem) {
    TJobFile job;
    TJobFileError error;
    const std::string text =
        "\xEF\xBB\xBF# comment\r\n"
        "\n"
        "  [ Open Image ]\n"
        "image_file= a = b \n"
        "; another comment\n"
        "[A_GRAPHICS_SAVE_IMAGE]\r\n"
        "image_file=\xC3\xA4\xFF.png\r\n"
        "format=1";
    ASSERT_TRUE(ParseJobText(text, job, error)) << error.message;
    ASSERT_EQ(job.steps.size(), 2u);
    EXPECT_EQ(job.steps[0].action, u"Open Image");
    EXPECT_EQ(job.steps[0].line, 3);
    EXPECT_EQ(job.steps[0].text, u"image_file= a = b \r\n");
    EXPECT_EQ(job.steps[1].line, 6);
    // A byte that is no UTF-8 travels as a lone surrogate and finds its file again.
    EXPECT_EQ(job.steps[1].text, u"image_file=\u00E4\xDCFF.png\r\nformat=1\r\n");
    EXPECT_FALSE(job.uses_input_file);
}

TEST(JobFile, NoticesInputFileVariables) {
    for (const std::string name : {"{file}", "{dir}", "{name}", "{ext}"}) {
        TJobFile job;
        TJobFileError error;
        ASSERT_TRUE(ParseJobText("[x]\nk=a" + name + "b\n", job, error));
        EXPECT_TRUE(job.uses_input_file) << name;
    }
}

TEST(JobFile, TellsTheLineOfTheFirstFault) {
    const struct {
        std::string text;
        std::int32_t line;
        std::string part;
    } cases[] = {
        {"", 0, "no step"},
        {"# only a comment\n", 0, "no step"},
        {std::string("[x]\0", 4), 0, "not a text"},
        {"key=1\n", 1, "before the first section"},
        {"[x]\n\nkey\n[y\n", 3, "key=value"},
        {"[x]\r\n[y\r\n", 2, "\"]\""},
        {"[x]\r[  ]\r", 2, "must name"},
    };
    for (const auto& c : cases) {
        TJobFile job;
        TJobFileError error;
        EXPECT_FALSE(ParseJobText(c.text, job, error)) << c.text;
        EXPECT_EQ(error.line, c.line) << c.text;
        EXPECT_NE(error.message.find(c.part), std::string::npos) << error.message;
    }
}

}  // namespace
}  // namespace zm::qvrun
