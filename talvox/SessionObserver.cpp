#include "talvox/SessionObserver.h"

#include <exception>
#include <utility>

#include "core/util/EventLock.h"
#include "pal/kd_log.h"

namespace Talvox {

namespace {

// Guarded by the event lock. Never destroyed: sessions may begin until the process has gone.
SessionObserver::Factory& installedFactory() {
    static auto* const factory = new SessionObserver::Factory;
    return *factory;
}

}  // namespace

SessionObserver::~SessionObserver() = default;

void SessionObserver::setFactory(Factory factory) {
    const Util::EventLock lock;
    installedFactory() = std::move(factory);
}

boost::shared_ptr<SessionObserver> SessionObserver::make(const Recognizer& recognizer) noexcept {
    try {
        const Factory& factory = installedFactory();
        return factory ? factory(recognizer) : nullptr;
    } catch (const std::exception& exception) {
        kdLogFormatMessage("SessionObserver: a session is not observed: %s", exception.what());
        return nullptr;
    }
}

}  // namespace Talvox
