// The configuration record and its file. The search for a key, the load and the save use one table
// of keys, in the order of the fields.
#include "Varnek_Config.h"

#include <errno.h>
#include <fcntl.h>
#include <stddef.h>
#include <stdio.h>
#include <stdlib.h>
#include <string.h>
#include <sys/file.h>
#include <sys/stat.h>
#include <unistd.h>

#include "Varnek_File.h"
#include "Varnek_Storage.h"
#include "Varnek_StrUtil.h"
#include "Varnek_Support.h"
#include "Varnek_Timer.h"
#include "Varnek_Trace.h"
#include "varnek_platform.h"

#define CTRL_HIGH(...) VARNEK_TRACE(VARNEK_LEVEL_HIGH | VARNEK_MODULE_MAIN_CONTROL, __VA_ARGS__)
#define CTRL_MID(...) VARNEK_TRACE(VARNEK_LEVEL_MID | VARNEK_MODULE_MAIN_CONTROL, __VA_ARGS__)

static_assert(sizeof(VarnekConfigInfo) == 212, "callers and library agree on this record");
static_assert(offsetof(VarnekConfigInfo, standardType) == 100,
              "callers and library agree on this record");
static_assert(offsetof(VarnekConfigInfo, tsFileSimulEnable) == 105,
              "callers and library agree on this record");
static_assert(offsetof(VarnekConfigInfo, cprmPlayerDelay) == 108,
              "callers and library agree on this record");
static_assert(offsetof(VarnekConfigInfo, supportNation) == 112,
              "callers and library agree on this record");

