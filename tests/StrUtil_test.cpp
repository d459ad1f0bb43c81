// The string helpers' results for null, radixes and signs. A fuzz target, which runs as a test, compares the helpers
// with the C library.
#include "Varnek_StrUtil.h"

#include "support/VarnekTest.h"

namespace {

TEST(StrUtil, NumbersHaveTheDigitsOfTheirRadix) {
    const struct {
        bool hasSign;
        uint32_t value, radix;
        const char *text;
    } rows[] = {
        {false, 0, 10, "0"},
        {true, 0x80000000, 10, "-2147483648"},
        {true, 0xBEEF, 16, "beef"},
        {true, 0, 36, "0"},
        {false, 0xFFFFFFFF, 2, "11111111111111111111111111111111"},
    };
    for (const auto &row : rows) {
        char text[40] = "before";
        const char *result = row.hasSign ? VarnekPGL_Ltoa(static_cast<int32_t>(row.value), text, row.radix)
                                         : VarnekPGL_Itoa(row.value, text, row.radix);
        EXPECT_EQ(result, text);
        EXPECT_STREQ(text, row.text) << row.value << " in " << row.radix;
    }
}

TEST(StrUtil, NullIsAccepted) {
    EXPECT_EQ(VarnekPGL_Stricmp("\xFF", "Z"), 255 - 'z');
    EXPECT_EQ(VarnekPGL_Stricmp(nullptr, "a"), -'a');
    EXPECT_EQ(VarnekPGL_Stristr(nullptr, "a"), nullptr);
    EXPECT_EQ(VarnekPGL_Itoa(1, nullptr, 10), nullptr);
    EXPECT_EQ(VarnekPGL_Ltoa(1, nullptr, 10), nullptr);
    EXPECT_EQ(VarnekPGL_Strmcpy(nullptr, "a", 0, 1), nullptr);
    VarnekPGL_Strtrim(nullptr);
}

}  // namespace
