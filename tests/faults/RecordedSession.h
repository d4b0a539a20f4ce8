/**
 * @file
 * A session with a real gateway, which needs real speech.
 */
#pragma once

#include <boost/make_shared.hpp>
#include <cstddef>
#include <string>

#include "FaultSession.h"
#include "cloud/Sounds.h"

namespace FaultTest {

/** What is said: goforward.raw of the pocketsphinx-testdata package. */
constexpr const char* RECORDED_WORDS = "go forward ten meters";

/** Plays the recording into a session. `sound` is empty without the package. */
class RecordedSession : public FaultSession {
  protected:
    RecordedSession() { sound = TestSupport::loadRecordedSpeech("goforward.raw"); }

    /** Starts a session in English with the gateway at `url`. */
    void startSession(const std::string& url) {
        configureText(Talvox::Settings::SKS_URL, url);
        events = boost::make_shared<CloudTest::EventRecorder>();
        const auto settings = boost::make_shared<Talvox::Settings>();
        settings->putString(Talvox::Settings::RS_LANGUAGE, "en-US");
        session = engine().createRecognizer(events, settings);
        session->start();
    }

    /** Plays on, in steps of 100 ms, until this many samples have been played. */
    void playTo(std::size_t samples) {
        constexpr std::size_t SAMPLES = SAMPLE_RATE_HZ / 10;
        while (played < samples) {
            advanceMs(BUFFER_MS);
            if (played + SAMPLES <= sound.size()) {
                recorder->deliver(
                    CloudTest::makeBuffer(TestSupport::toBytes(sound, played, SAMPLES)));
            }
            played += SAMPLES;
        }
    }

  private:
    std::size_t played = 0;
};

}  // namespace FaultTest
