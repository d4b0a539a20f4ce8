#include "gateway/CepstralMean.h"

#include <pocketsphinx.h>

#include <algorithm>

#include "pal/kd_log.h"

namespace Gateway {

namespace {

constexpr std::size_t MAX_FRAMES_PER_CALL = 32;

/** Its logarithmic energy is negative; that of any sound is not. */
bool isDigitalSilence(const float* cepstrum) {
    return cepstrum[0] < 0;
}

}  // namespace

CepstralMean::CepstralMean(const SpeechModel& model) {
    cmd_ln_t* configuration = model.createConfiguration();
    if (configuration == nullptr) {
        return;
    }
    // Its own choice of speech would hide which frame belongs to which sound.
    cmd_ln_set_boolean_r(configuration, "-remove_silence", FALSE);
    frontEnd = fe_init_auto_r(configuration);
    cmd_ln_free_r(configuration);
    if (frontEnd == nullptr) {
        kdLogFormatMessage("the decoder's front end cannot be made");
        return;
    }
    dimensions = static_cast<std::size_t>(fe_get_output_size(frontEnd));
    fe_start_stream(frontEnd);
    fe_start_utt(frontEnd);
}

CepstralMean::~CepstralMean() {
    if (frontEnd != nullptr) {
        std::vector<mfcc_t> rest(dimensions);
        int32 count = 0;
        fe_end_utt(frontEnd, rest.data(), &count);
        fe_free(frontEnd);
    }
}

void CepstralMean::add(const int16_t* samples, std::size_t count) {
    levels.add(samples, count);
    if (frontEnd == nullptr) {
        return;
    }
    std::vector<mfcc_t> found(dimensions * MAX_FRAMES_PER_CALL);
    std::vector<mfcc_t*> rows;
    rows.reserve(MAX_FRAMES_PER_CALL);
    for (std::size_t i = 0; i < MAX_FRAMES_PER_CALL; ++i) {
        rows.push_back(&found[i * dimensions]);
    }
    while (count > 0) {
        int32 rowCount = MAX_FRAMES_PER_CALL;
        int32 firstFrame = 0;
        const std::size_t before = count;
        if (fe_process_frames(frontEnd, &samples, &count, rows.data(), &rowCount, &firstFrame) <
            0) {
            return;
        }
        for (std::size_t i = 0; i < static_cast<std::size_t>(rowCount); ++i) {
            append(rows[i]);
        }
        if (count == before && rowCount == 0) {
            return;
        }
    }
}

void CepstralMean::append(const float* cepstrum) {
    cepstra.insert(cepstra.end(), cepstrum, cepstrum + dimensions);
    silent = silent && isDigitalSilence(cepstrum);
}

std::size_t CepstralMean::countSpeech() const {
    const double speechLevel = levels.findSpeechLevel();
    std::size_t frames = 0;
    for (std::size_t i = 0; speechLevel >= 0 && i < levels.getCount(); ++i) {
        frames += levels.getLevel(i) >= speechLevel ? 1U : 0U;
    }
    return frames;
}

std::size_t CepstralMean::countLeadingSamples() const {
    const double speechLevel = levels.findSpeechLevel();
    std::size_t frame = 0;
    while (frame < levels.getCount() && levels.getLevel(frame) < speechLevel) {
        ++frame;
    }
    return frame * FrameLevels::STEP_SAMPLES;
}

std::vector<float> CepstralMean::get() const {
    const double speechLevel = levels.findSpeechLevel();
    std::vector<double> sums(dimensions);
    std::size_t frames = 0;
    // The two differ by the length of a frame: the front end's are longer.
    const std::size_t available =
        dimensions == 0 ? 0 : std::min(levels.getCount(), cepstra.size() / dimensions);
    for (std::size_t i = 0; i < available; ++i) {
        const float* cepstrum = &cepstra[i * dimensions];
        if (levels.getLevel(i) < speechLevel || isDigitalSilence(cepstrum)) {
            continue;
        }
        ++frames;
        for (std::size_t k = 0; k < dimensions; ++k) {
            sums[k] += static_cast<double>(cepstrum[k]);
        }
    }
    std::vector<float> mean;
    if (frames >= MIN_FRAMES) {
        for (const double sum : sums) {
            mean.push_back(static_cast<float>(sum / static_cast<double>(frames)));
        }
    }
    return mean;
}

}  // namespace Gateway
