/**
 * @file
 * Threads that leave signals to the application.
 */
#pragma once

#include <pthread.h>
#include <signal.h>

namespace korvel_pal {

/**
 * Blocks all signals on the calling thread while it lives. Threads inherit that: signals belong to
 * the application's threads, and one that is started meanwhile is never the one that a handler
 * interrupts. To be destroyed on the thread that made it.
 */
class SignalsBlocked {
  public:
    SignalsBlocked() {
        sigset_t all;
        sigfillset(&all);
        pthread_sigmask(SIG_SETMASK, &all, &before);
    }
    ~SignalsBlocked() { pthread_sigmask(SIG_SETMASK, &before, nullptr); }
    SignalsBlocked(const SignalsBlocked&) = delete;
    SignalsBlocked& operator=(const SignalsBlocked&) = delete;

  private:
    sigset_t before{};
};

}  // namespace korvel_pal
