// The trace of the whole stack, its configuration, and the assertion report.
//
// A trace line reaches the Android log only when the debug configuration ("debug_ltn.ini" in the
// data directory) enables the output, the line's level and its module. The first trace loads that
// file. Failures of file access, the report of a load and assertion reports are always written.
#ifndef VARNEK_DEBUG_H
#define VARNEK_DEBUG_H

#include "Varnek_Common.h"

#ifdef __cplusplus
extern "C" {
#endif

// The place of the code that traces next. Every caller stores both before a trace or a panic
// report; VARNEK_TRACE does so. When two threads trace at once, a line may show the other thread's
// place: so a path must stay readable as long as the process lives. A module that traces is never
// unloaded; its makers link it with -Wl,-z,nodelete, as this library is.
extern VARNEK_API const char *gszVarnekDbgFilePath;
extern VARNEK_API int32_t gVarnekDbgLineNum;

// Stores both.
static inline void VarnekDbg_StorePlace(const char *path, int32_t line) {
    __atomic_store_n(&gszVarnekDbgFilePath, path, __ATOMIC_RELAXED);
    __atomic_store_n(&gVarnekDbgLineNum, line, __ATOMIC_RELAXED);
}

// Stores the caller's place and traces. `mask` is one VARNEK_LEVEL_ bit with one VARNEK_MODULE_
// bit; a printf format and its arguments follow. The trace adds no line end. There are twelve
// modules, and a bit beyond theirs is never switched on: what is traced under it alone is not
// written, and nothing says so. A new module takes the bit of the area that it belongs to.
#define VARNEK_TRACE(mask, ...) \
    (VarnekDbg_StorePlace(__FILE__, __LINE__), VarnekPGL_TraceOut((mask), __VA_ARGS__))

// Reports that a condition which must hold does not. Returns; the caller goes on with its fallback.
#define VARNEK_PANIC()                                                        \
    (VarnekPGL_CheckAndInitDebug(), VarnekDbg_StorePlace(__FILE__, __LINE__), \
     (void)VarnekPGL_Panic())

// Writes one line to the Android log, when the configuration enables it.
//   mask     level and module; a module of 0 is never written
//   format   printf format, cut to 2017 characters and to 2047 with the prefix; null shows "(null)"
//   threads  any, without a lock; lines never mix. errno is left alone
VARNEK_API void VarnekPGL_TraceOut(uint32_t mask, const char *format, ...)
    __attribute__((format(printf, 2, 3)));

// Loads the debug configuration, again if it was loaded before: resets everything to off, seeds the
// working copy from the system directory when it is missing, reads it, and logs what is enabled.
//   threads  any; concurrent loads run one after the other
VARNEK_API void VarnekPGL_InitializeDebug(void);

// Loads the debug configuration unless that has happened. A load that failed is not tried again.
VARNEK_API void VarnekPGL_CheckAndInitDebug(void);

// Writes the assertion report at fatal priority under the tag "Varnek", whatever the configuration
// says. The process goes on.
//   returns  the result of the log write
VARNEK_API int32_t VarnekPGL_Panic(void);

// The calling thread's errno.
VARNEK_API int32_t VarnekPGL_SysGetLastErro(void);

// Makes the working copies of the debug configuration and of the configuration file readable and
// writable for every user, where they exist.
VARNEK_API void VarnekPGL_changeModeForDebug(void);

#ifdef __cplusplus
}
#endif

#endif
