#include "FaultSession.h"

#include <algorithm>
#include <boost/make_shared.hpp>
#include <boost/weak_ptr.hpp>
#include <chrono>
#include <cstdio>
#include <future>
#include <memory>
#include <utility>

#include "Stillness.h"
#include "cloud/Sounds.h"
#include "core/network/NetworkManager.h"
#include "core/util/Singleton.h"
#include "pal/kd.h"

namespace FaultTest {

using Talvox::Settings;

namespace {

constexpr int64_t LONGEST_SESSION_MS = 120000;
constexpr std::chrono::seconds LONGEST_START{30};
constexpr std::size_t SAMPLES_PER_BUFFER = SAMPLE_RATE_HZ / (1000 / BUFFER_MS);

TestSupport::Samples makeSilence(int milliseconds) {
    TestSupport::NoiseSource noise(7);
    TestSupport::Samples samples(static_cast<std::size_t>(milliseconds) * SAMPLE_RATE_HZ / 1000);
    std::generate(samples.begin(), samples.end(),
                  [&noise] { return static_cast<int16_t>(60 * noise.next()); });
    return samples;
}

std::string inSeconds(int64_t ms) {
    char text[32];
    const std::size_t length = static_cast<std::size_t>(
        std::snprintf(text, sizeof(text), "%.3f", static_cast<double>(ms) / 1000));
    std::string seconds(text, length);
    // One decimal at least.
    seconds.erase(std::max(seconds.find_last_not_of('0') + 1, seconds.find('.') + 2));
    return seconds;
}

/** The event thread and the workers are started by the first who needs them. */
void startThreadsThatStay() {
    // Freed by the callback, which may come when nobody waits any more.
    auto* const done = new std::promise<void>;
    std::future<void> future = done->get_future();
    const auto tell = [](void* user) {
        const std::unique_ptr<std::promise<void>> told(static_cast<std::promise<void>*>(user));
        told->set_value();
    };
    kdQueueWorkKOR([](void*) {}, tell, done);
    EXPECT_EQ(std::future_status::ready, future.wait_for(LONGEST_START)) << "no worker runs";
    kdDrainEventsKOR();
}

std::size_t countAttempts(const TestSupport::LogCapture& log) {
    const std::vector<std::string> messages = log.messages();
    return static_cast<std::size_t>(
        std::count_if(messages.begin(), messages.end(), [](const std::string& message) {
            return message.rfind("Chunked request: ", 0) == 0 ||
                   message.rfind("Non-chunked request: ", 0) == 0;
        }));
}

}  // namespace

TestSupport::Samples makeUtterance(int sentences) {
    TestSupport::Samples samples = makeSilence(500);
    // A sentence is what the first 1.5 of every 2 seconds hold.
    const TestSupport::Samples speech =
        TestSupport::makeSpeechLike(SAMPLE_RATE_HZ, 2000 * sentences - 500);
    samples.insert(samples.end(), speech.begin(), speech.end());
    const TestSupport::Samples silence = makeSilence(2500);
    samples.insert(samples.end(), silence.begin(), silence.end());
    return samples;
}

FaultSession::FaultSession() {
    startThreadsThatStay();
    countsBefore = LiveCounts::now();
    server = std::make_unique<TestSupport::ScriptedHttpServer>();
    log = std::make_unique<TestSupport::LogCapture>();
    server->setDefaultAnswer(CloudTest::answerGoForward());
    configureText(Settings::SKS_URL, server->getUrl());
    configureText(Settings::SKS_SOUND_FORMAT, Settings::SOUND_FORMAT_PCM);
}

FaultSession::~FaultSession() = default;

void FaultSession::TearDown() {
    const boost::weak_ptr<Talvox::Recognizer> watched = session;
    const boost::weak_ptr<CloudTest::ScriptedRecorder> watchedRecorder = recorder;
    session.reset();
    recorder.reset();
    kdDrainEventsKOR();
    EXPECT_TRUE(watched.expired());
    EXPECT_TRUE(watchedRecorder.expired());
    Util::SingletonStorage::destroyAll();
    kdDrainEventsKOR();
    server.reset();
    log.reset();
    // One was there before, without its thread.
    Network::NetworkManager::getInstance();
    EXPECT_EQ(countsBefore, waitForCounts(countsBefore));
}

void FaultSession::setChunked(bool chunked) {
    configure(
        [chunked](Settings& settings) { settings.putBoolean(Settings::SKS_STREAMING, chunked); });
}

void FaultSession::start() {
    session.reset();
    elapsed = 0;
    attemptsBefore = countAttempts(*log);
    requestsBefore = server->getRequestCount();
    events = boost::make_shared<CloudTest::EventRecorder>();
    session = engine().createRecognizer(
        events, recognizerSettings ? recognizerSettings : boost::make_shared<Settings>());
    session->start();
    rest();
}

void FaultSession::rest() {
    ASSERT_TRUE(waitForStillness(*server)) << elapsed << " ms";
}

void FaultSession::deliverNext() {
    const auto end = static_cast<std::size_t>(elapsed) * SAMPLE_RATE_HZ / 1000;
    if (recorder && end <= sound.size()) {
        recorder->deliver(CloudTest::makeBuffer(
            TestSupport::toBytes(sound, end - SAMPLES_PER_BUFFER, SAMPLES_PER_BUFFER)));
    }
}

void FaultSession::step() {
    elapsed += BUFFER_MS;
    advanceMs(BUFFER_MS);
    deliverNext();
    rest();
    if (onStep) {
        onStep();
        rest();
    }
}

void FaultSession::stepTo(int64_t ms) {
    while (elapsed < ms) {
        step();
    }
}

SessionOutcome FaultSession::finish() {
    while (events->countEnds() == 0 && elapsed < LONGEST_SESSION_MS) {
        step();
    }
    SessionOutcome outcome = describe();
    EXPECT_TRUE(isEngineFree());
    advanceMs(LONGEST_SESSION_MS);
    rest();
    advanceMs(LONGEST_SESSION_MS);
    EXPECT_EQ(1U, events->countEnds());
    const SessionOutcome later = describe();
    EXPECT_EQ(outcome.events, later.events);
    EXPECT_EQ(outcome.attempts, later.attempts);
    return outcome;
}

SessionOutcome FaultSession::run() {
    start();
    return finish();
}

SessionOutcome FaultSession::describe() const {
    SessionOutcome outcome;
    for (const std::string& text : events->texts()) {
        outcome.endMs = events->timeOf(text);
        outcome.end = text;
        if (text == "results") {
            const auto results = events->recognition()->getResults();
            outcome.end += results->empty() ? " (none)" : " (" + results->front().getText() + ')';
        }
        outcome.events +=
            (outcome.events.empty() ? "" : ", ") + outcome.end + ' ' + inSeconds(outcome.endMs);
    }
    if (events->countEnds() == 0) {
        outcome.end.clear();
    }
    outcome.speechEndMs = events->timeOf("recordingDone");
    outcome.attempts = countAttempts(*log) - attemptsBefore;
    outcome.requests = server->getRequestCount() - requestsBefore;
    return outcome;
}

bool FaultSession::isEngineFree() {
    CloudTest::PlainRecognizer probe(&engine(), boost::make_shared<const Settings>());
    const bool isFree = engine().registerRecognizer(&probe);
    engine().unregisterRecognizer(&probe);
    return isFree;
}

std::string FaultSession::soundUpTo(int64_t ms) const {
    const std::vector<unsigned char> bytes =
        TestSupport::toBytes(sound, 0, static_cast<std::size_t>(ms) * SAMPLE_RATE_HZ / 1000);
    return {bytes.begin(), bytes.end()};
}

}  // namespace FaultTest
