// The user's wishes.
#ifndef RECEIVER_COMMANDLINE_H
#define RECEIVER_COMMANDLINE_H

#include <cstddef>
#include <cstdint>
#include <cstdio>
#include <optional>
#include <string>
#include <vector>

namespace receiver {

struct Options {
    bool help = false;
    bool version = false;
    bool json = false;
    bool quiet = false;
    bool log = false;
    std::optional<uint8_t> region;
    std::string capture;
    std::string path;
};

// Takes the arguments, the program's name left out.
//   returns  empty; else what is wrong with them
std::string ParseArguments(const std::vector<std::string> &arguments, Options &options);

// Tells how the program is called, in lines of at most `width` columns.
void WriteHelp(std::FILE *out, size_t width);

}  // namespace receiver

#endif
