/**
 * @file
 * The parameters of the "vad" setting, and what is wrong with a given text.
 */
#pragma once

#include <string>
#include <vector>

#include "talvox/Export.h"

namespace Talvox {

/** One parameter of the "vad" setting. */
struct VadParameter {
    /** How a value is read. */
    enum Type {
        NAME,
        INTEGER,
        /** An integer; below 0 it counts as a time longer than any session. */
        MILLISECONDS,
        NUMBER
    };

    /** As normalised: lower case without "_" and blanks. */
    std::string name;
    Type type = NAME;
    /** Has an effect only with the default engine, not with "engine=wrtc". */
    bool isOfBufferedOnly = false;
    /** Of numbers: the useful values are those from `lowest` to `highest` in steps of `step`. */
    double lowest = 0;
    double highest = 0;
    double step = 0; /**< 0 for any number in between */
    /** The useful values, for readers. */
    std::string range;
    /** The value of a detector to which none is given. */
    std::string byDefault;
    /** What it is for. */
    std::string meaning;
    /** What a value below `lowest`, or between the steps, leads to; may be empty. */
    std::string below;
    /** What a value above `highest` leads to; may be empty. */
    std::string above;
};

/** Thresholds of the frame detector, which it uses from a level of the leading noise on. */
struct VadNoiseThresholds {
    /** Level of the leading noise in dB, as `VadBufferAnalysis::level` has it. */
    double noiseLevelDb = 0;
    /** The parameters of these names. */
    int individual = 0;
    int total = 0;
    int overhangMax1 = 0;
    int overhangMax2 = 0;
};

/** What may stand in the "vad" setting. Any thread; never blocks. */
class TALVOX_API VadParameters {
  public:
    /** Every parameter, in the order in which a reader wants to know them. */
    static const std::vector<VadParameter>& all();

    /** The thresholds where the text gives none, from the highest noise level down. */
    static std::vector<VadNoiseThresholds> byNoise();

    /**
     * Everything in a parameter text that switches detection off, changes nothing or means
     * something else than it seems to: one sentence each, without a full stop, in the text's own
     * words. A detector takes any text; this is for those who write one.
     * @param sampleRateHz rate of the sound: at some rates every frame counts as speech
     */
    static std::vector<std::string> findMistakes(const std::string& text, int sampleRateHz);
};

}  // namespace Talvox
