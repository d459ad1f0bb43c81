// Texts of service information, shown in UTF-8.
#ifndef RECEIVER_BROADCASTTEXT_H
#define RECEIVER_BROADCASTTEXT_H

#include <string>

namespace receiver {

// Converts a text as a descriptor carries it. It is ISO/IEC 8859-15, unless its first bytes select
// UTF-8 or 16-bit Unicode; other selectors are skipped and the rest taken as ISO/IEC 8859-15.
// Characters beyond 16 bits and malformed ones become U+FFFD, line breaks of any kind "\n".
//   returns  well-formed UTF-8 without other control characters
std::string ToUtf8(const std::string &bytes);

}  // namespace receiver

#endif
