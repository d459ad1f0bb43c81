// The part of Google Benchmark's interface that the benchmarks use, for programs whose instructions
// are counted. It runs the benchmark that the command line names, for TURNS iterations, between two
// marks for the plugin (count.c).
//   PROGRAM ROW:CONTENDER TURNS
#ifndef VARNEK_BENCH_DEVICE_BENCHMARK_H
#define VARNEK_BENCH_DEVICE_BENCHMARK_H

#include <unistd.h>

#include <cstdint>
#include <cstdio>
#include <cstdlib>
#include <functional>
#include <list>
#include <string>
#include <utility>

namespace benchmark {

class State {
  public:
    State(int turns, int64_t argument, bool marked)
        : turns_(turns), argument_(argument), marked_(marked) {}

    struct Iterator {
        struct [[maybe_unused]] Turn {};
        int left;
        bool marked;
        bool operator!=(const Iterator &) const {
            if (left != 0) {
                return true;
            }
            Mark(marked);
            return false;
        }
        void operator++() { --left; }
        Turn operator*() const { return {}; }
    };
    Iterator begin() const {
        Mark(marked_);
        return {turns_, marked_};
    }
    Iterator end() const { return {}; }

    int64_t range(int) const { return argument_; }
    int64_t iterations() const { return turns_; }
    int thread_index() const { return 0; }
    void SetItemsProcessed(int64_t) {}
    // After an error there is nothing to measure.
    void SkipWithError(const char *what) const {
        std::fprintf(stderr, "%s\n", what);
        std::_Exit(1);
    }

  private:
    static void Mark(bool marked) {
        if (marked) {
            asm volatile("dbg #7" : : : "memory");
        }
    }

    const int turns_;
    const int64_t argument_;
    const bool marked_;
};

namespace internal {

class Benchmark {
  public:
    Benchmark(std::string name, std::function<void(State &)> function)
        : name_(std::move(name)), function_(std::move(function)) {}

    const std::string &Name() const { return name_; }
    void Run(int turns) const {
        // The first iterations are not counted, because the linker binds functions and the heap
        // grows. At the end of the pause, the program's other thread sleeps.
        State warm(kWarm, argument_, false);
        function_(warm);
        usleep(kPause);
        State state(turns, argument_, true);
        function_(state);
    }

    Benchmark *UseRealTime() { return this; }
    Benchmark *Arg(int64_t argument) {
        argument_ = argument;
        return this;
    }
    Benchmark *Threads(int) { return this; }
    template <typename Function>
    Benchmark *Setup(Function) {
        return this;
    }
    template <typename Function>
    Benchmark *Teardown(Function) {
        return this;
    }

  private:
    static constexpr int kWarm = 64;
    static constexpr useconds_t kPause = 10000;

    const std::string name_;
    const std::function<void(State &)> function_;
    int64_t argument_ = 0;
};

struct Runner {
    std::list<Benchmark> registered;
    std::string wanted;
    int turns = 0;
};

inline Runner &TheRunner() {
    static Runner runner;
    return runner;
}

}  // namespace internal

template <typename Function>
internal::Benchmark *RegisterBenchmark(const char *name, Function function) {
    return &internal::TheRunner().registered.emplace_back(name, std::move(function));
}

inline void Initialize(int *argc, char **argv) {
    if (*argc == 3) {
        internal::TheRunner().wanted = argv[1];
        internal::TheRunner().turns = std::atoi(argv[2]);
        *argc = 1;
    }
}

inline bool ReportUnrecognizedArguments(int argc, char **argv) {
    if (argc != 1) {
        std::fprintf(stderr, "%s takes ROW:CONTENDER and TURNS\n", argv[0]);
    }
    return argc != 1;
}

inline void RunSpecifiedBenchmarks() {
    const internal::Runner &runner = internal::TheRunner();
    for (const internal::Benchmark &one : runner.registered) {
        if (one.Name() == runner.wanted) {
            one.Run(runner.turns);
            return;
        }
    }
    std::fprintf(stderr, "no such benchmark: %s\n", runner.wanted.c_str());
    std::_Exit(1);
}

// Make the compiler compute a value, and discard its knowledge of memory.
template <typename T>
void DoNotOptimize(const T &value) {
    asm volatile("" : : "r,m"(value) : "memory");
}

inline void ClobberMemory() {
    asm volatile("" : : : "memory");
}

}  // namespace benchmark

#endif
