/**
 * @file
 * A recorder that plays a raw sound file.
 */
#pragma once

#include <string>

#include "core/sound/Recorder.h"
#include "core/util/Timer.h"

namespace Talvox {

/**
 * Plays a file of 16-bit mono samples instead of the microphone, one buffer of 1600 samples per
 * buffer length, then silence without end. See `Sound::Recorder` for threads and ownership.
 */
class TestRecorder : public Sound::Recorder {
  public:
    /** The file that is played. */
    static const char* const PATH;

    TestRecorder();
    /** @param file  path of another file, as the operating system knows it */
    explicit TestRecorder(std::string file);
    ~TestRecorder() override;

    /** Always true; a missing file shows when recording starts. */
    bool init() override;
    void startRecording() override;
    void stopRecording() override;

  private:
    void onTimerCallback();
    void closeFile();

    int fd = -1;
    Util::Timer timer;
    std::string path;
};

}  // namespace Talvox
