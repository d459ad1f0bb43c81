// The library's two configuration files: where they are, whether they may be opened, and how they
// split into lines. Private.
#ifndef VARNEK_SOURCE_CONFIGFILE_H
#define VARNEK_SOURCE_CONFIGFILE_H

#include <errno.h>
#include <string.h>
#include <sys/stat.h>

#include "Varnek_File.h"

constexpr char kSettingsPath[] = VARNEK_DATA_DIR "Varnek_Config.cfg";
constexpr char kDebugPath[] = VARNEK_DATA_DIR "debug_ltn.ini";
constexpr char kShippedDebugPath[] = VARNEK_SYSTEM_DIR "debug_ltn.ini";
static_assert(sizeof kSettingsPath <= MAX_PGL_FILE_PATH_LEN, "VARNEK_DATA_DIR is too long");
static_assert(sizeof kShippedDebugPath <= MAX_PGL_FILE_PATH_LEN, "VARNEK_SYSTEM_DIR is too long");

constexpr int32_t kMaxConfigSize = 1048576;  // a larger file is not read into memory

// Whether a file may be opened: not if it is a pipe or a device, which could block its reader.
inline bool MayOpen(const char *path) {
    struct stat64 status = {};
    return stat64(path, &status) != 0 || S_ISREG(status.st_mode);
}

inline bool IsReadable(const char *path) {
    return MayOpen(path) && VarnekPGL_CheckFile(path);
}

// Whether there is no such file. One that merely cannot be opened is not missing.
inline bool IsMissing(const char *path) {
    struct stat64 status = {};
    return stat64(path, &status) != 0 && errno == ENOENT;
}

// Copies the line at `*text` as far as it fits, and moves `*text` past it and all line ends that
// follow. Returns false at `end`, and for an empty line.
template <size_t size>
bool TakeLine(const char **text, const char *end, char (&line)[size]) {
    const auto isLineEnd = [](char c) { return c == '\r' || c == '\n'; };
    size_t length = 0;
    const char *at = *text;
    for (; at != end && !isLineEnd(*at); ++at) {
        if (length < size - 1) {
            line[length++] = *at;
        }
    }
    line[length] = '\0';
    while (at != end && isLineEnd(*at)) {
        ++at;
    }
    *text = at;
    return length > 0;
}

#endif
