// The string helpers with null. fuzz/string_helpers.cpp compares them with the C library.
#include "Varnek_StrUtil.h"

#include "support/VarnekTest.h"

namespace {

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
