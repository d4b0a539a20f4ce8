#include "core/sound/OggSpeexEncoder.h"

#include <algorithm>
#include <cstdint>
#include <string>
#include <vector>

#include "core/sound/BufferPool.h"
#include "pal/kd_log.h"
#include "sound/OggWriter.h"
#include "sound/SpeexCoder.h"

namespace Sound {

namespace {

const int QUALITY_MIN = 0;
const int QUALITY_MAX = 10;
const char VENDOR[] = "Korvel Talvox";

bool isUsable(const SoundDataInfo& info) {
    return info.getCodec() == SoundDataInfo::NONE && info.getChannelCount() == 1 &&
           info.getSampleSize() == 2 && info.getSampleRate() > 0;
}

bool isSameFormat(const SoundDataInfo& a, const SoundDataInfo& b) {
    return a.getCodec() == b.getCodec() && a.getChannelCount() == b.getChannelCount() &&
           a.getSampleSize() == b.getSampleSize() && a.getSampleRate() == b.getSampleRate();
}

void logFormat(const char* text, const SoundDataInfo& info) {
    kdLogFormatMessage("OggSpeexEncoder: %s: codec %d, %d channels, %d Hz, %d bytes a sample", text,
                       static_cast<int>(info.getCodec()), info.getChannelCount(),
                       info.getSampleRate(), info.getSampleSize());
}

void appendLittleEndian(std::vector<unsigned char>& bytes, uint32_t value) {
    for (int shift = 0; shift < 32; shift += 8) {
        bytes.push_back(static_cast<unsigned char>(value >> shift & 0xFFU));
    }
}

/** The comment packet: who encoded, and no comments. */
std::vector<unsigned char> makeComment() {
    const std::string vendor(VENDOR);
    std::vector<unsigned char> packet;
    appendLittleEndian(packet, static_cast<uint32_t>(vendor.size()));
    packet.insert(packet.end(), vendor.begin(), vendor.end());
    appendLittleEndian(packet, 0);
    return packet;
}

}  // namespace

class OggSpeexEncoder::Impl {
  public:
    Impl(const SoundDataInfo& format, int quality, int pageFillBytes)
        : info(format), writer(pageFillBytes) {
        if (!isUsable(format)) {
            logFormat("cannot encode this format", format);
            return;
        }
        coder.reset(new SpeexCoder(format.getSampleRate(),
                                   std::min(std::max(quality, QUALITY_MIN), QUALITY_MAX)));
        if (!coder->isReady()) {
            kdLogFormatMessage("OggSpeexEncoder: no memory for an encoder");
            coder.reset();
            hasNoCoder = true;
        }
    }

    void encode(const SoundDataBuffer& buffer) {
        if (!accepts(buffer)) {
            return;
        }
        const std::vector<unsigned char>& bytes = buffer.getData();
        for (std::size_t i = 0; i + 1 < bytes.size(); i += 2) {
            frame.push_back(static_cast<int16_t>(bytes[i] | bytes[i + 1] << 8));
            ++sampleCount;
            if (frame.size() == frameSize()) {
                writeFrame();
            }
        }
    }

    bool hasFailed() const { return hasNoCoder || writer.hasFailed(); }

    boost::shared_ptr<SoundDataBuffer> takeOutput(int maxBytes) {
        if (!headersWritten && !finished) {
            return boost::shared_ptr<SoundDataBuffer>();
        }
        const std::size_t count =
            maxBytes < 0 ? writer.getSize() : static_cast<std::size_t>(maxBytes);
        boost::shared_ptr<SoundDataBuffer> output =
            outputs.take(SoundDataInfo(SoundDataInfo::SPEEX, 1, info.getSampleRate(), 2));
        writer.take(count, output->getData());
        return output;
    }

    void finish() {
        if (finished) {
            return;
        }
        finished = true;
        if (!coder) {
            return;
        }
        if (sampleCount == 0) {
            writeHeaders(true);
            return;
        }
        // A decoder cuts its lag off at the first page and the padding off at the last one: where
        // the sound allows it, these are not the same page.
        writer.flush();
        while (!isComplete()) {
            frame.resize(frameSize(), 0);
            writeFrame();
            if (frameCount == 1 && coveredCount() <= sampleCount) {
                writer.flush();
            }
        }
    }

  private:
    bool accepts(const SoundDataBuffer& buffer) {
        if (finished) {
            kdLogFormatMessage("OggSpeexEncoder: sound after the end is ignored");
            return false;
        }
        if (!coder) {
            return false;
        }
        if (!isSameFormat(buffer.getInfo(), info)) {
            logFormat("sound of another format is ignored", buffer.getInfo());
            return false;
        }
        return true;
    }

    std::size_t frameSize() const { return static_cast<std::size_t>(coder->getFrameSize()); }

    /** Samples that the packets so far cover, counted as granule positions are. */
    int64_t coveredCount() const {
        return frameCount * coder->getFrameSize() - coder->getLookAhead();
    }

    /** True when a decoder, which lags behind a little more, has got the last sample as well. */
    bool isComplete() const { return coveredCount() - coder->getDecoderLag() >= sampleCount; }

    void writeHeaders(bool last) {
        writer.write(coder->makeHeader(), 0, false);
        writer.flush();
        writer.write(makeComment(), 0, last);
        writer.flush();
        headersWritten = true;
    }

    void writeFrame() {
        if (!headersWritten) {
            writeHeaders(false);
        }
        const std::vector<unsigned char>& packet = coder->encodeFrame(frame.data());
        frame.clear();
        ++frameCount;
        if (finished) {
            writer.write(packet, std::min(coveredCount(), sampleCount), isComplete());
        } else {
            writer.write(packet, coveredCount(), false);
            writer.closeFullPages();
        }
    }

    const SoundDataInfo info;
    OggWriter writer;
    BufferPool outputs;
    boost::scoped_ptr<SpeexCoder> coder;
    bool hasNoCoder = false;
    std::vector<int16_t> frame;
    int64_t sampleCount = 0;
    int64_t frameCount = 0;
    bool headersWritten = false;
    bool finished = false;
};

OggSpeexEncoder::OggSpeexEncoder(const SoundDataInfo& info, int quality, int pageFillBytes)
    : impl(new Impl(info, quality, pageFillBytes)) {}

OggSpeexEncoder::~OggSpeexEncoder() = default;

void OggSpeexEncoder::encode(const SoundDataBuffer& buffer) {
    impl->encode(buffer);
}

boost::shared_ptr<SoundDataBuffer> OggSpeexEncoder::takeOutput(int maxBytes) {
    return impl->takeOutput(maxBytes);
}

void OggSpeexEncoder::finish() {
    impl->finish();
}

bool OggSpeexEncoder::hasFailed() const {
    return impl->hasFailed();
}

}  // namespace Sound
