/// @file
/// Files by path and by stream, large files by descriptor, directories, and commands that copy,
/// move and change permissions.
///
/// Most failures are logged at error priority under the tag "SBTVD_File", whatever the debug
/// configuration says, and never through the trace. The exceptions are reading or writing too few
/// bytes (except in VarnekPGL_AppendFile), an unknown position, a size of 2 GiB or more, null
/// attributes, and open flags and permissions that mean nothing. Large files log only a failing
/// VarnekPGL_OpenFile64Bits, failing writes, negative descriptors and invalid seek bases. All calls
/// are thread-safe, but only one thread at a time may use a handle. A null path fails like one that
/// does not exist; a null buffer moves no bytes.
/// @see [Guide: files](docs/guide/files.md)
#ifndef VARNEK_FILE_H
#define VARNEK_FILE_H

#include "Varnek_Common.h"

/// @name Failures with a result of their own
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
/// Offsets and sizes have 32 bits, so they end below 2 GiB. Handles 0 and -1 are not streams: using
/// one is logged and gives the result listed for "no stream".
/// @{

/// Opens a stream.
/// @param path   at most 255 characters
/// @param flags  PGL_FILE_MODE_ bits: the first of APPEND, CREATE_RW, WRITE and READ that is set
///               counts; CREATE_RW and WRITE empty the file, so READ | WRITE does, too. Other bits
///               alone open nothing
/// @return the handle, which the caller closes; -1 on failure
VARNEK_API PglFileHandle VarnekPGL_OpenFile(const char *path, int32_t flags);

/// Closes a stream. The handle is gone even if this fails.
/// @return 0; -1 for no stream or if buffered data could not be written
VARNEK_API int32_t VarnekPGL_CloseFile(PglFileHandle hFile);

/// Moves the position by `offset` bytes from the start (base 0), the position (1) or the end (2).
/// @return 0, even for no stream; VARNEK_FILE_INVALID_BASE for another base; -1 on failure
VARNEK_API int32_t VarnekPGL_SeekFile(PglFileHandle hFile, int32_t offset, uint32_t base);

/// Returns the position in bytes; -1 for no stream or if there is no such position.
VARNEK_API int32_t VarnekPGL_TellFile(PglFileHandle hFile);

/// Hands buffered data to the system.
/// @return 0, or -1
VARNEK_API int32_t VarnekPGL_FlushFile(PglFileHandle hFile);

/// Reads up to `length` bytes.
/// @return the bytes read; 0 at the end of the file, on an error and for no stream
VARNEK_API uint32_t VarnekPGL_ReadFileByHandle(PglFileHandle hFile, void *buffer, uint32_t length);

/// Writes `length` bytes.
/// @return the bytes written; fewer than `length` on an error, 0 for no stream
VARNEK_API uint32_t VarnekPGL_WriteFileByHandle(PglFileHandle hFile, const void *buffer,
                                                uint32_t length);

/// Returns the size of an open stream in bytes; -1 if it is not known. The position stays, but the
/// end-of-file state ends, so a reader can follow a file that grows.
VARNEK_API int32_t VarnekPGL_GetFileSizeByHandle(PglFileHandle hFile);

/// Reads up to `length` bytes from the start of a file.
/// @return the bytes read; VARNEK_FILE_NOT_OPENED if it cannot be opened
VARNEK_API int32_t VarnekPGL_ReadFile(const char *path, void *buffer, uint32_t length);

/// Replaces a file's content, creating the file if need be.
/// @return the bytes written, 0 if closing failed; VARNEK_FILE_NOT_OPENED if it cannot be opened
VARNEK_API int32_t VarnekPGL_WriteFile(const char *path, const void *buffer, uint32_t length);

/// Appends to a file, creating it if need be.
/// @return 0 once all bytes are stored, else -1; VARNEK_FILE_NOT_OPENED if it cannot be opened
VARNEK_API int32_t VarnekPGL_AppendFile(const char *path, const void *buffer, uint32_t length);

/// Returns a file's size in bytes; 0 if the file cannot be opened or its size is not known.
VARNEK_API int32_t VarnekPGL_GetFileSize(const char *path);

/// Says whether a file can be opened for reading.
VARNEK_API BOOL VarnekPGL_CheckFile(const char *path);

/// Removes a file, a link or an empty directory.
/// @return 0, or -1
VARNEK_API int32_t VarnekPGL_DeleteFile(const char *path);
/// @}
/// @name Large files
/// The handle is the system's file descriptor, and offsets and sizes have 64 bits. Reading or
/// writing is one unbuffered system call. A negative descriptor fails and, unless only the size was
/// asked for, is logged.
/// @{

/// Opens a descriptor, never truncating the file. The path may have any length the system accepts.
/// @param path   the file
/// @param flags  READ; WRITE (write-only); APPEND (with WRITE or CREATE_RW); READ | WRITE
///               (read-write, neither creates nor appends); CREATE_RW (read-write, creates with
///               0666 under the umask)
/// @return the descriptor, which the caller closes; a negative value on failure
VARNEK_API int32_t VarnekPGL_OpenFile64Bits(const char *path, int32_t flags);

/// Closes a descriptor.
/// @return 0, even if that fails; -1 for a negative descriptor
VARNEK_API int32_t VarnekPGL_CloseFile64Bits(int32_t hFile);

