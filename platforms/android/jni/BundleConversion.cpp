#include "BundleConversion.h"

#include <boost/make_shared.hpp>
#include <string>

#include "Env.h"
#include "Text.h"
#include "pal/kd_jni.h"
#include "talvox/Log.h"

namespace {

using Jni::LocalRef;
using Util::Bundle;

// Both directions report under the one name.
const char* const FUNCTION = "jBundleToBundle";
const char* const PROVIDER = "Talvox";
const char* const BUNDLE_CLASS = "android/os/Bundle";
const char* const LOCATION_CLASS = "android/location/Location";
/** References that a nested bundle needs at one time, without those of its own nested ones. */
const jint FRAME_SIZE = 10;

void logUnknownType(const std::string& key, int type) {
    tvLogFormatMessage(0, "%s: unknown elem type for field %s: %d, ignoring", FUNCTION, key.c_str(),
                       type);
}

LocalRef<jobject> makeLocation(JNIEnv* env, const Bundle::LatLon& position) {
    const LocalRef<jclass> type = Jni::findClass(env, LOCATION_CLASS);
    const LocalRef<jstring> provider = Jni::toJString(env, PROVIDER);
    LocalRef<jobject> location =
        Jni::newObject(env, type.get(), "(Ljava/lang/String;)V", provider.get());
    Jni::callVoid(env, location.get(), "setLatitude", "(D)V", static_cast<jdouble>(position.lat));
    Jni::callVoid(env, location.get(), "setLongitude", "(D)V", static_cast<jdouble>(position.lon));
    return location;
}

void putElement(JNIEnv* env, jobject target, jstring key, const std::string& name,
                const Bundle::Elem& element) {
    switch (element.type) {
        case Bundle::BOOLEAN:
            Jni::callVoid(env, target, "putBoolean", "(Ljava/lang/String;Z)V", key,
                          static_cast<jboolean>(element.asBoolean() ? JNI_TRUE : JNI_FALSE));
            return;
        case Bundle::INT:
            Jni::callVoid(env, target, "putInt", "(Ljava/lang/String;I)V", key,
                          static_cast<jint>(element.asInt()));
            return;
        case Bundle::FLOAT:
            Jni::callVoid(env, target, "putFloat", "(Ljava/lang/String;F)V", key,
                          static_cast<jfloat>(element.asFloat()));
            return;
        case Bundle::LATLON: {
            const LocalRef<jobject> location = makeLocation(env, element.latLon);
            Jni::callVoid(env, target, "putParcelable",
                          "(Ljava/lang/String;Landroid/os/Parcelable;)V", key, location.get());
            return;
        }
        case Bundle::STRING: {
            const LocalRef<jstring> text = Jni::toJString(env, element.text);
            Jni::callVoid(env, target, "putString", "(Ljava/lang/String;Ljava/lang/String;)V", key,
                          text.get());
            return;
        }
        case Bundle::BUNDLE: {
            const Bundle nothing;
            const Jni::LocalFrame frame(env, FRAME_SIZE);
            const LocalRef<jobject> nested(
                env, bundleToJBundle(element.bundle ? *element.bundle : nothing));
            Jni::callVoid(env, target, "putBundle", "(Ljava/lang/String;Landroid/os/Bundle;)V", key,
                          nested.get());
            return;
        }
    }
    logUnknownType(name, element.type);
}

const char* getJavaClass(Bundle::ElemType type) {
    switch (type) {
        case Bundle::BOOLEAN:
            return "java/lang/Boolean";
        case Bundle::INT:
            return "java/lang/Integer";
        case Bundle::FLOAT:
            return "java/lang/Float";
        case Bundle::LATLON:
            return LOCATION_CLASS;
        case Bundle::STRING:
            return "java/lang/String";
        case Bundle::BUNDLE:
            return BUNDLE_CLASS;
    }
    return nullptr;
}

/** Whether the entry holds what the table asks for; the getters' own defaults would hide it. */
bool hasValue(JNIEnv* env, jobject source, jstring key, const Bundle::ElemSpec& row) {
    const LocalRef<jobject> value =
        Jni::callObject(env, source, "get", "(Ljava/lang/String;)Ljava/lang/Object;", key);
    if (!value) {
        tvLogFormatMessage(0, "%s: null value for field %s, ignoring", FUNCTION, row.name);
        return false;
    }
    const LocalRef<jclass> expected = Jni::findClass(env, getJavaClass(row.type));
    if (env->IsInstanceOf(value.get(), expected.get()) == JNI_FALSE) {
        tvLogFormatMessage(0, "%s: wrong value type for field %s, ignoring", FUNCTION, row.name);
        return false;
    }
    return true;
}

Bundle::LatLon readLocation(JNIEnv* env, jobject source, jstring key) {
    const LocalRef<jobject> location =
        Jni::callObject(env, source, "get", "(Ljava/lang/String;)Ljava/lang/Object;", key);
    Bundle::LatLon position;
    position.lat = static_cast<float>(Jni::callDouble(env, location.get(), "getLatitude", "()D"));
    position.lon = static_cast<float>(Jni::callDouble(env, location.get(), "getLongitude", "()D"));
    return position;
}

boost::shared_ptr<Bundle> readNested(JNIEnv* env, jobject source, jstring key, const Bundle& target,
                                     const Bundle::ElemSpec& row) {
    const Jni::LocalFrame frame(env, FRAME_SIZE);
    const LocalRef<jobject> nested =
        Jni::callObject(env, source, "getBundle", "(Ljava/lang/String;)Landroid/os/Bundle;", key);
    const bool isThere = target.hasKey(row.name) && target.getType(row.name) == Bundle::BUNDLE;
    const boost::shared_ptr<const Bundle> current =
        isThere ? target.getBundle(row.name) : boost::shared_ptr<const Bundle>();
    return jBundleToBundle(nested.get(), current ? *current : Bundle(), row.subSpec);
}

void readElement(JNIEnv* env, jobject source, jstring key, Bundle& target,
                 const Bundle::ElemSpec& row) {
    switch (row.type) {
        case Bundle::BOOLEAN:
            target.putBoolean(row.name, Jni::callBoolean(env, source, "getBoolean",
                                                         "(Ljava/lang/String;)Z", key) != 0);
            return;
        case Bundle::INT:
            target.putInt(row.name,
                          Jni::callInt(env, source, "getInt", "(Ljava/lang/String;)I", key));
            return;
        case Bundle::FLOAT:
            target.putFloat(row.name,
                            Jni::callFloat(env, source, "getFloat", "(Ljava/lang/String;)F", key));
            return;
        case Bundle::LATLON:
            target.putLatLon(row.name, readLocation(env, source, key));
            return;
        case Bundle::STRING: {
            const LocalRef<jstring> text =
                Jni::callObject(env, source, "getString", "(Ljava/lang/String;)Ljava/lang/String;",
                                key)
                    .as<jstring>();
            target.putString(row.name, Jni::toUtf8(env, text.get()));
            return;
        }
        case Bundle::BUNDLE:
            target.putBundle(row.name, readNested(env, source, key, target, row));
            return;
    }
}

const Bundle::ElemSpec* findRow(const Bundle::ElemSpec* spec, const std::string& key) {
    for (const Bundle::ElemSpec* row = spec; row != nullptr && row->name != nullptr; ++row) {
        if (key == row->name) {
            return row;
        }
    }
    return nullptr;
}

void readEntry(JNIEnv* env, jobject source, jstring key, Bundle& target,
               const Bundle::ElemSpec* spec) {
    const std::string name = Bundle::normalizeKey(Jni::toUtf8(env, key));
    const Bundle::ElemSpec* const row = findRow(spec, name);
    if (row == nullptr) {
        tvLogFormatMessage(0, "%s: unknown field name %s, ingoring", FUNCTION, name.c_str());
    } else if (getJavaClass(row->type) == nullptr) {
        logUnknownType(name, row->type);
    } else if (hasValue(env, source, key, *row)) {
        readElement(env, source, key, target, *row);
    }
}

}  // namespace

