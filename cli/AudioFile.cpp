#include "AudioFile.h"

#include <sys/stat.h>

#include <array>
#include <cerrno>
#include <cstring>
#include <fstream>
#include <optional>

#include "SoundDecoder.h"
#include "WavHead.h"

namespace Cli {

namespace {

// Less than a buffer of a session; the lengths of MPEG files are estimates.
const double TOLERATED_LOSS_S = 0.1;

void checkIsFile(const std::string& path) {
    struct stat status = {};
    if (stat(path.c_str(), &status) != 0) {
        refuseSound(path, std::strerror(errno));
    }
    if (S_ISDIR(status.st_mode)) {
        refuseSound(path, "it is a directory");
    }
    if (S_ISREG(status.st_mode) && status.st_size == 0) {
        refuseSound(path, "the file is empty");
    }
}

bool endsWith(const std::string& text, const std::string& tail) {
    return text.size() >= tail.size() &&
           text.compare(text.size() - tail.size(), tail.size(), tail) == 0;
}

bool isSpeex(const std::string& path) {
    std::array<char, 36> begin = {};
    std::ifstream(path, std::ios::binary).read(begin.data(), begin.size());
    return std::memcmp(begin.data(), "OggS", 4) == 0 &&
           std::memcmp(begin.data() + 28, "Speex   ", 8) == 0;
}

/** Why libsndfile refused a file, and what the user can do instead. */
std::string explainRefusal(const std::string& path, const OpenFailure& failure) {
    if (isSpeex(path)) {
        return "it is Ogg Speex; decode it first, as with speexdec FILE.spx FILE.wav";
    }
    if (failure.error != SF_ERR_UNRECOGNISED_FORMAT) {
        return failure.reason;
    }
    const bool isRaw = endsWith(path, ".raw") || endsWith(path, ".pcm");
    return std::string("it is not sound of a known format") +
           (isRaw ? "; pipe raw sound as with --file - --rate HZ < FILE" : "");
}

void warnOfLoss(const std::string& path, const SF_INFO& info, const AudioClip& clip) {
    const double promisedS = static_cast<double>(info.frames) / info.samplerate;
    if (info.frames < SF_COUNT_MAX && promisedS - clip.lengthS() > TOLERATED_LOSS_S) {
        warnOfCut(path, clip.lengthS(), promisedS);
    }
    std::ifstream file(path, std::ios::binary);
    if (const std::optional<WavHead> head = readWavHead(file)) {
        file.clear();
        file.seekg(0, std::ios::end);
        warnOfCutWav(path, *head, static_cast<std::uint64_t>(file.tellg()), clip);
    }
}

}  // namespace

AudioClip readAudioFile(const std::string& path) {
    checkIsFile(path);
    SF_INFO info = {};
    OpenFailure failure;
    const SoundFile file =
        openSound([&] { return sf_open(path.c_str(), SFM_READ, &info); }, failure);
    if (!file) {
        refuseSound(path, explainRefusal(path, failure));
    }
    const std::size_t maxSamples = samplesIn(MAX_CLIP_SECONDS, info.samplerate);
    AudioClip clip = decodeSound(file.get(), info, path, maxSamples);
    if (clip.samples.size() > maxSamples) {
        refuseSound(path, "it holds more than an hour of sound");
    }
    warnOfLoss(path, info, clip);
    return clip;
}

}  // namespace Cli
