#include <gtest/gtest.h>
#include <sys/stat.h>

#include <cstdio>
#include <string>

#include "Application.h"
#include "support/ScratchDirectory.h"

namespace {

using TearDown::Application;
using TearDown::Timing;
using TearDown::Words;

const int CALLS = 9;
const int PROCESSES = 5;

struct Situation {
    const char* name;  /**< of the test */
    const char* title; /**< in the table */
    Words words;
    bool hangsInSettings = false; /**< one more recorder hangs in libpulse */
};

void PrintTo(const Situation& situation, std::ostream* out) {
    *out << situation.title;
}

class TearDownTest : public ::testing::TestWithParam<Situation> {
  protected:
    Words makeCommand(const Words& more) const {
        Words words = GetParam().words;
        words.insert(words.end(), more.begin(), more.end());
        if (GetParam().hangsInSettings) {
            words.push_back("fifo=" + directory.path("client.conf"));
        }
        return Application::makeCommand(words);
    }

    void SetUp() override { ASSERT_EQ(::mkfifo(directory.path("client.conf").c_str(), 0600), 0); }

    static Timing makeTiming(const std::string& end) {
        return Timing(std::string(GetParam().title) + " | " + end);
    }

    void measureCall(const std::string& end) {
        Timing timing = makeTiming(end);
        Application(makeCommand({"end=" + end, "repeat=" + std::to_string(CALLS)})).finish(timing);
        timing.expectBounded();
    }

    void measureProcess(const std::string& end, const Words& more) {
        Timing timing = makeTiming(end + (more.empty() ? "" : " (" + more[0] + ")"));
        Words words = more;
        words.push_back("end=" + end);
        Timing unused("with a search for leaks");
        Application(makeCommand(words), Application::Leaks::SEARCHED).finish(unused);
        for (int i = 0; i < PROCESSES; ++i) {
            Application(makeCommand(words)).finish(timing);
        }
        timing.expectBounded(TearDown::PROCESS_FACTOR);
    }

    TestSupport::ScratchDirectory directory;
};

TEST_P(TearDownTest, Release) {
    measureCall("release");
}

TEST_P(TearDownTest, Cancel) {
    measureCall("cancel");
}

TEST_P(TearDownTest, DestructionOfEverything) {
    measureCall("destroy");
}

TEST_P(TearDownTest, ReturnFromMain) {
    measureProcess("return", {});
}

TEST_P(TearDownTest, ExitWithWhatWasNeverReleased) {
    measureProcess("exit", {"leaked=1"});
}

const Situation SITUATIONS[] = {
    {"GatewayReadsNothing", "gateway reads nothing, simple", {"gateway=unread", "mode=simple"}},
    {"GatewayReadsNoSound", "gateway reads nothing, chunked", {"gateway=unread", "mode=chunked"}},
    {"InMidUtterance",
     "gateway silent in mid-utterance, chunked",
     {"gateway=body", "mode=chunked"}},
    {"NoAnswer", "gateway never answers, simple", {"gateway=answer", "mode=simple"}},
    {"NoAnswerToAStream", "gateway never answers, chunked", {"gateway=answer", "mode=chunked"}},
    {"NoAnswerToTheLog",
     "usage log's endpoint never answers",
     {"gateway=answer", "mode=simple", "log=1"}},
    {"SilentNameServer", "name server silent", {"gateway=name", "mode=chunked"}},
    {"DeviceHangs",
     "recorder hangs in its device",
     {"gateway=body", "mode=chunked", "recorder=hang"}},
    {"ClientLibraryHangs",
     "recorder hangs before it has a device",
     {"gateway=body", "mode=chunked"},
     true},
    {"EncoderRuns",
     "encoder has 100 buffers to do",
     {"gateway=body", "mode=chunked", "format=speex", "encoder=1"}},
    {"EverythingAtOnce",
     "all of it at once",
     {"gateway=name", "mode=chunked", "format=speex", "recorder=hang", "log=1"},
     true},
};

INSTANTIATE_TEST_SUITE_P(While, TearDownTest, ::testing::ValuesIn(SITUATIONS),
                         [](const auto& instance) { return std::string(instance.param.name); });

}  // namespace
