// Streams, large files, directories, and the commands that the shell carries out.
//
// Everything here reports through __VarnekPGL_FileLog and nothing through the trace, which reads
// its own configuration through this file. No state is kept between calls.
#include "Varnek_File.h"

#include <dirent.h>
#include <errno.h>
#include <fcntl.h>
#include <limits.h>
#include <stdarg.h>
#include <stddef.h>
#include <stdio.h>
#include <stdlib.h>
#include <string.h>
#include <sys/stat.h>
#include <unistd.h>

#include "Varnek_FileLog.h"
#include "Varnek_Support.h"
#include "varnek_platform.h"

static_assert(sizeof(PglDirEntry) == 560, "callers and library agree on this record");
static_assert(offsetof(PglDirEntry, name) == 296, "callers and library agree on this record");
static_assert(sizeof(PglDirEntryInfo) == 260, "callers and library agree on this record");
static_assert(offsetof(PglDirEntryInfo, name) == 4, "callers and library agree on this record");
static_assert(sizeof(PglFmFileAttributes) == 40, "callers and library agree on this record");
static_assert(offsetof(PglFmFileAttributes, size) == 32,
              "callers and library agree on this record");

namespace {

constexpr size_t kFileLogSize = 1024;
constexpr size_t kChildPathSize = 257;
constexpr size_t kCopyCommandSize = 532;
constexpr size_t kChmodCommandSize = 512;

constexpr int32_t kNotOpened = -18;
constexpr int32_t kInvalidBase = -8;
constexpr uint32_t kSeekBases = 3;  // SEEK_SET 0, SEEK_CUR 1, SEEK_END 2

// The stream behind a handle, null for none. -1 is what a failed open gave the caller.
FILE *StreamOf(PglFileHandle hFile) {
    return hFile != -1 ? reinterpret_cast<FILE *>(hFile) : nullptr;
}

unsigned ShownHandle(PglFileHandle hFile) {
    return static_cast<unsigned>(hFile);
}

// A length whose count fits the signed result of the whole-file operations.
uint32_t Countable(uint32_t length) {
    return length < INT32_MAX ? length : INT32_MAX;
}

bool IsTooLong(const char *path) {
    return path != nullptr && strnlen(path, MAX_PGL_FILE_PATH_LEN) >= MAX_PGL_FILE_PATH_LEN;
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

// Streams ----------------------------------------------------------------------------------------

PglFileHandle VarnekPGL_OpenFile(const char *path, int32_t flags) {
    if (IsTooLong(path)) {
        __VarnekPGL_FileLog("%s : file path(%s) length over max size", __func__, path);
        return -1;
    }
    const char *mode = nullptr;
    if ((flags & PGL_FILE_MODE_READ) != 0) {
        mode = "r";
    }
    if ((flags & PGL_FILE_MODE_WRITE) != 0) {
        mode = "w";
    }
    if ((flags & PGL_FILE_MODE_CREATE_RW) != 0) {
        mode = "w+";
    }
    if ((flags & PGL_FILE_MODE_APPEND) != 0) {
        mode = "a";
    }
    if (mode == nullptr) {
        return -1;
    }
    FILE *stream = path != nullptr ? fopen(path, mode) : nullptr;
    if (stream == nullptr) {
        __VarnekPGL_FileLog("%s : NULL file pointer. szFilePath=[%s]", __func__, Shown(path));
        return -1;
    }
    return reinterpret_cast<PglFileHandle>(stream);
}

int32_t VarnekPGL_CloseFile(PglFileHandle hFile) {
    FILE *stream = StreamOf(hFile);
    if (stream == nullptr) {
        __VarnekPGL_FileLog("%s : NULL file pointer", __func__);
        return -1;
    }
    if (fclose(stream) != 0) {
        __VarnekPGL_FileLog("%s : fail hFile = 0x%x", __func__, ShownHandle(hFile));
        return -1;
    }
    return 0;
}

int32_t VarnekPGL_SeekFile(PglFileHandle hFile, int32_t offset, uint32_t base) {
    FILE *stream = StreamOf(hFile);
    if (stream == nullptr) {
        __VarnekPGL_FileLog("%s : NULL file pointer", __func__);
        return 0;
    }
    if (base >= kSeekBases) {
        __VarnekPGL_FileLog("%s : Invalid Seek base! base=%d", __func__, static_cast<int>(base));
        return kInvalidBase;
    }
    if (fseek(stream, offset, static_cast<int>(base)) < 0) {
        __VarnekPGL_FileLog("%s : fail handle = 0x%x", __func__, ShownHandle(hFile));
        return -1;
    }
    return 0;
}

int32_t VarnekPGL_TellFile(PglFileHandle hFile) {
    FILE *stream = StreamOf(hFile);
    if (stream == nullptr) {
        __VarnekPGL_FileLog("%s : NULL file pointer", __func__);
        return -1;
    }
    // A position that 32 bits cannot hold (a directory's "end" is one) is none.
    const int64_t position = ftell(stream);
    return position <= INT32_MAX ? static_cast<int32_t>(position) : -1;
}

int32_t VarnekPGL_FlushFile(PglFileHandle hFile) {
    FILE *stream = StreamOf(hFile);
    if (stream == nullptr) {
        __VarnekPGL_FileLog("%s : NULL file pointer", __func__);
        return -1;
    }
    if (fflush(stream) != 0) {
        __VarnekPGL_FileLog("%s : fail", __func__);
        return -1;
    }
    return 0;
}

uint32_t VarnekPGL_ReadFileByHandle(PglFileHandle hFile, void *buffer, uint32_t length) {
    FILE *stream = StreamOf(hFile);
    if (stream == nullptr) {
        __VarnekPGL_FileLog("%s : NULL file pointer", __func__);
        return 0;
    }
    if (buffer == nullptr && length > 0) {
        __VarnekPGL_FileLog("%s : NULL buffer", __func__);
        return 0;
    }
    return static_cast<uint32_t>(fread(buffer, 1, length, stream));
}

uint32_t VarnekPGL_WriteFileByHandle(PglFileHandle hFile, const void *buffer, uint32_t length) {
    FILE *stream = StreamOf(hFile);
    if (stream == nullptr) {
        __VarnekPGL_FileLog("%s : NULL file pointer", __func__);
        return 0;
    }
    if (buffer == nullptr && length > 0) {
        __VarnekPGL_FileLog("%s : NULL buffer", __func__);
        return 0;
    }
    return static_cast<uint32_t>(fwrite(buffer, 1, length, stream));
}

int32_t VarnekPGL_GetFileSizeByHandle(PglFileHandle hFile) {
    const int32_t position = VarnekPGL_TellFile(hFile);
    VarnekPGL_SeekFile(hFile, 0, SEEK_END);
    const int32_t size = VarnekPGL_TellFile(hFile);
    if (position >= 0 && position != size) {
        VarnekPGL_SeekFile(hFile, position, SEEK_SET);
    }
    return size;
}

int32_t VarnekPGL_ReadFile(const char *path, void *buffer, uint32_t length) {
    const PglFileHandle file = VarnekPGL_OpenFile(path, PGL_FILE_MODE_READ);
    if (file == -1) {
        __VarnekPGL_FileLog("%s : File doesn't exist! file path=[%s]", __func__, Shown(path));
        return kNotOpened;
    }
    const uint32_t count = VarnekPGL_ReadFileByHandle(file, buffer, Countable(length));
    VarnekPGL_CloseFile(file);
    return static_cast<int32_t>(count);
}

int32_t VarnekPGL_WriteFile(const char *path, const void *buffer, uint32_t length) {
    if (buffer == nullptr && length > 0) {
        // Opening would empty the file for nothing.
        __VarnekPGL_FileLog("%s : NULL buffer", __func__);
        return 0;
    }
    const PglFileHandle file = VarnekPGL_OpenFile(path, PGL_FILE_MODE_WRITE);
    if (file == -1) {
        __VarnekPGL_FileLog("%s : File doesn't exist! file path=[%s]", __func__, Shown(path));
        return kNotOpened;
    }
    const uint32_t count = VarnekPGL_WriteFileByHandle(file, buffer, Countable(length));
    // Small data reaches a full disk only here.
    if (VarnekPGL_CloseFile(file) != 0) {
        return 0;
    }
    return static_cast<int32_t>(count);
}

int32_t VarnekPGL_AppendFile(const char *path, const void *buffer, uint32_t length) {
    if (buffer == nullptr && length > 0) {
        // Opening would create the file for nothing.
        __VarnekPGL_FileLog("%s : NULL buffer", __func__);
        return -1;
    }
    const PglFileHandle file = VarnekPGL_OpenFile(path, PGL_FILE_MODE_APPEND);
    if (file == -1) {
        __VarnekPGL_FileLog("%s : File doesn't exist! file path=[%s]", __func__, Shown(path));
        return kNotOpened;
    }
    const auto fail = [path, length](uint32_t written) {
        __VarnekPGL_FileLog("%s : name = %s: Fail! write size = %d, desired size = %d",
                            "VarnekPGL_AppendFile", path, static_cast<int>(written),
                            static_cast<int>(length));
        return -1;
    };
    const uint32_t written = VarnekPGL_WriteFileByHandle(file, buffer, length);
    int32_t result = written == length ? 0 : fail(written);
    // Small data reaches a full disk only here.
    if (VarnekPGL_CloseFile(file) != 0 && result == 0) {
        result = fail(0);
    }
    return result;
}

int32_t VarnekPGL_GetFileSize(const char *path) {
    const PglFileHandle file = VarnekPGL_OpenFile(path, PGL_FILE_MODE_READ);
    if (file == -1) {
        __VarnekPGL_FileLog("%s fail =[%s]", __func__, Shown(path));
        return 0;
    }
    if (VarnekPGL_SeekFile(file, 0, SEEK_END) != 0) {
        __VarnekPGL_FileLog("%s : File Seeking Fail!! file path=[%s]", __func__, path);
        VarnekPGL_CloseFile(file);
        return 0;
    }
    const int32_t size = VarnekPGL_TellFile(file);
    VarnekPGL_CloseFile(file);
    return size > 0 ? size : 0;
}

BOOL VarnekPGL_CheckFile(const char *path) {
    const PglFileHandle file = VarnekPGL_OpenFile(path, PGL_FILE_MODE_READ);
    if (file == -1) {
        __VarnekPGL_FileLog("%s : fail %s", __func__, Shown(path));
        return FALSE;
    }
    VarnekPGL_CloseFile(file);
    return TRUE;
}

int32_t VarnekPGL_DeleteFile(const char *path) {
    if (path == nullptr || remove(path) != 0) {
        __VarnekPGL_FileLog("%s : remove File[] Fail", __func__);
        return -1;
    }
    return 0;
}

// Large files ------------------------------------------------------------------------------------

namespace {

// Measures through the descriptor and puts its position back.
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
        // The two access modes are values, not bits: read-write takes the place of write-only.
        access = (access & ~O_ACCMODE) | O_RDWR | O_CREAT;
    }
    if ((flags & readWrite) == readWrite) {
        access = O_RDWR;
        if ((flags & PGL_FILE_MODE_CREATE_RW) != 0) {
            access |= O_CREAT;
        }
    }
    // Data is shared by the umask's leave, and never executable.
    const int fd = path != nullptr ? open(path, access | O_LARGEFILE, 0666) : -1;
    if (fd < 0) {
        __VarnekPGL_FileLog(
            "[FULLSEG_64BIT_FILE]VarnekPGL_OpenFile64Bits: Invalid Hndl: %d Filename : [%s]", fd,
            Shown(path));
    }
    return fd;
}

int32_t VarnekPGL_CloseFile64Bits(int32_t hFile) {
    if (hFile < 0) {
        __VarnekPGL_FileLog(
            "[FULLSEG_64BIT_FILE]VarnekPGL_CloseFile64Bits: Close Failure Invalid Hndl : %d",
            hFile);
        return -1;
    }
    close(hFile);
    return 0;
}

int32_t VarnekPGL_ReadFileByHandle64Bits(int32_t hFile, void *buffer, uint32_t length) {
    if (hFile < 0) {
        __VarnekPGL_FileLog(
            "[FULLSEG_64BIT_FILE]VarnekPGL_ReadFileByHandle64Bits: Read Failure Invalid Hndl : %d",
            hFile);
        return 0;
    }
    return static_cast<int32_t>(read(hFile, buffer, length));
}

int32_t VarnekPGL_WriteFileByHandle64Bits(int32_t hFile, const void *buffer, uint32_t length) {
    if (hFile < 0) {
        __VarnekPGL_FileLog(
            "[FULLSEG_64BIT_FILE]VarnekPGL_WriteFileByHandle64Bits: Write Failure Invalid Hndl : "
            "%d",
            hFile);
        return 0;
    }
    const ssize_t written = write(hFile, buffer, length);
    if (written >= 0 && static_cast<size_t>(written) == length) {
        return static_cast<int32_t>(length);
    }
    // A short write reports no error, so the errno of an earlier call must not be taken for one.
    const int error = written < 0 ? errno : 0;
    __VarnekPGL_FileLog(
        "[FULLSEG_64BIT_FILE]VarnekPGL_WriteFileByHandle64Bits: Write Failure Hndl : %d, Size : [ "
        "%u "
        "%u ] %s ",
        hFile, length, static_cast<unsigned>(written), ErrorText(error));
    switch (error) {
        case EFBIG:
            return -27;
        case EIO:
        case ETIMEDOUT:
            return -5;
        case ENOSPC:
            return -28;
        default:
            return static_cast<int32_t>(written);
    }
}

int32_t VarnekPGL_SeekFile64Bits(int32_t hFile, int64_t offset, uint32_t base) {
    if (base >= kSeekBases) {
        __VarnekPGL_FileLog(
            "[FULLSEG_64BIT_FILE] VarnekPGL_SeekFile64Bits Invalid Seek base! base=[%d]",
            static_cast<int>(base));
        return kInvalidBase;
    }
    if (hFile < 0) {
        __VarnekPGL_FileLog(
            "[FULLSEG_64BIT_FILE]VarnekPGL_FSeek64Bits: Seek Failure Invalid Hndl : %d", hFile);
        return -1;
    }
    lseek64(hFile, offset, static_cast<int>(base));
    return 0;
}

int64_t VarnekPGL_TellFile64Bits(int32_t hFile) {
    if (hFile < 0) {
        __VarnekPGL_FileLog(
            "[FULLSEG_64BIT_FILE]VarnekPGL_TellFile64Bits: Tell Failure Invalid Hndl : %d", hFile);
        return 0;
    }
    return lseek64(hFile, 0, SEEK_CUR);
}

int32_t VarnekPGL_FlushFile64Bits(int32_t hFile) {
    if (hFile < 0) {
        __VarnekPGL_FileLog(
            "[FULLSEG_64BIT_FILE]VarnekPGL_FlushFile64Bits: Flush Failure Invalid Hndl : %d",
            hFile);
        return -1;
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

// Directories ------------------------------------------------------------------------------------

namespace {

// The directory stream behind a handle, null for none.
DIR *DirOf(void *hDir) {
    return hDir != PGL_INVALID_DIR_HANDLE ? static_cast<DIR *>(hDir) : nullptr;
}

// The first argument of the calling process's command line, empty when it cannot be read.
template <size_t size>
void ReadProcessName(char (&name)[size]) {
    char path[32];
    snprintf(path, sizeof path, "/proc/%d/cmdline", static_cast<int>(getpid()));
    FILE *stream = fopen(path, "r");
    if (stream == nullptr || fgets(name, size, stream) == nullptr) {
        name[0] = '\0';
    }
    if (stream != nullptr) {
        fclose(stream);
    }
}

// What one level of a tree deletion works with. It lies in the heap: a deep tree would be too much
// for the stack of a small thread.
struct TreeLevel {
    PglDirEntry entry;
    char child[kChildPathSize];
    char path[1];  // and as many more as it takes
};

// A level for a directory, whose path loses one final slash or backslash; null without memory.
TreeLevel *MakeLevel(const char *path) {
    const size_t length = strlen(path);
    TreeLevel *level = static_cast<TreeLevel *>(malloc(sizeof(TreeLevel) + length));
    if (level == nullptr) {
        return nullptr;
    }
    memcpy(level->path, path, length + 1);
    if (length > 0 && (path[length - 1] == '/' || path[length - 1] == '\\')) {
        level->path[length - 1] = '\0';
    }
    level->entry = {};
    return level;
}

// Whether the path names a link to a directory. The slashes that it may still end in would have
// lstat look through the link; the path of a link loses them.
bool CutToLink(char *path) {
    size_t bare = strlen(path);
    while (bare > 1 && path[bare - 1] == '/') {
        bare--;
    }
    const char cut = path[bare];
    path[bare] = '\0';
    struct stat64 link = {};
    struct stat64 target = {};
    const bool isLink = lstat64(path, &link) == 0 && S_ISLNK(link.st_mode) &&
                        stat64(path, &target) == 0 && S_ISDIR(target.st_mode);
    if (!isLink) {
        path[bare] = cut;
    }
    return isLink;
}

// Deletes the level's present entry. A path that does not fit must not be cut into the name of some
// other file, so that entry stays.
void DeleteChild(const char *operation, TreeLevel *level) {
    const char *name = level->entry.name;
    const size_t length = strlen(level->path);
    const bool joined = name[0] == '/' || (length > 0 && level->path[length - 1] == '/');
    const int needed =
        snprintf(level->child, sizeof level->child, joined ? "%s%s" : "%s/%s", level->path, name);
    if (needed < 0 || static_cast<size_t>(needed) >= sizeof level->child) {
        __VarnekPGL_FileLog("%s : exceed max file path length : %s/%s", operation, level->path,
                            name);
        return;
    }
    switch (level->entry.type) {
        case PGL_ENTRY_DIR:
            VarnekPGL_DeleteDirEx(level->child);
            return;
        case PGL_ENTRY_FILE:
            VarnekPGL_DeleteFile(level->child);
            return;
        default:
            __VarnekPGL_FileLog("%s: Invalid entry type", operation);
    }
}

// Deletes the level's directory with all that is in it, for `operation`.
int32_t DeleteTree(const char *operation, TreeLevel *level) {
    void *dir = VarnekPGL_OpenDir(level->path);
    if (dir == PGL_INVALID_DIR_HANDLE) {
        __VarnekPGL_FileLog("%s : No Eixst Dir! [%s]", operation, level->path);
        return -1;
    }
    while (__VarnekPGL_ReadDir(dir, &level->entry)) {
        if (strcmp(level->entry.name, ".") != 0 && strcmp(level->entry.name, "..") != 0) {
            DeleteChild(operation, level);
        }
    }
    VarnekPGL_CloseDir(dir);
    if (rmdir(level->path) != 0) {
        __VarnekPGL_FileLog("%s : rmdir[%s] Fail. return FALSE", operation, level->path);
        return -1;
    }
    return 0;
}

}  // namespace

int32_t VarnekPGL_MakeDir(const char *path) {
    if (IsTooLong(path)) {
        __VarnekPGL_FileLog("%s : exceed max file path length : %s", __func__, path);
        return -1;
    }
    if (path != nullptr && mkdir(path, 0755) == 0) {
        return 0;
    }
    const int error = path != nullptr ? errno : EFAULT;  // what the system says of a null path
    char process[200];
    ReadProcessName(process);
    __VarnekPGL_FileLog("%s : [%s] dir create failed! errno(%d),process(%s) pid(%d) uid(%d)",
                        __func__, Shown(path), error, process, static_cast<int>(getpid()),
                        static_cast<int>(getuid()));
    return -1;
}

int32_t VarnekPGL_DeleteDir(const char *path) {
    return VarnekPGL_DeleteDirEx(path);
}

// Calls itself for each directory inside; the limit on a child's path bounds the depth.
int32_t VarnekPGL_DeleteDirEx(const char *path) {
    TreeLevel *level = path != nullptr ? MakeLevel(path) : nullptr;
    if (level == nullptr) {
        __VarnekPGL_FileLog("%s : No Eixst Dir! [%s]", __func__, Shown(path));
        return -1;
    }
    const int32_t result =
        CutToLink(level->path) ? VarnekPGL_DeleteFile(level->path) : DeleteTree(__func__, level);
    free(level);
    return result;
}

int32_t VarnekPGL_ClearDir(const char *path) {
    // What could not be made again is not deleted.
    if (IsTooLong(path) || VarnekPGL_DeleteDirEx(path) != 0) {
        __VarnekPGL_FileLog("%s : Directory Deletion Fail. Dir Path=[%s]", __func__, Shown(path));
        return -1;
    }
    if (VarnekPGL_MakeDir(path) != 0) {
        __VarnekPGL_FileLog("%s : Directory Creation Fail. Dir Path=[%s]", __func__, path);
        return -1;
    }
    return 0;
}

void *VarnekPGL_OpenDir(const char *path) {
    DIR *dir = path != nullptr ? opendir(path) : nullptr;
    if (dir == nullptr) {
        __VarnekPGL_FileLog("%s : pDir(%s) = NULL", __func__, Shown(path));
        return PGL_INVALID_DIR_HANDLE;
    }
    return dir;
}

BOOL VarnekPGL_CloseDir(void *hDir) {
    if (DIR *dir = DirOf(hDir)) {
        closedir(dir);
    }
    return TRUE;
}

BOOL __VarnekPGL_ReadDir(void *hDir, PglDirEntry *entry) {
    if (entry == nullptr) {
        __VarnekPGL_FileLog("%s : pEntry == NULL", __func__);
        return FALSE;
    }
    DIR *dir = DirOf(hDir);
    const struct dirent64 *next = dir != nullptr ? readdir64(dir) : nullptr;
    if (next == nullptr || next->d_reclen < 1 || next->d_reclen > 256) {
        entry->type = 0;
        __VarnekPGL_FileLog("%s : return FALSE pDir = 0x%x", __func__,
                            ShownHandle(reinterpret_cast<intptr_t>(hDir)));
        return FALSE;
    }
    const size_t length = strnlen(next->d_name, next->d_reclen);
    memcpy(entry->name, next->d_name, length);
    entry->name[length] = '\0';
    entry->type = next->d_type == DT_DIR ? PGL_ENTRY_DIR : PGL_ENTRY_FILE;
    return TRUE;
}

BOOL VarnekPGL_ReadDir(void *hDir, PglDirEntryInfo *info) {
    if (info == nullptr) {
        __VarnekPGL_FileLog("%s : pEntry == NULL", __func__);
        return FALSE;
    }
    info->type = 0;
    PglDirEntry entry = {};
    if (!__VarnekPGL_ReadDir(hDir, &entry)) {
        return FALSE;
    }
    info->type = entry.type == PGL_ENTRY_DIR ? PGL_ENTRY_DIR : PGL_ENTRY_FILE;
    const size_t length = strlen(entry.name);
    if (length >= sizeof info->name) {
        return FALSE;
    }
    memcpy(info->name, entry.name, length + 1);
    return TRUE;
}

BOOL VarnekPGL_CheckDir(const char *path) {
    void *dir = VarnekPGL_OpenDir(path);
    if (dir == PGL_INVALID_DIR_HANDLE) {
        return FALSE;
    }
    VarnekPGL_CloseDir(dir);
    return TRUE;
}

BOOL VarnekPGL_FmGetFileAttributes(const char *path, PglFmFileAttributes *attr) {
    if (attr == nullptr) {
        return FALSE;
    }
    struct stat64 status = {};
    if (path == nullptr || stat64(path, &status) != 0) {
        __VarnekPGL_FileLog("%s : failed...%s", __func__, Shown(path));
        return FALSE;
    }
    *attr = {};
    attr->size = static_cast<uint32_t>(status.st_size);
    return TRUE;
}

// Commands ---------------------------------------------------------------------------------------

namespace {

// A shell command in a buffer of fixed size; what does not fit makes it unfit to run, never cut.
template <size_t size>
class ShellCommand {
  public:
    ShellCommand &Add(const char *text) {
        for (; *text != '\0'; text++) {
            Put(*text);
        }
        return *this;
    }

    // Adds a path as one word that the shell leaves alone and that no command takes for an option.
    ShellCommand &AddPath(const char *path) {
        const bool plain = IsPlain(path);
        if (!plain) {
            Put('\'');
        }
        if (path[0] == '-') {
            Add("./");
        }
        for (; *path != '\0'; path++) {
            if (*path == '\'') {
                Add("'\\''");
            } else {
                Put(*path);
            }
        }
        if (!plain) {
            Put('\'');
        }
        return *this;
    }

    // The command's status as system() gives it; -1 for a command that does not fit.
    int Run() const { return fits_ ? system(text_) : -1; }
    const char *Text() const { return text_; }

  private:
    static bool IsPlain(const char *path) {
        const size_t length = strspn(path,
                                     "ABCDEFGHIJKLMNOPQRSTUVWXYZabcdefghijklmnopqrstuvwxyz"
                                     "0123456789/._-+,:@%=");
        return length > 0 && path[length] == '\0';
    }

    void Put(char c) {
        if (length_ + 1 >= size) {
            fits_ = false;
            return;
        }
        text_[length_++] = c;
        text_[length_] = '\0';
    }

    char text_[size] = {};
    size_t length_ = 0;
    bool fits_ = true;
};

// Whether a copy may run: the shell empties the destination before it reads the source, so a source
// that it cannot read, or that is the destination, would cost the destination its content.
bool MayCopy(const char *source, const char *destination) {
    struct stat64 from = {};
    struct stat64 to = {};
    if (stat64(source, &from) != 0 || S_ISDIR(from.st_mode) || access(source, R_OK) != 0) {
        return false;
    }
    return stat64(destination, &to) != 0 || from.st_dev != to.st_dev || from.st_ino != to.st_ino;
}

}  // namespace

int32_t VarnekPGL_CopyFile(const char *source, const char *destination) {
    ShellCommand<kCopyCommandSize> command;
    if (source == nullptr || destination == nullptr || !MayCopy(source, destination) ||
        command.Add("cat ").AddPath(source).Add(" > ").AddPath(destination).Run() != 0) {
        __VarnekPGL_FileLog("%s : fail src = %s dest = %s", __func__, Shown(source),
                            Shown(destination));
        return -1;
    }
    return 0;
}

int32_t VarnekPGL_MoveFile(const char *source, const char *destination) {
    ShellCommand<kCopyCommandSize> command;
    if (source == nullptr || destination == nullptr ||
        command.Add("mv ").AddPath(source).Add(" ").AddPath(destination).Run() != 0) {
        __VarnekPGL_FileLog("%s : fail src = %s dest = %s", __func__, Shown(source),
                            Shown(destination));
        return -1;
    }
    return 0;
}

int32_t VarnekPGL_Chmod(const char *path, int32_t mode) {
    ShellCommand<kChmodCommandSize> command;
    switch (mode) {
        case 666:
            command.Add("chmod 666 ");
            break;
        case 755:
            command.Add("chmod 755 ");
            break;
        case 777:
            command.Add("chmod 777 ");
            break;
        default:
            return -1;
    }
    const int32_t status = path != nullptr ? command.AddPath(path).Run() : -1;
    if (status != 0) {
        __VarnekPGL_FileLog("%s : Could not change permission [%s]", __func__, command.Text());
    }
    return status;
}
