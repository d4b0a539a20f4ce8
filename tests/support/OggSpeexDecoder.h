/**
 * @file
 * Independent readers of Ogg Speex: a page walker of our own and the system's decoders.
 */
#pragma once

#include <cstddef>
#include <cstdint>
#include <string>
#include <vector>

namespace TestSupport {

using Bytes = std::vector<unsigned char>;

/** One page of an Ogg stream. */
struct OggPage {
    bool continued = false;
    bool first = false;
    bool last = false;
    int64_t granulePosition = 0;
    uint32_t serialNumber = 0;
    uint32_t sequenceNumber = 0;
    bool checksumRight = false;
    std::size_t sizeInBytes = 0;
    /** The packets that end on this page; none of ours spans pages. */
    std::vector<Bytes> packets;
};

/**
 * Splits a stream into its pages by the rules of RFC 3533.
 * @return all whole pages; fewer where something else than a page stands in the stream
 */
std::vector<OggPage> readOggPages(const Bytes& stream);

/** The fields of a Speex header packet that say how to decode. */
struct SpeexHeaderFields {
    bool valid = false;
    int rate = 0;
    int mode = -1;
    int channels = 0;
    int frameSize = 0;
    int framesPerPacket = 0;
};

SpeexHeaderFields readSpeexHeader(const Bytes& packet);

/** Samples that a decoder gave back. */
struct DecodedSound {
    bool decoded = false;
    std::string message; /**< what the decoder said */
    std::vector<int16_t> samples;
};

/** Decodes with the `speexdec` program. */
DecodedSound decodeWithSpeexdec(const Bytes& stream);

/**
 * Decodes with the `ffmpeg` program.
 * @param endSample -1 for whole packets; else the sound between the stream's own time stamps 0 and
 *                  this one
 */
DecodedSound decodeWithFfmpeg(const Bytes& stream, int64_t endSample = -1);

}  // namespace TestSupport
