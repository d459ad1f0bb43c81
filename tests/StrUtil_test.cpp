// The string helpers against the C library's, on random input, each result in a buffer of exactly
// the room it needs.
#include "Varnek_StrUtil.h"

#include <strings.h>

#include <cstdlib>
#include <cstring>
#include <memory>
#include <random>

#include "support/VarnekTest.h"

namespace {

std::mt19937 gRandom(10646);

int Pick(int low, int high) { return std::uniform_int_distribution<int>(low, high)(gRandom); }

std::string RandomText(const std::string &alphabet, int longest) {
    std::string text(static_cast<size_t>(Pick(0, longest)), ' ');
    for (char &c : text) {
        c = alphabet[static_cast<size_t>(Pick(0, static_cast<int>(alphabet.size()) - 1))];
    }
    return text;
}

// A copy whose bounds a sanitizer sees.
std::unique_ptr<char[]> Exact(const std::string &text) {
    std::unique_ptr<char[]> copy(new char[text.size() + 1]);
    memcpy(copy.get(), text.c_str(), text.size() + 1);
    return copy;
}

TEST(StrUtil, NumbersReadAsPrintfWritesThem) {
    const auto expect = [](auto *operation, auto value, uint32_t radix, const std::string &text) {
        const auto buffer = Exact(text);
        ASSERT_EQ(operation(value, buffer.get(), radix), buffer.get());
        ASSERT_EQ(buffer.get(), text) << radix;
    };
    for (int i = 0; i < 1000; ++i) {
        const uint32_t value =
            i < 3 ? 0x7FFFFFFFu + static_cast<uint32_t>(i) : static_cast<uint32_t>(gRandom()) >> i % 33 % 32;
        char upper[16], lower[16], digits[33];
        snprintf(upper, sizeof upper, "%X", value);
        snprintf(lower, sizeof lower, "%x", value);
        expect(VarnekPGL_Itoa, value, 10, std::to_string(value));
        expect(VarnekPGL_Itoa, value, 16, upper);
        expect(VarnekPGL_Ltoa, static_cast<int32_t>(value), 16, lower);
        expect(VarnekPGL_Ltoa, static_cast<int32_t>(value), 10, std::to_string(static_cast<int32_t>(value)));
        const int radix = i % 25 + 11;
        VarnekPGL_Ltoa(static_cast<int32_t>(value), digits, static_cast<uint32_t>(radix));
        ASSERT_EQ(strtoul(digits, nullptr, radix), value) << digits << " in " << radix;
    }
    expect(VarnekPGL_Itoa, 0xFFFFFFFFu, 2, std::string(32, '1'));
    expect(VarnekPGL_Ltoa, 0, 36, "0");
    expect(VarnekPGL_Itoa, 35u, 17, "");
    for (const uint32_t radix : {0u, 1u, 37u}) {
        expect(VarnekPGL_Itoa, 35u, radix, "");
        expect(VarnekPGL_Ltoa, -35, radix, "");
    }
}

TEST(StrUtil, CaseDoesNotMatter) {
    for (int i = 0; i < 20000; ++i) {
        const auto a = Exact(RandomText("aAbB[\xE9", 6)), b = Exact(RandomText("aAbB[\xE9", 3));
        const uint32_t count = static_cast<uint32_t>(Pick(0, 7));
        ASSERT_EQ(VarnekPGL_Stristr(a.get(), b.get()), strcasestr(a.get(), b.get()));
        ASSERT_EQ(VarnekPGL_Stricmp(a.get(), b.get()), strcasecmp(a.get(), b.get()));
        ASSERT_EQ(VarnekPGL_Strnicmp(a.get(), b.get(), count) > 0, strncasecmp(a.get(), b.get(), count) > 0);
    }
    EXPECT_EQ(VarnekPGL_Stricmp("\xFF", "Z"), 255 - 'z');
    EXPECT_EQ(VarnekPGL_Stricmp(nullptr, "a"), -'a');
    EXPECT_EQ(VarnekPGL_Stristr(nullptr, "a"), nullptr);
    EXPECT_EQ(VarnekPGL_Itoa(1, nullptr, 10), nullptr);
    EXPECT_EQ(VarnekPGL_Ltoa(1, nullptr, 10), nullptr);
    EXPECT_EQ(VarnekPGL_Strmcpy(nullptr, "a", 0, 1), nullptr);
    VarnekPGL_Strtrim(nullptr);
}

TEST(StrUtil, SubstringsArePaddedAndNeverOverrun) {
    for (int i = 0; i < 5000; ++i) {
        const std::string text = RandomText("abc", 8);
        const int start = Pick(-2, 9), count = Pick(-1, 12);
        const size_t from = static_cast<size_t>(std::max(start, 0));
        const bool beyond = count > 0 && from > text.size();
        std::string room(static_cast<size_t>(std::max(count, 1)), '#'), expected = room;
        if (!beyond) {
            const std::string part = count < 1 ? "" : text.substr(from, room.size());
            strncpy(expected.data(), part.data(), count < 1 ? 1 : room.size());
        }
        const auto source = Exact(text), destination = Exact(room);
        const char *result = VarnekPGL_Strmcpy(destination.get(), source.get(), start, count);
        ASSERT_EQ(std::string(destination.get(), room.size() + 1), expected + '\0');
        ASSERT_TRUE(result == destination.get() ? !beyond : beyond && *result == '\0');
    }
}

TEST(StrUtil, CaseAndBlanksChangeInPlace) {
    const char *blanks = " \t\n\v\f\r";
    for (int i = 0; i < 5000; ++i) {
        const std::string before = RandomText(" \t\n\v\f\r\b\x0E\xA0@aAzZ[`{\xE9", 6);
        const std::string head = before.substr(0, before.find_last_not_of(blanks) + 1);
        const auto right = Exact(before), both = Exact(before), text = Exact(before);
        VarnekPGL_Strrtrim(right.get());
        VarnekPGL_Strtrim(both.get());
        ASSERT_EQ(right.get(), head);
        ASSERT_EQ(both.get(), head.empty() ? head : head.substr(head.find_first_not_of(blanks)));
        std::string upper = before, lower = before;
        std::transform(before.begin(), before.end(), upper.begin(), toupper);
        std::transform(before.begin(), before.end(), lower.begin(), tolower);
        ASSERT_EQ(VarnekPGL_Strupr(text.get()), upper);
        ASSERT_EQ(VarnekPGL_Strlwr(text.get()), lower);
    }
}

}  // namespace
