#include "cli/HumanEvents.h"

#include <gmock/gmock.h>

#include <algorithm>
#include <sstream>

#include "Events.h"

namespace {

using Cli::SessionEvent;
using Talvox::Recognition;
using ::testing::EndsWith;
using ::testing::HasSubstr;

/** A session from its beginning to two hypotheses. */
std::string printedSession(bool terminal) {
    std::ostringstream out;
    Cli::HumanEvents printer(out, terminal);
    printer.print(TestSupport::event(SessionEvent::RECORDING_BEGIN, 203));
    printer.print(TestSupport::power(303, 22.5F));
    printer.print(TestSupport::event(SessionEvent::SPEAKING_BEGIN, 903));
    printer.print(TestSupport::power(1003, 45.0F));
    printer.print(TestSupport::event(SessionEvent::RECORDING_DONE, 2103));
    printer.print(TestSupport::results(2403, Recognition::OutcomeAccepted,
                                       {{"go forward ten meters", 0.934F}, {"go", -1.0F}},
                                       "abc123"));
    return out.str();
}

TEST(HumanEvents, PrintsLinesWithoutControlCharactersWhereThereIsNoTerminal) {
    const std::string text = printedSession(false);
    EXPECT_EQ(text,
              "   203 ms  recording, speak now\n"
              "   303 ms  [###############---------------]  22.5 dB\n"
              "   903 ms  speech begins\n"
              "  1003 ms  [##############################]  45.0 dB\n"
              "  2103 ms  recording done, waiting for the answer\n"
              "  2403 ms  answer, 300 ms after the end of speech\n"
              "\n"
              "  #  hypothesis             confidence\n"
              "  1  go forward ten meters  0.934\n"
              "  2  go                     unknown\n"
              "\n"
              "verdict: accepted\n"
              "request: abc123\n");
    EXPECT_TRUE(std::none_of(text.begin(), text.end(), [](char character) {
        return static_cast<unsigned char>(character) < 0x20 && character != '\n';
    }));
}

TEST(HumanEvents, RedrawsTheBarInPlaceOnATerminal) {
    EXPECT_THAT(printedSession(true),
                HasSubstr("   203 ms  recording, speak now\n"
                          "\r   303 ms  [###############---------------]  22.5 dB\x1b[K"
                          "\r\x1b[K   903 ms  speech begins\n"));
}

TEST(HumanEvents, ShowsDigitalSilenceAsSilence) {
    SessionEvent silence = TestSupport::power(303, -87.25F);
    silence.isSilence = true;
    std::ostringstream out;
    Cli::HumanEvents(out, false).print(silence);
    EXPECT_EQ(out.str(), "   303 ms  [------------------------------]  silence\n");
}

TEST(HumanEvents, NamesAnErrorAndItsReason) {
    std::ostringstream out;
    Cli::HumanEvents printer(out, false);
    printer.print(TestSupport::failure(5100, 6));
    printer.print(TestSupport::failure(700, 3, "HTTP \x1b[2Jstatus 404"));
    EXPECT_EQ(out.str(),
              "  5100 ms  error: ErrorNoVoice\n"
              "   700 ms  error: ErrorNetwork: HTTP ?[2Jstatus 404\n");
}

TEST(HumanEvents, SaysSoWhenThereAreNoHypotheses) {
    std::ostringstream out;
    Cli::HumanEvents(out, false)
        .print(TestSupport::results(10, Recognition::OutcomeUncertain, {}, ""));
    EXPECT_THAT(out.str(), HasSubstr("  -  (none)"));
    EXPECT_THAT(out.str(), EndsWith("verdict: uncertain\nrequest: \n"));
}

TEST(HumanEvents, LetsNoTextControlTheTerminal) {
    std::ostringstream out;
    Cli::HumanEvents(out, true).print(TestSupport::results(10, Recognition::OutcomeRejected,
                                                           {{"\x1b[2Jhi\r", 0.1F}},
                                                           "\x07"
                                                           "id"));
    EXPECT_THAT(out.str(), HasSubstr("?[2Jhi?"));
    EXPECT_THAT(out.str(), HasSubstr("request: ?id\n"));
    EXPECT_EQ(out.str().find('\x1b'), std::string::npos);
}

}  // namespace
