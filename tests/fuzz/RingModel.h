// A model of the byte ring that moves single bytes.
#ifndef VARNEK_TESTS_FUZZ_RINGMODEL_H
#define VARNEK_TESTS_FUZZ_RINGMODEL_H

#include <vector>

#include "support/RingFields.h"

struct RingModel : Fields {
    std::vector<unsigned char> bytes;

    int Ahead() const { return static_cast<int>(int64_t{wl} - rl); }
    int Flush() { return w = r = wl = rl = 0; }
    int Reset(int newSize) {
        if (newSize < 1) {
            return -8;
        }
        bytes.resize(static_cast<size_t>(size = newSize));
        return Flush();
    }
    int Used() const { return w - r + Ahead() * size; }
    int Space(bool reading) const {
        if ((Ahead() == 0 && r <= w) || (Ahead() == 1 && w <= r)) {
            return reading ? Used() : size - Used();
        }
        return Ahead() > 0 ? -32 : -34;
    }
    int GetDistance() const { return Used() * 100 / size - (Used() < 0 ? 1 : 0); }
    // Loop counts wrap around.
    static int Plus(int laps, int more) {
        return static_cast<int>(static_cast<unsigned int>(laps) + static_cast<unsigned int>(more));
    }
    void Step(int &pos, int &laps) const {
        laps = Plus(laps, ++pos == size ? 1 : 0);
        pos %= size;
    }
    int Write(const unsigned char *data, int n) {
        if (n < 0 || n > size) {
            return -8;
        }
        if (Ahead() == 0 && w < r) {
            return -11;
        }
        if (Ahead() < 0 || (Ahead() > 0 && r < w)) {
            const int result = Ahead() > 0 ? -10 : -11;
            return Reset(size), result;
        }
        if (n > (Ahead() > 0 ? r - w : size - (w - r))) {
            return -10;
        }
        for (int i = 0; i < n; ++i, Step(w, wl)) {
            bytes[static_cast<size_t>(w)] = data[i];
        }
        return 0;
    }
    int Read(unsigned char *dest, int n) {
        if (n < 0 || n > size) {
            return -8;
        }
        if (Ahead() == 0 && w == r) {
            return -11;
        }
        if (Ahead() < 0 || (Ahead() == 0 ? w < r : r < w)) {
            const int result = Ahead() > 0 ? -10 : -11;
            return Reset(size), result;
        }
        if (n > w - r + (Ahead() > 0 ? size : 0)) {
            return -11;
        }
        rl = Plus(rl, r / size);  // a reader at the end continues at the beginning
        r %= size;
        for (int i = 0; i < n; ++i, Step(r, rl)) {
            dest[i] = bytes[static_cast<size_t>(r)];
        }
        return 0;
    }
    int Seek(int n, int origin) {
        if (origin < 0 || origin > 2) {
            return -8;
        }
        if (n < 0 || n > (origin == 1 ? Space(true) : size)) {
            return -10;
        }
        if (origin == 1) {
            rl = Plus(rl, (r + n) / size);
            r = (r + n) % size;
            return 0;
        }
        r = origin == 0 ? n : (size - n + w) % size;
        rl = w < r ? Plus(wl, -1) : wl;
        return 0;
    }
};

#endif
