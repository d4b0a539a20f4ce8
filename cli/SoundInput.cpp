#include "SoundInput.h"

#include "AudioFile.h"
#include "AudioStream.h"
#include "ClipSamples.h"
#include "UsageError.h"

namespace Cli {

namespace {

const int RATE_MIN_HZ = 8000;
const int RATE_MAX_HZ = 44100;

}  // namespace

const char* const STANDARD_INPUT = "-";

void checkSampleRate(int sampleRateHz) {
    if (sampleRateHz < RATE_MIN_HZ || sampleRateHz > RATE_MAX_HZ) {
        throw UsageError("the sample rate " + std::to_string(sampleRateHz) +
                         " is not in the range 8000 to 44100");
    }
}

std::vector<int16_t> loadSound(const std::string& path, std::istream& input, int sampleRateHz,
                               int maxSeconds) {
    checkSampleRate(sampleRateHz);
    if (path != STANDARD_INPUT) {
        return toSamples(readAudioFile(path), sampleRateHz);
    }
    return toSamples(readAudioStream(input, sampleRateHz, maxSeconds), sampleRateHz);
}

void addLeadIn(std::vector<int16_t>& samples, int sampleRateHz, int milliseconds) {
    const std::size_t count =
        static_cast<std::size_t>(sampleRateHz) * static_cast<std::size_t>(milliseconds) / 1000;
    samples.insert(samples.begin(), count, 0);
}

}  // namespace Cli
