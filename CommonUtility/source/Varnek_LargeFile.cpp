// Large files: descriptors with 64-bit offsets. No state is kept between calls.
#include <errno.h>
#include <fcntl.h>
#include <unistd.h>

#include "Varnek_File.h"
#include "Varnek_Storage.h"
#include "Varnek_Support.h"

// Logs a failure of this family, with its marker in front, and evaluates to the result.
#define LARGE_FILE_FAIL(result, format, ...) \
    FILE_FAIL(result, "[FULLSEG_64BIT_FILE]" format, __VA_ARGS__)

namespace {

// Returns the size of the file, and restores the position.
int64_t SizeOfDescriptor(int fd) {
    const int64_t position = lseek64(fd, 0, SEEK_CUR);
    const int64_t size = lseek64(fd, 0, SEEK_END);
    lseek64(fd, position, SEEK_SET);
    return size;
}

}  // namespace

int32_t VarnekPGL_OpenFile64Bits(const char *path, int32_t flags) {
    const int32_t readWrite = PGL_FILE_MODE_READ | PGL_FILE_MODE_WRITE;
    int access = O_RDONLY;
    if ((flags & PGL_FILE_MODE_APPEND) != 0) {
        access |= O_APPEND;
    }
    if ((flags & PGL_FILE_MODE_WRITE) != 0) {
        access |= O_WRONLY;
    }
    if ((flags & PGL_FILE_MODE_CREATE_RW) != 0) {
        // The access modes are values, not bits, so read-write has to replace write-only.
        access = (access & ~O_ACCMODE) | O_RDWR | O_CREAT;
    }
    if ((flags & readWrite) == readWrite) {
        access = O_RDWR | ((flags & PGL_FILE_MODE_CREATE_RW) != 0 ? O_CREAT : 0);
    }
    // The umask decides who else may use the data; it is never executable.
    const int fd = path != nullptr ? open(path, access | O_LARGEFILE, 0666) : -1;
    if (fd < 0) {
        return LARGE_FILE_FAIL(fd, "VarnekPGL_OpenFile64Bits: Invalid Hndl: %d Filename : [%s]", fd,
                               Shown(path));
    }
    return fd;
}

int32_t VarnekPGL_CloseFile64Bits(int32_t hFile) {
    if (hFile < 0) {
        return LARGE_FILE_FAIL(-1, "VarnekPGL_CloseFile64Bits: Close Failure Invalid Hndl : %d",
                               hFile);
    }
    close(hFile);
    return 0;
}

int32_t VarnekPGL_ReadFileByHandle64Bits(int32_t hFile, void *buffer, uint32_t length) {
    if (hFile < 0) {
        return LARGE_FILE_FAIL(
            0, "VarnekPGL_ReadFileByHandle64Bits: Read Failure Invalid Hndl : %d", hFile);
    }
    return static_cast<int32_t>(read(hFile, buffer, length));
}

int32_t VarnekPGL_WriteFileByHandle64Bits(int32_t hFile, const void *buffer, uint32_t length) {
    if (hFile < 0) {
        return LARGE_FILE_FAIL(
            0, "VarnekPGL_WriteFileByHandle64Bits: Write Failure Invalid Hndl : %d", hFile);
    }
    const ssize_t written = write(hFile, buffer, length);
    if (written >= 0 && static_cast<size_t>(written) == length) {
        return static_cast<int32_t>(length);
    }
    // A short write sets no errno, so the value of an earlier call must not be reported.
    const int error = written < 0 ? errno : 0;
    const int32_t result = LARGE_FILE_FAIL(
        static_cast<int32_t>(written),
        "VarnekPGL_WriteFileByHandle64Bits: Write Failure Hndl : %d, Size : [ %u %u ] %s ", hFile,
        length, static_cast<unsigned>(written), ErrorText(error));
    switch (error) {
        case EFBIG:
            return VARNEK_FILE_TOO_LARGE;
        case EIO:
        case ETIMEDOUT:
            return VARNEK_FILE_DEVICE_FAILURE;
        case ENOSPC:
            return VARNEK_FILE_MEDIUM_FULL;
        default:
            return result;
    }
}

int32_t VarnekPGL_SeekFile64Bits(int32_t hFile, int64_t offset, uint32_t base) {
    if (base >= kSeekBases) {
        return LARGE_FILE_FAIL(VARNEK_FILE_INVALID_BASE,
                               " VarnekPGL_SeekFile64Bits Invalid Seek base! base=[%d]",
                               static_cast<int>(base));
    }
    if (hFile < 0) {
        return LARGE_FILE_FAIL(-1, "VarnekPGL_FSeek64Bits: Seek Failure Invalid Hndl : %d", hFile);
    }
    lseek64(hFile, offset, static_cast<int>(base));
    return 0;
}

int64_t VarnekPGL_TellFile64Bits(int32_t hFile) {
    if (hFile < 0) {
        return LARGE_FILE_FAIL(0, "VarnekPGL_TellFile64Bits: Tell Failure Invalid Hndl : %d",
                               hFile);
    }
    return lseek64(hFile, 0, SEEK_CUR);
}

int32_t VarnekPGL_FlushFile64Bits(int32_t hFile) {
    if (hFile < 0) {
        return LARGE_FILE_FAIL(-1, "VarnekPGL_FlushFile64Bits: Flush Failure Invalid Hndl : %d",
                               hFile);
    }
    fsync(hFile);
    return 0;
}

int64_t VarnekPGL_GetFileSize64Bits(const char *path) {
    const int fd = path != nullptr ? open(path, O_RDONLY | O_LARGEFILE) : -1;
    if (fd < 0) {
        return 0;
    }
    const int64_t size = SizeOfDescriptor(fd);
    close(fd);
    return size > 0 ? size : 0;
}

int64_t VarnekPGL_GetFileSizeByHandle64Bits(int32_t hFile) {
    return SizeOfDescriptor(hFile);
}
