#include "Text.h"

#include <limits>
#include <stdexcept>

#include "Env.h"
#include "Utf16.h"

namespace Jni {

bool isText(JNIEnv* env, jobject object) {
    const LocalRef<jclass> type = findClass(env, "java/lang/String");
    return object != nullptr && env->IsInstanceOf(object, type.get()) != JNI_FALSE;
}

std::string toUtf8(JNIEnv* env, jstring text) {
    if (text == nullptr) {
        return {};
    }
    const jsize length = env->GetStringLength(text);
    Utf16 units(static_cast<std::size_t>(length));
    env->GetStringRegion(text, 0, length, units.data());
    check(env);
    return utf16ToUtf8(units.data(), units.size());
}

LocalRef<jstring> toJString(JNIEnv* env, const std::string& bytes) {
    const Utf16 units = utf8ToUtf16(bytes);
    if (units.size() > static_cast<std::size_t>(std::numeric_limits<jsize>::max())) {
        throw std::length_error("a text is too long for Java");
    }
    static const jchar NOTHING = 0;
    const jchar* const data = units.empty() ? &NOTHING : units.data();
    LocalRef<jstring> text(env, env->NewString(data, static_cast<jsize>(units.size())));
    check(env);
    return text;
}

LocalRef<jobjectArray> toJStrings(JNIEnv* env, const std::vector<std::string>& texts) {
    const LocalRef<jclass> type = findClass(env, "java/lang/String");
    LocalRef<jobjectArray> array(
        env, env->NewObjectArray(static_cast<jsize>(texts.size()), type.get(), nullptr));
    check(env);
    for (std::size_t index = 0; index < texts.size(); ++index) {
        const LocalRef<jstring> text = toJString(env, texts[index]);
        env->SetObjectArrayElement(array.get(), static_cast<jsize>(index), text.get());
        check(env);
    }
    return array;
}

}  // namespace Jni