jobject bundleToJBundle(const Util::Bundle& bundle) {
    JNIEnv* const env = Jni::getEnv();
    const LocalRef<jclass> type = Jni::findClass(env, BUNDLE_CLASS);
    LocalRef<jobject> result = Jni::newObject(env, type.get(), "()V");
    for (const std::string& name : bundle.getKeys()) {
        const LocalRef<jstring> key = Jni::toJString(env, name);
        putElement(env, result.get(), key.get(), name, bundle.get(name));
    }
    return result.release();
}

boost::shared_ptr<Util::Bundle> jBundleToBundle(jobject javaBundle, const Util::Bundle& base,
                                                const Util::Bundle::ElemSpec* spec) {
    boost::shared_ptr<Bundle> result = base.clone();
    updateFromJBundle(javaBundle, *result, spec);
    return result;
}

void updateFromJBundle(jobject javaBundle, Util::Bundle& target,
                       const Util::Bundle::ElemSpec* spec) {
    JNIEnv* const env = Jni::getEnv();
    const LocalRef<jobject> keySet =
        Jni::callObject(env, javaBundle, "keySet", "()Ljava/util/Set;");
    const LocalRef<jobjectArray> keys =
        Jni::callObject(env, keySet.get(), "toArray", "()[Ljava/lang/Object;").as<jobjectArray>();
    const jsize count = env->GetArrayLength(keys.get());
    for (jsize index = 0; index < count; ++index) {
        const LocalRef<jstring> key(
            env, static_cast<jstring>(env->GetObjectArrayElement(keys.get(), index)));
        Jni::check(env);
        readEntry(env, javaBundle, key.get(), target, spec);
    }
}
