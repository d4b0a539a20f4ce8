#include "talvox/impl/ChunkedRecognizeProtocol.h"

#include <boost/make_shared.hpp>

#include "core/sound/OggSpeexEncoder.h"
#include "core/util/EventLock.h"
#include "talvox/Log.h"

namespace Talvox {

namespace {

const int LOG_LEVEL = 2;

/** Small pages, so that encoded sound leaves the encoder every few frames. */
const int PAGE_FILL_BYTES = 512;

}  // namespace

ChunkedRecognizeProtocol::ChunkedRecognizeProtocol(const Recognizer* user)
    : RecognizeProtocol(*user), recognizer(user), useSpeex(choosesSpeex()) {}

ChunkedRecognizeProtocol::~ChunkedRecognizeProtocol() {
    const Util::EventLock lock;
    holder.cancel();
    timer.reset();
    encoder.reset();
}

void ChunkedRecognizeProtocol::handle(boost::shared_ptr<const Sound::SoundDataBuffer> buffer) {
    if (!request) {
        openRequest();
    }
    if (useSpeex) {
        encode(buffer);
        return;
    }
    const std::vector<unsigned char>& bytes = buffer->getData();
    if (!bytes.empty()) {
        tvLogFormatMessage(LOG_LEVEL, "ChunkedRecognizeProtocol writes %d bytes",
                           static_cast<int>(bytes.size()));
        request->write(bytes.data(), static_cast<unsigned>(bytes.size()));
    }
}

void ChunkedRecognizeProtocol::openRequest() {
    request = makeRequest(*recognizer, holder);
    request->chunked = true;
    request->writer = boost::make_shared<Network::NetworkTaskWriter>();
    submit(holder, request);
    request->writeBodyStart();
}

void ChunkedRecognizeProtocol::encode(
    const boost::shared_ptr<const Sound::SoundDataBuffer>& buffer) {
    if (!encoder) {
        encoder = boost::make_shared<ParallelEncoder>(
            boost::make_shared<Sound::OggSpeexEncoder>(buffer->getInfo(), getSpeexQuality(),
                                                       PAGE_FILL_BYTES),
            request);
        encoder->setObserver(getObserver());
        // The encoder belongs to the protocol and calls back only while that lives.
        encoder->setFailureCallback([this] { notifyEncodingFailed(); });
    }
    encoder->write(buffer);
}

void ChunkedRecognizeProtocol::sendRequest() {
    if (sent) {
        return;
    }
    const boost::shared_ptr<RecognizeProtocol> self = shared_from_this();
    if (!announceVoiceCaptured()) {
        return;
    }
    if (!closeRequest()) {
        notifyError(SpeechError(SpeechError::ErrorAudio), NO_SOUND_REASON);
        return;
    }
    sent = true;
    timer = startAnswerTimer(holder);
}

bool ChunkedRecognizeProtocol::closeRequest() {
    if (useSpeex) {
        if (!encoder) {
            return false;
        }
        encoder->closeWrite();
        return true;
    }
    if (!request) {
        return false;
    }
    tvLogFormatMessage(LOG_LEVEL, "ChunkedRecognizeProtocol closes request");
    request->close(true);
    return true;
}

}  // namespace Talvox
