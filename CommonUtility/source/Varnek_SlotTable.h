// The table of named objects. It manages slots, handles and names, and nothing else. Private.
//
// Each handle is given to one object only and is never given out again. A creation completes the
// name of its slot and the Info, which is the data of the object, and then stores the handle, which
// makes the slot visible. The name does not change until the handle is cleared. Lookups take no
// lock. A lookup by handle reads the handle with acquire, unless its caller asks for a relaxed
// read. A lookup by name reads the handle, the words of the name, and the handle again. If both
// reads return the same handle, the words in between belong to that handle, because no handle is
// given out twice. This is a sequence lock whose sequence number cannot repeat. Each name has a
// digest. A lookup by name compares the digests first, so that it executes barriers only where the
// name probably matches.
//
// A handle does not contain the index of its slot. So that a lookup by handle rarely has to scan
// the slots, the table has 256 hints: the hint at handle % 256 is the index of the slot to check
// first. A hint may be stale, or belong to another handle with the same remainder. So the lookup
// compares the handle in that slot. If it is another one, the lookup scans all slots and corrects a
// stale hint.
//
// A thread that changes the table holds the lock that guards it. Only hints are corrected without
// the lock. A table of zero bytes is empty, so it needs no initialisation.
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
    // Each slot has its own cache lines, so that threads that use neighbouring slots do not slow
    // each other down.
    struct alignas(64) Slot {
        std::atomic<int32_t> handle;
        Info info;

        // Whether the slot still belongs to this handle.
        bool Has(int32_t wanted, std::memory_order order) const {
            return handle.load(order) == wanted;
        }
    };

    // Returns the slot of a live handle, null for none. It reads one slot if the hint is right, and
    // scans all slots if not. The handle is read with `order`. A relaxed read does not make the
    // Info visible, so it is only for a caller to which the Info is visible already, for example
    // because it was complete before the calling thread started.
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

    // The number that a slot has in the log: 0 for the first, -1 for null.
    int NumberOf(const Slot *slot) const {
        return slot != nullptr ? static_cast<int>(slot - slots_) : -1;
    }

    // The number of slots in use. For the holder of the guard it is exact; for any other thread it
    // may have changed.
    int32_t Count() const { return count_.load(std::memory_order_relaxed); }

    // Returns the lowest free slot, or with `last` the lowest one after that. Null for none, and
    // always null once every handle has been given out.
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

    // Makes a free slot visible under a name of at most 31 characters. The slot's Info must be
    // complete. Returns its handle.
    int32_t Publish(Slot *slot, const char *name) {
        const int32_t handle = ++given_;
        StoreName(NumberOf(slot), PackedName(name, LengthWithin(name, kNameSize - 1)));
        HintOf(handle).store(static_cast<uint32_t>(NumberOf(slot)), std::memory_order_relaxed);
        count_.fetch_add(1, std::memory_order_relaxed);
        slot->handle.store(handle, std::memory_order_release);
        return handle;
    }

    // Makes the slot invisible. Returns the number of slots that remain in use.
    int32_t Withdraw(Slot *slot) {
        slot->handle.store(kFree, std::memory_order_relaxed);
        digests_[NumberOf(slot)].store(0, std::memory_order_relaxed);
        return count_.fetch_sub(1, std::memory_order_relaxed) - 1;
    }

  protected:
    // Continues as if `given` handles had been given out. Tests use it to reach the last handles.
    void SkipHandles(int32_t given) { given_ = given; }

  private:
    static constexpr int32_t kFree = 0;
    static constexpr size_t kNameWords = kNameSize / sizeof(uint32_t);
    static constexpr size_t kHints = 256;
    static constexpr size_t kSlots = static_cast<size_t>(capacity);

    // A name as words, up to the word that contains its terminator. The words after that are not
    // compared.
    struct PackedName {
        PackedName(const char *name, size_t length) : used(length / sizeof(uint32_t) + 1) {
            words[used - 1] = 0;
            memcpy(words, name, length);
        }
        // Never 0, which stands for no name.
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

    // Out of line, so that a lookup that finds its handle at once does not have to save registers.
    __attribute__((noinline, cold)) Slot *Scan(int32_t handle, const Slot *hint) {
        for (Slot &slot : slots_) {
            if (!slot.Has(handle, std::memory_order_acquire)) {
                continue;
            }
            // Two live handles may share a hint. A hint that points to the other one is not
            // changed. A hint that points to neither is stale and is corrected.
            const int32_t hinted = hint->handle.load(std::memory_order_relaxed);
            if (hinted == kFree || &HintOf(hinted) != &HintOf(handle)) {
                HintOf(handle).store(static_cast<uint32_t>(NumberOf(&slot)),
                                     std::memory_order_relaxed);
            }
            return &slot;
        }
        return nullptr;
    }

    // Returns the handle of a slot if this is its name, kFree otherwise. The words are not older
    // than the handle, because the first read of the handle acquires. If a word is newer, it was
    // stored after the fence in StoreName. That fence pairs with the fence here, so the second read
    // does not find the handle any more.
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
    // hints_[handle % kHints] is the index of the slot to check first.
    std::atomic<uint32_t> hints_[kHints];
    std::atomic<uint32_t> digests_[kSlots];  // of the names; 0 in a free slot
    std::atomic<uint32_t> names_[kSlots][kNameWords];
    std::atomic<int32_t> count_;
    int32_t given_;  // the last handle given out; the first is 1; used under the guard only
};

#endif
