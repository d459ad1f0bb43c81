// A shorter text is padded with spaces to overwrite a longer one, which works on any terminal.
#include "Progress.h"

#include <algorithm>

namespace receiver {

std::string DescribeProgress(uint64_t done, uint64_t size, double seconds) {
    constexpr double kMega = 1e6;
    const double bytes = static_cast<double>(done);
    const double total = static_cast<double>(size);
    char text[160];
    if (size == 0) {
        std::snprintf(text, sizeof text, "%.0f MB", bytes / kMega);
    } else {
        // A file that grows must not show more than 100 %.
        std::snprintf(text, sizeof text, "%.0f %% of %.0f MB",
                      std::min(bytes / total * 100.0, 100.0), total / kMega);
    }
    std::string line = text;
    if (done == 0 || seconds <= 0.0) {
        return line;
    }
    std::snprintf(text, sizeof text, ", %.1f MB/s", bytes / seconds / kMega);
    line += text;
    if (size != 0) {
        std::snprintf(text, sizeof text, ", %.0f s left",
                      std::max(total - bytes, 0.0) * seconds / bytes);
        line += text;
    }
    return line;
}

void ProgressLine::Show(uint64_t done) {
    const std::chrono::duration<double> elapsed = std::chrono::steady_clock::now() - start_;
    Write(DescribeProgress(done, size_, elapsed.count()));
}

void ProgressLine::Erase() {
    if (width_ > 0) {
        Write("");
    }
}

void ProgressLine::Write(const std::string &text) {
    const size_t blanks = text.size() < width_ ? width_ - text.size() : 0;
    std::fprintf(terminal_, "\r%s%s\r", text.c_str(), std::string(blanks, ' ').c_str());
    std::fflush(terminal_);
    width_ = text.size();
}

}  // namespace receiver
