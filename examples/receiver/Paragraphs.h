// Writes text in lines of limited width.
#ifndef RECEIVER_PARAGRAPHS_H
#define RECEIVER_PARAGRAPHS_H

#include <cstddef>
#include <cstdio>
#include <string>
#include <vector>

namespace receiver {

// Returns the number of columns of a UTF-8 text, one for each character.
size_t WidthOf(const std::string &text);

// Pads a text with spaces.
std::string Padded(const std::string &text, size_t width);

class Paragraphs {
  public:
    static constexpr size_t kUsualWidth = 80;
    static constexpr size_t kLeastWidth = 40;

    // A width below the minimum counts as the minimum.
    Paragraphs(std::FILE *out, size_t width);

    // Writes `text` after `lead`, which is narrower than the minimum width. Lines break at spaces,
    // or inside a word longer than a line, and are indented to the start of the text, but to half
    // the width at most. Line breaks in the text count as spaces.
    void Add(const std::string &lead, const std::string &text);
    // Writes items with commas between them, and breaks none that fits a line.
    void AddList(const std::string &lead, const std::vector<std::string> &items);
    void AddEmptyLine() { std::fputc('\n', out_); }

  private:
    std::FILE *out_;
    size_t width_;
};

}  // namespace receiver

#endif
