/**
 * @file
 * The WebRTC voice activity detector, in the form that the engine's frame detector calls.
 *
 * An instance is used by one thread at a time and independent of every other. Decisions are those
 * of the bare detector, bit for bit, unless one of the two tuning functions at the end is used.
 */
#ifndef KORVEL_LIBS_WEBRTC_VAD_H
#define KORVEL_LIBS_WEBRTC_VAD_H

#include <stdint.h>

/** Marks what the library exports. */
#define KORVEL_LIBS_API __attribute__((visibility("default")))

#ifdef __cplusplus
extern "C" {
#endif

/** A detector; made by `WebRtcVad_Create`. */
typedef struct KorvelVadInst VadInst;

/** Decision thresholds and hang-over maxima, used for frames of every length alike. */
typedef struct WebRtc_ModeParams {
    int16_t individual;   /**< threshold of the log likelihood ratio of each single band */
    int16_t total;        /**< threshold of the weighted sum over the bands */
    int16_t overhangmax1; /**< hang-over in frames after short speech */
    int16_t overhangmax2; /**< hang-over in frames after long speech */
} WebRtc_ModeParams;

/**
 * Makes an instance in `*handle`, to be given back with `WebRtcVad_Free`; it must be initialised
 * before use. @return 0, or -1 when `handle` is null or no memory is left (`*handle` is null then).
 */
KORVEL_LIBS_API int WebRtcVad_Create(VadInst** handle);

/** Frees an instance; null is accepted. @return 0. */
KORVEL_LIBS_API int WebRtcVad_Free(VadInst* handle);

/** Resets the instance: mode 0, nothing learnt, no forced noise. @return 0, or -1 for null. */
KORVEL_LIBS_API int WebRtcVad_Init(VadInst* handle);

/** Sets the aggressiveness, 0 (least) to 3. @return 0, or -1 (nothing changed) otherwise. */
KORVEL_LIBS_API int WebRtcVad_set_mode(VadInst* handle, int16_t mode);

/**
 * Classifies one frame.
 * @param sampleRateHz  8000, 16000 or 32000
 * @param samples       the frame, `length` samples; not kept
 * @param length        10, 20 or 30 ms in samples
 * @return 1 speech, 0 noise, -1 for a null argument, an uninitialised instance or a rate or length
 *         that is not supported.
 */
KORVEL_LIBS_API int16_t WebRtcVad_Process(VadInst* handle, int16_t sampleRateHz,
                                          const int16_t* samples, int16_t length);

/**
 * Replaces the thresholds and hang-over maxima that the mode set, for all three frame lengths,
 * until the next `WebRtcVad_set_mode` or `WebRtcVad_Init`. @return 0, or -1 for null.
 */
KORVEL_LIBS_API int WebRtcVad_set_mode_fine_grained(VadInst* handle,
                                                    const WebRtc_ModeParams* params);

/**
 * While `flag` is not 0, frames are answered 0; the detector goes on adapting to them, so that its
 * later decisions are the same as without. @return 0, or -1 for null.
 */
KORVEL_LIBS_API int WebRtcVad_force_noise(VadInst* handle, int flag);

#ifdef __cplusplus
}
#endif

#endif
