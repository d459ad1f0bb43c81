/// @file
/// A string of bytes that owns its text.
/// @see [Guide: strings](docs/guide/strings.md)
#ifndef VARNEK_CSTRING_H
#define VARNEK_CSTRING_H

#include "Varnek_Common.h"

#ifdef __cplusplus

/// Owns a copy of a NUL-terminated text, or none: a null string, which differs from an empty one.
/// Misuse is traced and changes nothing. If memory runs out, a string that is constructed or
/// assigned becomes null, appending changes nothing, and a sum is null or its left operand alone.
/// Not thread-safe.
class VARNEK_API VarnekCString {
  public:
    /// Copies `text`; null gives a null string.
    VarnekCString(char const *text);
    VarnekCString(const VarnekCString &other);  ///< copies its text

    /// Frees the text.
    ~VarnekCString();

    /// Returns a new copy, which the caller frees with delete[]; null for a null string or if
    /// memory runs out.
    char *String() const;
    /// Takes over a text in an array from new[]. Null is an error.
    void SetMemAllocedString(char *text);

    /// Copies the other text; null makes this a null string.
    VarnekCString &operator=(const VarnekCString &other);
    VarnekCString &operator=(char const *text);  ///< copies likewise

    /// Appends. Appending a null or empty string object or a null text is an error; an empty text
    /// turns a null string into an empty one.
    VarnekCString &operator+=(const VarnekCString &other);
    VarnekCString &operator+=(char const *text);                ///< appends
    VarnekCString operator+(const VarnekCString &other) const;  ///< a new string
    VarnekCString operator+(char const *text) const;            ///< a new string

    /// Compares as strcmp does and returns 1 or 0. Two null strings are ==; every other comparison
    /// in which a string is null gives 0, even >= or <= of two. Null strings are traced.
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
