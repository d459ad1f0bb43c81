// Types and constants that every module of the stack shares. Compiles as C11 and as C++17.
//
// A call takes part of its thread's stack. On 32-bit ARM with all traces on, up to: trace,
// assertion and tasking 3.9 KiB, a load of the debug configuration 2.1, files 2.9, the deletion of
// a tree 3.3 whatever its depth, the settings 4.1; and what the platform's log function takes
// besides.
#ifndef VARNEK_COMMON_H
#define VARNEK_COMMON_H

#include <stdint.h>

// Marks what the shared library exports.
#define VARNEK_API __attribute__((visibility("default")))

// 32-bit truth value.
typedef int32_t BOOL;
#ifndef TRUE
#define TRUE 1
#endif
#ifndef FALSE
#define FALSE 0
#endif

// Time-outs are unsigned 32-bit milliseconds; this one waits without limit.
#define WAIT_FOREVER 0xFFFFFFFFu

// Level of a trace: one of these, or-ed with one module.
#define VARNEK_LEVEL_ERROR 0x80000000u
#define VARNEK_LEVEL_HIGH 0x40000000u
#define VARNEK_LEVEL_MID 0x20000000u
#define VARNEK_LEVEL_LOW 0x10000000u

// Module that traces; each has its tag in the log. Common is this library. There are no other ones:
// a trace under any other bit is not written.
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

// An open stream as a pointer-sized integer; -1 is the failure result of an open.
typedef intptr_t PglFileHandle;

// Open flags, for streams and for large files alike.
#define PGL_FILE_MODE_CREATE_RW 1
#define PGL_FILE_MODE_READ 2
#define PGL_FILE_MODE_WRITE 4
#define PGL_FILE_MODE_APPEND 8

// A path of this many characters or more is refused; 255 is the longest accepted.
#define MAX_PGL_FILE_PATH_LEN 256

#endif
