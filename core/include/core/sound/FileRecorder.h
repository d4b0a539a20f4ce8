/**
 * @file
 * A recorder that plays given sound, for tools and tests.
 */
#pragma once

#include <cstddef>
#include <cstdint>
#include <vector>

#include "core/sound/Recorder.h"
#include "core/util/Timer.h"

namespace Sound {

/**
 * Delivers the given samples, then silence without end, paced by the platform clock: one buffer
 * per buffer length. A recorder that was stopped and is started again goes on where it was.
 */
class KORVEL_CORE_API FileRecorder : public Recorder {
  public:
    /** @param samples mono samples at the rate that will be asked for */
    explicit FileRecorder(std::vector<int16_t> samples);
    ~FileRecorder() override;

    bool init() override;
    void startRecording() override;
    void stopRecording() override;

  private:
    void deliver();

    std::vector<int16_t> sound;
    std::size_t position = 0;
    Util::Timer timer;
};

}  // namespace Sound
