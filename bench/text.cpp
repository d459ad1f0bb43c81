// Converts Latin-15 to UTF-8: a short text, as a service's name is, and a long one.
#include <iconv.h>
#include <stdlib.h>
#include <string.h>

#include "Bench.h"
#include "Varnek_LngPack.h"

namespace {

// Every tenth character is an accented letter or a euro sign.
std::string Text(size_t length) {
    constexpr unsigned char kAccents[] = {0xE9, 0xE3, 0xE7, 0xED, 0xA4};
    std::string text(length, 'a');
    for (size_t i = 0; i < length; i++) {
        text[i] = static_cast<char>(i % 10 == 7 ? kAccents[i / 10 % sizeof kAccents]
                                                : 'a' + static_cast<int>(i % 26));
    }
    return text;
}

void Ours(benchmark::State &state, const std::string &text) {
    char *out = nullptr;
    for (auto _ : state) {
        const BOOL converted = VarnekPGL_ConvertLatin15toUTF8(
            &out, text.c_str(), static_cast<unsigned int>(text.size()));
        if (converted == FALSE) {
            state.SkipWithError("not converted");
            break;
        }
        benchmark::DoNotOptimize(out);
    }
    free(out);
}

bool SameAsOurs(const std::string &text, const char *other, size_t length) {
    char *ours = nullptr;
    VarnekPGL_ConvertLatin15toUTF8(&ours, text.c_str(), static_cast<unsigned int>(text.size()));
    const bool same = ours != nullptr && std::string(ours) == std::string(other, length);
    free(ours);
    return same;
}

void Iconv(benchmark::State &state, const std::string &text) {
    iconv_t converter = iconv_open("UTF-8", "ISO-8859-15");
    std::vector<char> buffer(text.size() * 3 + 1);
    std::string in = text;
    size_t room = buffer.size();
    for (auto _ : state) {
        char *from = in.data();
        size_t left = in.size();
        char *to = buffer.data();
        room = buffer.size();
        benchmark::DoNotOptimize(iconv(converter, &from, &left, &to, &room));
        benchmark::ClobberMemory();
    }
    iconv_close(converter);
    bench::Require(state, SameAsOurs(text, buffer.data(), buffer.size() - room), "another text");
}

void RegisterAll() {
    for (const size_t length : {32u, 4096u}) {
        const std::string row = "text/" + std::to_string(length) + ":";
        bench::Add(row + "ours", [length](benchmark::State &state) { Ours(state, Text(length)); });
        bench::Add(row + "iconv",
                   [length](benchmark::State &state) { Iconv(state, Text(length)); });
    }
}

}  // namespace

int main(int argc, char **argv) {
    return bench::Main(argc, argv, RegisterAll);
}
