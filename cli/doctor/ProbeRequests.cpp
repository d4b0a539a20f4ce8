#include "ProbeRequests.h"

#include <algorithm>
#include <cmath>
#include <utility>

#include "cli/corpus/Waves.h"
#include "core/network/HttpRequest.h"

namespace Cli {

namespace {

using Builder = Network::HttpRequest::MultipartBuilder;

const char* const BOUNDARY = "1BEF0A57BE110FD467A";
const int LARGE_RATE_HZ = 44100;
const int HARMONICS = 25;
const double PITCH_HZ = 120;
const double PEAK = 8000;

std::string soundType(int rateHz) {
    return "audio/x-pcm;bit=16;rate=" + std::to_string(rateHz);
}

boost::shared_ptr<Builder> makeBuilder() {
    return Builder::create(BOUNDARY);
}

std::string field(const std::string& name, const std::string& value) {
    const boost::shared_ptr<Builder> builder = makeBuilder();
    return builder->startField(name, false, false, "") + value + builder->endField();
}

std::string endBody(bool hasSound) {
    const boost::shared_ptr<Builder> builder = makeBuilder();
    return (hasSound ? builder->endField() : "") + builder->endEncodedContent();
}

/** The strength of a harmonic in a vowel like that of "far". */
double weigh(double frequencyHz) {
    const double first = (frequencyHz - 700) / 130;
    const double second = (frequencyHz - 1200) / 170;
    return 0.05 + 1 / (1 + first * first) + 0.6 / (1 + second * second);
}

/** Four syllables of a vowel with a little silence around them, as PCM. */
std::string makeUtterance() {
    const std::size_t length =
        std::size_t{WAVE_RATE_HZ} / 1000 * ProbeRequests::PIECES * ProbeRequests::PIECE_MS;
    Wave wave(length, 0.0);
    const std::size_t margin = length / 8;
    for (std::size_t i = margin; i < length - margin; ++i) {
        const double seconds = static_cast<double>(i) / WAVE_RATE_HZ;
        const double syllable = sineOfTurns(static_cast<double>(i - margin) * 4 /
                                            static_cast<double>(length - 2 * margin) / 2);
        double sum = 0;
        for (int harmonic = 1; harmonic <= HARMONICS; ++harmonic) {
            const double frequencyHz = harmonic * PITCH_HZ;
            sum += weigh(frequencyHz) * sineOfTurns(frequencyHz * seconds);
        }
        wave[i] = sum * std::fabs(syllable);
    }
    double peak = 1;
    for (const double value : wave) {
        peak = std::max(peak, std::fabs(value));
    }
    scale(wave, PEAK / peak);
    std::string bytes;
    bytes.reserve(2 * length);
    for (const int16_t sample : toSamples(wave)) {
        const auto bits = static_cast<uint16_t>(sample);
        bytes += static_cast<char>(bits & 0xFFU);
        bytes += static_cast<char>(bits >> 8U);
    }
    return bytes;
}

}  // namespace

ProbeRequests::ProbeRequests(std::string requestUuid, std::string requestLanguage)
    : uuid(std::move(requestUuid)), language(std::move(requestLanguage)) {}

std::string ProbeRequests::wholePath() const {
    return "/asrgw?uuid=" + uuid;
}

std::string ProbeRequests::streamedPath() const {
    return "/asrgw_chunked?uuid=" + uuid +
           "&action=verbose&Content-Type=" + soundType(WAVE_RATE_HZ);
}

std::string ProbeRequests::beginBody(int rateHz, bool hasSound) const {
    std::string text = field("uuid", uuid) + field("lang", language) + field("topic", "general") +
                       field("myll", "0.000000,0.000000") + field("centerll", "0.000000,0.000000");
    if (hasSound) {
        text += field("Content-Type", soundType(rateHz)) +
                makeBuilder()->startField("audio", false, false, soundType(rateHz));
    }
    return text;
}

ProbeRequest ProbeRequests::makeEmpty(bool isStreamed) const {
    ProbeRequest request;
    request.path = isStreamed ? streamedPath() : wholePath();
    request.paceMs = isStreamed ? 0 : -1;
    request.pieces.push_back(beginBody(WAVE_RATE_HZ, false) + endBody(false));
    return request;
}

ProbeRequest ProbeRequests::makeWhole() const {
    ProbeRequest request;
    request.path = wholePath();
    request.pieces.push_back(beginBody(WAVE_RATE_HZ, true) + makeUtterance() + endBody(true));
    return request;
}

ProbeRequest ProbeRequests::makeStreamed() const {
    ProbeRequest request;
    request.path = streamedPath();
    request.paceMs = PIECE_MS;
    const std::string sound = makeUtterance();
    const std::size_t bytes = sound.size() / PIECES;
    for (std::size_t i = 0; i < PIECES; ++i) {
        request.pieces.push_back(sound.substr(i * bytes, bytes));
    }
    request.pieces.front().insert(0, beginBody(WAVE_RATE_HZ, true));
    request.pieces.back() += endBody(true);
    return request;
}

ProbeRequest ProbeRequests::makeOfSize(std::size_t bytes) const {
    ProbeRequest request;
    request.path = wholePath();
    const std::string begin = beginBody(LARGE_RATE_HZ, true);
    const std::string end = endBody(true);
    const std::size_t room = bytes - begin.size() - end.size();
    request.pieces.push_back(begin + std::string(room / 2 * 2, '\0') + end);
    return request;
}

std::size_t ProbeRequests::getMaxSize() const {
    return beginBody(LARGE_RATE_HZ, true).size() + SOUND_MAX_BYTES + endBody(true).size();
}

}  // namespace Cli
