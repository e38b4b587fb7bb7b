// Which code calls an intrinsic, for `kastarri-profile --callers`.
#ifndef KASTARRI_PROFILE_CALLERS_H
#define KASTARRI_PROFILE_CALLERS_H

namespace profile {

// Whether callers are wanted.
bool callers_wanted();

// Begins the table of this process. What a forked one inherits is its parent's.
void begin_callers();

// Counts a call of an intrinsic from the code to which it returns.
void count_caller(unsigned intrinsic, const void* return_address);

// Forking must not leave the child a lock that another thread held.
void lock_callers();
void unlock_callers();

}  // namespace profile

#endif
