// The table of named objects: slots, handles and names, and nothing else. A handle is given out
// only once, so storing it publishes its slot, and a lookup without a lock trusts what it reads
// while the handle stays the same. Whoever changes the table holds its guard. A zeroed table is
// empty. Private.
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

    // Returns the slot of a live handle, null for none: one read if the hint is right, else a scan.
    // Acquire pairs with the release in Publish and makes the Info visible as it was published;
    // relaxed is for a caller that sees it already, as a thread sees its own record, or that uses
    // only what a lock in the Info guards, as a sender does.
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
        // The last word is compared here, because similar names usually differ at the end.
        const PackedName wanted(name, length);
        const size_t last = wanted.used - 1;
        for (size_t slot = 0; slot < kSlots; slot++) {
            if (names_[slot][last].load(std::memory_order_relaxed) == wanted.words[last]) {
                const int32_t handle = HandleOfName(slot, wanted);
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

    // Returns the lowest free slot. Null for none, and always null once every handle has been given
    // out.
    Slot *FirstFree() {
        for (Slot &slot : slots_) {
            if (given_ < INT32_MAX && slot.Has(kFree, std::memory_order_relaxed)) {
                return &slot;
            }
        }
        return nullptr;
    }

    // The handle that Publish gives out next.
    int32_t NextHandle() const { return given_ + 1; }

    // Makes a free slot visible under a name of at most 31 characters. The slot's Info must be
    // complete. Returns its handle.
    int32_t Publish(Slot *slot, const char *name) {
        const int32_t handle = ++given_;
        StoreName(static_cast<size_t>(NumberOf(slot)),
                  PackedName(name, LengthWithin(name, kNameSize - 1)));
        HintOf(handle).store(static_cast<uint32_t>(NumberOf(slot)), std::memory_order_relaxed);
        count_.fetch_add(1, std::memory_order_relaxed);
        slot->handle.store(handle, std::memory_order_release);
        return handle;
    }

    // Makes the slot invisible; its name stays until the slot is published again. Returns the
    // number of slots that remain in use.
    int32_t Withdraw(Slot *slot) {
        slot->handle.store(kFree, std::memory_order_relaxed);
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
        const size_t used;
        uint32_t words[kNameWords];
    };

    // Out of line, so that a lookup that finds its handle at once does not have to save registers.
    __attribute__((noinline, cold)) Slot *Scan(int32_t handle, const Slot *hint) {
        for (Slot &slot : slots_) {
            if (!slot.Has(handle, std::memory_order_acquire)) {
                continue;
            }
            // Two live handles may share a hint. A hint that points to the other one stays as it
            // is; a hint that points to neither is stale, so it is corrected.
            const int32_t hinted = hint->handle.load(std::memory_order_relaxed);
            if (hinted == kFree || &HintOf(hinted) != &HintOf(handle)) {
                HintOf(handle).store(static_cast<uint32_t>(NumberOf(&slot)),
                                     std::memory_order_relaxed);
            }
            return &slot;
        }
        return nullptr;
    }

    // Whether the words of a slot's name are these.
    bool HasWords(size_t slot, const PackedName &wanted) const {
        for (size_t i = 0; i < wanted.used; i++) {
            if (names_[slot][i].load(std::memory_order_relaxed) != wanted.words[i]) {
                return false;
            }
        }
        return true;
    }

    // Returns the handle of a slot if this is its name, kFree if not. Comparing before the handle
    // is read, like comparing the last word in FindByName, is only a filter, which saves the
    // barriers below where nothing matches. It cannot miss a name that was published before the
    // lookup, because it reads the words stored then or, if the object is being replaced, later
    // ones.
    //
    // The rest is a sequence lock whose sequence number, the handle, cannot repeat. If both reads
    // return the same handle, the words read in between belong to it:
    // - They are not older, because the first read acquires what Publish released, and the words
    //   were stored before that.
    // - They are not newer. A newer word is stored after the release fence in StoreName, which
    //   comes after the handle is withdrawn. Whoever reads such a word has an acquire fence that
    //   synchronises with that fence, so the second read no longer finds the handle.
    __attribute__((noinline)) int32_t HandleOfName(size_t slot, const PackedName &wanted) const {
        if (!HasWords(slot, wanted)) {
            return kFree;
        }
        const int32_t handle = slots_[slot].handle.load(std::memory_order_acquire);
        if (!HasWords(slot, wanted)) {
            return kFree;
        }
        std::atomic_thread_fence(std::memory_order_acquire);
        return slots_[slot].Has(handle, std::memory_order_relaxed) ? handle : kFree;
    }

    void StoreName(size_t slot, const PackedName &name) {
        std::atomic_thread_fence(std::memory_order_release);
        for (size_t i = 0; i < name.used; i++) {
            names_[slot][i].store(name.words[i], std::memory_order_relaxed);
        }
    }

    std::atomic<uint32_t> &HintOf(int32_t handle) {
        return hints_[static_cast<uint32_t>(handle) % kHints];
    }

    Slot slots_[kSlots];
    // hints_[handle % kHints] is the index of the slot that a lookup checks first. It may be stale
    // or belong to another handle with this remainder. Relaxed, because the handle found in the
    // slot decides.
    std::atomic<uint32_t> hints_[kHints];
    std::atomic<uint32_t> names_[kSlots][kNameWords];
    std::atomic<int32_t> count_;
    int32_t given_;  // the last handle given out; the first is 1; used under the guard only
};

#endif
