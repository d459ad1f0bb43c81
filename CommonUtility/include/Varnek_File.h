/// @file
/// Files by path and by stream handle, large files by descriptor, directories, and the copy, move
/// and permission commands.
///
/// Most failures are logged at error priority under the tag "SBTVD_File", whatever the debug
/// configuration says, and never through the trace. A stream's read or write that moves too few
/// bytes is not logged. For large files, only failing opens and writes, negative descriptors and
/// invalid seek bases are logged; the size queries log nothing. Thread-safe, except that one thread
/// at a time may use a handle. A null path fails like a path that does not exist; with a null
/// buffer no bytes are moved.
/// @see [Guide: files](docs/guide/files.md)
#ifndef VARNEK_FILE_H
#define VARNEK_FILE_H

#include "Varnek_Common.h"

/// @name Failures with a special result
/// Every other failure returns -1 or the value that the operation's comment gives.
/// @{

#define VARNEK_FILE_DEVICE_FAILURE (-5)  ///< the device failed
#define VARNEK_FILE_INVALID_BASE (-8)    ///< invalid base of a seek
#define VARNEK_FILE_NOT_OPENED (-18)     ///< the file cannot be opened
#define VARNEK_FILE_TOO_LARGE (-27)      ///< over the file size limit
#define VARNEK_FILE_MEDIUM_FULL (-28)    ///< no room on the medium
/// @}

