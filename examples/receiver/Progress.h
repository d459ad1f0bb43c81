// The progress line of a long reading.
#ifndef RECEIVER_PROGRESS_H
#define RECEIVER_PROGRESS_H

#include <chrono>
#include <cstdint>
#include <cstdio>
#include <string>

namespace receiver {

// Returns "37 % of 2147 MB, 412.5 MB/s, 4 s left", without parts that are not known yet.
//   done, size  bytes; a size of 0 is not known
//   seconds     since the start
std::string DescribeProgress(uint64_t done, uint64_t size, double seconds);

// A terminal line that each update overwrites. The clock starts when the object is created.
class ProgressLine {
  public:
    ProgressLine(std::FILE *terminal, uint64_t size) : terminal_(terminal), size_(size) {}

    void Show(uint64_t done);
    // Clears the line.
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
