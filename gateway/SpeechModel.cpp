#include "gateway/SpeechModel.h"

#include <pocketsphinx.h>
#include <sphinxbase/err.h>

#include <algorithm>
#include <fstream>

#include "core/util/Ascii.h"
#include "pal/kd_log.h"

namespace Gateway {

namespace {

bool isReadable(const std::string& path) {
    std::ifstream file(path);
    return file.good() && file.peek() != std::ifstream::traits_type::eof();
}

/** A language tag in lower case, with "-" between its subtags. */
std::string normalise(const std::string& languageTag) {
    std::string tag = Util::toLower(languageTag);
    std::replace(tag.begin(), tag.end(), '_', '-');
    return tag;
}

/** Keeps the decoder's own chatter off standard error, where the request log goes. */
void silenceRecogniser() {
    static const bool silenced = [] {
        err_set_logfp(nullptr);
        return true;
    }();
    static_cast<void>(silenced);
}

}  // namespace

bool SpeechModel::speaks(const std::string& languageTag) const {
    const std::string tag = normalise(languageTag);
    const std::string own = normalise(language);
    return tag.compare(0, own.size(), own) == 0 &&
           (tag.size() == own.size() || tag[own.size()] == '-');
}

std::string SpeechModel::findProblem() const {
    for (const std::string& path :
         {acousticDir + "/mdef", acousticDir + "/means", acousticDir + "/variances",
          acousticDir + "/transition_matrices", languageModel, dictionary}) {
        if (!isReadable(path)) {
            return "cannot read the model's file " + path;
        }
    }
    return std::string();
}

cmd_ln_s* SpeechModel::createConfiguration() const {
    silenceRecogniser();
    cmd_ln_t* configuration =
        cmd_ln_init(nullptr, ps_args(), TRUE, "-hmm", acousticDir.c_str(), "-lm",
                    languageModel.c_str(), "-dict", dictionary.c_str(), nullptr);
    if (configuration == nullptr) {
        return nullptr;
    }
    // The model's own parameters of the front end; the decoder would read them too late for
    // who only wants the front end.
    const std::string parameters = acousticDir + "/feat.params";
    if (isReadable(parameters)) {
        cmd_ln_t* extended =
            cmd_ln_parse_file_r(configuration, ps_args(), parameters.c_str(), FALSE);
        if (extended == nullptr) {
            kdLogFormatMessage("cannot read the model's file %s", parameters.c_str());
        }
        return extended;
    }
    return configuration;
}

}  // namespace Gateway
