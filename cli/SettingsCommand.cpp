#include "SettingsCommand.h"

#include "ExitStatus.h"

namespace Cli {

int runSettings(const SettingsOptions& options, std::ostream& out, LogOutput& log) {
    log.show(true);
    const boost::shared_ptr<Talvox::Settings> settings = buildSettings(options);
    settings->validate();
    out << settings->toXmlString("settings");
    return EXIT_OK;
}

}  // namespace Cli
