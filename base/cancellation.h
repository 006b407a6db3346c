/// \file
/// Threads of the host may be cancelled: what must not be left half done holds that off.
#pragma once

#include <pthread.h>

namespace VORK {

/// Holds a cancellation of the calling thread off until this object is gone. For destructors, in which being
/// cancelled ends the whole process, and for what must not be left half done.
class NoCancellation {
public:
    NoCancellation() { pthread_setcancelstate(PTHREAD_CANCEL_DISABLE, &before_); }
    ~NoCancellation() { pthread_setcancelstate(before_, nullptr); }
    NoCancellation(const NoCancellation &) = delete;
    NoCancellation &operator=(const NoCancellation &) = delete;

private:
    int before_ = PTHREAD_CANCEL_ENABLE;
};

}  // namespace VORK
