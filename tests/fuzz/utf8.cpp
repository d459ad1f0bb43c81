// UTF-8 to units and back: the units need exactly the room that was announced, and encoding and decoding them again
// changes nothing.
#include <algorithm>

#include "Fuzz.h"
#include "Varnek_LngPack.h"

namespace {

using Units = std::vector<unsigned short>;

// Decodes into a block of exactly the room that the text needs.
Units Decode(const char *text, int length) {
    const int room = __WmLngStrlenByByte(text, length);
    CHECK(room >= 2 && room % 2 == 0);
    Units units(static_cast<size_t>(room) / 2, 0x5555);
    if (length > 0) {
        CHECK(WmConvertUTF2PCode(units.data(), room - 1, text, length) == FALSE && units[0] == 0x5555);
    }
    CHECK(WmConvertUTF2PCode(units.data(), room, text, length) == TRUE && units.back() == 0);
    return units;
}

}  // namespace

int LLVMFuzzerTestOneInput(const uint8_t *data, size_t size) {
    const std::vector<char> text(data, data + size);
    const Units units = Decode(text.data() != nullptr ? text.data() : "", static_cast<int>(size));

    // An overlong form may decode to 0, where the text of units ends.
    const size_t length = static_cast<size_t>(WmStrlen(units.data()));
    CHECK(length < units.size());
    size_t bytes = 0;
    for (size_t i = 0; i < length; ++i) {
        bytes += units[i] < 0x80 ? 1u : units[i] < 0x800 ? 2u : 3u;
    }
    std::vector<char> utf8(bytes + 1, '#');
    CHECK(WmConvert2LCode(utf8.data(), units.data()) == TRUE);
    CHECK(std::find(utf8.begin(), utf8.end(), '\0') == utf8.end() - 1);
    if (length > 0) {
        std::vector<char> again(utf8.size());
        CHECK(__WmLngUnicode2UTF(again.data(), units.data(), static_cast<int>(length)) == static_cast<int>(bytes));
        CHECK(again == utf8);
    }

    Units expected(units.begin(), units.begin() + static_cast<std::ptrdiff_t>(length));
    std::replace(expected.begin(), expected.end(), 0xA0, 0x20);
    expected.push_back(0);
    const std::vector<char> exact(utf8.begin(), utf8.end() - 1);
    CHECK(Decode(exact.data() != nullptr ? exact.data() : "", static_cast<int>(bytes)) == expected);
    return 0;
}
