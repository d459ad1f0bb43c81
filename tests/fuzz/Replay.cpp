// Stands in for libFuzzer where a fuzz target is run as a test, whatever the compiler, processor or sanitizer.
//   fuzz_TARGET CORPUS COUNT    runs the corpus, then COUNT inputs derived from it, the same in each run
#include <algorithm>
#include <filesystem>
#include <fstream>
#include <iterator>
#include <random>
#include <utility>

#include "Fuzz.h"

namespace {

std::mt19937 gRandom(188);

size_t Below(size_t limit) { return gRandom() % limit; }

// Replaces a part with one of another input or with noise, and now and then changes several bytes.
std::string Mutated(std::string input, const std::string &other) {
    std::string part = other.substr(Below(other.size() + 1), Below(200));
    if (Below(2) == 0) {
        // Most operations take small numbers.
        const size_t limit = Below(3) == 0 ? 256 : 16;
        std::generate(part.begin(), part.end(), [limit] { return static_cast<char>(Below(limit)); });
    }
    const size_t begin = Below(input.size() + 1);
    input.replace(begin, Below(input.size() - begin + 1), part);
    for (size_t changes = Below(4); changes > 0 && !input.empty(); --changes) {
        input[Below(input.size())] = static_cast<char>(gRandom());
    }
    return input.substr(0, 1024);
}

// The input is in a block of exactly its size, so that a sanitizer notices a read past it.
void Run(const std::string &input) {
    LLVMFuzzerTestOneInput(std::vector<uint8_t>(input.begin(), input.end()).data(), input.size());
}

}  // namespace

int main(int argc, char **argv) {
    CHECK(argc == 3);
    LLVMFuzzerInitialize(&argc, &argv);
    std::vector<std::filesystem::path> files(std::filesystem::directory_iterator(argv[1]), {});
    CHECK(!files.empty());
    std::sort(files.begin(), files.end());
    std::vector<std::string> corpus;
    for (const auto &path : files) {
        std::ifstream file(path, std::ios::binary);
        corpus.emplace_back(std::istreambuf_iterator<char>(file), std::istreambuf_iterator<char>());
        Run(corpus.back());
    }
    // Now and then an input joins the corpus, so later ones stray further from it.
    for (int left = atoi(argv[2]); left > 0; --left) {
        std::string input = Mutated(corpus[Below(corpus.size())], corpus[Below(corpus.size())]);
        Run(input);
        if (Below(8) == 0) {
            corpus.push_back(std::move(input));
        }
    }
    LeaveClean();
    return 0;
}
