// "talvox vad --as-session" next to a real session that hears the same sound.
#include <gtest/gtest.h>

#include <boost/make_shared.hpp>
#include <nlohmann/json.hpp>
#include <sstream>
#include <string>
#include <utility>
#include <vector>

#include "SoundFiles.h"
#include "cli/CommandLine.h"
#include "core/network/NetworkManager.h"
#include "core/sound/FileRecorder.h"
#include "pal/kd.h"
#include "support/TestSound.h"
#include "talvox/RecognizerListenerAdapter.h"
#include "talvox/Talvox.h"

namespace {

using Talvox::Recognizer;
using TestSupport::Samples;

const int64_t NS_PER_MS = 1000000;
const int64_t CLOCK_START_MS = 1000;
const int64_t SESSION_MAX_MS = 25000;

/** What was reported, and how many milliseconds after the start. */
using Events = std::vector<std::pair<std::string, int64_t>>;

class EventNotes : public Talvox::RecognizerListenerAdapter {
  public:
    void onRecordingBegin(Recognizer* /*recognizer*/) override { note("recordingBegin"); }
    void onSpeakingBegin(Recognizer* /*recognizer*/) override { note("speakingBegin"); }
    void onRecordingDone(Recognizer* recognizer) override {
        note("recordingDone");
        isDone = true;
        recognizer->cancel();
    }
    void onError(Recognizer* /*recognizer*/, Talvox::SpeechError error) override {
        if (!isDone) {
            note(error.getErrorString());
        }
        isDone = true;
    }

    Events events;
    bool isDone = false;

  private:
    void note(const std::string& name) {
        events.emplace_back(name, kdGetTimeUST() / NS_PER_MS - CLOCK_START_MS);
    }
};

struct Clip {
    int rate;
    Samples samples;
    std::string parameters;
    std::string description;
};

/** Two words with a pause between them, over noise; the fields choose the lengths. */
Clip makeClip(int rate, int16_t noiseAmplitude, int number) {
    const int beforeMs = 75 * number * number / 4;
    const int pauseMs = 200 + 1000 * number / 9;
    const double firstWordS = 0.25 + 0.05 * number;
    const auto toCount = [rate](int ms) { return static_cast<std::size_t>(rate) * ms / 1000; };
    Samples samples(toCount(beforeMs), 0);
    for (const double wordS : {firstWordS, 0.9 - firstWordS / 2}) {
        const Samples word = TestSupport::voiceLike(rate, wordS);
        samples.insert(samples.end(), word.begin(), word.end());
        samples.resize(samples.size() + toCount(pauseMs), 0);
    }
    TestSupport::NoiseSource noise(static_cast<uint32_t>(number + 1));
    for (int16_t& sample : samples) {
        sample = static_cast<int16_t>(sample + static_cast<int>(noiseAmplitude * noise.next()));
    }
    static const char* const PARAMETERS[] = {"", "minvoicetimems=200;analyzemsoff=300",
                                             "framems=20;activityon=0.3;aggressiveness=3"};
    std::string description = std::to_string(rate) + " Hz, noise " +
                              std::to_string(noiseAmplitude) + ", clip " + std::to_string(number);
    return {rate, samples, PARAMETERS[number % 3], description};
}

class VadAsSessionTest : public ::testing::Test {
  protected:
    VadAsSessionTest() {
        Network::NetworkManager::getInstance().overrideReachability(Network::NetworkManager::WIFI);
    }
    ~VadAsSessionTest() override {
        Sound::Recorder::setFactory({});
        Network::NetworkManager::getInstance().overrideReachability(-1);
        kdUseRealClockKOR();
    }

    static Events runSession(const Clip& clip) {
        kdUseManualClockKOR(CLOCK_START_MS * NS_PER_MS);
        Sound::Recorder::setFactory(
            [&clip] { return boost::make_shared<Sound::FileRecorder>(clip.samples); });
        const auto settings = boost::make_shared<Talvox::Settings>();
        settings->putString(Talvox::Settings::SKS_URL, "http://127.0.0.1:9");
        settings->putString(Talvox::Settings::SKS_UUID, std::string(32, 'a'));
        settings->putString(Talvox::Settings::SKS_VAD_SETTINGS, clip.parameters);
        settings->putInt(Talvox::Settings::SKS_SAMPLE_RATE, clip.rate);
        Talvox::Talvox& engine = Talvox::Talvox::getInstance();
        engine.setTalvoxSettings(settings);
        const auto notes = boost::make_shared<EventNotes>();
        const boost::shared_ptr<Recognizer> session = engine.createRecognizer(notes, settings);
        session->start();
        for (int64_t ms = 0; ms < SESSION_MAX_MS && !notes->isDone; ms += 100) {
            kdAdvanceClockKOR(100 * NS_PER_MS);
        }
        return notes->events;
    }

