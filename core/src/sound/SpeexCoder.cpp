#include "sound/SpeexCoder.h"

#include <speex/speex_header.h>

#include <memory>

namespace Sound {

namespace {

const int NARROW_BAND_BELOW_HZ = 12500;
const int WIDE_BAND_BELOW_HZ = 25000;

const SpeexMode* modeForRate(int sampleRateHz) {
    if (sampleRateHz < NARROW_BAND_BELOW_HZ) {
        return speex_lib_get_mode(SPEEX_MODEID_NB);
    }
    if (sampleRateHz < WIDE_BAND_BELOW_HZ) {
        return speex_lib_get_mode(SPEEX_MODEID_WB);
    }
    return speex_lib_get_mode(SPEEX_MODEID_UWB);
}

int decoderLagOf(const SpeexMode* mode) {
    spx_int32_t lag = 0;
    if (void* decoder = speex_decoder_init(mode)) {
        speex_decoder_ctl(decoder, SPEEX_GET_LOOKAHEAD, &lag);
        speex_decoder_destroy(decoder);
    }
    return lag;
}

}  // namespace

SpeexCoder::SpeexCoder(int sampleRateHz, int quality)
    : sampleRate(sampleRateHz),
      mode(modeForRate(sampleRateHz)),
      state(speex_encoder_init(mode)),
      bits() {
    if (state == nullptr) {
        return;
    }
    speex_bits_init(&bits);
    spx_int32_t value = quality;
    speex_encoder_ctl(state, SPEEX_SET_QUALITY, &value);
    value = sampleRateHz;
    speex_encoder_ctl(state, SPEEX_SET_SAMPLING_RATE, &value);
    speex_encoder_ctl(state, SPEEX_GET_FRAME_SIZE, &value);
    frameSize = value;
    speex_encoder_ctl(state, SPEEX_GET_LOOKAHEAD, &value);
    lookAhead = value;
    decoderLag = decoderLagOf(mode);
}

SpeexCoder::~SpeexCoder() {
    if (state != nullptr) {
        speex_bits_destroy(&bits);
        speex_encoder_destroy(state);
    }
}

std::vector<unsigned char> SpeexCoder::makeHeader() const {
    SpeexHeader header;
    speex_init_header(&header, sampleRate, 1, mode);
    header.frames_per_packet = 1;
    int size = 0;
    struct Deleter {
        void operator()(char* header) const { speex_header_free(header); }
    };
    const std::unique_ptr<char, Deleter> text(speex_header_to_packet(&header, &size));
    if (!text) {
        return {};
    }
    return {text.get(), text.get() + size};
}

const std::vector<unsigned char>& SpeexCoder::encodeFrame(int16_t* samples) {
    speex_bits_reset(&bits);
    speex_encode_int(state, samples, &bits);
    speex_bits_insert_terminator(&bits);
    packet.resize(static_cast<std::size_t>(speex_bits_nbytes(&bits)));
    const int written = speex_bits_write(&bits, reinterpret_cast<char*>(packet.data()),
                                         static_cast<int>(packet.size()));
    packet.resize(static_cast<std::size_t>(written));
    return packet;
}

}  // namespace Sound
