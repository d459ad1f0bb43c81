// Assembles the sections of one PID from the payloads of its packets.
#ifndef RECEIVER_SECTIONASSEMBLER_H
#define RECEIVER_SECTIONASSEMBLER_H

#include <cstddef>
#include <cstdint>
#include <functional>
#include <vector>

namespace receiver {

class SectionAssembler {
  public:
    // Called with a complete section, which is valid during the call. Its CRC is not checked.
    using Handler = std::function<void(const unsigned char *section, size_t size)>;

    // Processes the payload of the PID's next packet; with `unit_start`, the packet's
    // payload_unit_start_indicator, it begins with a pointer_field.
    //   returns  the number of abandoned sections, which the next one cut short or which are too
    //            long for their table
    int Push(const unsigned char *payload, size_t size, bool unit_start, const Handler &handler);

    // Drops the unfinished section, because a packet is missing.
    //   returns  1 if there was one, otherwise 0
    int Drop();

  private:
    const unsigned char *Take(const unsigned char *from, const unsigned char *end,
                              const Handler &handler, int &given_up);
    const unsigned char *Fill(const unsigned char *from, const unsigned char *end, size_t size);

    std::vector<unsigned char> section_;  // unfinished; empty for none
};

}  // namespace receiver

#endif
