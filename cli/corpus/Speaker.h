#pragma once

#include <cstdint>
#include <map>
#include <string>
#include <utility>
#include <vector>

namespace Cli {

/**
 * Lets the speech synthesiser flite speak. Each text is spoken once and kept. Used by one thread.
 */
class Speaker {
  public:
    /** Makes a folder for what flite writes. @throws UsageError if that is not possible */
    Speaker();
    ~Speaker();
    Speaker(const Speaker&) = delete;
    Speaker& operator=(const Speaker&) = delete;

    /** The voices that the corpus is spoken with; all at `WAVE_RATE_HZ`. */
    static const std::vector<std::string>& voices();

    /**
     * The text in 16-bit samples without the silence around it. Speech begins and ends with the
     * first and last 10 ms that are at most 40 dB below the loudest; the length is a multiple
     * of 10 ms.
     * @throws UsageError if flite is not installed or fails
     */
    const std::vector<int16_t>& speak(const std::string& voice, const std::string& text);

    /**
     * A number for all that was spoken so far. Equal numbers say that flite, which is not part of
     * this tool, gave the same sound.
     */
    uint64_t checksum() const { return checksum_; }

  private:
    std::string folder_;
    std::map<std::pair<std::string, std::string>, std::vector<int16_t>> spoken_;
    uint64_t checksum_ = 14695981039346656037U;
};

/** The part of a sound that holds speech, by the rule of `Speaker::speak`. */
std::vector<int16_t> trimSpeech(const std::vector<int16_t>& samples);

}  // namespace Cli
