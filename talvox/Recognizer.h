/**
 * @file
 * Base of every recognizer.
 */
#pragma once

#include <boost/enable_shared_from_this.hpp>
#include <boost/shared_ptr.hpp>
#include <boost/weak_ptr.hpp>
#include <optional>
#include <string>
#include <string_view>

#include "core/util/ListenerList.h"
#include "talvox/Export.h"
#include "talvox/RecognitionResult.h"
#include "talvox/RecognizerListener.h"
#include "talvox/Settings.h"
#include "talvox/SpeechError.h"

namespace Talvox {

class Talvox;

/**
 * One recognition. Made by `Talvox::createRecognizer` and owned by shared pointer; may be started
 * once. `start`, `stop` and `cancel` may be called from any thread and from inside a listener; they
 * take the event lock and never wait for the network or a device.
 */
class TALVOX_API Recognizer : public boost::enable_shared_from_this<Recognizer> {
  public:
    Recognizer(const Recognizer&) = delete;
    Recognizer& operator=(const Recognizer&) = delete;
    virtual ~Recognizer();

    /** Begins. A failure is reported to the listeners, possibly before this returns. */
    virtual void start() = 0;
    /** Ends recording; the recognition goes on to its results. */
    virtual void stop() = 0;
    /** Gives up; the listeners hear `ErrorCanceled` unless it is over already. */
    virtual void cancel() = 0;

    /** Adds a listener, held weakly, called after those added before. Takes the event lock. */
    void addListener(const boost::weak_ptr<RecognizerListener>& listener);

    /** The validated settings of this recognition; never change. */
    const boost::shared_ptr<const Settings>& getSettings() const { return validatedSettings; }
    /** The facade that made this recognizer. */
    const Talvox* getEngine() const { return engine; }

    /**
     * Why the session ended with its error: one line of English for developers and logs, such as
     * "HTTP status 404" or "no speech within 5 s". The texts are not fixed; code must not depend on
     * them. Empty when no error was reported, and when its cause is unknown. Complete from inside
     * `onError` on. Any thread; takes the event lock.
     */
    std::string getErrorReason() const;

    /**
     * The HTTP status of the answer that ended the session with its error, such as 404; of the last
     * attempt if there were several. Absent without an error, and if no answer was its cause. Any
     * thread; takes the event lock.
     */
    std::optional<int> getErrorStatus() const;

    /**
     * The number with which the device recognizer ended the session, one of Android's
     * `SpeechRecognizer.ERROR_` constants. Absent if it reported none, and with every other kind of
     * recognizer. Any thread; takes the event lock.
     */
    std::optional<int> getDeviceError() const;

  protected:
    /**
     * @param facade   not owned; must outlive the recognizer. Null is a broken invariant; the
     *                 process's facade then takes its place.
     * @param settings null is a broken invariant; the defaults then take their place
     */
    Recognizer(const Talvox* facade, boost::shared_ptr<const Settings> settings);

    /**
     * Reports the error to all live listeners. Apart from the reason this changes no state of the
     * recognizer; both this and `callOnResults` keep it alive until the last listener has been
     * called.
     * @param reason for `getErrorReason`; empty when the cause is unknown
     *
     * Takes no memory but for the reason, and goes without that. An exception of a listener is
     * reported, and the others are called.
     */
    void callOnError(SpeechError error, std::string_view reason = std::string_view());

    /**
     * Judges the results by the engine's thresholds and hands them to all live listeners. A
     * listener for whose object there is no memory gets `ErrorUnknown` instead. Exceptions as
     * above.
     */
    void callOnResults(const boost::shared_ptr<const RecognitionResults>& results,
                       const std::string& requestId);

    /** For `getErrorStatus`; to be set before `callOnError`. */
    void setErrorStatus(std::optional<int> status) noexcept { errorStatus = status; }
    /** For `getDeviceError`; to be set before `callOnError`. */
    void setDeviceError(std::optional<int> number) noexcept { deviceError = number; }

    /** For an object that serves one session after another. */
    void forgetReason() noexcept { errorReason.clear(); }

    /** For the events of derived classes; see `Util::ListenerList`. */
    Util::ListenerList<RecognizerListener> listeners;

  private:
    void keepReason(std::string_view reason) noexcept;

    boost::shared_ptr<const Settings> validatedSettings;
    const Talvox* engine;
    std::string errorReason;
    std::optional<int> errorStatus;
    std::optional<int> deviceError;
};

}  // namespace Talvox
