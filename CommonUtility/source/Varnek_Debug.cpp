// The masked trace, the debug configuration that masks it, and the assertion report. One atomic
// word says what is enabled, so a trace that is off only stores its file and line, and loads and
// tests that word. Each call composes its line on its stack and holds no lock meanwhile.
#include "Varnek_Debug.h"

#include <errno.h>
#include <fcntl.h>
#include <pthread.h>
#include <stdarg.h>
#include <stdio.h>
#include <stdlib.h>
#include <string.h>

#include <atomic>
#include <initializer_list>

#include "Varnek_ConfigFile.h"
#include "Varnek_File.h"
#include "Varnek_Lock.h"
#include "Varnek_Storage.h"
#include "Varnek_Support.h"
#include "Varnek_Trace.h"
#include "varnek_platform.h"

// Every trace stores the first two words and reads the third. The section and the alignment place
// the first two in one cache line, so that only one line moves between the cores when two threads
// trace. g++ emits the variables last to first, and clang first to last; either order works.
#define VARNEK_TRACE_WORD __attribute__((section(".data.trace")))
VARNEK_TRACE_WORD const char *gszVarnekDbgFilePath = "";
VARNEK_TRACE_WORD int32_t gVarnekDbgLineNum = 0;
alignas(64) VARNEK_TRACE_WORD std::atomic<uint32_t> gDebugState{~0u};

namespace {

constexpr uint32_t kLevelBits = 0xF0000000u;
constexpr uint32_t kModuleBits = 0x00000FFFu;

OneAtATime gDebugLoad;

constexpr size_t kTraceLineSize = 2048;
constexpr size_t kTraceTextSize = 2018;  // the caller's text with its terminator
constexpr size_t kConfigLineSize = 52;

bool IsLoaded() {
    return (gDebugState.load(std::memory_order_relaxed) & kNotLoaded) == 0;
}

struct TraceLevel {
    uint32_t bit;
    const char *key;  // in the configuration file, and in the summary
    char label;       // in a line
    VarnekLogPriority priority;
};
constexpr TraceLevel kLevels[] = {
    {VARNEK_LEVEL_ERROR, "Error", 'E', VARNEK_LOG_ERROR},
    {VARNEK_LEVEL_HIGH, "High", 'H', VARNEK_LOG_INFO},
    {VARNEK_LEVEL_MID, "Mid", 'M', VARNEK_LOG_DEBUG},
    {VARNEK_LEVEL_LOW, "Low", 'L', VARNEK_LOG_VERBOSE},
};
constexpr TraceLevel kManyLevels = {0, "", 'L', VARNEK_LOG_DEBUG};

struct TraceModule {
    uint32_t bit;
    const char *key;    // in the configuration file
    const char *label;  // in the summary
    const char *tag;    // of a line
};
constexpr TraceModule kModules[] = {
    {VARNEK_MODULE_COMMON, "Common", "Common", "SBTVD_COM"},
    {VARNEK_MODULE_JNI, "JNI", "JNI", "SBTVD_JNI"},
    {VARNEK_MODULE_MAIN_CONTROL, "MainControl", "MainControl", "SBTVD_CTRL"},
    {VARNEK_MODULE_ESG, "ESG", "ESG", "SBTVD_ESG"},
    {VARNEK_MODULE_SESSION_MANAGER, "SessionManager", "SessionManager", "SBTVD_SessionMGR"},
    {VARNEK_MODULE_SECTION_PARSER, "SectionParser", "SectionParser", "SBTVD_SI_Parser"},
    {VARNEK_MODULE_DSMCC_DC, "DsmccDC", "DsmccDC", "SBTVD_Data_Carousel"},
    {VARNEK_MODULE_DSMCC_OC, "DsmccOC", "DsmccOC", "SBTVD_Object_Carousel"},
    {VARNEK_MODULE_TS_DEMUX, "TsDemux", "TS Demux", "SBTVD_Demux"},
    {VARNEK_MODULE_CPRM, "CPRM", "CPRM Player", "SBTVD_CPRM"},
    {VARNEK_MODULE_SM_PLAYER, "SMPlayer", "SMPlayer ", "SBTVD_SMPLAYER"},
    {VARNEK_MODULE_GINGA, "GingaAppMgr", "Ginga", "SBTVD_GINGA"},
};
constexpr TraceModule kUnknownModule = {0, "", "", "SBTVD_Unknown"};

const TraceLevel &LevelOf(uint32_t mask) {
    for (const TraceLevel &level : kLevels) {
        if ((mask & 0xFF000000u) == level.bit) {
            return level;
        }
    }
    return kManyLevels;
}

const TraceModule &ModuleOf(uint32_t mask) {
    for (const TraceModule &module : kModules) {
        if ((mask & 0x00FFFFFFu) == module.bit) {
            return module;
        }
    }
    return kUnknownModule;
}

// Returns the last component of the path of the code that traces.
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

void LogFailure(const char *text) {
    __android_log_write(VARNEK_LOG_ERROR, "SBTVD", text);
}

// Returns the bit that a line enables, or 0. The key may be anywhere in the line. If the line
// contains several keys, the first one in the order of the tables counts. A '1' anywhere in the
// line enables it.
uint32_t BitOfLine(const char *line) {
    if (line[0] == '#') {
        return 0;
    }
    const bool enables = strchr(line, '1') != nullptr;
    if (strstr(line, "LogToUSB") != nullptr) {
        return enables ? kOutputOn : 0;
    }
    for (const TraceLevel &level : kLevels) {
        if (strstr(line, level.key) != nullptr) {
            return enables ? level.bit : 0;
        }
    }
    for (const TraceModule &module : kModules) {
        if (strstr(line, module.key) != nullptr) {
            return enables ? module.bit : 0;
        }
    }
    return 0;
}

// Returns all bits that the text enables. A text that begins with a line end enables nothing.
uint32_t ParseConfig(const char *text, const char *end) {
    uint32_t enabled = 0;
    char line[kConfigLineSize];
    while (TakeLine(&text, end, line)) {
        enabled |= BitOfLine(line);
    }
    return enabled;
}

// Composes a line of the summary.
class SummaryLine {
  public:
    void Add(const char *label, bool on) {
        const int more = snprintf(text_ + length_, sizeof text_ - length_, "%s%s=[%d]", separator_,
                                  label, on ? 1 : 0);
        length_ += more > 0 ? static_cast<size_t>(more) : 0;
        separator_ = "\t";
    }
    void Log(const char *end) {
        snprintf(text_ + length_, sizeof text_ - length_, "%s", end);
        __android_log_write(VARNEK_LOG_DEBUG, "SBTVD", text_);
    }

