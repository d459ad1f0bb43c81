// Text conversion: Latin-15 bytes to 16-bit units, units to UTF-8 and back. Converting Latin-15
// directly to UTF-8 cannot differ from the two steps, because its table is built from theirs. The
// decoder needs as much room as was computed for it, because both use CharLength.
#include "Varnek_LngPack.h"

#include <limits.h>
#include <stddef.h>
#include <stdlib.h>
#include <string.h>

#include "Varnek_Bytes.h"
#include "Varnek_Support.h"
#include "Varnek_Trace.h"

namespace {

constexpr int kFirstUpper = 0xA0;

struct Latin15Row {
    unsigned short byte;
    unsigned short unicode;
};

struct Latin15Table {
    Latin15Row row[0x100 - kFirstUpper];
};

constexpr Latin15Table MakeLatin15Table() {
    // The characters that differ from Unicode, and the no-break space, which becomes a space.
    constexpr Latin15Row different[] = {
        {0xA0, 0x0020}, {0xA4, 0x20AC}, {0xA6, 0x0160}, {0xA8, 0x0161}, {0xB4, 0x017D},
        {0xB8, 0x017E}, {0xBC, 0x0152}, {0xBD, 0x0153}, {0xBE, 0x0178},
    };
    Latin15Table table = {};
    for (int byte = kFirstUpper; byte <= 0xFF; ++byte) {
        const unsigned short same = static_cast<unsigned short>(byte);
        table.row[byte - kFirstUpper] = {same, same};
    }
    for (const Latin15Row &row : different) {
        table.row[row.byte - kFirstUpper] = row;
    }
    return table;
}

// The row of a byte has the index byte - 0xA0.
constexpr Latin15Table gWmLatin15CodeTable = MakeLatin15Table();

// Plain characters are the same single byte in Latin-15 and UTF-8.
constexpr bool IsPlain(unsigned char byte) {
    return byte >= 0x20 && byte <= 0x7E;
}

// Returns the unit of a byte; 0 for a control character, which is dropped.
constexpr unsigned int UnitOf(unsigned char byte) {
    if (byte >= kFirstUpper) {
        return gWmLatin15CodeTable.row[byte - kFirstUpper].unicode;
    }
    return IsPlain(byte) ? byte : 0;
}

// Appends the UTF-8 of a unit, one to three bytes. Returns the end of the output.
constexpr char *PutUtf8(char *out, unsigned int unit) {
    if (unit < 0x80) {
        *out++ = static_cast<char>(unit);
    } else if (unit < 0x800) {
        *out++ = static_cast<char>(0xC0 | unit >> 6);
        *out++ = static_cast<char>(0x80 | (unit & 0x3F));
    } else {
        *out++ = static_cast<char>(0xE0 | unit >> 12);
        *out++ = static_cast<char>(0x80 | (unit >> 6 & 0x3F));
        *out++ = static_cast<char>(0x80 | (unit & 0x3F));
    }
    return out;
}

// Whether all bytes of a word are plain: the top bit is clear in the byte itself, in the byte minus
// 0x20 (which sets it below 0x20) and in the byte plus 1 (which sets it for 0x7F). A byte that
// borrows from the next one or carries into it does no harm, because its own top bit is set.
using Word = uintptr_t;
constexpr bool ArePlain(Word bytes) {
    constexpr Word kOnes = ~Word{0} / 0xFF;
    return ((bytes | (bytes - 0x20 * kOnes) | (bytes + kOnes)) & 0x80 * kOnes) == 0;
}

// The UTF-8 of each Latin-15 byte. The lowest byte of an entry is the first byte of the UTF-8, and
// the highest byte of the entry is the number of bytes, 0 for a control character.
struct Utf8Table {
    uint32_t of[0x100];
};

constexpr Utf8Table MakeUtf8Table() {
    Utf8Table table = {};
    for (unsigned int byte = 0; byte <= 0xFF; ++byte) {
        const unsigned int unit = UnitOf(static_cast<unsigned char>(byte));
        char utf8[3] = {};
        const long count = unit != 0 ? PutUtf8(utf8, unit) - utf8 : 0;
        for (int i = 2; i >= 0; --i) {
            table.of[byte] = table.of[byte] << 8 | static_cast<unsigned char>(utf8[i]);
        }
        table.of[byte] |= static_cast<uint32_t>(count) << 24;
    }
    return table;
}

constexpr Utf8Table kUtf8 = MakeUtf8Table();

// Writes all four bytes of an entry, the first of which are the UTF-8 of `byte`. Returns the end of
// the UTF-8.
char *PutLatin15(char *out, unsigned char byte) {
    const uint32_t utf8 = kUtf8.of[byte];
    const uint32_t stored = LittleEndian(utf8);
    memcpy(out, &stored, sizeof stored);
    return out + (utf8 >> 24);
}

// Converts `length` bytes directly to UTF-8. The output needs room for 3 * length + 1 bytes. Plain
// characters are copied a word at a time. Returns the end of the output.
char *PutLatin15(char *out, const unsigned char *in, size_t length) {
    const unsigned char *const end = in + length;
    while (static_cast<size_t>(end - in) >= sizeof(Word)) {
        const Word word = Load<Word>(in);
        memcpy(out, &word, sizeof word);
        if (ArePlain(word)) {
            in += sizeof word;
            out += sizeof word;
            continue;
        }
        for (; IsPlain(*in); ++in) {
            ++out;
        }
        out = PutLatin15(out, *in++);
    }
    while (in != end) {
        out = PutLatin15(out, *in++);
    }
    return out;
}

// Returns the number of bytes of the character at `text`, 0 if it is malformed. Reads at most
// `length` bytes; `length` is at least 1.
int CharLength(const unsigned char *text, int length) {
    if (text[0] < 0x80) {
        return 1;
    }
    if ((text[0] & 0xE0) == 0xC0 && length >= 2 && text[1] >= 0x80) {
        return 2;
    }
    if (text[0] >= 0xE0 && length >= 3 && text[1] >= 0x80 && text[2] >= 0x80) {
        return 3;
    }
    return 0;
}

void ReportTooLong() {
    VARNEK_TRACE(VARNEK_LEVEL_HIGH | VARNEK_MODULE_MAIN_CONTROL,
                 "WmConvertLatin15Code2PCode() fail. outBufSize < strLen\n");
}

}  // namespace

