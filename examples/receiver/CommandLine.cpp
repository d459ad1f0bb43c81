// Each option is a row of one table, which the parser, the help and the manual page share.
#include "CommandLine.h"

#include <algorithm>
#include <cstdlib>
#include <iterator>
#include <string_view>

#include "Paragraphs.h"

namespace receiver {
namespace {

constexpr unsigned kLargestRegion = 63;

//   returns  empty, or an error message about the value
using Setter = std::string (*)(Options &options, const std::string &value);

std::string SetRegion(Options &options, const std::string &value) {
    const bool digits = !value.empty() && value.size() <= 2 &&
                        value.find_first_not_of("0123456789") == std::string::npos;
    const unsigned long region = digits ? std::strtoul(value.c_str(), nullptr, 10) : ~0UL;
    if (region > kLargestRegion) {
        return "no region '" + value + "': a number from 0 to 63";
    }
    options.region = static_cast<uint8_t>(region);
    return {};
}

std::string SetCapture(Options &options, const std::string &value) {
    options.capture = value;
    return value.empty() ? "--capture needs the name of a file" : "";
}

template <bool Options::*Flag>
std::string Set(Options &options, const std::string & /*none*/) {
    options.*Flag = true;
    return {};
}

constexpr struct {
    const char *name;
    std::string_view value;  // empty for an option without one
    Setter set;
    const char *help;
} kOptions[] = {
#define OPTION(...) {__VA_ARGS__},
#include "Options.inc"
};

// Parses the option at `i`, and its value if it has one.
//   returns  empty, or an error message
std::string TakeOption(const std::vector<std::string> &arguments, size_t &i, Options &options) {
    const std::string name = arguments[i] == "-h" ? "--help" : arguments[i];
    const auto *option = std::find_if(std::begin(kOptions), std::end(kOptions),
                                      [&](const auto &known) { return known.name == name; });
    if (option == std::end(kOptions)) {
        return "unknown option " + name;
    }
    if (option->value.empty()) {
        return option->set(options, "");
    }
    if (i + 1 == arguments.size()) {
        return name + " needs a value";
    }
    return option->set(options, arguments[++i]);
}

std::string TakeFile(const std::string &path, Options &options) {
    if (path.empty()) {
        return "an empty file name";
    }
    if (!options.path.empty()) {
        return "more than one file: " + options.path + " and " + path;
    }
    options.path = path;
    return {};
}

}  // namespace

std::string ParseArguments(const std::vector<std::string> &arguments, Options &options) {
    bool only_files = false;
    std::string wrong;
    for (size_t i = 0; i < arguments.size() && wrong.empty(); ++i) {
        const std::string &argument = arguments[i];
        if (only_files || argument.size() < 2 || argument[0] != '-') {
            wrong = TakeFile(argument, options);
        } else if (argument == "--") {
            only_files = true;
        } else {
            wrong = TakeOption(arguments, i, options);
        }
    }
    const bool complete = options.help || options.version || !options.path.empty();
    return !wrong.empty() || complete ? wrong : "no file";
}

void WriteHelp(std::FILE *out, size_t width) {
    Paragraphs text(out, width);
    text.Add("usage: ", "receiver [OPTION...] FILE");
    text.Add("  ", RECEIVER_ABOUT);
    for (const auto &option : kOptions) {
        text.Add(Padded("  " + std::string(option.name) + ' ' + std::string(option.value), 18),
                 option.help);
    }
}

}  // namespace receiver
