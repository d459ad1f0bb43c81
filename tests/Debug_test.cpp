#include <sys/stat.h>

#include <algorithm>
#include <cerrno>
#include <cstring>
#include <filesystem>

#include "support/VarnekTest.h"

namespace {

using ::testing::ElementsAre;
using ::testing::IsEmpty;

constexpr char kWorking[] = VARNEK_DATA_DIR "debug_ltn.ini";
constexpr char kDefault[] = VARNEK_SYSTEM_DIR "debug_ltn.ini";

// Starts from a process that has not traced yet and from empty directories.
class DebugAlone : public VarnekTest {
  protected:
    void SetUp() override {
        LeaveClean();
        std::filesystem::create_directories(VARNEK_SYSTEM_DIR);
        std::filesystem::remove(kDefault);
    }
    void TearDown() override {
        VarnekTest::TearDown();
        gLogHook = nullptr;
        WriteAll(kDefault, ReadAll(TestFile("defaults/debug_ltn.ini")));
    }

    // Traces with this mask, and returns whether the trace reaches the log.
    static bool Passes(uint32_t mask) {
        TakeLog();
        VARNEK_TRACE(mask, "probe");
        return !TakeLog().empty();
    }
};

TEST_F(DebugAlone, EveryLevelAndModuleHasItsPriorityAndTag) {
    WriteAll(kWorking,
             "LogToUSB=1\nError=1\r\nHigh=1\r\rMid=1\nLow=1\nCommon=1\nJNI=1\nMainControl=1\nESG=1\n"
             "SessionManager=1\nSectionParser=1\nDsmccDC=1\nDsmccOC=1\nTsDemux=1\nCPRM=1\n"
             "SMPlayer=1\nGingaAppMgr=1");
    VarnekPGL_InitializeDebug();
    TakeLog();
    // Each module with one or several levels; then masks without a known level or module, which trace nothing.
    for (uint32_t mask : {0x80000001u, 0x40000002u, 0x20000004u, 0x10000008u, 0xC0000010u, 0x81000020u, 0x80000040u,
                          0x80000080u, 0x80000100u, 0x80000200u, 0x80000400u, 0x80000800u, 0x80000003u, 0x80000000u,
                          0x00000001u, 0x08000001u, 0x80001000u, 0x83FFF000u}) {
        gszVarnekDbgFilePath = "a/b/Some.cpp";
        gVarnekDbgLineNum = 442;
        VarnekPGL_TraceOut(mask, "%s %d", "text", 7);
        for (const LogLine &line : TakeLog()) {
            Note(std::to_string(line.priority) + " " + line.tag + " " + line.text + "\n");
        }
    }
}

TEST_F(DebugAlone, ALineEnablesByTheFirstKeyInIt) {
    for (const char *file : {
             "LogToUSB=1\nHigh=1\nCommon=1\n",
             "Error=1\nCommon=1\n",
             "1 LogToUSB\nError=10\nxCommon 1",
             "LogToUSB=1\n#Error=1\nHigh=1\nCommon=1",
             "LogToUSB=1\nErrorHigh=1\nCommon=1",
             "LogToUSB=1\nError=0\nerror=1\nHigh=1\nCommon=1",
             "\nLogToUSB=1\nError=1\nCommon=1",
             "LogToUSB=1\r\n\r\n\nError=1\rCommon=1",
             "LogToUSB=1\nError=1\nGingaAppMgr=1",
             "LogToUSB=1\nError=1\nSMPlayer=1",
             // The line is cut at 51 characters: its key counts, and the '1' after the cut does not.
             "LogToUSB=1\nCommon=1\nError=1\nHigh                                              0  1",
         }) {
        WriteAll(kWorking, file);
        TakeLog();
        VarnekPGL_InitializeDebug();
        Note(::testing::PrintToString(file), 0);
        Note(std::string("  An Error of Common is ") + (Passes(0x80000001) ? "traced.\n" : "not traced.\n"));
    }
}

TEST_F(DebugAlone, LoadsAndFailuresAreReported) {
    const auto load = [] { return VarnekPGL_InitializeDebug(), 0; };
    NOTE(VARNEK_TRACE(0x80000001, "the first trace loads"), 0);
    TakeLog();
    WriteAll(kDefault, "LogToUSB=1\nError=1\nCommon=1\n");
    VARNEK_TRACE(0x80000001, "a failed load is not tried again");
    EXPECT_THAT(TakeLog(), IsEmpty());
    WriteAll(kWorking, "");
    NOTE(load());
    for (const bool directory : {true, false}) {
        std::filesystem::remove(kWorking);
        EXPECT_EQ(directory ? mkdir(kWorking, 0777) : mkfifo(kWorking, 0666), 0);
        NOTE(load());
        VarnekPGL_changeModeForDebug();
    }
    std::filesystem::remove(kWorking);
    WriteAll(kWorking, std::string((1 << 20) + 1, '#'));
    NOTE(load());  // more than 1 MiB
    std::filesystem::remove(kWorking);
    NOTE(load());
    EXPECT_EQ(ReadAll(kWorking), ReadAll(kDefault)) << "the working copy is not the default file";
    EXPECT_TRUE(Passes(0x80000001));
    EXPECT_FALSE(Passes(0x80000002));
}

TEST_F(DebugAlone, EightFirstTracesLoadOnceAndAllGetThrough) {
    WriteAll(kWorking, "LogToUSB=1\nError=1\nCommon=1\n");
    AtOnce(8, [](int) { VARNEK_TRACE(0x80000001, "here"); });
    const std::vector<LogLine> lines = TakeLog();
    const auto count = [&lines](const char *tag) {
        return std::count_if(lines.begin(), lines.end(), [tag](const LogLine &line) { return line.tag == tag; });
    };
    EXPECT_EQ(count("SBTVD"), 4);
    EXPECT_EQ(count("SBTVD_COM"), 8);
}

TEST_F(DebugAlone, ALogFunctionMayTrace) {
    WriteAll(kWorking, "LogToUSB=1\nHigh=1\nCommon=1\n");
    gLogHook = [](const LogLine &line) {
        if (line.tag == "SBTVD") {
            VARNEK_TRACE(0x40000001, "from the log function");
            VarnekPGL_InitializeDebug();
        }
    };
    VARNEK_TRACE(0x40000001, "one");
    EXPECT_THAT(TakeBodies("SBTVD_COM"), ElementsAre("one"));
}

TEST_F(DebugAlone, MakesTheDebugFilesWritableForEveryUser) {
    const std::string settings = VARNEK_DATA_DIR "Varnek_Config.cfg";
    for (const std::string &path : {std::string(kWorking), settings}) {
        WriteAll(path, "#");
        chmod(path.c_str(), 0600);
    }
    VarnekPGL_changeModeForDebug();
    for (const std::string &path : {std::string(kWorking), settings}) {
        struct stat status = {};
        ASSERT_EQ(stat(path.c_str(), &status), 0);
        EXPECT_EQ(status.st_mode & 0777u, 0666u) << path;
    }
    // A link may lead to a file that only the administrator may write.
    WriteAll(kDefault, "#");
    chmod(kDefault, 0644);
    std::filesystem::remove(kWorking);
    std::filesystem::create_symlink(kDefault, kWorking);
    VarnekPGL_changeModeForDebug();
    struct stat status = {};
    ASSERT_EQ(stat(kDefault, &status), 0);
    EXPECT_EQ(status.st_mode & 0777u, 0644u);
}

class Trace : public VarnekTest {};

TEST_F(Trace, LinesAreCutToTheirBuffer) {
    const std::string text(3000, 'x');
    for (const std::string &file :
         {std::string("Short.cpp"), std::string(200, 'f'), std::string(2040, 'f'), std::string(5000, 'f')}) {
        gszVarnekDbgFilePath = file.c_str();
        gVarnekDbgLineNum = 1;
        VarnekPGL_TraceOut(0x80000001, "%s", text.c_str());
        const auto log = TakeLog();
        ASSERT_EQ(log.size(), 1u);
        EXPECT_EQ(log[0].text.size(), std::min<size_t>(strlen("[E][-   1] ") + file.size() + 2017, 2047));
        EXPECT_EQ(log[0].text.rfind("[E][" + file.substr(0, 2000), 0), 0u);
    }
    gszVarnekDbgFilePath = nullptr;
    for (const auto &[number, prefix] : {std::pair(INT32_MIN, "[E][--2147483648]"), std::pair(0, "[E][-   0]")}) {
        gVarnekDbgLineNum = number;
        VarnekPGL_TraceOut(0x80000001, nullptr);
        EXPECT_EQ(TakeLog()[0].text, prefix + std::string(" (null)"));
    }
}

TEST_F(Trace, LeavesErrnoAloneAndReportsIt) {
    gLogHook = [](const LogLine &) { errno = ENOMEM; };
    errno = EXDEV;
    VARNEK_TRACE(0x80000001, "%d", VarnekPGL_SysGetLastErro());
    VARNEK_PANIC();
    VarnekPGL_InitializeDebug();
    EXPECT_EQ(VarnekPGL_SysGetLastErro(), EXDEV);
    gLogHook = nullptr;
    EXPECT_EQ(TakeBodies("SBTVD_COM").front(), std::to_string(EXDEV));
}

TEST_F(Trace, PanicNamesTheCallersPlace) {
    gszVarnekDbgFilePath = "x/Place.cpp";
    gVarnekDbgLineNum = 17;
    NOTE(VarnekPGL_Panic());
}

}  // namespace
