// Streams, and the log function of all file operations. No state is kept between calls.
#include "Varnek_File.h"

#include <limits.h>
#include <stdarg.h>
#include <stdio.h>
#include <stdlib.h>
#include <string.h>
#include <sys/stat.h>

#include "Varnek_Storage.h"
#include "Varnek_Support.h"
#include "varnek_platform.h"

namespace {

constexpr size_t kFileLogSize = 1024;

// Limits a length, so that the count of bytes fits the signed result of the whole-file operations.
uint32_t Countable(uint32_t length) {
    return length < INT32_MAX ? length : INT32_MAX;
}

// Returns the size of a stream's regular file, without bytes that are not flushed yet; -1 for any
// other file. It does not use the position of the stream, because a 32-bit C library may let that
// wrap at 4 GiB.
int64_t SizeOfRegularFile(FILE *stream) {
    struct stat64 status = {};
    return fstat64(fileno(stream), &status) == 0 && S_ISREG(status.st_mode) ? status.st_size : -1;
}

}  // namespace

void __VarnekPGL_FileLog(const char *format, ...) {
    const ErrnoKeeper keeper;
    char line[kFileLogSize];
    va_list args;
    va_start(args, format);
    vsnprintf(line, sizeof line, format, args);
    va_end(args);
    __android_log_write(VARNEK_LOG_ERROR, "SBTVD_File", line);
}

PglFileHandle VarnekPGL_OpenFile(const char *path, int32_t flags) {
    if (IsTooLong(path)) {
        return FILE_FAIL(-1, "%s : file path(%s) length over max size", __func__, path);
    }
    const char *const mode = (flags & PGL_FILE_MODE_APPEND) != 0      ? "a"
                             : (flags & PGL_FILE_MODE_CREATE_RW) != 0 ? "w+"
                             : (flags & PGL_FILE_MODE_WRITE) != 0     ? "w"
                             : (flags & PGL_FILE_MODE_READ) != 0      ? "r"
                                                                      : nullptr;
    if (mode == nullptr) {
        return -1;
    }
    FILE *stream = path != nullptr ? fopen(path, mode) : nullptr;
    if (stream == nullptr) {
        return FILE_FAIL(-1, "%s : NULL file pointer. szFilePath=[%s]", __func__, Shown(path));
    }
    return reinterpret_cast<PglFileHandle>(stream);
}

// Not inlined, because g++ would warn that the log line uses the pointer of a closed stream.
__attribute__((noinline)) int32_t VarnekPGL_CloseFile(PglFileHandle hFile) {
    FILE *stream = StreamOf(hFile);
    if (stream == nullptr) {
        return FILE_FAIL(-1, "%s : NULL file pointer", __func__);
    }
    if (fclose(stream) != 0) {
        return FILE_FAIL(-1, "%s : fail hFile = 0x%x", __func__, ShownHandle(hFile));
    }
    return 0;
}

int32_t VarnekPGL_SeekFile(PglFileHandle hFile, int32_t offset, uint32_t base) {
    FILE *stream = StreamOf(hFile);
    if (stream == nullptr) {
        return FILE_FAIL(0, "%s : NULL file pointer", __func__);
    }
    if (base >= kSeekBases) {
        return FILE_FAIL(VARNEK_FILE_INVALID_BASE, "%s : Invalid Seek base! base=%d", __func__,
                         static_cast<int>(base));
    }
    if (fseek(stream, offset, static_cast<int>(base)) < 0) {
        return FILE_FAIL(-1, "%s : fail handle = 0x%x", __func__, ShownHandle(hFile));
    }
    return 0;
}

int32_t VarnekPGL_TellFile(PglFileHandle hFile) {
    FILE *stream = StreamOf(hFile);
    if (stream == nullptr) {
        return FILE_FAIL(-1, "%s : NULL file pointer", __func__);
    }
    // A position that does not fit the result, such as the "end" of a directory, counts as none.
    const int64_t position = ftell(stream);
    return position <= INT32_MAX ? static_cast<int32_t>(position) : -1;
}

int32_t VarnekPGL_FlushFile(PglFileHandle hFile) {
    FILE *stream = StreamOf(hFile);
    if (stream == nullptr) {
        return FILE_FAIL(-1, "%s : NULL file pointer", __func__);
    }
    if (fflush(stream) != 0) {
        return FILE_FAIL(-1, "%s : fail", __func__);
    }
    return 0;
}

uint32_t VarnekPGL_ReadFileByHandle(PglFileHandle hFile, void *buffer, uint32_t length) {
    FILE *stream = StreamOf(hFile);
    if (stream == nullptr) {
        return FILE_FAIL(0, "%s : NULL file pointer", __func__);
    }
    if (buffer == nullptr && length > 0) {
        return FILE_FAIL(0, "%s : NULL buffer", __func__);
    }
    return static_cast<uint32_t>(fread(buffer, 1, length, stream));
}

uint32_t VarnekPGL_WriteFileByHandle(PglFileHandle hFile, const void *buffer, uint32_t length) {
    FILE *stream = StreamOf(hFile);
    if (stream == nullptr) {
        return FILE_FAIL(0, "%s : NULL file pointer", __func__);
    }
    if (buffer == nullptr && length > 0) {
        return FILE_FAIL(0, "%s : NULL buffer", __func__);
    }
    return static_cast<uint32_t>(fwrite(buffer, 1, length, stream));
}

