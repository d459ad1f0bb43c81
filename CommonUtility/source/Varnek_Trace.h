// The library's own trace macros, and the macro that traces and returns a failure. Private.
#ifndef VARNEK_SOURCE_TRACE_H
#define VARNEK_SOURCE_TRACE_H

#include <atomic>

#include "Varnek_Debug.h"

// What is enabled: the bits of the enabled levels and modules, none of them when the output is off,
// and flags in bits that neither uses. Loading the debug configuration writes this word; until then
// every bit is set, because nothing is known to be off. A trace needs no other data, so every
// access is relaxed.
constexpr uint32_t kOutputOn = 0x02000000u;
constexpr uint32_t kOwnLowOn = 0x04000000u;  // the level Low and this library's module
constexpr uint32_t kNotLoaded = 0x08000000u;
extern __attribute__((visibility("hidden"))) std::atomic<uint32_t> gDebugState;

#define TRACE_ERROR(...) VARNEK_TRACE(VARNEK_LEVEL_ERROR | VARNEK_MODULE_COMMON, __VA_ARGS__)
#define TRACE_HIGH(...) VARNEK_TRACE(VARNEK_LEVEL_HIGH | VARNEK_MODULE_COMMON, __VA_ARGS__)
#define TRACE_MID(...) VARNEK_TRACE(VARNEK_LEVEL_MID | VARNEK_MODULE_COMMON, __VA_ARGS__)
#define TRACE_LOW(...) VARNEK_TRACE(VARNEK_LEVEL_LOW | VARNEK_MODULE_COMMON, __VA_ARGS__)

// TRACE_LOW for operations that are called often. It always stores file and line, but skips the
// call when that would write nothing, which saves passing the arguments.
#define TRACE_LOW_QUICK(...)                                        \
    (VarnekDbg_StorePlace(__FILE__, __LINE__),                      \
     (gDebugState.load(std::memory_order_relaxed) & kOwnLowOn) == 0 \
         ? (void)0                                                  \
         : VarnekPGL_TraceOut(VARNEK_LEVEL_LOW | VARNEK_MODULE_COMMON, __VA_ARGS__))

// Traces an Error line and evaluates to the result. The caller writes the `return`.
#define VARNEK_FAIL(result, ...) (TRACE_ERROR(__VA_ARGS__), (result))

#endif
