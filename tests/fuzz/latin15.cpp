// Latin-15 to UTF-8: a text is converted as its characters are, one by one. A test compares these with the chart.
#include <algorithm>
#include <cstring>

#include "Fuzz.h"
#include "Varnek_LngPack.h"

namespace {

// Empty for a character that is left out.
std::string Utf8Of(char latin) {
    const char single[] = {latin, '\0'};
    char *text = strdup("");
    CHECK(VarnekPGL_ConvertLatin15toUTF8(&text, single, 1) == TRUE);
    const std::string utf8 = text;
    free(text);
    return utf8;
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
        const std::string character = Utf8Of(latin[i]);
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
