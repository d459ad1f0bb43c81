// Directories, and the operations that run a shell command. No state is kept between calls.
#include <dirent.h>
#include <errno.h>
#include <fcntl.h>
#include <stddef.h>
#include <stdio.h>
#include <stdlib.h>
#include <string.h>
#include <sys/stat.h>
#include <unistd.h>

#include "Varnek_File.h"
#include "Varnek_Storage.h"
#include "Varnek_Support.h"

// Callers and library agree on these records.
static_assert(sizeof(PglDirEntry) == 560 && offsetof(PglDirEntry, name) == 296);
static_assert(sizeof(PglDirEntryInfo) == 260 && offsetof(PglDirEntryInfo, name) == 4);
static_assert(sizeof(PglFmFileAttributes) == 40 && offsetof(PglFmFileAttributes, size) == 32);

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
    return FILE_FAIL(false, "%s : remove File[] Fail", "VarnekPGL_DeleteFile");
}

// Deleting a directory tree works on descriptors that are opened without following links, so it
// does not enter a link that replaces a directory meanwhile.

// An open directory between the root of the tree and the current position. The levels are on the
// heap, so that a deep tree needs no more stack.
struct TreeLevel {
    TreeLevel *parent;  // null for the root
    DIR *dir;
    const char *path;  // from the caller's root, for the log; stored behind the level
    const char *name;  // the end of the path, as its parent knows the directory

    int Container() const { return parent != nullptr ? dirfd(parent->dir) : AT_FDCWD; }
};

constexpr char kDeletion[] = "VarnekPGL_DeleteDirEx";

int OpenWithoutFollowing(int dir, const char *name) {
    return openat(dir, name, O_RDONLY | O_DIRECTORY | O_NOFOLLOW | O_CLOEXEC);
}

// Returns the level of a directory, and owns its descriptor. Returns null, after log lines, when
// the directory cannot be read.
TreeLevel *Enter(TreeLevel *parent, int fd, const char *path, size_t nameLength) {
    DIR *dir = fd >= 0 ? fdopendir(fd) : nullptr;
    if (dir == nullptr) {
        __VarnekPGL_FileLog("%s : pDir(%s) = NULL", "VarnekPGL_OpenDir", path);
        if (fd >= 0) {
            close(fd);
        }
    }
    const size_t length = strlen(path);
    TreeLevel *level =
        dir != nullptr ? static_cast<TreeLevel *>(malloc(sizeof(TreeLevel) + length + 1)) : nullptr;
    if (level == nullptr) {
        __VarnekPGL_FileLog("%s : No Eixst Dir! [%s]", kDeletion, path);
        if (dir != nullptr) {
            closedir(dir);
        }
        return nullptr;
    }
    char *const copy = reinterpret_cast<char *>(level + 1);
    memcpy(copy, path, length + 1);
    *level = {parent, dir, copy, copy + length - nameLength};
    return level;
}

// Deletes an entry, or enters it if it is a directory. Returns the level to go on with. An entry
// whose path does not fit is left, because a truncated path would name another file in the log.
TreeLevel *DeleteChild(TreeLevel *level, const PglDirEntry &entry) {
    const int dir = dirfd(level->dir);
    const char *name = entry.name;
    const size_t length = strlen(level->path);
    const char *slash = length > 0 && level->path[length - 1] == '/' ? "" : "/";
    char path[kChildPathSize];
    const int needed = snprintf(path, sizeof path, "%s%s%s", level->path, slash, name);
    if (static_cast<size_t>(needed) >= sizeof path) {
        return FILE_FAIL(level, "%s : exceed max file path length : %s/%s", kDeletion, level->path,
                         name);
    }
    if (entry.type != PGL_ENTRY_DIR) {
        RemoveAt(dir, name);
        return level;
    }
    const int fd = OpenWithoutFollowing(dir, name);
    if (fd < 0 && IsLink(dir, name)) {
        RemoveAt(dir, name);
        return level;
    }
    TreeLevel *child = Enter(level, fd, path, strlen(name));
    return child != nullptr ? child : level;
}

// Closes and removes an emptied directory. Returns 0; -1, after a log line, on failure.
int32_t RemoveLevel(TreeLevel *level) {
    VarnekPGL_CloseDir(level->dir);
    const bool removed = unlinkat(level->Container(), level->name, AT_REMOVEDIR) == 0;
    if (!removed) {
        __VarnekPGL_FileLog("%s : rmdir[%s] Fail. return FALSE", kDeletion, level->path);
    }
    free(level);
    return removed ? 0 : -1;
}

// Deletes the tree under the open directory at `path`.
int32_t DeleteTree(const char *path, int fd) {
    int32_t result = -1;
    PglDirEntry entry = {};
    TreeLevel *level = Enter(nullptr, fd, path, strlen(path));
    while (level != nullptr) {
        if (!__VarnekPGL_ReadDir(level->dir, &entry)) {
            TreeLevel *parent = level->parent;
            result = RemoveLevel(level);
            level = parent;
        } else if (strcmp(entry.name, ".") != 0 && strcmp(entry.name, "..") != 0) {
            level = DeleteChild(level, entry);
        }
    }
    return result;
}

}  // namespace

int32_t VarnekPGL_MakeDir(const char *path) {
    if (IsTooLong(path)) {
        return FILE_FAIL(-1, "%s : exceed max file path length : %s", __func__, path);
    }
    if (path != nullptr && mkdir(path, 0755) == 0) {
        return 0;
    }
    const int error = path != nullptr ? errno : EFAULT;  // as mkdir reports a null path
    char process[200];
    ReadProcessName(process);
    return FILE_FAIL(-1, "%s : [%s] dir create failed! errno(%d),process(%s) pid(%d) uid(%d)",
                     __func__, Shown(path), error, process, static_cast<int>(getpid()),
                     static_cast<int>(getuid()));
}

