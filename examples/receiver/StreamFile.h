// The receiver's input, a file or standard input, read with the library's calls for large files.
#ifndef RECEIVER_STREAMFILE_H
#define RECEIVER_STREAMFILE_H

#include <atomic>
#include <cstddef>
#include <cstdint>
#include <string>

namespace receiver {

class StreamFile {
  public:
    StreamFile() = default;
    StreamFile(const StreamFile &) = delete;
    StreamFile &operator=(const StreamFile &) = delete;
    ~StreamFile();

    // Opens a file, once; "-" is standard input.
    //   returns  false if it cannot be opened; errno says why
    bool Open(const std::string &path);

    // Returns whether the input is a named pipe from which no bytes come, after waiting briefly.
    bool IsQuietPipe() const;

    // Waits for bytes or, if `stop` is not null, until it is set.
    //   returns  the bytes read; 0 at the end, on an error, and when it was stopped
    size_t Read(unsigned char *buffer, size_t size, const std::atomic<bool> *stop);

    // Returns the errno that ended the reading; 0 for none.
    int Error() const { return error_; }

    // Returns the size in bytes; 0 if it is not known.
    uint64_t Size() const;

    // Whether this path names the same file.
    bool IsSameAs(const std::string &path) const;

  private:
    int32_t handle_ = -1;
    bool owned_ = false;
    int error_ = 0;
};

}  // namespace receiver

#endif
