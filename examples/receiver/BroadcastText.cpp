// The conversions are the library's; here is what comes before them: the character table selector.
#include "BroadcastText.h"

#include <algorithm>
#include <cstdlib>
#include <vector>

#include "Varnek_LngPack.h"

namespace receiver {
namespace {

using Units = std::vector<unsigned short>;

constexpr unsigned char kFirstPrintable = 0x20;  // a text that begins below begins with a selector
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

std::string FromLatin15(std::string text) {
    // A zero byte is as empty as any other control character, and must not end the text.
    text.erase(std::remove(text.begin(), text.end(), '\0'), text.end());
    char *converted = nullptr;
    if (VarnekPGL_ConvertLatin15toUTF8(&converted, text.c_str(),
                                       static_cast<unsigned>(text.size())) == FALSE ||
        converted == nullptr) {
        return {};
    }
    std::string result = converted;
    std::free(converted);
    return result;
}

// Control characters, also those that broadcasting puts at U+E080, and half surrogates.
bool IsUnprintable(unsigned short unit) {
    return unit < 0x20 || (unit >= 0x7F && unit < 0xA0) || (unit >= 0xD800 && unit < 0xE000) ||
           (unit >= 0xE080 && unit < 0xE0A0);
}

std::string FromUnits(Units units) {
    units.erase(std::remove_if(units.begin(), units.end(), IsUnprintable), units.end());
    units.push_back(0);
    std::vector<char> text(units.size() * 3 + 1);
    return WmConvert2LCode(text.data(), units.data()) == FALSE ? std::string() : text.data();
}

std::string FromUnicode(const std::string &text) {
    Units units;
    for (size_t i = 0; i + 1 < text.size(); i += 2) {
        units.push_back(static_cast<unsigned short>(static_cast<unsigned char>(text[i]) << 8 |
                                                    static_cast<unsigned char>(text[i + 1])));
    }
    return FromUnits(std::move(units));
}

std::string FromUtf8(const std::string &text) {
    const int length = static_cast<int>(text.size());
    Units units(text.size() + 2);
    if (WmConvertUTF2PCode(units.data(), static_cast<int>(units.size() * sizeof units[0]),
                           text.c_str(), length) == FALSE) {
        return {};
    }
    return FromUnits(std::move(units));
}

}  // namespace

std::string ToUtf8(const std::string &bytes) {
    if (bytes.empty()) {
        return {};
    }
    const unsigned char first = static_cast<unsigned char>(bytes[0]);
    std::string text = bytes.substr(std::min(SelectorSize(first), bytes.size()));
    if (first == kSelectUnicode) {
        return FromUnicode(text);
    }
    return first == kSelectUtf8 ? FromUtf8(text) : FromLatin15(std::move(text));
}

}  // namespace receiver
