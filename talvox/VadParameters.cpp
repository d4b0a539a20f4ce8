#include "talvox/VadParameters.h"

#include <cfloat>
#include <cmath>

#include "talvox/impl/BufferedVAD.h"
#include "talvox/impl/ListeningRules.h"
#include "talvox/impl/VadNames.h"
#include "talvox/impl/VadNumber.h"
#include "talvox/impl/VadParameterText.h"
#include "talvox/impl/VoiceActivityDetectorWebRTC.h"
#include "util/impl/NumberText.h"

namespace Talvox {

namespace {

using namespace VadNames;
using Detector = VoiceActivityDetectorWebRTC;

const char* const MODE_PARAMETERS[] = {INDIVIDUAL, TOTAL, OVERHANG_MAX_1, OVERHANG_MAX_2};

constexpr char NEVER_BEGINS[] = "speech never begins";
constexpr char NEVER_ENDS[] = "speech never ends";
constexpr char ENDS_AT_ONCE[] = "speech ends as soon as minvoicetimems has passed";
constexpr char IS_OFF[] = "detection is off";
constexpr char ZERO_IS_USED[] = "0 is used";

constexpr double SESSION_MS = 20000;
constexpr double INT16_HIGHEST = 32767;
constexpr int RATES_HZ[] = {8000, 16000, 32000};

/** Buffers between the leading noise and the end of the time in which speech has to begin. */
constexpr unsigned BUFFERS_BEFORE_NO_VOICE = 48;

std::string toText(float number) {
    return Util::NumberText::writeFloat(number);
}

VadParameter makeName(const char* name, bool isOfBufferedOnly, const char* range,
                      const char* byDefault, const char* meaning) {
    return {name, VadParameter::NAME, isOfBufferedOnly, 0, 0, 0, range, byDefault, meaning, "", ""};
}

VadParameter makeModeParameter(const char* name, const char* meaning) {
    return {name, VadParameter::INTEGER, false,          0,       INT16_HIGHEST,
            1,    "0 to 32767",          "by the noise", meaning, "",
            ""};
}

VadParameter makeTime(const char* name, double lowest, const char* range, unsigned byDefault,
                      const char* meaning, const char* below, const char* above) {
    return {name,  VadParameter::MILLISECONDS, true,    lowest, SESSION_MS, 1,
            range, std::to_string(byDefault),  meaning, below,  above};
}

VadParameter makeShare(const char* name, float lowest, float highest, const char* range,
                       float byDefault, const char* meaning, const char* below, const char* above) {
    return {name,
            VadParameter::NUMBER,
            true,
            static_cast<double>(lowest),
            static_cast<double>(highest),
            0,
            range,
            toText(byDefault),
            meaning,
            below,
            above};
}

std::vector<VadParameter> makeAll() {
    return {
        makeName(ENGINE, false, "buffered or wrtc", BUFFERED,
                 "whether the decisions on frames are smoothed or taken as they are"),
        makeName(SUBENGINE, true, WEBRTC, WEBRTC, "what decides on a frame"),
        makeTime(ANALYZE_MS_ON, Detector::FRAME_MS_DFLT, "10 to 20000",
                 BufferedVAD::ANALYZE_MS_ON_DFLT,
                 "latest ms of sound that decide on the begin of speech", NEVER_BEGINS,
                 "a session has no more than 20 s of sound"),
        makeShare(ACTIVITY_ON, 0, std::nextafter(1.0F, 0.0F), "0 to less than 1",
                  BufferedVAD::ACTIVITY_ON_DFLT,
                  "speech begins when more than this share of analyzemson is speech",
                  "speech begins with the first buffer", NEVER_BEGINS),
        makeTime(ANALYZE_MS_OFF, Detector::FRAME_MS_DFLT, "10 to 20000",
                 BufferedVAD::ANALYZE_MS_OFF_DFLT, "latest ms of sound that decide on its end",
                 NEVER_ENDS, ENDS_AT_ONCE),
        makeTime(ANALYZE_MS, Detector::FRAME_MS_DFLT, "10 to 20000",
                 BufferedVAD::ANALYZE_MS_OFF_DFLT, "another name of analyzemsoff", NEVER_ENDS,
                 ENDS_AT_ONCE),
        makeShare(ACTIVITY_OFF, FLT_MIN, 1, "more than 0 to 1", BufferedVAD::ACTIVITY_OFF_DFLT,
                  "speech ends when less than this share of analyzemsoff is speech", NEVER_ENDS,
                  ENDS_AT_ONCE),
        makeTime(MIN_VOICE_TIME_MS, 0, "0 to 20000", BufferedVAD::MIN_VOICE_TIME_MS_DFLT,
                 "ms for which speech lasts at least", "", NEVER_ENDS),
        {FRAME_MS, VadParameter::INTEGER, false, 10, 30, 10, "10, 20 or 30",
         std::to_string(Detector::FRAME_MS_DFLT), "length of a frame in ms", IS_OFF, IS_OFF},
        {AGGRESSIVENESS, VadParameter::INTEGER, false, 0, 3, 1, "0 to 3",
         std::to_string(Detector::AGGRESSIVENESS_DFLT), "how readily a frame counts as noise",
         ZERO_IS_USED, ZERO_IS_USED},
        makeModeParameter(INDIVIDUAL, "threshold of a frame's single features"),
        makeModeParameter(TOTAL, "threshold of all features together"),
        makeModeParameter(OVERHANG_MAX_1,
                          "frames that count as speech behind a short stretch of it"),
        makeModeParameter(OVERHANG_MAX_2,
                          "frames that count as speech behind a long stretch of it"),
        {VERBOSE_LOG, VadParameter::INTEGER, true, 0, 2, 1, "0 to 2", "0",
         "logs each decision (1) and the frames as well (2)", "nothing is logged",
         "no more is logged than with 2"},
    };
}

const VadParameter* find(const std::string& name) {
    for (const VadParameter& parameter : VadParameters::all()) {
        if (parameter.name == name) {
            return &parameter;
        }
    }
    return nullptr;
}

/** Finds the mistakes of one text. */
class Examination {
  public:
    Examination(const std::string& parameters, int sampleRateHz)
        : text(parameters), sampleRate(sampleRateHz) {}

