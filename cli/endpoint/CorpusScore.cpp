#include "CorpusScore.h"

#include <algorithm>
#include <atomic>

#include "SweepStore.h"
#include "WorkPool.h"
#include "cli/Text.h"
#include "cli/UsageError.h"

namespace Cli {

namespace {

// What a session takes in; labels behind it can never be met.
const int64_t SESSION_MS = 20000;
const int64_t TAIL_WANTED_MS = 2000;

void describe(const CorpusSound& sound, ScoredSound& scored) {
    scored.soundMs = sound.lengthMs();
    scored.hasSpeech = !sound.speech.empty();
    for (std::size_t index = 1; index < sound.speech.size(); ++index) {
        scored.longestPauseMs = std::max(
            scored.longestPauseMs, sound.speech[index].startMs - sound.speech[index - 1].endMs);
    }
    if (scored.hasSpeech) {
        scored.tailMs = scored.soundMs - sound.speech.back().endMs;
    }
}

void score(ScoredSound& scored, const ScoreRun& run, const std::function<void()>& onSetup) {
    const CorpusSound sound = readLabelledSound(scored.entry);
    describe(sound, scored);
    if (scored.hasSpeech && sound.speech.back().endMs > SESSION_MS) {
        throw LabelError(scored.entry.labelPath + ": the last label ends at " +
                         fixed(static_cast<double>(sound.speech.back().endMs) / 1000, 0, 3) +
                         " s, but a session takes 20 s of sound; cut the sound");
    }
    const uint64_t fingerprint = run.store != nullptr ? run.store->fingerprint(sound) : 0;
    if (run.store != nullptr && run.store->load(scored.entry.name, fingerprint, scored.bySetup)) {
        return;
    }
    for (const DetectorSetup& setup : run.setups) {
        scored.bySetup.push_back(scoreSound(setup, sound));
        onSetup();
    }
    if (run.store != nullptr) {
        run.store->save(scored.entry.name, fingerprint, scored.bySetup);
    }
}

}  // namespace

std::vector<ScoredSound> scoreCorpus(const std::vector<CorpusEntry>& entries, const ScoreRun& run) {
    std::vector<ScoredSound> sounds(entries.size());
    std::atomic<std::size_t> done{0};
    const auto total = static_cast<double>(entries.size() * run.setups.size());
    runParallel(entries.size(), run.threads, [&](std::size_t index) {
        ScoredSound& scored = sounds[index];
        scored.entry = entries[index];
        std::size_t counted = 0;
        const auto count = [&](std::size_t setups) {
            counted += setups;
            run.onSound(static_cast<double>(done += setups) / total);
        };
        try {
            score(scored, run, [&] { count(1); });
        } catch (const UsageError& error) {
            scored.fault = error.what();
        } catch (const LabelError& error) {
            scored.fault = error.what();
        }
        count(run.setups.size() - counted);
    });
    return sounds;
}

void dropLongPauses(std::vector<ScoredSound>& sounds, int64_t pauseMaxMs) {
    sounds.erase(std::remove_if(sounds.begin(), sounds.end(),
                                [pauseMaxMs](const ScoredSound& sound) {
                                    return sound.longestPauseMs > pauseMaxMs;
                                }),
                 sounds.end());
}

int reportFaults(const std::vector<ScoredSound>& sounds, std::ostream& err) {
    int faults = 0;
    int shortTails = 0;
    for (const ScoredSound& sound : sounds) {
        if (!sound.fault.empty()) {
            err << "talvox: " << printable(sound.fault) << '\n';
            ++faults;
        } else if (sound.hasSpeech && sound.tailMs < TAIL_WANTED_MS) {
            ++shortTails;
        }
    }
    if (shortTails > 0) {
        err << "talvox: warning: " << shortTails << (shortTails == 1 ? " sound goes" : " sounds go")
            << " on for less than 2 s behind the last label; later ends count as never\n";
    }
    err.flush();
    return faults;
}

}  // namespace Cli
