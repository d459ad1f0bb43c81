// The settings and their file. Finding a key, loading and saving share one table of keys.
#include "Varnek_Config.h"

#include <dirent.h>
#include <errno.h>
#include <fcntl.h>
#include <signal.h>
#include <stddef.h>
#include <stdio.h>
#include <stdlib.h>
#include <string.h>
#include <sys/stat.h>
#include <unistd.h>

#include <algorithm>
#include <atomic>

#include "Varnek_ConfigFile.h"
#include "Varnek_File.h"
#include "Varnek_Storage.h"
#include "Varnek_StrUtil.h"
#include "Varnek_Support.h"
#include "Varnek_Trace.h"
#include "varnek_platform.h"

#define CTRL_HIGH(...) VARNEK_TRACE(VARNEK_LEVEL_HIGH | VARNEK_MODULE_MAIN_CONTROL, __VA_ARGS__)
#define CTRL_MID(...) VARNEK_TRACE(VARNEK_LEVEL_MID | VARNEK_MODULE_MAIN_CONTROL, __VA_ARGS__)

// Callers and library agree on this record.
static_assert(sizeof(VarnekConfigInfo) == 212 && offsetof(VarnekConfigInfo, standardType) == 100 &&
              offsetof(VarnekConfigInfo, tsFileSimulEnable) == 105 &&
              offsetof(VarnekConfigInfo, cprmPlayerDelay) == 108 &&
              offsetof(VarnekConfigInfo, supportNation) == 112);

