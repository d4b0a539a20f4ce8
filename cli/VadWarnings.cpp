#include "VadWarnings.h"

#include "Text.h"
#include "talvox/VadParameters.h"

namespace Cli {

namespace {

const std::size_t NAME_COLUMNS = 15;
const std::size_t RANGE_COLUMNS = 17;
const std::size_t DEFAULT_COLUMNS = 14;

}  // namespace

void warnOfVadMistakes(const Talvox::Settings& settings, std::ostream& err) {
    for (const std::string& mistake : Talvox::VadParameters::findMistakes(
             settings.getString(Talvox::Settings::SKS_VAD_SETTINGS), settings.getSampleRate())) {
        err << "talvox: warning: vad: " << printable(mistake) << '\n';
    }
    err.flush();
}

std::string vadParameterTable() {
    std::string table;
    for (const Talvox::VadParameter& parameter : Talvox::VadParameters::all()) {
        table += "  " + padded(parameter.name, NAME_COLUMNS) +
                 padded(parameter.range, RANGE_COLUMNS) +
                 padded('[' + parameter.byDefault + ']', DEFAULT_COLUMNS) + ' ' +
                 parameter.meaning + '\n';
    }
    return table;
}

}  // namespace Cli
