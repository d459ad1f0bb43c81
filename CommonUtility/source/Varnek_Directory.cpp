// Directories, and the operations that run a shell command. No state is kept between calls.
#include <dirent.h>
#include <errno.h>
#include <fcntl.h>
#include <stddef.h>
#include <stdio.h>
#include <stdlib.h>
#include <string.h>
#include <sys/file.h>
#include <sys/stat.h>
#include <unistd.h>

#include <initializer_list>

#include "Varnek_File.h"
#include "Varnek_Storage.h"
#include "Varnek_Support.h"

static_assert(sizeof(PglDirEntry) == 560, "callers and library agree on this record");
static_assert(offsetof(PglDirEntry, name) == 296, "callers and library agree on this record");
static_assert(sizeof(PglDirEntryInfo) == 260, "callers and library agree on this record");
static_assert(offsetof(PglDirEntryInfo, name) == 4, "callers and library agree on this record");
static_assert(sizeof(PglFmFileAttributes) == 40, "callers and library agree on this record");
static_assert(offsetof(PglFmFileAttributes, size) == 32,
              "callers and library agree on this record");

namespace {

constexpr size_t kChildPathSize = 257;
constexpr size_t kCopyCommandSize = 532;
constexpr size_t kChmodCommandSize = 512;

// Returns the directory stream of a handle, null for none.
DIR *DirOf(void *hDir) {
    return hDir != PGL_INVALID_DIR_HANDLE ? static_cast<DIR *>(hDir) : nullptr;
}

// Reads the name by which the process was started (argv[0]); it is empty when it cannot be read.
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

// Whether a path is a link. It does not use stat, which fails on a 32-bit system when the file has
// times after 2038.
bool IsLink(int dir, const char *name) {
    char target = '\0';
    return readlinkat(dir, name, &target, sizeof target) >= 0;
}

bool IsDirectory(const char *path) {
    const int fd = open(path, O_PATH | O_DIRECTORY | O_CLOEXEC);
    if (fd >= 0) {
        close(fd);
    }
    return fd >= 0;
}

// Removes a file or an empty directory, as remove() does. Never follows a link.
bool RemoveAt(int dir, const char *name) {
    if (unlinkat(dir, name, 0) == 0 ||
        (errno == EISDIR && unlinkat(dir, name, AT_REMOVEDIR) == 0)) {
        return true;
    }
    __VarnekPGL_FileLog("%s : remove File[] Fail", "VarnekPGL_DeleteFile");
    return false;
}

// An open directory between the root of a tree deletion and its current position.
struct TreeLevel {
    TreeLevel *parent;  // null for the root
    DIR *dir;
    size_t pathLength;  // of the directory's path
};

// The deletion of a directory tree, for VarnekPGL_DeleteDirEx. It works on descriptors that are
// opened without following links, so it does not enter a link that replaces a directory during the
// deletion. The levels are on the heap, so that a deep tree needs no more stack.
class TreeDeletion {
  public:
    // `path` is the path of the root, in a block with room for the path of a child.
    explicit TreeDeletion(char *path) : path_(path) {}

    int32_t Run() {
        // With a final slash or "/." the system would follow a link, so they are cut off here.
        size_t bare = strlen(path_);
        while (bare > 1 &&
               (path_[bare - 1] == '/' || (path_[bare - 1] == '.' && path_[bare - 2] == '/'))) {
            bare--;
        }
        const char cut = path_[bare];
        path_[bare] = '\0';
        if (IsLink(AT_FDCWD, path_) && IsDirectory(path_)) {
            return RemoveAt(AT_FDCWD, path_) ? 0 : -1;
        }
        const int fd = OpenWithoutFollowing(AT_FDCWD, path_);
        path_[bare] = cut;
        if (!Enter(fd)) {
            return -1;
        }
        int32_t result = 0;
        while (level_ != nullptr) {
            if (!__VarnekPGL_ReadDir(level_->dir, &entry_)) {
                result = RemoveLevel();
            } else if (strcmp(entry_.name, ".") != 0 && strcmp(entry_.name, "..") != 0) {
                DeleteChild();
            }
        }
        return result;
    }

  private:
    static constexpr const char *kOperation = "VarnekPGL_DeleteDirEx";

    static int OpenWithoutFollowing(int dir, const char *name) {
        return openat(dir, name, O_RDONLY | O_DIRECTORY | O_NOFOLLOW | O_CLOEXEC);
    }

    // Makes the directory at path_ the current level, and owns its descriptor. Returns false, after
    // log lines, when the directory cannot be read.
    bool Enter(int fd) {
        DIR *dir = fd >= 0 ? fdopendir(fd) : nullptr;
        TreeLevel *level =
            dir != nullptr ? static_cast<TreeLevel *>(malloc(sizeof(TreeLevel))) : nullptr;
        if (level != nullptr) {
            *level = {level_, dir, strlen(path_)};
            level_ = level;
            return true;
        }
        if (dir != nullptr) {
            closedir(dir);
        } else {
            __VarnekPGL_FileLog("%s : pDir(%s) = NULL", "VarnekPGL_OpenDir", path_);
            if (fd >= 0) {
                close(fd);
            }
        }
        __VarnekPGL_FileLog("%s : No Eixst Dir! [%s]", kOperation, path_);
        return false;
    }

