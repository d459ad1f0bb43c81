// All output goes through Add, so no line can be too wide.
#include "Paragraphs.h"

#include <langinfo.h>

#include <algorithm>
#include <climits>
#include <cstring>
#include <cuchar>

namespace receiver {
namespace {

bool BeginsCharacter(char c) {
    return (static_cast<unsigned char>(c) & 0xC0) != 0x80;
}

// Returns the number of bytes of the next `count` characters, or of those that are left.
size_t BytesOf(const std::string &text, size_t from, size_t count) {
    size_t at = from;
    while (at < text.size()) {
        if (BeginsCharacter(text[at])) {
            if (count == 0) {
                break;
            }
            --count;
        }
        ++at;
    }
    return at - from;
}

// Converts well-formed UTF-8 to the encoding of the locale, in which '?' replaces what it lacks.
std::string InLocale(const std::string &text) {
    if (std::strcmp(nl_langinfo(CODESET), "UTF-8") == 0) {
        return text;
    }
    std::string converted;
    for (size_t at = 0; at < text.size();) {
        const size_t size = BytesOf(text, at, 1);
        char32_t character =
            static_cast<unsigned char>(text[at]) & (size == 1 ? 0x7Fu : 0xFFu >> (size + 1));
        for (size_t i = 1; i < size; ++i) {
            character = character << 6 | (static_cast<unsigned char>(text[at + i]) & 0x3Fu);
        }
        char bytes[MB_LEN_MAX];
        std::mbstate_t state{};
        const size_t length = std::c32rtomb(bytes, character, &state);
        converted.append(length <= sizeof bytes ? bytes : "?", length <= sizeof bytes ? length : 1);
        at += size;
    }
    return converted;
}

}  // namespace

size_t WidthOf(const std::string &text) {
    return static_cast<size_t>(std::count_if(text.begin(), text.end(), BeginsCharacter));
}

std::string Padded(const std::string &text, size_t width) {
    const size_t used = WidthOf(text);
    return used < width ? text + std::string(width - used, ' ') : text;
}

Paragraphs::Paragraphs(std::FILE *out, size_t width)
    : out_(out), width_(std::max(width, kLeastWidth)) {}

void Paragraphs::Add(const std::string &lead, const std::string &text) {
    std::string rest = text;
    std::replace(rest.begin(), rest.end(), '\n', ' ');
    const size_t indent = std::min(WidthOf(lead), width_ / 2);
    std::string line = lead;
    size_t room = width_ - WidthOf(lead);
    size_t at = 0;
    do {
        size_t count = BytesOf(rest, at, room);
        if (at + count < rest.size() && rest[at + count] != ' ') {
            const size_t blank = rest.rfind(' ', at + count);
            count = blank != std::string::npos && blank > at ? blank - at : count;
        }
        line.append(rest, at, count);
        line.erase(line.find_last_not_of(' ') + 1);
        std::fprintf(out_, "%s\n", InLocale(line).c_str());
        at = std::min(rest.find_first_not_of(' ', at + count), rest.size());
        line.assign(indent, ' ');
        room = width_ - indent;
    } while (at < rest.size());
}

void Paragraphs::AddList(const std::string &lead, const std::vector<std::string> &items) {
    const size_t room = width_ - WidthOf(lead);
    std::string margin = lead;
    std::string line;
    for (size_t i = 0; i < items.size(); ++i) {
        const std::string item = items[i] + (i + 1 < items.size() ? "," : "");
        if (!line.empty() && WidthOf(line) + 1 + WidthOf(item) > room) {
            Add(margin, line);
            margin.assign(WidthOf(lead), ' ');
            line.clear();
        }
        line += (line.empty() ? "" : " ") + item;
    }
    Add(margin, line);
}

}  // namespace receiver
