/**
 * @file
 * Threads that leave signals to the application.
 */
#pragma once

#include <pthread.h>
#include <signal.h>

#include <initializer_list>

namespace korvel_pal {

/**
 * Blocks asynchronous signals on the calling thread while it lives. Threads started meanwhile
 * inherit the mask, so a signal sent to the process interrupts the application's threads, never
 * ours. Signals that a fault raises on the faulting thread stay open: the application's crash
 * reporter must see them on our threads, too. Destroy it on the thread that made it.
 */
class SignalsBlocked {
  public:
    SignalsBlocked() {
        sigset_t asynchronous;
        sigfillset(&asynchronous);
        for (const int fault : {SIGSEGV, SIGBUS, SIGFPE, SIGILL, SIGABRT, SIGTRAP, SIGSYS}) {
            sigdelset(&asynchronous, fault);
        }
        pthread_sigmask(SIG_BLOCK, &asynchronous, &before);
    }
    ~SignalsBlocked() { pthread_sigmask(SIG_SETMASK, &before, nullptr); }
    SignalsBlocked(const SignalsBlocked&) = delete;
    SignalsBlocked& operator=(const SignalsBlocked&) = delete;

  private:
    sigset_t before{};
};

}  // namespace korvel_pal
