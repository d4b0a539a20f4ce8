#pragma once

#include <ogg/ogg.h>

#include <cstdint>
#include <vector>

namespace Sound {

/** One logical Ogg stream: packets in, the bytes of pages out. */
class OggWriter {
  public:
    /** @param pageFillBytes a page is closed once it holds this many bytes and four packets */
    explicit OggWriter(int pageFillBytes);
    ~OggWriter();
    OggWriter(const OggWriter&) = delete;
    OggWriter& operator=(const OggWriter&) = delete;

    /** Appends a packet that ends at `granulePosition`; the last one closes its page. */
    void write(const std::vector<unsigned char>& packet, int64_t granulePosition, bool last);

    /** Closes pages as long as there are packets for full ones. */
    void closeFullPages();

    /** Closes a page with all packets that are on none yet. */
    void flush();

    /** Whether the library had no memory for the stream or for a packet. */
    bool hasFailed() const { return failed; }

    /** Bytes of closed pages that were not taken yet. */
    std::size_t getSize() const { return pages.size() - taken; }

    /** Takes up to `maxBytes`, oldest first, in place of what `bytes` holds. */
    void take(std::size_t maxBytes, std::vector<unsigned char>& bytes);

  private:
    void append(const ogg_page& page);

    const int pageFill;
    ogg_stream_state stream;
    bool failed = false;
    int64_t packetCount = 0;
    std::vector<unsigned char> pages;
    std::size_t taken = 0;
};

}  // namespace Sound
