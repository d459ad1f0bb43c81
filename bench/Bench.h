// Functions that the benchmarks share. Each program measures one area. A benchmark has the name
// ROW:CONTENDER, and script/bench compares the contenders of a row. Times are wall-clock times.
#ifndef VARNEK_BENCH_H
#define VARNEK_BENCH_H

#include <benchmark/benchmark.h>

#include <cstddef>
#include <cstdint>
#include <cstdio>
#include <string>
#include <utility>
#include <vector>

namespace bench {

// Runs an area's benchmarks in a thread of the library, so that they can receive messages. The
// first thread sleeps. With a second thread, the process does not skip atomics. `config` is the
// content of the debug configuration during the run; with an empty one nothing is traced.
int Main(int argc, char **argv, void (*registerAll)(), const char *config = "");

// Registers a contender that is a function. All contenders are measured in the same way.
template <typename Function>
benchmark::internal::Benchmark *Add(const std::string &name, Function function) {
    // NOLINTNEXTLINE(readability-redundant-string-cstr): Debian 12's version takes no std::string
    return benchmark::RegisterBenchmark(name.c_str(), std::move(function))->UseRealTime();
}

// Registers a contender that was not installed at build time, so that its row says so.
void AddMissing(const std::string &name);

// Returns random bytes that are the same in each run.
std::vector<unsigned char> Noise(size_t size);

// Binds the calling thread to a core, counted from 0. If there is only one core, it uses that one.
void PinTo(int core);

// Reports in the row that a benchmark cannot continue.
inline bool Require(benchmark::State &state, bool holds, const char *what) {
    if (!holds) {
        state.SkipWithError(what);
    }
    return holds;
}

}  // namespace bench

#endif
