/**
 * @file
 * From a session's sound to its hypotheses.
 */
#pragma once

#include <boost/enable_shared_from_this.hpp>
#include <boost/shared_ptr.hpp>
#include <boost/weak_ptr.hpp>
#include <optional>
#include <string>
#include <vector>

#include "core/network/NetworkTaskHolder.h"
#include "core/sound/SoundDataBuffer.h"
#include "core/util/ListenerList.h"
#include "core/util/Timer.h"
#include "talvox/Recognizer.h"
#include "talvox/SessionObserver.h"
#include "talvox/Settings.h"
#include "talvox/impl/RecognizeProtocolListener.h"
#include "talvox/impl/RecognizeRequest.h"

namespace Talvox {

/**
 * Turns the sound of one utterance into a request to the service and the request's end into events
 * for its listeners. Serves one utterance; always owned by shared pointer, used under the event
 * lock only, never blocks.
 *
 * The owner drops the protocol (or stops listening) once it has the results or an error: the
 * answer time-out is not cancelled by an answer.
 */
class RecognizeProtocol : public boost::enable_shared_from_this<RecognizeProtocol> {
  public:
    RecognizeProtocol(const RecognizeProtocol&) = delete;
    RecognizeProtocol& operator=(const RecognizeProtocol&) = delete;
    virtual ~RecognizeProtocol();

    /** Takes one buffer of the utterance; before `sendRequest`, in order. */
    virtual void handle(boost::shared_ptr<const Sound::SoundDataBuffer> buffer) = 0;

    /**
     * The utterance is over. A second call does nothing, unless the first one ended with the
     * error that there was no sound.
     */
    virtual void sendRequest() = 0;

    /**
     * @param recognizer gives the settings; must outlive the protocol
     * @param type       "simple" or "chunked"; anything else is logged and counts as "simple"
     */
    static boost::shared_ptr<RecognizeProtocol> create(const Recognizer* recognizer,
                                                       const std::string& type);

    void addListener(const boost::weak_ptr<RecognizeProtocolListener>& listener);

    /** Sets what observes requests and encoding; null for nothing. Before the first buffer. */
    void setObserver(const boost::shared_ptr<SessionObserver>& sessionObserver) {
        observer = sessionObserver;
    }

    /**
     * The owner has no use for the protocol any more and drops it. What the protocol is doing
     * further up the call stack then stops short: no event follows, nothing is sent.
     */
    void abandon();

    /** Why the error that the listeners were given came about; for `Recognizer::getErrorReason`. */
    const std::string& getErrorReason() const { return errorReason; }
    /** The HTTP status of the answer without results; for `Recognizer::getErrorStatus`. */
    std::optional<int> getErrorStatus() const { return errorStatus; }

  protected:
    /** Why an utterance without any buffer is an error. */
    static constexpr const char* NO_SOUND_REASON = "no sound was recorded";

    /** Keeps the engine's settings of now: a later change does not reach a running utterance. */
    explicit RecognizeProtocol(const Recognizer& recognizer);

    bool isAbandoned() const { return abandoned; }
    const boost::shared_ptr<SessionObserver>& getObserver() const { return observer; }

    /**
     * Tells the listeners that the utterance is complete.
     * @return false when there is nothing more to do: the protocol has been abandoned, now or
     *         earlier, or this is a call from inside the notification
     */
    bool announceVoiceCaptured();
    void notifyError(SpeechError error, const std::string& reason);
    /** Ends the utterance with `ErrorEncoding`; the request is not completed. */
    void notifyEncodingFailed();

    /** Whether the sound is sent as Speex, as settings and connection say now. */
    bool choosesSpeex() const;
    int getSpeexQuality() const;

    /** A request with the recognizer's settings that reports its end to the listeners. */
    boost::shared_ptr<RecognizeRequest> makeRequest(const Recognizer& recognizer,
                                                    Network::NetworkTaskHolder& holder);

    /** Hands the request to the holder, with the retries of a recognition. */
    static void submit(Network::NetworkTaskHolder& holder,
                       const boost::shared_ptr<RecognizeRequest>& request);

    /** A running timer that bounds the wait for the answer. */
    boost::shared_ptr<Util::Timer> startAnswerTimer(Network::NetworkTaskHolder& holder);

  private:
    void onNetworkRequestFinished(Network::NetworkTaskHolder& holder,
                                  const boost::shared_ptr<const RecognitionResults>& results,
                                  const std::string& requestId,
                                  const boost::shared_ptr<const RecognizeRequest>& request);
    std::string describeTimeout() const;
    void onNetworkRequestTimeout(Network::NetworkTaskHolder& holder);

    Util::ListenerList<RecognizeProtocolListener> listeners;
    boost::shared_ptr<const Settings> engineSettings;
    bool announcing = false;
    bool abandoned = false;
    /** The request that was made last; the holder owns it. */
    boost::weak_ptr<RecognizeRequest> lastRequest;
    std::string errorReason;
    std::optional<int> errorStatus;
    boost::shared_ptr<SessionObserver> observer;
};

}  // namespace Talvox