    std::vector<std::string> run() {
        checkSettings();
        for (const auto& [name, value] : text.values) {
            checkValue(name, value);
        }
        checkModeParameters();
        if (!isBare()) {
            checkSpans();
        }
        checkRate();
        return mistakes;
    }

  private:
    bool isBare() const { return text.valueOf(ENGINE) == WEBRTC; }

    void checkSettings() {
        for (const std::string& setting : text.badSettings) {
            mistakes.push_back(setting + " has more than one \"=\" and is ignored");
        }
        for (const std::string& name : text.repeatedNames) {
            mistakes.push_back(name + " is given more than once; the last value counts");
        }
    }

    void checkValue(const std::string& name, const std::string& value) {
        const VadParameter* const parameter = find(name);
        if (parameter == nullptr) {
            mistakes.push_back("there is no parameter \"" + name + "\"");
        } else if (parameter->isOfBufferedOnly && isBare()) {
            mistakes.push_back(name + " has no effect with engine=wrtc");
        } else if (parameter->type == VadParameter::NAME) {
            checkName(*parameter, value);
        } else {
            checkNumber(*parameter, value);
        }
    }

    void checkName(const VadParameter& parameter, const std::string& value) {
        const bool isKnown = parameter.name == ENGINE ? value == BUFFERED || value == WEBRTC
                                                      : value.empty() || value == WEBRTC;
        if (!isKnown) {
            mistakes.push_back(parameter.name + '=' + value + " is unknown; " +
                               parameter.byDefault + " is used");
        }
    }

    void checkNumber(const VadParameter& parameter, const std::string& value) {
        const bool isInteger = parameter.type != VadParameter::NUMBER;
        const VadNumber<int> integer = readIntParameter(value);
        const VadNumber<float> number = readFloatParameter(value);
        const std::string setting = parameter.name + '=' + value;
        if (!(isInteger ? integer.isNumber : number.isNumber) || std::isnan(number.value)) {
            const bool isNan = !isInteger && std::isnan(number.value);
            mistakes.push_back(setting + " is not a number and " +
                               (isNan ? "is never reached" : "counts as 0"));
            return;
        }
        if (!(isInteger ? integer.isWholeText : number.isWholeText)) {
            mistakes.push_back(setting + " counts as " +
                               (isInteger ? std::to_string(integer.value) : toText(number.value)) +
                               ": the rest is not part of the number");
        }
        checkRange(
            parameter, setting,
            isInteger ? static_cast<double>(integer.value) : static_cast<double>(number.value));
    }

    void checkRange(const VadParameter& parameter, const std::string& setting, double value) {
        const bool isAbove = value > parameter.highest ||
                             (parameter.type == VadParameter::MILLISECONDS && value < 0);
        const bool isBetween =
            parameter.step > 0 && std::fmod(value - parameter.lowest, parameter.step) != 0.0;
        if (!isAbove && !isBetween && value >= parameter.lowest) {
            return;
        }
        const std::string& effect = isAbove ? parameter.above : parameter.below;
        mistakes.push_back(setting + " is out of range (" + parameter.range + ')' +
                           (effect.empty() ? "" : ": " + effect));
    }

