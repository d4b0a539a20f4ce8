#include "SessionTest.h"

#include <boost/make_shared.hpp>

namespace CloudTest {

SessionTest::SessionTest() {
    server.setDefaultAnswer(answerGoForward());
    configureText(Talvox::Settings::SKS_URL, server.getUrl());
    configureText(Talvox::Settings::SKS_SOUND_FORMAT, Talvox::Settings::SOUND_FORMAT_PCM);
}

SessionTest::~SessionTest() {
    session.reset();
}

void SessionTest::makeSession() {
    session.reset();
    events = boost::make_shared<EventRecorder>();
    session = engine().createRecognizer(events, boost::make_shared<Talvox::Settings>());
}

void SessionTest::startSession() {
    makeSession();
    session->start();
}

void SessionTest::startSession(const std::string& vad) {
    configureText(Talvox::Settings::SKS_VAD_SETTINGS, vad);
    startSession();
}

void SessionTest::play(int milliseconds) {
    for (int played = 0; played < milliseconds; played += 100) {
        advanceMs(100);
        recorder->deliver(makeConstantBuffer(static_cast<int16_t>(played)));
    }
}

bool SessionTest::isEngineFree() {
    PlainRecognizer probe(&engine(), boost::make_shared<const Talvox::Settings>());
    const bool isFree = engine().registerRecognizer(&probe);
    engine().unregisterRecognizer(&probe);
    return isFree;
}

}  // namespace CloudTest
