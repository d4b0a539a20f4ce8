/**
 * @file
 * A whole session of the real recognizer against a server with faults.
 */
#pragma once

#include <boost/shared_ptr.hpp>
#include <cstddef>
#include <cstdint>
#include <functional>
#include <memory>
#include <string>
#include <vector>

#include "LiveCounts.h"
#include "cloud/EngineTest.h"
#include "cloud/EventRecorder.h"
#include "cloud/GatewayAnswers.h"
#include "support/LogCapture.h"
#include "support/ScriptedHttpServer.h"
#include "support/TestSound.h"

namespace FaultTest {

constexpr int SAMPLE_RATE_HZ = 16000;
constexpr int BUFFER_MS = 100;

/** Silence, a sentence, silence: the detector with its own settings finds begin and end. */
TestSupport::Samples makeUtterance(int sentences = 1);

/** What a session came to; times are of the platform's clock, since the start. */
struct SessionOutcome {
    std::string events; /**< "recordingBegin 0.3, ..." */
    std::string end;    /**< the last event, with the text of the best hypothesis; "" without end */
    int64_t endMs = -1;
    int64_t speechEndMs = -1; /**< when the recording was done; -1 when the session ended before */
    std::size_t attempts = 0; /**< requests that the library began */
    std::size_t requests = 0; /**< heads that reached the server */
};

/**
 * The engine, a scripted server, and a recorder that plays an utterance in steps of 100 ms. Between
 * two steps everything comes to rest, so that the outcome of a session is always the same.
 *
 * When a test is over, all that it used must have been given back.
 */
class FaultSession : public CloudTest::EngineTest {
  protected:
    FaultSession();
    ~FaultSession() override;
    void TearDown() override;

    void setChunked(bool chunked);

    /** Makes a session with a new listener and starts it. */
    void start();
    /** One step: the clock, the next buffer, rest, and `onStep` with what follows from it. */
    void step();
    /** Steps up to this time since the start. */
    void stepTo(int64_t ms);
    /** Steps until the session's end, for two minutes at most; then nothing may follow. */
    SessionOutcome finish();
    /** All of it. */
    SessionOutcome run();

    /** Milliseconds since the start. */
    int64_t elapsedMs() const { return elapsed; }
    /** Waits until nothing moves any more. */
    void rest();
    static bool isEngineFree();
    /** The sound up to a time since the start, as bytes. */
    std::string soundUpTo(int64_t ms) const;

    std::unique_ptr<TestSupport::ScriptedHttpServer> server;
    std::unique_ptr<TestSupport::LogCapture> log;
    boost::shared_ptr<CloudTest::EventRecorder> events;
    boost::shared_ptr<Talvox::Recognizer> session;
    /** The recognizer's own; the engine's are `configure`d. */
    boost::shared_ptr<Talvox::Settings> recognizerSettings;
    TestSupport::Samples sound = makeUtterance();
    /** Called at the end of each step. */
    std::function<void()> onStep;

  private:
    void deliverNext();
    SessionOutcome describe() const;

    LiveCounts countsBefore;
    int64_t elapsed = 0;
    std::size_t attemptsBefore = 0;
    std::size_t requestsBefore = 0;
};

}  // namespace FaultTest