    void checkModeParameters() {
        std::string given;
        std::string missing;
        bool isSet = false;
        for (const char* name : MODE_PARAMETERS) {
            std::string& list = text.has(name) ? given : missing;
            list += (list.empty() ? "" : ", ") + std::string(name);
            isSet = isSet || parseIntParameter(text.valueOf(name)) != 0;
        }
        if (given.empty()) {
            return;
        }
        if (!isSet) {
            mistakes.push_back(given + ": thresholds that are all 0 count as not given");
            return;
        }
        if (!missing.empty()) {
            mistakes.push_back(given + " without " + missing + ": those are 0 then");
        }
        if (text.has(AGGRESSIVENESS)) {
            mistakes.push_back(std::string(AGGRESSIVENESS) + " has no effect beside " + given);
        }
    }

    void checkSpans() {
        if (text.has(ANALYZE_MS_OFF) && text.has(ANALYZE_MS)) {
            mistakes.push_back(std::string(ANALYZE_MS) + " has no effect beside " + ANALYZE_MS_OFF);
        }
        const int frameMs = intOf(FRAME_MS, Detector::FRAME_MS_DFLT);
        if (frameMs != 10 && frameMs != 20 && frameMs != 30) {
            return;
        }
        checkSpan(ANALYZE_MS_ON, frameMs, NEVER_BEGINS);
        checkSpan(ANALYZE_MS_OFF, frameMs, NEVER_ENDS);
        checkSpan(ANALYZE_MS, frameMs, NEVER_ENDS);
        checkOnset(static_cast<unsigned>(frameMs));
    }

    void checkSpan(const char* name, int frameMs, const char* effect) {
        const int span = intOf(name, frameMs);
        if (span >= Detector::FRAME_MS_DFLT && span < frameMs) {
            mistakes.push_back(std::string(name) + '=' + text.valueOf(name) +
                               " is shorter than a frame of " + std::to_string(frameMs) +
                               " ms: " + effect);
        }
    }

    /** Whether enough speech frames fit into the time in which speech has to begin. */
    void checkOnset(unsigned frameMs) {
        const int spanMs = intOf(ANALYZE_MS_ON, BufferedVAD::ANALYZE_MS_ON_DFLT);
        const float share = text.has(ACTIVITY_ON) ? parseFloatParameter(text.valueOf(ACTIVITY_ON))
                                                  : BufferedVAD::ACTIVITY_ON_DFLT;
        if (spanMs < 0 || !(share >= 0 && share < 1)) {
            return;
        }
        const unsigned frames = static_cast<unsigned>(spanMs) / frameMs;
        const unsigned decided =
            BUFFERS_BEFORE_NO_VOICE * (ListeningRules::BUFFER_LENGTH_MS / frameMs);
        if (share * static_cast<float>(frames) >= static_cast<float>(decided)) {
            mistakes.push_back(
                "more than " + toText(share) + " of " + std::to_string(spanMs) +
                " ms do not fit into the 5 s in which a session waits for speech: " + NEVER_BEGINS);
        }
    }

    void checkRate() {
        for (const int rate : RATES_HZ) {
            if (sampleRate == rate) {
                return;
            }
        }
        mistakes.push_back("at " + std::to_string(sampleRate) +
                           " Hz every frame counts as speech; the detector knows 8000, 16000 and "
                           "32000 Hz");
    }

    int intOf(const char* name, int otherwise) const {
        return text.has(name) ? parseIntParameter(text.valueOf(name)) : otherwise;
    }

    const VadParameterText text;
    const int sampleRate;
    std::vector<std::string> mistakes;
};

}  // namespace

const std::vector<VadParameter>& VadParameters::all() {
    static const std::vector<VadParameter> parameters = makeAll();
    return parameters;
}

std::vector<VadNoiseThresholds> VadParameters::byNoise() {
    std::vector<VadNoiseThresholds> rows;
    for (const Detector::NoiseRow& row : Detector::NOISE_ROWS) {
        rows.push_back({static_cast<double>(row.noiseLevelDb), row.params.individual,
                        row.params.total, row.params.overhangmax1, row.params.overhangmax2});
    }
    return rows;
}

std::vector<std::string> VadParameters::findMistakes(const std::string& text, int sampleRateHz) {
    return Examination(text, sampleRateHz).run();
}

}  // namespace Talvox
