// Entry points of korvel.talvox.util.LogCollector.
#include <map>
#include <string>

#include "EntryPoint.h"
#include "Text.h"
#include "core/Logger.h"
#include "logcollector/LogCollector.h"
#include "pal/kd_jni.h"
#include "pal/kd_log.h"

namespace {

using Parameters = std::map<std::string, std::string>;

std::string readText(JNIEnv* env, jstring text, const char* name) {
    Jni::requireNonNull(env, text, name);
    return Jni::toUtf8(env, text);
}

std::string readValue(JNIEnv* env, jobject bundle, jstring key) {
    const Jni::LocalRef<jobject> value =
        Jni::callObject(env, bundle, "get", "(Ljava/lang/String;)Ljava/lang/Object;", key);
    if (!value) {
        return "null";
    }
    const Jni::LocalRef<jclass> type = Jni::findClass(env, "java/lang/Object");
    const jmethodID toString = Jni::findMethod(env, type.get(), "toString", "()Ljava/lang/String;");
    const Jni::LocalRef<jstring> text(
        env, static_cast<jstring>(env->CallObjectMethod(value.get(), toString)));
    Jni::check(env);
    return Jni::toUtf8(env, text.get());
}

Parameters toMap(JNIEnv* env, jobject bundle) {
    Jni::requireNonNull(env, bundle, "parameters");
    const Jni::LocalRef<jobject> keySet =
        Jni::callObject(env, bundle, "keySet", "()Ljava/util/Set;");
    const Jni::LocalRef<jobjectArray> keys =
        Jni::callObject(env, keySet.get(), "toArray", "()[Ljava/lang/Object;").as<jobjectArray>();
    const jsize count = env->GetArrayLength(keys.get());
    Parameters parameters;
    for (jsize index = 0; index < count; ++index) {
        const Jni::LocalRef<jstring> key(
            env, static_cast<jstring>(env->GetObjectArrayElement(keys.get(), index)));
        Jni::check(env);
        const std::string name = Jni::toUtf8(env, key.get());
        const std::string value = readValue(env, bundle, key.get());
        parameters[name] = value;
        kdLogFormatMessage("LogCollector: parameter %s = %s", name.c_str(), value.c_str());
    }
    return parameters;
}

const char* const JAVA_CLASS = "korvel/talvox/util/LogCollector";

void reportDelivered() {
    JNIEnv* const env = kdGetJNIEnvKOR();
    if (env == nullptr) {
        return;
    }
    try {
        const Jni::LocalRef<jclass> type = Jni::findClass(env, JAVA_CLASS);
        env->CallStaticVoidMethod(type.get(),
                                  Jni::findStaticMethod(env, type.get(), "onDelivered", "()V"));
        Jni::check(env);
    } catch (const Jni::PendingException&) {
        Jni::logAndClear(env, "LogCollector.onDelivered");
    }
}

}  // namespace

