// The file that the receiver reads, through the library's file operations.
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
        if (handle_ != -1) {
            VarnekPGL_CloseFile(handle_);
        }
    }

    // Opens a file, once.
    //   returns  false when it cannot be opened, with errno as it was left
    bool Open(const char *path) {
        handle_ = VarnekPGL_OpenFile(path, PGL_FILE_MODE_READ);
        return handle_ != -1;
    }

    //   returns  the bytes read; 0 at the end and on an error
    size_t Read(unsigned char *buffer, size_t size) const {
        return VarnekPGL_ReadFileByHandle(handle_, buffer, static_cast<uint32_t>(size));
    }

    //   returns  the size in bytes; 0 when it is not known
    uint64_t Size() const {
        const int32_t size = VarnekPGL_GetFileSizeByHandle(handle_);
        return size > 0 ? static_cast<uint64_t>(size) : 0;
    }

  private:
    PglFileHandle handle_ = -1;
};

}  // namespace receiver

#endif
