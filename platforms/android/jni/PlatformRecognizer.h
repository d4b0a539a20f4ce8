/**
 * @file
 * The recognizer that uses the platform's own speech recognizer.
 */
#pragma once

#include <jni.h>

#include <boost/shared_ptr.hpp>
#include <cstdint>
#include <memory>
#include <optional>
#include <string>
#include <string_view>
#include <vector>

#include "Refs.h"
#include "core/sound/SoundDataBuffer.h"
#include "core/util/Timer.h"
#include "talvox/Recognizer.h"
#include "talvox/impl/ExceptionWatch.h"
#include "talvox/impl/ParallelEncoder.h"
#include "talvox/impl/SessionGuard.h"

/**
 * Drives a Java object that drives Android's recognizer, and turns its callbacks into the events
 * of a recognition. By policy it also uploads what was recognised, and the sound, to the service;
 * nobody waits for that upload.
 *
 * `start`, `stop`, `cancel` and the destructor take the event lock; everything else is called
 * under it. After the one end of a session (results or an error) the callbacks have no effect.
 *
 * A device that falls silent does not keep the engine busy: `ErrorNetwork` ends the session 30 s
 * after the last callback while it listens, and 20 s after the first `stop` or end of speech,
 * whatever callbacks follow. An exception from Java's `stop` ends it with `ErrorUnknown`.
 *
 * So does any other exception, of want of memory or of a listener, in a call, a callback or on an
 * engine thread. Results that are there by then are delivered all the same, without the upload.
 */
class PlatformRecognizer : public Talvox::Recognizer, private Talvox::ExceptionWatch::Owner {
  public:
    PlatformRecognizer(const Talvox::Talvox* facade,
                       boost::shared_ptr<const Talvox::Settings> recognizerSettings);
    ~PlatformRecognizer() override;

    /** Makes an object at an address that no earlier one had for long: Java knows it by that. */
    static boost::shared_ptr<PlatformRecognizer> create(
        const Talvox::Talvox* facade, const boost::shared_ptr<const Talvox::Settings>& settings);

    void start() override;
    void stop() override;
    void cancel() override;

    /**
     * Makes a call into the session, such as what Java's callbacks do. What it throws ends the
     * session and goes no further; a pending Java exception is logged and cleared.
     */
    template <typename Call>
    void enter(Call call) noexcept {
        Talvox::enterSession(*this, call, [this](const char* what) { endUnexpectedly(what); });
    }

    /** Whether the device has a recognizer; false outside Android. */
    static bool isRecognitionAvailable();
    /** What the device recognizer says so far. */
    static const std::vector<std::string>& getAvailableLanguages();

    void onReadyForSpeech();
    void onBeginningOfSpeech();
    void onRmsChanged(float rms);
    /** Sound for the upload: 16-bit mono at 8000 Hz. */
    void onBufferReceived(const char* data, unsigned size);
    void onEndOfSpeech();
    /** Partial results are not reported. */
    void onPartialResults(const boost::shared_ptr<const Talvox::RecognitionResults>& results);
    void onResults(const boost::shared_ptr<const Talvox::RecognitionResults>& results);
    /**
     * @param code a `SpeechError` code, or -1: the session ended without a hypothesis. Any other
     *     number is logged and reported as `ErrorUnknown`
     */
    void onError(int code);
    /**
     * Says why the error comes that `onError` reports next.
     * @param number what the device recognizer reported; absent if Java found the failure itself
     * @param reason for `getErrorReason`
     */
    void onErrorCause(std::optional<int> number, const std::string& reason);
    /** Any other callback: a sign of life. */
    void onEvent();

  private:
    void chooseLogging();
    void prepareSound(bool isWifi);
    void begin();
    void startJavaObject(JNIEnv* env);
    void createJavaObject();
    void cancelSilently();
    void onException(const char* what) override;
    void endUnexpectedly(const char* what);
    void giveUp(int code, std::string_view reason);
    void endWithError(int code, std::string_view reason = std::string_view());
    void reportError(int code, std::string_view reason);
    void reportResults();
    /** Another session may begin; to be called right before the end is reported. */
    void leaveEngine();
    template <typename Call>
    void announce(Call call);

    void hear();
    void awaitAnswer();
    void checkSilence();
    void finishWithResults(const boost::shared_ptr<const Talvox::RecognitionResults>& results);
    void takeSound(const char* data, unsigned size);
    void takeError(int code);
    void endWithDeviceError(int code);
    void makeHttpRequest(const boost::shared_ptr<const Sound::SoundDataBuffer>& sound);
    void logSession(const boost::shared_ptr<const Sound::SoundDataBuffer>& sound);
    void submitLog(const boost::shared_ptr<const Sound::SoundDataBuffer>& sound);
    int getMsSinceRequest() const;

    std::string getModel();
    std::string getLanguagePreference();
    std::string getSource();
    std::string getStringProperty(const char* methodName);

    Jni::GlobalRef jobj;
    bool loggingEnabled = false;
    bool logWithSound = false;
    bool encodeWithSpeex = false;
    boost::shared_ptr<Sound::SoundDataBuffer> pcmBuffer;
    boost::shared_ptr<Talvox::ParallelEncoder> encoder;
    boost::shared_ptr<const Talvox::RecognitionResults> pendingResults;
    int64_t requestTime = 0;
    bool over = false;
    bool answerAwaited = false;
    int64_t silenceDeadline = 0;
    std::unique_ptr<Util::Timer> silenceTimer;
    std::optional<Talvox::ExceptionWatch> exceptionWatch;
    /** Of the error that Java reports next. */
    std::optional<int> causeNumber;
    std::string causeReason;
};
