#include "sound/OggWriter.h"

#include <algorithm>

namespace Sound {

namespace {

// Streams are never multiplexed, so any number will do; a fixed one makes the bytes repeatable.
const int SERIAL_NUMBER = 1;

// 255 segments of 255 bytes.
const int PAGE_BYTES_MAX = 65025;

}  // namespace

OggWriter::OggWriter(int pageFillBytes) : pageFill(std::max(pageFillBytes, 1)), stream() {
    failed = ogg_stream_init(&stream, SERIAL_NUMBER) != 0;
}

OggWriter::~OggWriter() {
    ogg_stream_clear(&stream);
}

void OggWriter::write(const std::vector<unsigned char>& packet, int64_t granulePosition,
                      bool last) {
    ogg_packet item = {};
    // The library only reads the bytes.
    item.packet = const_cast<unsigned char*>(packet.data());
    item.bytes = static_cast<long>(packet.size());
    item.b_o_s = packetCount == 0 ? 1 : 0;
    item.e_o_s = last ? 1 : 0;
    item.granulepos = granulePosition;
    item.packetno = packetCount++;
    failed = ogg_stream_packetin(&stream, &item) != 0 || failed;
    if (last) {
        flush();
    }
}

void OggWriter::closeFullPages() {
    ogg_page page;
    while (ogg_stream_pageout_fill(&stream, &page, pageFill) != 0) {
        append(page);
    }
}

void OggWriter::flush() {
    ogg_page page;
    while (ogg_stream_flush_fill(&stream, &page, PAGE_BYTES_MAX) != 0) {
        append(page);
    }
}

void OggWriter::take(std::size_t maxBytes, std::vector<unsigned char>& bytes) {
    const std::size_t count = std::min(maxBytes, getSize());
    const auto first = pages.begin() + static_cast<std::ptrdiff_t>(taken);
    bytes.assign(first, first + static_cast<std::ptrdiff_t>(count));
    taken += count;
    if (taken == pages.size()) {
        pages.clear();
        taken = 0;
    }
}

void OggWriter::append(const ogg_page& page) {
    pages.insert(pages.end(), page.header, page.header + page.header_len);
    pages.insert(pages.end(), page.body, page.body + page.body_len);
}

}  // namespace Sound
