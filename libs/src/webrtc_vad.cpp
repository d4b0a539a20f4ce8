#include "libs/webrtc_vad.h"

#include <cstdio>
#include <new>

#include "libs/src/vad_core.h"
#include "libs/src/vad_layout.h"

/** What a handle points to. */
struct KorvelVadInst {
    VadCore core = {};
    bool initialised = false;
    bool forcedNoise = false;
};

namespace {

constexpr int FAILED = -1;
constexpr int MODE_MAX = 3;

using CalcVad = int (*)(VadCore*, const int16_t*, size_t);

/**
 * Checked once per process. A core that is not the mirrored one would be corrupted by every call
 * that follows, and can only come from a wrong build: then no detector is made.
 */
bool isCoreUsable() {
    static const bool usable = [] {
        WebRtcSpl_Init();
        const char* fault = findVadLayoutFault({WebRtcVad_InitCore, WebRtcVad_set_mode_core});
        if (fault != nullptr) {
            std::fprintf(stderr, "libKorvelLibs: unusable voice activity detector: %s\n", fault);
        }
        return fault == nullptr;
    }();
    return usable;
}

CalcVad calcForRate(int sampleRateHz) {
    switch (sampleRateHz) {
        case 8000:
            return WebRtcVad_CalcVad8khz;
        case 16000:
            return WebRtcVad_CalcVad16khz;
        case 32000:
            return WebRtcVad_CalcVad32khz;
        default:
            return nullptr;
    }
}

bool isFrameLength(int sampleRateHz, int length) {
    const int samplesPer10Ms = sampleRateHz / 100;
    return length == samplesPer10Ms || length == 2 * samplesPer10Ms || length == 3 * samplesPer10Ms;
}

}  // namespace

int WebRtcVad_Create(VadInst** handle) {
    if (handle == nullptr) {
        return FAILED;
    }
    *handle = isCoreUsable() ? new (std::nothrow) KorvelVadInst : nullptr;
    return *handle != nullptr ? 0 : FAILED;
}

int WebRtcVad_Free(VadInst* handle) {
    delete handle;
    return 0;
}

int WebRtcVad_Init(VadInst* handle) {
    if (handle == nullptr) {
        return FAILED;
    }
    handle->forcedNoise = false;
    handle->initialised = WebRtcVad_InitCore(&handle->core) == 0;
    return handle->initialised ? 0 : FAILED;
}

int WebRtcVad_set_mode(VadInst* handle, int16_t mode) {
    if (handle == nullptr || !handle->initialised || mode < 0 || mode > MODE_MAX) {
        return FAILED;
    }
    return WebRtcVad_set_mode_core(&handle->core, mode);
}

int16_t WebRtcVad_Process(VadInst* handle, int16_t sampleRateHz, const int16_t* samples,
                          int16_t length) {
    const CalcVad calcVad = calcForRate(sampleRateHz);
    if (handle == nullptr || !handle->initialised || samples == nullptr || calcVad == nullptr ||
        !isFrameLength(sampleRateHz, length)) {
        return FAILED;
    }
    const int hangOver = calcVad(&handle->core, samples, static_cast<size_t>(length));
    return hangOver > 0 && !handle->forcedNoise ? 1 : 0;
}

int WebRtcVad_set_mode_fine_grained(VadInst* handle, const WebRtc_ModeParams* params) {
    if (handle == nullptr || params == nullptr) {
        return FAILED;
    }
    handle->core.individual.fill(params->individual);
    handle->core.total.fill(params->total);
    handle->core.overHangMax1.fill(params->overhangmax1);
    handle->core.overHangMax2.fill(params->overhangmax2);
    return 0;
}

int WebRtcVad_force_noise(VadInst* handle, int flag) {
    if (handle == nullptr) {
        return FAILED;
    }
    handle->forcedNoise = flag != 0;
    return 0;
}
