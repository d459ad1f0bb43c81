// Helpers for NUL-terminated strings. They convert the case of letters without the C library, so
// that the locale of the process cannot change which keys and names match.
#include "Varnek_StrUtil.h"

#include <string.h>

namespace {

constexpr char kEmpty[] = "";
constexpr char kUpperDigits[] = "0123456789ABCDEF";
constexpr char kLowerDigits[] = "0123456789abcdefghijklmnopqrstuvwxyz";

const char *OrEmpty(const char *text) {
    return text != nullptr ? text : kEmpty;
}

int Lower(char c) {
    const int byte = static_cast<unsigned char>(c);
    return byte >= 'A' && byte <= 'Z' ? byte + 32 : byte;
}

bool IsBlank(char c) {
    return c == ' ' || (c >= '\t' && c <= '\r');
}

// Writes the digits and the terminator.
void WriteDigits(char *out, uint32_t value, uint32_t radix, const char *digits) {
    char reversed[32];
    size_t count = 0;
    do {
        reversed[count++] = digits[value % radix];
        value /= radix;
    } while (value != 0);
    while (count > 0) {
        *out++ = reversed[--count];
    }
    *out = '\0';
}

// Returns the end of the text without its trailing whitespace.
char *EndOfText(char *text) {
    char *end = text + strlen(text);
    while (end > text && IsBlank(end[-1])) {
        --end;
    }
    return end;
}

}  // namespace

char *VarnekPGL_Stristr(const char *haystack, const char *needle) {
    if (haystack == nullptr) {
        return nullptr;
    }
    needle = OrEmpty(needle);
    for (;; ++haystack) {
        size_t matched = 0;
        while (needle[matched] != '\0' && Lower(haystack[matched]) == Lower(needle[matched])) {
            ++matched;
        }
        if (needle[matched] == '\0') {
            return const_cast<char *>(haystack);
        }
        // The rest of the haystack is shorter than the needle.
        if (haystack[matched] == '\0') {
            return nullptr;
        }
    }
}

char *VarnekPGL_Itoa(uint32_t value, char *buffer, uint32_t radix) {
    if (buffer == nullptr) {
        return buffer;
    }
    if (radix < 2 || radix > 16) {
        buffer[0] = '\0';
        return buffer;
    }
    WriteDigits(buffer, value, radix, kUpperDigits);
    return buffer;
}

char *VarnekPGL_Ltoa(int32_t value, char *buffer, uint32_t radix) {
    if (buffer == nullptr) {
        return buffer;
    }
    if (radix < 2 || radix > 36) {
        buffer[0] = '\0';
        return buffer;
    }
    char *out = buffer;
    uint32_t magnitude = static_cast<uint32_t>(value);
    if (radix == 10 && value < 0) {
        *out++ = '-';
        magnitude = 0 - magnitude;
    }
    WriteDigits(out, magnitude, radix, kLowerDigits);
    return buffer;
}

int32_t VarnekPGL_Stricmp(const char *a, const char *b) {
    return VarnekPGL_Strnicmp(a, b, UINT32_MAX);
}

int32_t VarnekPGL_Strnicmp(const char *a, const char *b, uint32_t count) {
    a = OrEmpty(a);
    b = OrEmpty(b);
    for (; count > 0; --count, ++a, ++b) {
        const int difference = Lower(*a) - Lower(*b);
        if (difference != 0 || *a == '\0') {
            return difference;
        }
    }
    return 0;
}

char *VarnekPGL_Strmcpy(char *destination, const char *source, int32_t start, int32_t count) {
    if (destination == nullptr) {
        return destination;
    }
    if (count < 1) {
        destination[0] = '\0';
        return destination;
    }
    source = OrEmpty(source);
    for (; start > 0; --start, ++source) {
        if (*source == '\0') {
            return const_cast<char *>(kEmpty);
        }
    }
    return strncpy(destination, source, static_cast<size_t>(count));
}

char *VarnekPGL_Strupr(char *text) {
    for (char *c = text; c != nullptr && *c != '\0'; ++c) {
        *c = *c >= 'a' && *c <= 'z' ? static_cast<char>(*c - 32) : *c;
    }
    return text;
}

char *VarnekPGL_Strlwr(char *text) {
    for (char *c = text; c != nullptr && *c != '\0'; ++c) {
        *c = static_cast<char>(Lower(*c));
    }
    return text;
}

void VarnekPGL_Strtrim(char *text) {
    if (text == nullptr) {
        return;
    }
    char *end = EndOfText(text);
    const char *begin = text;
    while (begin < end && IsBlank(*begin)) {
        ++begin;
    }
    const size_t length = static_cast<size_t>(end - begin);
    memmove(text, begin, length);
    text[length] = '\0';
}

void VarnekPGL_Strrtrim(char *text) {
    if (text != nullptr) {
        *EndOfText(text) = '\0';
    }
}
