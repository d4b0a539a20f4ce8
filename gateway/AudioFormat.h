#pragma once

#include <string>

namespace Gateway {

/** The form in which a client sends its sound: one channel in every case. */
struct AudioFormat {
    enum class Codec { PCM16, SPEEX };
    static constexpr unsigned MIN_RATE_HZ = 4000;
    static constexpr unsigned MAX_RATE_HZ = 96000;

    Codec codec = Codec::PCM16;
    /** Samples per second; of no meaning for Speex, whose stream carries its own. */
    unsigned rateHz = 0;

    /**
     * Reads "audio/x-pcm;bit=16;rate=N" or "audio/x-speex".
     * @return an empty text, or the reason why the type cannot be handled
     */
    static std::string parse(const std::string& contentType, AudioFormat& format);
};

}  // namespace Gateway
