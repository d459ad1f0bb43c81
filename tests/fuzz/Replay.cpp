// Stands in for libFuzzer where a fuzz target is run as a test, whatever the compiler, processor or sanitizer.
//   fuzz_TARGET CORPUS COUNT    runs the corpus, then COUNT inputs made of it, which are the same in each run
#include <algorithm>
#include <filesystem>
#include <fstream>
#include <iterator>
#include <random>
#include <utility>

#include "Fuzz.h"

extern "C" int LLVMFuzzerInitialize(int *argc, char ***argv);

namespace {

using Bytes = std::vector<uint8_t>;

std::mt19937 gRandom(188);

size_t Below(size_t limit) { return gRandom() % limit; }

// Replaces a part with one of another input or with noise, and now and then changes several bytes.
Bytes Mutated(Bytes input, const Bytes &other) {
    const size_t begin = Below(input.size() + 1);
    const size_t end = begin + Below(input.size() - begin + 1);
    const size_t from = Below(other.size() + 1);
    Bytes part(other.begin() + static_cast<std::ptrdiff_t>(from), other.end());
    part.resize(std::min<size_t>(part.size(), Below(200)));
    if (Below(2) == 0) {
        // Most operations take small numbers.
        const size_t limit = Below(3) == 0 ? 256 : 16;
        std::generate(part.begin(), part.end(), [limit] { return static_cast<uint8_t>(Below(limit)); });
    }
    const auto place = input.erase(input.begin() + static_cast<std::ptrdiff_t>(begin),
                                   input.begin() + static_cast<std::ptrdiff_t>(end));
    input.insert(place, part.begin(), part.end());
    for (size_t changes = Below(4); changes > 0 && !input.empty(); --changes) {
        input[Below(input.size())] = static_cast<uint8_t>(gRandom());
    }
    input.resize(std::min<size_t>(input.size(), 1024));
    return input;
}

void Run(const Bytes &input) { LLVMFuzzerTestOneInput(Bytes(input).data(), input.size()); }

}  // namespace

int main(int argc, char **argv) {
    CHECK(argc == 3);
    LLVMFuzzerInitialize(&argc, &argv);
    std::vector<std::filesystem::path> files(std::filesystem::directory_iterator(argv[1]), {});
    CHECK(!files.empty());
    std::sort(files.begin(), files.end());
    std::vector<Bytes> corpus;
    for (const auto &path : files) {
        std::ifstream file(path, std::ios::binary);
        corpus.emplace_back(std::istreambuf_iterator<char>(file), std::istreambuf_iterator<char>());
        Run(corpus.back());
    }
    // Now and then an input joins the corpus, so later ones stray further from it.
    for (int left = atoi(argv[2]); left > 0; --left) {
        Bytes input = Mutated(corpus[Below(corpus.size())], corpus[Below(corpus.size())]);
        Run(input);
        if (Below(8) == 0) {
            corpus.push_back(std::move(input));
        }
    }
    LeaveClean();
    return 0;
}
