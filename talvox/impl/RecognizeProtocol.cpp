#include "talvox/impl/RecognizeProtocol.h"

#include <boost/make_shared.hpp>

#include "core/network/NetworkManager.h"
#include "pal/kd.h"
#include "talvox/Talvox.h"
#include "talvox/impl/ChunkedRecognizeProtocol.h"
#include "talvox/impl/SimpleRecognizeProtocol.h"

namespace Talvox {

namespace {

const int RETRY_DELAY_MS = 2000;
const int RETRY_ATTEMPTS = 2;
const int64_t ANSWER_TIMEOUT_NS = 20LL * 1000 * 1000 * 1000;

}  // namespace

RecognizeProtocol::RecognizeProtocol(const Recognizer& recognizer)
    : engineSettings(recognizer.getEngine()->getTalvoxSettings()) {}

RecognizeProtocol::~RecognizeProtocol() = default;

boost::shared_ptr<RecognizeProtocol> RecognizeProtocol::create(const Recognizer* recognizer,
                                                               const std::string& type) {
    if (type == "chunked") {
        return boost::make_shared<ChunkedRecognizeProtocol>(recognizer);
    }
    if (type != "simple") {
        kdLogFormatMessage("RecognizeProtocol: unknown type %s", type.c_str());
    }
    return boost::make_shared<SimpleRecognizeProtocol>(recognizer);
}

void RecognizeProtocol::addListener(const boost::weak_ptr<RecognizeProtocolListener>& listener) {
    listeners.add(listener);
}

void RecognizeProtocol::abandon() {
    abandoned = true;
}

void RecognizeProtocol::notifyError(SpeechError error, const std::string& reason) {
    errorReason = reason;
    listeners.notify(
        [&error](RecognizeProtocolListener& listener) { listener.onProtocolError(error); });
}

void RecognizeProtocol::notifyEncodingFailed() {
    if (!abandoned) {
        const boost::shared_ptr<RecognizeProtocol> self = shared_from_this();
        notifyError(SpeechError(SpeechError::ErrorEncoding), "the sound could not be encoded");
    }
}

bool RecognizeProtocol::announceVoiceCaptured() {
    if (abandoned || announcing) {
        return false;
    }
    announcing = true;
    listeners.notify(
        [](RecognizeProtocolListener& listener) { listener.onProtocolVoiceCaptured(); });
    announcing = false;
    return !abandoned;
}

bool RecognizeProtocol::choosesSpeex() const {
    const std::string& format = engineSettings->getString(Settings::SKS_SOUND_FORMAT);
    if (format == Settings::SOUND_FORMAT_SPEEX) {
        return true;
    }
    return format == Settings::SOUND_FORMAT_PCM_IF_WIFI &&
           Network::NetworkManager::getInstance().getReachability() !=
               Network::NetworkManager::WIFI;
}

int RecognizeProtocol::getSpeexQuality() const {
    return engineSettings->getInt(Settings::SKS_SPEEX_QUALITY);
}

boost::shared_ptr<RecognizeRequest> RecognizeProtocol::makeRequest(
    const Recognizer& recognizer, Network::NetworkTaskHolder& holder) {
    auto request = boost::make_shared<RecognizeRequest>(*engineSettings, *recognizer.getSettings());
    request->observer = observer;
    lastRequest = request;
    const boost::weak_ptr<RecognizeProtocol> weakSelf = shared_from_this();
    const boost::weak_ptr<RecognizeRequest> weakRequest = request;
    request->callback = [weakSelf, weakRequest, &holder](
                            const boost::shared_ptr<const RecognitionResults>& results,
                            const std::string& requestId) {
        const boost::shared_ptr<RecognizeRequest> finished = weakRequest.lock();
        // The holder is the protocol's own and lives as long.
        if (const boost::shared_ptr<RecognizeProtocol> self = weakSelf.lock()) {
            self->onNetworkRequestFinished(holder, results, requestId, finished);
        }
    };
    return request;
}

void RecognizeProtocol::submit(Network::NetworkTaskHolder& holder,
                               const boost::shared_ptr<RecognizeRequest>& request) {
    holder.submit(request, boost::make_shared<Network::NetworkTaskBasicRetryPolicy>(
                               RETRY_DELAY_MS, RETRY_ATTEMPTS, false));
}

boost::shared_ptr<Util::Timer> RecognizeProtocol::startAnswerTimer(
    Network::NetworkTaskHolder& holder) {
    // The timer belongs to the protocol, so its function never runs after the protocol's end.
    auto timer =
        boost::make_shared<Util::Timer>([this, &holder] { onNetworkRequestTimeout(holder); });
    timer->start(KD_TIMER_ONESHOT, ANSWER_TIMEOUT_NS);
    return timer;
}

void RecognizeProtocol::onNetworkRequestFinished(
    Network::NetworkTaskHolder& holder, const boost::shared_ptr<const RecognitionResults>& results,
    const std::string& requestId, const boost::shared_ptr<const RecognizeRequest>& request) {
    if (abandoned) {
        return;
    }
    const boost::shared_ptr<RecognizeProtocol> self = shared_from_this();
    holder.onFinished();
    if (!results) {
        errorStatus = request ? request->getStatus() : std::nullopt;
        notifyError(SpeechError(SpeechError::ErrorNetwork),
                    request ? request->getNoResultsReason() : std::string());
        return;
    }
    listeners.notify([&results, &requestId](RecognizeProtocolListener& listener) {
        listener.onProtocolResults(results, requestId);
    });
}

std::string RecognizeProtocol::describeTimeout() const {
    const boost::shared_ptr<RecognizeRequest> request = lastRequest.lock();
    const std::string earlier = request ? request->getFailureReason() : std::string();
    const std::string reason = "no answer within 20 s";
    return earlier.empty() ? reason : reason + "; the first attempt failed: " + earlier;
}

void RecognizeProtocol::onNetworkRequestTimeout(Network::NetworkTaskHolder& holder) {
    if (abandoned) {
        return;
    }
    const boost::shared_ptr<RecognizeProtocol> self = shared_from_this();
    kdLogFormatMessage("Recognition request timeout");
    const std::string reason = describeTimeout();
    holder.cancel();
    notifyError(SpeechError(SpeechError::ErrorNetwork), reason);
}

}  // namespace Talvox