BOOL WmConvertLatin15Code2PCode(unsigned short *pmszOutText, int outBufSize, const char *szInText) {
    if (pmszOutText == nullptr || szInText == nullptr) {
        VARNEK_TRACE(VARNEK_LEVEL_HIGH | VARNEK_MODULE_MAIN_CONTROL,
                     "WmConvertLatin15Code2PCode() fail. pmszOutText == NULL ||  szInText  == "
                     "NULL\n");
        return FALSE;
    }
    const size_t strLen = strlen(szInText);
    if (outBufSize < 0 || strLen > static_cast<size_t>(outBufSize)) {
        ReportTooLong();
        return FALSE;
    }
    for (size_t i = 0; i < strLen; ++i) {
        const unsigned int unit = UnitOf(static_cast<unsigned char>(szInText[i]));
        if (unit != 0) {
            *pmszOutText++ = static_cast<unsigned short>(unit);
        }
    }
    *pmszOutText = 0;
    return TRUE;
}

int WmStrlen(const unsigned short *mszText) {
    if (mszText == nullptr) {
        return -1;
    }
    int length = 0;
    while (mszText[length] != 0) {
        ++length;
    }
    return length;
}

BOOL WmConvertPCode2UTF(char *pszOutText, const unsigned short *mszInText, int nChar) {
    if (pszOutText == nullptr) {
        TRACE_HIGH("WmConvertPCode2UTF : pszOutText - null  !!");
        return FALSE;
    }
    if (mszInText == nullptr) {
        TRACE_HIGH(" WmConvertPCode2UTF : mszInText - 0  !!");
        return FALSE;
    }
    if (nChar == 0) {
        pszOutText[0] = '\0';
        return TRUE;
    }
    if (__WmLngUnicode2UTF(pszOutText, mszInText, nChar) == -1) {
        TRACE_HIGH("WmConvertPCode2UTF: __WmLngUnicode2UTF returns false!\n");
        return FALSE;
    }
    return TRUE;
}

