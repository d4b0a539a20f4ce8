#include <algorithm>

#include "EndpointCommand.h"
#include "ScoreTable.h"
#include "VadText.h"
#include "cli/ExitStatus.h"
#include "cli/Progress.h"
#include "cli/report/EndpointReport.h"

namespace Cli {

int runScore(const EndpointOptions& options, Console& console) {
    std::vector<std::string> vads;
    std::transform(options.vads.begin(), options.vads.end(), std::back_inserter(vads),
                   expandPreset);
    if (vads.empty()) {
        vads.emplace_back();
    }
    const std::vector<CorpusEntry> entries = findSounds(options.folder, options.groups);
    ScoreRun run;
    run.setups = makeSetups(options, vads);
    run.threads = options.jobs;
    warnOfVadMistakes(run.setups, console.err);
    std::vector<ScoredSound> sounds;
    {
        Progress progress(console.err, console.errIsTerminal);
        run.onSound = [&progress](double share) { progress.show(share); };
        sounds = scoreCorpus(entries, run);
    }
    const int faults = reportFaults(sounds, console.err);
    dropLongPauses(sounds, options.pauseMaxMs);
    const std::vector<ScoreRow> rows = makeRows(sounds, run.setups);
    if (options.json) {
        printRowsAsJson(rows, console.out);
    } else if (options.csv) {
        printRowsAsCsv(rows, console.out);
    } else {
        printRows(rows, console.out);
    }
    if (!options.report.empty()) {
        writeScoreReport(options.report, options.folder, rows);
    }
    return faults == 0 ? EXIT_OK : EXIT_USAGE;
}

}  // namespace Cli
