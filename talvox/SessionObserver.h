/**
 * @file
 * What can be observed of a session from inside.
 */
#pragma once

#include <boost/shared_ptr.hpp>
#include <cstddef>
#include <cstdint>
#include <functional>
#include <string_view>

#include "core/network/TransferTrace.h"
#include "core/network/Transport.h"
#include "core/sound/SoundDataBuffer.h"
#include "talvox/Export.h"
#include "talvox/Recognition.h"
#include "talvox/SpeechError.h"

namespace Talvox {

class Recognizer;

/** An event that listeners receive. Valid only during `SessionObserver::onEventBegin`. */
struct ObservedEvent {
    /** Which operation of `RecognizerListener` is called. */
    enum Kind {
        RECORDING_BEGIN,
        SPEAKING_BEGIN,
        RECORDING_DONE,
        BUFFER_RECEIVED,
        POWER_CHANGED,
        RESULTS,
        ERROR
    };

    Kind kind = RECORDING_BEGIN;
    float levelDb = 0;                        /**< of `POWER_CHANGED` */
    int errorCode = 0;                        /**< of `ERROR` */
    std::string_view reason{};                /**< of `ERROR`; may be empty */
    const Recognition* recognition = nullptr; /**< of `RESULTS`; not null there */
};

/**
 * Observes one session of the cloud recognizer: what comes in, what the session decides, and which
 * events its listeners receive. The recording of sessions and their replay are observers.
 *
 * Operations are called under the event lock, except `onConnection` and `onSent`, which the network
 * thread calls without it, possibly at the same time as others. None may block, throw, or call the
 * engine.
 */
class TALVOX_API SessionObserver {
  public:
    /** A call of the application; `RELEASE` is the destruction of the recognizer. */
    enum class Call { START, STOP, CANCEL, RELEASE };
    /** What a session asks of its recorder. */
    enum class RecorderCall { INIT, START, STOP };
    /**
     * Makes the observer of a session, under the event lock, when the session is about to begin; a
     * null pointer leaves the session unobserved. May throw, which leaves it unobserved as well.
     */
    using Factory = std::function<boost::shared_ptr<SessionObserver>(const Recognizer&)>;

    /** Installs a factory for the sessions that begin from now on; an empty one removes it. */
    static void setFactory(Factory factory);

    /** What the factory makes; null without one. Under the event lock; allocates nothing then. */
    static boost::shared_ptr<SessionObserver> make(const Recognizer& recognizer) noexcept;

    virtual ~SessionObserver();

    /** A call of the application begins. */
    virtual void onCall(Call call) noexcept = 0;
    virtual void onRecorderCall(RecorderCall call) noexcept = 0;
    /** @param worked false when the recorder refused `INIT` */
    virtual void onRecorderReturned(RecorderCall call, bool worked) noexcept = 0;
    /** Recorder, protocol and detector are there. @param startTime the session counts from here */
    virtual void onStarted(int64_t startTime, bool isStreaming) noexcept = 0;

    /** A buffer has arrived while the session listens. @param arrival by the session's clock */
    virtual void onBuffer(int64_t arrival, const Sound::SoundDataBuffer& buffer) noexcept = 0;
    virtual void onRecorderError() noexcept = 0;

    /**
     * The detector has learned from a buffer of noise.
     * @param row its row of thresholds, 0 for the strictest; -1 for none of them
     */
    virtual void onNoise(float levelDb, int row) noexcept = 0;
    /** The verdict has changed. @param activity share of speech; NaN where it is unknown */
    virtual void onDetector(bool isSpeech, float activity) noexcept = 0;

    /** A buffer goes to a worker for encoding; one `onEncoded` follows unless the session ends. */
    virtual void onEncoding() noexcept = 0;
    /** @param size bytes that have become ready, possibly 0 @param isLast the stream is finished */
    virtual void onEncoded(std::size_t size, bool isLast) noexcept = 0;

    /** A request is made. @param attempt from 1 */
    virtual void onAttempt(int attempt, const Network::HttpRequest& request) noexcept = 0;
    /** As `Network::TransferTrace`. */
    virtual void onConnection(int attempt,
                              const Network::TransferConnection& connection) noexcept = 0;
    virtual void onSent(int attempt, std::size_t size) noexcept = 0;
    /** As `Network::TransferListener`. */
    virtual void onHead(int attempt, const Network::HttpResponse& response) noexcept = 0;
    virtual void onBody(int attempt, std::size_t size) noexcept = 0;
    virtual void onAttemptEnd(int attempt, const Network::TransferEnd& how) noexcept = 0;
    /** The session receives the end of its request. @param code as for `NetworkTask::onFinished` */
    virtual void onFinished(int code) noexcept = 0;

    /** Listeners are called now, if there are any. Calls from inside of the event come next. */
    virtual void onEventBegin(const ObservedEvent& event) noexcept = 0;
    /** The listeners have returned. */
    virtual void onEventEnd() noexcept = 0;
};

}  // namespace Talvox
