// The masked trace, the debug configuration that masks it, and the assertion report.
//
// What is enabled is one atomic word, so a trace that is off costs one load. A line is composed in
// a buffer of its own call and no lock is held while it is formatted or written; the only lock here
// lets one thread at a time load the configuration.
#include "Varnek_Debug.h"

#include <errno.h>
#include <pthread.h>
#include <stdarg.h>
#include <stdio.h>
#include <stdlib.h>
#include <string.h>

#include <atomic>

#include "Varnek_File.h"
#include "Varnek_Lock.h"
#include "Varnek_Support.h"
#include "Varnek_Trace.h"
#include "varnek_platform.h"

const char *gszVarnekDbgFilePath = "";
int32_t gVarnekDbgLineNum = 0;
std::atomic<uint32_t> gDebugState{0};

namespace {

constexpr uint32_t kLevelBits = 0xF0000000u;
constexpr uint32_t kModuleBits = 0x00000FFFu;

// Serialises loads. gDebugLoader names the thread that holds it, so that a log function which
// traces while the load reports through it finds everything off instead of waiting for itself.
Lock gDebugLoadLock;
std::atomic<pthread_t> gDebugLoader{};

constexpr size_t kTraceLineSize = 2048;
constexpr size_t kTraceTextSize = 2018;  // the caller's text with its terminator
constexpr size_t kConfigLineSize = 52;

constexpr char kConfigName[] = "debug_ltn.ini";
constexpr char kSettingsName[] = "Varnek_Config.cfg";
constexpr size_t kPathSize = 256;
static_assert(sizeof VARNEK_DATA_DIR + sizeof kSettingsName <= kPathSize,
              "VARNEK_DATA_DIR is too long");
static_assert(sizeof VARNEK_SYSTEM_DIR + sizeof kConfigName <= kPathSize,
              "VARNEK_SYSTEM_DIR is too long");

// In the order in which the keys are tried: the first one found in a line decides the line.
struct ConfigKey {
    const char *text;
    uint32_t bit;
};
constexpr ConfigKey kConfigKeys[] = {
    {"LogToUSB", kOutputOn},
    {"Error", VARNEK_LEVEL_ERROR},
    {"High", VARNEK_LEVEL_HIGH},
    {"Mid", VARNEK_LEVEL_MID},
    {"Low", VARNEK_LEVEL_LOW},
    {"Common", VARNEK_MODULE_COMMON},
    {"JNI", VARNEK_MODULE_JNI},
    {"MainControl", VARNEK_MODULE_MAIN_CONTROL},
    {"ESG", VARNEK_MODULE_ESG},
    {"SessionManager", VARNEK_MODULE_SESSION_MANAGER},
    {"SectionParser", VARNEK_MODULE_SECTION_PARSER},
    {"DsmccDC", VARNEK_MODULE_DSMCC_DC},
    {"DsmccOC", VARNEK_MODULE_DSMCC_OC},
    {"TsDemux", VARNEK_MODULE_TS_DEMUX},
    {"CPRM", VARNEK_MODULE_CPRM},
    {"SMPlayer", VARNEK_MODULE_SM_PLAYER},
    {"GingaAppMgr", VARNEK_MODULE_GINGA},
};

struct LevelLook {
    char label;
    VarnekLogPriority priority;
};

LevelLook LookOfLevel(uint32_t mask) {
    switch (mask & 0xFF000000u) {
        case VARNEK_LEVEL_ERROR:
            return {'E', VARNEK_LOG_ERROR};
        case VARNEK_LEVEL_HIGH:
            return {'H', VARNEK_LOG_INFO};
        case VARNEK_LEVEL_MID:
            return {'M', VARNEK_LOG_DEBUG};
        case VARNEK_LEVEL_LOW:
            return {'L', VARNEK_LOG_VERBOSE};
        default:
            return {'L', VARNEK_LOG_DEBUG};
    }
}

const char *TagOfModule(uint32_t mask) {
    switch (mask & 0x00FFFFFFu) {
        case VARNEK_MODULE_COMMON:
            return "SBTVD_COM";
        case VARNEK_MODULE_JNI:
            return "SBTVD_JNI";
        case VARNEK_MODULE_MAIN_CONTROL:
            return "SBTVD_CTRL";
        case VARNEK_MODULE_ESG:
            return "SBTVD_ESG";
        case VARNEK_MODULE_SESSION_MANAGER:
            return "SBTVD_SessionMGR";
        case VARNEK_MODULE_SECTION_PARSER:
            return "SBTVD_SI_Parser";
        case VARNEK_MODULE_DSMCC_DC:
            return "SBTVD_Data_Carousel";
        case VARNEK_MODULE_DSMCC_OC:
            return "SBTVD_Object_Carousel";
        case VARNEK_MODULE_TS_DEMUX:
            return "SBTVD_Demux";
        case VARNEK_MODULE_CPRM:
            return "SBTVD_CPRM";
        case VARNEK_MODULE_GINGA:
            return "SBTVD_GINGA";
        case VARNEK_MODULE_SM_PLAYER:
            return "SBTVD_SMPLAYER";
        default:
            return "SBTVD_Unknown";
    }
}

// The last component of the path of the code that traces.
const char *CallerFileName() {
    const char *path = __atomic_load_n(&gszVarnekDbgFilePath, __ATOMIC_RELAXED);
    if (path == nullptr) {
        return "";
    }
    const char *slash = strrchr(path, '/');
    return slash != nullptr ? slash + 1 : path;
}

int32_t CallerLine() {
    return __atomic_load_n(&gVarnekDbgLineNum, __ATOMIC_RELAXED);
}

// Reads the whole configuration file into a block that the caller frees; null, after its line in
// the log, when there is nothing to parse.
char *ReadConfig(const char *path, int32_t *size) {
    *size = VarnekPGL_CheckFile(path) ? VarnekPGL_GetFileSize(path) : 0;
    if (*size < 1) {
        __android_log_write(VARNEK_LOG_ERROR, "SBTVD", "Debug Configuration File Doesn't exist!\n");
        return nullptr;
    }
    char *data = static_cast<char *>(malloc(static_cast<size_t>(*size) + 1));
    if (data == nullptr || VarnekPGL_ReadFile(path, data, static_cast<uint32_t>(*size)) != *size) {
        __android_log_write(VARNEK_LOG_ERROR, "SBTVD", "Debug Configuration File reading fail!\n");
        free(data);
        return nullptr;
    }
    return data;
}

// What one line enables. A key counts wherever it stands, and so does the '1'.
uint32_t BitOfLine(const char *line) {
    if (line[0] == '#') {
        return 0;
    }
    for (const ConfigKey &key : kConfigKeys) {
        if (strstr(line, key.text) != nullptr) {
            return strchr(line, '1') != nullptr ? key.bit : 0;
        }
    }
    return 0;
}

// Everything that the text enables. A line over its buffer is cut; a text that begins with a line
// end enables nothing.
uint32_t ParseConfig(const char *data, size_t size) {
    uint32_t enabled = 0;
    size_t position = 0;
    while (position < size) {
        size_t end = position;
        while (end < size && !IsLineEnd(data[end])) {
            end++;
        }
        if (end == position) {
            break;
        }
        char line[kConfigLineSize];
        const size_t length = end - position < sizeof line ? end - position : sizeof line - 1;
        memcpy(line, data + position, length);
        line[length] = '\0';
        enabled |= BitOfLine(line);
        while (end < size && IsLineEnd(data[end])) {
            end++;
        }
        position = end;
    }
    return enabled;
}

void LogSummary(uint32_t enabled) {
    const auto on = [enabled](uint32_t bit) { return (enabled & bit) != 0 ? 1 : 0; };
    char line[kTraceLineSize];
    const auto write = [&line] { __android_log_write(VARNEK_LOG_DEBUG, "SBTVD", line); };
    snprintf(line, sizeof line, "Log Config: Error=[%d]\tHigh=[%d]\tMid=[%d]\tLow=[%d]\n",
             on(VARNEK_LEVEL_ERROR), on(VARNEK_LEVEL_HIGH), on(VARNEK_LEVEL_MID),
             on(VARNEK_LEVEL_LOW));
    write();
    snprintf(line, sizeof line,
             "Log Config: Common=[%d]\tJNI=[%d]\tMainControl=[%d]\tESG=[%d]\tSessionManager=[%d]",
             on(VARNEK_MODULE_COMMON), on(VARNEK_MODULE_JNI), on(VARNEK_MODULE_MAIN_CONTROL),
             on(VARNEK_MODULE_ESG), on(VARNEK_MODULE_SESSION_MANAGER));
    write();
    snprintf(line, sizeof line,
             "Log Config: TS Demux=[%d]\tCPRM Player=[%d]\tSMPlayer =[%d]\tSectionParser=[%d]",
             on(VARNEK_MODULE_TS_DEMUX), on(VARNEK_MODULE_CPRM), on(VARNEK_MODULE_SM_PLAYER),
             on(VARNEK_MODULE_SECTION_PARSER));
    write();
    snprintf(line, sizeof line, "Log Config: DsmccDC=[%d]\tDsmccOC=[%d]\tGinga=[%d]",
             on(VARNEK_MODULE_DSMCC_DC), on(VARNEK_MODULE_DSMCC_OC), on(VARNEK_MODULE_GINGA));
    write();
}

// One load, in the thread that holds gDebugLoadLock. While it runs nothing is traced, also when it
// replaces an earlier load.
void LoadConfig() VARNEK_REQUIRES(gDebugLoadLock) {
    gDebugState.fetch_and(kInitialised, std::memory_order_relaxed);
    char path[kPathSize];
    snprintf(path, sizeof path, "%s%s", VARNEK_DATA_DIR, kConfigName);
    if (!VarnekPGL_CheckFile(path)) {
        char defaultPath[kPathSize];
        snprintf(defaultPath, sizeof defaultPath, "%s%s", VARNEK_SYSTEM_DIR, kConfigName);
        if (VarnekPGL_CheckFile(defaultPath)) {
            (void)VarnekPGL_CopyFile(defaultPath, path);
        } else {
            char line[kTraceLineSize];
            snprintf(line, sizeof line,
                     "Default Log Configuration file doesn't exit! File Path=[%s]\n", defaultPath);
            __android_log_write(VARNEK_LOG_ERROR, "SBTVD", line);
        }
    }
    uint32_t enabled = 0;
    int32_t size = 0;
    if (char *data = ReadConfig(path, &size)) {
        enabled = ParseConfig(data, static_cast<size_t>(size));
        free(data);
    }
    LogSummary(enabled);
    gDebugState.store(enabled | kInitialised, std::memory_order_release);
}

// Loads under the lock; with `again` unset only when no load has finished meanwhile.
void LoadConfigOnce(bool again) {
    const ErrnoKeeper keeper;
    if (pthread_equal(gDebugLoader.load(std::memory_order_relaxed), pthread_self())) {
        return;
    }
    const Hold hold(gDebugLoadLock);
    if (again || (gDebugState.load(std::memory_order_relaxed) & kInitialised) == 0) {
        gDebugLoader.store(pthread_self(), std::memory_order_relaxed);
        LoadConfig();
        gDebugLoader.store(pthread_t{}, std::memory_order_relaxed);
    }
}

// Writes "[L][File.cpp- 442] ", as far as it fits, without a terminator. Returns its length. By
// hand, since the C library would take as long for it as for a caller's text.
size_t PutPrefix(char (&line)[kTraceLineSize], char label, const char *file, int32_t number) {
    constexpr size_t kColumns = 4;  // of the line number, at least
    char digits[12];
    char *first = digits + sizeof digits;
    uint32_t rest = number < 0 ? 0u - static_cast<uint32_t>(number) : static_cast<uint32_t>(number);
    do {
        *--first = static_cast<char>('0' + rest % 10);
        rest /= 10;
    } while (rest != 0);
    if (number < 0) {
        *--first = '-';
    }
    while (first > digits + sizeof digits - kColumns) {
        *--first = ' ';
    }

    size_t length = 0;
    const auto put = [&line, &length](const char *text, size_t size) {
        const size_t room = sizeof line - 1 - length;
        memcpy(line + length, text, size < room ? size : room);
        length += size < room ? size : room;
    };
    const char opening[] = {'[', label, ']', '['};
    put(opening, sizeof opening);
    put(file, strlen(file));
    put("-", 1);
    put(first, static_cast<size_t>(digits + sizeof digits - first));
    put("] ", 2);
    return length;
}

// Composes and writes one line that the configuration lets through. Kept out of line, so that the
// buffer costs nothing in a trace that is off.
__attribute__((noinline, format(printf, 2, 0))) void WriteTrace(uint32_t mask, const char *format,
                                                                va_list args) {
    const ErrnoKeeper keeper;
    if (format == nullptr) {
        format = "(null)";
    }
    const LevelLook look = LookOfLevel(mask);
    char line[kTraceLineSize];
    const size_t prefix = PutPrefix(line, look.label, CallerFileName(), CallerLine());
    const size_t room = sizeof line - prefix;
    line[prefix] = '\0';
    vsnprintf(line + prefix, room < kTraceTextSize ? room : kTraceTextSize, format, args);
    if ((gDebugState.load(std::memory_order_relaxed) & kOutputOn) != 0) {
        __android_log_write(look.priority, TagOfModule(mask), line);
    }
}

}  // namespace

