// The owning string. A new array is complete before the old one is freed, so an operand may be the
// string itself or part of its array.
#include "Varnek_CString.h"

#include <string.h>

#include <new>

#include "Varnek_Trace.h"

namespace {

// Returns a new array with both texts, one after the other. Null, after a trace, when there is no
// memory or the length does not fit its field.
char *Joined(const char *first, size_t firstLength, const char *second, size_t secondLength) {
    const size_t length = firstLength + secondLength;
    char *text = length < UINT32_MAX ? new (std::nothrow) char[length + 1] : nullptr;
    if (text == nullptr) {
        return VARNEK_FAIL(text, "String: Out of memory! length=[%u]\n",
                           static_cast<unsigned int>(length));
    }
    if (firstLength > 0) {
        memcpy(text, first, firstLength);
    }
    memcpy(text + firstLength, second, secondLength);
    text[length] = '\0';
    return text;
}

char *CopyOf(const char *text, size_t length) {
    return text != nullptr ? Joined(nullptr, 0, text, length) : nullptr;
}

size_t LengthOf(const char *text) {
    return text != nullptr ? strlen(text) : 0;
}

// Whether both operands of an ordering have a text.
bool AreOrdered(const char *a, const char *b) {
    if (a != nullptr && b != nullptr) {
        return true;
    }
    return VARNEK_FAIL(false, "One of two strings is NULL!\n");
}

}  // namespace

VarnekCString::VarnekCString(char const *text) : pszString(CopyOf(text, LengthOf(text))) {
    uiLength = static_cast<uint32_t>(LengthOf(pszString));
}

VarnekCString::VarnekCString(const VarnekCString &other)
    : pszString(CopyOf(other.pszString, other.uiLength)),
      uiLength(pszString != nullptr ? other.uiLength : 0) {}

VarnekCString::~VarnekCString() {
    delete[] pszString;
}

char *VarnekCString::String() const {
    return CopyOf(pszString, uiLength);
}

void VarnekCString::SetMemAllocedString(char *text) {
    if (text == nullptr) {
        TRACE_ERROR("Argument String is NULL!\n");
        return;
    }
    if (text != pszString) {
        delete[] pszString;
    }
    pszString = text;
    uiLength = static_cast<uint32_t>(strlen(text));
}

VarnekCString &VarnekCString::operator=(const VarnekCString &other) {
    if (this == &other) {
        return *this;
    }
    char *copy = CopyOf(other.pszString, other.uiLength);
    delete[] pszString;
    pszString = copy;
    uiLength = copy != nullptr ? other.uiLength : 0;
    return *this;
}

VarnekCString &VarnekCString::operator=(char const *text) {
    char *copy = CopyOf(text, LengthOf(text));
    delete[] pszString;
    pszString = copy;
    uiLength = static_cast<uint32_t>(LengthOf(copy));
    return *this;
}

VarnekCString &VarnekCString::operator+=(const VarnekCString &other) {
    if (other.uiLength == 0) {
        return VARNEK_FAIL(*this, "No String!\n");
    }
    return *this += other.pszString;
}

VarnekCString &VarnekCString::operator+=(char const *text) {
    if (text == nullptr) {
        return VARNEK_FAIL(*this, "Adding String is NULL!\n");
    }
    const size_t added = strlen(text);
    char *joined = Joined(pszString, uiLength, text, added);
    if (joined == nullptr) {
        return *this;
    }
    delete[] pszString;
    pszString = joined;
    uiLength += static_cast<uint32_t>(added);
    return *this;
}

// When there is no memory for the left operand, a sum is null rather than the right operand alone.

VarnekCString VarnekCString::operator+(const VarnekCString &other) const {
    VarnekCString sum(*this);
    if (sum.pszString != nullptr || pszString == nullptr) {
        sum += other;
    }
    return sum;
}

VarnekCString VarnekCString::operator+(char const *text) const {
    VarnekCString sum(*this);
    if (sum.pszString != nullptr || pszString == nullptr) {
        sum += text;
    }
    return sum;
}

int VarnekCString::operator==(const VarnekCString &other) const {
    if (pszString == nullptr && other.pszString == nullptr) {
        TRACE_HIGH("Two strings are NULL!\n");
        return 1;
    }
    if (pszString == nullptr || other.pszString == nullptr) {
        TRACE_HIGH("One of two strings is NULL!\n");
        return 0;
    }
    return strcmp(pszString, other.pszString) == 0 ? 1 : 0;
}

int VarnekCString::operator>(const VarnekCString &other) const {
    return int{AreOrdered(pszString, other.pszString) && strcmp(pszString, other.pszString) > 0};
}

int VarnekCString::operator>=(const VarnekCString &other) const {
    return int{AreOrdered(pszString, other.pszString) && strcmp(pszString, other.pszString) >= 0};
}

int VarnekCString::operator<(const VarnekCString &other) const {
    return int{AreOrdered(pszString, other.pszString) && strcmp(pszString, other.pszString) < 0};
}

int VarnekCString::operator<=(const VarnekCString &other) const {
    return int{AreOrdered(pszString, other.pszString) && strcmp(pszString, other.pszString) <= 0};
}
