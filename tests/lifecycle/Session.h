/**
 * @file
 * One session as the application sees it.
 */
#pragma once

#include <array>
#include <boost/make_shared.hpp>
#include <boost/shared_ptr.hpp>
#include <boost/weak_ptr.hpp>
#include <cstdint>
#include <memory>
#include <string>

#include "CloudModel.h"
#include "Plan.h"
#include "RecorderDouble.h"
#include "RelayModel.h"
#include "talvox/Recognizer.h"
#include "talvox/RecognizerListener.h"

namespace Lifecycle {

using BufferPtr = boost::shared_ptr<const Sound::SoundDataBuffer>;

class Session;

/** Where the sessions live. */
class SessionHost {
  public:
    virtual ~SessionHost() = default;

    /** Called inside the event, once it is known to be in order. */
    virtual void onEvent(Session& session, Event event, int errorCode) = 0;
    /** Something went against the contract; empty texts are ignored. */
    virtual void onWrong(const std::string& what) = 0;
    virtual int64_t now() const = 0;
};

/** Checks each event against the model, and the words of results against the session's own. */
class SessionListener : public Talvox::RecognizerListener {
  public:
    SessionListener(SessionHost& owner, Session& heard) : host(owner), session(heard) {}

    void onRecordingBegin(Talvox::Recognizer* recognizer) override;
    void onSpeakingBegin(Talvox::Recognizer* recognizer) override;
    void onRecordingDone(Talvox::Recognizer* recognizer) override;
    void onBufferReceived(Talvox::Recognizer* recognizer,
                          const Sound::SoundDataBuffer& buffer) override;
    void onPowerChanged(Talvox::Recognizer* recognizer, float power) override;
    void onResults(Talvox::Recognizer* recognizer,
                   boost::shared_ptr<Talvox::Recognition> recognition) override;
    void onError(Talvox::Recognizer* recognizer, Talvox::SpeechError error) override;

  private:
    void hear(const Talvox::Recognizer* recognizer, Event event, int errorCode = -1);

    SessionHost& host;
    Session& session;
};

/** Hears the same session as another listener before it, and only counts. */
class Witness : public Talvox::RecognizerListener {
  public:
    Witness(SessionHost& owner, bool standIn) : host(owner), isStandIn(standIn) {}

    void onRecordingBegin(Talvox::Recognizer*) override { hear(); }
    void onSpeakingBegin(Talvox::Recognizer*) override { hear(); }
    void onRecordingDone(Talvox::Recognizer*) override { hear(); }
    void onBufferReceived(Talvox::Recognizer*, const Sound::SoundDataBuffer&) override { hear(); }
    void onPowerChanged(Talvox::Recognizer*, float) override { hear(); }
    void onResults(Talvox::Recognizer*, boost::shared_ptr<Talvox::Recognition>) override {
        hear();
        ++ends;
    }
    void onError(Talvox::Recognizer*, Talvox::SpeechError) override {
        hear();
        ++ends;
    }

    int countEnds() const { return ends; }

  private:
    void hear() {
        if (ends > 0 && !isStandIn) {
            host.onWrong("the second listener hears something after the end");
        }
    }

    SessionHost& host;
    const bool isStandIn;
    int ends = 0;
};

/** The application's references, the model and the recorder. */
class Session {
  public:
    /** @param served what serves it, which is the stand-in where the platform does not */
    Session(SessionHost& owner, int number, const SessionPlan& what, Kind served);

    /** Takes the application's reference to a recognizer that has the listener already. */
    void own(const boost::shared_ptr<Talvox::Recognizer>& made);
    /** The application's reference goes. */
    void release();
    bool isReleased() const { return !recognizer; }
    /** After `release`, once no call is under way: the object must have gone as well. */
    bool isLeftBehind() const { return isReleased() && frames == 0 && !object.expired(); }

    /** A call of the engine for this session, or an event of it, is under way in between. */
    void enter() { ++frames; }
    void leave();

    /** How often this event was heard before. */
    int count(Event event) { return heard[static_cast<std::size_t>(event)]++; }

    const int index;
    const SessionPlan& plan;
    const Kind kind;
    std::unique_ptr<SessionModel> model;
    CloudModel* cloud = nullptr; /**< the model, if it is one */
    RelayModel* relay = nullptr; /**< the model, if it is one */
    boost::shared_ptr<SessionListener> listener;
    boost::shared_ptr<Witness> witness;
    boost::shared_ptr<Talvox::Recognizer> recognizer;
    boost::shared_ptr<RecorderDouble> recorder;
    bool sendsPcm = false;
    std::string spoken; /**< what the recorder delivered while the session listened */
    int attempts = 0;
    bool gotWords = false;
    int64_t deviceHandle = 0;

  private:
    boost::weak_ptr<Talvox::Recognizer> object;
    std::array<int, EVENT_COUNT> heard{};
    int frames = 0;
};

}  // namespace Lifecycle
