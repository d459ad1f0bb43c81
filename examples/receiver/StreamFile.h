// The file that the receiver reads, through the library's operations for large files.
#ifndef RECEIVER_STREAMFILE_H
#define RECEIVER_STREAMFILE_H

#include <cstddef>
#include <cstdint>

#include "Varnek_File.h"

namespace receiver {

class StreamFile {
  public:
    StreamFile() = default;
    StreamFile(const StreamFile &) = delete;
    StreamFile &operator=(const StreamFile &) = delete;
    ~StreamFile() {
        if (handle_ >= 0) {
            VarnekPGL_CloseFile64Bits(handle_);
        }
    }

    // Opens a file, once.
    //   returns  false when it cannot be opened, with errno as it was left
    bool Open(const char *path) {
        handle_ = VarnekPGL_OpenFile64Bits(path, PGL_FILE_MODE_READ);
        return handle_ >= 0;
    }

    //   returns  the bytes read; 0 at the end and on an error
    size_t Read(unsigned char *buffer, size_t size) const {
        const int32_t count =
            VarnekPGL_ReadFileByHandle64Bits(handle_, buffer, static_cast<uint32_t>(size));
        return count > 0 ? static_cast<size_t>(count) : 0;
    }

    //   returns  the size in bytes; 0 when it is not known
    uint64_t Size() const {
        const int64_t size = VarnekPGL_GetFileSizeByHandle64Bits(handle_);
        return size > 0 ? static_cast<uint64_t>(size) : 0;
    }

  private:
    int32_t handle_ = -1;
};

}  // namespace receiver

#endif
