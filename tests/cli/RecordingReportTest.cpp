// talvox report: its table, its JSON, and its page in a real browser.
#include <gmock/gmock.h>

#include <filesystem>
#include <memory>
#include <sstream>

#include "RecordedSession.h"
#include "ToolProcess.h"
#include "support/Browser.h"
#include "support/ScratchDirectory.h"

namespace {

using ::testing::ElementsAre;
using ::testing::HasSubstr;
using ::testing::Not;
using TestSupport::Browser;
using TestSupport::makeStreamedSession;
using TestSupport::RecordedSession;
using TestSupport::runTalvox;
using TestSupport::ToolResult;
using Json = nlohmann::json;

const char* const HOSTILE = "</script><img src=x onerror=window.broken=1><b>&amp;";

class RecordingReportTest : public ::testing::Test {
  protected:
    std::string write(const std::string& name, const RecordedSession& session,
                      bool hasSound = true) {
        session.write(directory.path(name), hasSound);
        return directory.path(name);
    }

    /** A session whose results come some time after 2,500 ms; nothing else is in it. */
    static RecordedSession lateSession(int lateMs) {
        RecordedSession session;
        session.addEvent(2000, "recordingDone");
        session.addEvent(2500 + lateMs, "results");
        session.add(2600 + lateMs, "end", {{"reason", "over"}});
        return session;
    }

    static std::vector<Json> parseLines(const std::string& text) {
        std::vector<Json> objects;
        std::istringstream in(text);
        for (std::string line; std::getline(in, line);) {
            objects.push_back(Json::parse(line));
        }
        return objects;
    }

    const TestSupport::ScratchDirectory directory;
    const std::string page = directory.path("report.html");
};

TEST_F(RecordingReportTest, PrintsTheStagesOfASession) {
    const std::string folder = write("one", makeStreamedSession(), false);
    const ToolResult result = runTalvox({"report", folder});
    EXPECT_EQ(result.status, 0) << result.err;
    EXPECT_EQ(result.out,
              folder +
                  " 2026-11-22T05:10:57Z results\n"
                  "There is no sound.wav that can be read.\n"
                  "The end of speech is not known without sound; the times begin where recording "
                  "stops.\n"
                  "\n"
                  "      ms  stage\n"
                  "       0  sound not yet sent at the end of speech\n"
                  "       0  detector's wait\n"
                  "      20  encoding\n"
                  "       0  connection\n"
                  "      30  upload\n"
                  "     420  service\n"
                  "      10  delivery\n"
                  "     480  total\n");
    EXPECT_EQ(result.err, "");
}

TEST_F(RecordingReportTest, PrintsMediansAndTheSlowestOfSeveral) {
    for (int i = 0; i < 12; ++i) {
        write("many/" + std::to_string(100 + i), lateSession(100 * i), false);
    }
    write("many/broken", RecordedSession(), false);
    const ToolResult result = runTalvox({"report", directory.path("many")});
    EXPECT_EQ(result.status, 0) << result.err;
    EXPECT_THAT(result.out, HasSubstr("13 sessions, 12 with times\n"));
    EXPECT_THAT(result.out, HasSubstr("    1000    1500  total\n"));
    EXPECT_THAT(result.out, HasSubstr("   total  slowest (ms)\n"
                                      "    1600  " +
                                      directory.path("many/111") + "\n    1500  " +
                                      directory.path("many/110") + "\n"));
    EXPECT_THAT(result.out, HasSubstr("     700  " + directory.path("many/102") + "\n"));
    EXPECT_THAT(result.out, Not(HasSubstr(directory.path("many/101"))));
    EXPECT_THAT(result.out,
                HasSubstr(directory.path("many/broken") +
                          ": no times: the session has neither results nor an error\n"));
}

TEST_F(RecordingReportTest, RefusesWhatIsNoRecording) {
    EXPECT_EQ(runTalvox({"report"}).status, 2);
    const ToolResult nothing = runTalvox({"report", directory.path("none")});
    EXPECT_EQ(nothing.status, 2);
    EXPECT_EQ(nothing.err,
              "talvox: " + directory.path("none") + " is no recording, and there is none in it\n");
    RecordedSession newer;
    newer.session["format"] = 2;
    const std::string folder = write("newer", newer);
    const ToolResult refused = runTalvox({"report", folder, "--output", page});
    EXPECT_EQ(refused.status, 2);
    EXPECT_EQ(refused.err,
              "talvox: " + folder + " was recorded in format 2; this tool reads format 1\n");
    EXPECT_FALSE(std::filesystem::exists(page));
}

TEST_F(RecordingReportTest, PrintsNothingThatControlsATerminal) {
    RecordedSession session;
    session.session["time"] = "\x1b[2J\xff";
    session.addEvent(1, "recordingDone");
    session.addEvent(2, "error", {{"name", "\x1b]0;title\x07\xfe"}});
    const ToolResult result = runTalvox({"report", write("one", session)});
    EXPECT_EQ(result.status, 0) << result.err;
    EXPECT_THAT(result.out, Not(HasSubstr("\x1b")));
    EXPECT_THAT(result.out, HasSubstr("[2J"));
}

class RecordingPageTest : public RecordingReportTest {
  protected:
    void SetUp() override {
        if (!TestSupport::ChildProcess::isInstalled(Browser::PROGRAM)) {
            GTEST_SKIP() << "needs the package " << Browser::PROGRAM;
        }
        std::filesystem::create_directory(directory.path("browser"));
        browser = std::make_unique<Browser>(directory.path("browser"));
    }

