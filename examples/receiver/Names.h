// Names for the codes in tables and descriptors.
#ifndef RECEIVER_NAMES_H
#define RECEIVER_NAMES_H

#include <cstdint>
#include <string>

#include "Code.h"
#include "Events.h"
#include "Model.h"

namespace receiver {

// Works as printf, for short texts.
std::string Format(const char *format, ...) __attribute__((format(printf, 1, 2)));

// Returns the name of a PID with a fixed meaning; empty for others.
std::string NameOfPid(uint16_t pid);
std::string NameOfTable(uint8_t table_id);
std::string NameOfServiceType(uint8_t type);
// Returns what a component is for, such as "captions", "superimposed text", "AIT" or a kind of
// audio; empty if its codes do not say.
std::string RoleOfComponent(const Component &component);
// Returns a component's name by its stream_type and descriptors, with its languages.
std::string NameOfComponent(const Component &component);
// Returns "1/16", for example; empty for a code beyond two bits.
std::string NameOfGuardInterval(uint8_t code);
// Returns the name of a genre's first level, for Brazil and for nations that use EN 300 468. Other
// nations with ISDB-T have genres of their own, which are shown as numbers.
std::string NameOfGenre(uint8_t genre, const Code &nation);
// Returns the age from which an event is suitable and, in Brazil, why.
std::string NameOfRating(const Rating &rating);

// Returns the language of a nation's events; empty without ISDB-T.
Code LanguageOf(const Code &nation);

constexpr Code kBrazil = Code::Of("BRA");

}  // namespace receiver

#endif
