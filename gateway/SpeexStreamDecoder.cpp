#include "gateway/SpeexStreamDecoder.h"

#include <speex/speex_header.h>

#include <algorithm>
#include <cmath>
#include <cstring>
#include <iterator>

namespace Gateway {

namespace {

constexpr int MIN_RATE_HZ = 6000;
constexpr int MAX_RATE_HZ = 48000;
constexpr int MAX_FRAMES_PER_PACKET = 16;
constexpr int MAX_EXTRA_HEADERS = 16;
constexpr std::size_t MAX_FRAME_SIZE = 640;

struct HeaderOwner {
    explicit HeaderOwner(const ogg_packet& packet)
        : header(speex_packet_to_header(reinterpret_cast<char*>(packet.packet),
                                        static_cast<int>(packet.bytes))) {}
    ~HeaderOwner() {
        if (header != nullptr) {
            speex_header_free(header);
        }
    }
    HeaderOwner(const HeaderOwner&) = delete;
    HeaderOwner& operator=(const HeaderOwner&) = delete;

    SpeexHeader* header;
};

/** Samples by which an encoder of that mode delays the sound. */
std::size_t encoderDelay(int mode) {
    void* encoder = speex_encoder_init(speex_lib_get_mode(mode));
    if (encoder == nullptr) {
        return 0;
    }
    spx_int32_t delay = 0;
    speex_encoder_ctl(encoder, SPEEX_GET_LOOKAHEAD, &delay);
    speex_encoder_destroy(encoder);
    return static_cast<std::size_t>(delay);
}

/** The nearest sample; silence for what is no number. */
int16_t toSample(float value) {
    if (std::isnan(value)) {
        return 0;
    }
    return static_cast<int16_t>(std::floor(std::clamp(value, -32768.0F, 32767.0F) + 0.5));
}

}  // namespace

SpeexStreamDecoder::SpeexStreamDecoder() {
    ogg_sync_init(&sync);
    speex_bits_init(&bits);
}

SpeexStreamDecoder::~SpeexStreamDecoder() {
    if (decoder != nullptr) {
        speex_decoder_destroy(decoder);
    }
    if (hasStream) {
        ogg_stream_clear(&stream);
    }
    speex_bits_destroy(&bits);
    ogg_sync_clear(&sync);
}

std::string SpeexStreamDecoder::write(const unsigned char* data, std::size_t size,
                                      std::vector<int16_t>& samples) {
    constexpr std::size_t PIECE = 4096;
    std::string reason;
    while (size > 0 && !failed) {
        const std::size_t count = std::min(size, PIECE);
        char* buffer = ogg_sync_buffer(&sync, static_cast<long>(count));
        if (buffer == nullptr) {
            reason = "out of memory";
        } else {
            std::memcpy(buffer, data, count);
            ogg_sync_wrote(&sync, static_cast<long>(count));
            reason = readPages(samples);
        }
        failed = !reason.empty();
        data += count;
        size -= count;
    }
    return reason;
}

std::string SpeexStreamDecoder::readPages(std::vector<int16_t>& samples) {
    ogg_page page;
    for (;;) {
        const int found = ogg_sync_pageout(&sync, &page);
        if (found == 0) {
            return std::string();
        }
        if (found > 0) {
            std::string reason = readPage(page, samples);
            if (!reason.empty()) {
                return reason;
            }
        } else if (!hasStream) {
            return "the sound is not an Ogg stream";
        }
    }
}

std::string SpeexStreamDecoder::readPage(ogg_page& page, std::vector<int16_t>& samples) {
    if (!hasStream) {
        if (ogg_stream_init(&stream, ogg_page_serialno(&page)) != 0) {
            return "out of memory";
        }
        hasStream = true;
    }
    // A page of another stream is not ours to read.
    if (ogg_stream_pagein(&stream, &page) != 0) {
        return std::string();
    }
    if (ogg_page_eos(&page) != 0 && ogg_page_granulepos(&page) >= 0) {
        total = ogg_page_granulepos(&page);
    }
    ogg_packet packet;
    for (;;) {
        const int found = ogg_stream_packetout(&stream, &packet);
        if (found == 0) {
            return std::string();
        }
        if (found < 0) {
            ++damagedPackets;
        } else if (decoder == nullptr) {
            std::string reason = readHead(packet);
            if (!reason.empty()) {
                return reason;
            }
        } else if (headersLeft > 0) {
            --headersLeft;
        } else {
            decodePacket(packet, samples);
        }
    }
}

std::string SpeexStreamDecoder::readHead(const ogg_packet& packet) {
    const HeaderOwner owner(packet);
    const SpeexHeader* header = owner.header;
    if (header == nullptr) {
        return "the Ogg stream does not begin with a Speex header";
    }
    if (header->mode < 0 || header->mode >= SPEEX_NB_MODES || header->rate < MIN_RATE_HZ ||
        header->rate > MAX_RATE_HZ || header->frames_per_packet < 0 ||
        header->frames_per_packet > MAX_FRAMES_PER_PACKET || header->extra_headers < 0 ||
        header->extra_headers > MAX_EXTRA_HEADERS) {
        return "the Speex header has a mode, rate or packet size that cannot be";
    }
    decoder = speex_decoder_init(speex_lib_get_mode(header->mode));
    if (decoder == nullptr) {
        return "out of memory";
    }
    spx_int32_t value = 0;
    speex_decoder_ctl(decoder, SPEEX_GET_FRAME_SIZE, &value);
    frameSize = static_cast<std::size_t>(value);
    speex_decoder_ctl(decoder, SPEEX_GET_LOOKAHEAD, &value);
    skip = static_cast<std::size_t>(value) + encoderDelay(header->mode);
    // The enhancement pleases ears and makes the sound less like what was recorded.
    value = 0;
    speex_decoder_ctl(decoder, SPEEX_SET_ENH, &value);
    rateHz = static_cast<unsigned>(header->rate);
    framesPerPacket = std::max(1, static_cast<int>(header->frames_per_packet));
    headersLeft = 1 + static_cast<unsigned>(header->extra_headers);
    return std::string();
}

void SpeexStreamDecoder::decodePacket(const ogg_packet& packet, std::vector<int16_t>& samples) {
    if (frameSize > MAX_FRAME_SIZE || packet.bytes <= 0) {
        ++damagedPackets;
        return;
    }
    speex_bits_read_from(&bits, reinterpret_cast<const char*>(packet.packet),
                         static_cast<int>(packet.bytes));
    for (int i = 0; i < framesPerPacket; ++i) {
        // The library's own conversion decodes into memory that it does not set before, and of some
        // damaged packets it reads samples that it has not written.
        float frame[MAX_FRAME_SIZE] = {};
        const int status = speex_decode(decoder, &bits, frame);
        if (status == -1) {
            return;
        }
        if (status < 0 || speex_bits_remaining(&bits) < 0) {
            ++damagedPackets;
            return;
        }
        append(frame, frameSize, samples);
    }
}

void SpeexStreamDecoder::append(const float* frame, std::size_t count,
                                std::vector<int16_t>& samples) {
    const std::size_t skipped = std::min(skip, count);
    skip -= skipped;
    frame += skipped;
    count -= skipped;
    if (total >= 0) {
        const int64_t left = std::max<int64_t>(0, total - decoded);
        count = static_cast<std::size_t>(std::min<int64_t>(left, static_cast<int64_t>(count)));
    }
    decoded += static_cast<int64_t>(count);
    std::transform(frame, frame + count, std::back_inserter(samples), toSample);
}

}  // namespace Gateway