    /** Makes a report and opens it. @return what the tool prints */
    std::vector<Json> open(const std::string& folder) {
        const ToolResult result = runTalvox({"report", folder, "--json", "--output", page});
        EXPECT_EQ(result.status, 0) << result.err;
        browser->open("file://" + page);
        return parseLines(result.out);
    }

    /** The numbers of a name in the page, in the page's order. */
    Json numbers(const std::string& name) {
        return browser->evaluate("[...document.querySelectorAll('[data-name=" + name +
                                 "]')].map((one) => Number(one.dataset.value))");
    }

    std::string textOf(const std::string& selector) {
        return browser->evaluate("document.querySelector('" + selector + "').textContent")
            .get<std::string>();
    }

    std::unique_ptr<Browser> browser;
};

TEST_F(RecordingPageTest, HoldsTheNumbersThatTheToolPrints) {
    const std::vector<Json> lines = open(write("one", makeStreamedSession()));
    ASSERT_EQ(lines.size(), 1U);
    int64_t sum = 0;
    for (const auto& [name, ms] : lines[0]["stages"].items()) {
        EXPECT_EQ(numbers(name), Json::array({ms})) << name;
        sum += ms.get<int64_t>();
    }
    EXPECT_EQ(numbers("totalMs"), Json::array({sum}));
    EXPECT_EQ(lines[0]["totalMs"], sum);
    EXPECT_EQ(numbers("lookup"), Json::array({5}));
    EXPECT_EQ(numbers("connect"), Json::array({4}));
    EXPECT_EQ(numbers("pieces"), Json::array({21}));
    EXPECT_EQ(numbers("waiting"), Json::array({410}));
    EXPECT_EQ(numbers("answer"), Json::array({10}));
    EXPECT_EQ(numbers("happenedMs"), Json::parse("[0,220,820,2020,2495,2500]"));
    EXPECT_EQ(browser->evaluate("document.querySelectorAll('canvas').length"), Json(2));
    EXPECT_THAT(browser->getComplaints(), ElementsAre());
    const std::string text = TestSupport::ScratchDirectory::read(page);
    EXPECT_THAT(text, Not(HasSubstr("src=\"")));
    EXPECT_THAT(text, Not(HasSubstr("@import")));
}

TEST_F(RecordingPageTest, PlaysTheSound) {
    open(write("one", makeStreamedSession()));
    EXPECT_EQ(browser->evaluate("new Promise((resolve, reject) => {"
                                "  const audio = document.querySelector('audio');"
                                "  audio.addEventListener('error', () => reject(audio.error));"
                                "  audio.addEventListener('ended', () => resolve(audio.duration));"
                                "  audio.play().catch(reject);"
                                "})"),
              Json(2));
    EXPECT_THAT(browser->getComplaints(), ElementsAre());
}

TEST_F(RecordingPageTest, LinksTheSlowestOfSeveral) {
    for (int i = 0; i < 12; ++i) {
        write("many/" + std::to_string(100 + i), lateSession(100 * i), false);
    }
    const std::vector<Json> lines = open(directory.path("many"));
    ASSERT_EQ(lines.size(), 13U);
    const Json& statistics = lines[12];
    EXPECT_EQ(statistics["total"], Json::parse(R"({"median":1000,"p90":1500})"));
    EXPECT_EQ(numbers("median").back(), statistics["total"]["median"]);
    EXPECT_EQ(numbers("p90").back(), statistics["total"]["p90"]);
    EXPECT_EQ(numbers("slowestMs"),
              Json::parse("[1600,1500,1400,1300,1200,1100,1000,900,800,700]"));
    EXPECT_EQ(textOf("#detail"), "111");
    browser->evaluate("document.querySelectorAll('td a')[3].click()");
    EXPECT_EQ(textOf("#detail"), "108");
    EXPECT_EQ(numbers("totalMs"), Json::parse("[1300]"));
    EXPECT_EQ(browser->evaluate("document.querySelectorAll('canvas').length"), Json(1));
    EXPECT_THAT(browser->getComplaints(), ElementsAre());
}

TEST_F(RecordingPageTest, ShowsWhatItFindsAsText) {
    RecordedSession session = makeStreamedSession();
    session.session["source"] = HOSTILE;
    session.session["time"] = HOSTILE;
    session.session["kit"] = HOSTILE;
    session.add(1, "call", {{"call", HOSTILE}});
    session.add(1, "attempt", {{"attempt", 2}});
    session.add(2, "attemptEnd", {{"attempt", 2}, {"code", HOSTILE}, {"reason", HOSTILE}});
    session.addEvent(2498, "error", {{"name", HOSTILE}, {"reason", HOSTILE}});
    session.addEvent(2499, HOSTILE, {{"outcome", HOSTILE}});
    open(write(std::string("<img src=x onerror=window.broken=1>"), session));
    EXPECT_EQ(textOf("h1"), "<img src=x onerror=window.broken=1>");
    EXPECT_THAT(textOf("main"), HasSubstr(std::string("call ") + HOSTILE));
    EXPECT_THAT(textOf("table.attempts"), HasSubstr(std::string("0: ") + HOSTILE));
    EXPECT_THAT(textOf("main"), HasSubstr(std::string(HOSTILE) + ", " + HOSTILE));
    EXPECT_EQ(browser->evaluate("typeof window.broken"), Json("undefined"));
    EXPECT_EQ(browser->evaluate("document.querySelectorAll('main img, main b').length"), Json(0));
    EXPECT_THAT(browser->getComplaints(), ElementsAre());
}

TEST_F(RecordingPageTest, DrawsWhatAKilledProcessLeft) {
    const std::string folder = write("one", makeStreamedSession());
    const std::string text = makeStreamedSession().text();
    directory.write("one/events.jsonl", text.substr(0, text.size() / 2));
    const std::vector<Json> lines = open(folder);
    EXPECT_EQ(lines[0]["missing"], "the session has neither results nor an error");
    EXPECT_THAT(textOf("main"), HasSubstr("The last line of events.jsonl is cut off."));
    EXPECT_EQ(browser->evaluate("document.querySelectorAll('canvas').length"), Json(2));
    EXPECT_THAT(browser->getComplaints(), ElementsAre());
    RecordedSession nothing;
    open(write("two", nothing, false));
    EXPECT_THAT(browser->getComplaints(), ElementsAre());
}

}  // namespace
