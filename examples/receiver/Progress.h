// The progress line while reading a long stream, such as "37 % of 2147 MB, 412.5 MB/s, 4 s left".
#ifndef RECEIVER_PROGRESS_H
#define RECEIVER_PROGRESS_H

#include <chrono>
#include <cstdint>
#include <cstdio>
#include <string>

namespace receiver {

// A line that each update overwrites. Its clock starts when the object is created.
class ProgressLine {
  public:
    // Without a terminal it shows nothing. A size of 0 means that it is not known.
    ProgressLine(std::FILE *terminal, uint64_t size) : terminal_(terminal), size_(size) {}

    void Show(uint64_t done);
    void Erase();

  private:
    void Write(const std::string &text);

    std::FILE *terminal_;
    uint64_t size_;
    std::chrono::steady_clock::time_point start_ = std::chrono::steady_clock::now();
    size_t width_ = 0;  // of the text on the line
};

}  // namespace receiver

#endif
