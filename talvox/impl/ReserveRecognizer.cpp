#include "talvox/impl/ReserveRecognizer.h"

#include <utility>

#include "core/util/EventLock.h"
#include "pal/CallGuarded.h"

namespace Talvox {

ReserveRecognizer::ReserveRecognizer(const Talvox* facade,
                                     boost::shared_ptr<const Settings> settings)
    : Recognizer(facade, std::move(settings)) {}

ReserveRecognizer::~ReserveRecognizer() = default;

void ReserveRecognizer::assign(const boost::weak_ptr<RecognizerListener>& listener) noexcept {
    listeners = {};
    firstListener = listener;
    over = false;
    forgetReason();
}

void ReserveRecognizer::start() {
    end(SpeechError::ErrorUnknown, "no memory for a recognizer");
}

void ReserveRecognizer::stop() {}

void ReserveRecognizer::cancel() {
    end(SpeechError::ErrorCanceled, "the application cancelled");
}

void ReserveRecognizer::end(SpeechError error, std::string_view reason) {
    const Util::EventLock lock;
    if (std::exchange(over, true)) {
        return;
    }
    const boost::shared_ptr<Recognizer> self = shared_from_this();
    callOnError(error, reason);
    if (const boost::shared_ptr<RecognizerListener> listener = firstListener.lock()) {
        korvel_pal::callGuarded([&] { listener->onError(this, error); });
    }
}

}  // namespace Talvox
