#include "talvox/impl/SimpleRecognizeProtocol.h"

#include <boost/make_shared.hpp>

#include "core/sound/OggSpeexEncoder.h"
#include "core/util/EventLock.h"
#include "pal/kd_assert.h"

namespace Talvox {

namespace {

const char* const SOURCE = "talvox/impl/SimpleRecognizeProtocol";

}  // namespace

SimpleRecognizeProtocol::SimpleRecognizeProtocol(const Recognizer* user)
    : RecognizeProtocol(*user), recognizer(user), useSpeex(choosesSpeex()) {}

SimpleRecognizeProtocol::~SimpleRecognizeProtocol() {
    const Util::EventLock lock;
    holder.cancel();
    timer.reset();
    encoder.reset();
}

void SimpleRecognizeProtocol::handle(boost::shared_ptr<const Sound::SoundDataBuffer> buffer) {
    if (!KOR_ASSERT_AT(!holder.isWorking(), "!holder.isWorking()", SOURCE, 38)) {
        return;
    }
    if (useSpeex) {
        encode(buffer);
    } else {
        append(*buffer);
    }
}

void SimpleRecognizeProtocol::encode(
    const boost::shared_ptr<const Sound::SoundDataBuffer>& buffer) {
    if (!encoder) {
        encoder = boost::make_shared<ParallelEncoder>(
            boost::make_shared<Sound::OggSpeexEncoder>(
                buffer->getInfo(), getSpeexQuality(), Sound::OggSpeexEncoder::PAGE_FILL_BYTES_DFLT),
            [this](const boost::shared_ptr<const Sound::SoundDataBuffer>& utterance) {
                makeHttpRequest(utterance);
            });
        encoder->setObserver(getObserver());
        // The encoder belongs to the protocol and calls back only while that lives.
        encoder->setFailureCallback([this] { notifyEncodingFailed(); });
    }
    encoder->write(buffer);
}

void SimpleRecognizeProtocol::append(const Sound::SoundDataBuffer& buffer) {
    if (!sound) {
        sound = boost::make_shared<Sound::SoundDataBuffer>(buffer);
        return;
    }
    std::vector<unsigned char>& bytes = sound->getData();
    bytes.insert(bytes.end(), buffer.getData().begin(), buffer.getData().end());
}

void SimpleRecognizeProtocol::sendRequest() {
    if (sent) {
        return;
    }
    const boost::shared_ptr<RecognizeProtocol> self = shared_from_this();
    if (!announceVoiceCaptured()) {
        return;
    }
    if (useSpeex ? !encoder : !sound) {
        notifyError(SpeechError(SpeechError::ErrorAudio), NO_SOUND_REASON);
        return;
    }
    if (useSpeex) {
        encoder->closeWrite();
    } else {
        makeHttpRequest(sound);
    }
    sent = true;
}

void SimpleRecognizeProtocol::makeHttpRequest(
    const boost::shared_ptr<const Sound::SoundDataBuffer>& utterance) {
    if (isAbandoned() || !KOR_ASSERT_AT(!holder.isWorking(), "!holder.isWorking()", SOURCE, 85)) {
        return;
    }
    const boost::shared_ptr<RecognizeRequest> request = makeRequest(*recognizer, holder);
    request->sound = utterance;
    submit(holder, request);
    timer = startAnswerTimer(holder);
}

}  // namespace Talvox
