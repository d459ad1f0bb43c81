// A string of bytes that owns its text.
#ifndef VARNEK_CSTRING_H
#define VARNEK_CSTRING_H

#include "Varnek_Common.h"

#ifdef __cplusplus

// Holds a NUL-terminated text in an array of its own, or none: a null string differs from one with
// an empty text. Misuse is traced and changes nothing. Without memory, construction, assignment
// and a sum give a null string, and appending changes nothing. One thread uses a string at a time.
class VARNEK_API VarnekCString {
  public:
    // A copy of `text`; null gives a null string.
    VarnekCString(char const *text);
    VarnekCString(const VarnekCString &other);

    // Frees the text.
    ~VarnekCString();

    // A new copy of the text, which the caller releases with delete[]; null for a null string
    // and without memory.
    char *String() const;
    // Takes over an array from new[] that holds a text; the caller must not use it any more. Null
    // is refused.
    void SetMemAllocedString(char *text);

    // A copy of the other text; null makes a null string.
    VarnekCString &operator=(const VarnekCString &other);
    VarnekCString &operator=(char const *text);

    // Appends. A string with no bytes and a null text are refused; an empty text makes a null
    // string an empty one.
    VarnekCString &operator+=(const VarnekCString &other);
    VarnekCString &operator+=(char const *text);
    VarnekCString operator+(const VarnekCString &other) const;
    VarnekCString operator+(char const *text) const;

    // Compare as strcmp does: 1 or 0. Two null strings are equal; otherwise a relation with a null
    // string does not hold. Null strings are traced.
    int operator==(const VarnekCString &other) const;
    int operator>(const VarnekCString &other) const;
    int operator>=(const VarnekCString &other) const;
    int operator<(const VarnekCString &other) const;
    int operator<=(const VarnekCString &other) const;

  private:
    char *pszString = nullptr;
    uint32_t uiLength = 0;
};

#endif

#endif
