// Signals that wait while a lock is held.
#ifndef KASTARRI_PROFILE_SIGNALS_H
#define KASTARRI_PROFILE_SIGNALS_H

#include <csignal>

namespace profile {

// While it lives, signals of the thread wait: a handler that calls an intrinsic would wait for ever for a lock that the
// code behind it holds.
class SignalsWait {
 public:
  SignalsWait() {
    sigset_t all;
    sigfillset(&all);
    pthread_sigmask(SIG_BLOCK, &all, &before_);
  }
  ~SignalsWait() { pthread_sigmask(SIG_SETMASK, &before_, nullptr); }
  SignalsWait(const SignalsWait&) = delete;
  SignalsWait& operator=(const SignalsWait&) = delete;

 private:
  sigset_t before_;
};

}  // namespace profile

#endif
