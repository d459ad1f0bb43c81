// Text in lines of bounded width.
#ifndef RECEIVER_PARAGRAPHS_H
#define RECEIVER_PARAGRAPHS_H

#include <cstddef>
#include <cstdio>
#include <string>
#include <vector>

namespace receiver {

// Columns that a UTF-8 text takes, one for each character.
size_t WidthOf(const std::string &text);

// Fills a text up with blanks.
std::string Padded(const std::string &text, size_t width);

class Paragraphs {
  public:
    static constexpr size_t kUsualWidth = 80;
    static constexpr size_t kLeastWidth = 40;

    // A width below the least one counts as that.
    Paragraphs(std::FILE *out, size_t width);

    // Writes `text` behind `lead`, which is narrower than the least width. It is broken at blanks,
    // and words at the end of a line where they are too long for one; further lines begin where the
    // text began. Line breaks in it count as blanks.
    void Add(const std::string &lead, const std::string &text);
    // The same of items with commas between them, which are kept whole where they fit a line.
    void AddList(const std::string &lead, const std::vector<std::string> &items);
    void AddEmptyLine() { std::fputc('\n', out_); }

  private:
    std::FILE *out_;
    size_t width_;
};

}  // namespace receiver

#endif
