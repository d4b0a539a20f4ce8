/**
 * @file
 * A recognition session with everything around it.
 */
#pragma once

#include <boost/shared_ptr.hpp>
#include <cstddef>
#include <string>
#include <vector>

#include "EngineTest.h"
#include "EventRecorder.h"
#include "GatewayAnswers.h"
#include "Sounds.h"
#include "support/ScriptedHttpServer.h"

namespace CloudTest {

using Texts = std::vector<std::string>;

/** PCM in one piece to a server that recognises "go forward", unless a test says otherwise. */
class SessionTest : public EngineTest {
  protected:
    SessionTest();
    ~SessionTest() override;

    /** Makes a session with a new listener; an old one is dropped. */
    void makeSession();
    /** Makes and starts one. */
    void startSession();
    void startSession(const std::string& vad);

    /** Lets this much time pass, with a buffer at each 100 ms. */
    void play(int milliseconds);

    /** True when no recognizer is active. */
    static bool isEngineFree();

    TestSupport::ScriptedHttpServer server;
    boost::shared_ptr<EventRecorder> events;
    boost::shared_ptr<Talvox::Recognizer> session;
};

}  // namespace CloudTest
