// Every value goes through Member, which knows about commas, lines and keys.
#include "JsonWriter.h"

#include <cstdio>

namespace receiver {

void JsonWriter::Text(const char *key, const std::string &value) {
    Member(key);
    Quote(value);
}

void JsonWriter::Number(const char *key, int64_t value) {
    Member(key);
    out_ += std::to_string(value);
}

void JsonWriter::Boolean(const char *key, bool value) {
    Member(key);
    out_ += value ? "true" : "false";
}

void JsonWriter::Begin(const char *key, char open) {
    Member(key);
    out_ += open;
    open_ += open;
    first_ = true;
}

void JsonWriter::End(char close) {
    const bool lines = OwnLines() && !first_;
    open_.pop_back();
    if (lines) {
        out_ += '\n' + std::string(open_.size() * 2, ' ');
    }
    out_ += close;
    first_ = false;
}

void JsonWriter::Member(const char *key) {
    if (!first_) {
        out_ += ',';
    }
    if (OwnLines()) {
        out_ += '\n' + std::string(open_.size() * 2, ' ');
    } else if (!first_) {
        out_ += ' ';
    }
    first_ = false;
    if (key != nullptr) {
        Quote(key);
        out_ += ": ";
    }
}

void JsonWriter::Quote(const std::string &text) {
    out_ += '"';
    for (const char c : text) {
        if (static_cast<unsigned char>(c) < 0x20) {
            char escape[8];
            std::snprintf(escape, sizeof escape, "\\u%04x", static_cast<unsigned>(c));
            out_ += escape;
            continue;
        }
        if (c == '"' || c == '\\') {
            out_ += '\\';
        }
        out_ += c;
    }
    out_ += '"';
}

bool JsonWriter::OwnLines() const {
    return open_ == "{" || open_ == "{[";
}

}  // namespace receiver
