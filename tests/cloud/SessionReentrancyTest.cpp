#include <gtest/gtest.h>

#include <boost/make_shared.hpp>
#include <tuple>

#include "SessionTest.h"
#include "core/util/EventLock.h"
#include "pal/kd.h"

namespace {

using CloudTest::EventRecorder;
using CloudTest::Texts;
using Talvox::Settings;
using TestSupport::Answer;

enum Action { STOP, CANCEL, START, START_NEXT, DROP, DROP_LISTENER };

const char* const ACTION_NAMES[] = {"Stop", "Cancel", "Start", "StartNext", "Drop", "DropListener"};

/** What a listener may do from inside any event, in every kind of session. */
using Parameters = std::tuple<const char*, Action, bool>;

class SessionReentrancyTest : public CloudTest::SessionTest,
                              public ::testing::WithParamInterface<Parameters> {
  protected:
    ~SessionReentrancyTest() override {
        const Util::EventLock lock;
        next.reset();
    }

    /** Under the event lock, from inside the event. */
    void act(Action action) {
        ++acted;
        switch (action) {
            case STOP:
                session->stop();
                break;
            case CANCEL:
                session->cancel();
                break;
            case START:
                session->start();
                break;
            case START_NEXT:
                next = engine().createRecognizer(nextEvents, boost::make_shared<Settings>());
                next->start();
                break;
            case DROP:
                session.reset();
                break;
            case DROP_LISTENER:
                kept = events;
                events.reset();
                break;
        }
    }

    boost::shared_ptr<EventRecorder> nextEvents = boost::make_shared<EventRecorder>();
    boost::shared_ptr<Talvox::Recognizer> next;
    boost::shared_ptr<EventRecorder> kept;
    int acted = 0;
};

TEST_P(SessionReentrancyTest, EndsAtMostOnceAndFreesTheEngine) {
    const std::string event = std::get<0>(GetParam());
    const Action action = std::get<1>(GetParam());
    const bool streaming = std::get<2>(GetParam());
    configure([streaming](Settings& settings) {
        settings.putBoolean(Settings::SKS_STREAMING, streaming);
        settings.putString(Settings::SKS_VAD_SETTINGS, CloudTest::SHORT_SPEECH);
    });
    const bool failing = event.rfind("error", 0) == 0;
    if (failing) {
        server.setDefaultAnswer(Answer::status(404));
    }
    makeSession();
    const boost::shared_ptr<EventRecorder> listener = events;
    const auto witness = boost::make_shared<EventRecorder>();
    session->addListener(witness);
    bool armed = true;
    listener->hook = [&](const std::string& text, Talvox::Recognizer*) {
        if (armed && text == event) {
            armed = false;
            act(action);
        }
    };
    session->start();
    const auto firstRecorder = recorder;
    for (int i = 0; i < 11; ++i) {
        advanceMs(100);
        firstRecorder->deliver(CloudTest::makeConstantBuffer(1));
    }
    const bool dropped = action == DROP && event != "results" && !failing;
    if (!dropped) {
        ASSERT_TRUE(witness->waitForEnds());
    }
    kdDrainEventsKOR();
    advanceMs(40000);
    kdDrainEventsKOR();

    EXPECT_EQ(acted, 1);
    for (const auto& heard : {listener, witness}) {
        const Texts texts = heard->texts();
        EXPECT_LE(heard->countEnds(), 1U);
        if (heard->countEnds() == 1) {
            const std::string& last = texts.back();
            EXPECT_TRUE(last == "results" || last.rfind("error", 0) == 0) << last;
        }
    }
    EXPECT_FALSE(firstRecorder->isRecording());
    if (action == START_NEXT) {
        const bool ended = event == "results" || failing;
        EXPECT_EQ(nextEvents->texts().front() == "error ErrorBusy", !ended);
    }
    if (action == CANCEL && event != "results" && !failing) {
        EXPECT_EQ(listener->texts().back(), "error ErrorCanceled");
    }
    if (action == START && event != "results" && !failing) {
        EXPECT_EQ(listener->texts().back(), "error ErrorBusy");
    }
    {
        const Util::EventLock lock;
        next.reset();
    }
    EXPECT_TRUE(isEngineFree());
}

INSTANTIATE_TEST_SUITE_P(
    InEveryEvent, SessionReentrancyTest,
    ::testing::Combine(::testing::Values("recordingBegin", "buffer", "power", "speakingBegin",
                                         "recordingDone", "results", "error ErrorNetwork"),
                       ::testing::Values(STOP, CANCEL, START, START_NEXT, DROP, DROP_LISTENER),
                       ::testing::Bool()),
    [](const ::testing::TestParamInfo<Parameters>& parameters) {
        const std::string event = std::get<0>(parameters.param);
        return ACTION_NAMES[std::get<1>(parameters.param)] + std::string("In_") +
               event.substr(event.find(' ') + 1) +
               (std::get<2>(parameters.param) ? "_Streaming" : "");
    });

}  // namespace
