#include "VadCommand.h"

#include "ExitStatus.h"
#include "SoundInput.h"
namespace Cli {
int runVad(const VadOptions& options, Console& console, LogOutput& log) {
    log.show(true);
    const boost::shared_ptr<Talvox::Settings> settings = buildSettings(options.settings);
    loadSound(options.file, console.in, settings->getSampleRate(), 3600);
    return EXIT_OK;
}
}  // namespace Cli
