#include "Speaker.h"

#include <fcntl.h>
#include <spawn.h>
#include <sys/wait.h>
#include <unistd.h>

#include <algorithm>
#include <array>
#include <cerrno>
#include <cstring>
#include <filesystem>
#include <system_error>

#include "Waves.h"
#include "cli/ClipSamples.h"
#include "cli/UsageError.h"

extern char** environ;

namespace Cli {

namespace {

const std::size_t FRAME_SAMPLES = WAVE_RATE_HZ / 100;
// 40 dB.
const int64_t SPEECH_ENERGY_SHARE = 10000;

int64_t frameEnergy(const std::vector<int16_t>& samples, std::size_t frame) {
    int64_t energy = 0;
    for (std::size_t index = frame * FRAME_SAMPLES; index < (frame + 1) * FRAME_SAMPLES; ++index) {
        energy += int64_t{samples[index]} * samples[index];
    }
    return energy;
}

/** Runs flite to its end. @return its exit status; 127 if there is no flite */
int runFlite(const std::string& voice, const std::string& text, const std::string& file) {
    std::array<std::string, 7> words = {"flite", "-voice", voice, "-t", text, "-o", file};
    std::array<char*, words.size() + 1> argv = {};
    std::transform(words.begin(), words.end(), argv.begin(),
                   [](std::string& word) { return word.data(); });
    posix_spawn_file_actions_t actions;
    posix_spawn_file_actions_init(&actions);
    posix_spawn_file_actions_addopen(&actions, STDOUT_FILENO, "/dev/null", O_WRONLY, 0);
    posix_spawn_file_actions_addopen(&actions, STDERR_FILENO, "/dev/null", O_WRONLY, 0);
    pid_t pid = -1;
    const int error = posix_spawnp(&pid, "flite", &actions, nullptr, argv.data(), environ);
    posix_spawn_file_actions_destroy(&actions);
    if (error != 0) {
        return 127;
    }
    int status = 0;
    while (waitpid(pid, &status, 0) < 0 && errno == EINTR) {
    }
    return WIFEXITED(status) ? WEXITSTATUS(status) : 128;
}

}  // namespace

std::vector<int16_t> trimSpeech(const std::vector<int16_t>& samples) {
    const std::size_t frames = samples.size() / FRAME_SAMPLES;
    std::vector<int64_t> energies(frames);
    for (std::size_t frame = 0; frame < frames; ++frame) {
        energies[frame] = frameEnergy(samples, frame);
    }
    const int64_t loudest =
        frames > 0 ? *std::max_element(energies.begin(), energies.end()) : int64_t{0};
    std::size_t first = frames;
    std::size_t behind = 0;
    for (std::size_t frame = 0; frame < frames; ++frame) {
        if (energies[frame] > 0 && energies[frame] >= loudest / SPEECH_ENERGY_SHARE) {
            first = std::min(first, frame);
            behind = frame + 1;
        }
    }
    if (first >= behind) {
        return {};
    }
    return {samples.begin() + static_cast<std::ptrdiff_t>(first * FRAME_SAMPLES),
            samples.begin() + static_cast<std::ptrdiff_t>(behind * FRAME_SAMPLES)};
}

Speaker::Speaker() : folder_("") {
    std::string pattern =
        (std::filesystem::temp_directory_path() / "talvox-corpus-XXXXXX").string();
    if (mkdtemp(pattern.data()) == nullptr) {
        throw UsageError("cannot make " + pattern + ": " + std::strerror(errno));
    }
    folder_ = pattern;
}

Speaker::~Speaker() {
    std::error_code ignored;
    std::filesystem::remove_all(folder_, ignored);
}

const std::vector<std::string>& Speaker::voices() {
    static const std::vector<std::string> names = {"kal16", "slt", "rms", "awb"};
    return names;
}

const std::vector<int16_t>& Speaker::speak(const std::string& voice, const std::string& text) {
    std::vector<int16_t>& samples = spoken_[{voice, text}];
    if (!samples.empty()) {
        return samples;
    }
    const std::string file = folder_ + "/spoken.wav";
    const int status = runFlite(voice, text, file);
    if (status != 0) {
        throw UsageError(status == 127
                             ? "cannot run flite, which speaks the corpus; install the package "
                               "flite"
                             : "flite could not speak \"" + text + "\" with the voice " + voice);
    }
    samples = trimSpeech(toSamples(readAudioFile(file), WAVE_RATE_HZ));
    if (samples.empty()) {
        throw UsageError("flite spoke no sound for \"" + text + "\" with the voice " + voice);
    }
    for (const int16_t sample : samples) {
        checksum_ = (checksum_ ^ static_cast<uint16_t>(sample)) * 1099511628211U;
    }
    return samples;
}

}  // namespace Cli
