// Reports in a real browser: what they show is what --json prints.
#include <gmock/gmock.h>
#include <sndfile.h>

#include <algorithm>
#include <filesystem>
#include <nlohmann/json.hpp>
#include <regex>
#include <set>
#include <sstream>

#include "SoundFiles.h"
#include "ToolProcess.h"
#include "cli/corpus/Labels.h"
#include "support/ChildProcess.h"
#include "support/ScratchDirectory.h"

namespace {

using ::testing::HasSubstr;
using ::testing::Not;
using TestSupport::ChildProcess;
using TestSupport::runTalvox;
using TestSupport::ScratchDirectory;
using TestSupport::ToolResult;
using Json = nlohmann::json;

const char* const BROWSER = "chromium-headless-shell";
const int RATE_HZ = 16000;

/** A number of a table, by name and value, as the page's elements hold it. */
using Numbers = std::multiset<std::pair<std::string, std::string>>;

class ReportTest : public ::testing::Test {
  protected:
    void SetUp() override {
        if (!ChildProcess::isInstalled(BROWSER)) {
            GTEST_SKIP() << "needs the package " << BROWSER;
        }
        std::filesystem::create_directories(directory.path("corpus/a room"));
        for (int number = 0; number < 3; ++number) {
            addUtterance("corpus/a room/" + std::string(40, 'n') + std::to_string(number),
                         200 + 400 * number);
        }
    }

    void addUtterance(const std::string& name, int pauseMs) {
        std::vector<int16_t> samples(RATE_HZ / 2);
        const std::vector<int16_t> word = TestSupport::voiceLike(RATE_HZ, 0.5);
        samples.insert(samples.end(), word.begin(), word.end());
        samples.resize(samples.size() + static_cast<std::size_t>(pauseMs) * RATE_HZ / 1000);
        samples.insert(samples.end(), word.begin(), word.end());
        samples.resize(samples.size() + std::size_t{RATE_HZ} * 3);
        const std::string path = directory.path(name + ".wav");
        ASSERT_TRUE(TestSupport::writeSoundFile(path, SF_FORMAT_WAV | SF_FORMAT_PCM_16, RATE_HZ, 1,
                                                samples));
        directory.write(
            name + ".txt",
            Cli::labelText({{500, 1000, "</script>"}, {1000 + pauseMs, 1500 + pauseMs, "two"}}, 0));
    }

    /** What the browser says while it does something with a page. */
    std::string browse(const std::string& page, const std::vector<std::string>& options) {
        std::vector<std::string> words = {BROWSER,
                                          "--no-sandbox",
                                          "--disable-gpu",
                                          "--enable-logging=stderr",
                                          "--user-data-dir=" + directory.path("profile"),
                                          "--window-size=1200,2400"};
        words.insert(words.end(), options.begin(), options.end());
        words.push_back("file://" + page);
        const ChildProcess::Result result =
            ChildProcess::run(words, {{"HOME", directory.path()}, {"TZ", "UTC"}});
        EXPECT_EQ(result.exitStatus, 0) << result.output;
        return result.output;
    }

    /** The numbers that the rendered page holds. */
    Numbers render(const std::string& page) {
        const std::string dom = browse(page, {"--dump-dom"});
        EXPECT_THAT(dom, Not(HasSubstr("CONSOLE")));
        Numbers numbers;
        const std::regex element("data-name=\"([^\"]+)\" data-value=\"([^\"]+)\"");
        for (std::sregex_iterator at(dom.begin(), dom.end(), element), end; at != end; ++at) {
            numbers.emplace((*at)[1], (*at)[2]);
        }
        return numbers;
    }

    /** How many shades of grey a picture of the page has, and the mean of them. */
    std::pair<std::size_t, double> photograph(const std::string& page, const std::string& scheme) {
        const std::string picture = directory.path("page.png");
        browse(page,
               {"--screenshot=" + picture, "--blink-settings=preferredColorScheme=" + scheme});
        const std::string raw = directory.path("page.grey");
        const ChildProcess::Result converted =
            ChildProcess::run({"ffmpeg", "-v", "error", "-y", "-i", picture, "-f", "rawvideo",
                               "-pix_fmt", "gray", raw});
        EXPECT_EQ(converted.exitStatus, 0) << converted.output;
        const std::string pixels = ScratchDirectory::read(raw);
        double sum = 0;
        for (const char pixel : pixels) {
            sum += static_cast<unsigned char>(pixel);
        }
        const std::set<char> shades(pixels.begin(), pixels.end());
        return {shades.size(), sum / static_cast<double>(std::max<std::size_t>(1, pixels.size()))};
    }

    /** A bright picture by day and a dark one by night, and neither of them empty. */
    void expectPictures(const std::string& page) {
        const auto [dayShades, dayMean] = photograph(page, "1");
        const auto [nightShades, nightMean] = photograph(page, "0");
        EXPECT_GT(dayShades, 30U);
        EXPECT_GT(nightShades, 30U);
        EXPECT_GT(dayMean, 180);
        EXPECT_LT(nightMean, 80);
    }

