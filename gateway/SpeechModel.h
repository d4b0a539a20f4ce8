#pragma once

#include <string>

// Named so by the recogniser's base library.
struct cmd_ln_s;

namespace Gateway {

/** Which model the recogniser uses, and for which language. */
struct SpeechModel {
    static constexpr unsigned RATE_HZ = 16000;

    /** Folder of the acoustic model. */
    std::string acousticDir = "/usr/share/pocketsphinx/model/en-us/en-us";
    /** Language model, text or binary. */
    std::string languageModel = "/usr/share/pocketsphinx/model/en-us/en-us.lm.bin";
    /** Pronouncing dictionary. */
    std::string dictionary = "/usr/share/pocketsphinx/model/en-us/cmudict-en-us.dict";
    /** First part of the language tags that the model is for. */
    std::string language = "en";

    /** True for "en", "en-US", "EN_gb", not for "ru-RU" or "eng". */
    bool speaks(const std::string& languageTag) const;

    /** Tells which of the files cannot be read; empty when all can. */
    std::string findProblem() const;

    /** A configuration of the recogniser, to be freed by the caller; null when it is refused. */
    cmd_ln_s* createConfiguration() const;
};

}  // namespace Gateway
