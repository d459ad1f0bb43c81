#include "support/VarnekTest.h"

#include <sys/syscall.h>
#include <unistd.h>

#include <cerrno>
#include <cstdlib>
#include <cstring>
#include <filesystem>
#include <fstream>
#include <iterator>
#include <mutex>
#include <regex>

#include "varnek_platform.h"

std::atomic<void (*)(const LogLine &line)> gLogHook{nullptr};

namespace {

// Never destroyed: a detached thread may still log while the process ends.
std::mutex &gLogLock = *new std::mutex;
std::vector<LogLine> &gLog = *new std::vector<LogLine>;

void Capture(int priority, const char *tag, const char *text) {
    LogLine line{priority, tag, text, static_cast<pid_t>(syscall(SYS_gettid))};
    if (const auto hook = gLogHook.load()) {
        hook(line);
    }
    const std::lock_guard<std::mutex> guard(gLogLock);
    gLog.push_back(std::move(line));
}

constexpr std::pair<int, const char *> kErrors[] = {
    NAMED(EPERM),  NAMED(ENOENT), NAMED(EINTR),  NAMED(EIO),     NAMED(EBADF),     NAMED(ENOMEM),    NAMED(EACCES),
    NAMED(EFAULT), NAMED(EBUSY),  NAMED(EEXIST), NAMED(ENOTDIR), NAMED(EISDIR),    NAMED(EINVAL),    NAMED(EMFILE),
    NAMED(EFBIG),  NAMED(ENOSPC), NAMED(ESPIPE), NAMED(EROFS),   NAMED(EOVERFLOW), NAMED(ETIMEDOUT), NAMED(ECONNRESET),
};

}  // namespace

std::string LogLine::Body() const { return BodyOf(tag.c_str(), text.c_str()); }

std::vector<LogLine> TakeLog() {
    const std::lock_guard<std::mutex> guard(gLogLock);
    std::vector<LogLine> lines;
    lines.swap(gLog);
    return lines;
}

std::vector<std::string> TakeBodies(const std::string &tag, int priority) {
    std::vector<std::string> bodies;
    for (const LogLine &line : TakeLog()) {
        if ((tag.empty() || line.tag == tag) && (priority == 0 || line.priority == priority)) {
            bodies.push_back(line.Body());
        }
    }
    return bodies;
}

std::string TestFile(const std::string &name) {
    const char *files = getenv("VARNEK_TEST_FILES");
    return std::string(files != nullptr ? files : VARNEK_TEST_FILES) + "/" + name;
}

std::string ReadAll(const std::string &path) {
    std::ifstream file(path, std::ios::binary);
    return {std::istreambuf_iterator<char>(file), {}};
}

void WriteAll(const std::string &path, const std::string &content) { std::ofstream(path, std::ios::binary) << content; }

void VarnekTest::SetUp() {
    StartClean();
    char folder[] = "test.XXXXXX";
    ASSERT_NE(mkdtemp(folder), nullptr);
    folder_ = folder;
    Show(folder_, "DIR");
    VarnekPGL_CheckAndInitDebug();
    TakeLog();
    VARNEK_PANIC();
    ASSERT_EQ(TakeLog().size(), 1u) << "the log is not captured";
}

void VarnekTest::Note(const std::string &call, const std::string &result) {
    std::string text = call + (result.empty() ? "\n" : " = " + result + "\n");
    for (const LogLine &line : TakeLog()) {
        if (line.thread == syscall(SYS_gettid) && (notesLow_ || line.priority != VARNEK_LOG_VERBOSE)) {
            text += std::string("  ") + "??LMH?EP"[line.priority & 7] + " " + line.tag + " ";
            text += std::regex_replace(line.Body(), std::regex("\n"), "\\n") + "\n";
        }
    }
    // A letter that is repeated many times is shown once, with the number.
    for (size_t at = 0; at < text.size(); ++at) {
        const char letter = text[at];
        const size_t count = std::min(text.find_first_not_of(letter, at), text.size()) - at;
        if (count > 30) {
            text.replace(at, count, letter + ("{" + std::to_string(count) + "}"));
        }
    }
    transcript_ += text;
}

std::string WithoutHandles(const std::string &text) {
    static const std::regex system(
        "((?:linux ?[A-Z][a-z]+=|[pP]threadI[dD] = |tv_n?sec)\\[|[pu]id\\((?=\\d)|(?:pDir|hFile|handle) = 0x)"
        "[^\\]), \n]*|(process\\()[^)]*/");
    return std::regex_replace(text, system, "$1$2*");
}

void VarnekTest::TearDown() {
    for (const auto &[error, name] : kErrors) {
        if (error != EINVAL) {  // "Invalid argument" are also words of the library
            Show(strerror(error), name);
        }
        for (const char *before : {"errCode = [", "errno(", "errno = ["}) {
            const char end = before[strlen(before) - 1] == '(' ? ')' : ']';
            Show(before + std::to_string(error) + end, before + std::string(name) + end);
        }
    }
    for (const auto &[text, name] : names_) {
        for (size_t at = 0; (at = transcript_.find(text, at)) != std::string::npos; at += name.size()) {
            transcript_.replace(at, text.size(), name);
        }
    }
    transcript_ = WithoutHandles(transcript_);
    const auto &test = *::testing::UnitTest::GetInstance()->current_test_info();
    const std::string path = TestFile("expected/") + test.test_suite_name() + "." + test.name() + ".txt";
    if (getenv("VARNEK_WRITE_EXPECTED") != nullptr) {
        transcript_.empty() ? void(std::filesystem::remove(path)) : WriteAll(path, transcript_);
    }
    // A file that is missing reads as empty, so a test that notes nothing must have none.
    EXPECT_EQ(transcript_, ReadAll(path));
    std::error_code ignored;
    std::filesystem::remove_all(folder_, ignored);
}

int main(int argc, char **argv) {
    ::testing::InitGoogleMock(&argc, argv);
    gOnLog = Capture;
    return RUN_ALL_TESTS();
}
