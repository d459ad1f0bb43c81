/// @file
/// The trace of the whole stack, its configuration, and the assertion report.
///
/// A trace line reaches the Android log only when the debug configuration ("debug_ltn.ini" in the
/// data directory) enables the output, the line's level and its module. The first trace loads that
/// file. Failures of file access, the summary of a load and assertion reports are always written.
/// @see [Guide: trace](docs/guide/trace.md)
#ifndef VARNEK_DEBUG_H
#define VARNEK_DEBUG_H

#include "Varnek_Common.h"

#ifdef __cplusplus
extern "C" {
#endif

/// The source file and line of the code that traces next. Every caller stores both before a trace
/// or a panic report; VARNEK_TRACE does so. When two threads trace at the same time, one may read
/// what the other stored, so its line shows the other's file and line. Therefore the path must stay
/// readable as long as the process lives, and a module that traces must never be unloaded: link it
/// with -Wl,-z,nodelete, as this library is.
extern VARNEK_API const char *gszVarnekDbgFilePath;
extern VARNEK_API int32_t gVarnekDbgLineNum;  ///< the line in that file

/// Stores file and line.
static inline void VarnekDbg_StorePlace(const char *path, int32_t line) {
    __atomic_store_n(&gszVarnekDbgFilePath, path, __ATOMIC_RELAXED);
    __atomic_store_n(&gVarnekDbgLineNum, line, __ATOMIC_RELAXED);
}

/// Stores the caller's file and line, and traces. `mask` is one VARNEK_LEVEL_ bit or-ed with one
/// VARNEK_MODULE_ bit; a printf format and its arguments follow. The trace adds no line feed. Only
/// the bits of the twelve modules can be enabled: a trace with none of these bits is dropped
/// silently. A new module uses the bit of the area that it belongs to.
#define VARNEK_TRACE(mask, ...) \
    (VarnekDbg_StorePlace(__FILE__, __LINE__), VarnekPGL_TraceOut((mask), __VA_ARGS__))

/// Reports a violated condition. The macro returns, and the caller continues with its fallback.
#define VARNEK_PANIC()                                                        \
    (VarnekPGL_CheckAndInitDebug(), VarnekDbg_StorePlace(__FILE__, __LINE__), \
     (void)VarnekPGL_Panic())

/// Writes one line to the Android log if the configuration enables it. Preserves errno.
/// @param mask    level and module; a mask without a module writes nothing
/// @param format  printf format; null shows "(null)". The text is truncated to 2017 bytes, and to
///                2047 with the prefix
/// @par Threads
/// Thread-safe without a lock; lines never mix.
VARNEK_API void VarnekPGL_TraceOut(uint32_t mask, const char *format, ...)
    __attribute__((format(printf, 2, 3)));

/// Loads the debug configuration, even if it was loaded before. The load disables everything,
/// copies the shipped file from the system directory when the working copy is missing, reads the
/// working copy, and logs what is enabled.
/// @par Threads
/// Thread-safe; concurrent loads run one after the other.
VARNEK_API void VarnekPGL_InitializeDebug(void);

/// Loads the debug configuration if no load has been tried yet. A failed load counts as tried.
VARNEK_API void VarnekPGL_CheckAndInitDebug(void);

/// Writes the assertion report at fatal priority under the tag "Varnek", whatever the configuration
/// says. The process goes on.
/// @return the result of the log write
VARNEK_API int32_t VarnekPGL_Panic(void);

/// Returns the calling thread's errno.
VARNEK_API int32_t VarnekPGL_SysGetLastErro(void);

/// Makes the working copies of the debug configuration and of the settings file readable and
/// writable for every user, if they exist.
VARNEK_API void VarnekPGL_changeModeForDebug(void);

#ifdef __cplusplus
}
#endif

#endif
