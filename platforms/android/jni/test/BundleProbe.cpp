// Entry points of the test class korvel.talvox.impl.BundleProbe: the conversion of bundles with a
// table that has nested bundles, which the engine's settings have not.
#include <boost/make_shared.hpp>

#include "platforms/android/jni/BundleConversion.h"
#include "platforms/android/jni/EntryPoint.h"
#include "platforms/android/jni/Text.h"

namespace {

using Util::Bundle;

const char* const NESTED = "inner";
const char* const ROOT = "tree";
const auto UNKNOWN_TYPE = static_cast<Bundle::ElemType>(42);

/** Every type, to any depth. */
const Bundle::ElemSpec TREE[] = {
    {"flag", Bundle::BOOLEAN, nullptr},     {"count", Bundle::INT, nullptr},
    {"ratio", Bundle::FLOAT, nullptr},      {"place", Bundle::LATLON, nullptr},
    {"sometitle", Bundle::STRING, nullptr}, {NESTED, Bundle::BUNDLE, TREE},
    {"odd", UNKNOWN_TYPE, nullptr},         {nullptr, Bundle::BOOLEAN, nullptr}};

boost::shared_ptr<Bundle> makeLevel(int count, const char* title) {
    auto level = boost::make_shared<Bundle>();
    level->putBoolean("flag", true);
    level->putInt("count", count);
    level->putFloat("ratio", 0.5F);
    level->putLatLon("place", {10.5F, 20.25F});
    level->putString("sometitle", title);
    return level;
}

/** Three levels. */
boost::shared_ptr<Bundle> makeBase() {
    const auto middle = makeLevel(2, "middle");
    middle->putBundle(NESTED, makeLevel(3, "lowest"));
    auto top = makeLevel(1, "top");
    top->putBundle(NESTED, middle);
    return top;
}

std::string toBytes(JNIEnv* env, jbyteArray array) {
    std::string bytes(static_cast<std::size_t>(env->GetArrayLength(array)), '\0');
    env->GetByteArrayRegion(array, 0, static_cast<jsize>(bytes.size()),
                            reinterpret_cast<jbyte*>(bytes.data()));
    Jni::check(env);
    return bytes;
}

}  // namespace

extern "C" {

// Without one of its own, the VM would find and run that of the engine's library once more.
JNIEXPORT jint JNICALL JNI_OnLoad(JavaVM* /*vm*/, void* /*reserved*/) {
    return Jni::enter<jint>(JNI_ERR, [](JNIEnv* env) {
        const Jni::LocalRef<jclass> type(env, env->FindClass("korvel/core/CoreApplication"));
        Jni::check(env);
        Jni::keepClassLoader(env, type.get());
        return JNI_VERSION_1_6;
    });
}

JNIEXPORT jobject JNICALL Java_korvel_talvox_impl_BundleProbe_makeBase(JNIEnv* /*env*/,
                                                                       jclass /*type*/) {
    return Jni::enter<jobject>(nullptr,
                               [](JNIEnv* /*env*/) { return bundleToJBundle(*makeBase()); });
}

JNIEXPORT jobject JNICALL Java_korvel_talvox_impl_BundleProbe_update(JNIEnv* /*env*/,
                                                                     jclass /*type*/,
                                                                     jobject update) {
    return Jni::enter<jobject>(nullptr, [update](JNIEnv* /*env*/) {
        return bundleToJBundle(*jBundleToBundle(update, *makeBase(), TREE));
    });
}

JNIEXPORT jstring JNICALL Java_korvel_talvox_impl_BundleProbe_updateNothing(JNIEnv* /*env*/,
                                                                            jclass /*type*/,
                                                                            jobject update) {
    return Jni::enter<jstring>(nullptr, [update](JNIEnv* env) {
        return Jni::toJString(env, jBundleToBundle(update, Bundle(), TREE)->toXmlString(ROOT))
            .release();
    });
}

JNIEXPORT jstring JNICALL Java_korvel_talvox_impl_BundleProbe_updateWithoutTable(JNIEnv* /*env*/,
                                                                                 jclass /*type*/,
                                                                                 jobject update) {
    return Jni::enter<jstring>(nullptr, [update](JNIEnv* env) {
        return Jni::toJString(env, jBundleToBundle(update, Bundle(), nullptr)->toXmlString(ROOT))
            .release();
    });
}

JNIEXPORT jstring JNICALL Java_korvel_talvox_impl_BundleProbe_getBaseAfter(JNIEnv* /*env*/,
                                                                           jclass /*type*/,
                                                                           jobject update) {
    return Jni::enter<jstring>(nullptr, [update](JNIEnv* env) {
        const auto base = makeBase();
        jBundleToBundle(update, *base, TREE);
        return Jni::toJString(env, base->toXmlString(ROOT)).release();
    });
}

JNIEXPORT jint JNICALL Java_korvel_talvox_impl_BundleProbe_countShared(JNIEnv* /*env*/,
                                                                       jclass /*type*/,
                                                                       jobject update) {
    return Jni::enter<jint>(-1, [update](JNIEnv* /*env*/) {
        boost::shared_ptr<const Bundle> before = makeBase();
        boost::shared_ptr<const Bundle> after = jBundleToBundle(update, *before, TREE);
        jint shared = 0;
        while (before->hasKey(NESTED)) {
            before = before->getBundle(NESTED);
            after = after->getBundle(NESTED);
            shared += before == after ? 1 : 0;
        }
        return shared;
    });
}

JNIEXPORT jobject JNICALL Java_korvel_talvox_impl_BundleProbe_makeNested(JNIEnv* /*env*/,
                                                                         jclass /*type*/,
                                                                         jbyteArray title) {
    return Jni::enter<jobject>(nullptr, [title](JNIEnv* env) {
        const auto nested = boost::make_shared<Bundle>();
        nested->putString("sometitle", toBytes(env, title));
        Bundle::Elem odd;
        odd.type = UNKNOWN_TYPE;
        nested->put("odd", odd);
        nested->putBundle(NESTED, nullptr);
        Bundle top;
        top.putBundle(NESTED, nested);
        return bundleToJBundle(top);
    });
}

}  // extern "C"
