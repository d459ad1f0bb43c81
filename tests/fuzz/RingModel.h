// A model of the byte ring that moves single bytes, and composes the traces that the ring owes.
#ifndef VARNEK_TESTS_FUZZ_RINGMODEL_H
#define VARNEK_TESTS_FUZZ_RINGMODEL_H

#include <string>
#include <type_traits>
#include <vector>

#include "support/RingFields.h"

inline std::string Text(const std::string &text) { return text; }
inline std::string Text(int number) { return std::to_string(number); }

// The same operations, byte by byte.
struct RingModel : Fields {
    std::vector<unsigned char> bytes;
    std::vector<std::string> log;

    template <typename... Parts>
    int Say(int result, const Parts &...parts) {
        log.push_back((Text(parts) + ... + "\n"));
        return result;
    }
    int Ahead() const { return static_cast<int>(int64_t{wl} - rl); }
    int Flush() {
        w = r = wl = rl = 0;
        return Say(0, "Ring Buffer will be flushed!!!");
    }
    int Reset(int newSize) {
        if (newSize < 1) {
            return Say(-8, "Invalid Ring Size! size=[", newSize, "]");
        }
        bytes.resize(static_cast<size_t>(size = newSize));
        w = r = wl = rl = 0;
        return Say(0, "Ring Buffer will be reset!!!");
    }
    int Used() const { return w - r + Ahead() * size; }
    int Space(bool reading) {
        if ((Ahead() == 0 && r <= w) || (Ahead() == 1 && w <= r)) {
            return reading ? Used() : size - Used();
        }
        Say(0, "[Abnormal State] reading loop count=[", rl, "], writing loop count=[", wl, "]");
        return Say(Ahead() > 0 ? -32 : -34, "[Abnormal State] Reading Position=[", r, "], Writing Position=[", w, "]");
    }
    int GetSpaceReading() { return Space(true); }
    int GetSpaceWriting() { return Space(false); }
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
        const std::string lost = "This data will be discarded";
        const std::string underflow = "Invalid Ring Buffer State! Underflow! " + lost + "!";
        const int space = Ahead() > 0 ? r - w : size - (w - r);
        if (n < 0 || n > size) {
            return Say(-8, "Too long writelen=[", n, "]! Ring buffer size=[", size, "]");
        }
        if (Ahead() > 0 && r < w) {
            Say(0, "[Abnormal Sate] Ring Buffer is already overflowed! ", lost);
            return Reset(size), -10;
        }
        if (Ahead() < 0) {
            Say(0, "[Abnormal State] ", underflow);
            return Reset(size), -11;
        }
        if (w < r && Ahead() == 0) {
            return Say(-11, underflow);
        }
        if (space < n) {
            return Say(-10, "Remaing Writing Space=[", space, "], Wrting Len=[", n, "]!! ", lost, "!");
        }
        for (int i = 0; i < n; ++i, Step(w, wl)) {
            bytes[static_cast<size_t>(w)] = data[i];
        }
        return 0;
    }
    int Read(unsigned char *dest, int n) {
        const int used = w - r + (Ahead() > 0 ? size : 0);
        if (n < 0 || n > size) {
            return Say(-8, "Too long readLen=[", n, "]! Ring buffer size=[", size, "]");
        }
        if (Ahead() == 0 && w == r) {
            return Say(-11, "No reading data!");
        }
        if (Ahead() < 0 || (Ahead() == 0 ? w < r : r < w)) {
            const int result = Ahead() > 0 ? -10 : -11;
            Say(0, "Abnormal Sate!! Buffer Already ", Ahead() == 0 ? "Under" : "Over", "flow!");
            return Reset(size), result;
        }
        if (used < n) {
            return Say(-11, "Not enough reading buffer space. readLen=[", n, "], readiing buf=[", used, "]!");
        }
        rl = Plus(rl, r / size);  // a reader that was set to the end starts over
        r %= size;
        for (int i = 0; i < n; ++i, Step(r, rl)) {
            dest[i] = bytes[static_cast<size_t>(r)];
        }
        return 0;
    }
    int Seek(int n, int origin) {
        const char *const names[] = {"[SEEK_SET]", "[SEEK_CUR]", "[SEEK_END]"};
        if (origin < 0 || origin > 2) {
            return Say(-8, "Invalid origin value=[", origin, "]");
        }
        const int most = origin == 1 ? Space(true) : size;
        if (n < 0 || n > most) {
            return Say(-10, names[origin], " Too long offset. aOffset=[", n, "]");
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
