#include "sound/PulseCapture.h"

#include <pulse/error.h>
#include <pulse/proplist.h>

#include <new>

namespace Sound {

namespace {

const char CLIENT_NAME[] = "Korvel Talvox";
const char STREAM_NAME[] = "Speech";

/** How long a server may be silent in its handshake: so many steps of this length. */
constexpr int SILENT_STEPS_MAX = 20;
constexpr int STEP_US = 50000;

/** The role tells the server which device, profile and effects suit the stream. */
const char* roleForMode(Recorder::Mode mode) {
    return mode == Recorder::MODE_VOICE_RECOGNITION ? "phone" : "production";
}

}  // namespace

PulseCapture::PulseCapture(int sampleRateHz, int fragmentBytes, Recorder::Mode recordingMode,
                           const boost::shared_ptr<CaptureQueue>& captureQueue)
    : sampleRate(sampleRateHz),
      fragmentSize(fragmentBytes),
      mode(recordingMode),
      queue(captureQueue) {}

void PulseCapture::run() {
    pa_mainloop* const own = pa_mainloop_new();
    if (own == nullptr) {
        fail("no resources for an audio loop");
        return;
    }
    {
        const std::lock_guard<std::mutex> lock(mutex);
        loop = own;
    }
    work();
    finishHandshake();
    disconnect();
    {
        const std::lock_guard<std::mutex> lock(mutex);
        loop = nullptr;
    }
    pa_mainloop_free(own);
}

void PulseCapture::begin() {
    begun = true;
    wakeLoop();
}

void PulseCapture::end() {
    ended = true;
    wakeLoop();
}

void PulseCapture::wakeLoop() {
    const std::lock_guard<std::mutex> lock(mutex);
    if (loop != nullptr) {
        pa_mainloop_wakeup(loop);
    }
}

void PulseCapture::work() {
    if (!connect()) {
        fail("no connection to the sound server");
        return;
    }
    while (!ended) {
        if (begun && stream == nullptr && pa_context_get_state(context) == PA_CONTEXT_READY) {
            openStream();
        }
        if (!ended && pa_mainloop_iterate(loop, 1, nullptr) < 0) {
            fail("the audio loop failed");
        }
    }
}

bool PulseCapture::connect() {
    context = pa_context_new(pa_mainloop_get_api(loop), CLIENT_NAME);
    if (context == nullptr) {
        return false;
    }
    pa_context_set_state_callback(context, &PulseCapture::onContextState, this);
    // Starting a server is the session manager's affair, not that of a library.
    return pa_context_connect(context, nullptr, PA_CONTEXT_NOAUTOSPAWN, nullptr) >= 0;
}

void PulseCapture::openStream() {
    pa_sample_spec spec = {};
    spec.format = PA_SAMPLE_S16LE;
    spec.rate = static_cast<uint32_t>(sampleRate);
    spec.channels = 1;
    pa_proplist* properties = pa_proplist_new();
    pa_proplist_sets(properties, PA_PROP_MEDIA_ROLE, roleForMode(mode));
    stream = pa_stream_new_with_proplist(context, STREAM_NAME, &spec, nullptr, properties);
    pa_proplist_free(properties);
    if (stream == nullptr) {
        fail("no recording stream");
        return;
    }
    pa_stream_set_state_callback(stream, &PulseCapture::onStreamState, this);
    pa_stream_set_read_callback(stream, &PulseCapture::onStreamReadable, this);
    const auto serverChoice = static_cast<uint32_t>(-1);
    pa_buffer_attr attributes = {serverChoice, serverChoice, serverChoice, serverChoice,
                                 static_cast<uint32_t>(fragmentSize)};
    if (pa_stream_connect_record(stream, nullptr, &attributes, PA_STREAM_ADJUST_LATENCY) < 0) {
        fail("no recording stream");
    }
}

void PulseCapture::readStream() {
    while (!ended && pa_stream_readable_size(stream) > 0) {
        const void* data = nullptr;
        size_t size = 0;
        if (pa_stream_peek(stream, &data, &size) < 0) {
            fail("the recording stream failed");
            return;
        }
        if (size == 0) {
            return;
        }
        // No data but a size is a hole in the stream.
        if (!queue->push(static_cast<const unsigned char*>(data), size)) {
            ended = true;
        }
        if (pa_stream_drop(stream) < 0) {
            fail("the recording stream failed");
        }
    }
}

// A client that disconnects between the consent and the end of the handshake loses descriptors:
// libpulse then forgets those that the server has passed (memory, events of the channel).
void PulseCapture::finishHandshake() {
    if (context == nullptr) {
        return;
    }
    pa_context_set_state_callback(context, nullptr, nullptr);
    int silentSteps = 0;
    while (pa_context_get_state(context) == PA_CONTEXT_SETTING_NAME &&
           silentSteps < SILENT_STEPS_MAX) {
        if (pa_mainloop_prepare(loop, STEP_US) < 0) {
            return;
        }
        const int ready = pa_mainloop_poll(loop);
        if (ready < 0 || pa_mainloop_dispatch(loop) < 0) {
            return;
        }
        silentSteps += ready == 0 ? 1 : 0;
    }
}

void PulseCapture::disconnect() {
    if (stream != nullptr) {
        pa_stream_set_state_callback(stream, nullptr, nullptr);
        pa_stream_set_read_callback(stream, nullptr, nullptr);
        pa_stream_disconnect(stream);
        pa_stream_unref(stream);
        stream = nullptr;
    }
    if (context != nullptr) {
        pa_context_set_state_callback(context, nullptr, nullptr);
        pa_context_disconnect(context);
        pa_context_unref(context);
        context = nullptr;
    }
}

void PulseCapture::fail(const char* what) noexcept {
    ended = true;
    const int error = context != nullptr ? pa_context_errno(context) : PA_ERR_INTERNAL;
    try {
        queue->fail(std::string(what) + ": " + pa_strerror(error));
    } catch (const std::bad_alloc&) {
        queue->fail("no memory");  // short enough to take none
    }
}

void PulseCapture::onContextState(pa_context* context, void* user) {
    const pa_context_state_t state = pa_context_get_state(context);
    if (!PA_CONTEXT_IS_GOOD(state)) {
        auto* const self = static_cast<PulseCapture*>(user);
        self->fail(self->stream != nullptr ? "the sound server is gone"
                                           : "no connection to the sound server");
    }
}

void PulseCapture::onStreamState(pa_stream* stream, void* user) {
    const pa_stream_state_t state = pa_stream_get_state(stream);
    if (!PA_STREAM_IS_GOOD(state)) {
        static_cast<PulseCapture*>(user)->fail("the recording stream ended");
    }
}

void PulseCapture::onStreamReadable(pa_stream* /*stream*/, size_t /*size*/, void* user) {
    static_cast<PulseCapture*>(user)->readStream();
}

}  // namespace Sound
