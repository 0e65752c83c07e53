// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <pthread.h>
#include <signal.h>

namespace utils {

/// Keeps signals from threads that are started in its scope, which inherit the mask. They belong to the
/// threads of the hosting program: a worker that waits in the kernel would answer them late, or interrupt a
/// write to a flash.
class SignalsBlocked {
  public:
    SignalsBlocked() {
        sigset_t signals;
        sigfillset(&signals);
        // What a thread's own mistakes raise stays, or nobody would learn where the mistake is.
        for (const int fault : {SIGSEGV, SIGBUS, SIGFPE, SIGILL, SIGTRAP, SIGABRT, SIGSYS, SIGPROF})
            sigdelset(&signals, fault);
        pthread_sigmask(SIG_BLOCK, &signals, &m_before);
    }
    ~SignalsBlocked() { pthread_sigmask(SIG_SETMASK, &m_before, nullptr); }
    SignalsBlocked(const SignalsBlocked&) = delete;
    SignalsBlocked& operator=(const SignalsBlocked&) = delete;

  private:
    sigset_t m_before{};
};

}  // namespace utils