namespace {

constexpr size_t kLineSize = 255;  // a line that is read, with its terminator
constexpr size_t kFileSize = 900;  // the text that is written, with its terminator

// Saving writes a draft first, whose name ends in the saver's process id and a number.
constexpr char kDraftPrefix[] = "Varnek_Config.new.";
std::atomic<unsigned int> gNextDraft{0};  // number of this process's next draft

enum ConfigField {
    AREA_NAME,
    STANDARD_TYPE,
    TS_CAPTURE,
    TS_FILE_SIMUL,
    PLAYER_DELAY,
    NATION,
    CONFIG_FIELD_COUNT
};

// If a line contains several keys, the first one in this table counts.
constexpr const char *kKeys[CONFIG_FIELD_COUNT] = {
    "CONFIG_CURRENTAREANAME=", "CONFIG_STANDARDTYPE=",     "CONFIG_TSCAPTURE=",
    "CONFIG_TSFILESIMUL=",     "CONFIG_CPRMPLAYER_DELAY=", "CONFIG_SUPPORT_NATION=",
};

constexpr char kFeatureKey[] = "TarnFeature_MobileTV_EnableServiceAs";
constexpr char kNationTag[] = "NATION:";
constexpr size_t kNationLength = 3;
constexpr char kDefaultNation[] = "BRA";
constexpr char kNationWithBml[] = "PHL";

VarnekConfigInfo gpVarnekConfigInfo = {"", 2, 0, 0, 68, ""};

// Copies as much of the text as fits, and terminates it.
template <size_t size>
void CopyText(char (&to)[size], const char *from, size_t length) {
    const size_t count = length < size ? length : size - 1;
    memcpy(to, from, count);
    to[count] = '\0';
}

// Converts as atoi does. A number that does not fit becomes the nearest one that does.
int32_t NumberOf(const char *text) {
    const ErrnoKeeper keeper;
    const long long number = strtoll(text, nullptr, 10);
    return static_cast<int32_t>(number > INT32_MAX   ? INT32_MAX
                                : number < INT32_MIN ? INT32_MIN
                                                     : number);
}

template <size_t size>
void StoreText(char (&field)[size], const char *key, const char *value) {
    CopyText(field, value, strlen(value));
    CTRL_HIGH("%s[%s]", key, field);
}

int32_t StoredNumber(const char *key, const char *value) {
    const int32_t number = NumberOf(value);
    CTRL_HIGH("%s[%d]", key, number);
    return number;
}

void StoreValue(int field, const char *value) {
    const char *key = kKeys[field];
    switch (field) {
        case AREA_NAME:
            StoreText(gpVarnekConfigInfo.currentAreaName, key, value);
            break;
        case STANDARD_TYPE:
            gpVarnekConfigInfo.standardType = StoredNumber(key, value);
            break;
        case TS_CAPTURE:
            gpVarnekConfigInfo.tsCaptureEnable = static_cast<uint8_t>(StoredNumber(key, value));
            break;
        case TS_FILE_SIMUL:
            gpVarnekConfigInfo.tsFileSimulEnable = static_cast<uint8_t>(StoredNumber(key, value));
            break;
        case PLAYER_DELAY:
            gpVarnekConfigInfo.cprmPlayerDelay = StoredNumber(key, value);
            break;
        default:
            StoreText(gpVarnekConfigInfo.supportNation, key, value);
            break;
    }
}

void ReadLine(const char *line) {
    CTRL_HIGH("  __VarnekCfg_GetKeyWord : called!");
    for (int field = 0; field < CONFIG_FIELD_COUNT; ++field) {
        const char *found = VarnekPGL_Stristr(line, kKeys[field]);
        if (found != nullptr) {
            StoreValue(field, found + strlen(kKeys[field]));
            return;
        }
    }
    CTRL_HIGH(" ERROR :unknown line(%s)", line);
}

void ReadLines(const char *text) {
    text += strspn(text, "\r\n");
    const char *const end = text + strlen(text);
    char line[kLineSize];
    while (TakeLine(&text, end, line)) {
        ReadLine(line);
    }
}

// Formats the whole file. The texts are limited to 99 bytes, because a caller may have filled a
// field without a terminator.
void FormatFile(char (&text)[kFileSize]) {
    const VarnekConfigInfo &info = gpVarnekConfigInfo;
    snprintf(text, sizeof text, "%s%.99s\n%s%d\n%s%d\n%s%d\n%s%d\n%s%.99s\n", kKeys[AREA_NAME],
             info.currentAreaName, kKeys[STANDARD_TYPE], info.standardType, kKeys[TS_CAPTURE],
             info.tsCaptureEnable, kKeys[TS_FILE_SIMUL], info.tsFileSimulEnable,
             kKeys[PLAYER_DELAY], info.cprmPlayerDelay, kKeys[NATION], info.supportNation);
}

// Reads the whole text of the open file, into a block that the caller frees. Returns null, after a
// trace, when it cannot be read.
char *ReadSettings(PglFileHandle file) {
    const bool atEnd = VarnekPGL_SeekFile(file, 0, SEEK_END) == 0;
    const int32_t length = VarnekPGL_TellFile(file);
    CTRL_HIGH("  VarnekCfg_LoadConfigFile : readlen = %d", length);
    if (!atEnd || length < 0 || length > kMaxConfigSize ||
        VarnekPGL_SeekFile(file, 0, SEEK_SET) != 0) {
        CTRL_HIGH("  VarnekCfg_LoadConfigFile : Cannot Read Config File!");
        return nullptr;
    }
    uint32_t count = 0;
    char *text = ReadText(file, static_cast<uint32_t>(length), &count);
    if (text == nullptr) {
        CTRL_HIGH("  VarnekCfg_LoadConfigFile : Out of memory!");
    } else if ((length > 0 && count == 0) || ferror(StreamOf(file)) != 0) {
        CTRL_HIGH("  VarnekCfg_LoadConfigFile : Cannot Read Config File!");
        free(text);
        return nullptr;
    }
    return text;
}

bool IsOwnFile(const struct stat64 &entry) {
    return S_ISREG(entry.st_mode) && entry.st_uid == geteuid();
}

// Whether the owner has protected the file against writing. That counts for root too, although the
// system would let it write.
bool IsProtected(const struct stat64 &entry) {
    return IsOwnFile(entry) && (entry.st_mode & S_IWUSR) == 0;
}

// Whether a new file may replace what is at the path of the settings: nothing, or a file of this
// user that may be written and has no second name. A file that another saver has just replaced has
// no name left. Fills `*old`, with zeros if there is nothing.
bool MayReplace(struct stat64 *old) {
    *old = {};
    if (lstat64(kSettingsPath, old) != 0) {
        return errno == ENOENT;
    }
    return IsOwnFile(*old) && !IsProtected(*old) && old->st_nlink <= 1;
}

// Gives the draft the group and mode of the file that it will replace, as late as possible, because
// another process may change them. Returns false if that fails or the file must not be replaced.
bool ImitateOld(int draft) {
    struct stat64 old = {};
    return MayReplace(&old) &&
           (old.st_mode == 0 || (fchown(draft, static_cast<uid_t>(-1), old.st_gid) == 0 &&
                                 fchmod(draft, old.st_mode & 07777) == 0));
}

// Whether the saver of a draft is gone, given the "PID.NUMBER" at the end of its name. It takes no
// permission to learn whether a process exists; if the id is in use again, the draft stays until
// that process ends, too. Under our own id, a number that we have not reached yet is an earlier
// process's, since a draft of ours takes its number before it can be listed.
bool IsDead(const char *saver) {
    char *end = nullptr;
    const pid_t process = static_cast<pid_t>(strtoll(saver, &end, 10));
    if (process == getpid()) {
        return strtoll(*end == '.' ? end + 1 : end, nullptr, 10) >= int64_t{gNextDraft.load()};
    }
    return kill(process, 0) != 0 && errno == ESRCH;
}

void RemoveDeadDrafts(DIR *directory) {
    while (const struct dirent64 *entry = readdir64(directory)) {
        constexpr size_t kLength = sizeof kDraftPrefix - 1;
        if (strncmp(entry->d_name, kDraftPrefix, kLength) == 0 && IsDead(entry->d_name + kLength)) {
            unlinkat(dirfd(directory), entry->d_name, 0);
        }
    }
}

// Writes the text to a draft, flushes it to the medium and renames it over the settings file, so a
// reader finds the old text or the new one, whatever happens to this process. No lock is needed,
// because every caller writes a draft of its own. Returns false on failure, without a line; the
// file then has its old text, or the new one, which may not be on the medium yet.
bool Replace(DIR *directory, const char *text, size_t length) {
    const int in = dirfd(directory);
    char draft[48];
    int fd = -1;
    do {
        snprintf(draft, sizeof draft, "%s%d.%u", kDraftPrefix, static_cast<int>(getpid()),
                 gNextDraft.fetch_add(1));
        fd = openat(in, draft, O_WRONLY | O_CREAT | O_EXCL | O_NOFOLLOW | O_CLOEXEC, 0666);
    } while (fd < 0 && errno == EEXIST);  // somebody else's, so it stays as it is
    if (fd < 0) {
        return false;
    }
    const bool stored =
        write(fd, text, length) == static_cast<ssize_t>(length) && fsync(fd) == 0 && ImitateOld(fd);
    const bool closed = close(fd) == 0;
    if (!stored || !closed || renameat(in, draft, AT_FDCWD, kSettingsPath) != 0) {
        unlinkat(in, draft, 0);
        return false;
    }
    return fsync(in) == 0;
}

// Whether these bytes are a whole text: six lines and nothing after them. The rest of a longer text
// would add a line end, and a cut would lose one.
bool IsWhole(const char *text, ssize_t size) {
    return size > 0 && text[size - 1] == '\n' &&
           std::count(text, text + size, '\n') == CONFIG_FIELD_COUNT;
}

// Writes the text over the old one and cuts the file to length afterwards. When the medium refuses,
// it puts the old text back. Another process may do the same at the same time and cut this text, so
// the file is read again until its text is whole: whoever changes it last also reads it last.
bool WriteOver(int fd, const char *text, size_t length) {
    constexpr int kTries = 100;
    for (int i = 0; i < kTries; ++i) {
        char old[kFileSize];
        const ssize_t size = pread(fd, old, sizeof old, 0);
        const bool same = size == static_cast<ssize_t>(length) && memcmp(old, text, length) == 0;
        if (same || (i > 0 && IsWhole(old, size))) {
            return fsync(fd) == 0;
        }
        const ssize_t written = size >= 0 ? pwrite(fd, text, length, 0) : 0;
        if (written != static_cast<ssize_t>(length) || ftruncate(fd, written) != 0) {
            const ssize_t kept = size < written ? size : written;
            [[maybe_unused]] const bool restored =
                kept >= 0 && pwrite(fd, old, static_cast<size_t>(kept), 0) == kept &&
                (written <= size || ftruncate(fd, size) == 0);
            return false;
        }
    }
    return false;
}

// Saves in place, where the file cannot be replaced. Creates a file only as the target of a
// link: if no new file could be stored, an empty one would only wipe the settings when next loaded.
void SaveInPlace(const struct stat64 &old, const char *text) {
    const int flags = O_RDWR | O_CLOEXEC | (S_ISLNK(old.st_mode) ? O_CREAT : 0);
    const int fd = IsProtected(old) ? -1 : open(kSettingsPath, flags, 0666);
    if (fd < 0) {
        __VarnekPGL_FileLog("VarnekPGL_OpenFile : NULL file pointer. szFilePath=[%s]",
                            kSettingsPath);
        CTRL_HIGH("VarnekCfg_SaveConfigFile() :  VarnekPGL_OpenFile() fail.!");
        return;
    }
    const bool written = WriteOver(fd, text, strlen(text));
    if (close(fd) != 0 || !written) {
        __VarnekPGL_FileLog("VarnekCfg_SaveConfigFile : fail %s", kSettingsPath);
        CTRL_HIGH("VarnekCfg_SaveConfigFile() :  VarnekPGL_WriteFileByHandle() fail.!");
    }
}

void LoadUnlessLoaded() {
    if (gpVarnekConfigInfo.standardType == 0) {
        VarnekCfg_LoadConfigFile();
    }
}

}  // namespace

