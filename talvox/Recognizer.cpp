#include "talvox/Recognizer.h"

#include <boost/make_shared.hpp>
#include <new>
#include <optional>
#include <utility>

#include "core/util/EventLock.h"
#include "pal/CallGuarded.h"
#include "pal/kd_assert.h"
#include "pal/kd_log.h"
#include "talvox/Talvox.h"

namespace Talvox {

namespace {

/** What it makes; an empty value when there is no memory. */
template <typename Make>
auto makeOrNothing(Make make) -> decltype(make()) {
    try {
        return make();
    } catch (const std::bad_alloc&) {
        return {};
    }
}

}  // namespace

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

std::optional<int> Recognizer::getErrorStatus() const {
    const Util::EventLock lock;
    return errorStatus;
}

std::optional<int> Recognizer::getDeviceError() const {
    const Util::EventLock lock;
    return deviceError;
}

void Recognizer::callOnError(SpeechError error, std::string_view reason) {
    kdLogFormatMessage("Recognizer error: %d, %s", error.getCode(), error.getErrorString().c_str());
    keepReason(reason);
    // A listener may drop the last reference, and those after it are given this recognizer too.
    const boost::shared_ptr<Recognizer> self = weak_from_this().lock();
    listeners.notify([this, error](RecognizerListener& listener) {
        korvel_pal::callGuarded([&] { listener.onError(this, error); });
    });
}

void Recognizer::keepReason(std::string_view reason) noexcept {
    errorReason.clear();
    if (reason.empty()) {
        return;
    }
    kdLogFormatMessage("Recognizer error reason: %.*s", static_cast<int>(reason.size()),
                       reason.data());
    try {
        errorReason = reason;
    } catch (const std::bad_alloc&) {
        kdLogFormatMessage("Recognizer: no memory to keep the reason");
    }
}

void Recognizer::callOnResults(const boost::shared_ptr<const RecognitionResults>& results,
                               const std::string& requestId) {
    boost::shared_ptr<const RecognitionResults> hypotheses = results;
    // Nothing but this takes memory before the listeners are called.
    const std::optional<Recognition::Outcome> outcome = makeOrNothing([&] {
        if (!KOR_ASSERT(results)) {
            hypotheses = boost::make_shared<const RecognitionResults>();
        }
        return std::make_optional(
            Recognition::decideOutcome(*hypotheses, *engine->getTalvoxSettings()));
    });
    const boost::shared_ptr<Recognizer> self = weak_from_this().lock();
    listeners.notify([&](RecognizerListener& listener) {
        korvel_pal::callGuarded([&] {
            const boost::shared_ptr<Recognition> own = makeOrNothing([&] {
                return outcome ? boost::make_shared<Recognition>(*outcome, hypotheses, requestId)
                               : boost::shared_ptr<Recognition>();
            });
            if (own) {
                listener.onResults(this, own);
            } else {
                keepReason("no memory for the results");
                listener.onError(this, SpeechError(SpeechError::ErrorUnknown));
            }
        });
    });
}

}  // namespace Talvox
