#include "talvox/DummyRecognizer.h"

#include "core/util/EventLock.h"

namespace Talvox {

DummyRecognizer::DummyRecognizer(const Talvox* facade,
                                 const boost::shared_ptr<const Settings>& settings)
    : Recognizer(facade, settings) {}

DummyRecognizer::~DummyRecognizer() = default;

void DummyRecognizer::start() {
    const Util::EventLock lock;
    callOnError(SpeechError::ErrorNotAvailable);
}

void DummyRecognizer::stop() {
    const Util::EventLock lock;
    callOnError(SpeechError::ErrorNotAvailable);
}

void DummyRecognizer::cancel() {
    const Util::EventLock lock;
    callOnError(SpeechError::ErrorCanceled);
}

}  // namespace Talvox