  private:
    char text_[128] = {};  // enough for the labels of any line
    size_t length_ = 0;
    const char *separator_ = "Log Config: ";
};

void LogSummary(uint32_t enabled) {
    SummaryLine levels;
    for (const TraceLevel &level : kLevels) {
        levels.Add(level.key, (enabled & level.bit) != 0);
    }
    levels.Log("\n");
    constexpr uint32_t kLines[][5] = {
        {VARNEK_MODULE_COMMON, VARNEK_MODULE_JNI, VARNEK_MODULE_MAIN_CONTROL, VARNEK_MODULE_ESG,
         VARNEK_MODULE_SESSION_MANAGER},
        {VARNEK_MODULE_TS_DEMUX, VARNEK_MODULE_CPRM, VARNEK_MODULE_SM_PLAYER,
         VARNEK_MODULE_SECTION_PARSER},
        {VARNEK_MODULE_DSMCC_DC, VARNEK_MODULE_DSMCC_OC, VARNEK_MODULE_GINGA},
    };
    for (const auto &bits : kLines) {
        SummaryLine line;
        for (const uint32_t bit : bits) {
            if (bit != 0) {
                line.Add(ModuleOf(bit).label, (enabled & bit) != 0);
            }
        }
        line.Log("");
    }
}

// Copies the shipped configuration to the data directory. Returns whether the copy can be read.
bool SeedConfig() {
    if (!IsReadable(kShippedDebugPath)) {
        LogFailure("Default Log Configuration file doesn't exit! File Path=[" VARNEK_SYSTEM_DIR
                   "debug_ltn.ini]\n");
        return false;
    }
    return VarnekPGL_CopyFile(kShippedDebugPath, kDebugPath) == 0 && IsReadable(kDebugPath);
}

// Returns all bits that the configuration file enables. 0, after a line in the log, when it cannot
// be read.
uint32_t ReadConfig() {
    const bool exists = IsReadable(kDebugPath) || (IsMissing(kDebugPath) && SeedConfig());
    const int32_t size = exists ? VarnekPGL_GetFileSize(kDebugPath) : 0;
    if (size < 1) {
        LogFailure("Debug Configuration File Doesn't exist!\n");
        return 0;
    }
    char *data = size <= kMaxConfigSize ? ReadWholeFile(kDebugPath, size) : nullptr;
    if (data == nullptr) {
        LogFailure("Debug Configuration File reading fail!\n");
        return 0;
    }
    const uint32_t enabled = ParseConfig(data, data + size);
    free(data);
    return enabled;
}

// Returns the state word for the bits that a configuration enables.
uint32_t StateOf(uint32_t enabled) {
    constexpr uint32_t kOwnLow = VARNEK_LEVEL_LOW | VARNEK_MODULE_COMMON;
    if ((enabled & kOutputOn) == 0) {
        return 0;
    }
    return (enabled & kOwnLow) == kOwnLow ? enabled | kOwnLowOn : enabled;
}

// Loads; nothing is traced meanwhile, even if an earlier configuration enabled traces.
void LoadConfig() {
    if (IsLoaded()) {
        gDebugState.store(0, std::memory_order_relaxed);
    }
    const uint32_t enabled = ReadConfig();
    LogSummary(enabled);
    gDebugState.store(StateOf(enabled), std::memory_order_relaxed);
}

// Loads the configuration if nobody has, so that threads that come together load it once; with
// `again`, each of them loads it. Meanwhile the log function can neither trace nor load in this
// thread.
void LoadConfigOnce(bool again) {
    const ErrnoKeeper keeper;
    gDebugLoad.Do([again] {
        if (again || !IsLoaded()) {
            LoadConfig();
        }
    });
}

// Writes "[L][File.cpp- 442] ", as far as it fits, without a terminator, and returns its length. It
// does not use snprintf, which would take as long for the prefix as for a caller's text.
size_t PutPrefix(char (&line)[kTraceLineSize], char label, const char *file, int32_t number) {
    constexpr size_t kColumns = 4;  // minimal width of the line number
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

// Writes a line that may be enabled, after loading the configuration if that has not happened. Not
// inlined, so that its buffer costs nothing in a trace that is off.
__attribute__((noinline, format(printf, 2, 0))) void WriteTrace(uint32_t mask, const char *format,
                                                                va_list args) {
    if (!IsLoaded()) {
        LoadConfigOnce(false);
    }
    const uint32_t state = gDebugState.load(std::memory_order_relaxed);
    const uint32_t enabled = state & mask;
    if ((state & kNotLoaded) != 0 || (enabled & kLevelBits) == 0 || (enabled & kModuleBits) == 0) {
        return;
    }
    const ErrnoKeeper keeper;
    if (format == nullptr) {
        format = "(null)";
    }
    const TraceLevel &level = LevelOf(mask);
    char line[kTraceLineSize];
    const size_t prefix = PutPrefix(line, level.label, CallerFileName(), CallerLine());
    const size_t room = sizeof line - prefix;
    line[prefix] = '\0';
    vsnprintf(line + prefix, room < kTraceTextSize ? room : kTraceTextSize, format, args);
    if ((gDebugState.load(std::memory_order_relaxed) & kOutputOn) != 0) {
        __android_log_write(level.priority, ModuleOf(mask).tag, line);
    }
}

}  // namespace

void VarnekPGL_TraceOut(uint32_t mask, const char *format, ...) {
    // The level and kNotLoaded are in the top byte, the module below it.
    const uint32_t enabled = gDebugState.load(std::memory_order_relaxed) & (mask | kNotLoaded);
    if (enabled >> 24 == 0) {
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
    if (!IsLoaded()) {
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
    for (const char *path : {kDebugPath, kSettingsPath}) {
        // chmod would follow a link out of the directory.
        if (!IsLink(AT_FDCWD, path) && IsReadable(path)) {
            (void)VarnekPGL_Chmod(path, 666);
        }
    }
}
