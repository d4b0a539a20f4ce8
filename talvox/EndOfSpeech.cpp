#include "talvox/EndOfSpeech.h"

namespace Talvox {

const char* const EndOfSpeech::COMMAND =
    "individual=45;total=300;overhangmax1=1;overhangmax2=6;"
    "analyzems=850;activityoff=.1;analyzemson=300;activityon=.4";
const char* const EndOfSpeech::DICTATION =
    "individual=45;total=300;overhangmax1=1;overhangmax2=6;"
    "analyzems=1250;activityoff=.1;analyzemson=300;activityon=.4";
const char* const EndOfSpeech::NOISY =
    "individual=45;total=300;overhangmax1=1;overhangmax2=6;"
    "analyzems=1250;activityoff=.1;analyzemson=300;activityon=.7";

const std::array<EndOfSpeech, 3>& EndOfSpeech::all() {
    static const std::array<EndOfSpeech, 3> presets = {{
        {"command", COMMAND, "short commands; a quick end"},
        {"dictation", DICTATION, "sentences with pauses; a late end"},
        {"noisy", NOISY, "places with clicks, hum or wind; noise seldom begins speech"},
    }};
    return presets;
}

}  // namespace Talvox
