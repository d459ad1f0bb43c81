// A thread's message queue, guarded by a leaf lock: no trace, wait or other lock comes under it.
// Whether the owner has to wait depends only on a count of permits: sending adds one, receiving
// uses one up. The semaphore on which it waits carries no count; a post only tells it to look
// again, so one that comes late or twice is harmless. Private.
#ifndef VARNEK_SOURCE_MESSAGEQUEUE_H
#define VARNEK_SOURCE_MESSAGEQUEUE_H

#include <errno.h>
#include <limits.h>
#include <semaphore.h>
#include <stdlib.h>
#include <string.h>

#include <utility>

#include "Varnek_ListLink.h"
#include "Varnek_Lock.h"
#include "Varnek_Thread.h"

class MessageQueue {
  public:
    // A message in one block with its node. Whoever takes it out of the queue frees it.
    struct Queued {
        list_node_t node;
        THREAD_MSG message;
    };

    struct Pushed {
        bool isOpen;      // whether the queue belongs to the handle; if not, nothing has happened
        int error;        // the post's, or EOVERFLOW if no permit could be added; 0 for none
        int32_t permits;  // with the one for this message
    };

    struct Taken {
        bool isOpen;       // whether the queue belongs to the handle
        bool isPermitted;  // whether there was a permit; it is used up
        int32_t permits;   // before that
        int error;         // of the wait, if nothing else ended it; 0 for none
        Queued *queued;    // the message, null for none
        int32_t left;      // messages behind it
    };

    struct Closed {
        list_t unread;  // the caller frees the blocks
        sem_t *waiter;  // to post once the caller holds no lock; null for none
    };

    // The queue belongs to the thread of this handle from here on. Until it is closed, the
    // operations below work for that handle only, so none of them reaches a later owner.
    void Open(int32_t owner) {
        const Hold hold(lock_);
        owner_ = owner;
    }

    // Leaves the queue empty and without an owner.
    Closed Close() {
        const Hold hold(lock_);
        const Closed closed = {MsgQ_, std::exchange(waiter_, nullptr)};
        MsgQ_ = {};
        owner_ = kNoOwner;
        permits_ = 0;
        return closed;
    }

    // Appends a message, or puts it in front if it is urgent, and wakes the owner if it waits. The
    // queue owns the block afterwards, if it is open. Inlined, because the modules send messages
    // all the time.
    inline __attribute__((always_inline)) Pushed Push(int32_t owner, Queued *queued,
                                                      bool isUrgent) {
        Hold hold(lock_);
        if (owner_ != owner) {
            return {};
        }
        LinkBefore(&MsgQ_, isUrgent ? MsgQ_.head : nullptr, &queued->node, &queued->message);
        if (permits_ == kMostPermits) {
            return {true, EOVERFLOW, permits_};
        }
        Pushed pushed = {true, 0, ++permits_};
        sem_t *const waiter = std::exchange(waiter_, nullptr);
        hold.Release();  // the owner takes the lock as soon as it wakes
        if (waiter != nullptr) {
            pushed.error = Wake(owner, waiter);
        }
        return pushed;
    }

    // Uses up a permit and takes the first message, without waiting.
    inline __attribute__((always_inline)) Taken Take(int32_t owner) {
        const Hold hold(lock_);
        return TakeNow(owner);
    }

    // Does the same, after waiting for a permit if there is none. `own` is the owner's semaphore.
    Taken WaitAndTake(int32_t owner, uint32_t timeout, sem_t *own);

    // Takes the first message, but leaves its permit.
    Taken TakeUncounted(int32_t owner) {
        const Hold hold(lock_);
        Taken taken = {};
        taken.isOpen = owner_ == owner;
        if (taken.isOpen) {
            TakeFirst(&taken);
        }
        return taken;
    }

  private:
    static constexpr int32_t kNoOwner = 0;  // no thread has this handle
    // A thread that only peeks uses up no permits, so their number can reach this limit.
    static constexpr int32_t kMostPermits = SEM_VALUE_MAX;

    int Wake(int32_t owner, sem_t *waiter);

    Taken TakeNow(int32_t owner) VARNEK_REQUIRES(lock_) {
        Taken taken = {};
        taken.isOpen = owner_ == owner;
        if (!taken.isOpen) {
            return taken;
        }
        taken.permits = permits_;
        taken.isPermitted = permits_ > 0;
        if (taken.isPermitted) {
            permits_--;
            TakeFirst(&taken);
        }
        return taken;
    }

    void TakeFirst(Taken *taken) VARNEK_REQUIRES(lock_) {
        list_node_t *const node = MsgQ_.head;
        if (node != nullptr) {
            Unlink(&MsgQ_, node);
            taken->queued = reinterpret_cast<Queued *>(node);  // its first member
            taken->left = MsgQ_.count;
        }
    }

    Lock lock_;
    int32_t owner_ VARNEK_GUARDED_BY(lock_);
    int32_t permits_ VARNEK_GUARDED_BY(lock_);
    // The semaphore of an owner that waits and has not been posted since it last looked; else null.
    sem_t *waiter_ VARNEK_GUARDED_BY(lock_);
    list_t MsgQ_ VARNEK_GUARDED_BY(lock_);
};

#endif