VarnekConfigInfo *VarnekCfg_GetConfigInfo() {
    return &gpVarnekConfigInfo;
}

void VarnekCfg_LoadConfigFile() {
    CTRL_HIGH("  VarnekCfg_LoadConfigFile : called!");
    if (!MayOpen(kSettingsPath)) {
        CTRL_HIGH("  VarnekCfg_LoadConfigFile : Cannot Read Config File!");
        return;
    }
    const PglFileHandle file = VarnekPGL_OpenFile(kSettingsPath, PGL_FILE_MODE_READ);
    if (file == -1) {
        CTRL_HIGH("  VarnekCfg_LoadConfigFile : Cannot Open Config File!");
        return;
    }
    // The record is cleared only once there is a text, lest an unreadable file wipe it.
    char *text = ReadSettings(file);
    VarnekPGL_CloseFile(file);
    if (text == nullptr) {
        return;
    }
    gpVarnekConfigInfo = {};
    ReadLines(text);
    free(text);
    CTRL_HIGH(" __VarnekCfg_GetTempBuffer: End of Configuration\n");
    VarnekCfg_GetSupportNation();
}

void VarnekCfg_SaveConfigFile() {
    void *directory = VarnekPGL_OpenDir(VARNEK_DATA_DIR);
    if (directory == PGL_INVALID_DIR_HANDLE) {
        VARNEK_TRACE(VARNEK_LEVEL_HIGH | VARNEK_MODULE_ESG,
                     "VarnekCfg_SaveConfigFile: Root_Path(%s) is not Exist\n", VARNEK_DATA_DIR);
        return;
    }
    char text[kFileSize];
    FormatFile(text);
    RemoveDeadDrafts(static_cast<DIR *>(directory));
    struct stat64 old = {};
    const bool replaced =
        MayReplace(&old) && Replace(static_cast<DIR *>(directory), text, strlen(text));
    VarnekPGL_CloseDir(directory);
    if (!replaced) {
        SaveInPlace(old, text);
    }
}

