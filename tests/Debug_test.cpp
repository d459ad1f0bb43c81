#include <sys/stat.h>

#include <cerrno>
#include <cstring>
#include <filesystem>
#include <regex>

#include "support/VarnekTest.h"

namespace {

using ::testing::ElementsAre, ::testing::IsEmpty, ::testing::StartsWith;

constexpr uint32_t kErrorOfCommon = VARNEK_LEVEL_ERROR | VARNEK_MODULE_COMMON;

// Begins in a process that has not traced yet, with empty directories.
class DebugAlone : public VarnekTest {
  protected:
    void SetUp() override {
        LeaveClean();
        std::filesystem::create_directories(VARNEK_SYSTEM_DIR);
        std::filesystem::remove(kShippedDebugFile);
    }
    void TearDown() override {
        VarnekTest::TearDown();
        gLogHook = nullptr;
        WriteAll(kShippedDebugFile, ReadAll(TestFile("defaults/debug_ltn.ini")));
    }

    // Returns the levels and modules that a load's summary shows as enabled, and each line that is no part of one.
    static std::vector<std::string> Enabled(const std::vector<std::string> &lines) {
        std::vector<std::string> enabled;
        const std::regex field("(\\w[\\w ]*\\w) ?=\\[1\\]");
        for (const std::string &line : lines) {
            if (line.rfind("Log Config: ", 0) != 0) {
                enabled.push_back(line);
            }
            for (std::sregex_iterator found(line.begin(), line.end(), field), end; found != end; ++found) {
                enabled.push_back((*found)[1]);
            }
        }
        return enabled;
    }
    // Traces with this mask, and returns whether the trace reaches the log.
    static bool Passes(uint32_t mask) {
        TakeLog();
        VARNEK_TRACE(mask, "probe");
        return !TakeLog().empty();
    }
};

TEST_F(DebugAlone, EveryLevelAndModuleHasItsPriorityAndTag) {
    StartClean();
    VarnekPGL_InitializeDebug();
    TakeLog();
    // Each module with one level or several, two modules at once, then masks that trace nothing, because they have no
    // known level or module.
    const uint32_t error = VARNEK_LEVEL_ERROR, common = VARNEK_MODULE_COMMON;
    for (const uint32_t mask :
         {error | common, VARNEK_LEVEL_HIGH | VARNEK_MODULE_JNI, VARNEK_LEVEL_MID | VARNEK_MODULE_MAIN_CONTROL,
          VARNEK_LEVEL_LOW | VARNEK_MODULE_ESG, error | VARNEK_LEVEL_HIGH | VARNEK_MODULE_SESSION_MANAGER,
          error | 0x01000000 | VARNEK_MODULE_SECTION_PARSER, error | VARNEK_MODULE_DSMCC_DC,
          error | VARNEK_MODULE_DSMCC_OC, error | VARNEK_MODULE_TS_DEMUX, error | VARNEK_MODULE_CPRM,
          error | VARNEK_MODULE_GINGA, error | VARNEK_MODULE_SM_PLAYER, error | common | VARNEK_MODULE_JNI, error,
          common, 0x08000000 | common, error | 0x00001000, error | 0x03FFF000}) {
        gszVarnekDbgFilePath = "a/b/Some.cpp";
        gVarnekDbgLineNum = 442;
        VarnekPGL_TraceOut(mask, "%s %d", "text", 7);
        for (const LogLine &line : TakeLog()) {
            Note(std::to_string(line.priority) + " " + line.tag + " " + line.text + "\n");
        }
    }
}

TEST_F(DebugAlone, ALineEnablesByTheFirstKeyInIt) {
    const struct {
        const char *file;
        std::vector<std::string> enabled;
        bool traced;  // whether an Error of Common is
    } rows[] = {
        {"LogToUSB=1\nHigh=1\nCommon=1\n", {"High", "Common"}, false},
        {"Error=1\nCommon=1\n", {"Error", "Common"}, false},
        {"1 LogToUSB\nError=10\nxCommon 1", {"Error", "Common"}, true},
        {"LogToUSB=1\n#Error=1\nHigh=1\nCommon=1", {"High", "Common"}, false},
        {"LogToUSB=1\nErrorHigh=1\nCommon=1", {"Error", "Common"}, true},
        {"LogToUSB=1\nError=0\nerror=1\nHigh=1\nCommon=1", {"High", "Common"}, false},
        {"\nLogToUSB=1\nError=1\nCommon=1", {}, false},
        {"LogToUSB=1\r\n\r\n\nError=1\rCommon=1", {"Error", "Common"}, true},
        {"LogToUSB=1\nError=1\nGingaAppMgr=1", {"Error", "Ginga"}, false},
        {"LogToUSB=1\nError=1\nSMPlayer=1", {"Error", "SMPlayer"}, false},
        // The line is cut at 51 characters: its key counts, and the '1' after the cut does not.
        {"LogToUSB=1\nCommon=1\nError=1\nHigh                                              0  1",
         {"Error", "Common"},
         true},
    };
    for (const auto &row : rows) {
        WriteAll(kDebugFile, row.file);
        TakeLog();
        VarnekPGL_InitializeDebug();
        EXPECT_EQ(Enabled(TakeBodies()), row.enabled) << row.file;
        EXPECT_EQ(Passes(kErrorOfCommon), row.traced) << row.file;
    }
}

TEST_F(DebugAlone, LoadsAndFailuresAreReported) {
    VARNEK_TRACE(kErrorOfCommon, "it loads");
    Note("the first trace", "");
    TakeLog();
    WriteAll(kShippedDebugFile, "LogToUSB=1\nError=1\nCommon=1\n");
    VARNEK_TRACE(kErrorOfCommon, "a failed load is not tried again");
    EXPECT_THAT(TakeLog(), IsEmpty());
    const auto load = [] { return VarnekPGL_InitializeDebug(), Enabled(TakeBodies()); };
    WriteAll(kDebugFile, "");
    EXPECT_THAT(load(), ElementsAre("Debug Configuration File Doesn't exist!\n"));
    WriteAll(kDebugFile, "#");
    EXPECT_THAT(load(), IsEmpty());
    for (const bool directory : {true, false}) {
        std::filesystem::remove(kDebugFile);
        EXPECT_EQ(directory ? mkdir(kDebugFile, 0777) : mkfifo(kDebugFile, 0666), 0);
        EXPECT_THAT(load(), ElementsAre("Debug Configuration File Doesn't exist!\n"));
        VarnekPGL_changeModeForDebug();
        TakeLog();
    }
    std::filesystem::remove(kDebugFile);
    WriteAll(kDebugFile, std::string(1 << 20, '#'));
    EXPECT_THAT(load(), IsEmpty());
    WriteAll(kDebugFile, std::string((1 << 20) + 1, '#'));
    EXPECT_THAT(load(), ElementsAre("Debug Configuration File reading fail!\n")) << "more than 1 MiB";
    std::filesystem::remove(kDebugFile);
    EXPECT_THAT(load(),
                ElementsAre(StartsWith("VarnekPGL_OpenFile"), StartsWith("VarnekPGL_CheckFile"), "Error", "Common"));
    EXPECT_EQ(ReadAll(kDebugFile), ReadAll(kShippedDebugFile)) << "the working copy is not the default file";
    EXPECT_TRUE(Passes(kErrorOfCommon));
    EXPECT_FALSE(Passes(VARNEK_LEVEL_ERROR | VARNEK_MODULE_JNI));
}

TEST_F(DebugAlone, EightFirstTracesLoadOnceAndAllGetThrough) {
    WriteAll(kDebugFile, "LogToUSB=1\nError=1\nCommon=1\n");
    AtOnce(8, [](int) { VARNEK_TRACE(kErrorOfCommon, "here"); });
    const std::vector<LogLine> lines = TakeLog();
    const auto count = [&lines](const char *tag) {
        return std::count_if(lines.begin(), lines.end(), [tag](const LogLine &line) { return line.tag == tag; });
    };
    EXPECT_EQ(count("SBTVD"), 4);
    EXPECT_EQ(count("SBTVD_COM"), 8);
}

TEST_F(DebugAlone, ALogFunctionMayTrace) {
    WriteAll(kDebugFile, "LogToUSB=1\nHigh=1\nCommon=1\n");
    gLogHook = [](const LogLine &line) {
        if (line.tag == "SBTVD") {
            VARNEK_TRACE(VARNEK_LEVEL_HIGH | VARNEK_MODULE_COMMON, "from the log function");
            VarnekPGL_InitializeDebug();
        }
    };
    VARNEK_TRACE(VARNEK_LEVEL_HIGH | VARNEK_MODULE_COMMON, "one");
    EXPECT_THAT(TakeBodies("SBTVD_COM"), ElementsAre("one"));
}

TEST_F(DebugAlone, MakesTheDebugFilesWritableForEveryUser) {
    const auto modeAfter = [](const char *path) {
        VarnekPGL_changeModeForDebug();
        struct stat status = {};
        EXPECT_EQ(stat(path, &status), 0);
        return status.st_mode & 0777u;
    };
    for (const char *path : {kDebugFile, kSettingsFile}) {
        WriteAll(path, "#");
        chmod(path, 0600);
        EXPECT_EQ(modeAfter(path), 0666u) << path;
    }
    // A link may lead to a file that only the administrator may write.
    WriteAll(kShippedDebugFile, "#");
    chmod(kShippedDebugFile, 0644);
    std::filesystem::remove(kDebugFile);
    std::filesystem::create_symlink(kShippedDebugFile, kDebugFile);
    EXPECT_EQ(modeAfter(kShippedDebugFile), 0644u);
}

class Trace : public VarnekTest {};

TEST_F(Trace, LinesAreCutToTheirBuffer) {
    const std::string text(3000, 'x');
    for (const std::string &file :
         {std::string("Short.cpp"), std::string(200, 'f'), std::string(2040, 'f'), std::string(5000, 'f')}) {
        gszVarnekDbgFilePath = file.c_str();
        gVarnekDbgLineNum = 1;
        VarnekPGL_TraceOut(kErrorOfCommon, "%s", text.c_str());
        const auto log = TakeLog();
        ASSERT_EQ(log.size(), 1u);
        EXPECT_EQ(log[0].text.size(), std::min<size_t>(strlen("[E][-   1] ") + file.size() + 2017, 2047));
        EXPECT_EQ(log[0].text.rfind("[E][" + file.substr(0, 2000), 0), 0u);
    }
    gszVarnekDbgFilePath = nullptr;
    for (const auto &[number, prefix] : {std::pair(INT32_MIN, "[E][--2147483648]"), std::pair(0, "[E][-   0]")}) {
        gVarnekDbgLineNum = number;
        VarnekPGL_TraceOut(kErrorOfCommon, nullptr);
        EXPECT_EQ(TakeLog()[0].text, prefix + std::string(" (null)"));
    }
}

TEST_F(Trace, LeavesErrnoAloneAndReportsIt) {
    gLogHook = [](const LogLine &) { errno = ENOMEM; };
    errno = EXDEV;
    VARNEK_TRACE(kErrorOfCommon, "%d", VarnekPGL_SysGetLastErro());
    VARNEK_PANIC();
    VarnekPGL_InitializeDebug();
    EXPECT_EQ(VarnekPGL_SysGetLastErro(), EXDEV);
    gLogHook = nullptr;
    EXPECT_EQ(TakeBodies("SBTVD_COM").front(), std::to_string(EXDEV));
}

TEST_F(Trace, PanicNamesTheCallersPlace) {
    gszVarnekDbgFilePath = "x/Place.cpp";
    gVarnekDbgLineNum = 17;
    EXPECT_EQ(VarnekPGL_Panic(), TRUE);
    EXPECT_EQ(TakeBodies("Varnek", 7), std::vector<std::string>{"#### [VarnekPanic]  File=[Place.cpp], line=[17]!\n"});
}

}  // namespace
