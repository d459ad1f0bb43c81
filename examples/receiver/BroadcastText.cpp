// The library converts the characters. This file handles the character table selector at the start,
// line breaks, and characters that the conversions do not support.
#include "BroadcastText.h"

#include <algorithm>
#include <cstdlib>
#include <vector>

#include "Varnek_LngPack.h"

namespace receiver {
namespace {

using Units = std::vector<unsigned short>;

constexpr unsigned char kFirstPrintable = 0x20;  // a lower first byte is a selector
constexpr unsigned char kSelectNumbered = 0x10;  // the table's number follows in two bytes
constexpr unsigned char kSelectUnicode = 0x11;
constexpr unsigned char kSelectUtf8 = 0x15;
constexpr unsigned char kSelectEncoding = 0x1F;  // the encoding's number follows in one byte

size_t SelectorSize(unsigned char first) {
    if (first >= kFirstPrintable) {
        return 0;
    }
    return first == kSelectNumbered ? 3 : first == kSelectEncoding ? 2 : 1;
}

constexpr unsigned char kCarriageReturn = 0x0D;
constexpr unsigned char kLineFeed = 0x0A;
constexpr unsigned char kBreak = 0x8A;  // the line break of broadcasting; U+E08A in Unicode
constexpr unsigned short kReplacement = 0xFFFD;

std::string ConvertLatin15(const std::string &line) {
    char *converted = nullptr;
    if (VarnekPGL_ConvertLatin15toUTF8(&converted, line.c_str(),
                                       static_cast<unsigned>(line.size())) == FALSE ||
        converted == nullptr) {
        return {};
    }
    std::string result = converted;
    std::free(converted);
    return result;
}

bool IsControl(char c) {
    return static_cast<unsigned char>(c) < 0x20 || static_cast<unsigned char>(c) == kBreak;
}

// Converts line by line, because the library's conversion drops control characters.
std::string FromLatin15(const std::string &text) {
    if (std::none_of(text.begin(), text.end(), IsControl)) {
        return ConvertLatin15(text);
    }
    std::string result;
    std::string line;
    for (size_t i = 0; i < text.size(); ++i) {
        const unsigned char byte = static_cast<unsigned char>(text[i]);
        const bool pair = byte == kCarriageReturn && i + 1 < text.size() && text[i + 1] == '\n';
        if (byte == 0 || pair) {
            continue;  // skips a zero byte, which would end the text, and the first of CR LF
        }
        if (byte == kCarriageReturn || byte == kLineFeed || byte == kBreak) {
            result += ConvertLatin15(line) + '\n';
            line.clear();
        } else {
            line += text[i];
        }
    }
    return result + ConvertLatin15(line);
}

bool IsBreak(unsigned short unit) {
    return unit == kCarriageReturn || unit == kLineFeed || unit == kBreak || unit == 0xE08A;
}

// Whether a unit is a control character, also one of those that broadcasting has from U+E080 on.
bool IsUnprintable(unsigned short unit) {
    return unit < 0x20 || (unit >= 0x7F && unit < 0xA0) || (unit >= 0xE080 && unit < 0xE0A0);
}

bool IsHighSurrogate(unsigned short unit) {
    return unit >= 0xD800 && unit < 0xDC00;
}

bool IsLowSurrogate(unsigned short unit) {
    return unit >= 0xDC00 && unit < 0xE000;
}

std::string FromUnits(const Units &units) {
    Units kept;
    for (size_t i = 0; i < units.size(); ++i) {
        const unsigned short unit = units[i];
        const unsigned short next = i + 1 < units.size() ? units[i + 1] : 0;
        if (IsBreak(unit)) {
            i += unit == kCarriageReturn && next == kLineFeed ? 1u : 0u;
            kept.push_back(kLineFeed);
        } else if (IsHighSurrogate(unit) || IsLowSurrogate(unit)) {
            i += IsHighSurrogate(unit) && IsLowSurrogate(next) ? 1u : 0u;
            kept.push_back(kReplacement);
        } else if (!IsUnprintable(unit)) {
            kept.push_back(unit);
        }
    }
    kept.push_back(0);
    std::vector<char> text(kept.size() * 3 + 1);
    return WmConvert2LCode(text.data(), kept.data()) == FALSE ? std::string() : text.data();
}

std::string FromUnicode(const std::string &text) {
    Units units;
    for (size_t i = 0; i + 1 < text.size(); i += 2) {
        units.push_back(static_cast<unsigned short>(static_cast<unsigned char>(text[i]) << 8 |
                                                    static_cast<unsigned char>(text[i + 1])));
    }
    return FromUnits(units);
}

// Returns the number of bytes of the first character of a UTF-8 text.
//   valid    out: whether it is well-formed
//   returns  for a malformed one, the number of bytes that could begin a character, at least 1
size_t MeasureCharacter(const unsigned char *text, size_t size, bool &valid) {
    const unsigned char lead = text[0];
    const size_t length = lead < 0x80 ? 1 : lead < 0xC2 ? 0 : lead < 0xE0 ? 2 : lead < 0xF0 ? 3 : 4;
    // The second byte shows overlong forms, surrogates and code points beyond Unicode.
    const unsigned char least = lead == 0xE0 ? 0xA0 : lead == 0xF0 ? 0x90 : 0x80;
    const unsigned char most = lead == 0xED ? 0x9F : lead == 0xF4 ? 0x8F : 0xBF;
    size_t count = 1;
    while (length > count && lead <= 0xF4 && count < size) {
        const unsigned char byte = text[count];
        if (byte < (count == 1 ? least : 0x80) || byte > (count == 1 ? most : 0xBF)) {
            break;
        }
        ++count;
    }
    valid = count == length;
    return count;
}

// Replaces malformed characters and those of four bytes with U+FFFD. The library's conversion does
// not support them and would return other letters.
std::string ReplaceMalformed(const std::string &text) {
    std::string result;
    for (size_t i = 0; i < text.size();) {
        bool valid = false;
        const auto *rest = reinterpret_cast<const unsigned char *>(text.data()) + i;
        const size_t count = MeasureCharacter(rest, text.size() - i, valid);
        if (!valid || count > 3) {
            result += "\xEF\xBF\xBD";
        } else if (*rest != 0) {  // a zero byte would end the text
            result.append(text, i, count);
        }
        i += count;
    }
    return result;
}

std::string FromUtf8(const std::string &bytes) {
    const std::string text = ReplaceMalformed(bytes);
    const int length = static_cast<int>(text.size());
    Units units(text.size() + 2);
    if (WmConvertUTF2PCode(units.data(), static_cast<int>(units.size() * sizeof units[0]),
                           text.c_str(), length) == FALSE) {
        return {};
    }
    units.resize(static_cast<size_t>(WmStrlen(units.data())));
    return FromUnits(units);
}

}  // namespace

std::string ToUtf8(const std::string &bytes) {
    if (bytes.empty()) {
        return {};
    }
    const unsigned char first = static_cast<unsigned char>(bytes[0]);
    const std::string text = bytes.substr(std::min(SelectorSize(first), bytes.size()));
    if (first == kSelectUnicode) {
        return FromUnicode(text);
    }
    return first == kSelectUtf8 ? FromUtf8(text) : FromLatin15(text);
}

}  // namespace receiver
