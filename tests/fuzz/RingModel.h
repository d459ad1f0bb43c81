// A model of the byte ring: what was written last, and how much of it is unread.
#ifndef VARNEK_TESTS_FUZZ_RINGMODEL_H
#define VARNEK_TESTS_FUZZ_RINGMODEL_H

#include <algorithm>
#include <cstdio>
#include <deque>

#include "Varnek_CRingBuffer.h"

struct RingModel {
    explicit RingModel(int ringSize) : size(ringSize), last(static_cast<size_t>(ringSize)) {}

    int size;
    std::deque<unsigned char> last;  // the newest `size` bytes, where a ring that was never full has zeros
    int unread = 0, written = 0;

    int Flush() {
        std::fill(last.begin(), last.end(), static_cast<unsigned char>(0));
        return unread = written = 0;
    }
    int Reset(int newSize) {
        if (newSize < 1) {
            return VARNEK_RING_INVALID;
        }
        last.resize(static_cast<size_t>(size = newSize));
        return Flush();
    }
    int GetSpaceReading() const { return unread; }
    int GetSpaceWriting() const { return size - unread; }
    int GetDistance() const { return unread * 100 / size; }
    int Write(const unsigned char *data, int n) {
        if (n < 0 || n > size) {
            return VARNEK_RING_INVALID;
        }
        if (n > size - unread) {
            return VARNEK_RING_NO_SPACE;
        }
        last.insert(last.end(), data, data + n);
        last.erase(last.begin(), last.begin() + n);
        unread += n;
        written = (written + n) % size;
        return 0;
    }
    int Read(unsigned char *dest, int n) {
        if (n < 0 || n > size) {
            return VARNEK_RING_INVALID;
        }
        if (unread == 0 || n > unread) {
            return VARNEK_RING_NO_DATA;
        }
        std::copy_n(last.end() - unread, n, dest);
        unread -= n;
        return 0;
    }
    int Seek(int n, int origin) {
        if (origin < SEEK_SET || origin > SEEK_END) {
            return VARNEK_RING_INVALID;
        }
        if (n < 0 || n > (origin == SEEK_CUR ? unread : size)) {
            return VARNEK_RING_NO_SPACE;
        }
        unread = origin == SEEK_CUR ? unread - n : (origin == SEEK_END ? n : size + written - n) % size;
        return 0;
    }
};

#endif
