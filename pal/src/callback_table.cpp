#include "callback_table.h"

#include <exception>

#include "pal/kd_log.h"

namespace korvel_pal {

CallbackTable& CallbackTable::instance() {
    static Immortal<CallbackTable> table;
    return table.get();
}

void CallbackTable::install(KDCallbackFunc* func, KDint type, void* userptr) {
    const std::lock_guard<std::mutex> lock(mutex);
    if (func == nullptr) {
        callbacks.erase({type, userptr});
    } else {
        callbacks[{type, userptr}] = func;
    }
}

void CallbackTable::deliver(const KDEvent& event) {
    KDCallbackFunc* func = nullptr;
    {
        const std::lock_guard<std::mutex> lock(mutex);
        const auto found = callbacks.find({event.type, event.userptr});
        if (found == callbacks.end()) {
            return;
        }
        func = found->second;
    }
    func(&event);
}

// By key, not by iterator: a callback may remove any registration.
void CallbackTable::deliverToAll(KDEvent event) {
    Key key(event.type, nullptr);
    for (;;) {
        KDCallbackFunc* func = nullptr;
        {
            const std::lock_guard<std::mutex> lock(mutex);
            const auto next = callbacks.upper_bound(key);
            if (next == callbacks.end() || next->first.first != event.type) {
                return;
            }
            key = next->first;
            func = next->second;
        }
        event.userptr = key.second;
        func(&event);
    }
}

}  // namespace korvel_pal

KDint kdInstallCallback(KDCallbackFunc* func, KDint eventtype, void* eventuserptr) {
    if (eventtype != KD_EVENT_TIMER && eventtype != KD_EVENT_EXCEPTION_KOR) {
        return -1;
    }
    try {
        korvel_pal::CallbackTable::instance().install(func, eventtype, eventuserptr);
    } catch (const std::exception&) {
        kdLogMessage("PAL: no memory for a callback");
        return -1;
    }
    return 0;
}
