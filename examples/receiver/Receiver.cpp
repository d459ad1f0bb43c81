// The command line, then the pipeline over the file, then the presentation of what it found.
#include "Receiver.h"

#include <unistd.h>

#include <cerrno>
#include <system_error>

#include "Pipeline.h"
#include "Presentation.h"
#include "StreamFile.h"

namespace receiver {
namespace {

constexpr char kUsage[] =
    "usage: receiver [--json] FILE\n"
    "  Reads a transport stream and shows its services, events and counters.\n"
    "  --json  show them as one JSON object\n";

struct Options {
    bool help = false;
    bool json = false;
    std::string path;
};

bool ParseArguments(const std::vector<std::string> &arguments, Options &options) {
    bool only_files = false;
    for (const std::string &argument : arguments) {
        const bool is_option = !only_files && argument.size() > 1 && argument[0] == '-';
        if (is_option && argument == "--") {
            only_files = true;
        } else if (is_option && argument == "--json") {
            options.json = true;
        } else if (is_option && (argument == "--help" || argument == "-h")) {
            options.help = true;
        } else if (is_option || argument.empty() || !options.path.empty()) {
            return false;
        } else {
            options.path = argument;
        }
    }
    return options.help || !options.path.empty();
}

// Why a file that could be opened gave no packet.
std::string DescribeFailure(const std::string &path, const PacketCounters &packets) {
    if (packets.bytes != 0) {
        return "no transport stream packets in " + std::to_string(packets.bytes) + " bytes";
    }
    return VarnekPGL_CheckDir(path.c_str()) != FALSE ? "is a directory"
                                                     : "is empty or cannot be read";
}

int Fail(std::FILE *err, const std::string &path, const std::string &message) {
    std::fprintf(err, "receiver: %s: %s\n", path.c_str(), message.c_str());
    return 1;
}

bool IsTerminal(std::FILE *file) {
    const int descriptor = fileno(file);
    return descriptor >= 0 && isatty(descriptor) != 0;
}

}  // namespace

int RunReceiver(const std::vector<std::string> &arguments, std::FILE *out, std::FILE *err) {
    Options options;
    if (!ParseArguments(arguments, options)) {
        std::fputs(kUsage, err);
        return 2;
    }
    if (options.help) {
        std::fputs(kUsage, out);
        return 0;
    }
    StreamFile file;
    errno = 0;
    if (!file.Open(options.path.c_str())) {
        // An open that is refused without asking the system leaves no error number.
        const int error = errno;
        return Fail(err, options.path,
                    std::string("cannot be opened") +
                        (error != 0 ? ": " + std::generic_category().message(error) : ""));
    }
    Report report;
    const std::string missing = RunPipeline(file, IsTerminal(err) ? err : nullptr, report);
    if (!missing.empty()) {
        return Fail(err, options.path, "the " + missing + " could not be created");
    }
    if (report.packets.packets == 0) {
        return Fail(err, options.path, DescribeFailure(options.path, report.packets));
    }
    const std::string text = options.json ? ToJson(report) : ToSummary(report);
    if (std::fputs(text.c_str(), out) == EOF || std::fflush(out) != 0) {
        return Fail(err, options.path, "the result could not be written");
    }
    return 0;
}

}  // namespace receiver
