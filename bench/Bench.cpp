#include "Bench.h"

#include <pthread.h>
#include <sched.h>

#include <random>

#include "Varnek_File.h"
#include "Varnek_Tasking.h"

namespace bench {

int Main(int argc, char **argv, void (*registerAll)(), const char *config) {
    benchmark::Initialize(&argc, argv);
    if (benchmark::ReportUnrecognizedArguments(argc, argv)) {
        return 2;
    }
    const std::string text = std::string("# benchmark\n") + config;
    const char *path = VARNEK_DATA_DIR "debug_ltn.ini";
    const uint32_t size = static_cast<uint32_t>(text.size());
    if (VarnekPGL_WriteFile(path, text.data(), size) != static_cast<int32_t>(size)) {
        std::fprintf(stderr, "cannot write %s\n", path);
        return 1;
    }
    VarnekPGL_InitializeDebug();
    registerAll();
    varnek::Thread thread("bench", 1024 * 1024, [] {
        PinTo(0);
        benchmark::RunSpecifiedBenchmarks();
    });
    const bool ran = thread && thread.Join();
    VarnekPGL_DeleteFile(path);
    return ran ? 0 : 1;
}

std::vector<unsigned char> Noise(size_t size) {
    std::mt19937 random(188);  // NOLINT(cert-msc51-cpp): intentionally the same bytes in every run
    std::vector<unsigned char> bytes(size);
    for (unsigned char &byte : bytes) {
        byte = static_cast<unsigned char>(random());
    }
    return bytes;
}

void PinTo(int core) {
    static const int cores = [] {
        cpu_set_t all;
        CPU_ZERO(&all);
        sched_getaffinity(0, sizeof all, &all);
        return CPU_COUNT(&all);
    }();
    cpu_set_t one;
    CPU_ZERO(&one);
    CPU_SET(static_cast<size_t>(cores > 0 ? core % cores : 0), &one);
    pthread_setaffinity_np(pthread_self(), sizeof one, &one);
}

}  // namespace bench
