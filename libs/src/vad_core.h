/**
 * @file
 * The detector core inside libwebrtc_audio_processing.a, for which no header is installed.
 */
#pragma once

#include <array>
#include <cstddef>
#include <cstdint>

/** Frame lengths (10, 20 and 30 ms) for each of which the core keeps its own thresholds. */
constexpr std::size_t VAD_FRAME_LENGTHS = 3;

/** One threshold or maximum, for frames of 10, 20 and 30 ms. */
using VadPerFrameLength = std::array<int16_t, VAD_FRAME_LENGTHS>;

/**
 * The core's instance. What it has learnt is its own affair; the decision parameters at its end are
 * mirrored here so that they can be replaced. `findVadLayoutFault` checks that the mirror is true.
 */
struct VadCore {
    alignas(8) unsigned char state[708];
    VadPerFrameLength overHangMax1;
    VadPerFrameLength overHangMax2;
    VadPerFrameLength individual;
    VadPerFrameLength total;
    int32_t initFlag;
};

static_assert(sizeof(VadCore) == 736, "The core's instance has 736 bytes");
static_assert(offsetof(VadCore, initFlag) == 732, "The core's init flag is its last word");

extern "C" {

void WebRtcSpl_Init();
int WebRtcVad_InitCore(VadCore* core);
int WebRtcVad_set_mode_core(VadCore* core, int mode);

/** Each returns the hang-over state: greater than 0 for speech, 0 for noise. */
int WebRtcVad_CalcVad8khz(VadCore* core, const int16_t* samples, size_t length);
int WebRtcVad_CalcVad16khz(VadCore* core, const int16_t* samples, size_t length);
int WebRtcVad_CalcVad32khz(VadCore* core, const int16_t* samples, size_t length);

}  // extern "C"
