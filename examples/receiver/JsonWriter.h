// Writes JSON text (RFC 8259) to a file. Each member of the outermost object gets a line, and so
// does each element of an array in it.
#ifndef RECEIVER_JSONWRITER_H
#define RECEIVER_JSONWRITER_H

#include <cstdint>
#include <cstdio>
#include <optional>
#include <string>

namespace receiver {

class JsonWriter {
  public:
    explicit JsonWriter(std::FILE *out) : out_(out) {}

    // `key` is null for the elements of an array and for the outermost object.
    void BeginObject(const char *key) { Begin(key, '{'); }
    void EndObject() { End('}'); }
    void BeginArray(const char *key) { Begin(key, '['); }
    void EndArray() { End(']'); }
    // Text must be well-formed UTF-8.
    void Text(const char *key, const std::string &value);
    void Boolean(const char *key, bool value) { Literal(key, value ? "true" : "false"); }
    void Number(const char *key, int64_t value) { Literal(key, std::to_string(value)); }
    template <typename Integer>
    void Number(const char *key, const std::optional<Integer> &value) {
        Literal(key, value ? std::to_string(*value) : "null");
    }
    // Writes a number that is counted in thousandths.
    void Thousandths(const char *key, const std::optional<int64_t> &value);

  private:
    void Begin(const char *key, char open);
    void End(char close);
    void Member(const char *key);
    void Literal(const char *key, const std::string &text);
    void NewLine();
    void Quote(const std::string &text);
    bool OwnLines() const;

    std::FILE *out_;
    std::string open_;   // brackets that are open
    bool first_ = true;  // the innermost one is still empty
};

}  // namespace receiver

#endif
