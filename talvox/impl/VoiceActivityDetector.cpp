#include "talvox/impl/VoiceActivityDetector.h"

#include <algorithm>
#include <boost/make_shared.hpp>
#include <locale>
#include <map>
#include <vector>

#include "pal/kd_log.h"
#include "talvox/impl/BufferedVAD.h"
#include "talvox/impl/FrameVAD.h"
#include "talvox/impl/VoiceActivityDetectorWebRTC.h"

namespace {

using Parameters = std::map<std::string, std::string>;

constexpr char ENGINE[] = "engine";
constexpr char ENGINE_BUFFERED[] = "buffered";
constexpr char ENGINE_WEBRTC[] = "wrtc";
constexpr char SUBENGINE[] = "subengine";

std::vector<std::string> split(const std::string& text, char separator) {
    std::vector<std::string> parts;
    std::string::size_type begin = 0;
    for (auto end = text.find(separator); end != std::string::npos;
         end = text.find(separator, begin)) {
        parts.push_back(text.substr(begin, end - begin));
        begin = end + 1;
    }
    parts.push_back(text.substr(begin));
    return parts;
}

std::string normaliseName(std::string name) {
    name.erase(std::remove(name.begin(), name.end(), '_'), name.end());
    name.erase(std::remove(name.begin(), name.end(), ' '), name.end());
    const std::locale locale;
    std::transform(name.begin(), name.end(), name.begin(),
                   [&locale](char letter) { return std::tolower(letter, locale); });
    return name;
}

Parameters parse(const std::string& text) {
    Parameters parameters;
    for (const std::string& token : split(text, ';')) {
        if (token.empty()) {
            continue;
        }
        const std::vector<std::string> parts = split(token, '=');
        if (parts.size() > 2) {
            kdLogFormatMessage("Bad VAD parameter setting: %s", token.c_str());
            continue;
        }
        parameters[normaliseName(parts[0])] = parts.size() == 2 ? parts[1] : std::string();
    }
    return parameters;
}

std::string valueOf(const Parameters& parameters, const char* name,
                    const std::string& otherwise = std::string()) {
    const auto found = parameters.find(name);
    return found != parameters.end() ? found->second : otherwise;
}

}  // namespace

namespace Talvox {

VoiceActivityDetector::~VoiceActivityDetector() = default;

void VoiceActivityDetector::setSessionMode(Sound::Recorder::Mode /*mode*/) {}

int VoiceActivityDetector::getLeadingNoiseMS() const {
    return 0;
}

void VoiceActivityDetector::processNoise(const Sound::SoundDataBuffer& /*buffer*/) {}

boost::shared_ptr<VoiceActivityDetector> VoiceActivityDetector::create(
    const std::string& parameters) {
    return create(parameters, [](const boost::shared_ptr<FrameVAD>& frameVad) { return frameVad; });
}

boost::shared_ptr<VoiceActivityDetector> VoiceActivityDetector::create(
    const std::string& parameters, const FrameDecorator& decorate) {
    const Parameters parsed = parse(parameters);
    const std::string engine = valueOf(parsed, ENGINE, ENGINE_BUFFERED);
    boost::shared_ptr<VoiceActivityDetector> detector;
    if (engine == ENGINE_WEBRTC) {
        detector = decorate(boost::make_shared<VoiceActivityDetectorWebRTC>());
    } else {
        std::string subengine = valueOf(parsed, SUBENGINE);
        if (engine != ENGINE_BUFFERED) {
            kdLogFormatMessage("Unknown engine name for VoiceActivityDetector: %s", engine.c_str());
            subengine.clear();
        }
        detector = boost::make_shared<BufferedVAD>(decorate(FrameVAD::create(subengine)));
    }
    for (const auto& [name, value] : parsed) {
        detector->setParameter(name, value);
    }
    return detector;
}

}  // namespace Talvox