/// Reads up to `length` bytes.
/// @return the bytes read, 0 at the end of the file; -1 on failure; 0 for a negative descriptor
VARNEK_API int32_t VarnekPGL_ReadFileByHandle64Bits(int32_t hFile, void *buffer, uint32_t length);

/// Writes `length` bytes, trying once.
/// @return `length`; on failure VARNEK_FILE_MEDIUM_FULL, VARNEK_FILE_TOO_LARGE,
///         VARNEK_FILE_DEVICE_FAILURE, or else the bytes written or -1; 0 for a negative descriptor
VARNEK_API int32_t VarnekPGL_WriteFileByHandle64Bits(int32_t hFile, const void *buffer,
                                                     uint32_t length);

/// Moves the position by `offset` bytes from the start (base 0), the position (1) or the end (2).
/// @return 0, even if that fails; VARNEK_FILE_INVALID_BASE for another base; -1 for a negative
///         descriptor
VARNEK_API int32_t VarnekPGL_SeekFile64Bits(int32_t hFile, int64_t offset, uint32_t base);

/// Returns the position in bytes; -1 if there is none; 0 for a negative descriptor.
VARNEK_API int64_t VarnekPGL_TellFile64Bits(int32_t hFile);

/// Forces data and metadata to the device.
/// @return 0, even if that fails; -1 for a negative descriptor
VARNEK_API int32_t VarnekPGL_FlushFile64Bits(int32_t hFile);

/// Returns a file's size in bytes; 0 if the file cannot be opened or its size is not known.
VARNEK_API int64_t VarnekPGL_GetFileSize64Bits(const char *path);

/// Returns an open file's size in bytes without moving the position; -1 if it is not known.
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

/// Creates one directory, with 0755 under the umask, in a parent that exists.
/// @param path  at most 255 characters
/// @return 0; -1 on failure, which includes a directory that exists
VARNEK_API int32_t VarnekPGL_MakeDir(const char *path);

/// Deletes a directory tree, going on after entries that cannot be deleted. Links are removed and
/// never followed, not even one that takes the place of a directory meanwhile. Each level needs an
/// open descriptor. Entries whose path would exceed 256 characters stay and are logged; entries
/// that a listing does not reach stay as well.
/// @param path  one final slash or backslash is ignored
/// @return 0 once the directory and all in it are gone, else -1
VARNEK_API int32_t VarnekPGL_DeleteDirEx(const char *path);
VARNEK_API int32_t VarnekPGL_DeleteDir(const char *path);  ///< as VarnekPGL_DeleteDirEx

/// Deletes a directory tree and creates the directory again. A link to a directory gives way to a
/// new directory, while the one it pointed to stays as it is. A directory that does not exist is
/// not created, and one whose path is too long to be created again keeps its content.
/// @return 0, or -1
VARNEK_API int32_t VarnekPGL_ClearDir(const char *path);

/// Opens a directory, which the caller closes; PGL_INVALID_DIR_HANDLE on failure.
VARNEK_API void *VarnekPGL_OpenDir(const char *path);

/// Closes a directory and returns TRUE, even for null and PGL_INVALID_DIR_HANDLE.
VARNEK_API BOOL VarnekPGL_CloseDir(void *hDir);

/// Reads the next entry, in no particular order and including "." and "..". The end of the listing
/// writes a log line. It comes early at an entry whose record is longer than 256 bytes, that is, at
/// a name of more than 236 bytes.
/// @return TRUE with an entry; FALSE, and type 0, at the end or on failure
VARNEK_API BOOL __VarnekPGL_ReadDir(void *hDir, PglDirEntry *entry);
VARNEK_API BOOL VarnekPGL_ReadDir(void *hDir, PglDirEntryInfo *info);  ///< as `__VarnekPGL_ReadDir`

/// Says whether a directory can be opened.
VARNEK_API BOOL VarnekPGL_CheckDir(const char *path);

/// Fills the record with a file's size; FALSE if there is no such file or no record.
VARNEK_API BOOL VarnekPGL_FmGetFileAttributes(const char *path, PglFmFileAttributes *attr);
/// @}
/// @name Commands
/// These run cat, mv or chmod, found through PATH, in a shell. Any path is safe, because special
/// characters are quoted. A command of 532 bytes or more (512 for permissions) is not run. If the
/// process ignores SIGCHLD, or another thread waits for any child, the command's status is lost: it
/// runs, but the result is -1.
/// @{

/// Replaces a file's content with that of another. The destination keeps its content if the source
/// cannot be read or is the destination itself.
/// @return 0, or -1
VARNEK_API int32_t VarnekPGL_CopyFile(const char *source, const char *destination);

/// Moves or renames a file, replacing an existing one; if the destination is a directory, the file
/// moves into it and keeps its name. Within one file system this is atomic, and so is the C
/// library's rename, which starts no shell and is more than ten times as fast.
/// @return 0, or -1
VARNEK_API int32_t VarnekPGL_MoveFile(const char *source, const char *destination);

/// Changes a file's permissions.
/// @param path  the file
/// @param mode  decimal 666, 755 or 777, whose digits are read as an octal mode
/// @return 0; the status from system() if the command fails; -1 for another mode or a command that
///         is too long
VARNEK_API int32_t VarnekPGL_Chmod(const char *path, int32_t mode);
/// @}

#ifdef __cplusplus
}
#endif

#endif
