// Packets are written in blocks, because each write of the library is a system call.
#include "Capture.h"

#include <unistd.h>

#include <cerrno>

#include "TransportStream.h"
#include "Varnek_File.h"

namespace receiver {
namespace {

constexpr size_t kBlockSize = 256 * kPacketSize;

const char *Explain(int32_t result) {
    return result == VARNEK_FILE_MEDIUM_FULL      ? "no space is left"
           : result == VARNEK_FILE_TOO_LARGE      ? "the file would become too large"
           : result == VARNEK_FILE_DEVICE_FAILURE ? "the device failed"
                                                  : "it could not be written";
}

}  // namespace

Capture::~Capture() {
    if (file_ >= 0) {
        VarnekPGL_CloseFile64Bits(file_);
    }
}

bool Capture::Open(const std::string &path) {
    file_ = VarnekPGL_OpenFile64Bits(path.c_str(), PGL_FILE_MODE_WRITE);
    if (file_ < 0) {
        file_ = VarnekPGL_OpenFile64Bits(path.c_str(), PGL_FILE_MODE_CREATE_RW);
    }
    return file_ >= 0;
}

void Capture::Push(const unsigned char *packet) {
    if (!failure_.empty()) {
        return;
    }
    waiting_.insert(waiting_.end(), packet, packet + kPacketSize);
    if (waiting_.size() >= kBlockSize) {
        Write();
    }
}

void Capture::Finish() {
    if (failure_.empty() && !waiting_.empty()) {
        Write();
    }
}

void Capture::Write() {
    if (!empty_) {
        // The library's open never truncates. Devices and pipes have no length.
        if (ftruncate(file_, 0) != 0 && errno != EINVAL) {
            failure_ = "the old content could not be removed";
            return;
        }
        empty_ = true;
    }
    const auto size = static_cast<uint32_t>(waiting_.size());
    const int32_t result = VarnekPGL_WriteFileByHandle64Bits(file_, waiting_.data(), size);
    if (result != static_cast<int32_t>(size)) {
        failure_ = Explain(result);
    }
    waiting_.clear();
}

}  // namespace receiver
