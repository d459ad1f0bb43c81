// The table of named objects: slots, handles and names, and nothing else. Private.
//
// A handle is published once in the life of the process, so it is the one word that publishes a
// slot: what belongs to it is complete before it is stored and untouched until it is withdrawn.
// Lookups take no lock. They read the handle with acquire; for a name they read the handle again
// after the name's words, and since no handle ever comes back, the same handle twice means that the
// words in between were its own: a sequence lock whose number cannot repeat. A digest of each name
// tells where that is worth its barriers.
//
// A thread that changes the table holds the family's guard. The table is zero when the library is
// loaded.
#ifndef VARNEK_SOURCE_SLOTTABLE_H
#define VARNEK_SOURCE_SLOTTABLE_H

#include <stddef.h>
#include <stdint.h>
#include <string.h>

#include <atomic>

#include "Varnek_Support.h"

constexpr int32_t kInvalidHandle = -1;
constexpr size_t kNameSize = 32;  // with the terminator

template <typename Info, int capacity>
class SlotTable {
  public:
    // A line of the cache each, so that threads at neighbouring slots do not slow each other.
    struct alignas(64) Slot {
        std::atomic<int32_t> handle;
        Info info;

        // Whether the slot still belongs to this handle.
        bool Has(int32_t wanted, std::memory_order order) const {
            return handle.load(order) == wanted;
        }
    };

    // The slot of a live handle, null for none. One look when the hint is right, a scan when it is
    // not: for an unknown handle, and when another handle has the same place among the hints.
    // Read with `order`; with relaxed, what belongs to the slot may not be looked at yet.
    Slot *Find(int32_t handle, std::memory_order order = std::memory_order_acquire) {
        if (handle <= kFree) {
            return nullptr;
        }
        Slot *hint = &slots_[HintOf(handle).load(std::memory_order_relaxed)];
        return __builtin_expect(hint->Has(handle, order), 1) ? hint : Scan(handle, hint);
    }

    // The handle of the lowest live slot of this name, kInvalidHandle for none and for null.
    int32_t FindByName(const char *name) const {
        const size_t length = name != nullptr ? LengthWithin(name, kNameSize) : kNameSize;
        if (length == kNameSize) {
            return kInvalidHandle;
        }
        const PackedName wanted(name, length);
        const uint32_t digest = wanted.Digest();
        for (const std::atomic<uint32_t> &candidate : digests_) {
            if (candidate.load(std::memory_order_relaxed) == digest) {
                const int32_t handle = HandleOfName(&candidate - digests_, wanted);
                if (handle != kFree) {
                    return handle;
                }
            }
        }
        return kInvalidHandle;
    }

    // The number of a slot in the log: from 0 on, -1 for null.
    int NumberOf(const Slot *slot) const {
        return slot != nullptr ? static_cast<int>(slot - slots_) : -1;
    }

    // The slots in use. Exact for the holder of the guard, a moment old for any other thread.
    int32_t Count() const { return count_.load(std::memory_order_relaxed); }

    // The lowest slot that a new object may take, after `last` where that is given. Null for none,
    // and for good once every handle has been given out.
    Slot *FirstFree(const Slot *last = nullptr) {
        for (int slot = NumberOf(last) + 1; slot < capacity && HasHandles(); slot++) {
            if (slots_[slot].Has(kFree, std::memory_order_relaxed)) {
                return &slots_[slot];
            }
        }
        return nullptr;
    }

    // Whether there is a handle left to give out.
    bool HasHandles() const { return given_ < INT32_MAX; }

    // The handle that the next publication gives out.
    int32_t NextHandle() const { return given_ + 1; }

    // Makes a free slot visible under a name of at most 31 characters. The slot's Info is complete
    // by now. Returns its handle.
    int32_t Publish(Slot *slot, const char *name) {
        const int32_t handle = ++given_;
        StoreName(NumberOf(slot), PackedName(name, LengthWithin(name, kNameSize - 1)));
        HintOf(handle).store(static_cast<uint32_t>(NumberOf(slot)), std::memory_order_relaxed);
        slot->handle.store(handle, std::memory_order_release);
        count_.fetch_add(1, std::memory_order_relaxed);
        return handle;
    }

