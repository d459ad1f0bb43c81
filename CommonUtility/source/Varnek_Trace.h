// How the library itself reports: its trace masks and the one-line failure. Private.
#ifndef VARNEK_SOURCE_TRACE_H
#define VARNEK_SOURCE_TRACE_H

#include "Varnek_Debug.h"

#define TRACE_ERROR(...) VARNEK_TRACE(VARNEK_LEVEL_ERROR | VARNEK_MODULE_COMMON, __VA_ARGS__)
#define TRACE_HIGH(...) VARNEK_TRACE(VARNEK_LEVEL_HIGH | VARNEK_MODULE_COMMON, __VA_ARGS__)
#define TRACE_MID(...) VARNEK_TRACE(VARNEK_LEVEL_MID | VARNEK_MODULE_COMMON, __VA_ARGS__)
#define TRACE_LOW(...) VARNEK_TRACE(VARNEK_LEVEL_LOW | VARNEK_MODULE_COMMON, __VA_ARGS__)

// One row of a failure table: traces the Error line and is the result. The `return` stays with the
// caller.
#define VARNEK_FAIL(result, ...) (TRACE_ERROR(__VA_ARGS__), (result))

#endif