    // Deletes the current entry, or enters it if it is a directory. An entry whose path does not
    // fit is left, because the truncated path could name another file.
    void DeleteChild() {
        const char *name = entry_.name;
        const size_t length = level_->pathLength;
        const char *slash = name[0] == '/' || (length > 0 && path_[length - 1] == '/') ? "" : "/";
        if (length + strlen(slash) + strlen(name) >= kChildPathSize) {
            __VarnekPGL_FileLog("%s : exceed max file path length : %s/%s", kOperation, path_,
                                name);
            return;
        }
        if (entry_.type != PGL_ENTRY_DIR) {
            RemoveAt(dirfd(level_->dir), name);
            return;
        }
        snprintf(path_ + length, kChildPathSize - length, "%s%s", slash, name);
        const int fd = OpenWithoutFollowing(dirfd(level_->dir), name);
        if (fd < 0 && IsLink(dirfd(level_->dir), name)) {
            RemoveAt(dirfd(level_->dir), name);
        } else if (Enter(fd)) {
            return;
        }
        path_[length] = '\0';
    }

    // Leaves the current directory and removes it. Returns 0; -1, after a log line, on failure.
    int32_t RemoveLevel() {
        TreeLevel *level = level_;
        level_ = level->parent;
        VarnekPGL_CloseDir(level->dir);
        free(level);
        const size_t parentLength = level_ != nullptr ? level_->pathLength : 0;
        const char *name = path_ + parentLength;
        const bool removed =
            level_ != nullptr
                ? unlinkat(dirfd(level_->dir), *name == '/' ? name + 1 : name, AT_REMOVEDIR) == 0
                : rmdir(path_) == 0;
        if (!removed) {
            __VarnekPGL_FileLog("%s : rmdir[%s] Fail. return FALSE", kOperation, path_);
        }
        if (level_ != nullptr) {
            path_[parentLength] = '\0';
        }
        return removed ? 0 : -1;
    }

    char *const path_;
    TreeLevel *level_ = nullptr;
    PglDirEntry entry_ = {};
};

}  // namespace

int32_t VarnekPGL_MakeDir(const char *path) {
    if (IsTooLong(path)) {
        __VarnekPGL_FileLog("%s : exceed max file path length : %s", __func__, path);
        return -1;
    }
    if (path != nullptr && mkdir(path, 0755) == 0) {
        return 0;
    }
    const int error = path != nullptr ? errno : EFAULT;  // as mkdir reports a null path
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

int32_t VarnekPGL_DeleteDirEx(const char *path) {
    const size_t length = path != nullptr ? strlen(path) : 0;
    const size_t room = length < kChildPathSize ? kChildPathSize : length + 1;
    char *copy = path != nullptr ? static_cast<char *>(malloc(room)) : nullptr;
    if (copy == nullptr) {
        __VarnekPGL_FileLog("%s : No Eixst Dir! [%s]", __func__, Shown(path));
        return -1;
    }
    memcpy(copy, path, length + 1);
    if (length > 0 && (path[length - 1] == '/' || path[length - 1] == '\\')) {
        copy[length - 1] = '\0';
    }
    const int32_t result = TreeDeletion(copy).Run();
    free(copy);
    return result;
}

int32_t VarnekPGL_ClearDir(const char *path) {
    // A directory that could not be created again is not deleted. MakeDir below logs the reason.
    if (!IsTooLong(path) && VarnekPGL_DeleteDirEx(path) != 0) {
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
    int64_t size = 0;
    if (path != nullptr && stat64(path, &status) == 0) {
        size = status.st_size;
    } else if (path != nullptr && errno == EOVERFLOW) {
        // The file exists, but its times after 2038 do not fit the record of a 32-bit system.
        size = VarnekPGL_GetFileSize64Bits(path);
    } else {
        __VarnekPGL_FileLog("%s : failed...%s", __func__, Shown(path));
        return FALSE;
    }
    *attr = {};
    attr->size = static_cast<uint32_t>(size);
    return TRUE;
}

// Commands ---------------------------------------------------------------------------------------

namespace {

// A shell command in a buffer of fixed size. A command that does not fit is never run, not even
// truncated.
template <size_t size>
class ShellCommand {
  public:
    ShellCommand &Add(const char *text) {
        for (; *text != '\0'; text++) {
            Put(*text);
        }
        return *this;
    }

    // Adds a path as one word. The shell expands nothing in it, and no command takes it for an
    // option.
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

    // Runs the command and returns its status as system() does; -1 for a command that does not fit.
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

// Returns whether two paths may name the same file, without stat. If they name the same file, a
// lock through one path prevents a lock through the other. It also returns true if a lock cannot be
// taken for another reason.
bool ShareALock(const char *a, const char *b) {
    const int first = open(a, O_RDONLY | O_NONBLOCK | O_CLOEXEC);
    const int second = open(b, O_RDONLY | O_NONBLOCK | O_CLOEXEC);
    const bool apart = first >= 0 && second >= 0 && flock(first, LOCK_EX | LOCK_NB) == 0 &&
                       flock(second, LOCK_EX | LOCK_NB) == 0;
    for (const int fd : {first, second}) {
        if (fd >= 0) {
            close(fd);
        }
    }
    return !apart;
}

// Whether two paths name the same file. On a 32-bit system stat fails when times after 2038 do not
// fit its record. If the paths name the same file, it fails for both.
bool IsSameFile(const char *a, const char *b) {
    struct stat64 first = {};
    struct stat64 second = {};
    const int firstError = stat64(a, &first) == 0 ? 0 : errno;
    const int secondError = stat64(b, &second) == 0 ? 0 : errno;
    if (firstError == EOVERFLOW && secondError == EOVERFLOW) {
        return ShareALock(a, b);
    }
    return firstError == 0 && secondError == 0 && first.st_dev == second.st_dev &&
           first.st_ino == second.st_ino;
}

// Whether a copy may run. The shell empties the destination before it reads the source. So if the
// source could not be read, or were the destination itself, the destination would lose its content.
bool MayCopy(const char *source, const char *destination) {
    return access(source, R_OK) == 0 && !IsDirectory(source) && !IsSameFile(source, destination);
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
