// The table of named objects: slots, handles and names, and nothing else. Private.
//
// A handle is published once in the life of the process, so it is the one word that publishes a
// slot: what belongs to it is complete before it is stored and untouched until it is withdrawn.
// Lookups take no lock. They read the handle with acquire; for a name they read the handle again
// after the name's words, and since no handle ever comes back, the same handle twice means that the
// words in between were its own: a sequence lock whose number cannot repeat.
//
// A thread that changes the table holds the family's guard. The table is zero when the library is
// loaded.
#ifndef VARNEK_SOURCE_SLOTTABLE_H
#define VARNEK_SOURCE_SLOTTABLE_H

#include <stdint.h>
#include <string.h>

#include <atomic>

constexpr int32_t kInvalidHandle = -1;
constexpr size_t kNameSize = 32;  // with the terminator

template <typename Info, int capacity>
class SlotTable {
  public:
    Info &operator[](int slot) { return slots_[slot].info; }

    // The slot of a live handle, -1 for none. One look when the hint is right, a scan when it is
    // not: for an unknown handle, and when another handle has the same place among the hints.
    int FindByHandle(int32_t handle) const {
        if (handle <= kFree) {
            return -1;
        }
        const int hint = HintOf(handle).load(std::memory_order_relaxed);
        return __builtin_expect(IsLive(hint, handle), 1) ? hint : ScanForHandle(handle, hint);
    }

    // The handle of the lowest live slot of this name, kInvalidHandle for none and for null.
    int32_t FindByName(const char *name) const {
        if (name == nullptr || strnlen(name, kNameSize) >= kNameSize) {
            return kInvalidHandle;
        }
        const PackedName wanted(name);
        for (int slot = 0; slot < capacity; slot++) {
            const int32_t handle = slots_[slot].handle.load(std::memory_order_acquire);
            if (handle != kFree && HasName(slot, wanted) && IsLive(slot, handle)) {
                return handle;
            }
        }
        return kInvalidHandle;
    }

    // Whether the slot still belongs to this handle.
    bool IsLive(int slot, int32_t handle) const {
        return slots_[slot].handle.load(std::memory_order_acquire) == handle;
    }

    // The handle that the slot belongs to, 0 for none.
    int32_t HandleOf(int slot) const { return slots_[slot].handle.load(std::memory_order_acquire); }

    // The slots in use. Exact for the holder of the guard, a moment old for any other thread.
    int32_t Count() const { return count_.load(std::memory_order_relaxed); }

    // The lowest slot from `first` on that a new object may take. -1 for none, and for good once
    // every handle has been given out.
    int FirstFree(int first = 0) const {
        for (int slot = first; slot < capacity && HasHandles(); slot++) {
            if (HandleOf(slot) == kFree) {
                return slot;
            }
        }
        return -1;
    }

    // Whether there is a handle left to give out.
    bool HasHandles() const { return given_ < INT32_MAX; }

    // The handle that the next publication gives out.
    int32_t NextHandle() const { return given_ + 1; }

    // Makes a free slot visible under a name of at most 31 characters. The slot's Info is complete
    // by now. Returns its handle.
    int32_t Publish(int slot, const char *name) {
        const int32_t handle = ++given_;
        StoreName(slot, PackedName(name));
        HintOf(handle).store(static_cast<uint8_t>(slot), std::memory_order_relaxed);
        slots_[slot].handle.store(handle, std::memory_order_release);
        count_.fetch_add(1, std::memory_order_relaxed);
        return handle;
    }

    // Makes the slot invisible; its Info may be taken apart now. Returns how many are left in use.
    int32_t Withdraw(int slot) {
        slots_[slot].handle.store(kFree, std::memory_order_relaxed);
        StoreName(slot, PackedName(""));
        return count_.fetch_sub(1, std::memory_order_relaxed) - 1;
    }

  private:
    static constexpr int32_t kFree = 0;
    static constexpr size_t kNameWords = kNameSize / sizeof(uint32_t);
    static constexpr size_t kHints = 256;
    static_assert(capacity > 0 && capacity <= 256, "a hint is one byte");
    static constexpr size_t kSlots = static_cast<size_t>(capacity);

    struct PackedName {
        explicit PackedName(const char *name) { memcpy(words, name, strnlen(name, kNameSize - 1)); }
        uint32_t words[kNameWords] = {};
    };

    // A line of the cache each, so that threads at neighbouring slots do not slow each other.
    struct alignas(64) Slot {
        std::atomic<int32_t> handle;
        Info info;
    };

    // Kept out of line, so that it does not weigh on the lookups that find their handle at once.
    __attribute__((noinline, cold)) int ScanForHandle(int32_t handle, int hint) const {
        for (int slot = 0; slot < capacity; slot++) {
            if (!IsLive(slot, handle)) {
                continue;
            }
            // Two live handles may share a hint, which then belongs to one of them. A hint that
            // points to no live handle of the two has been left behind, and is corrected.
            const int32_t hinted = HandleOf(hint);
            if (hinted == kFree || &HintOf(hinted) != &HintOf(handle)) {
                HintOf(handle).store(static_cast<uint8_t>(slot), std::memory_order_relaxed);
            }
            return slot;
        }
        return -1;
    }

    // Acquire and release on the words order them before the second look at the handle: a lookup
    // that reads a word of a later owner then finds that the earlier handle is gone.
    bool HasName(int slot, const PackedName &wanted) const {
        for (size_t i = 0; i < kNameWords; i++) {
            if (names_[slot][i].load(std::memory_order_acquire) != wanted.words[i]) {
                return false;
            }
        }
        return true;
    }

    void StoreName(int slot, const PackedName &name) {
        for (size_t i = 0; i < kNameWords; i++) {
            names_[slot][i].store(name.words[i], std::memory_order_release);
        }
    }

    std::atomic<uint8_t> &HintOf(int32_t handle) const {
        return hints_[static_cast<uint32_t>(handle) % kHints];
    }

    Slot slots_[kSlots];
    std::atomic<uint32_t> names_[kSlots][kNameWords];
    // hints_[handle % kHints] is the slot at which to look first; the handle found there decides.
    mutable std::atomic<uint8_t> hints_[kHints];
    std::atomic<int32_t> count_;

  protected:
    int32_t given_;  // handles given out so far, 1 to this one; used under the guard only
};

#endif
