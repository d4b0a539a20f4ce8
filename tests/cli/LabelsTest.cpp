#include "cli/corpus/Labels.h"

#include <gmock/gmock.h>

#include "support/ScratchDirectory.h"

namespace {

using Cli::Label;
using ::testing::IsEmpty;
using ::testing::SizeIs;
using TestSupport::ScratchDirectory;

class LabelsTest : public ::testing::Test {
  protected:
    std::vector<Label> read(const std::string& text) {
        return Cli::readLabels(directory.write("a.txt", text), 5000);
    }

    /** What is wrong with a text, without the path before it. */
    std::string faultOf(const std::string& text) {
        try {
            read(text);
        } catch (const Cli::LabelError& error) {
            const std::string message = error.what();
            const std::string path = directory.path("a.txt");
            EXPECT_EQ(message.substr(0, path.size()), path);
            return message.substr(path.size());
        }
        return "";
    }

    const ScratchDirectory directory;
};

TEST_F(LabelsTest, ReadsWhatAudacityExports) {
    const std::vector<Label> labels =
        read("0.500000\t1.234600\tturn on\r\n\\\t100.0\t2000.0\n\n2\t4.5\t\n4.5\t5.01\tlight\tx\n");
    ASSERT_THAT(labels, SizeIs(3));
    EXPECT_EQ(labels[0].startMs, 500);
    EXPECT_EQ(labels[0].endMs, 1235);
    EXPECT_EQ(labels[0].text, "turn on");
    EXPECT_EQ(labels[1].startMs, 2000);
    EXPECT_EQ(labels[1].endMs, 4500);
    EXPECT_EQ(labels[1].text, "");
    EXPECT_EQ(labels[2].endMs, 5010);
    EXPECT_EQ(labels[2].text, "light\tx");
}

TEST_F(LabelsTest, TakesASoundForNoiseOnlyIfALabelSaysSo) {
    EXPECT_THAT(read("0\t5\t(noise)\n"), IsEmpty());
    EXPECT_THAT(read("0\t1\t(noise)\n1\t2\tword\n"), SizeIs(1));
    const std::string none =
        ":1: there is no label; one with the text (noise) marks a sound without speech";
    EXPECT_EQ(faultOf(""), none);
    EXPECT_EQ(faultOf("\n\\\t1\t2\n"), none);
}

TEST_F(LabelsTest, NamesFileAndLineOfEachFault) {
    EXPECT_EQ(faultOf("0.1\t0.5\ta\n0.4\t0.9\tb\n"),
              ":2: the label begins at 0.400 s, before the end of the one above (0.500 s)");
    EXPECT_EQ(faultOf("0.1\t5.011\ta\n"),
              ":1: the label ends at 5.011 s, behind the end of the sound (5.000 s)");
    EXPECT_EQ(faultOf("-0.1\t0.5\ta\n"), ":1: the label begins before the sound");
    EXPECT_EQ(faultOf("\n0.1\n"),
              ":2: the label has no end; expected start, end and text, separated by tabs");
    EXPECT_EQ(faultOf("0.1\t\ta\n"),
              ":1: the label has no end; expected start, end and text, separated by tabs");
    EXPECT_EQ(faultOf("0.3\t0.3\ta\n"), ":1: the label at 0.300 s has no length");
    EXPECT_EQ(faultOf("0.3\t0.2\ta\n"),
              ":1: the label ends at 0.200 s, before its start at 0.300 s");
    for (const char* word : {"x", "0,5", "1e9", "nan", "inf", "0.5s", " 1", "\x1b[2J"}) {
        EXPECT_EQ(faultOf(std::string("1\t2\ta\n") + word + "\t9\ta\n").substr(0, 13),
                  ":2: the start")
            << word;
    }
    EXPECT_EQ(faultOf("0.5 0.7 a\n"), ":1: the start \"0.5 0.7 a\" is not a time in seconds");
}

TEST_F(LabelsTest, NamesAFileThatCannotBeRead) {
    try {
        Cli::readLabels(directory.path("none.txt"), 5000);
        FAIL();
    } catch (const Cli::LabelError& error) {
        EXPECT_EQ(error.what(),
                  directory.path("none.txt") + ":1: cannot read it: No such file or directory");
    }
}

TEST_F(LabelsTest, ReadsWhatItWrites) {
    const std::string text = Cli::labelText({{10, 1230, "go on"}, {4000, 5000, ""}}, 5000);
    EXPECT_EQ(text, "0.010000\t1.230000\tgo on\n4.000000\t5.000000\t\n");
    const std::vector<Label> labels = read(text);
    ASSERT_THAT(labels, SizeIs(2));
    EXPECT_EQ(labels[0].endMs, 1230);
    EXPECT_EQ(labels[1].startMs, 4000);
    EXPECT_EQ(Cli::labelText({}, 60000), "0.000000\t60.000000\t(noise)\n");
}

}  // namespace
