/**
 * @file
 * Marks the delivery of an event for a session's observer.
 */
#pragma once

#include <boost/shared_ptr.hpp>

#include "talvox/SessionObserver.h"

namespace Talvox {

/** Lives as long as listeners are called. Does nothing without an observer. */
class EventMark {
  public:
    EventMark(const boost::shared_ptr<SessionObserver>& sessionObserver, const ObservedEvent& event)
        : observer(sessionObserver) {
        if (observer) {
            observer->onEventBegin(event);
        }
    }
    ~EventMark() {
        if (observer) {
            observer->onEventEnd();
        }
    }
    EventMark(const EventMark&) = delete;
    EventMark& operator=(const EventMark&) = delete;

  private:
    // Owned: a listener may drop the session.
    const boost::shared_ptr<SessionObserver> observer;
};

}  // namespace Talvox
