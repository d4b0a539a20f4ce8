/**
 * @file
 * A recorder that plays given sound, for tools and tests.
 */
#pragma once

#include <cstddef>
#include <cstdint>
#include <vector>

#include "core/sound/BufferPool.h"
#include "core/sound/Recorder.h"
#include "core/util/Timer.h"

namespace Sound {

/**
 * Delivers the given samples, then silence without end, paced by the platform clock as a microphone
 * is: each buffer arrives the device's delay after its last sample. A recorder that was stopped and
 * is started again goes on where it was.
 *
 * The sound begins when the caller of `startRecording` releases the event lock. A caller that notes
 * its start time under that lock receives the k-th buffer at least k buffer lengths plus the delay
 * later, however long its start takes. On the hand-driven clock the sound begins at the first move
 * of the clock after the call.
 */
class KORVEL_CORE_API FileRecorder : public Recorder {
  public:
    /** In milliseconds. */
    static constexpr int DEVICE_DELAY_MS_DFLT = 20;

    /**
     * @param samples       mono samples at the rate that will be asked for
     * @param deviceDelayMs milliseconds from a buffer's last sample to its delivery; values below 0
     *                      count as 0. Without a delay, a buffer and a time limit of equal
     *                      length fall on the same moment; on the real clock either may be
     *                      first.
     */
    explicit FileRecorder(std::vector<int16_t> samples, int deviceDelayMs = DEVICE_DELAY_MS_DFLT);
    ~FileRecorder() override;

    bool init() override;
    void startRecording() override;
    void stopRecording() override;

  private:
    void onTimer();
    void open();
    void awaitBuffer();
    void deliver();

    std::vector<int16_t> sound;
    const int64_t deviceDelayNs;
    std::size_t position = 0;
    bool isOpen = false;
    int64_t openTime = 0;
    int64_t samplesDelivered = 0;
    BufferPool buffers;
    Util::Timer timer;
};

}  // namespace Sound
