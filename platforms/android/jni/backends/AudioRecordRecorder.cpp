#include "AudioRecordRecorder.h"

#include <algorithm>
#include <array>
#include <boost/make_shared.hpp>
#include <cstddef>
#include <map>
#include <mutex>
#include <utility>

#include "../EntryPoint.h"
#include "../Text.h"

namespace {

const char* const JAVA_CLASS = "korvel/core/AudioRecorderBackend";

/** The queues that Java's threads may fill. Has its own lock: those threads must not wait. */
class OpenQueues {
  public:
    using Queue = boost::shared_ptr<Sound::CaptureQueue>;

    jlong add(const Queue& queue) {
        const std::lock_guard<std::mutex> lock(mutex);
        queues[++lastHandle] = queue;
        return lastHandle;
    }
    void remove(jlong handle) {
        const std::lock_guard<std::mutex> lock(mutex);
        queues.erase(handle);
    }
    /** Null when the recorder does not record any more. */
    Queue find(jlong handle) {
        const std::lock_guard<std::mutex> lock(mutex);
        const auto found = queues.find(handle);
        return found != queues.end() ? found->second : Queue();
    }

    static OpenQueues& instance() {
        static auto* const open = new OpenQueues;
        return *open;
    }

  private:
    std::mutex mutex;
    std::map<jlong, Queue> queues;
    jlong lastHandle = 0;
};

void receive(JNIEnv* env, jlong recorder, jbyteArray data, jint size) {
    Jni::requireNonNull(env, data, "data");
    const OpenQueues::Queue queue = OpenQueues::instance().find(recorder);
    // Half samples are none.
    const jint evenSize = size - size % 2;
    if (!queue || evenSize <= 0) {
        return;
    }
    // Piece by piece through the stack: this thread is not to allocate.
    std::array<unsigned char, 4096> piece;
    for (jint done = 0; done < evenSize;) {
        const jint count = std::min(evenSize - done, static_cast<jint>(piece.size()));
        env->GetByteArrayRegion(data, done, count, reinterpret_cast<jbyte*>(piece.data()));
        Jni::check(env);
        queue->push(piece.data(), static_cast<std::size_t>(count));
        done += count;
    }
}

}  // namespace

AudioRecordRecorder::AudioRecordRecorder() : QueuedRecorder("AudioRecordRecorder") {}

AudioRecordRecorder::~AudioRecordRecorder() {
    QueuedRecorder::stopRecording();
}

void AudioRecordRecorder::install(JNIEnv* env) {
    Jni::findClass(env, JAVA_CLASS);
    Sound::Recorder::setFactory([] { return boost::make_shared<AudioRecordRecorder>(); });
}

bool AudioRecordRecorder::openDevice(const Sound::RecorderFormat& /*format*/,
                                     const boost::shared_ptr<Sound::CaptureQueue>& target) {
    JNIEnv* const env = kdGetJNIEnvKOR();
    if (env == nullptr) {
        return false;
    }
    handle = OpenQueues::instance().add(target);
    try {
        const Jni::LocalRef<jclass> type = Jni::findClass(env, JAVA_CLASS);
        const Jni::LocalRef<jobject> object =
            Jni::newObject(env, type.get(), "(JIII)V", handle, static_cast<jint>(getSampleRate()),
                           static_cast<jint>(getBufferLength()), static_cast<jint>(getMode()));
        backend = Jni::GlobalRef(env, object.get());
        output = target;
        return true;
    } catch (const Jni::PendingException&) {
        Jni::logAndClear(env, "AudioRecorderBackend");
        OpenQueues::instance().remove(handle);
        return false;
    }
}

void AudioRecordRecorder::beginDevice() {
    call("start");
}

void AudioRecordRecorder::endDevice() {
    OpenQueues::instance().remove(handle);
    call("stop");
    output.reset();
    backend.reset();
}

void AudioRecordRecorder::call(const char* method) {
    JNIEnv* const env = kdGetJNIEnvKOR();
    if (env == nullptr) {
        return;
    }
    try {
        Jni::callVoid(env, backend.get(), method, "()V");
    } catch (const Jni::PendingException&) {
        Jni::logAndClear(env, "AudioRecorderBackend");
        output->fail("the recorder does not obey");
    }
}

extern "C" {

JNIEXPORT void JNICALL Java_korvel_core_AudioRecorderBackend_installInternal(JNIEnv* /*env*/,
                                                                             jclass /*type*/) {
    Jni::enter([](JNIEnv* env) { AudioRecordRecorder::install(env); });
}

JNIEXPORT void JNICALL Java_korvel_core_AudioRecorderBackend_onDataInternal(
    JNIEnv* /*env*/, jclass /*type*/, jlong recorder, jbyteArray data, jint size) {
    Jni::enterUnlocked([recorder, data, size](JNIEnv* env) { receive(env, recorder, data, size); });
}

JNIEXPORT void JNICALL Java_korvel_core_AudioRecorderBackend_onErrorInternal(JNIEnv* /*env*/,
                                                                             jclass /*type*/,
                                                                             jlong recorder,
                                                                             jstring reason) {
    Jni::enterUnlocked([recorder, reason](JNIEnv* env) {
        if (const OpenQueues::Queue queue = OpenQueues::instance().find(recorder)) {
            queue->fail(Jni::toUtf8(env, reason));
        }
    });
}

}  // extern "C"