namespace {

constexpr size_t kLineSize = 255;  // a line that is read, with its terminator
constexpr size_t kFileSize = 900;  // the text that is written, with its terminator

constexpr char kConfigPath[] = VARNEK_DATA_DIR "Varnek_Config.cfg";
constexpr char kNewPath[] = VARNEK_DATA_DIR "Varnek_Config.new";  // before it is renamed
static_assert(sizeof kConfigPath <= MAX_PGL_FILE_PATH_LEN, "VARNEK_DATA_DIR is too long");
constexpr int kLockTries = 1000;  // one per millisecond
constexpr int32_t kSaveFlags = PGL_FILE_MODE_CREATE_RW | PGL_FILE_MODE_WRITE;

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
    for (;;) {
        while (IsLineEnd(*text)) {
            ++text;
        }
        if (*text == '\0') {
            return;
        }
        const size_t length = strcspn(text, "\r\n");
        char line[kLineSize];
        CopyText(line, text, length);
        ReadLine(line);
        text += length;
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

// Reads the whole text of the open file. The data is null, after a trace, if it cannot be read.
FileText ReadFromStart(PglFileHandle file) {
    VarnekPGL_SeekFile(file, 0, SEEK_END);
    const int32_t length = VarnekPGL_TellFile(file);
    VarnekPGL_SeekFile(file, 0, SEEK_SET);
    CTRL_HIGH("  VarnekCfg_LoadConfigFile : readlen = %d", length);
    const uint32_t size = length > 0 ? static_cast<uint32_t>(length) : 0;
    const FileText text = ReadText(file, size);
    if (text.data == nullptr) {
        CTRL_HIGH("  VarnekCfg_LoadConfigFile : Out of memory!");
        return text;
    }
    if (length < 0 || (size > 0 && text.count == 0) || ferror(StreamOf(file)) != 0) {
        CTRL_HIGH("  VarnekCfg_LoadConfigFile : Cannot Read Config File!");
        free(text.data);
        return {};
    }
    return text;
}

// Whether a new file may replace the existing one. It may if there is none, or if it is a regular
// file of this user that has no second name (hard link). Fills `*old`, with zeros if there is none.
bool MayReplace(struct stat64 *old) {
    *old = {};
    if (lstat64(kConfigPath, old) != 0) {
        return errno == ENOENT;
    }
    return S_ISREG(old->st_mode) && old->st_nlink == 1 && old->st_uid == geteuid();
}

// Gives the new file the group and the mode of the old one, as late as possible, because another
// process may change them during the save. Returns false if that fails or the old file may no
// longer be replaced.
bool TakeOver(int fd) {
    struct stat64 old = {};
    if (!MayReplace(&old)) {
        return false;
    }
    return old.st_mode == 0 || (fchown(fd, static_cast<uid_t>(-1), old.st_gid) == 0 &&
                                fchmod(fd, old.st_mode & 07777) == 0);
}

// Writes the text to a second file, flushes that to the disk, and renames it over the settings
// file. So a reader finds either the old text or the new one, whatever happens to this process.
// Returns false on failure; the settings file is unchanged then.
bool ReplaceFile(const char *text) {
    remove(kNewPath);
    const PglFileHandle file = VarnekPGL_OpenFile(kNewPath, kSaveFlags);
    if (file == -1) {
        return false;
    }
    const int fd = fileno(StreamOf(file));
    const uint32_t length = static_cast<uint32_t>(strlen(text));
    const bool stored = VarnekPGL_WriteFileByHandle(file, text, length) == length &&
                        VarnekPGL_FlushFile(file) == 0 && fsync(fd) == 0 && TakeOver(fd);
    const bool closed = VarnekPGL_CloseFile(file) == 0;
    if (stored && closed && rename(kNewPath, kConfigPath) == 0) {
        return true;
    }
    remove(kNewPath);
    return false;
}

// Takes the lock that keeps other processes from writing the second file. The system releases it
// when its holder ends. But the holder may be stopped, or a child of the holder may keep the lock,
// so the wait is limited.
bool LockDirectory(int directory) {
    for (int i = 0; i < kLockTries; i++) {
        if (flock(directory, LOCK_EX | LOCK_NB) == 0) {
            return true;
        }
        VarnekPGL_MSleep(1);
    }
    return false;
}

// Calls ReplaceFile under the lock, if the directory and the file allow it.
bool SaveBeside(const char *text) {
    struct stat64 old = {};
    if (access(VARNEK_DATA_DIR, W_OK) != 0 || !MayReplace(&old)) {
        return false;
    }
    const int directory = open(VARNEK_DATA_DIR, O_RDONLY | O_DIRECTORY | O_CLOEXEC);
    if (directory < 0) {
        return false;
    }
    bool replaced = false;
    if (LockDirectory(directory)) {
        replaced = ReplaceFile(text);
        // A child that was forked during the save has the descriptor too, so the close below would
        // not release the lock.
        flock(directory, LOCK_UN);
    }
    close(directory);
    return replaced;
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
    const FileKind kind = KindOfConfigFile(kConfigPath);
    if (kind == FileKind::kOdd || kind == FileKind::kTooLarge) {
        CTRL_HIGH("  VarnekCfg_LoadConfigFile : Cannot Read Config File!");
        return;
    }
    const PglFileHandle file = VarnekPGL_OpenFile(kConfigPath, PGL_FILE_MODE_READ);
    if (file == -1) {
        CTRL_HIGH("  VarnekCfg_LoadConfigFile : Cannot Open Config File!");
        return;
    }
    // The record is cleared only after the text has been read. Otherwise a file that cannot be read
    // would cost the settings, and the next save would write empty ones.
    const FileText text = ReadFromStart(file);
    VarnekPGL_CloseFile(file);
    if (text.data == nullptr) {
        return;
    }
    gpVarnekConfigInfo = {};
    ReadLines(text.data);
    free(text.data);
    CTRL_HIGH(" __VarnekCfg_GetTempBuffer: End of Configuration\n");
    VarnekCfg_GetSupportNation();
}

void VarnekCfg_SaveConfigFile() {
    if (VarnekPGL_CheckDir(VARNEK_DATA_DIR) != TRUE) {
        VARNEK_TRACE(VARNEK_LEVEL_HIGH | VARNEK_MODULE_ESG,
                     "VarnekCfg_SaveConfigFile: Root_Path(%s) is not Exist\n", VARNEK_DATA_DIR);
        return;
    }
    // Opening the file below empties it, so the text is composed first.
    char text[kFileSize];
    FormatFile(text);
    if (SaveBeside(text)) {
        return;
    }
    const PglFileHandle file = VarnekPGL_OpenFile(kConfigPath, kSaveFlags);
    if (file == -1) {
        CTRL_HIGH("VarnekCfg_SaveConfigFile() :  VarnekPGL_OpenFile() fail.!");
        return;
    }
    const uint32_t length = static_cast<uint32_t>(strlen(text));
    const uint32_t written = VarnekPGL_WriteFileByHandle(file, text, length);
    // On a full disk, the error may not appear until the stream is closed.
    if (VarnekPGL_CloseFile(file) != 0 || written != length) {
        CTRL_HIGH("VarnekCfg_SaveConfigFile() :  VarnekPGL_WriteFileByHandle() fail.!");
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
