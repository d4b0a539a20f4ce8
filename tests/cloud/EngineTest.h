/**
 * @file
 * What every test of the cloud recognizer needs.
 */
#pragma once

#include <gtest/gtest.h>

#include <boost/shared_ptr.hpp>
#include <cstdint>
#include <functional>
#include <string>

#include "ScriptedRecorder.h"
#include "talvox/Recognizer.h"
#include "talvox/Settings.h"
#include "talvox/Talvox.h"

namespace CloudTest {

const char* const UUID = "0123456789abcdef0123456789abcdef";

/** Detector texts that make the decisions certain, whatever the sound. */
const char* const NEVER_SPEECH = "activityon=2";
const char* const ENDLESS_SPEECH = "activityon=-1;activityoff=-1";
/** Speech from the first buffer after the noise, for 700 ms. */
const char* const SHORT_SPEECH = "activityon=-1;activityoff=2;minvoicetimems=600";

/** A recognizer without a mind of its own: what protocols need to reach the settings. */
class PlainRecognizer : public Talvox::Recognizer {
  public:
    PlainRecognizer(const Talvox::Talvox* facade,
                    boost::shared_ptr<const Talvox::Settings> recognizerSettings);
    void start() override {}
    void stop() override {}
    void cancel() override {}
};

/**
 * The engine with its default settings and a valid identifier, under the hand-driven clock, with
 * Wi-Fi and with recorders that the test plays. Everything is put back afterwards.
 */
class EngineTest : public ::testing::Test {
  protected:
    EngineTest();
    ~EngineTest() override;

    static Talvox::Talvox& engine();

    /** Changes the engine's settings for what starts from now on. */
    static void configure(const std::function<void(Talvox::Settings&)>& change);
    static void configureText(const std::string& key, const std::string& value);

    static void advanceMs(int64_t milliseconds);

    /** The recorder of the latest session, null before the first. */
    boost::shared_ptr<ScriptedRecorder> recorder;
    /** Called on each recorder that is made. */
    std::function<void(ScriptedRecorder&)> prepareRecorder;
};

}  // namespace CloudTest
