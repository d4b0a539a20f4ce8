#include "gateway/CepstralMean.h"

#include <pocketsphinx.h>

#include <memory>

#include "pal/kd_log.h"

namespace Gateway {

namespace {

constexpr int MAX_FRAMES_PER_CALL = 32;

}  // namespace

CepstralMean::CepstralMean(const SpeechModel& model) {
    cmd_ln_t* configuration = model.createConfiguration();
    if (configuration == nullptr) {
        return;
    }
    frontEnd = fe_init_auto_r(configuration);
    cmd_ln_free_r(configuration);
    if (frontEnd == nullptr) {
        kdLogFormatMessage("the recogniser's front end cannot be made");
        return;
    }
    sums.assign(static_cast<std::size_t>(fe_get_output_size(frontEnd)), 0.0);
    fe_start_stream(frontEnd);
    fe_start_utt(frontEnd);
}

CepstralMean::~CepstralMean() {
    if (frontEnd != nullptr) {
        std::vector<mfcc_t> rest(sums.size());
        int32 count = 0;
        fe_end_utt(frontEnd, rest.data(), &count);
        fe_free(frontEnd);
    }
}

void CepstralMean::add(const int16_t* samples, std::size_t count) {
    if (frontEnd == nullptr) {
        return;
    }
    std::vector<mfcc_t> cepstra(sums.size() * MAX_FRAMES_PER_CALL);
    std::vector<mfcc_t*> rows;
    rows.reserve(MAX_FRAMES_PER_CALL);
    for (int i = 0; i < MAX_FRAMES_PER_CALL; ++i) {
        rows.push_back(&cepstra[static_cast<std::size_t>(i) * sums.size()]);
    }
    while (count > 0) {
        int32 found = MAX_FRAMES_PER_CALL;
        int32 firstFrame = 0;
        const std::size_t before = count;
        if (fe_process_frames(frontEnd, &samples, &count, rows.data(), &found, &firstFrame) < 0) {
            return;
        }
        for (int i = 0; i < found; ++i) {
            const mfcc_t* frame = rows[static_cast<std::size_t>(i)];
            // Digital silence has no energy and no meaning.
            if (frame[0] < 0) {
                continue;
            }
            ++frames;
            for (std::size_t k = 0; k < sums.size(); ++k) {
                sums[k] += static_cast<double>(frame[k]);
            }
        }
        if (count == before && found == 0) {
            return;
        }
    }
}

std::vector<float> CepstralMean::get() const {
    std::vector<float> mean;
    if (frames >= MIN_FRAMES) {
        for (const double sum : sums) {
            mean.push_back(static_cast<float>(sum / static_cast<double>(frames)));
        }
    }
    return mean;
}

}  // namespace Gateway
