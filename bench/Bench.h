// What the benchmarks share. A program holds one area; a benchmark is called ROW:CONTENDER, and
// script/bench.py sets the contenders of a row side by side. Time is that of the clock on the wall.
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

// Runs an area's benchmarks in a thread of the library, so that they can receive messages, while
// the first thread sleeps: a process that never had a second one skips atomics. `config` is what
// the debug configuration holds meanwhile; an empty one traces nothing.
int Main(int argc, char **argv, void (*registerAll)(), const char *config = "");

// A row that has a function in its place, each measured alike.
template <typename Function>
benchmark::internal::Benchmark *Add(const std::string &name, Function function) {
    // NOLINTNEXTLINE(readability-redundant-string-cstr): Debian 12's version takes no std::string
    return benchmark::RegisterBenchmark(name.c_str(), std::move(function))->UseRealTime();
}

// Keeps a contender in its row that was not there when this was built.
void AddMissing(const std::string &name);

// Bytes that differ from run to run in nothing.
std::vector<unsigned char> Noise(size_t size);

// Binds the calling thread to one of the cores, counted from 0; where there is but one, to that.
void PinTo(int core);

// A benchmark that cannot go on says so in its row.
inline bool Require(benchmark::State &state, bool holds, const char *what) {
    if (!holds) {
        state.SkipWithError(what);
    }
    return holds;
}

}  // namespace bench

#endif
