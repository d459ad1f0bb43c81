// Helpers that File's sources share, and functions that read whole files for other areas. Private.
//
// File reports through __VarnekPGL_FileLog and never through the trace, because the trace reads its
// configuration through File.
#ifndef VARNEK_SOURCE_STORAGE_H
#define VARNEK_SOURCE_STORAGE_H

#include <stdio.h>
#include <string.h>
#include <unistd.h>

#include "Varnek_File.h"
#include "Varnek_Support.h"

// Logs a failure of a file operation at error priority under "SBTVD_File". The text is truncated to
// 1023 characters. Preserves errno.
void __VarnekPGL_FileLog(const char *format, ...) __attribute__((format(printf, 1, 2)));

// Logs a failure and evaluates to the result. The caller writes the `return`.
#define FILE_FAIL(result, ...) (__VarnekPGL_FileLog(__VA_ARGS__), (result))

constexpr uint32_t kSeekBases = 3;  // SEEK_SET 0, SEEK_CUR 1, SEEK_END 2

inline bool IsTooLong(const char *path) {
    return path != nullptr && strnlen(path, MAX_PGL_FILE_PATH_LEN) >= MAX_PGL_FILE_PATH_LEN;
}

inline bool IsLink(int dir, const char *name) {
    char target = '\0';
    return readlinkat(dir, name, &target, sizeof target) >= 0;
}

// Returns the stream of a handle, null for none. A failed open returns the handle -1.
inline FILE *StreamOf(PglFileHandle hFile) {
    return hFile != -1 ? reinterpret_cast<FILE *>(hFile) : nullptr;
}

// Returns a handle in the form that the log shows.
inline unsigned ShownHandle(intptr_t handle) {
    return static_cast<unsigned>(handle);
}

// Reads up to `size` bytes from the stream's position. Returns a block that the caller frees, with
// a NUL after the `*count` bytes that were read; null when there is no memory.
char *ReadText(PglFileHandle file, uint32_t size, uint32_t *count);

// Reads a file of `size` bytes. Returns a block that the caller frees; null when it cannot be
// opened, there is no memory, or it has become shorter.
char *ReadWholeFile(const char *path, int32_t size);

#endif
