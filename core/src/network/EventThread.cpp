#include "network/EventThread.h"

#include <memory>
#include <utility>

#include "pal/kd_event.h"

namespace Network {

namespace {

void runAndDelete(void* user) {
    const std::unique_ptr<std::function<void()>> function(
        static_cast<std::function<void()>*>(user));
    (*function)();
}

}  // namespace

void postToEventThread(std::function<void()> function) {
    kdPostKOR(&runAndDelete,
              std::make_unique<std::function<void()>>(std::move(function)).release());
}

}  // namespace Network