    /** The lines that "talvox vad --as-session --json" prints. */
    static std::vector<nlohmann::json> runVad(const Clip& clip) {
        std::istringstream in(TestSupport::rawBytes(clip.samples));
        std::ostringstream out;
        std::ostringstream err;
        Cli::LogOutput log(err);
        Cli::Console console{in, out, err, false};
        const std::string rate = std::to_string(clip.rate);
        const std::vector<const char*> arguments = {
            "talvox", "vad",    "--as-session", "--json", "--file",
            "-",      "--rate", rate.c_str(),   "--vad",  clip.parameters.c_str()};
        EXPECT_EQ(Cli::runTool(static_cast<int>(arguments.size()), arguments.data(), console, log),
                  0)
            << err.str();
        std::vector<nlohmann::json> lines;
        std::istringstream text(out.str());
        for (std::string line; std::getline(text, line);) {
            lines.push_back(nlohmann::json::parse(line));
        }
        return lines;
    }

    static Events eventsOf(const std::vector<nlohmann::json>& lines) {
        Events events;
        for (const nlohmann::json& line : lines) {
            if (line.contains("ms")) {
                const bool isError = line["event"] == "error";
                events.emplace_back(line[isError ? "name" : "event"], line["ms"]);
            }
        }
        return events;
    }
};

TEST_F(VadAsSessionTest, ReportsWhatASessionReportsToTheMillisecond) {
    int clips = 0;
    int begins = 0;
    int endsWithinTheSound = 0;
    for (const int rate : {8000, 11025, 16000, 44100}) {
        for (const int16_t noiseAmplitude : {10, 100, 1000}) {
            for (int number = 0; number < 9; ++number) {
                const Clip clip = makeClip(rate, noiseAmplitude, number);
                const Events session = runSession(clip);
                EXPECT_EQ(eventsOf(runVad(clip)), session) << clip.description;
                ASSERT_GE(session.size(), 2U) << clip.description;
                ++clips;
                begins += session[1].first == "speakingBegin" ? 1 : 0;
                endsWithinTheSound += session.back().second < 20000 ? 1 : 0;
            }
        }
    }
    // The clips are of all kinds.
    EXPECT_GE(clips, 100);
    EXPECT_GE(begins, 80);
    EXPECT_GE(endsWithinTheSound, 50);
}

TEST_F(VadAsSessionTest, GoesOnInSilenceUntilTheTimeWithoutSpeechIsOver) {
    for (const int rate : {8000, 16000}) {
        const Clip clip{rate, Samples(static_cast<std::size_t>(rate) / 2, 0), "", "silence"};
        const Events expected = {{"recordingBegin", 220}, {"ErrorNoVoice", 5020}};
        EXPECT_EQ(runSession(clip), expected);
        EXPECT_EQ(eventsOf(runVad(clip)), expected);
    }
}

TEST_F(VadAsSessionTest, EndsAtTheLimitOfSound) {
    // At these rates everything counts as speech.
    const Clip whole{44100, Samples(4410, 1), "", ""};
    const Events expected = {
        {"recordingBegin", 220}, {"speakingBegin", 520}, {"recordingDone", 20120}};
    EXPECT_EQ(runSession(whole), expected);
    EXPECT_EQ(eventsOf(runVad(whole)), expected);
    // A buffer of 1102 samples counts as 99 ms, so there are 203 of them.
    const Clip truncated{11025, Samples(1102, 1), "", ""};
    const Events later = {
        {"recordingBegin", 219}, {"speakingBegin", 519}, {"recordingDone", 20310}};
    EXPECT_EQ(runSession(truncated), later);
    EXPECT_EQ(eventsOf(runVad(truncated)), later);
}

TEST_F(VadAsSessionTest, PrintsNothingBehindTheEndOfTheSession) {
    const Clip clip = makeClip(16000, 100, 0);
    const std::vector<nlohmann::json> lines = runVad(clip);
    int buffersBehind = -1;
    for (const nlohmann::json& line : lines) {
        buffersBehind = line["event"] == "recordingDone" ? 0 : buffersBehind;
        buffersBehind += line["event"] == "buffer" && buffersBehind >= 0 ? 1 : 0;
    }
    EXPECT_EQ(buffersBehind, 0);
}

}  // namespace
