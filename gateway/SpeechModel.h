#pragma once

#include <string>

// The name is PocketSphinx's.
struct cmd_ln_s;

namespace Gateway {

/** Which model the decoder uses, and for which language. */
struct SpeechModel {
    static constexpr unsigned RATE_HZ = 16000;

    /** Folder of the acoustic model. */
    std::string acousticDir = "/usr/share/pocketsphinx/model/en-us/en-us";
    /** Language model, text or binary. */
    std::string languageModel = "/usr/share/pocketsphinx/model/en-us/en-us.lm.bin";
    /** Pronouncing dictionary. */
    std::string dictionary = "/usr/share/pocketsphinx/model/en-us/cmudict-en-us.dict";
    /** Language tag that the model is for; never empty. */
    std::string language = "en";

    /**
     * True if `languageTag` is the model's tag or narrows it down by further subtags. Case does not
     * matter, and "_" separates subtags just as "-" does. A model for "en" speaks "en", "en-US"
     * and "EN_gb", not "eng" or "ru-RU"; a model for "en-US" does not speak "en".
     */
    bool speaks(const std::string& languageTag) const;

    /** Names the first file that cannot be read; empty when all can. */
    std::string findProblem() const;

    /** A configuration of the decoder, to be freed by the caller; null when it is refused. */
    cmd_ln_s* createConfiguration() const;
};

}  // namespace Gateway
