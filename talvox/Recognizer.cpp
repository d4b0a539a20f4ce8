#include "talvox/Recognizer.h"

#include <boost/make_shared.hpp>
#include <utility>

#include "core/util/EventLock.h"
#include "pal/kd_assert.h"
#include "pal/kd_log.h"
#include "talvox/Talvox.h"

namespace Talvox {

RecognizerListener::~RecognizerListener() = default;

Recognizer::Recognizer(const Talvox* facade, boost::shared_ptr<const Settings> settings)
    : validatedSettings(std::move(settings)), engine(facade) {
    if (!KOR_ASSERT(validatedSettings)) {
        validatedSettings = boost::make_shared<const Settings>();
    }
    if (!KOR_ASSERT(engine)) {
        engine = &Talvox::getInstance();
    }
}

Recognizer::~Recognizer() = default;

void Recognizer::addListener(const boost::weak_ptr<RecognizerListener>& listener) {
    const Util::EventLock lock;
    listeners.add(listener);
}

std::string Recognizer::getErrorReason() const {
    const Util::EventLock lock;
    return errorReason;
}

void Recognizer::callOnError(SpeechError error, const std::string& reason) {
    kdLogFormatMessage("Recognizer error: %d, %s", error.getCode(), error.getErrorString().c_str());
    if (!reason.empty()) {
        kdLogFormatMessage("Recognizer error reason: %s", reason.c_str());
    }
    errorReason = reason;
    // A listener may drop the last reference, and those after it are given this recognizer too.
    const boost::shared_ptr<Recognizer> self = weak_from_this().lock();
    listeners.notify(
        [this, error](RecognizerListener& listener) { listener.onError(this, error); });
}

void Recognizer::callOnResults(const boost::shared_ptr<const RecognitionResults>& results,
                               const std::string& requestId) {
    const boost::shared_ptr<const RecognitionResults> hypotheses =
        KOR_ASSERT(results) ? results : boost::make_shared<const RecognitionResults>();
    const Recognition::Outcome outcome =
        Recognition::decideOutcome(*hypotheses, *engine->getTalvoxSettings());
    const boost::shared_ptr<Recognizer> self = weak_from_this().lock();
    listeners.notify([&](RecognizerListener& listener) {
        listener.onResults(this, boost::make_shared<Recognition>(outcome, hypotheses, requestId));
    });
}

}  // namespace Talvox
