// A name that the stream gives to something, held in the library's string.
#ifndef RECEIVER_NAME_H
#define RECEIVER_NAME_H

#include <memory>
#include <string>

#include "Varnek_CString.h"

namespace receiver {

class Name {
  public:
    Name() = default;
    Name(const std::string &text) : text_(text.c_str()) {}  // a name is its text

    // Empty also when there was no memory for it.
    std::string Text() const {
        const std::unique_ptr<char[]> copy(text_.String());
        return copy != nullptr ? copy.get() : "";
    }

  private:
    VarnekCString text_{""};
};

}  // namespace receiver

#endif
