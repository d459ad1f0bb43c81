// The capture: a second file with the packets that carry the receiver's tables.
#ifndef RECEIVER_CAPTURE_H
#define RECEIVER_CAPTURE_H

#include <cstddef>
#include <cstdint>
#include <string>
#include <vector>

namespace receiver {

// One thread writes to it; once that has finished, another may ask for the result.
class Capture {
  public:
    Capture() = default;
    Capture(const Capture &) = delete;
    Capture &operator=(const Capture &) = delete;
    ~Capture();

    // Opens or creates the file, whose old content stays until there is something to write.
    //   returns  false if it cannot be written
    bool Open(const std::string &path);
    bool IsOpen() const { return file_ >= 0; }

    // Writes the 188 bytes of a packet. The first failure ends the capture.
    void Push(const unsigned char *packet);
    void Finish();

    //   returns  empty, or the reason why the capture ended early
    const std::string &Failure() const { return failure_; }

  private:
    void Write();

    int32_t file_ = -1;
    bool empty_ = false;  // the old content is gone
    std::vector<unsigned char> waiting_;
    std::string failure_;
};

}  // namespace receiver

#endif
