#pragma once

#include <cstdint>
#include <string>
#include <vector>

#include "Labels.h"

namespace Cli {

/** A sound of a corpus: a file below the corpus's folder, with its labels in a file beside it. */
struct CorpusEntry {
    std::string path;
    std::string labelPath; /**< the sound's with the extension .txt; need not exist */
    std::string name;      /**< the path from the corpus's folder on */
    std::string group;     /**< the folder part of the name; "." for none */
};

/** What a sound of a corpus holds. */
struct CorpusSound {
    std::vector<int16_t> samples;
    int rateHz = 0;
    std::vector<Label> speech;

    int64_t lengthMs() const { return static_cast<int64_t>(samples.size()) * 1000 / rateHz; }
};

/**
 * The sounds below a folder, by the bytes of their names: everything with one of the extensions
 * wav, flac, ogg, aiff, aif, au, caf and mp3 in any case.
 * @param groups only the sounds of these groups; "*" at the end of one stands for any text; empty
 *               for all
 * @throws UsageError if the folder cannot be read or holds no such sound
 */
std::vector<CorpusEntry> findSounds(const std::string& folder,
                                    const std::vector<std::string>& groups = {});

/**
 * The sound of an entry without its labels. At 8, 16 and 32 kHz it has its own rate, otherwise it
 * is converted to 16 kHz: the detector knows no other rates.
 * @throws UsageError
 */
CorpusSound readSound(const CorpusEntry& entry);

/** As `readSound`, with its labels. @throws UsageError @throws LabelError */
CorpusSound readLabelledSound(const CorpusEntry& entry);

}  // namespace Cli
