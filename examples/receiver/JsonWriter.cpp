// Every value is written through Member, which handles commas, lines and keys.
#include "JsonWriter.h"

#include <cinttypes>

#include "Names.h"

namespace receiver {

void JsonWriter::Text(const char *key, const std::string &value) {
    Member(key);
    Quote(value);
}

void JsonWriter::Thousandths(const char *key, const std::optional<int64_t> &value) {
    Literal(key, value ? Format("%" PRId64 ".%03d", *value / 1000, static_cast<int>(*value % 1000))
                       : "null");
}

void JsonWriter::Literal(const char *key, const std::string &text) {
    Member(key);
    std::fputs(text.c_str(), out_);
}

void JsonWriter::Begin(const char *key, char open) {
    Member(key);
    std::fputc(open, out_);
    open_ += open;
    first_ = true;
}

void JsonWriter::End(char close) {
    const bool lines = OwnLines() && !first_;
    open_.pop_back();
    if (lines) {
        NewLine();
    }
    std::fputc(close, out_);
    first_ = false;
}

void JsonWriter::Member(const char *key) {
    if (!first_) {
        std::fputc(',', out_);
    }
    if (OwnLines()) {
        NewLine();
    } else if (!first_) {
        std::fputc(' ', out_);
    }
    first_ = false;
    if (key != nullptr) {
        Quote(key);
        std::fputs(": ", out_);
    }
}

void JsonWriter::NewLine() {
    std::fprintf(out_, "\n%*s", static_cast<int>(open_.size() * 2), "");
}

// Writes the text between two escapes in one piece.
void JsonWriter::Quote(const std::string &text) {
    std::fputc('"', out_);
    size_t plain = 0;  // start of the text that has not been written
    for (size_t i = 0; i < text.size(); ++i) {
        const unsigned char c = static_cast<unsigned char>(text[i]);
        if (c >= 0x20 && c != '"' && c != '\\') {
            continue;
        }
        std::fwrite(text.data() + plain, 1, i - plain, out_);
        plain = i + 1;
        if (c == '\n') {
            std::fputs("\\n", out_);
        } else if (c < 0x20) {
            std::fprintf(out_, "\\u%04x", static_cast<unsigned>(c));
        } else {
            std::fprintf(out_, "\\%c", c);
        }
    }
    std::fwrite(text.data() + plain, 1, text.size() - plain, out_);
    std::fputc('"', out_);
}

bool JsonWriter::OwnLines() const {
    return open_ == "{" || open_ == "{[";
}

}  // namespace receiver
