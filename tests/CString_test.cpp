// Compares the owning string with an optional std::string, and checks its memory.
#include "Varnek_CString.h"

#include <cstring>
#include <memory>
#include <optional>

#include "support/VarnekTest.h"

namespace {

class String : public VarnekTest {};

using Text = std::optional<std::string>;

Text TextOf(const VarnekCString &string) {
    const std::unique_ptr<char[]> copy(string.String());
    return copy != nullptr ? Text(copy.get()) : Text();
}

char *NewArray(const char *text) { return text != nullptr ? strcpy(new char[strlen(text) + 1], text) : nullptr; }

TEST_F(String, BehavesLikeAnOptionalText) {
    const char *const texts[] = {nullptr, "", "a", "ab", "\xFF"};
    for (const char *a : texts) {
        for (const char *b : texts) {
            const Text first = a != nullptr ? Text(a) : Text(), second = b != nullptr ? Text(b) : Text();
            const Text sum = second ? Text(first.value_or("") + *second) : first;
            const VarnekCString left(a), right(b);
            VarnekCString assigned(a), copied(a), owner(a), longer(a), joined(a);
            assigned = b;
            copied = right;
            owner.SetMemAllocedString(NewArray(b));
            longer += b;
            joined += right;
            EXPECT_EQ(TextOf(assigned), second);
            EXPECT_EQ(TextOf(copied), second);
            EXPECT_EQ(TextOf(owner), second ? second : first);
            EXPECT_EQ(TextOf(longer), sum);
            EXPECT_EQ(TextOf(left + b), sum);
            EXPECT_EQ(TextOf(joined), second == "" ? first : sum);
            EXPECT_EQ(TextOf(left + right), second == "" ? first : sum);
            std::vector<int> expected = {first == second, 0, 0, 0, 0};
            if (first && second) {
                const int order = strcmp(a, b);
                expected = {order == 0, order > 0, order < 0, order >= 0, order <= 0};
            }
            EXPECT_EQ((std::vector<int>{left == right, left > right, left < right, left >= right, left <= right}),
                      expected);
        }
    }
}

TEST_F(String, RefusalsHaveTheirLine) {
    VarnekCString null(nullptr), other(nullptr), text("text");
    Noting("null == null", [&] { return null == other; })();
    Noting("null == text", [&] { return null == text; })();
    Noting("text > null", [&] { return text > null; })();
    Noting("text < null", [&] { return text < null; })();
    Noting("null >= text", [&] { return null >= text; })();
    Noting("null <= null", [&] { return null <= other; })();
    Noting("text += null", [&] { text += null; })();
    Noting("text +=", [&](const char *tail) { text += tail; })(nullptr);
    Noting("SetMemAllocedString", [&](char *array) { text.SetMemAllocedString(array); })(nullptr);
    EXPECT_EQ(TextOf(text), Text("text"));
}

TEST_F(String, OwnsItsArrayAndNoOther) {
    char *const array = NewArray("text");
    VarnekCString string("before");
    string.SetMemAllocedString(array);
    array[0] = 'n';
    const VarnekCString copy(string);
    string.SetMemAllocedString(array);
    string = array + 1;
    EXPECT_EQ(TextOf(string), Text("ext"));
    EXPECT_EQ(TextOf(copy), Text("next"));
    string += string;
    EXPECT_EQ(TextOf(string), Text("extext"));
    EXPECT_THAT(TakeLog(), ::testing::IsEmpty());
}

}  // namespace
