#pragma once

#include <ogg/ogg.h>
#include <speex/speex.h>

#include <cstddef>
#include <cstdint>
#include <string>
#include <vector>

namespace Gateway {

/**
 * Decodes an Ogg Speex stream as it arrives, in pieces of any size, to mono 16-bit samples.
 *
 * Damage after the stream's head costs the packets that it hit and no more: bytes that are not a
 * page are skipped, a page with a wrong check sum is dropped, a packet that does not decode ends
 * with its last good frame. The delay of encoder and decoder is taken off at the beginning and the
 * padding at the end, as the stream's last page tells.
 */
class SpeexStreamDecoder {
  public:
    SpeexStreamDecoder();
    ~SpeexStreamDecoder();
    SpeexStreamDecoder(const SpeexStreamDecoder&) = delete;
    SpeexStreamDecoder& operator=(const SpeexStreamDecoder&) = delete;

    /**
     * Appends to `samples` what the bytes complete.
     * @return an empty text, or the reason why the stream cannot be decoded at all; nothing more
     *         is decoded then
     */
    std::string write(const unsigned char* data, std::size_t size, std::vector<int16_t>& samples);

    /** Samples per second; 0 until the stream's head has arrived. */
    unsigned getRateHz() const { return rateHz; }

    /** Packets that were lost or did not decode. */
    unsigned getDamagedPackets() const { return damagedPackets; }

  private:
    std::string readPages(std::vector<int16_t>& samples);
    std::string readPage(ogg_page& page, std::vector<int16_t>& samples);
    std::string readHead(const ogg_packet& packet);
    void decodePacket(const ogg_packet& packet, std::vector<int16_t>& samples);
    void append(const float* frame, std::size_t count, std::vector<int16_t>& samples);

    ogg_sync_state sync;
    ogg_stream_state stream;
    SpeexBits bits;
    bool hasStream = false;
    void* decoder = nullptr;
    unsigned rateHz = 0;
    std::size_t frameSize = 0;
    int framesPerPacket = 1;
    /** Comment and extra packets that stand before the sound. */
    unsigned headersLeft = 0;
    std::size_t skip = 0;
    int64_t decoded = 0;
    /** Samples in the whole stream, -1 until its last page says so. */
    int64_t total = -1;
    unsigned damagedPackets = 0;
    bool failed = false;
};

}  // namespace Gateway
