// Small things that several areas share. Private.
#ifndef VARNEK_SOURCE_SUPPORT_H
#define VARNEK_SOURCE_SUPPORT_H

#include <errno.h>
#include <stdint.h>
#include <string.h>
#include <time.h>

#include <limits>

// What a log line shows of a text that may be null.
inline const char *Shown(const char *text) {
    return text != nullptr ? text : "(null)";
}

// Whether a character ends a line of the two configuration files.
inline bool IsLineEnd(char c) {
    return c == '\r' || c == '\n';
}

// What strnlen tells, by a call that C libraries write in their processor's own instructions.
inline size_t LengthWithin(const char *text, size_t most) {
    const void *end = memchr(text, '\0', most);
    return end != nullptr ? static_cast<size_t>(static_cast<const char *>(end) - text) : most;
}

// The system's text for an error number, the calling thread's until it asks again.
inline const char *ErrorText(int error) {
    return strerror(error);  // NOLINT(concurrency-mt-unsafe): a buffer per thread on every target
}

// Leaves the caller's errno as it was, whatever the calls in between do to it.
class ErrnoKeeper {
  public:
    ErrnoKeeper() : kept_(errno) {}
    ~ErrnoKeeper() { errno = kept_; }
    ErrnoKeeper(const ErrnoKeeper &) = delete;
    ErrnoKeeper &operator=(const ErrnoKeeper &) = delete;

  private:
    int kept_;
};

// Whether a pthread call succeeded. Such a call returns its error; afterwards errno holds it, as
// the traces expect.
inline bool Succeeded(int pthreadResult) {
    if (pthreadResult != 0) {
        errno = pthreadResult;
    }
    return pthreadResult == 0;
}

// Four bytes, the most significant first, wherever they lie.
inline uint32_t BigEndian(const unsigned char *p) {
    return static_cast<uint32_t>(p[0]) << 24 | static_cast<uint32_t>(p[1]) << 16 |
           static_cast<uint32_t>(p[2]) << 8 | p[3];
}

// A word whose least significant byte comes first, from the machine's order or into it.
template <typename Word>
constexpr Word LittleEndian(Word word) {
    if constexpr (__BYTE_ORDER__ == __ORDER_LITTLE_ENDIAN__) {
        return word;
    }
    return static_cast<Word>(sizeof word == 8 ? __builtin_bswap64(word)
                                              : __builtin_bswap32(static_cast<uint32_t>(word)));
}

// A word as the machine loads it, wherever it lies.
template <typename Word>
Word Load(const unsigned char *p) {
    Word word = 0;
    memcpy(&word, p, sizeof word);
    return word;
}

// Seconds as the system takes them: where its own have 32 bits, those after 2038 are its last one.
inline time_t SystemSeconds(int64_t seconds) {
    constexpr time_t kLast = std::numeric_limits<time_t>::max();
    return seconds < kLast ? static_cast<time_t>(seconds) : kLast;
}

// The point in time `timeout` milliseconds after `now`.
inline timespec DeadlineAfter(const timespec &now, uint32_t timeout) {
    constexpr int64_t kSecond = 1000000000;
    const int64_t nanoseconds = now.tv_nsec + int64_t{timeout} * 1000000;
    timespec deadline = {};
    deadline.tv_sec = SystemSeconds(now.tv_sec + nanoseconds / kSecond);
    deadline.tv_nsec = static_cast<long>(nanoseconds % kSecond);
    return deadline;
}

// The first 32-bit word of an OS object, which tells its state to a reader of the log.
template <typename OsObject>
int FirstWord(const OsObject &object) {
    int32_t word = 0;
    static_assert(sizeof object >= sizeof word, "an OS object has at least one word");
    memcpy(&word, &object, sizeof word);
    return word;
}

#endif
