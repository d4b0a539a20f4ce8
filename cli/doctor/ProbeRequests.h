#pragma once

#include <cstddef>
#include <string>

#include "HttpProbe.h"

namespace Cli {

/** The requests that the doctor sends, in the form of the engine's own. */
class ProbeRequests {
  public:
    /** Length of the generated utterance in pieces of `PIECE_MS`. */
    static constexpr int PIECES = 20;
    static constexpr int PIECE_MS = 100;

    /** Sound that a session sends at most: 20.1 s of PCM at 44.1 kHz. */
    static constexpr std::size_t SOUND_MAX_BYTES = 1772820;

    ProbeRequests(std::string requestUuid, std::string requestLanguage);

    /** A whole or a streamed request without sound. */
    ProbeRequest makeEmpty(bool isStreamed) const;

    /** The utterance in one piece. */
    ProbeRequest makeWhole() const;

    /** The utterance at the pace of speech. */
    ProbeRequest makeStreamed() const;

    /**
     * A whole request with silence at 44.1 kHz whose body has `bytes` bytes, at least 1000; one
     * less if the samples need it.
     */
    ProbeRequest makeOfSize(std::size_t bytes) const;

    /** Bytes of the body with the longest sound of a session. */
    std::size_t getMaxSize() const;

  private:
    std::string wholePath() const;
    std::string streamedPath() const;
    std::string beginBody(int rateHz, bool hasSound) const;

    const std::string uuid;
    const std::string language;
};

}  // namespace Cli
