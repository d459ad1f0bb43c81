// A read that waits, as on a quiet pipe, checks regularly whether it should stop, because a signal
// may interrupt another thread instead.
#include "StreamFile.h"

#include <fcntl.h>
#include <poll.h>
#include <sys/stat.h>
#include <unistd.h>

#include <cerrno>

#include "Varnek_File.h"

namespace receiver {
namespace {

constexpr int kPatience = 100;  // milliseconds between two checks of `stop`

}  // namespace

StreamFile::~StreamFile() {
    if (owned_ && handle_ >= 0) {
        VarnekPGL_CloseFile64Bits(handle_);
    }
}

bool StreamFile::Open(const std::string &path) {
    owned_ = path != "-";
    struct stat status = {};
    if (owned_ && stat(path.c_str(), &status) == 0 && S_ISFIFO(status.st_mode)) {
        // The library's open would wait for a writer.
        handle_ = open(path.c_str(), O_RDONLY | O_NONBLOCK | O_CLOEXEC);
        return handle_ >= 0;
    }
    handle_ = owned_ ? VarnekPGL_OpenFile64Bits(path.c_str(), PGL_FILE_MODE_READ) : STDIN_FILENO;
    return handle_ >= 0;
}

bool StreamFile::IsQuietPipe() const {
    struct stat status = {};
    pollfd request{handle_, POLLIN, 0};
    return owned_ && fstat(handle_, &status) == 0 && S_ISFIFO(status.st_mode) &&
           poll(&request, 1, 2 * kPatience) == 0;
}

size_t StreamFile::Read(unsigned char *buffer, size_t size, const std::atomic<bool> *stop) {
    while (stop == nullptr || !*stop) {
        pollfd request{handle_, POLLIN, 0};
        if (poll(&request, 1, kPatience) <= 0) {
            continue;
        }
        const int32_t count =
            VarnekPGL_ReadFileByHandle64Bits(handle_, buffer, static_cast<uint32_t>(size));
        if (count >= 0) {
            return static_cast<size_t>(count);
        }
        if (errno != EINTR && errno != EAGAIN) {
            error_ = errno;
            return 0;
        }
    }
    return 0;
}

uint64_t StreamFile::Size() const {
    const int64_t size = VarnekPGL_GetFileSizeByHandle64Bits(handle_);
    return size > 0 ? static_cast<uint64_t>(size) : 0;
}

bool StreamFile::IsSameAs(const std::string &path) const {
    struct stat own = {};
    struct stat other = {};
    return fstat(handle_, &own) == 0 && stat(path.c_str(), &other) == 0 &&
           own.st_dev == other.st_dev && own.st_ino == other.st_ino;
}

}  // namespace receiver
