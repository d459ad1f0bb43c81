// The options of the command line.
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
    bool all = false;
    bool quiet = false;
    bool log = false;
    std::optional<uint8_t> region;
    std::string capture;
    std::string path;
};

// Parses the arguments, without the program's name.
//   returns  empty, or an error message
std::string ParseArguments(const std::vector<std::string> &arguments, Options &options);

// Writes the usage of the program, in lines of at most `width` columns.
void WriteHelp(std::FILE *out, size_t width);

}  // namespace receiver

#endif
