#include "Varnek_MessageQueue.h"

#include <time.h>

#include "Varnek_Clock.h"

// Posts the semaphore of an owner that waits, without the lock. If that fails, the owner sleeps on,
// so it is noted as waiting again, and the next sender tries to wake it. It may have stopped
// waiting meanwhile; then the note costs one needless post.
int MessageQueue::Wake(int32_t owner, sem_t *waiter) {
    if (sem_post(waiter) == 0) {
        return 0;
    }
    const int error = errno;
    const Hold hold(lock_);
    if (owner_ == owner) {
        waiter_ = waiter;
    }
    return error;
}

// Nothing is lost between a look and the wait after it, because note and permits change under the
// lock: a sender adds its permit before the look, or finds the note and posts. The owner looks once
// more before it reports an error, so a message that comes as the wait ends is taken.
MessageQueue::Taken MessageQueue::WaitAndTake(int32_t owner, uint32_t timeout, sem_t *own) {
    timespec now = {};
    timespec deadline = {};
    int error = 0;
    if (timeout != WAIT_FOREVER) {
        error = clock_gettime(CLOCK_REALTIME, &now) == 0 ? 0 : errno;
        deadline = DeadlineAfter(now, timeout);
    }
    Hold hold(lock_);
    for (;;) {
        Taken taken = TakeNow(owner);
        if (!taken.isOpen) {
            return taken;  // what the queue holds is not the caller's
        }
        waiter_ = nullptr;
        if (taken.isPermitted || error != 0) {
            taken.error = taken.isPermitted ? 0 : error;
            return taken;
        }
        waiter_ = own;
        hold.Release();
        const int ended = timeout == WAIT_FOREVER ? sem_wait(own) : sem_timedwait(own, &deadline);
        error = ended == 0 ? 0 : errno;
        hold.Acquire();
    }
}
