#include <exception>

#include "callback_table.h"
#include "clock.h"
#include "event_lock.h"
#include "event_loop.h"
#include "pal/kd_event.h"
#include "pal/kd_log.h"

void kdReportExceptionKOR(const char* what) {
    using namespace korvel_pal;
    const char* const text = what != nullptr ? what : "of an unknown type";
    kdLogFormatMessage("PAL: an exception ended a callback: %s", text);
    if (EventLoop::instance().isStopping()) {
        return;
    }
    const EventLockGuard lock;
    if (EventLoop::instance().isStopping()) {
        return;
    }
    try {
        CallbackTable::instance().deliverToAll(
            {Clock::now(), KD_EVENT_EXCEPTION_KOR, nullptr, nullptr, text});
    } catch (const std::exception& again) {
        kdLogFormatMessage("PAL: so did its report: %s", again.what());
    } catch (...) {
        kdLogMessage("PAL: so did its report");
    }
}
