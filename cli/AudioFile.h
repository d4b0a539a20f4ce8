#pragma once

#include <string>

#include "AudioClip.h"

namespace Cli {

/**
 * Reads a sound file of any format that libsndfile knows and mixes its channels down to one.
 * A file that ends before its sound does gives the sound that is there; the log says so.
 * @throws UsageError with the path and the reason if it is not a sound file, holds no sound or more
 *         than `MAX_CLIP_SECONDS`, or cannot be read to its end
 */
AudioClip readAudioFile(const std::string& path);

}  // namespace Cli