    static std::string textOf(const Json& value) {
        return value.is_string() ? value.get<std::string>() : value.dump();
    }

    static std::vector<Json> lines(const std::string& text) {
        std::vector<Json> objects;
        std::istringstream in(text);
        for (std::string line; std::getline(in, line);) {
            objects.push_back(Json::parse(line));
        }
        return objects;
    }

    /** As JavaScript writes a number. */
    static std::string scriptNumber(const Json& value) {
        const std::string text = textOf(value);
        return text.size() > 2 && text.substr(text.size() - 2) == ".0"
                   ? text.substr(0, text.size() - 2)
                   : text;
    }

    const ScratchDirectory directory;
    const std::string reportPath = directory.path("report.html");
};

TEST_F(ReportTest, OfAScoreHoldsTheNumbersOfItsRows) {
    const ToolResult result =
        runTalvox({"endpoint", "score", directory.path("corpus"), "--json", "--vad", "", "--vad",
                   "analyzems=700", "--report", reportPath});
    ASSERT_EQ(result.status, 0) << result.err;
    Numbers expected;
    for (const Json& row : lines(result.out)) {
        expected.emplace("sessions", scriptNumber(row["sessions"]));
        for (const char* figure :
             {"missed", "falseBegin", "beginLateMs", "early", "unended", "endLateMs", "excessMs"}) {
            expected.emplace(figure, scriptNumber(row[figure]["value"]));
        }
        expected.emplace("beginLateP90Ms", scriptNumber(row["beginLateMs"]["p90"]));
        expected.emplace("endLateP90Ms", scriptNumber(row["endLateMs"]["p90"]));
    }
    EXPECT_GE(expected.size(), 80U);
    EXPECT_EQ(render(reportPath), expected);
    expectPictures(reportPath);
}

TEST_F(ReportTest, OfASweepHoldsTheNumbersOfItsPoints) {
    const ToolResult result =
        runTalvox({"endpoint", "sweep", directory.path("corpus"), "--json", "--grid",
                   "analyzems=600:1600:500;activityoff=.1,.3", "--report", reportPath});
    ASSERT_EQ(result.status, 0) << result.err;
    Numbers expected;
    for (const Json& object : lines(result.out)) {
        const bool isPoint = object["event"] == "point";
        const Json& figures = isPoint ? object : object["heldOut"];
        for (const char* name :
             {"lost", "early", "missed", "unended", "falseBegin", "endLateMs", "endLateP90Ms"}) {
            if (figures.contains(name)) {
                expected.emplace(name, scriptNumber(figures[name]));
            }
        }
        if (isPoint) {
            expected.emplace("heatLost", scriptNumber(object["lost"]));
            expected.emplace("heatLatency", scriptNumber(object["endLateMs"]));
        }
    }
    EXPECT_EQ(render(reportPath), expected);
    expectPictures(reportPath);
}

TEST_F(ReportTest, OfASoundHoldsWhatTheDetectorDecided) {
    const std::string sound = directory.path("corpus/a room/" + std::string(40, 'n') + "1.wav");
    const ToolResult result =
        runTalvox({"vad", "--file", sound, "--json", "--as-session", "--report", reportPath});
    ASSERT_EQ(result.status, 0) << result.err;
    Numbers expected;
    std::string noiseLevel;
    for (const Json& object : lines(result.out)) {
        if (object["event"] == "segment") {
            expected.emplace("startMs", scriptNumber(object["startMs"]));
            expected.emplace("endMs", scriptNumber(object["endMs"]));
        } else if (object["event"] != "buffer") {
            expected.emplace("ms", scriptNumber(object["ms"]));
        } else if (object["learningNoise"].get<bool>()) {
            noiseLevel = scriptNumber(object["level"]);
        }
    }
    expected.emplace("noiseLevel", noiseLevel);
    EXPECT_GE(expected.size(), 6U);
    EXPECT_EQ(render(reportPath), expected);
    // The page needs nothing but itself.
    const std::string text = ScratchDirectory::read(reportPath);
    EXPECT_THAT(text, Not(HasSubstr("src=\"")));
    EXPECT_THAT(text, Not(HasSubstr("@import")));
    expectPictures(reportPath);
}

TEST_F(ReportTest, NoticesAPageWithAnError) {
    const std::string broken = directory.write("broken.html", "<script>missing();</script>");
    EXPECT_THAT(browse(broken, {"--dump-dom"}), HasSubstr("CONSOLE"));
}

TEST_F(ReportTest, RefusesAFileThatCannotBeWritten) {
    const ToolResult result = runTalvox({"endpoint", "score", directory.path("corpus"), "--report",
                                         directory.path("none/report.html")});
    EXPECT_EQ(result.status, 2);
    EXPECT_THAT(result.err, HasSubstr("cannot write to " + directory.path("none/report.html") +
                                      ": No such file or directory\n"));
}

}  // namespace
