// Traces at a level that is off, and into a log function that discards the line.
#include <dlfcn.h>
#include <stdarg.h>
#include <string.h>

#include "Bench.h"
#include "Varnek_Debug.h"
#include "bare.h"
#include "varnek_platform.h"

#ifdef HAVE_SPDLOG
#include <spdlog/sinks/null_sink.h>
#include <spdlog/spdlog.h>
#endif

// Replaces the platform's log function.
extern "C" __attribute__((visibility("default"))) int __android_log_write(int, const char *,
                                                                          const char *text) {
    benchmark::DoNotOptimize(text);
    return 1;
}

namespace {

constexpr uint32_t kOff = VARNEK_LEVEL_LOW | VARNEK_MODULE_COMMON;
constexpr uint32_t kOn = VARNEK_LEVEL_ERROR | VARNEK_MODULE_COMMON;

// Traces with a new number each time.
template <typename Trace>
void Run(benchmark::State &state, Trace trace) {
    int i = 0;
    for (auto _ : state) {
        trace(++i);
    }
}

__attribute__((noinline, format(printf, 1, 2))) void Format(const char *format, ...) {
    char line[2048];
    va_list args;
    va_start(args, format);
    vsnprintf(line, sizeof line, format, args);
    va_end(args);
    benchmark::DoNotOptimize(line);
}

#ifdef HAVE_ANDROID_LOG
using AndroidPrint = int (*)(int, const char *, const char *, ...);

// Loads the library at run time, because this program and the stand-in define symbols with the same
// names.
AndroidPrint LoadAndroidPrint() {
    void *library = dlopen(HAVE_ANDROID_LOG, RTLD_NOW | RTLD_LOCAL | RTLD_DEEPBIND);
    if (library == nullptr) {
        return nullptr;
    }
    constexpr int32_t kError = 6;
    const auto setMinimum = reinterpret_cast<int32_t (*)(int32_t)>(
        dlsym(library, "__android_log_set_minimum_priority"));
    if (setMinimum != nullptr) {
        setMinimum(kError);
    }
    return reinterpret_cast<AndroidPrint>(dlsym(library, "__android_log_print"));
}

void AndroidOff(benchmark::State &state) {
    static const AndroidPrint print = LoadAndroidPrint();
    constexpr int kVerbose = 2;
    if (bench::Require(state, print != nullptr, "cannot be loaded") &&
        bench::Require(state, print(kVerbose, "SBTVD_COM", "%d", 1) <= 0, "is not filtered")) {
        Run(state,
            [](int i) { print(kVerbose, "SBTVD_COM", "section of table %d on pid %d", i, 18); });
    }
}
#endif

#ifdef HAVE_SPDLOG
// The null sink drops the message before a line is composed, so only the text is formatted.
void SpdlogOn(benchmark::State &state) {
    spdlog::logger logger("SBTVD_COM", std::make_shared<spdlog::sinks::null_sink_mt>());
    logger.set_level(spdlog::level::err);
    Run(state, [&logger](int i) { logger.error("section of table {} on pid {}", i, 18); });
}
#endif

// Traces that are off, in each of `threads` threads.
void RegisterOff(const std::string &row, int threads) {
    const auto add = [&row, threads](const char *contender, auto run) {
        bench::Add(row + contender, [run](benchmark::State &state) {
            bench::PinTo(state.thread_index());
            run(state);
        })->Threads(threads);
    };
    add("ours", [](benchmark::State &state) {
        Run(state, [](int i) { VARNEK_TRACE(kOff, "section of table %d on pid %d", i, 18); });
    });
    add("bare", [](benchmark::State &state) {
        Run(state, [](int i) { BareTrace(kOff, "section of table %d on pid %d", i, 18); });
    });
#ifdef HAVE_ANDROID_LOG
    add("liblog", AndroidOff);
#endif
}

void RegisterAll() {
    RegisterOff("trace_off/one:", 1);
    RegisterOff("trace_off/two:", 2);
    bench::Add("trace_on:ours", [](benchmark::State &state) {
        Run(state, [](int i) { VARNEK_TRACE(kOn, "section of table %d on pid %d", i, 18); });
    });
    bench::Add("trace_on:bare", [](benchmark::State &state) {
        Run(state, [](int i) {
            Format("[%c][%s-%4d] section of table %d on pid %d", 'E', "trace.cpp", __LINE__, i, 18);
        });
    });
#ifdef HAVE_SPDLOG
    bench::Add("trace_on:spdlog", SpdlogOn);
#endif
}

}  // namespace

int main(int argc, char **argv) {
    return bench::Main(argc, argv, RegisterAll, "LogToUSB=1\nError=1\nCommon=1\n");
}
