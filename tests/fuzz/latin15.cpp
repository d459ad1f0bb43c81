// Latin-15 to UTF-8, against the code chart of ISO/IEC 8859-15.
#include <algorithm>
#include <cstring>

#include "Fuzz.h"
#include "Varnek_LngPack.h"

namespace {

// Controls go, and a no-break space becomes a space.
std::string Utf8Of(uint8_t byte) {
    switch (byte) {
        case 0xA0:
            return " ";
        case 0xA4:
            return "\u20AC";
        case 0xA6:
            return "\u0160";
        case 0xA8:
            return "\u0161";
        case 0xB4:
            return "\u017D";
        case 0xB8:
            return "\u017E";
        case 0xBC:
            return "\u0152";
        case 0xBD:
            return "\u0153";
        case 0xBE:
            return "\u0178";
        default:
            break;
    }
    if (byte < 0x20 || (byte >= 0x7F && byte < 0xA0)) {
        return "";
    }
    return byte < 0x80 ? std::string(1, static_cast<char>(byte))
                       : std::string{static_cast<char>(0xC0 | byte >> 6), static_cast<char>(0x80 | (byte & 0x3F))};
}

}  // namespace

int LLVMFuzzerTestOneInput(const uint8_t *data, size_t size) {
    Input input(data, size);
    const unsigned int stated = input.Byte() == 0 ? UINT32_MAX : input.Byte();
    std::vector<char> latin = input.Text();
    const size_t length = latin.size() - 1;

    std::string expected;
    int kept = 0;
    for (size_t i = 0; i < length; ++i) {
        const std::string character = Utf8Of(static_cast<uint8_t>(latin[i]));
        expected += character;
        kept += character.empty() ? 0 : 1;
    }

    char *const before = strdup("before");
    char *text = before;
    const bool accepted = length <= uint64_t{3} * stated + 1;
    CHECK(VarnekPGL_ConvertLatin15toUTF8(&text, latin.data(), stated) == (accepted ? TRUE : FALSE));
    if (accepted && kept > 0) {
        CHECK(text == expected);
    } else {
        CHECK(text == before && strcmp(text, "before") == 0);
    }
    free(text);

    std::vector<unsigned short> units(length + 1);
    CHECK(WmConvertLatin15Code2PCode(units.data(), static_cast<int>(length) - 1, latin.data()) == FALSE);
    CHECK(WmConvertLatin15Code2PCode(units.data(), static_cast<int>(length), latin.data()) == TRUE);
    CHECK(WmStrlen(units.data()) == kept);
    return 0;
}
