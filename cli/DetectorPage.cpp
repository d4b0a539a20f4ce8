#include "DetectorPage.h"

#include "Text.h"
#include "talvox/VadParameters.h"

namespace Cli {

namespace {

using Talvox::VadNoiseThresholds;
using Talvox::VadParameter;
using Talvox::VadParameters;

const char* const PAGE_BEGIN =
    "# The speech detector\n"
    "\n"
    "<!-- Written by ./dev pages from talvox/VadParameters.cpp. Do not edit. -->\n"
    "\n"
    "The detector finds where speech begins and ends in the sound of a session. The setting `vad`\n"
    "(`Settings::SKS_VAD_SETTINGS`, Java's `TalvoxSettings.VAD`) has its parameters. It counts on\n"
    "the engine.\n"
    "\n"
    "```\n"
    "activityon=0.6;analyzemsoff=1500;framems=20\n"
    "```\n"
    "\n"
    "`;` separates parameters, `=` the name from the value. Case, blanks and `_` in names do not\n"
    "count, so `Analyze_Ms On` is `analyzemson`; values are taken as written. If a name is given\n"
    "twice, the last value counts. Any text gives a detector: a parameter that is not known, or "
    "has\n"
    "a second `=`, is a line in the log and has no effect. An unknown `engine` also raises an\n"
    "assertion. `talvox vad --file FILE --vad TEXT` shows what a text does with a sound file, and\n"
    "warns of each mistake in it.\n"
    "\n"
    "## How it decides\n"
    "\n"
    "1. A frame detector (WebRTC's) decides whether each frame is speech. It learns the level of\n"
    "   the first 200 ms, which it takes for noise.\n"
    "2. Speech begins when more than `activityon` of the last `analyzemson` ms is speech.\n"
    "3. Speech ends when it has lasted for more than `minvoicetimems`, and less than "
    "`activityoff`\n"
    "   of the last `analyzemsoff` ms is speech.\n"
    "\n"
    "With `engine=wrtc` the last frame of each buffer decides alone.\n"
    "\n"
    "The frame detector works at 8000, 16000 and 32000 Hz. At any other rate it takes every frame\n"
    "for speech.\n"
    "\n"
    "## Parameters\n"
    "\n"
    "A number counts as far as it can be read; a text that begins with no number counts as 0. A "
    "time\n"
    "below 0 is longer than any session.\n"
    "\n";

const char* const NOISE_BEGIN =
    "\n"
    "## Thresholds by the noise\n"
    "\n"
    "If `individual`, `total`, `overhangmax1` and `overhangmax2` are all 0 or missing, the "
    "leading\n"
    "noise chooses them: the first row whose level it reaches counts. Below the last row they are\n"
    "those of `aggressiveness`. If one of the four is given, the missing ones are 0, and\n"
    "`aggressiveness` and the noise count for nothing.\n"
    "\n"
    "The level is in decibels above -45.3 dB of full scale, over all noise so far.\n"
    "\n"
    "| noise from | `individual` | `total` | `overhangmax1` | `overhangmax2` |\n"
    "|---|---|---|---|---|\n";

const char* typeText(VadParameter::Type type) {
    switch (type) {
        case VadParameter::NAME:
            return "name";
        case VadParameter::INTEGER:
            return "integer";
        case VadParameter::MILLISECONDS:
            return "integer, ms";
        case VadParameter::NUMBER:
            break;
    }
    return "number";
}

/** What values out of range lead to. */
std::string consequencesOf(const VadParameter& parameter) {
    if (parameter.type == VadParameter::NAME) {
        return "the default is used";
    }
    if (parameter.below == parameter.above) {
        return parameter.below;
    }
    std::string text = parameter.below.empty() ? "" : "below: " + parameter.below;
    if (!parameter.above.empty()) {
        text += (text.empty() ? "above: " : "; above: ") + parameter.above;
    }
    return text;
}

std::string rowOf(const VadParameter& parameter) {
    return "| `" + parameter.name + "` | " + typeText(parameter.type) + " | " + parameter.range +
           " | " + parameter.byDefault + " | " + parameter.meaning + " | " +
           (parameter.isOfBufferedOnly ? "buffered" : "both") + " | " + consequencesOf(parameter) +
           " |\n";
}

std::string rowOf(const VadNoiseThresholds& row) {
    return "| " + fixed(row.noiseLevelDb, 0, 0) + " dB | " + std::to_string(row.individual) +
           " | " + std::to_string(row.total) + " | " + std::to_string(row.overhangMax1) + " | " +
           std::to_string(row.overhangMax2) + " |\n";
}

}  // namespace

std::string detectorPage() {
    std::string page = PAGE_BEGIN;
    page +=
        "| name | type | values | default | meaning | engine | other values |\n"
        "|---|---|---|---|---|---|---|\n";
    for (const VadParameter& parameter : VadParameters::all()) {
        page += rowOf(parameter);
    }
    page += NOISE_BEGIN;
    for (const VadNoiseThresholds& row : VadParameters::byNoise()) {
        page += rowOf(row);
    }
    return page;
}

}  // namespace Cli
