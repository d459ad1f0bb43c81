// Puts the sections of one PID together from the payloads of its packets.
#ifndef RECEIVER_SECTIONASSEMBLER_H
#define RECEIVER_SECTIONASSEMBLER_H

#include <cstddef>
#include <cstdint>
#include <functional>
#include <vector>

namespace receiver {

class SectionAssembler {
  public:
    // Called with a whole section, section_length + 3 bytes from its table_id on, valid during the
    // call. Its CRC has not been looked at.
    using Handler = std::function<void(const unsigned char *section, size_t size)>;

    // Takes the payload of the PID's next packet. `unit_start` is the packet's
    // payload_unit_start_indicator: the payload begins with a pointer_field.
    //   returns  the sections that were given up: cut short by the next one, or with a length that
    //            their table does not allow
    int Push(const unsigned char *payload, size_t size, bool unit_start, const Handler &handler);

    // Forgets the section in progress, because a packet is missing.
    //   returns  1 when there was one, else 0
    int Drop();

  private:
    const unsigned char *Take(const unsigned char *from, const unsigned char *end,
                              const Handler &handler, int &given_up);
    const unsigned char *Fill(const unsigned char *from, const unsigned char *end, size_t size);

    std::vector<unsigned char>
        section_;  // the section in progress, as far as it has come; empty: none
};

}  // namespace receiver

#endif
