#include "talvox/impl/ExceptionWatch.h"

#include <new>

namespace Talvox {

ExceptionWatch::ExceptionWatch(Owner& owner) : target(owner) {
    if (kdInstallCallback(&ExceptionWatch::deliver, KD_EVENT_EXCEPTION_KOR, this) != 0) {
        throw std::bad_alloc();
    }
}

ExceptionWatch::~ExceptionWatch() {
    kdInstallCallback(nullptr, KD_EVENT_EXCEPTION_KOR, this);
}

void ExceptionWatch::deliver(const KDEvent* event) {
    static_cast<ExceptionWatch*>(event->userptr)->target.onException(event->text);
}

}  // namespace Talvox
