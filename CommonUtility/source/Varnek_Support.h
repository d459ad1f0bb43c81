// Small helpers that several areas share. Private.
#ifndef VARNEK_SOURCE_SUPPORT_H
#define VARNEK_SOURCE_SUPPORT_H

#include <errno.h>
#include <stdint.h>
#include <string.h>
#include <time.h>

#include <limits>

// Returns a text for a log line, also for null.
inline const char *Shown(const char *text) {
    return text != nullptr ? text : "(null)";
}

// Whether a character ends a line of the two configuration files.
inline bool IsLineEnd(char c) {
    return c == '\r' || c == '\n';
}

// Returns the same as strnlen. It uses memchr, which C libraries optimise more often than strnlen.
inline size_t LengthWithin(const char *text, size_t most) {
    const void *end = memchr(text, '\0', most);
    return end != nullptr ? static_cast<size_t>(static_cast<const char *>(end) - text) : most;
}

// Returns the system's text for an error number. It is valid until the calling thread asks again.
inline const char *ErrorText(int error) {
    return strerror(error);  // NOLINT(concurrency-mt-unsafe): a buffer per thread on every target
}

// Restores the caller's errno at the end of the scope.
class ErrnoKeeper {
  public:
    ErrnoKeeper() : kept_(errno) {}
    ~ErrnoKeeper() { errno = kept_; }
    ErrnoKeeper(const ErrnoKeeper &) = delete;
    ErrnoKeeper &operator=(const ErrnoKeeper &) = delete;

  private:
    int kept_;
};

// Whether a pthread call succeeded. Such a call returns its error, which is stored in errno,
// because the traces read it there.
inline bool Succeeded(int pthreadResult) {
    if (pthreadResult != 0) {
        errno = pthreadResult;
    }
    return pthreadResult == 0;
}

// Reads four bytes at any alignment, the most significant first.
inline uint32_t BigEndian(const unsigned char *p) {
    return static_cast<uint32_t>(p[0]) << 24 | static_cast<uint32_t>(p[1]) << 16 |
           static_cast<uint32_t>(p[2]) << 8 | p[3];
}

// Converts a word between the machine's byte order and little-endian order.
template <typename Word>
constexpr Word LittleEndian(Word word) {
    if constexpr (__BYTE_ORDER__ == __ORDER_LITTLE_ENDIAN__) {
        return word;
    }
    return static_cast<Word>(sizeof word == 8 ? __builtin_bswap64(word)
                                              : __builtin_bswap32(static_cast<uint32_t>(word)));
}

// Loads a word in the machine's byte order, at any alignment.
template <typename Word>
Word Load(const unsigned char *p) {
    Word word = 0;
    memcpy(&word, p, sizeof word);
    return word;
}

// Converts seconds to the system's type. If that has 32 bits, times after 2038 become its last one.
inline time_t SystemSeconds(int64_t seconds) {
    constexpr time_t kLast = std::numeric_limits<time_t>::max();
    return seconds < kLast ? static_cast<time_t>(seconds) : kLast;
}

// Returns the time `timeout` milliseconds after `now`.
inline timespec DeadlineAfter(const timespec &now, uint32_t timeout) {
    constexpr int64_t kSecond = 1000000000;
    const int64_t nanoseconds = now.tv_nsec + int64_t{timeout} * 1000000;
    timespec deadline = {};
    deadline.tv_sec = SystemSeconds(now.tv_sec + nanoseconds / kSecond);
    deadline.tv_nsec = static_cast<long>(nanoseconds % kSecond);
    return deadline;
}

// Returns the first 32-bit word of an OS object. Log lines show it, because it contains the state.
template <typename OsObject>
int FirstWord(const OsObject &object) {
    int32_t word = 0;
    static_assert(sizeof object >= sizeof word, "an OS object has at least one word");
    memcpy(&word, &object, sizeof word);
    return word;
}

#endif
