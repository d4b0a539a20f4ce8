/**
 * @file
 * Turns what happens in a session into the lines of its recording.
 */
#pragma once

#include <boost/shared_ptr.hpp>
#include <cstdint>
#include <string>
#include <vector>

#include "talvox/SessionObserver.h"
#include "talvox/SessionRecording.h"
#include "talvox/Settings.h"
#include "talvox/impl/recording/JsonObject.h"
#include "talvox/impl/recording/RecordingWriter.h"

namespace Talvox {

class Talvox;

/** Records one session, from `start` to its terminal event or its release. */
class RecordingObserver : public SessionObserver {
  public:
    RecordingObserver(boost::shared_ptr<RecordingWriter> recordingWriter,
                      const SessionRecordingOptions& options, const Recognizer& recognizer);
    ~RecordingObserver() override;

    void onCall(Call call) noexcept override;
    void onRecorderCall(RecorderCall call) noexcept override;
    void onRecorderReturned(RecorderCall call, bool worked) noexcept override;
    void onStarted(int64_t startTime, bool isStreaming) noexcept override;
    void onBuffer(int64_t arrival, const Sound::SoundDataBuffer& buffer) noexcept override;
    void onRecorderError() noexcept override;
    void onNoise(float levelDb, int row) noexcept override;
    void onDetector(bool isSpeech, float activity) noexcept override;
    void onEncoding() noexcept override {}
    void onEncoded(std::size_t size, bool isLast) noexcept override;
    void onAttempt(int attempt, const Network::HttpRequest& request) noexcept override;
    void onConnection(int attempt, const Network::TransferConnection& connection) noexcept override;
    void onSent(int attempt, std::size_t size) noexcept override;
    void onHead(int attempt, const Network::HttpResponse& response) noexcept override;
    void onBody(int attempt, std::size_t size) noexcept override;
    void onAttemptEnd(int attempt, const Network::TransferEnd& how) noexcept override;
    void onFinished(int code) noexcept override;
    void onEventBegin(const ObservedEvent& event) noexcept override;
    void onEventEnd() noexcept override;

  private:
    template <typename Write>
    void record(Write write) noexcept;
    JsonObject makeLine(const char* kind) const;
    JsonObject makeLineAt(int64_t time, const char* kind) const;
    void put(const JsonObject& line, bool isUrgent = true) const;
    void noteSettings();
    void finish(const char* reason);

    const boost::shared_ptr<RecordingWriter> writer;
    const bool hasSound;
    const Talvox& engine;
    const int64_t beginning;
    boost::shared_ptr<const Settings> engineSettings;
    RecordingWriter::Files files;
    bool isFinished = false;
    std::vector<const char*> recorderCalls;
    int bufferCount = 0;
    int64_t soundBytes = 0;
    int eventCount = 0;
    /** Numbers of the events whose listeners have not returned yet; the innermost is the last. */
    std::vector<int> openEvents;
    /** Depth at which the terminal event is being delivered; 0 for not yet. */
    std::size_t terminalDepth = 0;
};

}  // namespace Talvox