#ifdef __cplusplus
extern "C" {
#endif

/// @name Streams
/// Offsets and sizes are signed 32-bit numbers, which cannot express the size of a file of 2 GiB or
/// more. A handle of 0 or -1 is not a stream. Its use is logged and has the result that is given
/// for "no stream".
/// @{

/// Opens a stream.
/// @param path   at most 255 characters
/// @param flags  PGL_FILE_MODE_ bits. Only the first of APPEND, CREATE_RW, WRITE and READ that is
///               set counts, so READ | WRITE truncates. Other bits alone open nothing
/// @return the handle, which the caller closes; -1 on failure
VARNEK_API PglFileHandle VarnekPGL_OpenFile(const char *path, int32_t flags);

/// Closes a stream; the handle is invalid afterwards even when this fails.
/// @return 0; -1 for no stream or when buffered data could not be written
VARNEK_API int32_t VarnekPGL_CloseFile(PglFileHandle hFile);

/// Moves the position.
/// @param hFile   handle of an open stream
/// @param offset  bytes from the base
/// @param base    0 from the start, 1 from the current position, 2 from the end
/// @return 0, also for no stream; VARNEK_FILE_INVALID_BASE for another base; -1 when the seek fails
VARNEK_API int32_t VarnekPGL_SeekFile(PglFileHandle hFile, int32_t offset, uint32_t base);

/// Returns the position.
/// @return the position in bytes; -1 for no stream or when there is no such position
VARNEK_API int32_t VarnekPGL_TellFile(PglFileHandle hFile);

/// Writes buffered data to the system.
/// @return 0, or -1
VARNEK_API int32_t VarnekPGL_FlushFile(PglFileHandle hFile);

/// Reads up to `length` bytes.
/// @return the bytes read; 0 at the end of the file, on an error and for no stream
VARNEK_API uint32_t VarnekPGL_ReadFileByHandle(PglFileHandle hFile, void *buffer, uint32_t length);

/// Writes `length` bytes.
/// @return the bytes written; fewer than `length` on an error, 0 for no stream
VARNEK_API uint32_t VarnekPGL_WriteFileByHandle(PglFileHandle hFile, const void *buffer,
                                                uint32_t length);

/// Returns the size of an open stream. The position does not move, but the end-of-file state ends.
/// @return the size in bytes, -1 when it cannot be determined
VARNEK_API int32_t VarnekPGL_GetFileSizeByHandle(PglFileHandle hFile);

/// Reads the first bytes of a file.
/// @return the bytes read, 0 to `length`; VARNEK_FILE_NOT_OPENED when it cannot be opened
VARNEK_API int32_t VarnekPGL_ReadFile(const char *path, void *buffer, uint32_t length);

/// Replaces a file's content, and creates the file if necessary.
/// @return the bytes written, 0 when closing failed; VARNEK_FILE_NOT_OPENED when it cannot be
///         opened
VARNEK_API int32_t VarnekPGL_WriteFile(const char *path, const void *buffer, uint32_t length);

/// Appends bytes to a file, and creates the file if necessary.
/// @return 0 when all bytes are stored; -1 when not; VARNEK_FILE_NOT_OPENED when it cannot be
///         opened
VARNEK_API int32_t VarnekPGL_AppendFile(const char *path, const void *buffer, uint32_t length);

/// Returns the size of a file.
/// @return the size in bytes; 0 when the file cannot be opened or its size not determined
VARNEK_API int32_t VarnekPGL_GetFileSize(const char *path);

/// Checks whether a file can be read.
/// @return TRUE when the file can be opened for reading
VARNEK_API BOOL VarnekPGL_CheckFile(const char *path);

/// Removes a file, a link or an empty directory.
/// @return 0, or -1
VARNEK_API int32_t VarnekPGL_DeleteFile(const char *path);
/// @}
/// @name Large files
/// The handle is the system's file descriptor; offsets and sizes are signed 64-bit. Each read or
/// write is one unbuffered system call. A negative descriptor is logged, and the call fails.
/// @{

/// Opens a descriptor. No flag truncates the file.
/// @param path   of any length that the system accepts
/// @param flags  READ; WRITE (write-only); APPEND (with WRITE or CREATE_RW); READ | WRITE
///               (read-write, does not create or append); CREATE_RW (read-write, creates with 0666
///               under the umask)
/// @return the descriptor, which the caller closes; a negative value on failure
VARNEK_API int32_t VarnekPGL_OpenFile64Bits(const char *path, int32_t flags);

/// Closes a descriptor.
/// @return 0 even when the close fails; -1 for a negative descriptor
VARNEK_API int32_t VarnekPGL_CloseFile64Bits(int32_t hFile);

/// Reads up to `length` bytes with one call.
/// @return the bytes read, 0 at the end of the file; -1 when the read fails; 0 for a negative
///         descriptor
VARNEK_API int32_t VarnekPGL_ReadFileByHandle64Bits(int32_t hFile, void *buffer, uint32_t length);

/// Writes with one call and does not retry.
/// @return `length` on success; on failure VARNEK_FILE_MEDIUM_FULL, VARNEK_FILE_TOO_LARGE or
///         VARNEK_FILE_DEVICE_FAILURE, or else the number of bytes written or -1; 0 for a negative
///         descriptor
VARNEK_API int32_t VarnekPGL_WriteFileByHandle64Bits(int32_t hFile, const void *buffer,
                                                     uint32_t length);

/// Moves the position.
/// @param hFile   the descriptor
/// @param offset  bytes from the base
/// @param base    0 from the start, 1 from the current position, 2 from the end
/// @return 0 even when the seek fails; VARNEK_FILE_INVALID_BASE for another base; -1 for a negative
///         descriptor
VARNEK_API int32_t VarnekPGL_SeekFile64Bits(int32_t hFile, int64_t offset, uint32_t base);

/// Returns the position.
/// @return the position in bytes; -1 when there is none; 0 for a negative descriptor
VARNEK_API int64_t VarnekPGL_TellFile64Bits(int32_t hFile);

/// Forces data and metadata to the device.
/// @return 0 even when the flush fails; -1 for a negative descriptor
VARNEK_API int32_t VarnekPGL_FlushFile64Bits(int32_t hFile);

/// Returns the size of a file. Logs nothing.
/// @return the size in bytes; 0 when the file cannot be opened or its size not determined
VARNEK_API int64_t VarnekPGL_GetFileSize64Bits(const char *path);

/// Returns the size of an open file; the position does not move. Logs nothing.
/// @return the size in bytes, -1 when it cannot be determined
VARNEK_API int64_t VarnekPGL_GetFileSizeByHandle64Bits(int32_t hFile);
/// @}
/// @name Directories
/// @{

#define PGL_ENTRY_FILE 1  ///< anything that is not a directory, or whose kind is not known
#define PGL_ENTRY_DIR 2   ///< a directory

/// The result of VarnekPGL_OpenDir on failure.
#define PGL_INVALID_DIR_HANDLE ((void *)(intptr_t)-1)

/// An entry for __VarnekPGL_ReadDir; zero it before the first read.
typedef struct PglDirEntry {
    uint32_t type;            ///< PGL_ENTRY_FILE, PGL_ENTRY_DIR, or 0 for no entry
    unsigned char area[292];  ///< unused: the library neither reads nor writes it
    char name[264];           ///< NUL-terminated
} PglDirEntry;

/// An entry for VarnekPGL_ReadDir.
typedef struct PglDirEntryInfo {
    uint32_t type;   ///< PGL_ENTRY_FILE, PGL_ENTRY_DIR, or 0 for no entry
    char name[256];  ///< NUL-terminated
} PglDirEntryInfo;

/// Ten words; all but the size are 0.
typedef struct PglFmFileAttributes {
    uint32_t reserved[8];  ///< 0
    uint32_t size;         ///< bytes, the low 32 bits
    uint32_t reserved2;    ///< 0
} PglFmFileAttributes;

/// Creates one directory with 0755 under the umask; its parent must exist.
/// @param path  at most 255 characters
/// @return 0; -1 on failure, also when the directory exists
VARNEK_API int32_t VarnekPGL_MakeDir(const char *path);

/// Deletes a directory tree. The deletion continues after entries that cannot be deleted. It
/// removes links and never follows them, not even a link that replaces a directory during the
/// deletion. It needs one open descriptor for each level of the tree. It does not delete entries
/// whose path would exceed 256 characters, which it logs, or entries that a listing does not reach.
/// Both functions do the same.
/// @param path  one final slash or backslash is ignored
/// @return 0 when the directory and its contents are gone, -1 otherwise
VARNEK_API int32_t VarnekPGL_DeleteDirEx(const char *path);
VARNEK_API int32_t VarnekPGL_DeleteDir(const char *path);  ///< as VarnekPGL_DeleteDirEx

/// Deletes a directory tree and creates the directory again. A link to a directory is replaced by a
/// new directory; the directory that it pointed to stays unchanged. A directory that does not exist
/// is not created, and a directory whose path is too long to be created again keeps its content.
/// @return 0, or -1
VARNEK_API int32_t VarnekPGL_ClearDir(const char *path);

/// Opens a directory.
/// @return a directory handle, which the caller closes; PGL_INVALID_DIR_HANDLE on failure
VARNEK_API void *VarnekPGL_OpenDir(const char *path);

/// Closes a directory. Accepts a null handle and PGL_INVALID_DIR_HANDLE.
/// @return TRUE, always
VARNEK_API BOOL VarnekPGL_CloseDir(void *hDir);

/// Read the next entry, in no particular order, "." and ".." included. One thread at a time may
/// read from a handle. The end of a listing writes a log line. A listing ends early at an entry
/// whose record is longer than 256 bytes, that is, at a name of more than 236 bytes.
/// @return TRUE with an entry; FALSE, and type 0, at the end or on failure
VARNEK_API BOOL __VarnekPGL_ReadDir(void *hDir, PglDirEntry *entry);
VARNEK_API BOOL VarnekPGL_ReadDir(void *hDir, PglDirEntryInfo *info);  ///< as `__VarnekPGL_ReadDir`

/// Checks whether a directory can be opened.
/// @return TRUE when it can
VARNEK_API BOOL VarnekPGL_CheckDir(const char *path);

/// Gets a file's size.
/// @return TRUE with the record filled; FALSE when there is no such file or no record
VARNEK_API BOOL VarnekPGL_FmGetFileAttributes(const char *path, PglFmFileAttributes *attr);
/// @}
/// @name Commands
/// These run a shell command; the shell finds cat, mv and chmod through PATH. Any path is safe: a
/// path with special characters is quoted. A command of 532 bytes or more (512 for the permissions)
/// is not run. When the process ignores SIGCHLD, or another thread waits for any child, the status
/// of the command is lost: the command runs, but the result is -1.
/// @{

/// Replaces a file's content with that of another file. If the source cannot be read, or is the
/// destination itself, the call fails, and the destination keeps its content.
/// @return 0, or -1
VARNEK_API int32_t VarnekPGL_CopyFile(const char *source, const char *destination);

/// Moves or renames a file. Within one file system the move is atomic. It runs a shell, which
/// `rename` does not need. An existing destination file is replaced. If the destination is a
/// directory, the file is moved into it under its own name.
/// @return 0, or -1
VARNEK_API int32_t VarnekPGL_MoveFile(const char *source, const char *destination);

/// Changes a file's permissions.
/// @param path  the file
/// @param mode  decimal 666, 755 or 777; its digits are read as an octal mode
/// @return 0; when the command fails, its status as system() returns it; -1 for another mode or a
///         command that is too long
VARNEK_API int32_t VarnekPGL_Chmod(const char *path, int32_t mode);
/// @}

#ifdef __cplusplus
}
#endif

#endif
