#include "gateway/RecordedSpeech.h"

#include <fstream>
#include <iterator>
#include <stdexcept>

#include "support/ChildProcess.h"
#include "support/ScratchDirectory.h"

namespace GatewayTest {

namespace {

std::string readFile(const std::string& path) {
    std::ifstream file(path, std::ios::binary);
    std::string bytes((std::istreambuf_iterator<char>(file)), std::istreambuf_iterator<char>());
    if (bytes.empty()) {
        throw std::runtime_error("cannot read " + path);
    }
    return bytes;
}

}  // namespace

std::vector<int16_t> readRecording(const std::string& name) {
    return readSound("/usr/share/pocketsphinx/test/data/" + name);
}

std::vector<int16_t> readSound(const std::string& path) {
    const std::string bytes = readFile(path);
    const std::size_t data = bytes.compare(0, 4, "RIFF") == 0 ? bytes.find("data") + 8 : 0;
    std::vector<int16_t> samples;
    for (std::size_t i = data; i + 1 < bytes.size(); i += 2) {
        const unsigned low = static_cast<unsigned char>(bytes[i]);
        const unsigned high = static_cast<unsigned char>(bytes[i + 1]);
        samples.push_back(static_cast<int16_t>(static_cast<uint16_t>(low | (high << 8U))));
    }
    return samples;
}

std::string toPcm(const std::vector<int16_t>& samples) {
    std::string bytes;
    for (const int16_t sample : samples) {
        const auto value = static_cast<uint16_t>(sample);
        bytes += static_cast<char>(value & 0xffU);
        bytes += static_cast<char>(value >> 8U);
    }
    return bytes;
}

std::vector<int16_t> halveRate(const std::vector<int16_t>& samples) {
    std::vector<int16_t> halved;
    for (std::size_t i = 1; i + 1 < samples.size(); i += 2) {
        halved.push_back(
            static_cast<int16_t>((samples[i - 1] + 2 * samples[i] + samples[i + 1]) / 4));
    }
    return halved;
}

std::string encodeWithSpeexenc(const std::vector<int16_t>& samples, int rateHz,
                               const std::string& mode) {
    const TestSupport::ScratchDirectory directory;
    const std::string pcm = directory.path("sound.raw");
    const std::string speex = directory.path("sound.spx");
    std::ofstream(pcm, std::ios::binary) << toPcm(samples);
    const TestSupport::ChildProcess::Result result =
        TestSupport::ChildProcess::run({"speexenc", "--" + mode, "--quality", "8", "--rate",
                                        std::to_string(rateHz), "--le", "--16bit", pcm, speex});
    if (result.exitStatus != 0) {
        throw std::runtime_error("speexenc failed: " + result.output);
    }
    return readFile(speex);
}

}  // namespace GatewayTest
