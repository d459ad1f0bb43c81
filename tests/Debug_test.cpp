#include <sys/stat.h>

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
        WriteAll(kDefault, ReadAll(VARNEK_DEFAULTS "debug_ltn.ini"));
    }

    // Whether a trace from this line with this mask gets through.
    static bool Passes(uint32_t mask) {
        TakeLog();
        VARNEK_TRACE(mask, "probe");
        return !TakeLog().empty();
    }
};

TEST_F(DebugAlone, EveryLevelAndModuleHasItsLook) {
    WriteAll(kWorking,
             "LogToUSB=1\nError=1\r\nHigh=1\r\rMid=1\nLow=1\nCommon=1\nJNI=1\nMainControl=1\nESG=1\n"
             "SessionManager=1\nSectionParser=1\nDsmccDC=1\nDsmccOC=1\nTsDemux=1\nCPRM=1\n"
             "SMPlayer=1\nGingaAppMgr=1");
    VarnekPGL_InitializeDebug();
    TakeLog();
    const struct {
        uint32_t mask;
        int priority;
        const char *tag;
        char label;
    } rows[] = {
        {0x80000001, 6, "SBTVD_COM", 'E'},           {0x40000002, 4, "SBTVD_JNI", 'H'},
        {0x20000004, 3, "SBTVD_CTRL", 'M'},          {0x10000008, 2, "SBTVD_ESG", 'L'},
        {0xC0000010, 3, "SBTVD_SessionMGR", 'L'},    {0x81000020, 3, "SBTVD_SI_Parser", 'L'},
        {0x80000040, 6, "SBTVD_Data_Carousel", 'E'}, {0x80000080, 6, "SBTVD_Object_Carousel", 'E'},
        {0x80000100, 6, "SBTVD_Demux", 'E'},         {0x80000200, 6, "SBTVD_CPRM", 'E'},
        {0x80000400, 6, "SBTVD_GINGA", 'E'},         {0x80000800, 6, "SBTVD_SMPLAYER", 'E'},
        {0x80000003, 6, "SBTVD_Unknown", 'E'},
    };
    for (const auto &row : rows) {
        gszVarnekDbgFilePath = "a/b/Some.cpp";
        gVarnekDbgLineNum = 442;
        VarnekPGL_TraceOut(row.mask, "%s %d", "text", 7);
        const auto log = TakeLog();
        ASSERT_EQ(log.size(), 1u) << std::hex << row.mask;
        EXPECT_EQ(log[0].priority, row.priority) << std::hex << row.mask;
        EXPECT_EQ(log[0].tag, row.tag);
        EXPECT_EQ(log[0].text, std::string("[") + row.label + "][Some.cpp- 442] text 7");
    }
    for (uint32_t mask : {0x80000000u, 0x00000001u, 0x08000001u, 0x80001000u, 0x83FFF000u}) {
        EXPECT_FALSE(Passes(mask)) << std::hex << mask;
    }
}

TEST_F(DebugAlone, ALineEnablesByTheFirstKeyInIt) {
    const struct {
        const char *file;
        uint32_t passes;
        uint32_t stopped;
    } rows[] = {
        {"LogToUSB=1\nHigh=1\nCommon=1\n", 0x40000001, 0x80000001},
        {"LogToUSB=1\nHigh=1\nCommon=1\n", 0x40000003, 0x40000002},
        {"Error=1\nCommon=1\n", 0, 0x80000001},
        {"1 LogToUSB\nError=10\nxCommon 1", 0x80000001, 0x40000001},
        {"LogToUSB=1\n#Error=1\nHigh=1\nCommon=1", 0x40000001, 0x80000001},
        {"LogToUSB=1\nErrorHigh=1\nCommon=1", 0x80000001, 0x40000001},
        {"LogToUSB=1\nError=0\nerror=1\nHigh=1\nCommon=1", 0x40000001, 0x80000001},
        {"\nLogToUSB=1\nError=1\nCommon=1", 0, 0x80000001},
        {"LogToUSB=1\r\n\r\n\nError=1\rCommon=1", 0x80000001, 0x10000001},
        {"LogToUSB=1\nError=1\nGingaAppMgr=1", 0x80000400, 0x80000800},
        {"LogToUSB=1\nError=1\nSMPlayer=1", 0x80000800, 0x80000400},
        // Cut at 51 characters: the key before counts, the '1' behind does not.
        {"LogToUSB=1\nCommon=1\nError=1\nHigh                                              0  1", 0x80000001,
         0x40000001},
    };
    for (const auto &row : rows) {
        WriteAll(kWorking, row.file);
        VarnekPGL_InitializeDebug();
        if (row.passes != 0) {
            EXPECT_TRUE(Passes(row.passes)) << row.file;
        }
        EXPECT_FALSE(Passes(row.stopped)) << row.file;
    }
}

