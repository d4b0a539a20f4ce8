#include "core/sound/Recorder.h"

#include <boost/make_shared.hpp>
#include <utility>

#include "core/util/EventLock.h"
#include "pal/kd_assert.h"

#if defined(__linux__) && !defined(__ANDROID__)
#include "sound/PulseRecorder.h"
#endif

namespace Sound {

namespace {

/** Stands for a device that is not there. */
class UnavailableRecorder : public Recorder {
  public:
    bool init() override { return false; }
};

// Guarded by the event lock. Never destroyed: recorders may be made until the process has gone.
Recorder::Factory& installedFactory() {
    static auto* const factory = new Recorder::Factory;
    return *factory;
}

boost::shared_ptr<Recorder> createPlatformRecorder() {
#if defined(__linux__) && !defined(__ANDROID__)
    return boost::make_shared<PulseRecorder>();
#else
    return boost::shared_ptr<Recorder>();
#endif
}

}  // namespace

RecorderListener::~RecorderListener() = default;

Recorder::Recorder() = default;

Recorder::~Recorder() = default;

void Recorder::startRecording() {
    recording = true;
}

void Recorder::stopRecording() {
    recording = false;
    ++stopCount;
}

boost::shared_ptr<Recorder> Recorder::createRecorder() {
    const Util::EventLock lock;
    // A copy, because the factory may install another one.
    const Factory factory = installedFactory();
    const boost::shared_ptr<Recorder> recorder = factory ? factory() : createPlatformRecorder();
    return recorder ? recorder : boost::make_shared<UnavailableRecorder>();
}

void Recorder::setFactory(Factory factory) {
    const Util::EventLock lock;
    installedFactory() = std::move(factory);
}

void Recorder::addListener(const boost::weak_ptr<RecorderListener>& listener) {
    listeners.add(listener);
}

void Recorder::notifyData(const boost::shared_ptr<const SoundDataBuffer>& buffer) {
    if (!KOR_ASSERT(buffer)) {
        return;
    }
    const boost::shared_ptr<Recorder> self = weak_from_this().lock();
    const unsigned stopsBefore = stopCount;
    listeners.notify([this, &buffer, stopsBefore](RecorderListener& listener) {
        if (stopCount == stopsBefore) {
            listener.onRecorderDataReceived(this, buffer);
        }
    });
}

void Recorder::notifyError() {
    const boost::shared_ptr<Recorder> self = weak_from_this().lock();
    listeners.notify([this](RecorderListener& listener) { listener.onRecorderError(this); });
}

}  // namespace Sound
