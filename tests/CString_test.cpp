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
    std::mt19937 random(33);
    const std::string one = "One of two strings is NULL!\n";
    const char *const texts[] = {nullptr, "", "a", "ab", "\xFF", "abc"};
    VarnekCString strings[] = {nullptr, "", "a"};
    Text models[] = {Text(), "", "a"};
    for (int step = 0; step < 30000; ++step) {
        const size_t i = random() % 3, j = random() % 3;
        const char *const text = texts[random() % 6];
        const Text old = models[i], other = models[j], given = text != nullptr ? Text(text) : Text();
        Text next = old;
        std::vector<std::string> lines;
        const auto append = [&](const Text &tail, bool refused, const char *line) {
            refused ? lines.assign(2, line) : void(next = old.value_or("") + *tail);
        };
        const size_t kind = random() % 7;
        if (kind == 0) {
            strings[i] = text;
            next = given;
        } else if (kind == 1) {
            strings[i] = strings[j];
            next = other;
        } else if (kind == 2) {
            strings[i].SetMemAllocedString(NewArray(text));
            given ? void(next = given) : lines.push_back("Argument String is NULL!\n");
        } else if (kind == 3) {
            append(given, !given, "Adding String is NULL!\n");
            ASSERT_EQ(TextOf(strings[i] + text), next);
            strings[i] += text;
        } else if (kind == 4) {
            append(other, other.value_or("").empty(), "No String!\n");
            ASSERT_EQ(TextOf(strings[i] + strings[j]), next);
            strings[i] += strings[j];
        } else {
            const VarnekCString &a = strings[i], &b = strings[j];
            const int order = old && other ? strcmp(old->c_str(), other->c_str()) : 0;
            std::vector<int> expected = {old == other, 0, 0, 0, 0};
            if (old && other) {
                expected = {order == 0, order > 0, order < 0, order >= 0, order <= 0};
            } else {
                lines.assign(5, one);
                lines[0] = old || other ? one : "Two strings are NULL!\n";
            }
            ASSERT_EQ((std::vector<int>{a == b, a > b, a < b, a >= b, a <= b}), expected);
        }
        ASSERT_EQ(TextOf(strings[i]), models[i] = next) << step;
        ASSERT_EQ(TakeBodies(), lines) << step;
        if (next.value_or("").size() > 40) {
            strings[i] = nullptr;
            models[i].reset();
        }
    }
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
    EXPECT_THAT(TakeLog(), ::testing::IsEmpty());
    const VarnekCString null(nullptr);
    EXPECT_EQ((copy == null) + (copy < null), 0);
    const auto lines = TakeLog();
    EXPECT_EQ(lines[0].priority, 4) << "a comparison for equality traces null strings as High";
    EXPECT_EQ(lines[1].priority, 6) << "a comparison for order traces null strings as an Error";
}

}  // namespace
