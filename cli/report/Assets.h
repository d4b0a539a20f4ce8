#pragma once

namespace Cli {

/** Texts that a report is made of; the build embeds them from the files of these names. */
extern const char REPORT_CSS[];
extern const char REPORT_JS[];
extern const char RECORDING_JS[];
/** The plotting library Chart.js, from the system's package. */
extern const char CHART_JS[];

}  // namespace Cli
