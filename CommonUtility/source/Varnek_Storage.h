// What the sources of storage share, and the reading of whole files for the areas above. Private.
//
// Storage reports through __VarnekPGL_FileLog and nothing through the trace, which reads its own
// configuration through storage.
#ifndef VARNEK_SOURCE_STORAGE_H
#define VARNEK_SOURCE_STORAGE_H

#include <stdio.h>
#include <string.h>

#include "Varnek_File.h"
#include "Varnek_Support.h"

// Writes a failure of storage at error priority under "SBTVD_File", cut to 1023 characters. Leaves
// errno alone.
void __VarnekPGL_FileLog(const char *format, ...) __attribute__((format(printf, 1, 2)));

constexpr uint32_t kSeekBases = 3;  // SEEK_SET 0, SEEK_CUR 1, SEEK_END 2

inline bool IsTooLong(const char *path) {
    return path != nullptr && strnlen(path, MAX_PGL_FILE_PATH_LEN) >= MAX_PGL_FILE_PATH_LEN;
}

// The stream behind a handle, null for none. -1 is what a failed open gave the caller.
inline FILE *StreamOf(PglFileHandle hFile) {
    return hFile != -1 ? reinterpret_cast<FILE *>(hFile) : nullptr;
}

// A handle as the log shows it.
inline unsigned ShownHandle(intptr_t handle) {
    return static_cast<unsigned>(handle);
}

// What is in a configuration file's place. Only a readable one is opened: another one could block
// its reader, or take all the memory.
enum class FileKind {
    kMissing,
    kReadable,  // as far as can be seen without opening it
    kOdd,       // no regular file
    kTooLarge,  // more than kMaxConfigSize bytes
};
constexpr int64_t kMaxConfigSize = 1048576;
FileKind KindOfConfigFile(const char *path);

// What a read of a whole file brought: `count` bytes in a block from malloc, a NUL behind them.
// Null without memory. The owner frees it.
struct FileText {
    char *data;
    uint32_t count;
};

// Reads up to `size` bytes from the stream's position.
FileText ReadText(PglFileHandle file, uint32_t size);

// Reads the `size` bytes that a file is known to have. Null when there is no memory, or fewer
// bytes.
char *ReadWholeFile(const char *path, int32_t size);

#endif
