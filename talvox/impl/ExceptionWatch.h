/**
 * @file
 * What a session learns of exceptions that ended a callback.
 */
#pragma once

#include "pal/kd_event.h"

namespace Talvox {

/**
 * Calls its owner when an exception has ended a callback on one of the engine's threads (see
 * `kdReportExceptionKOR`). Nothing can say what that callback still had to do, so the owner's
 * session must not wait for it.
 */
class ExceptionWatch {
  public:
    class Owner {
      public:
        /** Under the event lock. @param what the exception's text */
        virtual void onException(const char* what) = 0;

      protected:
        ~Owner() = default;
    };

    /** Begins to watch. Throws `std::bad_alloc` when there is no memory for that. */
    explicit ExceptionWatch(Owner& owner);
    /** To be destroyed under the event lock; the owner is not called afterwards. */
    ~ExceptionWatch();
    ExceptionWatch(const ExceptionWatch&) = delete;
    ExceptionWatch& operator=(const ExceptionWatch&) = delete;

  private:
    static void deliver(const KDEvent* event);

    Owner& target;
};

}  // namespace Talvox
