/// @file
/// Types and constants that every module of the stack shares. Compiles as C11 and as C++17.
///
/// Stack use on 32-bit ARM with all traces enabled is at most 3.9 KiB for trace, assertion and
/// tasking, 2.1 KiB for a load of the debug configuration, 2.9 KiB for files, 3.3 KiB for the
/// deletion of a tree of any depth, and 4.1 KiB for the settings. The platform's log function needs
/// its own stack in addition.
#ifndef VARNEK_COMMON_H
#define VARNEK_COMMON_H

#include <stdint.h>

/// Marks the symbols that the shared library exports.
#define VARNEK_API __attribute__((visibility("default")))

/// 32-bit truth value.
typedef int32_t BOOL;
#ifndef TRUE
#define TRUE 1
#endif
#ifndef FALSE
#define FALSE 0
#endif

/// Time-outs are unsigned 32-bit milliseconds; this value waits without limit.
#define WAIT_FOREVER 0xFFFFFFFFu

/// Levels of a trace. A mask is one of these, or-ed with one module.
#define VARNEK_LEVEL_ERROR 0x80000000u
#define VARNEK_LEVEL_HIGH 0x40000000u
#define VARNEK_LEVEL_MID 0x20000000u
#define VARNEK_LEVEL_LOW 0x10000000u

/// Modules that trace; each has a tag in the log. Common is this library. A trace with none of
/// these module bits is not written.
#define VARNEK_MODULE_COMMON 0x001u
#define VARNEK_MODULE_JNI 0x002u
#define VARNEK_MODULE_MAIN_CONTROL 0x004u
#define VARNEK_MODULE_ESG 0x008u
#define VARNEK_MODULE_SESSION_MANAGER 0x010u
#define VARNEK_MODULE_SECTION_PARSER 0x020u
#define VARNEK_MODULE_DSMCC_DC 0x040u
#define VARNEK_MODULE_DSMCC_OC 0x080u
#define VARNEK_MODULE_TS_DEMUX 0x100u
#define VARNEK_MODULE_CPRM 0x200u
#define VARNEK_MODULE_GINGA 0x400u
#define VARNEK_MODULE_SM_PLAYER 0x800u

/// An open stream as a pointer-sized integer. An open that fails returns -1.
typedef intptr_t PglFileHandle;

/// Open flags, for both streams and large files.
#define PGL_FILE_MODE_CREATE_RW 1
#define PGL_FILE_MODE_READ 2
#define PGL_FILE_MODE_WRITE 4
#define PGL_FILE_MODE_APPEND 8

/// Paths must be shorter than this; the longest one has 255 characters.
#define MAX_PGL_FILE_PATH_LEN 256

#endif
