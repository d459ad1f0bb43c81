// Converts the texts of service information to UTF-8.
#ifndef RECEIVER_BROADCASTTEXT_H
#define RECEIVER_BROADCASTTEXT_H

#include <string>

namespace receiver {

// Converts the text of a descriptor. A text of ISDB-Tb is ISO/IEC 8859-15 with the control
// functions of ARIB STD-B24, which are dropped with their parameters. A text of DVB may begin with
// a selector of UTF-8, 16-bit Unicode or ISO/IEC 8859-9; after any other selector it is read as
// ISO/IEC 8859-15. Characters that are malformed or beyond 16 bits become U+FFFD. Line breaks of
// any kind become "\n".
//   returns  well-formed UTF-8 without other control characters
std::string ToUtf8(const std::string &bytes);

}  // namespace receiver

#endif
