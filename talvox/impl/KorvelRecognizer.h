/**
 * @file
 * The recognizer that uses the cloud service.
 */
#pragma once

#include <boost/shared_ptr.hpp>
#include <cstdint>
#include <optional>
#include <string>
#include <string_view>
#include <vector>

#include "core/sound/Recorder.h"
#include "core/util/Timer.h"
#include "talvox/Recognizer.h"
#include "talvox/SessionObserver.h"
#include "talvox/impl/ExceptionWatch.h"
#include "talvox/impl/RecognizeProtocol.h"
#include "talvox/impl/RecognizeProtocolListener.h"
#include "talvox/impl/VoiceActivityDetector.h"
#include "talvox/impl/VoicePowerEstimator.h"
#include "util/WavOutputStream.h"

namespace Talvox {

/**
 * One recognition session: records, learns the noise, finds the speech, feeds every buffer to a
 * protocol and reports to the application's listeners what happens, up to exactly one end (results
 * or one error).
 *
 * `start`, `stop`, `cancel` and the destructor take the event lock and may be called on any thread;
 * everything else is called under that lock. Listeners may call any of them, start another
 * recognizer and drop their last reference to this one from inside any event.
 */
class KorvelRecognizer : public Recognizer,
                         public Sound::RecorderListener,
                         public RecognizeProtocolListener,
                         private ExceptionWatch::Owner {
  public:
    KorvelRecognizer(const Talvox* facade, boost::shared_ptr<const Settings> recognizerSettings);
    ~KorvelRecognizer() override;

    /**
     * Begins the session, once; an object whose session is over only logs the call. What the engine
     * needs of the system is there when this has returned without an error.
     */
    void start() override;
    /** Ends listening; what was heard is recognised. Does nothing outside a session. */
    void stop() override;
    void cancel() override;

    void onRecorderDataReceived(Sound::Recorder* source,
                                boost::shared_ptr<const Sound::SoundDataBuffer> buffer) override;
    void onRecorderError(Sound::Recorder* source) override;

    void onProtocolError(SpeechError error) override;
    void onProtocolVoiceBegin() override;
    void onProtocolVoiceCaptured() override;
    void onProtocolResults(boost::shared_ptr<const RecognitionResults> results,
                           const std::string& requestId) override;

    /** The languages of the service; the same list at every call. */
    static const std::vector<std::string>& getAvailableLanguages();

  private:
    /** An exception, also of a listener, ends the session; it goes no further. */
    template <typename Call>
    void enter(Call call) noexcept;
    void onException(const char* what) override;
    template <typename Report>
    void observe(Report report);
    void endUnexpectedly(const char* what);
    void begin();
    /** Another session may begin; to be called right before the end is reported. */
    void leaveEngine();
    /** Whether a session can begin; if not, logs it and says why in `obstacle`. */
    static bool statusIsReasonable(const Settings& engineSettings, std::string& obstacle);
    void chooseSessionMode(const Settings& engineSettings);
    /** @param ask what is asked of the recorder; returns whether that worked */
    template <typename Ask>
    bool callRecorder(SessionObserver::RecorderCall call, Ask ask);
    /** @return false when the session is over because there is no recording */
    bool startRecorder(int sampleRateHz);
    void startProtocol(bool streaming);
    void startDetector(const std::string& parameters, const Sound::SoundDataInfo& format);
    void startDump(const Sound::SoundDataInfo& format);
    void startWatchdog();
    void checkRecorder();

    /** Calls every listener, until one of them ends the session. */
    template <typename Call>
    void announce(ObservedEvent::Kind kind, Call call);
    void reportError(SpeechError error, std::string_view reason);
    void reportResults(const boost::shared_ptr<const RecognitionResults>& results,
                       const std::string& requestId);
    void take(const boost::shared_ptr<const Sound::SoundDataBuffer>& buffer);
    bool isOver() const { return resultsReported || errorReported || recorderRefused; }
    bool isListening() const { return recorder && protocol; }
    void learnLeadingNoise(const Sound::SoundDataBuffer& buffer, int64_t arrival);
    /** As `announce`, and only as long as the session listens. */
    template <typename Call>
    void reportWhileListening(const ObservedEvent& event, Call call);
    void reportSound(const Sound::SoundDataBuffer& buffer);
    void detectVoice(const Sound::SoundDataBuffer& buffer, int64_t arrival);

    void sendWhatWasHeard();
    void stopRecorder();
    void stopListening();
    void dropProtocol();
    void stopWithError(SpeechError error, std::string_view reason);
    /** The end by an error of the protocol, or of what counts as one. */
    void fail(SpeechError error, std::string_view reason);

    Sound::Recorder::Mode sessionMode = Sound::Recorder::MODE_VOICE_RECOGNITION;
    boost::shared_ptr<Sound::Recorder> recorder;
    boost::shared_ptr<RecognizeProtocol> protocol;
    boost::shared_ptr<VoiceActivityDetector> vad;
    VoicePowerEstimator powerEstimator;
    int64_t startTime = 0;
    int64_t listeningStoppedTime = 0;
    bool leadingNoiseDone = false;
    bool resultsReported = false;
    bool errorReported = false;
    unsigned leadingNoiseMs = 0;
    unsigned recordedMs = 0;
    boost::shared_ptr<Util::WavOutputStream> wavDump;

    /** Null unless sessions are observed. */
    boost::shared_ptr<SessionObserver> observer;
    bool started = false;
    bool recorderRefused = false;
    int64_t lastSoundTime = 0;
    boost::shared_ptr<Util::Timer> watchdog;
    std::optional<ExceptionWatch> exceptionWatch;
};

}  // namespace Talvox
