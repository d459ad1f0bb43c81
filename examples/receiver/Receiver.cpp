// Parses the command line, runs the pipeline on the file, and shows its report.
#include "Receiver.h"

#include <fcntl.h>
#include <sys/ioctl.h>
#include <unistd.h>

#include <cerrno>
#include <csignal>
#include <cstdlib>
#include <system_error>

#include "BroadcastText.h"
#include "CommandLine.h"
#include "Names.h"
#include "Paragraphs.h"
#include "Pipeline.h"
#include "StreamFile.h"
#include "Varnek_Config.h"

namespace receiver {
namespace {

constexpr int kInterrupted = 130;  // as shells report it for a program that Ctrl-C ended

int Fail(std::FILE *err, const std::string &path, const std::string &message) {
    std::fprintf(err, "receiver: %s: %s\n", path.c_str(), message.c_str());
    return 1;
}

std::string SystemText(int error) {
    return std::generic_category().message(error);
}

// Says why the content of an open file cannot be shown.
//   returns  empty when it can be shown
std::string FindFault(const Report &report, int read_error) {
    const PacketCounters &packets = report.packets;
    const std::string bytes = std::to_string(packets.bytes) + " bytes";
    if (packets.packets == 0) {
        return read_error != 0      ? "read failed: " + SystemText(read_error)
               : packets.bytes == 0 ? "is empty"
                                    : "no transport stream packets in " + bytes;
    }
    const bool few = packets.packets * packets.packet_size < packets.bytes / 2;
    return few && report.sections.good == 0
               ? "hardly a transport stream: " + std::to_string(packets.packets) + " packets in " +
                     bytes
               : "";
}

// Gets the library's configuration, which has initial values without a file.
Settings LoadSettings(const Options &options) {
    VarnekCfg_LoadConfigFile();
    Settings settings;
    settings.standard_type = VarnekCfg_GetStandard();
    settings.nation = ToUtf8(VarnekCfg_GetSupportNation());
    settings.bml = VarnekCfg_IsSupportBML() != FALSE;
    settings.region = options.region;
    settings.all = options.all;
    return settings;
}

// Opens the capture that the options or else the configuration asks for; for standard input only
// the options can.
//   returns  empty, or an error message
std::string OpenCapture(const Options &options, const StreamFile &file, Capture &capture) {
    std::string path = options.capture;
    if (path.empty() && options.path != "-" && VarnekCfg_GetTSCaptueEnable() != 0) {
        path = options.path + ".capture";
    }
    if (path.empty()) {
        return {};
    }
    if (file.IsSameAs(path)) {
        return "the capture would overwrite the stream";
    }
    return capture.Open(path) ? "" : "the capture " + path + " cannot be written";
}

bool IsTerminal(std::FILE *file) {
    const int descriptor = fileno(file);
    return descriptor >= 0 && isatty(descriptor) != 0;
}

// Returns the width that COLUMNS names, or else that of a terminal: the output's, or that of the
// messages when the output goes through a pipe.
size_t LineWidth(std::FILE *out, std::FILE *err) {
    const char *columns = std::getenv("COLUMNS");
    const long width = columns != nullptr ? std::strtol(columns, nullptr, 10) : 0;
    if (width > 0) {
        return static_cast<size_t>(width);
    }
    for (std::FILE *file : {out, err}) {
        winsize size{};
        if (fileno(file) >= 0 && ioctl(fileno(file), TIOCGWINSZ, &size) == 0 && size.ws_col != 0) {
            return size.ws_col;
        }
    }
    return Paragraphs::kUsualWidth;
}

// Redirects descriptor 2 to a file, or to nowhere if the file cannot be opened.
void DivertLog(const char *path) {
    constexpr int kFlags = O_WRONLY | O_CREAT | O_TRUNC | O_APPEND | O_CLOEXEC;
    int log = open(path, kFlags, 0666);
    if (log < 0) {
        log = open("/dev/null", O_WRONLY | O_CLOEXEC);
    }
    if (log >= 0) {
        dup2(log, STDERR_FILENO);
        close(log);
    }
}

bool IsStopped(const Surroundings &surroundings) {
    return surroundings.stop != nullptr && *surroundings.stop;
}

bool IsWritten(std::FILE *out) {
    return std::fflush(out) == 0 && std::ferror(out) == 0;
}

// Answers --help and --version. Returns the exit status.
int WriteFacts(const Options &options, std::FILE *out, std::FILE *err) {
    if (options.help) {
        WriteHelp(out, LineWidth(out, err));
    }
    if (options.version) {
        std::fputs("receiver " RECEIVER_VERSION "\n", out);
    }
    return IsWritten(out) ? 0 : Fail(err, "standard output", "could not be written");
}

}  // namespace

int RunReceiver(const std::vector<std::string> &arguments, const Surroundings &surroundings) {
    std::FILE *const out = surroundings.out;
    std::FILE *const err = surroundings.err;
    Options options;
    const std::string wrong = ParseArguments(arguments, options);
    if (!wrong.empty()) {
        std::fprintf(err, "receiver: %s\nusage: receiver [OPTION...] FILE (--help shows more)\n",
                     wrong.c_str());
        return 2;
    }
    if (options.help || options.version) {
        return WriteFacts(options, out, err);
    }
    if (surroundings.log_path != nullptr && !options.log) {
        DivertLog(surroundings.log_path);
    }
    StreamFile file;
    if (!file.Open(options.path) && !IsStopped(surroundings)) {
        return Fail(err, options.path, "cannot be opened: " + SystemText(errno));
    }
    if (file.IsQuietPipe() && !options.quiet) {
        std::fprintf(err, "receiver: %s: waiting for a program that writes to this pipe\n",
                     options.path.c_str());
    }
    Report report;
    report.settings = LoadSettings(options);
    Capture capture;
    const std::string unfit = OpenCapture(options, file, capture);
    if (!unfit.empty()) {
        return Fail(err, options.path, unfit);
    }
    PipelineOptions pipeline;
    pipeline.progress = !options.quiet && IsTerminal(err) ? err : nullptr;
    pipeline.capture = capture.IsOpen() ? &capture : nullptr;
    pipeline.stop = surroundings.stop;
    pipeline.language = LanguageOf(Code::Of(report.settings.nation.c_str()));
    const std::string missing = RunPipeline(file, pipeline, report);
    if (!missing.empty()) {
        return Fail(err, options.path, "the " + missing + " could not be created");
    }
    const std::string fault = FindFault(report, file.Error());
    if (!fault.empty() && !IsStopped(surroundings)) {
        return Fail(err, options.path, fault);
    }
    if (surroundings.stop != nullptr) {
        // From here on Ctrl-C ends the program, because the handler could only stop the reading.
        std::signal(SIGINT, SIG_DFL);
    }
    if (options.json) {
        WriteJson(report, out);
    } else {
        WriteSummary(report, LineWidth(out, err), out);
    }
    if (!IsWritten(out)) {
        return Fail(err, options.path, "the result could not be written");
    }
    if (file.Error() != 0) {
        return Fail(err, options.path, "read failed: " + SystemText(file.Error()));
    }
    if (!capture.Failure().empty()) {
        return Fail(err, options.path, "the capture ended early: " + capture.Failure());
    }
    if (options.region && StreamClock(report).Offset() == nullptr) {
        return Fail(err, options.path,
                    "no local time for region " + std::to_string(*options.region));
    }
    return IsStopped(surroundings) ? kInterrupted : 0;
}

}  // namespace receiver
