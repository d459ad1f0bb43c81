// What log lines and error numbers need, and lengths of text. Private.
#ifndef VARNEK_SOURCE_SUPPORT_H
#define VARNEK_SOURCE_SUPPORT_H

#include <errno.h>
#include <string.h>

// Returns a text for a log line, even for null.
inline const char *Shown(const char *text) {
    return text != nullptr ? text : "(null)";
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

// Stores in errno the error that a pthread call returns, because the traces read it there. Returns
// the error, 0 for none.
inline int SetErrno(int error) {
    if (__builtin_expect(error != 0, 0)) {
        errno = error;
    }
    return error;
}

#endif
