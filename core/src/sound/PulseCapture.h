#pragma once

#include <pulse/context.h>
#include <pulse/mainloop.h>
#include <pulse/stream.h>

#include <atomic>
#include <boost/shared_ptr.hpp>
#include <mutex>
#include <string>

#include "core/sound/CaptureQueue.h"
#include "core/sound/Recorder.h"

namespace Sound {

/**
 * One connection to the sound server and one recording stream from its default source, on a thread
 * of their own. All of the client library is used on that thread only, because even its first steps
 * (reading its files, finding the server) may block.
 */
class PulseCapture {
  public:
    PulseCapture(int sampleRateHz, int fragmentBytes, Recorder::Mode mode,
                 const boost::shared_ptr<CaptureQueue>& queue);
    PulseCapture(const PulseCapture&) = delete;
    PulseCapture& operator=(const PulseCapture&) = delete;

    /** The thread's work: connects at once, records from `begin` on, returns after `end` or a
     * failure. */
    void run();

    /** Lets sound be recorded. Any thread; never blocks. */
    void begin();

    /** Ends the work soon. Any thread; never blocks. */
    void end();

  private:
    void wakeLoop();
    void work();
    bool connect();
    void openStream();
    void readStream();
    void finishHandshake();
    void disconnect();
    void fail(const char* what) noexcept;
    static void onContextState(pa_context* context, void* user);
    static void onStreamState(pa_stream* stream, void* user);
    static void onStreamReadable(pa_stream* stream, size_t size, void* user);

    const int sampleRate;
    const int fragmentSize;
    const Recorder::Mode mode;
    const boost::shared_ptr<CaptureQueue> queue;
    std::atomic<bool> begun{false};
    std::atomic<bool> ended{false};

    std::mutex mutex;  // keeps the loop alive while another thread wakes it
    pa_mainloop* loop = nullptr;

    // Of the thread alone.
    pa_context* context = nullptr;
    pa_stream* stream = nullptr;
};

}  // namespace Sound
