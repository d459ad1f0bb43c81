/// @file
/// Types and constants that every module of the stack shares, in C11 and C++17.
///
/// On 32-bit ARM, with all traces enabled, the library uses at most this much stack: 4.0 KiB for
/// traces, assertion reports and tasking, 2.1 KiB for loading the debug configuration, 3.6 KiB for
/// files and directories, 3.9 KiB for the CRC of a file, 3.3 KiB for deleting a tree of any depth,
/// 4.1 KiB for the settings, plus what the platform's log function takes.
#ifndef VARNEK_COMMON_H
#define VARNEK_COMMON_H

#include <stdint.h>

/// Marks the symbols that the shared library exports.
#define VARNEK_API __attribute__((visibility("default")))

typedef int32_t BOOL;  ///< a truth value of 32 bits
#ifndef TRUE
#define TRUE 1  ///< of a BOOL
#endif
#ifndef FALSE
#define FALSE 0  ///< of a BOOL
#endif

/// Waits without limit. Any other time-out is in milliseconds by the wall clock, which a
/// receiver sets from the broadcast: setting it forward ends waits early, setting it back prolongs
/// them. If that matters, wait without limit and let a timer (Varnek_Timer.h), which does not
/// follow the clock, signal or send.
#define WAIT_FOREVER 0xFFFFFFFFu

/// @name Levels and modules of a trace
/// A mask is one level or-ed with one module, which has its own tag in the log.
/// @{

#define VARNEK_LEVEL_ERROR 0x80000000u  ///< a failure, or misuse by a caller
#define VARNEK_LEVEL_HIGH 0x40000000u   ///< an important event
#define VARNEK_LEVEL_MID 0x20000000u    ///< the end of an operation, a reset
#define VARNEK_LEVEL_LOW 0x10000000u    ///< the start and end of calls

#define VARNEK_MODULE_COMMON 0x001u           ///< this library
#define VARNEK_MODULE_JNI 0x002u              ///< Java bridge
#define VARNEK_MODULE_MAIN_CONTROL 0x004u     ///< main control
#define VARNEK_MODULE_ESG 0x008u              ///< electronic service guide
#define VARNEK_MODULE_SESSION_MANAGER 0x010u  ///< session manager
#define VARNEK_MODULE_SECTION_PARSER 0x020u   ///< section parser
#define VARNEK_MODULE_DSMCC_DC 0x040u         ///< DSM-CC data carousel
#define VARNEK_MODULE_DSMCC_OC 0x080u         ///< DSM-CC object carousel
#define VARNEK_MODULE_TS_DEMUX 0x100u         ///< demultiplexer
#define VARNEK_MODULE_CPRM 0x200u             ///< CPRM player
#define VARNEK_MODULE_GINGA 0x400u            ///< Ginga application manager
#define VARNEK_MODULE_SM_PLAYER 0x800u        ///< SM player
/// @}

/// An open stream as a pointer-sized integer; -1 if it could not be opened.
typedef intptr_t PglFileHandle;

/// @name Open flags, for both streams and large files
/// @{

#define PGL_FILE_MODE_CREATE_RW 1  ///< reads and writes, and creates the file
#define PGL_FILE_MODE_READ 2       ///< reads
#define PGL_FILE_MODE_WRITE 4      ///< writes
#define PGL_FILE_MODE_APPEND 8     ///< writes at the end
/// @}

/// Room for a path of 255 characters and its terminator.
#define MAX_PGL_FILE_PATH_LEN 256

#endif
