// Spaces overwrite the rest of a longer text, which works on any terminal.
#include "Progress.h"

#include <algorithm>

#include "Names.h"

namespace receiver {

void ProgressLine::Show(uint64_t done) {
    constexpr double kMega = 1e6;
    const std::chrono::duration<double> elapsed = std::chrono::steady_clock::now() - start_;
    const double seconds = elapsed.count();
    const double bytes = static_cast<double>(done);
    const double total = static_cast<double>(size_);
    const double left = std::max(total - bytes, 0.0);  // the file may have grown
    std::string text = Format("%.0f MB", bytes / kMega);
    if (size_ != 0) {
        text = Format("%.0f %% of %.0f MB", 100 - left / total * 100, total / kMega);
    }
    if (done != 0 && seconds > 0) {
        text += Format(", %.1f MB/s", bytes / seconds / kMega);
        text += size_ == 0 ? "" : Format(", %.0f s left", left * seconds / bytes);
    }
    Write(text);
}

void ProgressLine::Erase() {
    if (width_ > 0) {
        Write("");
    }
}

void ProgressLine::Write(const std::string &text) {
    if (terminal_ != nullptr) {
        std::fprintf(terminal_, "\r%-*s\r", static_cast<int>(width_), text.c_str());
        std::fflush(terminal_);
        width_ = text.size();
    }
}

}  // namespace receiver