int32_t VarnekPGL_GetFileSizeByHandle(PglFileHandle hFile) {
    FILE *stream = StreamOf(hFile);
    const int32_t position = VarnekPGL_TellFile(hFile);
    // Seeking makes the bytes written so far count, unless the medium is full, and ends the
    // end-of-file state, so that a reader can follow a file that grows.
    if (stream != nullptr && SizeOfRegularFile(stream) >= 0 &&
        VarnekPGL_SeekFile(hFile, 0, SEEK_CUR) == 0) {
        const int64_t size = SizeOfRegularFile(stream);
        return size <= INT32_MAX ? static_cast<int32_t>(size) : -1;
    }
    VarnekPGL_SeekFile(hFile, 0, SEEK_END);
    const int32_t size = VarnekPGL_TellFile(hFile);
    if (position >= 0 && position != size) {
        VarnekPGL_SeekFile(hFile, position, SEEK_SET);
    }
    return size;
}

// Opens a file for an operation on the whole file. Returns -1, after a line of that operation, on
// failure.
static PglFileHandle OpenWhole(const char *operation, const char *path, int32_t flags) {
    const PglFileHandle file = VarnekPGL_OpenFile(path, flags);
    if (file == -1) {
        __VarnekPGL_FileLog("%s : File doesn't exist! file path=[%s]", operation, Shown(path));
    }
    return file;
}

int32_t VarnekPGL_ReadFile(const char *path, void *buffer, uint32_t length) {
    const PglFileHandle file = OpenWhole(__func__, path, PGL_FILE_MODE_READ);
    if (file == -1) {
        return VARNEK_FILE_NOT_OPENED;
    }
    const uint32_t count = VarnekPGL_ReadFileByHandle(file, buffer, Countable(length));
    VarnekPGL_CloseFile(file);
    return static_cast<int32_t>(count);
}

int32_t VarnekPGL_WriteFile(const char *path, const void *buffer, uint32_t length) {
    if (buffer == nullptr && length > 0) {
        // Refused here, because the open below would empty the file.
        return FILE_FAIL(0, "%s : NULL buffer", __func__);
    }
    const PglFileHandle file = OpenWhole(__func__, path, PGL_FILE_MODE_WRITE);
    if (file == -1) {
        return VARNEK_FILE_NOT_OPENED;
    }
    const uint32_t count = VarnekPGL_WriteFileByHandle(file, buffer, Countable(length));
    // Small data stays in the stream's buffer until here, and so does the error of a full disk.
    if (VarnekPGL_CloseFile(file) != 0) {
        return 0;
    }
    return static_cast<int32_t>(count);
}

int32_t VarnekPGL_AppendFile(const char *path, const void *buffer, uint32_t length) {
    if (buffer == nullptr && length > 0) {
        // Refused here, because the open below would create the file.
        return FILE_FAIL(-1, "%s : NULL buffer", __func__);
    }
    const PglFileHandle file = OpenWhole(__func__, path, PGL_FILE_MODE_APPEND);
    if (file == -1) {
        return VARNEK_FILE_NOT_OPENED;
    }
    uint32_t written = VarnekPGL_WriteFileByHandle(file, buffer, length);
    // Small data stays in the stream's buffer until here, and so does the error of a full disk.
    const bool closed = VarnekPGL_CloseFile(file) == 0;
    if (closed && written == length) {
        return 0;
    }
    if (written == length) {
        written = 0;
    }
    return FILE_FAIL(-1, "%s : name = %s: Fail! write size = %d, desired size = %d", __func__, path,
                     static_cast<int>(written), static_cast<int>(length));
}

int32_t VarnekPGL_GetFileSize(const char *path) {
    const PglFileHandle file = VarnekPGL_OpenFile(path, PGL_FILE_MODE_READ);
    if (file == -1) {
        return FILE_FAIL(0, "%s fail =[%s]", __func__, Shown(path));
    }
    if (VarnekPGL_SeekFile(file, 0, SEEK_END) != 0) {
        __VarnekPGL_FileLog("%s : File Seeking Fail!! file path=[%s]", __func__, path);
        VarnekPGL_CloseFile(file);
        return 0;
    }
    int64_t size = SizeOfRegularFile(StreamOf(file));
    if (size < 0) {
        size = VarnekPGL_TellFile(file);
    }
    VarnekPGL_CloseFile(file);
    return size > 0 && size <= INT32_MAX ? static_cast<int32_t>(size) : 0;
}

BOOL VarnekPGL_CheckFile(const char *path) {
    const PglFileHandle file = VarnekPGL_OpenFile(path, PGL_FILE_MODE_READ);
    if (file == -1) {
        return FILE_FAIL(FALSE, "%s : fail %s", __func__, Shown(path));
    }
    VarnekPGL_CloseFile(file);
    return TRUE;
}

int32_t VarnekPGL_DeleteFile(const char *path) {
    if (path == nullptr || remove(path) != 0) {
        return FILE_FAIL(-1, "%s : remove File[] Fail", __func__);
    }
    return 0;
}

// Whole files in memory --------------------------------------------------------------------------

char *ReadText(PglFileHandle file, uint32_t size, uint32_t *count) {
    char *data = static_cast<char *>(malloc(size_t{size} + 1));
    if (data != nullptr) {
        *count = VarnekPGL_ReadFileByHandle(file, data, size);
        data[*count] = '\0';
    }
    return data;
}

char *ReadWholeFile(const char *path, int32_t size) {
    const PglFileHandle file = OpenWhole("VarnekPGL_ReadFile", path, PGL_FILE_MODE_READ);
    if (file == -1) {
        return nullptr;
    }
    uint32_t count = 0;
    char *data = ReadText(file, static_cast<uint32_t>(size), &count);
    VarnekPGL_CloseFile(file);
    if (count == static_cast<uint32_t>(size)) {
        return data;
    }
    free(data);
    return nullptr;
}
