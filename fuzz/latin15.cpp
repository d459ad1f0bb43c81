// Latin-15 to UTF-8, against the C library's own conversion of it.
#include <iconv.h>

#include <algorithm>
#include <cstring>

#include "Fuzz.h"
#include "Varnek_LngPack.h"

int LLVMFuzzerTestOneInput(const uint8_t *data, size_t size) {
    static iconv_t converter = iconv_open("UTF-8", "ISO-8859-15");
    CHECK(reinterpret_cast<intptr_t>(converter) != -1);
    Input input(data, size);
    const unsigned int stated = input.Byte() == 0 ? UINT32_MAX : input.Byte();
    std::vector<char> latin = input.Text();
    const size_t length = latin.size() - 1;

    // Controls go, and a no-break space becomes a space.
    std::vector<char> kept;
    std::copy_if(latin.begin(), latin.end() - 1, std::back_inserter(kept), [](char c) {
        const int byte = static_cast<unsigned char>(c);
        return byte >= 0xA0 || (byte >= 0x20 && byte < 0x7F);
    });
    std::replace(kept.begin(), kept.end(), '\xA0', ' ');
    std::vector<char> expected(kept.size() * 3 + 1);
    char *from = kept.data();
    char *to = expected.data();
    size_t fromLeft = kept.size();
    size_t toLeft = expected.size();
    CHECK(iconv(converter, &from, &fromLeft, &to, &toLeft) == 0 && fromLeft == 0);

    char *const before = strdup("before");
    char *text = before;
    const bool accepted = length <= uint64_t{3} * stated + 1;
    CHECK(VarnekPGL_ConvertLatin15toUTF8(&text, latin.data(), stated) == (accepted ? TRUE : FALSE));
    if (accepted && !kept.empty()) {
        CHECK(strcmp(text, expected.data()) == 0);
    } else {
        CHECK(text == before && strcmp(text, "before") == 0);
    }
    free(text);

    std::vector<unsigned short> units(length + 1);
    CHECK(WmConvertLatin15Code2PCode(units.data(), static_cast<int>(length) - 1, latin.data()) == FALSE);
    CHECK(WmConvertLatin15Code2PCode(units.data(), static_cast<int>(length), latin.data()) == TRUE);
    CHECK(WmStrlen(units.data()) == static_cast<int>(kept.size()));
    return 0;
}
