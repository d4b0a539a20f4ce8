#include "gateway/SpeechDecoder.h"

#include <pocketsphinx.h>
#include <sphinxbase/cmn.h>

#include "gateway/HypothesisReader.h"
#include "pal/kd_log.h"

namespace Gateway {

std::unique_ptr<SpeechDecoder> SpeechDecoder::create(const SpeechModel& model) {
    cmd_ln_t* configuration = model.createConfiguration();
    if (configuration == nullptr) {
        return nullptr;
    }
    ps_decoder_t* loaded = ps_init(configuration);
    cmd_ln_free_r(configuration);
    if (loaded == nullptr) {
        return nullptr;
    }
    return std::unique_ptr<SpeechDecoder>(new SpeechDecoder(loaded));
}

SpeechDecoder::SpeechDecoder(ps_decoder_s* loaded) : decoder(loaded) {
    feat_t* features = ps_get_feat(decoder);
    if (features->cmn_struct != nullptr) {
        initialMean.resize(static_cast<std::size_t>(features->cmn_struct->veclen));
        cmn_live_get(features->cmn_struct, initialMean.data());
    }
}

SpeechDecoder::~SpeechDecoder() {
    abandon();
    ps_free(decoder);
}

bool SpeechDecoder::begin(const std::vector<float>& cepstralMean) {
    abandon();
    if (ps_start_stream(decoder) < 0) {
        return false;
    }
    if (!initialMean.empty()) {
        const bool usable = cepstralMean.size() == initialMean.size();
        cmn_live_set(ps_get_feat(decoder)->cmn_struct,
                     usable ? cepstralMean.data() : initialMean.data());
    }
    inUtterance = ps_start_utt(decoder) >= 0;
    return inUtterance;
}

bool SpeechDecoder::decode(const int16_t* samples, std::size_t count) {
    return inUtterance && ps_process_raw(decoder, samples, count, FALSE, FALSE) >= 0;
}

std::vector<Hypothesis> SpeechDecoder::finish() {
    if (!inUtterance) {
        return std::vector<Hypothesis>();
    }
    inUtterance = false;
    if (ps_end_utt(decoder) < 0) {
        kdLogFormatMessage("the decoder could not end an utterance");
        return std::vector<Hypothesis>();
    }
    return HypothesisReader(decoder).read(MAX_HYPOTHESES);
}

void SpeechDecoder::abandon() {
    if (inUtterance) {
        inUtterance = false;
        ps_end_utt(decoder);
    }
}

}  // namespace Gateway