void VarnekPGL_TraceOut(uint32_t mask, const char *format, ...) {
    uint32_t state = gDebugState.load(std::memory_order_acquire);
    if ((state & kInitialised) == 0) {
        LoadConfigOnce(false);
        state = gDebugState.load(std::memory_order_acquire);
    }
    const uint32_t enabled = state & mask;
    if ((state & kOutputOn) == 0 || (enabled & kLevelBits) == 0 || (enabled & kModuleBits) == 0) {
        return;
    }
    va_list args;
    va_start(args, format);
    WriteTrace(mask, format, args);
    va_end(args);
}

void VarnekPGL_InitializeDebug() {
    LoadConfigOnce(true);
}

void VarnekPGL_CheckAndInitDebug() {
    if ((gDebugState.load(std::memory_order_acquire) & kInitialised) == 0) {
        LoadConfigOnce(false);
    }
}

int32_t VarnekPGL_Panic() {
    const ErrnoKeeper keeper;
    char line[kTraceLineSize];
    snprintf(line, sizeof line, "#### [VarnekPanic]  File=[%s], line=[%d]!\n", CallerFileName(),
             static_cast<int>(CallerLine()));
    return __android_log_write(VARNEK_LOG_FATAL, "Varnek", line);
}

int32_t VarnekPGL_SysGetLastErro() {
    return errno;
}

void VarnekPGL_changeModeForDebug() {
    VARNEK_TRACE(VARNEK_LEVEL_MID | VARNEK_MODULE_MAIN_CONTROL, " VarnekCfg_changeDebugMode\n");
    const char *const names[] = {kConfigName, kSettingsName};
    for (const char *name : names) {
        char path[kPathSize];
        snprintf(path, sizeof path, "%s%s", VARNEK_DATA_DIR, name);
        if (VarnekPGL_CheckFile(path)) {
            (void)VarnekPGL_Chmod(path, 666);
        }
    }
}
