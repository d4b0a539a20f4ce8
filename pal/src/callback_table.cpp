#include "callback_table.h"

namespace korvel_pal {

CallbackTable& CallbackTable::instance() {
    static CallbackTable* const table = new CallbackTable;
    return *table;
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

}  // namespace korvel_pal

KDint kdInstallCallback(KDCallbackFunc* func, KDint eventtype, void* eventuserptr) {
    if (eventtype != KD_EVENT_TIMER) {
        return -1;
    }
    korvel_pal::CallbackTable::instance().install(func, eventtype, eventuserptr);
    return 0;
}
