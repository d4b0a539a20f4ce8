#include "AndroidProximitySource.h"

#include <boost/make_shared.hpp>
#include <utility>

#include "../EntryPoint.h"
#include "../Handles.h"

namespace {

const char* const JAVA_CLASS = "korvel/core/ProximityBackend";

}  // namespace

using Sources = Jni::KnownObjects<AndroidProximitySource>;

AndroidProximitySource::~AndroidProximitySource() {
    const Util::EventLock lock;
    Sources::remove(this);
    AndroidProximitySource::stop();
}

void AndroidProximitySource::install(JNIEnv* env) {
    Jni::findClass(env, JAVA_CLASS);
    setFactory([]() -> boost::shared_ptr<ProximitySource> {
        auto source = boost::allocate_shared<AndroidProximitySource>(
            Jni::QuarantineAllocator<AndroidProximitySource>());
        Sources::add(source);
        return source;
    });
}

bool AndroidProximitySource::start(Callback callback) {
    JNIEnv* const env = kdGetJNIEnvKOR();
    if (env == nullptr) {
        return false;
    }
    stop();
    target = std::move(callback);
    try {
        const Jni::LocalRef<jclass> type = Jni::findClass(env, JAVA_CLASS);
        const Jni::LocalRef<jobject> object =
            Jni::newObject(env, type.get(), "(J)V", Jni::toHandle(this));
        backend = Jni::GlobalRef(env, object.get());
        if (Jni::callBoolean(env, object.get(), "start", "()Z") != JNI_FALSE) {
            return true;
        }
    } catch (const Jni::PendingException&) {
        Jni::logAndClear(env, "ProximityBackend.start");
    }
    stop();
    return false;
}

void AndroidProximitySource::stop() {
    target = nullptr;
    JNIEnv* const env = kdGetJNIEnvKOR();
    if (!backend || env == nullptr) {
        return;
    }
    const Jni::GlobalRef stopping = std::move(backend);
    try {
        Jni::callVoid(env, stopping.get(), "stop", "()V");
    } catch (const Jni::PendingException&) {
        Jni::logAndClear(env, "ProximityBackend.stop");
    }
}

void AndroidProximitySource::onSample(bool isNear) {
    // A copy, because the callback may stop the source.
    const Callback callback = target;
    if (callback) {
        callback(isNear);
    }
}

extern "C" {

JNIEXPORT void JNICALL Java_korvel_core_ProximityBackend_onSampleInternal(JNIEnv* /*env*/,
                                                                          jclass /*type*/,
                                                                          jlong source,
                                                                          jboolean isNear) {
    Jni::enter([source, isNear](JNIEnv* /*env*/) {
        // The sensor may be faster than the end of the listening.
        if (const boost::shared_ptr<AndroidProximitySource> listener = Sources::find(source)) {
            listener->onSample(isNear != JNI_FALSE);
        }
    });
}

}  // extern "C"
