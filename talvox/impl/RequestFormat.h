/**
 * @file
 * The texts that a recognition request consists of.
 */
#pragma once

#include <string>

#include "core/sound/SoundDataInfo.h"
#include "talvox/RecognitionResult.h"
#include "talvox/Settings.h"
#include "util/Bundle.h"

namespace Talvox {

/** MIME type of sound of this format; only Speex and 16-bit mono PCM are known to the service. */
std::string makeContentType(const Sound::SoundDataInfo& info);

/**
 * Address of a request. Values go into it as they are, without encoding.
 * @param chunked      the body is streamed
 * @param contentType  MIME type of the sound; part of the address of a streamed request only
 */
std::string makeRequestUrl(const Settings& engineSettings, const Settings& recognizerSettings,
                           bool chunked, const std::string& contentType);

/** "latitude,longitude", six decimals each, whatever the process's locale. */
std::string formatLocation(const Util::Bundle::LatLon& location);

/**
 * The value without any separator of the body that it is to be a part of, so that it cannot end its
 * part and begin one of its own. A value that has to be changed is logged.
 * @param name  of the part, for the log
 */
std::string removeSeparators(const std::string& name, const std::string& value,
                             const std::string& boundary);

/** What a transcripts document says about where its hypotheses come from. */
struct TranscriptsOrigin {
    std::string source;
    std::string defaultLanguage; /**< left out when empty */
    std::string topic;           /**< left out when empty */
};

/** XML of hypotheses that are uploaded; values are written as they are, without escaping. */
std::string makeTranscripts(const RecognitionResults& results, const TranscriptsOrigin& origin);

}  // namespace Talvox