extern "C" {

JNIEXPORT void JNICALL Java_korvel_talvox_util_LogCollector_setLoggingEnabled(JNIEnv* /*env*/,
                                                                              jclass /*type*/,
                                                                              jboolean enabled) {
    Jni::enter(
        [enabled](JNIEnv* /*env*/) { LogCollector::setLoggingEnabled(enabled != JNI_FALSE); });
}

JNIEXPORT jboolean JNICALL Java_korvel_talvox_util_LogCollector_isLoggingEnabled(JNIEnv* /*env*/,
                                                                                 jclass /*type*/) {
    return Jni::enter<jboolean>(JNI_FALSE, [](JNIEnv* /*env*/) {
        return static_cast<jboolean>(LogCollector::isLoggingEnabled() ? JNI_TRUE : JNI_FALSE);
    });
}

JNIEXPORT void JNICALL Java_korvel_talvox_util_LogCollector_startLogSession(JNIEnv* /*env*/,
                                                                            jclass /*type*/,
                                                                            jstring id) {
    Jni::enter([id](JNIEnv* env) { LogCollector::startSession(readText(env, id, "id")); });
}

JNIEXPORT void JNICALL Java_korvel_talvox_util_LogCollector_stopLogSession(JNIEnv* /*env*/,
                                                                           jclass /*type*/,
                                                                           jstring id) {
    Jni::enter([id](JNIEnv* env) { LogCollector::stopSession(readText(env, id, "id")); });
}

JNIEXPORT void JNICALL Java_korvel_talvox_util_LogCollector_setUuid(JNIEnv* /*env*/,
                                                                    jclass /*type*/, jstring uuid) {
    Jni::enter([uuid](JNIEnv* env) { LogCollector::configure(readText(env, uuid, "uuid")); });
}

JNIEXPORT void JNICALL Java_korvel_talvox_util_LogCollector_configure(JNIEnv* /*env*/,
                                                                      jclass /*type*/, jstring uuid,
                                                                      jstring url) {
    Jni::enter([uuid, url](JNIEnv* env) {
        const std::string identifier = readText(env, uuid, "uuid");
        LogCollector::configure(identifier, readText(env, url, "url"));
    });
}

JNIEXPORT jboolean JNICALL Java_korvel_talvox_util_LogCollector_openStore(
    JNIEnv* /*env*/, jclass /*type*/, jstring folder, jlong maxBytes, jlong maxAgeS) {
    bool isOpen = false;
    // The files are read without the event lock.
    Jni::enterUnlocked([&isOpen, folder, maxBytes, maxAgeS](JNIEnv* env) {
        LogCollector::LogStoreOptions options;
        options.folder = readText(env, folder, "folder");
        options.maxBytes = maxBytes;
        options.maxAgeS = maxAgeS;
        isOpen = LogCollector::openStore(options);
    });
    return static_cast<jboolean>(isOpen ? JNI_TRUE : JNI_FALSE);
}

JNIEXPORT void JNICALL Java_korvel_talvox_util_LogCollector_setLogLevelInternal(JNIEnv* /*env*/,
                                                                                jclass /*type*/,
                                                                                jint level) {
    Jni::enter([level](JNIEnv* /*env*/) { Logger::setLevel(level); });
}

JNIEXPORT jlong JNICALL Java_korvel_talvox_util_LogCollector_getPendingCount(JNIEnv* /*env*/,
                                                                             jclass /*type*/) {
    return Jni::enter<jlong>(
        0, [](JNIEnv* /*env*/) { return static_cast<jlong>(LogCollector::getPendingCount()); });
}

JNIEXPORT void JNICALL Java_korvel_talvox_util_LogCollector_watchDeliveryInternal(JNIEnv* /*env*/,
                                                                                  jclass /*type*/) {
    Jni::enter([](JNIEnv* /*env*/) { LogCollector::setDeliveredCallback(&reportDelivered); });
}

JNIEXPORT void JNICALL Java_korvel_talvox_util_LogCollector_logEvent(JNIEnv* /*env*/,
                                                                     jclass /*type*/,
                                                                     jstring session, jstring name,
                                                                     jobject parameters) {
    Jni::enter([session, name, parameters](JNIEnv* env) {
        const std::string id = readText(env, session, "session");
        const std::string event = readText(env, name, "name");
        LogCollector::logEvent(id, event, toMap(env, parameters));
    });
}

JNIEXPORT void JNICALL Java_korvel_talvox_util_LogCollector_logError(JNIEnv* /*env*/,
                                                                     jclass /*type*/,
                                                                     jstring session, jstring name,
                                                                     jobject parameters) {
    Jni::enter([session, name, parameters](JNIEnv* env) {
        const std::string id = readText(env, session, "session");
        const std::string error = readText(env, name, "name");
        LogCollector::logError(id, error, toMap(env, parameters));
    });
}

}  // extern "C"
