#include "talvox/DummyRecognizer.h"

#include "core/util/EventLock.h"

namespace Talvox {

namespace {

const char* const REASON = "settings and platform leave no recognition mechanism";

}  // namespace

DummyRecognizer::DummyRecognizer(const Talvox* facade,
                                 const boost::shared_ptr<const Settings>& settings)
    : Recognizer(facade, settings) {}

DummyRecognizer::~DummyRecognizer() = default;

void DummyRecognizer::start() {
    const Util::EventLock lock;
    callOnError(SpeechError::ErrorNotAvailable, REASON);
}

void DummyRecognizer::stop() {
    const Util::EventLock lock;
    callOnError(SpeechError::ErrorNotAvailable, REASON);
}

void DummyRecognizer::cancel() {
    const Util::EventLock lock;
    callOnError(SpeechError::ErrorCanceled, "the application cancelled");
}

}  // namespace Talvox
