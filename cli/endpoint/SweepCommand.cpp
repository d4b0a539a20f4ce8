#include <charconv>
#include <filesystem>
#include <memory>
#include <system_error>

#include "EndpointCommand.h"
#include "Grid.h"
#include "SweepStore.h"
#include "SweepTable.h"
#include "VadText.h"
#include "cli/ExitStatus.h"
#include "cli/Progress.h"
#include "cli/Text.h"
#include "cli/UsageError.h"
#include "cli/report/EndpointReport.h"

namespace Cli {

namespace {

const double LOST_DFLT = 0.01;
const char* const STORE_NAME = ".talvox-sweep";

/** A share such as "1%" or "0.01"; none for an empty text. */
std::optional<double> parseShare(const std::string& option, const std::string& text) {
    if (text.empty()) {
        return std::nullopt;
    }
    const bool isPercent = text.back() == '%';
    const char* const end = text.data() + text.size() - (isPercent ? 1 : 0);
    double share = -1;
    const auto [behind, error] = std::from_chars(text.data(), end, share);
    share /= isPercent ? 100 : 1;
    if (error != std::errc() || behind != end || !(share >= 0 && share <= 1)) {
        throw UsageError(option + ": \"" + printable(text) + "\" is not a share, such as 1%");
    }
    return share;
}

Wanted wantedOf(const EndpointOptions& options) {
    Wanted wanted;
    wanted.lost = parseShare("--early", options.lost);
    wanted.falseBegin = parseShare("--false-begin", options.falseBegin);
    wanted.latencyMs = options.latencyMs;
    if (!wanted.lost && !wanted.latencyMs) {
        wanted.lost = LOST_DFLT;
    }
    return wanted;
}

std::vector<ScoredSound> scorePoints(const EndpointOptions& options,
                                     const std::vector<CorpusEntry>& entries, ScoreRun& run,
                                     Console& console) {
    const std::filesystem::path path = std::filesystem::path(options.folder) / STORE_NAME;
    if (options.startsOver) {
        std::error_code ignored;
        std::filesystem::remove(path, ignored);
    }
    SweepStore store(path.string(), run.setups);
    if (!store.isWritable()) {
        console.err << "talvox: warning: cannot write to " << printable(path.string())
                    << "; an interrupted sweep will start from the beginning" << std::endl;
    }
    std::vector<ScoredSound> sounds;
    {
        Progress progress(console.err, console.errIsTerminal);
        run.store = &store;
        run.onSound = [&progress](double share) { progress.show(share); };
        sounds = scoreCorpus(entries, run);
        run.store = nullptr;
    }
    if (store.loadedCount() > 0) {
        console.err << "talvox: " << store.loadedCount() << " of " << entries.size()
                    << " sounds were scored before" << std::endl;
    }
    return sounds;
}

}  // namespace

int runSweep(const EndpointOptions& options, Console& console) {
    const std::string base = options.vads.empty() ? "" : expandPreset(options.vads.front());
    const std::vector<GridAxis> axes = parseGrid(options.grid);
    std::vector<std::string> vads = gridPoints(axes);
    for (std::string& vad : vads) {
        vad = mergeVad(base, vad);
    }
    SweepResult result;
    result.wanted = wantedOf(options);
    const std::vector<CorpusEntry> entries = findSounds(options.folder, options.groups);
    ScoreRun run;
    run.setups = makeSetups(options, vads);
    run.threads = options.jobs;
    warnOfVadMistakes(run.setups, console.err);

    std::vector<ScoredSound> sounds = scorePoints(options, entries, run, console);
    const int faults = reportFaults(sounds, console.err);
    dropLongPauses(sounds, options.pauseMaxMs);
    result.points = makePoints(sounds, run.setups);
    result.advice = advise(sounds, result.points, result.wanted);
    if (options.json) {
        printSweepAsJson(result, console.out);
    } else if (options.csv) {
        printSweepAsCsv(result, console.out);
    } else {
        printSweep(result, console.out);
    }
    if (!options.report.empty()) {
        writeSweepReport(options.report, options.folder, axes, result);
    }
    return faults == 0 ? EXIT_OK : EXIT_USAGE;
}

}  // namespace Cli
