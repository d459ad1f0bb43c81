// Appends to a string, copies it and compares it.
#include "Bench.h"
#include "Varnek_CString.h"

namespace {

constexpr char kName[] = "Rede Ip\xEA do Cerrado, servi\xE7o de televis\xE3o";

template <typename String>
void Append(benchmark::State &state) {
    for (auto _ : state) {
        String text(kName);
        text += kName;
        benchmark::DoNotOptimize(text);
    }
}

template <typename String>
void Copy(benchmark::State &state) {
    const String text(kName);
    for (auto _ : state) {
        String copy(text);
        benchmark::DoNotOptimize(copy);
    }
}

template <typename String>
void Compare(benchmark::State &state) {
    String one(kName);
    String other(kName);
    for (auto _ : state) {
        benchmark::DoNotOptimize(one);
        benchmark::DoNotOptimize(one == other);
    }
}

template <typename String>
void Register(const std::string &contender) {
    bench::Add("string/append:" + contender, Append<String>);
    bench::Add("string/copy:" + contender, Copy<String>);
    bench::Add("string/compare:" + contender, Compare<String>);
}

void RegisterAll() {
    Register<VarnekCString>("ours");
    Register<std::string>("std");
}

}  // namespace

int main(int argc, char **argv) {
    return bench::Main(argc, argv, RegisterAll);
}
