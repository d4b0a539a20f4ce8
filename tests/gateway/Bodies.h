/**
 * @file
 * Multipart bodies as clients of the gateway send them, written out by hand.
 */
#pragma once

#include <string>
#include <utility>
#include <vector>

namespace GatewayTest {

constexpr const char* BOUNDARY = "1BEF0A57BE110FD467A";
constexpr const char* PCM16K = "audio/x-pcm;bit=16;rate=16000";
constexpr const char* PCM8K = "audio/x-pcm;bit=16;rate=8000";
constexpr const char* SPEEX = "audio/x-speex";

using Fields = std::vector<std::pair<std::string, std::string>>;

/** One part with its boundary line before it. */
inline std::string part(const std::string& name, const std::string& value,
                        const std::string& contentType = "") {
    std::string text = std::string("--") + BOUNDARY +
                       "\r\nContent-Disposition: form-data; name=\"" + name + "\"\r\n";
    if (!contentType.empty()) {
        text += "Content-Type: " + contentType + "\r\n";
    }
    return text + "\r\n" + value + "\r\n";
}

inline std::string closing() {
    return std::string("--") + BOUNDARY + "--\r\n";
}

/** The fields that stand before the sound. */
inline Fields usualFields(const std::string& language = "en-US") {
    return {{"uuid", "u1"},
            {"lang", language},
            {"topic", "freeform"},
            {"myll", "55.750000,37.616000"},
            {"centerll", "0.000000,0.000000"}};
}

inline std::string parts(const Fields& fields) {
    std::string text;
    for (const auto& field : fields) {
        text += part(field.first, field.second);
    }
    return text;
}

/** A whole body with sound. */
inline std::string bodyWithSound(const std::string& sound, const std::string& type,
                                 const std::string& language = "en-US") {
    return parts(usualFields(language)) + part("Content-Type", type) + part("audio", sound, type) +
           closing();
}

}  // namespace GatewayTest
