// The array operators for the device's library. Those in the NDK's static C++ runtime share an
// object with the operators that throw, and would bring its unwinder and demangler along.
#include <stdlib.h>

#include <new>

namespace std {
const nothrow_t nothrow{};
}  // namespace std

void *operator new[](size_t size, const std::nothrow_t &) noexcept {
    return malloc(size);
}

// The library calls no other form of new[].
// NOLINTNEXTLINE(misc-new-delete-overloads)
void operator delete[](void *block) noexcept {
    free(block);
}

// Called where the compiler knows the size.
void operator delete[](void *block, size_t) noexcept {
    free(block);
}
