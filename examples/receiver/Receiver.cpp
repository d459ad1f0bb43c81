// The command line, then the pipeline over the file, then the report on what it found.
#include "Receiver.h"

#include <unistd.h>

#include <cerrno>
#include <filesystem>
#include <system_error>

#include "BroadcastText.h"
#include "JsonReport.h"
#include "Pipeline.h"
#include "StreamFile.h"
#include "Summary.h"
#include "Varnek_Config.h"

namespace receiver {
namespace {

constexpr char kUsage[] =
    "usage: receiver [--json] [--quiet] [--capture FILE] FILE\n"
    "  Reads a transport stream and shows its services, events and counters.\n"
    "  --json          show them as one JSON object\n"
    "  --quiet         no progress line\n"
    "  --capture FILE  write the packets of the tables to a file; where the configuration has its\n"
    "                  capture switch on, the default is the stream's name with \".capture\"\n";

constexpr int kInterrupted = 130;  // as shells have it for a program that Ctrl-C ended

struct Options {
    bool help = false;
    bool json = false;
    bool quiet = false;
    std::string capture;
    std::string path;
};

bool ParseArguments(const std::vector<std::string> &arguments, Options &options) {
    bool only_files = false;
    for (size_t i = 0; i < arguments.size(); ++i) {
        const std::string &argument = arguments[i];
        const bool is_option = !only_files && argument.size() > 1 && argument[0] == '-';
        if (is_option && argument == "--") {
            only_files = true;
        } else if (is_option && argument == "--json") {
            options.json = true;
        } else if (is_option && argument == "--quiet") {
            options.quiet = true;
        } else if (is_option && argument == "--capture" && i + 1 < arguments.size()) {
            options.capture = arguments[++i];
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

// The library's configuration: the file when there is one, else its initial values.
Settings LoadSettings() {
    VarnekCfg_LoadConfigFile();
    Settings settings;
    settings.standard_type = VarnekCfg_GetStandard();
    settings.nation = ToUtf8(VarnekCfg_GetSupportNation());
    settings.bml = VarnekCfg_IsSupportBML() != FALSE;
    return settings;
}

// Opens the capture that is asked for, if any.
//   returns  empty; else what is wrong with it
std::string OpenCapture(const Options &options, Capture &capture) {
    std::string path = options.capture;
    if (path.empty() && VarnekCfg_GetTSCaptueEnable() != 0) {
        path = options.path + ".capture";
    }
    std::error_code ignored;
    if (!path.empty() && std::filesystem::equivalent(path, options.path, ignored)) {
        return "the capture would overwrite the stream";
    }
    if (!path.empty() && !capture.Open(path)) {
        return "the capture " + path + " cannot be written";
    }
    return {};
}

bool IsTerminal(std::FILE *file) {
    const int descriptor = fileno(file);
    return descriptor >= 0 && isatty(descriptor) != 0;
}

}  // namespace

int RunReceiver(const std::vector<std::string> &arguments, std::FILE *out, std::FILE *err,
                const std::atomic<bool> *stop) {
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
    report.settings = LoadSettings();
    Capture capture;
    const std::string unfit = OpenCapture(options, capture);
    if (!unfit.empty()) {
        return Fail(err, options.path, unfit);
    }
    PipelineOptions pipeline;
    pipeline.progress = !options.quiet && IsTerminal(err) ? err : nullptr;
    pipeline.capture = capture.IsOpen() ? &capture : nullptr;
    pipeline.stop = stop;
    const std::string missing = RunPipeline(file, pipeline, report);
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
    if (!capture.Failure().empty()) {
        return Fail(err, options.path, "the capture ended early: " + capture.Failure());
    }
    return stop != nullptr && *stop ? kInterrupted : 0;
}

}  // namespace receiver
