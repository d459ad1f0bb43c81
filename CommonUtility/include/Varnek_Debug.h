/// @file
/// Tracing for the whole stack, its configuration, and the assertion report.
///
/// A trace reaches the Android log only if the debug configuration ("debug_ltn.ini" in the data
/// directory, loaded by the first trace) enables the output, its level and its module. The summary
/// of a loaded configuration, most failed file operations and assertion reports are always logged.
/// @see [Guide: trace](docs/guide/trace.md)
#ifndef VARNEK_DEBUG_H
#define VARNEK_DEBUG_H

#include "Varnek_Common.h"

#ifdef __cplusplus
extern "C" {
#endif

/// The source file of the code that traces next. Callers store file and line before they trace or
/// report a panic, as VARNEK_TRACE does. When two threads trace at the same time, one may show what
/// the other stored, so the path has to stay readable as long as the process lives: never unload a
/// module that traces, but link it with -Wl,-z,nodelete, as this library is.
extern VARNEK_API const char *gszVarnekDbgFilePath;
extern VARNEK_API int32_t gVarnekDbgLineNum;  ///< the line in that file

/// Stores file and line.
static inline void VarnekDbg_StorePlace(const char *path, int32_t line) {
    __atomic_store_n(&gszVarnekDbgFilePath, path, __ATOMIC_RELAXED);
    __atomic_store_n(&gVarnekDbgLineNum, line, __ATOMIC_RELAXED);
}

/// Traces with the caller's file and line. The arguments are one VARNEK_LEVEL_ bit or-ed with one
/// VARNEK_MODULE_ bit, a printf format and what it formats. No line feed is added. Only the twelve
/// module bits can be enabled, and a trace without one is dropped silently, so a new module uses
/// the bit of the area it belongs to.
#define VARNEK_TRACE(mask, ...) \
    (VarnekDbg_StorePlace(__FILE__, __LINE__), VarnekPGL_TraceOut((mask), __VA_ARGS__))

/// Reports that a condition does not hold. The caller goes on with its fallback.
#define VARNEK_PANIC()                                                        \
    (VarnekPGL_CheckAndInitDebug(), VarnekDbg_StorePlace(__FILE__, __LINE__), \
     (void)VarnekPGL_Panic())

/// Writes one line to the Android log if the configuration enables it, and preserves errno. Takes
/// no lock once the configuration is loaded; lines of different threads never mix.
/// @param mask    level and module; unless it has both, nothing is written
/// @param format  printf format; null shows "(null)". The text is cut to 2017 bytes, and to 2047
///                with the prefix
VARNEK_API void VarnekPGL_TraceOut(uint32_t mask, const char *format, ...)
    __attribute__((format(printf, 2, 3)));

/// Loads the debug configuration, even if it is loaded already: disables everything, copies the
/// shipped file from the system directory if the working copy is missing, reads that and logs what
/// is enabled. Threads that load at the same time do so one after the other.
VARNEK_API void VarnekPGL_InitializeDebug(void);

/// Loads the debug configuration unless that was tried before, successfully or not.
VARNEK_API void VarnekPGL_CheckAndInitDebug(void);

/// Writes the assertion report at fatal priority under the tag "Varnek", whatever the configuration
/// says. The process goes on.
/// @return what the log function returned
VARNEK_API int32_t VarnekPGL_Panic(void);

/// Returns the calling thread's errno.
VARNEK_API int32_t VarnekPGL_SysGetLastErro(void);

/// Lets every user read and write the debug configuration and the settings in the data directory,
/// but leaves alone a link and a file that this process cannot read.
VARNEK_API void VarnekPGL_changeModeForDebug(void);

#ifdef __cplusplus
}
#endif

#endif
