// The part of Google Benchmark's interface that the benchmarks use, for counting instructions. Runs
// TURNS iterations of the benchmark that the command line names, between two marks that the plugin
// (count.c) knows.
//   PROGRAM ROW:CONTENDER TURNS
#ifndef VARNEK_BENCH_DEVICE_BENCHMARK_H
#define VARNEK_BENCH_DEVICE_BENCHMARK_H

#include <unistd.h>

#include <cstdint>
#include <cstdio>
#include <cstdlib>
#include <functional>
#include <string>

namespace benchmark {

class State {
  public:
    explicit State(int turns) : turns_(turns) {}

    struct Iterator {
        struct [[maybe_unused]] Turn {};
        int left;
        bool operator!=(const Iterator &) const {
            if (left != 0) {
                return true;
            }
            Mark();
            return false;
        }
        void operator++() { --left; }
        Turn operator*() const { return {}; }
    };
    Iterator begin() const {
        Mark();
        return {turns_};
    }
    Iterator end() const { return {}; }

    int64_t iterations() const { return turns_; }
    int thread_index() const { return 0; }
    void SetItemsProcessed(int64_t) {}
    // After an error there is nothing to measure.
    void SkipWithError(const char *what) const {
        std::fprintf(stderr, "%s\n", what);
        std::_Exit(1);
    }

  private:
    static void Mark() { asm volatile("dbg #7" : : : "memory"); }

    const int turns_;
};

namespace internal {

struct Benchmark {
    Benchmark *UseRealTime() { return this; }
    Benchmark *Threads(int) { return this; }
};

// What the command line asks for.
struct Request {
    std::string name;
    int turns = 0;
    std::function<void(State &)> function;
    Benchmark benchmark;
};

inline Request &Wanted() {
    static Request wanted;
    return wanted;
}

}  // namespace internal

template <typename Function>
internal::Benchmark *RegisterBenchmark(const char *name, Function function) {
    internal::Request &wanted = internal::Wanted();
    if (wanted.name == name) {
        wanted.function = function;
    }
    return &wanted.benchmark;
}

inline void Initialize(int *argc, char **argv) {
    if (*argc == 3) {
        internal::Wanted().name = argv[1];
        internal::Wanted().turns = std::atoi(argv[2]);
    }
}

inline bool ReportUnrecognizedArguments(int argc, char **argv) {
    if (argc != 3) {
        std::fprintf(stderr, "%s takes ROW:CONTENDER and TURNS\n", argv[0]);
    }
    return argc != 3;
}

// Runs twice, because in the first iterations the linker binds functions and the heap grows; the
// plugin reports the last run. By the end of the pause, the program's other thread sleeps.
inline void RunSpecifiedBenchmarks() {
    constexpr int kWarm = 64;
    constexpr useconds_t kPause = 10000;
    const internal::Request &wanted = internal::Wanted();
    if (!wanted.function) {
        State(0).SkipWithError("no such benchmark");
    }
    State warm(kWarm), counted(wanted.turns);
    wanted.function(warm);
    usleep(kPause);
    wanted.function(counted);
}

// Makes the compiler compute a value.
template <typename T>
void DoNotOptimize(const T &value) {
    asm volatile("" : : "r,m"(value) : "memory");
}

// Makes the compiler forget what it knows about the content of memory.
inline void ClobberMemory() {
    asm volatile("" : : : "memory");
}

}  // namespace benchmark

#endif
