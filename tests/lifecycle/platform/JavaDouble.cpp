#include "JavaDouble.h"

#include <algorithm>
#include <cstdarg>
#include <cstring>

#include "pal/kd_jni.h"

namespace Lifecycle {

namespace {

/** Stands for an object, a class, a text or an exception. */
struct Object {
    const char* name;
    jlong handle;
};

const char* const RECOGNISER = "korvel/talvox/impl/PlatformRecognizer";
const jchar TEXT[] = {'t', 'e', 'x', 't'};
const jsize TEXT_LENGTH = 4;

DeviceHost* host = nullptr;
JNIEnv* environment = nullptr;
long references = 0;
bool exceptionPending = false;

Object anything{"anything", 0};
Object recogniserClass{RECOGNISER, 0};

jobject hand(Object* object) {
    ++references;
    return reinterpret_cast<jobject>(object);
}

Object* get(jobject reference) {
    return reinterpret_cast<Object*>(reference);
}

const char* getName(jmethodID method) {
    return reinterpret_cast<const char*>(method);
}

// Names of methods are literals: their addresses stand for the methods.
jmethodID JNICALL getMethodId(JNIEnv*, jclass, const char* name, const char*) {
    return reinterpret_cast<jmethodID>(const_cast<char*>(name));
}

jclass JNICALL findClass(JNIEnv*, const char* name) {
    const bool isRecogniser = std::strcmp(name, RECOGNISER) == 0;
    return static_cast<jclass>(hand(isRecogniser ? &recogniserClass : &anything));
}

/** Each reference to an object of the recogniser is an object here. */
jobject JNICALL newObject(JNIEnv*, jclass type, jmethodID, va_list arguments) {
    if (get(type) != &recogniserClass) {
        return hand(&anything);
    }
    const jlong handle = va_arg(arguments, jlong);
    if (!host->onDeviceMade(handle)) {
        exceptionPending = true;
        return nullptr;
    }
    return hand(new Object{RECOGNISER, handle});
}

void JNICALL callVoid(JNIEnv*, jobject object, jmethodID method, va_list) {
    if (get(object)->handle != 0 && !host->onDeviceAsked(get(object)->handle, getName(method))) {
        exceptionPending = true;
    }
}

jobject JNICALL callObject(JNIEnv*, jobject, jmethodID, va_list) {
    return hand(&anything);
}

jclass JNICALL getObjectClass(JNIEnv*, jobject) {
    return static_cast<jclass>(hand(&anything));
}

jobject JNICALL newGlobalRef(JNIEnv*, jobject object) {
    return hand(get(object)->handle != 0 ? new Object(*get(object)) : get(object));
}

void JNICALL deleteRef(JNIEnv*, jobject object) {
    --references;
    if (get(object)->handle != 0) {
        delete get(object);
    }
}

jstring JNICALL newString(JNIEnv*, const jchar*, jsize) {
    return static_cast<jstring>(hand(&anything));
}

jsize JNICALL getStringLength(JNIEnv*, jstring) {
    return TEXT_LENGTH;
}

void JNICALL getStringRegion(JNIEnv*, jstring, jsize, jsize length, jchar* units) {
    std::copy(TEXT, TEXT + std::min(length, TEXT_LENGTH), units);
}

jboolean JNICALL exceptionCheck(JNIEnv*) {
    return exceptionPending ? JNI_TRUE : JNI_FALSE;
}

jthrowable JNICALL exceptionOccurred(JNIEnv*) {
    return exceptionPending ? static_cast<jthrowable>(hand(&anything)) : nullptr;
}

void JNICALL exceptionClear(JNIEnv*) {
    exceptionPending = false;
}

jint JNICALL throwObject(JNIEnv*, jthrowable) {
    exceptionPending = true;
    return JNI_OK;
}

jint JNICALL getEnv(JavaVM*, void** env, jint) {
    *env = environment;
    return JNI_OK;
}

}  // namespace

JavaDouble::JavaDouble(DeviceHost& owner) {
    functions.GetMethodID = &getMethodId;
    functions.GetStaticMethodID = &getMethodId;
    functions.FindClass = &findClass;
    functions.NewObjectV = &newObject;
    functions.CallVoidMethodV = &callVoid;
    functions.CallObjectMethodV = &callObject;
    functions.GetObjectClass = &getObjectClass;
    functions.NewGlobalRef = &newGlobalRef;
    functions.DeleteGlobalRef = &deleteRef;
    functions.DeleteLocalRef = &deleteRef;
    functions.NewString = &newString;
    functions.GetStringLength = &getStringLength;
    functions.GetStringRegion = &getStringRegion;
    functions.ExceptionCheck = &exceptionCheck;
    functions.ExceptionOccurred = &exceptionOccurred;
    functions.ExceptionClear = &exceptionClear;
    functions.Throw = &throwObject;
    env.functions = &functions;
    invocations.GetEnv = &getEnv;
    vm.functions = &invocations;
    host = &owner;
    environment = &env;
    references = 0;
    kdSetJavaVMKOR(&vm);
}

JavaDouble::~JavaDouble() {
    kdSetJavaVMKOR(nullptr);
    host = nullptr;
}

long JavaDouble::countReferences() const {
    return references;
}

}  // namespace Lifecycle
