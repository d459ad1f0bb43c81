// Files by path and by stream handle, large files by descriptor, directories, and the copy, move
// and permission commands.
//
// Failures are logged at error priority under the tag "SBTVD_File", whatever the debug
// configuration says, and never through the trace. No operation keeps state: callers that share a
// handle between threads take turns. A null path is refused like one that does not exist, a null
// buffer moves no bytes.
#ifndef VARNEK_FILE_H
#define VARNEK_FILE_H

#include "Varnek_Common.h"

// Failures that have a result of their own; every other failure is -1 or what its operation says.
#define VARNEK_FILE_DEVICE_FAILURE (-5)
#define VARNEK_FILE_INVALID_BASE (-8)  // of a seek
#define VARNEK_FILE_NOT_OPENED (-18)
#define VARNEK_FILE_TOO_LARGE (-27)  // for its size limit
#define VARNEK_FILE_MEDIUM_FULL (-28)

#ifdef __cplusplus
extern "C" {
#endif

// Streams ----------------------------------------------------------------------------------------
// Offsets and sizes are signed 32-bit: a file of 2 GiB or more has no position that these report.
// A handle of 0 or -1 is no stream; that is logged and refused.

// Opens a stream.
//   path     at most 255 characters
//   flags    PGL_FILE_MODE_ bits. APPEND wins over CREATE_RW, that over WRITE, that over READ: so
//            READ | WRITE truncates. Other bits alone open nothing
//   returns  the handle, to be closed by the caller; -1 on failure
VARNEK_API PglFileHandle VarnekPGL_OpenFile(const char *path, int32_t flags);

// Closes a stream; the handle is dead even when this fails.
//   returns  0; -1 for no stream or when buffered data could not be written
VARNEK_API int32_t VarnekPGL_CloseFile(PglFileHandle hFile);

// Moves the position.
//   hFile    handle of an open stream
//   offset   bytes from the base
//   base     0 from the start, 1 from here, 2 from the end
//   returns  0, also for no stream; VARNEK_FILE_INVALID_BASE for another base; -1 when the seek
//   fails
VARNEK_API int32_t VarnekPGL_SeekFile(PglFileHandle hFile, int32_t offset, uint32_t base);

// Tells the position.
//   returns  the position in bytes; -1 for no stream or when there is no such position
VARNEK_API int32_t VarnekPGL_TellFile(PglFileHandle hFile);

// Hands buffered data to the system.
//   returns  0, or -1
VARNEK_API int32_t VarnekPGL_FlushFile(PglFileHandle hFile);

// Reads up to `length` bytes.
//   returns  the bytes read; 0 at the end of the file, on an error and for no stream
VARNEK_API uint32_t VarnekPGL_ReadFileByHandle(PglFileHandle hFile, void *buffer, uint32_t length);

// Writes `length` bytes.
//   returns  the bytes taken; fewer on an error, 0 for no stream
VARNEK_API uint32_t VarnekPGL_WriteFileByHandle(PglFileHandle hFile, const void *buffer,
                                                uint32_t length);

// Measures an open stream; the position stays.
//   returns  the size in bytes, -1 when it cannot be told
VARNEK_API int32_t VarnekPGL_GetFileSizeByHandle(PglFileHandle hFile);

// Reads the first bytes of a file.
//   returns  the bytes read, 0 to `length`; VARNEK_FILE_NOT_OPENED
VARNEK_API int32_t VarnekPGL_ReadFile(const char *path, void *buffer, uint32_t length);

// Replaces a file's content, creating it if need be.
//   returns  the bytes written, 0 when closing failed; VARNEK_FILE_NOT_OPENED
VARNEK_API int32_t VarnekPGL_WriteFile(const char *path, const void *buffer, uint32_t length);

// Adds bytes at a file's end, creating it if need be.
//   returns  0 when all bytes are stored; -1 when not; VARNEK_FILE_NOT_OPENED
VARNEK_API int32_t VarnekPGL_AppendFile(const char *path, const void *buffer, uint32_t length);

// Measures a file.
//   returns  the size in bytes; 0 when the file cannot be opened or measured
VARNEK_API int32_t VarnekPGL_GetFileSize(const char *path);

// Tries whether a file can be read.
//   returns  TRUE when the file can be opened for reading
VARNEK_API BOOL VarnekPGL_CheckFile(const char *path);

// Removes a file, a link or an empty directory.
//   returns  0, or -1
VARNEK_API int32_t VarnekPGL_DeleteFile(const char *path);

// Large files ------------------------------------------------------------------------------------
// The handle is the system's file descriptor; offsets and sizes are signed 64-bit. Each read or
// write is one system call, unbuffered. A negative descriptor is logged and refused.

// Opens a descriptor; nothing ever truncates.
//   path     of any length that the system takes
//   flags    READ; WRITE (write-only); APPEND (with WRITE or CREATE_RW); READ | WRITE (read-write,
//            not created, not appending); CREATE_RW (read-write, created with 0666 under the umask)
//   returns  the descriptor, to be closed by the caller; a negative value on failure
VARNEK_API int32_t VarnekPGL_OpenFile64Bits(const char *path, int32_t flags);

// Closes a descriptor.
//   returns  0 whatever the close reported; -1 for a negative descriptor
VARNEK_API int32_t VarnekPGL_CloseFile64Bits(int32_t hFile);

// Reads up to `length` bytes with one call.
//   returns  the bytes read, 0 at the end of the file; -1 when the read fails; 0 for a negative
//            descriptor
VARNEK_API int32_t VarnekPGL_ReadFileByHandle64Bits(int32_t hFile, void *buffer, uint32_t length);

// Writes with one call and does not retry.
//   returns  `length`; VARNEK_FILE_MEDIUM_FULL, VARNEK_FILE_TOO_LARGE, VARNEK_FILE_DEVICE_FAILURE;
//            otherwise the short count or -1. 0 for a negative descriptor
VARNEK_API int32_t VarnekPGL_WriteFileByHandle64Bits(int32_t hFile, const void *buffer,
                                                     uint32_t length);

// Moves the position.
//   hFile    the descriptor
//   offset   bytes from the base
//   base     0 from the start, 1 from here, 2 from the end
//   returns  0 whatever the seek reported; VARNEK_FILE_INVALID_BASE for another base; -1 for a
//            negative descriptor
VARNEK_API int32_t VarnekPGL_SeekFile64Bits(int32_t hFile, int64_t offset, uint32_t base);

// Tells the position.
//   returns  the position in bytes; -1 when there is none; 0 for a negative descriptor
VARNEK_API int64_t VarnekPGL_TellFile64Bits(int32_t hFile);

// Forces data and metadata to the device.
//   returns  0 whatever the system reported; -1 for a negative descriptor
VARNEK_API int32_t VarnekPGL_FlushFile64Bits(int32_t hFile);

// Measures a file.
//   returns  the size in bytes; 0, without a log line, when the file cannot be opened or measured
VARNEK_API int64_t VarnekPGL_GetFileSize64Bits(const char *path);

// Measures an open file; the position stays. Logs nothing.
//   returns  the size in bytes, -1 when it cannot be told
VARNEK_API int64_t VarnekPGL_GetFileSizeByHandle64Bits(int32_t hFile);

// Directories ------------------------------------------------------------------------------------

#define PGL_ENTRY_FILE 1  // anything that is not a directory, or whose kind is not known
#define PGL_ENTRY_DIR 2   // a directory

// What an open of a directory returns on failure.
#define PGL_INVALID_DIR_HANDLE ((void *)(intptr_t)-1)

// An entry as the library reads it; zero it before the first read.
typedef struct PglDirEntry {
    uint32_t type;            // PGL_ENTRY_FILE, PGL_ENTRY_DIR, or 0 for no entry
    unsigned char area[292];  // neither read nor written here
    char name[264];           // NUL-terminated
} PglDirEntry;

// An entry as callers read it.
typedef struct PglDirEntryInfo {
    uint32_t type;   // PGL_ENTRY_FILE, PGL_ENTRY_DIR, or 0 for no entry
    char name[256];  // NUL-terminated
} PglDirEntryInfo;

// Ten words, of which only the size carries a value.
typedef struct PglFmFileAttributes {
    uint32_t reserved[8];  // 0
    uint32_t size;         // bytes, the low 32 bits
    uint32_t reserved2;    // 0
} PglFmFileAttributes;

// Creates one directory with 0755 under the umask; its parent must exist.
//   path     at most 255 characters
//   returns  0; -1 on failure, an existing directory included
VARNEK_API int32_t VarnekPGL_MakeDir(const char *path);

// Deletes a directory tree, going on past entries that cannot be deleted. Links are removed and
// never followed, not even one that takes a directory's place meanwhile. An open descriptor is
// needed for each level. An entry whose path would exceed 256 characters is left, with a log line,
// and so is what a listing does not reach. Both names do the same.
//   path     one final slash or backslash is ignored
//   returns  0 when the directory and its contents are gone, -1 otherwise
VARNEK_API int32_t VarnekPGL_DeleteDirEx(const char *path);
VARNEK_API int32_t VarnekPGL_DeleteDir(const char *path);

// Deletes a directory tree and makes the directory again. A link to a directory is replaced by a
// new directory; what it led to stays as it is.
//   returns  0, or -1; a directory that does not exist is not created, and one whose path is too
//   long
//            to be created again keeps its content
VARNEK_API int32_t VarnekPGL_ClearDir(const char *path);

// Opens a directory.
//   returns  a directory handle, to be closed by the caller; PGL_INVALID_DIR_HANDLE on failure
VARNEK_API void *VarnekPGL_OpenDir(const char *path);

// Closes a directory. A null handle and that of a failed open are accepted.
//   returns  TRUE, always
VARNEK_API BOOL VarnekPGL_CloseDir(void *hDir);

// Reads the next entry, in no particular order, "." and ".." included. One handle is read by one
// thread at a time. The end of a listing writes a log line. A listing ends early at an entry whose
// record is longer than 256 bytes, that is, whose name has more than 236.
//   returns  TRUE with an entry; FALSE, and type 0, at the end or on failure
VARNEK_API BOOL __VarnekPGL_ReadDir(void *hDir, PglDirEntry *entry);
VARNEK_API BOOL VarnekPGL_ReadDir(void *hDir, PglDirEntryInfo *info);

// Tries whether a directory can be listed.
//   returns  TRUE when the directory can be opened
VARNEK_API BOOL VarnekPGL_CheckDir(const char *path);

// Tells a file's size.
//   returns  TRUE with the record filled; FALSE when there is no such file or no record
VARNEK_API BOOL VarnekPGL_FmGetFileAttributes(const char *path, PglFmFileAttributes *attr);

// Commands ---------------------------------------------------------------------------------------
// These run a shell command; the shell finds cat, mv and chmod by PATH. Any path is safe: one that
// is not made of plain characters is quoted. A command of 532 bytes or more (512 for the
// permissions) is refused. In a process that ignores SIGCHLD, or in which another thread waits for
// every child, a command's status is lost: it is carried out, and the result is -1 all the same.

// Copies a file's content over another file's. A source that cannot be read, or that is the
// destination itself, is refused and the destination keeps its content.
//   returns  0, or -1
VARNEK_API int32_t VarnekPGL_CopyFile(const char *source, const char *destination);

// Moves or renames a file, over another file's place included. A directory as destination takes the
// file in under its own name.
//   returns  0, or -1
VARNEK_API int32_t VarnekPGL_MoveFile(const char *source, const char *destination);

// Changes a file's permissions.
//   path     the file
//   mode     decimal 666, 755 or 777, read as the octal permission
//   returns  0; the command's status, as system() gives it, when it fails; -1 for another mode or a
//            command that is too long
VARNEK_API int32_t VarnekPGL_Chmod(const char *path, int32_t mode);

#ifdef __cplusplus
}
#endif

#endif
