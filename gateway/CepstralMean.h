#pragma once

#include <cstddef>
#include <cstdint>
#include <vector>

#include "gateway/FrameLevels.h"
#include "gateway/SpeechModel.h"

// The name is PocketSphinx's.
struct fe_s;

namespace Gateway {

/**
 * Mean of the cepstra of the speech in some sound. The decoder subtracts it from the cepstra of an
 * utterance, which takes the channel out of them: measured on the utterance itself, it depends on
 * nothing that was said before. Only speech counts: the mean of a pause describes the room.
 */
class CepstralMean {
  public:
    /** Fewer frames say more about the words than about the channel. */
    static constexpr std::size_t MIN_FRAMES = 20;

    explicit CepstralMean(const SpeechModel& model);
    ~CepstralMean();
    CepstralMean(const CepstralMean&) = delete;
    CepstralMean& operator=(const CepstralMean&) = delete;

    /** Appends sound at 16 kHz. */
    void add(const int16_t* samples, std::size_t count);

    /** True while all sound has been digital silence. */
    bool isSilent() const { return silent; }

    /** Frames of speech, one each 10 ms, as far as the sound tells by now; 0 while it is noise. */
    std::size_t countSpeech() const;

    /** Samples before the first frame of speech; 0 where nothing stands out from the background. */
    std::size_t countLeadingSamples() const;

    /**
     * The mean over all speech so far. Where nothing stands out from the background, all sound
     * counts but digital silence.
     * @return empty if there are fewer than `MIN_FRAMES` frames
     */
    std::vector<float> get() const;

  private:
    void append(const float* cepstrum);

    fe_s* frontEnd = nullptr;
    FrameLevels levels;
    std::size_t dimensions = 0;
    /** One after the other, `dimensions` numbers each. */
    std::vector<float> cepstra;
    bool silent = true;
};

}  // namespace Gateway