int32_t VarnekPGL_DeleteDir(const char *path) {
    return VarnekPGL_DeleteDirEx(path);
}

int32_t VarnekPGL_DeleteDirEx(const char *path) {
    size_t length = path != nullptr ? strlen(path) : 0;
    if (length > 0 && (path[length - 1] == '/' || path[length - 1] == '\\')) {
        length--;
    }
    // With a final slash or "/." the system would follow a link.
    size_t bare = length;
    while (bare > 1 &&
           (path[bare - 1] == '/' || (path[bare - 1] == '.' && path[bare - 2] == '/'))) {
        bare--;
    }
    char *root = path != nullptr ? strndup(path, length) : nullptr;
    char *entry = root != nullptr ? strndup(root, bare) : nullptr;
    int32_t result = -1;
    if (entry == nullptr) {
        __VarnekPGL_FileLog("%s : No Eixst Dir! [%s]", __func__, Shown(path));
    } else if (IsLink(AT_FDCWD, entry) && IsDirectory(entry)) {
        result = RemoveAt(AT_FDCWD, entry) ? 0 : -1;
    } else {
        result = DeleteTree(root, OpenWithoutFollowing(AT_FDCWD, entry));
    }
    free(root);
    free(entry);
    return result;
}

int32_t VarnekPGL_ClearDir(const char *path) {
    // A directory that could not be created again is not deleted. MakeDir below logs the reason.
    if (!IsTooLong(path) && VarnekPGL_DeleteDirEx(path) != 0) {
        return FILE_FAIL(-1, "%s : Directory Deletion Fail. Dir Path=[%s]", __func__, Shown(path));
    }
    if (VarnekPGL_MakeDir(path) != 0) {
        return FILE_FAIL(-1, "%s : Directory Creation Fail. Dir Path=[%s]", __func__, path);
    }
    return 0;
}

void *VarnekPGL_OpenDir(const char *path) {
    DIR *dir = path != nullptr ? opendir(path) : nullptr;
    if (dir == nullptr) {
        return FILE_FAIL(PGL_INVALID_DIR_HANDLE, "%s : pDir(%s) = NULL", __func__, Shown(path));
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
        return FILE_FAIL(FALSE, "%s : pEntry == NULL", __func__);
    }
    DIR *dir = DirOf(hDir);
    const struct dirent64 *next = dir != nullptr ? readdir64(dir) : nullptr;
    if (next == nullptr || next->d_reclen < 1 || next->d_reclen > 256) {
        entry->type = 0;
        return FILE_FAIL(FALSE, "%s : return FALSE pDir = 0x%x", __func__,
                         ShownHandle(reinterpret_cast<intptr_t>(hDir)));
    }
    const size_t length = strnlen(next->d_name, next->d_reclen);
    memcpy(entry->name, next->d_name, length);
    entry->name[length] = '\0';
    entry->type = next->d_type == DT_DIR ? PGL_ENTRY_DIR : PGL_ENTRY_FILE;
    return TRUE;
}

BOOL VarnekPGL_ReadDir(void *hDir, PglDirEntryInfo *info) {
    if (info == nullptr) {
        return FILE_FAIL(FALSE, "%s : pEntry == NULL", __func__);
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
        return FILE_FAIL(FALSE, "%s : failed...%s", __func__, Shown(path));
    }
    *attr = {};
    attr->size = static_cast<uint32_t>(status.st_size);
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

// Runs "COMMAND source BETWEEN destination". Returns 0; -1, after a line of the operation, on
// failure and if it may not run.
int32_t RunOnTwo(const char *operation, bool mayRun, const char *command, const char *source,
                 const char *between, const char *destination) {
    ShellCommand<kCopyCommandSize> line;
    if (mayRun && line.Add(command).AddPath(source).Add(between).AddPath(destination).Run() == 0) {
        return 0;
    }
    return FILE_FAIL(-1, "%s : fail src = %s dest = %s", operation, Shown(source),
                     Shown(destination));
}

// Whether copying loses nothing. The shell empties the destination before it reads the source, so
// the destination's content would be gone if the source could not be read or were the same file.
bool MayCopy(const char *source, const char *destination) {
    struct stat64 from = {};
    struct stat64 to = {};
    if (access(source, R_OK) != 0 || stat64(source, &from) != 0 || S_ISDIR(from.st_mode)) {
        return false;
    }
    return stat64(destination, &to) != 0 || from.st_dev != to.st_dev || from.st_ino != to.st_ino;
}

}  // namespace

int32_t VarnekPGL_CopyFile(const char *source, const char *destination) {
    const bool mayRun = source != nullptr && destination != nullptr && MayCopy(source, destination);
    return RunOnTwo(__func__, mayRun, "cat ", source, " > ", destination);
}

int32_t VarnekPGL_MoveFile(const char *source, const char *destination) {
    const bool mayRun = source != nullptr && destination != nullptr;
    return RunOnTwo(__func__, mayRun, "mv ", source, " ", destination);
}

int32_t VarnekPGL_Chmod(const char *path, int32_t mode) {
    if (mode != 666 && mode != 755 && mode != 777) {
        return -1;
    }
    ShellCommand<kChmodCommandSize> command;
    command.Add(mode == 666 ? "chmod 666 " : mode == 755 ? "chmod 755 " : "chmod 777 ");
    const int32_t status = path != nullptr ? command.AddPath(path).Run() : -1;
    if (status != 0) {
        __VarnekPGL_FileLog("%s : Could not change permission [%s]", __func__, command.Text());
    }
    return status;
}
