#include "cli/JsonEvents.h"

#include <gtest/gtest.h>

#include <limits>
#include <sstream>

#include "Events.h"

namespace {

using Cli::SessionEvent;
using Talvox::Recognition;

std::string printed(const SessionEvent& event) {
    std::ostringstream out;
    Cli::JsonEvents(out).print(event);
    return out.str();
}

TEST(JsonEvents, PrintsOneObjectALine) {
    EXPECT_EQ(printed(TestSupport::event(SessionEvent::RECORDING_BEGIN, 203)),
              "{\"event\":\"recordingBegin\",\"ms\":203}\n");
    EXPECT_EQ(printed(TestSupport::event(SessionEvent::SPEAKING_BEGIN, 900)),
              "{\"event\":\"speakingBegin\",\"ms\":900}\n");
    EXPECT_EQ(printed(TestSupport::event(SessionEvent::RECORDING_DONE, 2100)),
              "{\"event\":\"recordingDone\",\"ms\":2100}\n");
}

TEST(JsonEvents, PrintsTheLevelOfPower) {
    EXPECT_EQ(printed(TestSupport::power(300, 21.5F)),
              "{\"event\":\"power\",\"ms\":300,\"level\":21.5,\"silence\":false}\n");
    SessionEvent silence = TestSupport::power(300, -87.25F);
    silence.isSilence = true;
    EXPECT_EQ(printed(silence),
              "{\"event\":\"power\",\"ms\":300,\"level\":-87.25,\"silence\":true}\n");
    EXPECT_EQ(printed(TestSupport::power(300, 0.1F)),
              "{\"event\":\"power\",\"ms\":300,\"level\":0.1,\"silence\":false}\n");
    EXPECT_EQ(printed(TestSupport::power(300, std::numeric_limits<float>::quiet_NaN())),
              "{\"event\":\"power\",\"ms\":300,\"level\":null,\"silence\":false}\n");
}

TEST(JsonEvents, PrintsCodeAndNameOfAnError) {
    EXPECT_EQ(printed(TestSupport::failure(5100, 6)),
              "{\"event\":\"error\",\"ms\":5100,\"code\":6,\"name\":\"ErrorNoVoice\"}\n");
}

TEST(JsonEvents, PrintsTheReasonOfAnErrorWhereItIsKnown) {
    EXPECT_EQ(printed(TestSupport::failure(700, 3, "HTTP status 404")),
              "{\"event\":\"error\",\"ms\":700,\"code\":3,\"name\":\"ErrorNetwork\","
              "\"reason\":\"HTTP status 404\"}\n");
}

TEST(JsonEvents, PrintsOutcomeAndHypotheses) {
    EXPECT_EQ(printed(TestSupport::results(2400, Recognition::OutcomeAccepted,
                                           {{"go forward", 0.95F}, {"go four", 0.5F}}, "r1")),
              "{\"event\":\"results\",\"ms\":2400,\"outcome\":\"accepted\",\"outcomeCode\":1,"
              "\"requestId\":\"r1\",\"hypotheses\":[{\"text\":\"go forward\",\"confidence\":0.95},"
              "{\"text\":\"go four\",\"confidence\":0.5}]}\n");
}

TEST(JsonEvents, PrintsAnEmptyListWithoutHypotheses) {
    EXPECT_EQ(printed(TestSupport::results(1, Recognition::OutcomeUncertain, {}, "")),
              "{\"event\":\"results\",\"ms\":1,\"outcome\":\"uncertain\",\"outcomeCode\":2,"
              "\"requestId\":\"\",\"hypotheses\":[]}\n");
    EXPECT_EQ(printed(TestSupport::results(1, Recognition::OutcomeRejected, {{"a", -1.0F}}, "")),
              "{\"event\":\"results\",\"ms\":1,\"outcome\":\"rejected\",\"outcomeCode\":0,"
              "\"requestId\":\"\",\"hypotheses\":[{\"text\":\"a\",\"confidence\":-1.0}]}\n");
}

TEST(JsonEvents, EscapesWhatJsonCannotCarry) {
    const std::string line = printed(TestSupport::results(
        1, Recognition::OutcomeAccepted, {{"a\"b\\c\n\t\x01 \xC3\xA9", 1.0F}}, "x\"y"));
    EXPECT_EQ(line,
              "{\"event\":\"results\",\"ms\":1,\"outcome\":\"accepted\",\"outcomeCode\":1,"
              "\"requestId\":\"x\\\"y\",\"hypotheses\":[{\"text\":"
              "\"a\\\"b\\\\c\\n\\t\\u0001 \xC3\xA9\",\"confidence\":1.0}]}\n");
}

TEST(JsonEvents, ReplacesBytesThatAreNotUtf8) {
    const std::string line = printed(TestSupport::results(1, Recognition::OutcomeAccepted,
                                                          {{"a\xFF"
                                                            "b\xC3",
                                                            1.0F}},
                                                          ""));
    EXPECT_EQ(nlohmann::json::parse(line)["hypotheses"][0]["text"],
              "a\xEF\xBF\xBD"
              "b\xEF\xBF\xBD");
}

TEST(JsonEvents, NumbersReadBackAsTheSameFloat) {
    for (const float value : {0.85F, 0.1F, 1.0F / 3, 45.3087F, -1.0F, 1e-30F, 3e38F}) {
        EXPECT_EQ(static_cast<float>(Cli::toJsonNumber(value).get<double>()), value);
    }
    EXPECT_EQ(Cli::toJsonNumber(0.85F).dump(), "0.85");
    EXPECT_TRUE(Cli::toJsonNumber(std::numeric_limits<float>::infinity()).is_null());
}

}  // namespace