void VarnekCfg_SetStandard(int32_t std) {
    CTRL_MID(" VarnekCfg_SetStandard: aStd is %d\n", std);
    if (std == gpVarnekConfigInfo.standardType) {
        return;
    }
    gpVarnekConfigInfo.standardType = std;
    VarnekCfg_SaveConfigFile();
}

int32_t VarnekCfg_GetStandard() {
    LoadUnlessLoaded();
    CTRL_MID(" VarnekCfg_GetStandard: gpVarnekConfigInfo.standardType is %d\n",
             gpVarnekConfigInfo.standardType);
    return gpVarnekConfigInfo.standardType;
}

uint8_t VarnekCfg_GetTSCaptueEnable() {
    LoadUnlessLoaded();
    CTRL_MID("VarnekCfg_GetTSCaptueEnable: gpVarnekConfigInfo.tsCaptureEnable=[%d]",
             gpVarnekConfigInfo.tsCaptureEnable);
    return gpVarnekConfigInfo.tsCaptureEnable;
}

uint8_t VarnekCfg_GetTSFileSimulEnable() {
    LoadUnlessLoaded();
    return gpVarnekConfigInfo.tsFileSimulEnable;
}

const char *VarnekCfg_GetSupportNation() {
    char(&nation)[100] = gpVarnekConfigInfo.supportNation;
    if (nation[0] != '\0') {
        return nation;
    }
    const char *feature = VellNativeFeature_getStringWithDefault(kFeatureKey, "");
    if (feature == nullptr) {
        TRACE_ERROR("%s can't find Nation from TARN feature. so set default nation(BRA)", __func__);
        CopyText(nation, kDefaultNation, kNationLength);
        return nation;
    }
    const char *tag = strstr(feature, kNationTag);
    const char *code = tag != nullptr ? tag + strlen(kNationTag) : "";
    // A code that contains a line end is invalid, and the settings file could not store it.
    if (strcspn(code, "\r\n") < kNationLength) {
        CopyText(nation, kDefaultNation, kNationLength);
        TRACE_ERROR("%s can't find Nation TAG in TARN feature. so set default nation(BRA)",
                    __func__);
        return nation;
    }
    CopyText(nation, code, kNationLength);
    TRACE_ERROR("%s found nation in TARN = %s", __func__, nation);
    return nation;
}

BOOL VarnekCfg_IsSupportBML() {
    if (strncmp(VarnekCfg_GetSupportNation(), kNationWithBml, kNationLength) == 0) {
        VARNEK_TRACE(VARNEK_LEVEL_MID | VARNEK_MODULE_SESSION_MANAGER, " %s: BML supported",
                     __func__);
        return TRUE;
    }
    VARNEK_TRACE(VARNEK_LEVEL_MID | VARNEK_MODULE_SESSION_MANAGER, " %s: BML not supported",
                 __func__);
    return FALSE;
}
