#pragma once

#include <cstdint>
#include <functional>
#include <string>
#include <vector>

namespace Cli {

/** What a generated corpus is made of. */
struct CorpusPlan {
    uint64_t seed = 1;
    int utterances = 36; /**< in clean sound, and in each noise at each ratio */
    std::vector<std::string> noises = {"white", "pink", "wind", "hum", "clicks", "tones", "babble"};
    std::vector<int> ratiosDb = {30, 20, 10, 5, 0}; /**< of speech to noise */
    int tailMs = 3000;                              /**< sound behind the last word */
    int noiseAloneS = 60;                           /**< length of the files of noise; 0 for none */
};

/** The kinds that `CorpusPlan::noises` may name. */
const std::vector<std::string>& corpusNoises();

/** The ratios of speech to noise that `CorpusPlan::ratiosDb` may name. */
const std::vector<int>& corpusRatiosDb();

/** What was written. */
struct CorpusSummary {
    int files = 0;
    int64_t soundMs = 0;
    uint64_t speechChecksum = 0; /**< of what flite spoke */
};

/**
 * Writes a corpus below a folder: `clean`, `white-10` (noise and ratio) and so on, with a sound
 * and its label file for each utterance, and `alone-white` with noise alone. Sounds are 16-bit mono
 * WAV files, at 8 and 16 kHz by turns. Utterance k is the same, apart from its noise, in each of
 * the folders. The plan determines every byte, given the same flite. Existing files of the same
 * name are replaced.
 * @param onFile called after each file with the share that is done, 0 to 1
 * @throws UsageError if flite fails or a file cannot be written
 */
CorpusSummary makeCorpus(const std::string& folder, const CorpusPlan& plan,
                         const std::function<void(double)>& onFile);

}  // namespace Cli
