// The helpers for NUL-terminated strings, compared with the C and C++ libraries. Texts are in blocks of exactly their
// size.
#include <algorithm>
#include <cstring>
#include <string>

#include "Fuzz.h"
#include "Varnek_StrUtil.h"

namespace {

constexpr char kBlanks[] = "\t\n\v\f\r ";

int Sign(int value) { return (value > 0) - (value < 0); }

void CheckNumber(uint32_t value, uint32_t radix) {
    char text[33];
    CHECK(VarnekPGL_Itoa(value, text, radix) == text);
    const int base = static_cast<int>(radix);
    CHECK(radix < 2 || radix > 16 ? text[0] == '\0' : strtoull(text, nullptr, base) == value);
    CHECK(std::none_of(text, text + strlen(text), islower));
    const int32_t number = static_cast<int32_t>(value);
    const int64_t expected = radix == 10 ? int64_t{number} : int64_t{value};
    CHECK(VarnekPGL_Ltoa(number, text, radix) == text);
    CHECK(radix < 2 || radix > 36 ? text[0] == '\0' : strtoll(text, nullptr, base) == expected);
    CHECK(std::none_of(text, text + strlen(text), isupper));
}

void CheckPart(const std::string &source, const char *exact, int32_t start, int32_t count) {
    std::vector<char> part(static_cast<size_t>(std::max(count, 1)), '#');
    const char *result = VarnekPGL_Strmcpy(part.data(), exact, start, count);
    if (count >= 1 && start > static_cast<int32_t>(source.size())) {
        CHECK(result != part.data() && *result == '\0' && part[0] == '#');
        return;
    }
    std::string expected = count < 1 ? "" : source.substr(start < 1 ? 0 : static_cast<size_t>(start), part.size());
    expected.resize(part.size());
    CHECK(result == part.data() && expected == std::string(part.begin(), part.end()));
}

}  // namespace

int LLVMFuzzerTestOneInput(const uint8_t *data, size_t size) {
    Input input(data, size);
    const uint8_t radix = input.Byte();
    const uint32_t value = uint32_t{input.Byte()} << 24 | static_cast<uint32_t>(input.Int());
    const int32_t start = input.Int();
    const int32_t count = input.Int() % 4096;
    std::vector<char> exactA = input.Text();
    std::vector<char> exactB = input.Text();
    const std::string a = exactA.data();
    const std::string b = exactB.data();

    CheckNumber(value, radix % 40);
    CheckPart(a, exactA.data(), start, count);

    CHECK(VarnekPGL_Stristr(exactA.data(), exactB.data()) == strcasestr(exactA.data(), exactB.data()));
    CHECK(Sign(VarnekPGL_Stricmp(exactA.data(), exactB.data())) == Sign(strcasecmp(a.c_str(), b.c_str())));
    CHECK(Sign(VarnekPGL_Strnicmp(exactA.data(), exactB.data(), radix)) ==
          Sign(strncasecmp(a.c_str(), b.c_str(), radix)));

    const auto edited = [&exactA](auto edit) {
        std::vector<char> text = exactA;
        edit(text.data());
        return std::string(text.data());
    };
    std::string upper = a, lower = a;
    std::transform(a.begin(), a.end(), upper.begin(), toupper);
    std::transform(a.begin(), a.end(), lower.begin(), tolower);
    CHECK(edited(VarnekPGL_Strupr) == upper && edited(VarnekPGL_Strlwr) == lower);
    const std::string right = a.substr(0, a.find_last_not_of(kBlanks) + 1);
    CHECK(edited(VarnekPGL_Strrtrim) == right);
    CHECK(edited(VarnekPGL_Strtrim) == right.substr(std::min(right.find_first_not_of(kBlanks), right.size())));
    return 0;
}
