#include "support/VarnekTest.h"

#include <sys/syscall.h>
#include <unistd.h>

#include <cstdlib>
#include <cstring>
#include <filesystem>
#include <fstream>
#include <iterator>
#include <mutex>

#include "varnek_platform.h"

void (*gLogHook)(const LogLine &line) = nullptr;
const char *gFeature = "";

namespace {

constexpr char kConfigPath[] = VARNEK_DATA_DIR "debug_ltn.ini";
constexpr char kEverythingOn[] =
    "LogToUSB=1\nError=1\nHigh=1\nMid=1\nLow=1\n"
    "Common=1\nJNI=1\nMainControl=1\nESG=1\nSessionManager=1\nSectionParser=1\nDsmccDC=1\n"
    "DsmccOC=1\nTsDemux=1\nCPRM=1\nSMPlayer=1\nGingaAppMgr=1\n";

// Never destroyed: a detached thread may still log while the process ends.
std::mutex &gLogLock = *new std::mutex;
std::vector<LogLine> &gLog = *new std::vector<LogLine>;

// Other tests may be reading the file, so it is put in place whole.
void PutDefaultConfig() {
    std::filesystem::create_directories(VARNEK_DATA_DIR);
    std::filesystem::create_directories(VARNEK_SYSTEM_DIR);
    if (ReadAll(kConfigPath) == kEverythingOn) {
        return;
    }
    const std::string draft = kConfigPath + std::to_string(getpid());
    WriteAll(draft, kEverythingOn);
    std::filesystem::rename(draft, kConfigPath);
}

}  // namespace

// Takes the place of the platform's log function for the whole process.
extern "C" __attribute__((visibility("default"))) int __android_log_write(int priority, const char *tag,
                                                                          const char *text) {
    LogLine line{priority, tag, text, static_cast<pid_t>(syscall(SYS_gettid))};
    if (gLogHook != nullptr) {
        gLogHook(line);
    }
    const std::lock_guard<std::mutex> guard(gLogLock);
    gLog.push_back(std::move(line));
    return 1;
}

// And that of the platform's feature store.
extern "C" __attribute__((visibility("default"))) const char *VellNativeFeature_getStringWithDefault(
    const char *key, const char *defaultValue) {
    return strcmp(key, "TarnFeature_MobileTV_EnableServiceAs") == 0 && *defaultValue == '\0' ? gFeature
                                                                                             : "not asked for";
}

std::string LogLine::Body() const {
    const size_t end = IsTrace() ? text.find("] ", text.find("][")) : std::string::npos;
    return end != std::string::npos ? text.substr(end + 2) : text;
}

std::vector<LogLine> TakeLog() {
    const std::lock_guard<std::mutex> guard(gLogLock);
    std::vector<LogLine> lines;
    lines.swap(gLog);
    return lines;
}

std::vector<std::string> TakeBodies(const std::string &tag) {
    std::vector<std::string> bodies;
    for (const LogLine &line : TakeLog()) {
        if (tag.empty() || line.tag == tag) {
            bodies.push_back(line.Body());
        }
    }
    return bodies;
}

std::vector<std::string> TakeErrors() {
    std::vector<std::string> bodies;
    for (const LogLine &line : TakeLog()) {
        if (line.priority == 6) {
            bodies.push_back(line.Body());
        }
    }
    return bodies;
}

void ExpectRows(const std::vector<Row> &rows) {
    std::vector<std::string> expected;
    for (const Row &row : rows) {
        EXPECT_EQ(row.result, row.expected) << ::testing::PrintToString(row.lines);
        expected.insert(expected.end(), row.lines.begin(), row.lines.end());
    }
    EXPECT_EQ(TakeErrors(), expected);
}

std::string ReadAll(const std::string &path) {
    std::ifstream file(path, std::ios::binary);
    return {std::istreambuf_iterator<char>(file), {}};
}

void WriteAll(const std::string &path, const std::string &content) { std::ofstream(path, std::ios::binary) << content; }

void VarnekTest::SetUp() {
    PutDefaultConfig();
    char folder[] = "test.XXXXXX";
    ASSERT_NE(mkdtemp(folder), nullptr);
    folder_ = folder;
    VarnekPGL_CheckAndInitDebug();
    TakeLog();
    VARNEK_PANIC();
    ASSERT_EQ(TakeLog().size(), 1u) << "the log is not captured";
}

void VarnekTest::TearDown() {
    std::error_code ignored;
    std::filesystem::remove_all(folder_, ignored);
}

int main(int argc, char **argv) {
    ::testing::InitGoogleMock(&argc, argv);
    return RUN_ALL_TESTS();
}
