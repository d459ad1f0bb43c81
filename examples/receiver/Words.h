// Names for the codes in tables and descriptors.
#ifndef RECEIVER_WORDS_H
#define RECEIVER_WORDS_H

#include <cstdint>
#include <string>

#include "Code.h"
#include "Events.h"
#include "Model.h"

namespace receiver {

// printf for short texts of bounded size.
std::string Format(const char *format, ...) __attribute__((format(printf, 1, 2)));

// Names a PID whose content does not depend on the stream; empty for others.
std::string NameOfPid(uint16_t pid);
std::string NameOfTable(uint8_t table_id);
std::string NameOfServiceType(uint8_t type);
// Names a component by its stream_type and descriptors, with the languages of audio.
std::string NameOfComponent(const Component &component);
// Gives "1/16", for example; empty for a code beyond two bits.
std::string NameOfGuardInterval(uint8_t code);
// Names the first level of a genre, in Brazil and where EN 300 468 holds. Other nations with ISDB-T
// have genres of their own, which are shown as numbers.
std::string NameOfGenre(uint8_t genre, const Code &nation);
// Gives the age from which an event is suitable and, in Brazil, the content that led to it.
std::string NameOfRating(const Rating &rating);

// Gives the language of a nation's events; empty for nations without ISDB-T.
Code LanguageOf(const Code &nation);

constexpr Code kBrazil = Code::Of("BRA");

}  // namespace receiver

#endif
