// A name from the stream, stored in the library's string.
#ifndef RECEIVER_NAME_H
#define RECEIVER_NAME_H

#include <memory>
#include <string>

#include "Varnek_CString.h"

namespace receiver {

class Name {
  public:
    Name() = default;
    Name(const std::string &text) : text_(text.c_str()) {}  // implicit on purpose

    // Also empty when there was no memory for the name.
    std::string Text() const {
        const std::unique_ptr<char[]> copy(text_.String());
        return copy != nullptr ? copy.get() : "";
    }

  private:
    VarnekCString text_{""};
};

}  // namespace receiver

#endif
