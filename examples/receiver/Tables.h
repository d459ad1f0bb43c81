// Parses the sections of program and service information tables.
#ifndef RECEIVER_TABLES_H
#define RECEIVER_TABLES_H

#include <cstddef>
#include <cstdint>
#include <vector>

#include "FieldReader.h"
#include "Model.h"

namespace receiver {

// The fields that follow section_length in most tables.
struct SectionHeader {
    uint16_t extension;  // transport_stream_id, service_id, ...
    bool current;        // false if the section announces what will apply later
    uint8_t number;
    uint8_t last;
};

using Pat = std::vector<Program>;

// Reads the programs from a PAT section with a correct CRC, without the entry for the network.
//   returns  false when ReadHeader does
bool ParsePat(const unsigned char *section, size_t size, SectionHeader &header, Pat &pat);

// Reads a PMT from the fields that follow the header of its section. `pmt_pid` stays 0.
ProgramMap ParsePmt(FieldReader &fields);

// Reads the header of a section. `fields` then contains the fields between header and CRC.
//   returns  false when the section does not apply now, is too short, or has a number beyond that
//            of the last one
bool ReadHeader(FieldReader &fields, SectionHeader &header);

// Fills a model from sections, in the order of their arrival. Unknown tables are ignored. A loop
// that claims to be longer than its section ends with the section; that of a TOT is ignored.
class TableParser {
  public:
    // The model must outlive the parser. `language` is preferred for an event's texts.
    explicit TableParser(Model &model, Code language = {}) : model_(model), language_(language) {}

    // Parses a complete section with a correct CRC, or without one.
    void Push(uint16_t pid, const unsigned char *section, size_t size);

  private:
    void OnPat(const unsigned char *section, size_t size);
    void OnPmt(uint16_t pid, const SectionHeader &header, FieldReader &fields);
    void OnNit(const SectionHeader &header, FieldReader &fields);
    void OnSdt(const SectionHeader &header, FieldReader &fields);
    void OnEit(uint8_t table_id, const SectionHeader &header, FieldReader &fields);
    void OnTime(uint8_t table_id, FieldReader &fields);
    Event ReadEvent(FieldReader &fields) const;

    Model &model_;
    Code language_;
};

}  // namespace receiver

#endif
