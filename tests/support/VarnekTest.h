// The tests' fixture, which captures what the library writes to the Android log and gives each test its own folder.
// The tests count on what this header includes.
#ifndef VARNEK_TESTS_SUPPORT_VARNEKTEST_H
#define VARNEK_TESTS_SUPPORT_VARNEKTEST_H

#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <signal.h>
#include <sys/resource.h>
#include <sys/types.h>

#include <algorithm>
#include <atomic>
#include <chrono>
#include <functional>
#include <map>
#include <random>
#include <string>
#include <thread>
#include <type_traits>
#include <utility>
#include <vector>

#include "Varnek_Debug.h"
#include "support/Platform.h"

struct LogLine {
    int priority;
    std::string tag;
    std::string text;
    pid_t thread;

    // Returns the caller's text of a trace, without the prefix, and other lines as a whole.
    std::string Body() const;
};

// Returns what all threads have written since the last call, in the order in which it was written.
std::vector<LogLine> TakeLog();

// Returns the bodies of all lines since the last call, or only of those with this tag and this priority.
std::vector<std::string> TakeBodies(const std::string &tag = "", int priority = 0);

// The same for Error traces and failures of the storage functions.
inline std::vector<std::string> TakeErrors() { return TakeBodies("", 6); }

// Puts a "*" for whatever the system has chosen, such as handles and times.
std::string WithoutHandles(const std::string &text);

// Called without a lock for each line before it is captured, in the thread that wrote the line; null for none.
extern std::atomic<void (*)(const LogLine &line)> gLogHook;

// Returns the path of what the tests read ("expected/", "defaults/" or "sample.ts"): in the build tree, or in the
// folder that VARNEK_TEST_FILES in the environment names.
std::string TestFile(const std::string &name);

std::string ReadAll(const std::string &path);
void WriteAll(const std::string &path, const std::string &content);

inline std::vector<unsigned char> RandomBytes(std::mt19937 &random, size_t size) {
    std::vector<unsigned char> bytes(size);
    std::generate(bytes.begin(), bytes.end(), std::ref(random));
    return bytes;
}

// Runs work(0), work(1) ... in threads that begin at the same moment.
template <typename Work>
void AtOnce(int threads, Work work) {
    std::atomic<int> waiting{threads};
    std::vector<std::thread> all;
    for (int i = 0; i < threads; ++i) {
        all.emplace_back([&waiting, &work, i] {
            for (--waiting; waiting > 0;) {
            }
            work(i);
        });
    }
    for (std::thread &thread : all) {
        thread.join();
    }
}

// Waits up to twenty seconds for `condition` to hold, and returns whether it does.
template <typename Condition>
bool Eventually(Condition condition) {
    const auto end = std::chrono::steady_clock::now() + std::chrono::seconds(20);
    while (!condition()) {
        if (std::chrono::steady_clock::now() > end) {
            return false;
        }
        std::this_thread::sleep_for(std::chrono::microseconds(100));
    }
    return true;
}

// Keeps every file from growing beyond `size` bytes.
class FileSizeLimit {
  public:
    explicit FileSizeLimit(rlim_t size) {
        signal(SIGXFSZ, SIG_IGN);
        getrlimit(RLIMIT_FSIZE, &old_);
        const rlimit limit = {size, old_.rlim_max};
        setrlimit(RLIMIT_FSIZE, &limit);
    }
    FileSizeLimit(const FileSizeLimit &) = delete;
    FileSizeLimit &operator=(const FileSizeLimit &) = delete;
    ~FileSizeLimit() { setrlimit(RLIMIT_FSIZE, &old_); }

  private:
    rlimit old_;
};

// In each test the debug configuration is loaded, with every level and module on.
class VarnekTest : public ::testing::Test {
  protected:
    void SetUp() override;
    void TearDown() override;

    // Returns a path in this test's own folder.
    std::string Path(const std::string &name) const { return folder_ + "/" + name; }

    // Appends a text, or a call's result and this thread's lines since the last TakeLog(), to the transcript, which
    // must equal tests/expected/SUITE.TEST.txt. A run with VARNEK_WRITE_EXPECTED in its environment writes that file.
    void Note(const std::string &text) { transcript_ += text; }
    void Note(const std::string &call, const std::string &result);
    bool notesLow_ = true;  // a test of failures may leave out the Low lines if another test shows them

    // Replaces a text that differs from run to run with `name` in the transcript. The system's handles are always
    // hidden, and its errors have their names instead of its numbers and words.
    void Show(const std::string &text, const std::string &name) { names_.emplace_back(text, name); }

    // What the transcript shows for a result: its name, if the test has given it one, or else the number.
    std::string Named(int64_t result) const {
        const auto named = resultNames_.find(result);
        return named != resultNames_.end() ? named->second : std::to_string(result);
    }
    std::map<int64_t, const char *> resultNames_;

    // Returns a function that calls `function` and notes the call with the values of its arguments.
    template <typename Result, typename... Parameters>
    auto Noting(const std::string &name, Result (*function)(Parameters...)) {
        return Noting(name, [function](auto... arguments) { return function(static_cast<Parameters>(arguments)...); });
    }
    template <typename Function>
    auto Noting(const std::string &name, Function function) {
        return [this, name, function](auto &&...arguments) {
            std::string list;
            ((list += (list.empty() ? "" : ", ") + Shown(arguments)), ...);
            const std::string call = name + "(" + list + ")";
            TakeLog();
            if constexpr (std::is_void_v<decltype(function(Passed(arguments)...))>) {
                function(Passed(arguments)...);
                Note(call, "");
            } else {
                Note(call, Named(function(Passed(arguments)...)));
            }
        };
    }

  private:
    template <typename T>
    static auto Passed(T &value) {
        if constexpr (std::is_same_v<std::remove_const_t<T>, std::string>) {
            return value.c_str();
        } else {
            return std::decay_t<T>(value);
        }
    }
    // Texts are quoted, and an address is a star.
    template <typename T>
    static std::string Shown(const T &value) {
        if constexpr (std::is_integral_v<T>) {
            return std::is_unsigned_v<T> && value == T(WAIT_FOREVER) ? "WAIT_FOREVER" : std::to_string(value);
        } else {
            return std::is_null_pointer_v<T> ? "null" : "*";
        }
    }
    static std::string Shown(const std::string &text) { return '"' + text + '"'; }
    static std::string Shown(const char *const &text) {
        return text != nullptr ? '"' + std::string(text) + '"' : "null";
    }

    std::string folder_, transcript_;
    std::vector<std::pair<std::string, std::string>> names_{{VARNEK_DATA_DIR, "DATA/"}, {VARNEK_SYSTEM_DIR, "SYSTEM/"}};
};

// NOTE(VarnekPGL_DeleteMutex)(-1) notes this call.
#define NOTE(function) Noting(#function, function)

// A constant and its name.
#define NAMED(constant) std::pair(constant, #constant)

#endif
