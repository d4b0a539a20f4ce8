#pragma once

#include <sndfile.h>

#include <cstddef>
#include <cstdint>
#include <memory>
#include <string>

#include "AudioClip.h"
#include "WavHead.h"

namespace Cli {

using SoundFile = std::unique_ptr<SNDFILE, int (*)(SNDFILE*)>;

/** @throws UsageError always: the sound called `name` cannot be read */
[[noreturn]] void refuseSound(const std::string& name, const std::string& reason);

/** A message of libsndfile as a part of a sentence. */
std::string plainReason(const char* message);

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