    // Makes the slot invisible; its Info may be taken apart now. Returns how many are left in use.
    int32_t Withdraw(Slot *slot) {
        slot->handle.store(kFree, std::memory_order_relaxed);
        digests_[NumberOf(slot)].store(0, std::memory_order_relaxed);
        return count_.fetch_sub(1, std::memory_order_relaxed) - 1;
    }

  protected:
    // As if so many handles had been given out.
    void SkipHandles(int32_t given) { given_ = given; }

  private:
    static constexpr int32_t kFree = 0;
    static constexpr size_t kNameWords = kNameSize / sizeof(uint32_t);
    static constexpr size_t kHints = 256;
    static constexpr size_t kSlots = static_cast<size_t>(capacity);

    // A name as words, up to the one that holds its terminator: what lies behind does not count.
    struct PackedName {
        PackedName(const char *name, size_t length) : used(length / sizeof(uint32_t) + 1) {
            words[used - 1] = 0;
            memcpy(words, name, length);
        }
        // Never 0, which is no name's.
        uint32_t Digest() const {
            uint32_t digest = 0;
            for (size_t i = 0; i < used; i++) {
                digest = digest * 31 + words[i];
            }
            return digest | 1;
        }
        const size_t used;
        uint32_t words[kNameWords];
    };

    // Kept out of line, so that it does not weigh on the lookups that find their handle at once.
    __attribute__((noinline, cold)) Slot *Scan(int32_t handle, const Slot *hint) {
        for (Slot &slot : slots_) {
            if (!slot.Has(handle, std::memory_order_acquire)) {
                continue;
            }
            // Two live handles may share a hint, which then belongs to one of them. A hint that
            // points to no live handle of the two has been left behind, and is corrected.
            const int32_t hinted = hint->handle.load(std::memory_order_relaxed);
            if (hinted == kFree || &HintOf(hinted) != &HintOf(handle)) {
                HintOf(handle).store(static_cast<uint32_t>(NumberOf(&slot)),
                                     std::memory_order_relaxed);
            }
            return &slot;
        }
        return nullptr;
    }

    // The handle of a slot whose name is this one, kFree for another. The acquire of the first look
    // keeps the words from being older than the handle. A word that is younger was stored after the
    // fence of StoreName, which the fence here meets: then the second look finds the handle gone.
    int32_t HandleOfName(ptrdiff_t slot, const PackedName &wanted) const {
        const int32_t handle = slots_[slot].handle.load(std::memory_order_acquire);
        for (size_t i = 0; i < wanted.used; i++) {
            if (names_[slot][i].load(std::memory_order_relaxed) != wanted.words[i]) {
                return kFree;
            }
        }
        std::atomic_thread_fence(std::memory_order_acquire);
        return slots_[slot].Has(handle, std::memory_order_relaxed) ? handle : kFree;
    }

    void StoreName(int slot, const PackedName &name) {
        std::atomic_thread_fence(std::memory_order_release);
        for (size_t i = 0; i < name.used; i++) {
            names_[slot][i].store(name.words[i], std::memory_order_relaxed);
        }
        digests_[slot].store(name.Digest(), std::memory_order_relaxed);
    }

    std::atomic<uint32_t> &HintOf(int32_t handle) {
        return hints_[static_cast<uint32_t>(handle) % kHints];
    }

    Slot slots_[kSlots];
    // hints_[handle % kHints] is the slot at which to look first; the handle found there decides.
    std::atomic<uint32_t> hints_[kHints];
    std::atomic<uint32_t> digests_[kSlots];  // of the names, 0 where there is none
    std::atomic<uint32_t> names_[kSlots][kNameWords];
    std::atomic<int32_t> count_;
    int32_t given_;  // handles given out so far, 1 to this one; used under the guard only
};

#endif
