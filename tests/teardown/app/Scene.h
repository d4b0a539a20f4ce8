/**
 * @file
 * An application in the worst moment.
 */
#pragma once

#include <boost/shared_ptr.hpp>
#include <string>
#include <vector>

#include "HangingRecorder.h"
#include "Options.h"
#include "cloud/ScriptedRecorder.h"
#include "core/sound/Recorder.h"
#include "logcollector/LogCollector.h"
#include "support/ScriptedHttpServer.h"
#include "talvox/Talvox.h"

namespace TearDown {

/**
 * Brings a session, and whatever else the options name, to the point where it hangs.
 *
 * gateway=unread|body|answer   accepts the connection; reads nothing beyond the head; reads the
 *                              sound of a session that records; reads all and never answers
 * gateway=name                 its name server is silent
 * gateway=none                 nothing is sent to it
 * mode=simple|chunked  format=pcm|speex
 * recorder=hang|pulse          the device hangs; the sound server records
 * encoder=1                    a hundred buffers wait for the encoder
 * log=1                        a request of the usage log waits for its answer
 * fifo=PATH                    one more recorder hangs while it reads this settings file
 * nameserver=ADDRESS           has a name server there that never answers; gateway=real asks it
 */
class Scene {
  public:
    explicit Scene(const Options& options);

    /** Returns when all that can hang hangs. */
    void prepare(const boost::shared_ptr<Talvox::RecognizerListener>& listener);

    boost::shared_ptr<Talvox::Recognizer> takeSession() { return std::move(session); }

    /** Lets go of what belongs to the application. */
    void cleanUp();

  private:
    void configure();
    void chooseRecorder();
    void play(int buffers);
    void reachStage();
    void hangAnotherRecorder();
    void startLog();
    std::string getUrl() const;

    const Options& options;
    TestSupport::ScriptedHttpServer& server;
    TestSupport::ScriptedHttpServer& logServer;
    boost::shared_ptr<Talvox::Recognizer> session;
    boost::shared_ptr<CloudTest::ScriptedRecorder> scripted;
    boost::shared_ptr<HangingRecorder> hanging;
    boost::shared_ptr<Sound::Recorder> another;
    std::size_t requests = 0;
    std::size_t logRequests = 0;
    int questions = 0;
    int nameServer = -1;
};

}  // namespace TearDown
