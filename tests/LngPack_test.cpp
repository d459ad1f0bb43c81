// Text conversion: the code tables as text, the lengths of UTF-8, and malformed input. fuzz/utf8.cpp converts both
// ways.
#include "Varnek_LngPack.h"

#include <cstdlib>
#include <cstring>

#include "support/VarnekTest.h"

namespace {

using Units = std::vector<unsigned short>;

class LngPack : public VarnekTest {};

TEST_F(LngPack, Latin15BecomesUtf8) {
    std::string every;
    for (int byte = 1; byte < 256; ++byte) {
        every.push_back(static_cast<char>(byte));
    }
    char *text = strdup("a block of the caller");
    EXPECT_EQ(VarnekPGL_ConvertLatin15toUTF8(&text, every.c_str(), 255), TRUE);
    EXPECT_STREQ(text,
                 " !\"#$%&'()*+,-./0123456789:;<=>?@ABCDEFGHIJKLMNOPQRSTUVWXYZ[\\]^_"
                 "`abcdefghijklmnopqrstuvwxyz{|}~"
                 " ¡¢£€¥Š§š©ª«¬\u00AD®¯°±²³Žµ¶·ž¹º»ŒœŸ¿"
                 "ÀÁÂÃÄÅÆÇÈÉÊËÌÍÎÏÐÑÒÓÔÕÖ×ØÙÚÛÜÝÞßàáâãäåæçèéêëìíîïðñòóôõö÷øùúûüýþÿ");
    NOTE(VarnekPGL_ConvertLatin15toUTF8)(&text, "caf\xE9", 4);
    // The text stays when there is nothing to convert, or far more than stated.
    EXPECT_EQ(VarnekPGL_ConvertLatin15toUTF8(&text, "", 0), TRUE);
    EXPECT_EQ(VarnekPGL_ConvertLatin15toUTF8(&text, "\x09\x0A\x1B\x7F\x85", 5), TRUE);
    NOTE(VarnekPGL_ConvertLatin15toUTF8)(&text, "12345", 1);
    EXPECT_STREQ(text, "café");
    // A little more than the stated length is accepted, and so is the largest stated length.
    EXPECT_EQ(VarnekPGL_ConvertLatin15toUTF8(&text, "\xA4\xA4\xA4\xA4", 1), TRUE);
    EXPECT_STREQ(text, "€€€€");
    EXPECT_EQ(VarnekPGL_ConvertLatin15toUTF8(&text, "\xA4", UINT32_MAX), TRUE);
    EXPECT_STREQ(text, "€");
    const std::string much(5000, '\xA4');
    EXPECT_EQ(VarnekPGL_ConvertLatin15toUTF8(&text, much.c_str(), 5000), TRUE);
    EXPECT_EQ(strlen(text), 15000u);
    // A character of two bytes and one that is left out, at each place in a run of ASCII.
    for (size_t at = 0; at < 20; ++at) {
        std::string latin(22, 'a'), utf8(20, 'a');
        latin.replace(at, 2, "\xE9\x1B");
        utf8.replace(at, 1, "é");
        EXPECT_EQ(VarnekPGL_ConvertLatin15toUTF8(&text, latin.c_str(), 22), TRUE);
        EXPECT_EQ(text, utf8 + "a");
        Units units(22), expected(21, 'a');
        expected[at] = 0xE9;
        expected.push_back(0);
        EXPECT_EQ(WmConvertLatin15Code2PCode(units.data(), 22, latin.c_str()), TRUE);
        EXPECT_EQ(units, expected);
    }
    free(text);
}

TEST_F(LngPack, UnitsSurviveUtf8) {
    const Units edges = {0x7F, 0x80, 0x7FF, 0x800, 0xD800, 0xFFFF, 0};
    char utf8[32];
    EXPECT_EQ(__WmLngUnicode2UTF(utf8, edges.data(), 9), 14);
    EXPECT_STREQ(utf8, "\x7F\xC2\x80\xDF\xBF\xE0\xA0\x80\xED\xA0\x80\xEF\xBF\xBF");
    Units back(edges.size());
    EXPECT_EQ(WmConvertUTF2PCode(back.data(), 14, utf8, 14), TRUE);
    EXPECT_EQ(back, edges);
    EXPECT_EQ(__WmLngUnicode2UTF(utf8, edges.data(), 2), 3);
    EXPECT_EQ(__WmLngUnicode2UTF(utf8, edges.data(), -1), 0);
}

TEST_F(LngPack, MalformedUtf8IsDecodedByteByByte) {
    const struct {
        std::string utf8;
        Units units;
        size_t incorrect;  // how often a byte is out of range
    } rows[] = {
        {"\xA9", {0x29}, 1},
        {"\xF0\x9F\x98\x80", {0x07D8, 0}, 1},
        {"a\xC2\xA0\xC2\xE0", {'a', ' ', 0xA0}, 0},
        {"\xE2\x82", {0x62, 0x02}, 2},
        {"\xDF", {0x5F}, 1},
        {"\xE2\x82zz", {0x62, 0x02, 'z', 'z'}, 2},
        {std::string("\xE2\x82\0\x80", 4), {0x62, 0x02}, 2},
        {std::string("a\0b", 3), {'a'}, 0},
    };
    for (auto [utf8, expected, incorrect] : rows) {
        std::vector<std::string> lines(incorrect, "__WmLngStrlenByByte: utf8 incorrect range!\n");
        lines.resize(incorrect * 2, "__WmLngUTF2Unicode: utf8 incorrect range!\n");
        expected.push_back(0);
        Units units(expected.size(), 0x5555);
        const int room = static_cast<int>(expected.size() * 2);
        const std::vector<char> exact(utf8.begin(), utf8.end());  // no terminator follows
        EXPECT_EQ(WmConvertUTF2PCode(units.data(), room, exact.data(), static_cast<int>(utf8.size())), TRUE);
        EXPECT_EQ(units, expected);
        EXPECT_EQ(TakeBodies("SBTVD_COM"), lines);
    }
}

TEST_F(LngPack, FailuresAreNamed) {
    const unsigned short abc[] = {'a', 'b', 'c', 0};
    unsigned short units[8];
    char bytes[8] = "before";
    char *text = nullptr;
    NOTE(WmConvertLatin15Code2PCode)(nullptr, 4, "a");
    NOTE(WmConvertLatin15Code2PCode)(units, 4, "12345");
    EXPECT_EQ(WmConvertLatin15Code2PCode(units, 5, "12345"), TRUE);
    NOTE(__WmLngUnicode2UTF)(nullptr, abc, 3);
    NOTE(__WmLngUnicode2UTF)(bytes, nullptr, 3);
    NOTE(__WmLngUnicode2UTF)(bytes, abc, 0);
    EXPECT_EQ(WmConvertPCode2UTF(bytes, abc, 0), TRUE);
    EXPECT_STREQ(bytes, "");
    NOTE(WmConvert2LCode)(bytes, nullptr);
    TakeLog();
    EXPECT_EQ(WmConvert2LCode(nullptr, abc + 3), FALSE);
    EXPECT_EQ(TakeBodies()[0], "WmConvertPCode2UTF : pszOutText - null  !!");
    NOTE(__WmLngUTF2Unicode)(nullptr, "a", 1);
    NOTE(__WmLngUTF2Unicode)(units, nullptr, 1);
    NOTE(WmConvertUTF2PCode)(nullptr, 8, "a", 1);
    NOTE(WmConvertUTF2PCode)(units, 8, nullptr, 1);
    NOTE(WmConvertUTF2PCode)(units, 4, "abc", 3);
    NOTE(WmConvertUTF2PCode)(units, 6, "abc", 3);
    EXPECT_EQ(WmConvertUTF2PCode(units, 0, "abc", 0), TRUE);
    EXPECT_EQ(units[0], 0);
    EXPECT_EQ(__WmLngStrlenByByte("abc", 0), 2);
    NOTE(VarnekPGL_ConvertLatin15toUTF8)(&text, nullptr, 1);
}

}  // namespace
