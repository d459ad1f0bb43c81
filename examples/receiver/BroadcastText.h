// Converts the texts of service information to UTF-8.
#ifndef RECEIVER_BROADCASTTEXT_H
#define RECEIVER_BROADCASTTEXT_H

#include <string>

namespace receiver {

// Converts the text of a descriptor. It is ISO/IEC 8859-15, unless its first bytes select UTF-8 or
// 16-bit Unicode. Other selectors are skipped, and the rest is read as ISO/IEC 8859-15. Characters
// that are malformed or beyond 16 bits become U+FFFD. Line breaks of any kind become "\n".
//   returns  well-formed UTF-8 without other control characters
std::string ToUtf8(const std::string &bytes);

}  // namespace receiver

#endif
