#include "host/qvjobdocument.h"

#include <gtest/gtest.h>

namespace zm::qvrun {
namespace {

TJobDocument Document(std::string_view text) {
    TJobDocument document;
    TJobFileError error;
    EXPECT_TRUE(document.Parse(text, error)) << error.message;
    return document;
}

TEST(JobDocument, GivesEveryByteBack) {
    for (const std::string_view text : {"", "\n\n", "# only a comment", "[A]",
                                        "\xEF\xBB\xBF; c\r\n[ A ]\r\rk=v\n\n k = \t\n[B]\n",
                                        "#\xFF\n[A]\nx=\xC3\xA4\xFE\xED\xA0\x80\r\n# end"}) {
        EXPECT_EQ(Document(text).Text(), text);
    }
}

TEST(JobDocument, RejectsWhatIsNoJobAndStaysAsItWas) {
    TJobDocument document = Document("[A]\n");
    TJobFileError error;
    EXPECT_FALSE(document.Parse("[A]\nnonsense\n", error));
    EXPECT_EQ(error.line, 2);
    EXPECT_FALSE(document.Parse(std::string_view("#\0", 2), error));
    EXPECT_EQ(document.Text(), "[A]\n");
}

TEST(JobDocument, StepsAreThoseThatRun) {
    const std::string_view text = "# top\n[A]\n; c\nx=1\n\n# b\n[ B ]\ny= 2 \n";
    const TJobDocument document = Document(text);
    TJobFile job;
    TJobFileError error;
    ASSERT_TRUE(ParseJobText(text, job, error));
    ASSERT_EQ(document.StepCount(), job.steps.size());
    for (std::size_t index = 0; index < job.steps.size(); ++index) {
        EXPECT_EQ(document.Step(index).action, job.steps[index].action);
        EXPECT_EQ(document.Step(index).text, job.steps[index].text);
        EXPECT_EQ(document.Step(index).line, job.steps[index].line);
    }
}

TEST(JobDocument, SettingsChangeInPlace) {
    TJobDocument document = Document("[A]\n# size\nImage_W=1\n; unit\nu=0\nold=5\n\n[B]\nx=1");
    document.SetStepText(0, u"u=0\r\nimage_w=2=3\r\nnew=4\r\n");
    EXPECT_EQ(document.Text(), "[A]\n# size\nImage_W=2=3\n; unit\nu=0\nnew=4\n\n[B]\nx=1");
    document.SetStepText(1, u"x=1\r\ny=2\r\n");
    EXPECT_EQ(document.Text(), "[A]\n# size\nImage_W=2=3\n; unit\nu=0\nnew=4\n\n[B]\nx=1\ny=2\n");
    document.SetStepText(1, u"");
    EXPECT_EQ(document.Step(1).text, u"");
}

TEST(JobDocument, StepsMoveWithTheirComments) {
    const std::string_view text = "# the job\n[A]\nx=1\n\n# about b\n[B]\n# inside\ny=1\n[C]";
    TJobDocument document = Document(text);
    document.MoveStep(1, 0);
    EXPECT_EQ(document.Text(), "# the job\n# about b\n[B]\n# inside\ny=1\n\n[A]\nx=1\n\n[C]\n");
    document.RemoveStep(0);
    EXPECT_EQ(document.Text(), "# the job\n[A]\nx=1\n\n[C]\n");
    document.MoveStep(0, 1);
    EXPECT_EQ(document.Text(), "# the job\n[C]\n\n[A]\nx=1\n\n");
}

TEST(JobDocument, NewStepsTakeTheFilesLineEnds) {
    TJobDocument document = Document("# job\r\n[A]\r\nx=1");
    document.InsertStep(1, u"B", u"y=1\r\nz=\xDCFF\r\n");
    document.InsertStep(0, u"Z", u"");
    EXPECT_EQ(document.Text(), "# job\r\n[Z]\r\n\r\n[A]\r\nx=1\r\n\r\n[B]\r\ny=1\r\nz=\xFF\r\n");
    TJobDocument empty;
    empty.InsertStep(0, u"A", u"k=v\r\n");
    EXPECT_EQ(empty.Text(), "[A]\nk=v\n");
}

}  // namespace
}  // namespace zm::qvrun