int __WmLngUnicode2UTF(char *des, const unsigned short *src, int nChar) {
    if (des == nullptr) {
        TRACE_HIGH(" __WmLngUnicode2UTF : des - null  !!");
        return -1;
    }
    if (src == nullptr) {
        TRACE_HIGH("__WmLngUnicode2UTF : src - null  !!");
        return -1;
    }
    if (nChar == 0) {
        TRACE_HIGH(" __WmLngUnicode2UTF : nChar - 0  !!");
        return -1;
    }
    char *out = des;
    for (int i = 0; i < nChar && src[i] != 0; ++i) {
        out = PutUtf8(out, src[i]);
    }
    *out = '\0';
    return static_cast<int>(out - des);
}

BOOL WmConvert2LCode(char *pszOutText, const unsigned short *mszInText) {
    const int nChar = WmStrlen(mszInText);
    if (nChar == 0 && pszOutText != nullptr) {
        pszOutText[0] = '\0';
        return TRUE;
    }
    if (WmConvertPCode2UTF(pszOutText, mszInText, nChar) != TRUE) {
        TRACE_HIGH("WmConvert2LCode: Converting Unicode(%x) to utf8 code failed\n",
                   static_cast<unsigned int>(reinterpret_cast<uintptr_t>(mszInText)));
        return FALSE;
    }
    return TRUE;
}

BOOL WmConvertUTF2PCode(unsigned short *pmszOutText, int outBufSize, const char *szInText,
                        int length) {
    if (pmszOutText == nullptr) {
        TRACE_HIGH("WmConvertUTF2PCode : pmszOutText - null  !!");
        return FALSE;
    }
    if (szInText == nullptr) {
        TRACE_HIGH("WmConvertUTF2PCode : szInText - null  !!");
        return FALSE;
    }
    if (length == 0) {
        pmszOutText[0] = 0;
        return TRUE;
    }
    const int required = __WmLngStrlenByByte(szInText, length);
    if (__WmConvertCodeBufferSizeCheck("pmszOutText", outBufSize, required) != TRUE) {
        TRACE_HIGH("WmConvertUTF2PCode: Out buffer size seems to be small!\n");
        return FALSE;
    }
    if (__WmLngUTF2Unicode(pmszOutText, szInText, length) == -1) {
        TRACE_HIGH("WmConvertUTF2PCode: __WmLngUTF2Unicode returns false!\n");
        return FALSE;
    }
    return TRUE;
}

int __WmLngStrlenByByte(const char *szText, int length) {
    int count = 1;
    if (length < 1 || szText == nullptr) {
        return 2;
    }
    const unsigned char *text = reinterpret_cast<const unsigned char *>(szText);
    // For a text that needs 2 GiB of output or more, the result is INT_MAX.
    while (length > 0 && *text != 0 && count < INT_MAX / 2) {
        int step = CharLength(text, length);
        if (step == 0) {
            TRACE_HIGH("__WmLngStrlenByByte: utf8 incorrect range!\n");
            step = 1;
        }
        text += step;
        length -= step;
        ++count;
    }
    return length > 0 && *text != 0 ? INT_MAX : count * 2;
}

BOOL __WmConvertCodeBufferSizeCheck(const char *szName, int OutBuffer, int RequiredBufSize) {
    if (OutBuffer >= RequiredBufSize) {
        return TRUE;
    }
    if (OutBuffer == 4) {
        TRACE_HIGH("__WmConvertCodeBufferSizeCheck: Out buffer size seems to be small (%s)\n",
                   Shown(szName));
    } else {
        TRACE_HIGH(
            "__WmConvertCodeBufferSizeCheck: Buffer size is too small %s: OutBuffer(%d), "
            "RequiredBufSize(%d)\n",
            Shown(szName), OutBuffer, RequiredBufSize);
    }
    return FALSE;
}

