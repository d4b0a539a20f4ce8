// Shows where the speech detector finds speech in a file of raw 16-bit mono sound at 16 kHz. Needs
// no gateway and no session. usage: detector SOUND.raw [PARAMETERS]
#include <talvox/VadAnalysis.h>
#include <talvox/VadParameters.h>

#include <algorithm>
#include <cstring>
#include <iostream>

#include "Session.h"

namespace {

const int SAMPLE_RATE_HZ = 16000;
const std::size_t SAMPLES_PER_BUFFER = SAMPLE_RATE_HZ / 10;

Sound::SoundDataBuffer makeBuffer(const int16_t* samples, std::size_t count) {
    std::vector<unsigned char> bytes(count * sizeof(int16_t));
    std::memcpy(bytes.data(), samples, bytes.size());
    const Sound::SoundDataInfo format(Sound::SoundDataInfo::NONE, 1, SAMPLE_RATE_HZ, 2,
                                      static_cast<int>(count));
    return {format, std::move(bytes)};
}

}  // namespace

int main(int argc, char** argv) {
    if (argc < 2) {
        std::cerr << "usage: detector SOUND.raw [PARAMETERS]" << std::endl;
        return 2;
    }
    const std::string parameters = argc > 2 ? argv[2] : "";
    for (const std::string& mistake :
         Talvox::VadParameters::findMistakes(parameters, SAMPLE_RATE_HZ)) {
        std::cerr << "warning: " << mistake << std::endl;
    }
    const std::vector<int16_t> samples = readSamples(argv[1]);
    Talvox::VadAnalyzer analyzer(parameters, SAMPLE_RATE_HZ);
    for (std::size_t begin = 0; begin + SAMPLES_PER_BUFFER <= samples.size();
         begin += SAMPLES_PER_BUFFER) {
        analyzer.analyze(makeBuffer(&samples[begin], SAMPLES_PER_BUFFER));
    }
    for (const Talvox::VadSegment& segment : analyzer.segments()) {
        std::cout << "speech from " << segment.startMs << " to " << segment.endMs << " ms"
                  << std::endl;
    }
    return 0;
}
