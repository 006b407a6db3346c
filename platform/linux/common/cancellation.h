// Threads of the host may be cancelled.
#ifndef PLATFORM_LINUX_COMMON_CANCELLATION_H
#define PLATFORM_LINUX_COMMON_CANCELLATION_H

#include <pthread.h>

namespace VORK::PLATFORM {

/// While it lives the thread is not cancelled: a cancellation waits for the next point after it. For destructors,
/// in which being cancelled ends the whole process, and for what must not be left half done.
class CancellationOff {
public:
    CancellationOff() { pthread_setcancelstate(PTHREAD_CANCEL_DISABLE, &former_); }
    ~CancellationOff() { pthread_setcancelstate(former_, nullptr); }
    CancellationOff(const CancellationOff &) = delete;
    CancellationOff &operator=(const CancellationOff &) = delete;

private:
    int former_ = PTHREAD_CANCEL_ENABLE;
};

}  // namespace VORK::PLATFORM

#endif