TEST_F(DebugAlone, LoadsAndFailuresAreReported) {
    const std::string missing = "Debug Configuration File Doesn't exist!\n";
    NOTE(VARNEK_TRACE(0x80000001, "the first trace loads"), 0);
    TakeLog();
    WriteAll(kDefault, "LogToUSB=1\nError=1\nCommon=1\n");
    VARNEK_TRACE(0x80000001, "a failed load is not tried again");
    EXPECT_THAT(TakeLog(), IsEmpty());

    WriteAll(kWorking, "");
    VarnekPGL_InitializeDebug();
    EXPECT_EQ(TakeBodies("SBTVD").front(), missing);

    for (const bool directory : {true, false}) {
        std::filesystem::remove(kWorking);
        EXPECT_EQ(directory ? mkdir(kWorking, 0777) : mkfifo(kWorking, 0666), 0);
        VarnekPGL_InitializeDebug();
        EXPECT_EQ(TakeBodies("SBTVD").front(), missing);
        VarnekPGL_changeModeForDebug();
    }
    std::filesystem::remove(kWorking);
    WriteAll(kWorking, std::string((1 << 20) + 1, '#'));
    VarnekPGL_InitializeDebug();
    EXPECT_EQ(TakeBodies("SBTVD").front(), "Debug Configuration File reading fail!\n") << "more than 1 MiB";
    std::filesystem::remove(kWorking);

    VarnekPGL_InitializeDebug();
    EXPECT_EQ(ReadAll(kWorking), ReadAll(kDefault)) << "the working copy is seeded";
    EXPECT_EQ(TakeBodies("SBTVD").front(), "Log Config: Error=[1]\tHigh=[0]\tMid=[0]\tLow=[0]\n");
    EXPECT_TRUE(Passes(0x80000001));
    EXPECT_FALSE(Passes(0x80000002));
}

TEST_F(DebugAlone, EightFirstTracesLoadOnceAndAllGetThrough) {
    WriteAll(kWorking, "LogToUSB=1\nError=1\nCommon=1\n");
    AtOnce(8, [](int) { VARNEK_TRACE(0x80000001, "here"); });
    int summaries = 0;
    int traces = 0;
    for (const LogLine &line : TakeLog()) {
        summaries += line.tag == "SBTVD";
        traces += line.tag == "SBTVD_COM";
    }
    EXPECT_EQ(summaries, 4);
    EXPECT_EQ(traces, 8);
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

TEST_F(DebugAlone, OpensTheDebugFilesToEveryUser) {
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
}

class Trace : public VarnekTest {};

TEST_F(Trace, LinesAreCutToTheirBuffer) {
    const std::string text(3000, 'x');
    const struct {
        std::string file;
        size_t total;
    } rows[] = {
        {"Short.cpp", sizeof "[E][Short.cpp-   1] " - 1 + 2017},
        {std::string(200, 'f'), 2047},
        {std::string(2040, 'f'), 2047},
        {std::string(5000, 'f'), 2047},
    };
    for (const auto &row : rows) {
        gszVarnekDbgFilePath = row.file.c_str();
        gVarnekDbgLineNum = 1;
        VarnekPGL_TraceOut(0x80000001, "%s", text.c_str());
        const auto log = TakeLog();
        ASSERT_EQ(log.size(), 1u);
        EXPECT_EQ(log[0].text.size(), row.total);
        EXPECT_EQ(log[0].text.rfind("[E][" + row.file.substr(0, 2000), 0), 0u);
    }
    gszVarnekDbgFilePath = nullptr;
    gVarnekDbgLineNum = INT32_MIN;
    VarnekPGL_TraceOut(0x80000001, nullptr);
    EXPECT_EQ(TakeLog()[0].text, "[E][--2147483648] (null)");
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
    EXPECT_EQ(VarnekPGL_Panic(), 1);
    const auto log = TakeLog();
    ASSERT_EQ(log.size(), 1u);
    EXPECT_EQ(log[0].priority, 7);
    EXPECT_EQ(log[0].tag, "Varnek");
    EXPECT_EQ(log[0].text, "#### [VarnekPanic]  File=[Place.cpp], line=[17]!\n");
}

}  // namespace
