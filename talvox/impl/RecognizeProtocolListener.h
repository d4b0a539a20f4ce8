/**
 * @file
 * What a recognize protocol tells its session.
 */
#pragma once

#include <boost/shared_ptr.hpp>
#include <string>

#include "talvox/RecognitionResult.h"
#include "talvox/SpeechError.h"

namespace Talvox {

/**
 * Hears of a protocol's progress. Called under the event lock.
 *
 * May do: drop the protocol, add or drop listeners. Must not do: block, throw.
 */
class RecognizeProtocolListener {
  public:
    virtual ~RecognizeProtocolListener() = default;

    /** The recognition failed; nothing follows. */
    virtual void onProtocolError(SpeechError error) = 0;

    /** The service has heard speech. */
    virtual void onProtocolVoiceBegin() = 0;

    /** The utterance is complete and is about to be sent to its end. */
    virtual void onProtocolVoiceCaptured() = 0;

    /** The hypotheses, best first, never null; nothing follows. */
    virtual void onProtocolResults(boost::shared_ptr<const RecognitionResults> results,
                                   const std::string& requestId) = 0;
};

}  // namespace Talvox
