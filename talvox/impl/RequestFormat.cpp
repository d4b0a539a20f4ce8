#include "talvox/impl/RequestFormat.h"

#include <array>
#include <cstddef>

#include "pal/kd.h"
#include "util/impl/NumberText.h"

namespace Talvox {

namespace {

const char* const SOURCE = "talvox/impl/RecognizeRequest";

/** Two floats, of 39 digits before the point at most, as "%f,%f". */
constexpr std::size_t LOCATION_BYTES_MAX = 128;

const std::string WHOLE_PATH = "/asrgw";
const std::string CHUNKED_PATH = "/asrgw_chunked";

bool endsWith(const std::string& text, const std::string& ending) {
    return text.size() >= ending.size() &&
           text.compare(text.size() - ending.size(), ending.size(), ending) == 0;
}

/** The service's address without the path of whole requests, which settings may carry. */
std::string getBase(const std::string& url) {
    return endsWith(url, WHOLE_PATH) ? url.substr(0, url.size() - WHOLE_PATH.size()) : url;
}

}  // namespace

std::string makeContentType(const Sound::SoundDataInfo& aInfo) {
    if (aInfo.getCodec() == Sound::SoundDataInfo::SPEEX) {
        return "audio/x-speex";
    }
    KOR_ASSERT_AT(aInfo.getCodec() == Sound::SoundDataInfo::NONE,
                  "aInfo.getCodec() == Sound::SoundDataInfo::NONE", SOURCE, 317);
    KOR_ASSERT_AT(aInfo.getChannelCount() == 1, "aInfo.getChannelCount() == 1", SOURCE, 318);
    KOR_ASSERT_AT(aInfo.getSampleSize() == 2, "aInfo.getSampleSize() == 2", SOURCE, 319);
    std::array<char, 64> text = {};
    kdSprintf_s(text.data(), text.size(), "audio/x-pcm;bit=16;rate=%i", aInfo.getSampleRate());
    return text.data();
}

std::string makeRequestUrl(const Settings& talvoxSettings, const Settings& recognizerSettings,
                           bool chunked, const std::string& contentType) {
    std::string url = getBase(talvoxSettings.getUrl());
    if (chunked) {
        KOR_ASSERT_AT(!talvoxSettings.getUuid().empty(), "!talvoxSettings.getUuid().empty()",
                      SOURCE, 137);
        url += CHUNKED_PATH + "?uuid=" + talvoxSettings.getUuid() +
               "&action=verbose&Content-Type=" + contentType;
    } else {
        url += WHOLE_PATH + "?uuid=" + talvoxSettings.getUuid();
    }
    if (!recognizerSettings.getSessionId().empty()) {
        url += "&sessionId=" + recognizerSettings.getSessionId();
    }
    return url;
}

std::string formatLocation(const Util::Bundle::LatLon& location) {
    std::array<char, LOCATION_BYTES_MAX> text = {};
    kdSprintf_s(text.data(), text.size(), "%f,%f", static_cast<double>(location.lat),
                static_cast<double>(location.lon));
    return text.data();
}

std::string removeSeparators(const std::string& name, const std::string& value,
                             const std::string& boundary) {
    const std::string separator = "--" + boundary;
    if (value.find(separator) == std::string::npos) {
        return value;
    }
    kdLogFormatMessage("RecognizeRequest: %s holds the separator of the request, removing it",
                       name.c_str());
    std::string safe;
    for (const char c : value) {
        safe += c;
        // What stood around a removed one may form another, which is at the end then as well.
        if (endsWith(safe, separator)) {
            safe.resize(safe.size() - separator.size());
        }
    }
    return safe;
}

std::string makeTranscripts(const RecognitionResults& results, const TranscriptsOrigin& origin) {
    std::string xml = "<?xml version=\"1.0\" encoding=\"utf-8\"?>\n";
    xml += "<Transcripts source=\"" + origin.source + '"';
    if (!origin.defaultLanguage.empty()) {
        xml += " default_language=\"" + origin.defaultLanguage + '"';
    }
    if (!origin.topic.empty()) {
        xml += " topic=\"" + origin.topic + '"';
    }
    xml += ">\n";
    for (const RecognitionResult& result : results) {
        xml += "  <Transcript";
        if (result.getConfidence() >= 0.0F) {
            xml += " confidence=\"" + Util::NumberText::writeFloat(result.getConfidence()) + '"';
        }
        xml += '>' + result.getText() + "</Transcript>\n";
    }
    return xml + "</Transcripts>\n";
}

}  // namespace Talvox
