#include "gateway/AudioFormat.h"

#include <algorithm>

#include "core/util/Ascii.h"
#include "gateway/HeaderValue.h"

namespace Gateway {

namespace {

/** Decimal digits only; 0 for anything else and for what cannot be a rate. */
unsigned parseNumber(const std::string& text) {
    const bool digits = std::all_of(text.begin(), text.end(), &Util::isDigit);
    if (text.empty() || text.size() > 8 || !digits) {
        return 0;
    }
    return static_cast<unsigned>(std::stoul(text));
}

}  // namespace

std::string AudioFormat::parse(const std::string& contentType, AudioFormat& format) {
    HeaderValue type;
    if (!HeaderValue::parse(contentType, type)) {
        return "the audio's content type is malformed: " + contentType;
    }
    if (type.value == "audio/x-speex") {
        format.codec = Codec::SPEEX;
        format.rateHz = 0;
        return std::string();
    }
    if (type.value != "audio/x-pcm") {
        return "the audio's content type is not supported: " + contentType;
    }
    const std::string* bits = type.find("bit");
    const std::string* rate = type.find("rate");
    if (bits == nullptr || *bits != "16") {
        return "PCM sound must have bit=16: " + contentType;
    }
    format.codec = Codec::PCM16;
    format.rateHz = rate == nullptr ? 0 : parseNumber(*rate);
    if (format.rateHz < MIN_RATE_HZ || format.rateHz > MAX_RATE_HZ) {
        return "PCM sound must have a rate from 4000 to 96000: " + contentType;
    }
    return std::string();
}

}  // namespace Gateway
