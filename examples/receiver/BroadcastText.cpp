// The library converts characters; this file handles the selector of their table, control
// functions, and characters that those conversions do not support.
#include "BroadcastText.h"

#include <algorithm>
#include <cstdlib>
#include <cstring>
#include <vector>

#include "Varnek_LngPack.h"

namespace receiver {
namespace {

using Units = std::vector<unsigned short>;

constexpr unsigned char kSelectLatin5 = 0x05;
constexpr unsigned char kSelectNumbered = 0x10;  // a part of ISO/IEC 8859 follows in two bytes
constexpr unsigned char kSelectUnicode = 0x11;
constexpr unsigned char kSelectUtf8 = 0x15;
constexpr unsigned char kSelectEncoding = 0x1F;  // the encoding's number follows in one byte

// Returns the size of a DVB selector; 0 if the text begins with none.
size_t SelectorSize(const std::string &text) {
    const unsigned char first = static_cast<unsigned char>(text[0]);
    if (first == kSelectNumbered || first == kSelectEncoding) {
        return first == kSelectNumbered ? 3 : 2;
    }
    const bool part_of_8859 = first >= 0x01 && first <= 0x0B && first != 0x08;
    return part_of_8859 || (first >= kSelectUnicode && first <= kSelectUtf8) ? 1 : 0;
}

constexpr unsigned char kCarriageReturn = 0x0D;
constexpr unsigned char kLineFeed = 0x0A;
constexpr unsigned char kDvbBreak = 0x8A;        // in ISDB the same byte selects the normal size
constexpr unsigned short kDvbControls = 0xE000;  // plus the byte: a DVB control in wider tables
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
    return (static_cast<unsigned char>(c) & 0x7F) < 0x20;
}

// Returns the number of bytes of a control function of ISDB with its parameters. Each of these is a
// printable byte after any intermediate bytes; a byte that cannot be one cuts the function short.
size_t ControlSize(const std::string &text, size_t at) {
    static const struct {
        const char *controls;
        int parameters;
        unsigned char most;  // the largest intermediate byte; the least is 0x20
    } kWithParameters[] = {
        {"\x16\x19\x1D\x8B\x91\x93\x94\x97\x98", 1, 0},  // PAPF SS2 SS3 SZX FLC POL WMM HLC RPC
        {"\x1C", 2, 0},                                  // APS
        {"\x90\x92", 1, 0x20},                           // COL CDC
        {"\x1B", 1, 0x2F},                               // ESC
        {"\x9B\x9D", 1, 0x3F},                           // CSI TIME
    };
    if (text[at] == '\x95') {  // MACRO, whose definition ends with another one
        const size_t end = text.find("\x95\x4F", at);
        return end == std::string::npos ? 2 : end + 2 - at;
    }
    const auto is_within = [&](size_t i, unsigned char most) {
        return i < text.size() && text[i] >= 0x20 && static_cast<unsigned char>(text[i]) <= most;
    };
    size_t end = at + 1;
    for (const auto &row : kWithParameters) {
        const bool found = text[at] != 0 && std::strchr(row.controls, text[at]) != nullptr;
        for (int left = found ? row.parameters : 0; left > 0; --left) {
            while (is_within(end, row.most)) {
                ++end;
            }
            end += is_within(end, 0x7E) ? 1u : 0u;
        }
    }
    return end - at;
}

// Converts the text between control functions piece by piece, because the library's conversion
// drops line breaks too.
std::string FromLatin15(const std::string &text, bool dvb) {
    std::string result;
    for (size_t at = 0; at < text.size();) {
        const auto end =
            std::find_if(text.begin() + static_cast<std::ptrdiff_t>(at), text.end(), IsControl);
        const size_t next = static_cast<size_t>(end - text.begin());
        result += ConvertLatin15(text.substr(at, next - at));
        if (end == text.end()) {
            break;
        }
        const unsigned char control = static_cast<unsigned char>(*end);
        const bool pair =
            control == kCarriageReturn && next + 1 < text.size() && text[next + 1] == kLineFeed;
        const bool breaks =
            control == kCarriageReturn || control == kLineFeed || (dvb && control == kDvbBreak);
        result += breaks && !pair ? "\n" : "";
        at = next + (dvb ? 1 : ControlSize(text, next));
    }
    return result;
}

bool IsBreak(unsigned short unit) {
    return unit == kCarriageReturn || unit == kLineFeed || unit == kDvbControls + kDvbBreak;
}

// Whether a unit is a control character, including those that broadcasting has from U+E080 on.
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

// ISO/IEC 8859-9 differs from the first characters of Unicode in six letters.
std::string FromLatin5(const std::string &text) {
    Units units;
    for (const char c : text) {
        const auto byte = static_cast<unsigned char>(c);
        constexpr char kBytes[] = "\xD0\xDD\xDE\xF0\xFD\xFE";
        constexpr unsigned short kLetters[] = {0x011E, 0x0130, 0x015E, 0x011F, 0x0131, 0x015F};
        const char *found = c != 0 ? std::strchr(kBytes, c) : nullptr;
        const bool control = byte >= 0x80 && byte < 0xA0;
        units.push_back(found != nullptr
                            ? kLetters[found - kBytes]
                            : static_cast<unsigned short>(byte + (control ? kDvbControls : 0)));
    }
    return FromUnits(units);
}

std::string FromUnicode(const std::string &text) {
    Units units;
    for (size_t i = 0; i + 1 < text.size(); i += 2) {
        units.push_back(static_cast<unsigned short>(static_cast<unsigned char>(text[i]) << 8 |
                                                    static_cast<unsigned char>(text[i + 1])));
    }
    return FromUnits(units);
}

// Returns the number of bytes of the first character of a UTF-8 text, or of what could begin one.
//   valid  out: whether the character is well-formed
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

// Replaces malformed characters and those of four bytes, which the library's conversion would turn
// into other letters, with U+FFFD.
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
    const size_t selector = SelectorSize(bytes);
    const std::string text = bytes.substr(std::min(selector, bytes.size()));
    const unsigned char first = selector != 0 ? static_cast<unsigned char>(bytes[0]) : 0;
    const bool latin5 = first == kSelectLatin5 || bytes.compare(0, 3, "\x10\x00\x09", 3) == 0;
    return first == kSelectUnicode ? FromUnicode(text)
           : first == kSelectUtf8  ? FromUtf8(text)
           : latin5                ? FromLatin5(text)
                                   : FromLatin15(text, selector != 0);
}

}  // namespace receiver
