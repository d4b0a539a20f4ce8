#pragma once

#include <sndfile.h>

#include <cstddef>
#include <cstdint>
#include <functional>
#include <memory>
#include <string>

#include "AudioClip.h"
#include "WavHead.h"

namespace Cli {

using SoundFile = std::unique_ptr<SNDFILE, int (*)(SNDFILE*)>;

/** @throws UsageError always: the sound called `name` cannot be read */
[[noreturn]] void refuseSound(const std::string& name, const std::string& reason);

/** Why libsndfile did not open a file. */
struct OpenFailure {
    int error = SF_ERR_NO_ERROR; /**< a number of libsndfile's */
    std::string reason;          /**< a part of a sentence */
};

/**
 * Calls `open`, which calls sf_open or one of its kin. libsndfile keeps the reason of a failure in
 * one place for the whole process and clears it at the next opening, so openings take turns.
 * @return the open file; null, and `failure` filled in, if there is none
 */
SoundFile openSound(const std::function<SNDFILE*()>& open, OpenFailure& failure);

/** How many samples `seconds` of sound have. */
std::size_t samplesIn(int seconds, int sampleRateHz);

/**
 * Reads an open sound file to its end, or to the end of the first block behind `maxSamples`, and
 * mixes its channels down to one.
 * @param name of the file, for messages
 * @throws UsageError if it holds no sound, cannot be read so far, or its sample rate is absurd
 */
AudioClip decodeSound(SNDFILE* file, const SF_INFO& info, const std::string& name,
                      std::size_t maxSamples);

/** Logs that the file holds less sound than it should. */
void warnOfCut(const std::string& name, double presentS, double promisedS);

/**
 * Logs it if a WAV file ends before the sound that its header promises.
 * @param bytes how many bytes there are, header included
 * @param clip  the sound that they hold
 */
void warnOfCutWav(const std::string& name, const WavHead& head, std::uint64_t bytes,
                  const AudioClip& clip);

}  // namespace Cli
