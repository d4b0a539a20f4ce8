#pragma once

#include <condition_variable>
#include <cstddef>
#include <cstdint>
#include <exception>
#include <mutex>
#include <string>
#include <vector>

#include <nlohmann/json.hpp>

#include "talvox/SessionObserver.h"

namespace Cli {

/**
 * Compares the events of a session with those of a recording as they come, and knows when the
 * session's workers are idle.
 */
class EventComparison : public Talvox::SessionObserver {
  public:
    /**
     * @param recorded      the lines of kind "event"
     * @param zeroTime      the clock at which the times of the recording begin
     * @param mostLatenessNs how much later than in the replay an event may have been recorded
     */
    EventComparison(std::vector<nlohmann::json> recorded, int64_t zeroTime, int64_t mostLatenessNs);

    /**
     * The first difference in words; empty for none so far.
     * @throws nlohmann::json::exception if a recorded event could not be compared
     */
    std::string getDifference() const;
    std::size_t countRecorded() const { return expected.size(); }
    /** Notes a difference unless so many events have come. */
    void expectEvents(std::size_t count);
    /** Number of the event that is being delivered, the innermost; under the event lock. */
    int getOpenEvent() const { return openEvents.empty() ? -1 : openEvents.back(); }

    /** Waits until no sound is being encoded, or the session is over. */
    void waitForWorkers();

    void onCall(Call call) noexcept override;
    void onRecorderCall(RecorderCall /*call*/) noexcept override {}
    void onRecorderReturned(RecorderCall /*call*/, bool /*worked*/) noexcept override {}
    void onStarted(int64_t /*startTime*/, bool /*isStreaming*/) noexcept override {}
    void onBuffer(int64_t /*arrival*/, const Sound::SoundDataBuffer& /*buffer*/) noexcept override {
    }
    void onRecorderError() noexcept override {}
    void onNoise(float /*levelDb*/, int /*row*/) noexcept override {}
    void onDetector(bool /*isSpeech*/, float /*activity*/) noexcept override {}
    void onEncoding() noexcept override;
    void onEncoded(std::size_t size, bool isLast) noexcept override;
    void onAttempt(int /*attempt*/, const Network::HttpRequest& /*request*/) noexcept override {}
    void onConnection(int /*attempt*/,
                      const Network::TransferConnection& /*connection*/) noexcept override {}
    void onSent(int /*attempt*/, std::size_t /*size*/) noexcept override {}
    void onHead(int /*attempt*/, const Network::HttpResponse& /*response*/) noexcept override {}
    void onBody(int /*attempt*/, std::size_t /*size*/) noexcept override {}
    void onAttemptEnd(int /*attempt*/, const Network::TransferEnd& /*how*/) noexcept override {}
    void onFinished(int /*code*/) noexcept override {}
    void onEventBegin(const Talvox::ObservedEvent& event) noexcept override;
    void onEventEnd() noexcept override;

  private:
    void compare(const Talvox::ObservedEvent& event);
    void note(const std::string& difference);

    const std::vector<nlohmann::json> expected;
    const int64_t zero;
    const int64_t mostLateness;
    mutable std::mutex mutex;
    std::condition_variable changed;
    std::size_t count = 0;
    std::string firstDifference;
    std::exception_ptr failure;
    int pendingBuffers = 0;
    bool isOver = false;
    std::vector<int> openEvents;
};

}  // namespace Cli
