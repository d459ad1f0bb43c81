// What the benchmarks share. Each program measures one area. A benchmark is called ROW:CONTENDER,
// and script/bench compares the contenders of a row; one whose library was not installed at build
// time is left out.
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
// the first thread sleeps: in a process that never had a second thread, the C library skips
// atomics. `config` becomes the trace configuration; an empty one traces nothing.
int Main(int argc, char **argv, void (*registerAll)(), const char *config = "");

// Registers a contender, which is a function of a benchmark::State.
template <typename Function>
benchmark::internal::Benchmark *Add(const std::string &name, Function function) {
    // NOLINTNEXTLINE(readability-redundant-string-cstr): Debian 12's version takes no std::string
    return benchmark::RegisterBenchmark(name.c_str(), std::move(function))->UseRealTime();
}

// Returns random bytes, the same ones in every run.
std::vector<unsigned char> Noise(size_t size);

// Binds the calling thread to a core, counted from 0; if there is only one, to that one.
void PinTo(int core);

// Makes the row report why a benchmark cannot go on, unless `holds`, which it returns.
inline bool Require(benchmark::State &state, bool holds, const char *what) {
    if (!holds) {
        state.SkipWithError(what);
    }
    return holds;
}

}  // namespace bench

#endif
