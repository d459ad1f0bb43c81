/// @file
/// A string of bytes that owns its text.
/// @see [Guide: strings](docs/guide/strings.md)
#ifndef VARNEK_CSTRING_H
#define VARNEK_CSTRING_H

#include "Varnek_Common.h"

#ifdef __cplusplus

/// Owns a copy of a NUL-terminated text. A string without a text is a null string, which differs
/// from an empty one. Misuse is traced and changes nothing. When memory runs out, construction,
/// assignment and a sum give a null string, and appending changes nothing. Not thread-safe: one
/// thread at a time may use a string.
class VARNEK_API VarnekCString {
  public:
    /// Copies `text`; null gives a null string.
    VarnekCString(char const *text);
    VarnekCString(const VarnekCString &other);  ///< copies its text

    /// Frees the text.
    ~VarnekCString();

    /// Returns a new copy of the text, which the caller frees with delete[]; null for a null string
    /// and when memory runs out.
    char *String() const;
    /// Takes ownership of a text in an array from new[]; the caller must not use it afterwards.
    /// Null is an error.
    void SetMemAllocedString(char *text);

    /// Copy the other text; null makes this a null string.
    VarnekCString &operator=(const VarnekCString &other);
    VarnekCString &operator=(char const *text);  ///< copies likewise

    /// Append. A string object without bytes and a null text are errors; an empty text turns a null
    /// string into an empty one.
    VarnekCString &operator+=(const VarnekCString &other);
    VarnekCString &operator+=(char const *text);                ///< appends
    VarnekCString operator+(const VarnekCString &other) const;  ///< a new string
    VarnekCString operator+(char const *text) const;            ///< a new string

    /// Compare as strcmp does, and return 1 or 0. Two null strings are equal; every other
    /// comparison with a null string returns 0. Null strings are traced.
    int operator==(const VarnekCString &other) const;
    int operator>(const VarnekCString &other) const;   ///< compares
    int operator>=(const VarnekCString &other) const;  ///< compares
    int operator<(const VarnekCString &other) const;   ///< compares
    int operator<=(const VarnekCString &other) const;  ///< compares

  private:
    char *pszString = nullptr;
    uint32_t uiLength = 0;
};

#endif

#endif
