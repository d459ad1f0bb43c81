// Converts the texts of service information to UTF-8.
#ifndef RECEIVER_BROADCASTTEXT_H
#define RECEIVER_BROADCASTTEXT_H

#include <string>

namespace receiver {

// Converts the text of a descriptor, as README.md says under "Texts".
//   returns  well-formed UTF-8 without control characters other than "\n"
std::string ToUtf8(const std::string &bytes);

}  // namespace receiver

#endif
