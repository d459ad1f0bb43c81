// How the library itself reports: its trace masks and the one-line failure. Private.
#ifndef VARNEK_SOURCE_TRACE_H
#define VARNEK_SOURCE_TRACE_H

#include <atomic>

#include "Varnek_Debug.h"

// What a trace may write: the enabled levels and modules where a trace mask holds its own, none of
// them when the output is off, and flags in bits that neither uses. A load of the debug
// configuration writes it; before the first one every bit is set, since nothing is known to be off.
// The word itself says all that a trace asks of it, so every access is relaxed.
constexpr uint32_t kOutputOn = 0x02000000u;
constexpr uint32_t kOwnLowOn = 0x04000000u;  // the level Low and this library's module
constexpr uint32_t kNotLoaded = 0x08000000u;
extern __attribute__((visibility("hidden"))) std::atomic<uint32_t> gDebugState;

#define TRACE_ERROR(...) VARNEK_TRACE(VARNEK_LEVEL_ERROR | VARNEK_MODULE_COMMON, __VA_ARGS__)
#define TRACE_HIGH(...) VARNEK_TRACE(VARNEK_LEVEL_HIGH | VARNEK_MODULE_COMMON, __VA_ARGS__)
#define TRACE_MID(...) VARNEK_TRACE(VARNEK_LEVEL_MID | VARNEK_MODULE_COMMON, __VA_ARGS__)
#define TRACE_LOW(...) VARNEK_TRACE(VARNEK_LEVEL_LOW | VARNEK_MODULE_COMMON, __VA_ARGS__)

// TRACE_LOW for operations that are called often. The place is stored as ever, but the call is left
// out when it would write nothing, and with it the arguments' way to the stack and back.
#define TRACE_LOW_QUICK(...)                                        \
    (VarnekDbg_StorePlace(__FILE__, __LINE__),                      \
     (gDebugState.load(std::memory_order_relaxed) & kOwnLowOn) == 0 \
         ? (void)0                                                  \
         : VarnekPGL_TraceOut(VARNEK_LEVEL_LOW | VARNEK_MODULE_COMMON, __VA_ARGS__))

// One row of a failure table: traces the Error line and is the result. The `return` stays with the
// caller.
#define VARNEK_FAIL(result, ...) (TRACE_ERROR(__VA_ARGS__), (result))

#endif