int __WmLngUTF2Unicode(unsigned short *des, const char *src, int length) {
    if (des == nullptr) {
        TRACE_HIGH("__WmLngUTF2Unicode : des - null  !!");
        return -1;
    }
    if (src == nullptr) {
        TRACE_HIGH("__WmLngUTF2Unicode : src - null  !!");
        return -1;
    }
    const unsigned char *text = reinterpret_cast<const unsigned char *>(src);
    unsigned short *out = des;
    while (length > 0 && *text != 0) {
        int step = CharLength(text, length);
        if (step == 3) {
            *out = __WmLngConvert3ByteChar(text[0], text[1], text[2]);
        } else if (step == 2) {
            const bool noBreakSpace = text[0] == 0xC2 && text[1] == 0xA0;
            *out = noBreakSpace ? 0x0020 : __WmLngConvert2ByteChar(text[0], text[1]);
        } else {
            *out = __WmLngConvert1ByteChar(text[0]);
        }
        if (step == 0) {
            TRACE_HIGH("__WmLngUTF2Unicode: utf8 incorrect range!\n");
            step = 1;
        }
        ++out;
        text += step;
        length -= step;
    }
    *out = 0;
    return static_cast<int>(out - des);
}

unsigned short __WmLngConvert1ByteChar(unsigned char first) {
    return first & 0x7F;
}

unsigned short __WmLngConvert2ByteChar(unsigned char first, unsigned char second) {
    return static_cast<unsigned short>((first & 0x1F) << 6 | (second & 0x3F));
}

unsigned short __WmLngConvert3ByteChar(unsigned char first, unsigned char second,
                                       unsigned char third) {
    return static_cast<unsigned short>(first << 12 | (second & 0x3F) << 6 | (third & 0x3F));
}

BOOL VarnekPGL_ConvertLatin15toUTF8(char **outputData, const char *szInput,
                                    unsigned int szInputSize) {
    if (outputData == nullptr || szInput == nullptr) {
        TRACE_HIGH("VarnekPGL_ConvertLatin15toUTF8: outputData or szInput is NULL  !\n");
        return FALSE;
    }
    // The input may have three times the stated size plus one byte, within a limit that keeps the
    // sizes below from overflowing. The buffer's size follows the input, not the stated size.
    const uint64_t stated = 3 * static_cast<uint64_t>(szInputSize) + 1;
    const int capacity = stated < INT_MAX / 4 ? static_cast<int>(stated) : INT_MAX / 4;
    const size_t length = LengthWithin(szInput, static_cast<size_t>(capacity) + 1);
    char *utf8 = static_cast<char *>(malloc(length * 3 + 1));
    if (utf8 == nullptr) {
        TRACE_HIGH("VarnekPGL_ConvertLatin15toUTF8: memalloc failed  !\n");
        return FALSE;
    }
    TRACE_LOW_QUICK("VarnekPGL_ConvertLatin15toUTF8: szInputSize is %d\t!\n",
                    static_cast<int>(szInputSize));
    if (length > static_cast<size_t>(capacity)) {
        free(utf8);
        ReportTooLong();
        TRACE_HIGH("VarnekPGL_ConvertLatin15toUTF8: WmConvertLatin15Code2PCode. ERROR  !\n");
        return FALSE;
    }
    // The direct conversion does both steps without storing the units.
    char *end = PutLatin15(utf8, reinterpret_cast<const unsigned char *>(szInput), length);
    *end = '\0';
    TRACE_LOW_QUICK("VarnekPGL_ConvertLatin15toUTF8: Convert String => %s !\n", utf8);
    const size_t textlen = static_cast<size_t>(end - utf8);
    if (textlen == 0) {
        free(utf8);
        return TRUE;
    }
    TRACE_LOW_QUICK("VarnekPGL_ConvertLatin15toUTF8:textlen = %d !\n",
                    static_cast<int>(textlen + 1));
    char *text = static_cast<char *>(malloc(textlen + 1));
    if (text == nullptr) {
        free(utf8);
        TRACE_HIGH("VarnekPGL_ConvertLatin15toUTF8: memalloc failed  !\n");
        return FALSE;
    }
    memcpy(text, utf8, textlen + 1);
    free(utf8);
    free(*outputData);
    *outputData = text;
    TRACE_LOW_QUICK("VarnekPGL_ConvertLatin15toUTF8 : VarnekPGL_Strlen(*outputData) = %d !\n",
                    static_cast<int>(textlen));
    return TRUE;
}
