/**
 * @file
 * What every session does when it is interrupted by an exception.
 */
#pragma once

#include <boost/shared_ptr.hpp>
#include <exception>

#include "core/util/EventLock.h"
#include "pal/kd_log.h"
#include "talvox/Recognizer.h"

namespace Talvox {

/** Why a session ends for which the event thread cannot be started. */
inline constexpr const char* NO_THREAD_REASON = "the system has no thread for the engine";

/**
 * Ends a session that an exception has interrupted. What the end itself throws is logged.
 * @param end called with the exception's text
 */
template <typename End>
void endSession(const char* what, End end) noexcept {
    kdLogFormatMessage("Recognizer: the session cannot go on: %s", what);
    try {
        end(what);
    } catch (const std::exception& exception) {
        kdLogFormatMessage("Recognizer: an exception at the end: %s", exception.what());
    } catch (...) {
        kdLogMessage("Recognizer: an exception at the end");
    }
}

/**
 * Makes a call into a session under the event lock, and keeps the session alive meanwhile. An
 * exception of the call, also of a listener, goes no further: `end` is called with its text.
 */
template <typename Call, typename End>
void enterSession(Recognizer& session, Call call, End end) noexcept {
    const Util::EventLock lock;
    const boost::shared_ptr<Recognizer> self = session.weak_from_this().lock();
    if (!self) {
        return;  // the last reference is going on another thread, and that is the end
    }
    try {
        call();
    } catch (const std::exception& exception) {
        endSession(exception.what(), end);
    } catch (...) {
        endSession("an exception of an unknown type", end);
    }
}

}  // namespace Talvox
