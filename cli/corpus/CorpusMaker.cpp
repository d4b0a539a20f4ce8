#include "CorpusMaker.h"

#include <algorithm>
#include <cerrno>
#include <cstring>
#include <filesystem>
#include <fstream>
#include <system_error>

#include "Noise.h"
#include "Utterance.h"
#include "cli/UsageError.h"
#include "core/sound/SoundDataInfo.h"
#include "util/WavOutputStream.h"

namespace Cli {

namespace {

const char* const BABBLE = "babble";
const int ALONE_RMS[] = {30, 300};
const std::size_t BABBLE_SECONDS = 60;

/** 10 to the power of -ratio / 20. */
double noiseShare(int ratioDb) {
    switch (ratioDb) {
        case 30:
            return 0.03162277660168379;
        case 20:
            return 0.1;
        case 10:
            return 0.31622776601683794;
        case 5:
            return 0.5623413251903491;
        default:
            return 1;
    }
}

std::string twoDigits(int number) {
    return (number < 10 ? "0" : "") + std::to_string(number);
}

/** The root mean square over the speech, pauses left out. */
double speechRms(const Utterance& utterance) {
    Wave spoken;
    for (const Label& label : utterance.speech) {
        const auto toIndex = [](int64_t ms) { return ms * (WAVE_RATE_HZ / 1000); };
        spoken.insert(spoken.end(), utterance.wave.begin() + toIndex(label.startMs),
                      utterance.wave.begin() + toIndex(label.endMs));
    }
    return rms(spoken);
}

/** Writes the files of one corpus. */
class CorpusWriter {
  public:
    CorpusWriter(std::string folder, const CorpusPlan& plan,
                 const std::function<void(double)>& onFile)
        : folder_(std::move(folder)), plan_(plan), onFile_(onFile) {
        const std::size_t conditions = 1 + plan.noises.size() * plan.ratiosDb.size();
        filesInAll_ = conditions * static_cast<std::size_t>(plan.utterances) +
                      (plan.noiseAloneS > 0 ? plan.noises.size() * 4 : 0);
    }

    CorpusSummary run() {
        const auto& noises = plan_.noises;
        if (std::find(noises.begin(), noises.end(), BABBLE) != noises.end()) {
            babble_ = makeBabble(BABBLE_SECONDS * WAVE_RATE_HZ,
                                 Dice(Dice::derive(plan_.seed, BABBLE)), speaker_);
        }
        for (int number = 0; number < plan_.utterances; ++number) {
            writeUtterances(number);
        }
        if (plan_.noiseAloneS > 0) {
            writeNoises();
        }
        summary_.speechChecksum = speaker_.checksum();
        return summary_;
    }

  private:
    void writeUtterances(int number) {
        const Utterance utterance = makeUtterance(plan_.seed, number, plan_.tailMs, speaker_);
        const int rateHz = number % 2 == 0 ? WAVE_RATE_HZ : WAVE_RATE_HZ / 2;
        std::string name = "u" + twoDigits(number);
        name += '-' + utterance.voice;
        name += "-peak" + std::to_string(utterance.peak);
        name += '-' + std::to_string(rateHz / 1000) + 'k';
        write("clean", name, utterance.wave, utterance.speech, rateHz);
        const double loudness = speechRms(utterance);
        for (const std::string& noise : plan_.noises) {
            std::string purpose = noise;
            purpose += ' ' + std::to_string(number);
            const Wave background = noiseOf(noise, utterance.wave.size(), purpose);
            for (const int ratioDb : plan_.ratiosDb) {
                const double gain = loudness * noiseShare(ratioDb) / rms(background);
                Wave mixed = utterance.wave;
                for (std::size_t index = 0; index < mixed.size(); ++index) {
                    mixed[index] += gain * background[index];
                }
                write(noise + '-' + twoDigits(ratioDb), name, mixed, utterance.speech, rateHz);
            }
        }
    }

    void writeNoises() {
        const auto samples = static_cast<std::size_t>(plan_.noiseAloneS) * WAVE_RATE_HZ;
        for (const std::string& noise : plan_.noises) {
            for (const int loudness : ALONE_RMS) {
                const std::string name = "rms" + std::to_string(loudness);
                std::string purpose = noise;
                purpose += " alone ";
                purpose += name;
                Wave background = noiseOf(noise, samples, purpose);
                scale(background, loudness / rms(background));
                for (const int rateHz : {WAVE_RATE_HZ, WAVE_RATE_HZ / 2}) {
                    write("alone-" + noise, name + '-' + std::to_string(rateHz / 1000) + "k",
                          background, {}, rateHz);
                }
            }
        }
    }

    Wave noiseOf(const std::string& kind, std::size_t samples, const std::string& purpose) const {
        Dice dice(Dice::derive(plan_.seed, purpose));
        if (kind != BABBLE) {
            return makeNoise(kind, samples, dice);
        }
        Wave wave(samples);
        const std::size_t begin = dice.below(babble_.size());
        for (std::size_t index = 0; index < samples; ++index) {
            wave[index] = babble_[(begin + index) % babble_.size()];
        }
        return wave;
    }

    void write(const std::string& group, const std::string& name, const Wave& wave,
               const std::vector<Label>& speech, int rateHz) {
        const std::filesystem::path directory = std::filesystem::path(folder_) / group;
        std::error_code error;
        std::filesystem::create_directories(directory, error);
        if (error) {
            throw UsageError("cannot make " + directory.string() + ": " + error.message());
        }
        const std::string base = (directory / name).string();
        writeWav(base + ".wav", toSamples(rateHz == WAVE_RATE_HZ ? wave : halveRate(wave)), rateHz);
        const auto soundMs = static_cast<int64_t>(wave.size()) * 1000 / WAVE_RATE_HZ;
        std::ofstream labels(base + ".txt", std::ios::binary);
        labels << labelText(speech, soundMs);
        if (!labels.flush()) {
            throw UsageError("cannot write to " + base + ".txt: " + std::strerror(errno));
        }
        ++summary_.files;
        summary_.soundMs += soundMs;
        onFile_(summary_.files / static_cast<double>(filesInAll_));
    }

    static void writeWav(const std::string& path, const std::vector<int16_t>& samples, int rateHz) {
        std::vector<unsigned char> bytes;
        bytes.reserve(samples.size() * 2);
        for (const int16_t sample : samples) {
            const auto value = static_cast<uint16_t>(sample);
            bytes.push_back(static_cast<unsigned char>(value & 0xFFU));
            bytes.push_back(static_cast<unsigned char>(value >> 8U));
        }
        const auto size = static_cast<int>(bytes.size());
        Util::WavOutputStream file;
        const Sound::SoundDataInfo format(Sound::SoundDataInfo::NONE, 1, rateHz, 2);
        if (!file.init(path, format) || file.write(bytes.data(), size) != size) {
            throw UsageError("cannot write to " + path);
        }
    }

    const std::string folder_;
    const CorpusPlan& plan_;
    const std::function<void(double)>& onFile_;
    std::size_t filesInAll_ = 0;
    Speaker speaker_;
    Wave babble_;
    CorpusSummary summary_;
};

}  // namespace

const std::vector<std::string>& corpusNoises() {
    static const std::vector<std::string> names = CorpusPlan().noises;
    return names;
}

const std::vector<int>& corpusRatiosDb() {
    static const std::vector<int> ratios = CorpusPlan().ratiosDb;
    return ratios;
}

CorpusSummary makeCorpus(const std::string& folder, const CorpusPlan& plan,
                         const std::function<void(double)>& onFile) {
    return CorpusWriter(folder, plan, onFile).run();
}

}  // namespace Cli
