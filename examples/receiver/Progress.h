// The line that tells how far a long reading is.
#ifndef RECEIVER_PROGRESS_H
#define RECEIVER_PROGRESS_H

#include <chrono>
#include <cstdint>
#include <cstdio>
#include <string>

namespace receiver {

// "37 % of 2147 MB, 412.5 MB/s, 4 s left"; without what is not known yet.
//   done, size  bytes; a size of 0 is not known
//   seconds     since the start
std::string DescribeProgress(uint64_t done, uint64_t size, double seconds);

// One line that is written over itself, at the left of a terminal. The clock starts with the
// object.
class ProgressLine {
  public:
    ProgressLine(std::FILE *terminal, uint64_t size) : terminal_(terminal), size_(size) {}

    void Show(uint64_t done);
    // Leaves the line as if nothing had been written.
    void Erase();

  private:
    void Write(const std::string &text);

    std::FILE *terminal_;
    uint64_t size_;
    std::chrono::steady_clock::time_point start_ = std::chrono::steady_clock::now();
    size_t width_ = 0;  // of what stands there
};

}  // namespace receiver

#endif
