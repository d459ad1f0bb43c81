// A section begins where a pointer_field says, or directly after another in the same packet. After
// anything that does not fit, the assembler waits for the next such place.
#include "SectionAssembler.h"

#include <algorithm>

#include "FieldReader.h"

namespace receiver {
namespace {

constexpr unsigned char kStuffing = 0xFF;
constexpr size_t kHeaderSize = 3;

// Returns the largest section_length of a table. Sections of program tables and most service
// information have at most 1024 bytes, those of events and private tables 4096.
uint16_t LargestLength(unsigned char table_id) {
    const bool program_table = table_id <= 0x03;
    const bool service_table = table_id >= 0x40 && table_id <= 0x4D;
    const bool time_table = table_id == 0x70 || table_id == 0x71 || table_id == 0x73;
    return program_table || service_table || time_table ? 1021 : 4093;
}

}  // namespace

int SectionAssembler::Push(const unsigned char *payload, size_t size, bool unit_start,
                           const Handler &handler) {
    const unsigned char *const end = payload + size;
    int given_up = 0;
    if (!unit_start) {
        if (!section_.empty()) {
            Take(payload, end, handler, given_up);
        }
        return given_up;
    }
    if (size == 0 || size_t{1} + payload[0] > size) {
        return Drop();
    }
    const unsigned char *start = payload + 1 + payload[0];
    if (!section_.empty()) {
        Take(payload + 1, start, handler, given_up);
        given_up += Drop();
    }
    while (start < end && *start != kStuffing) {
        start = Take(start, end, handler, given_up);
    }
    return given_up;
}

int SectionAssembler::Drop() {
    const int dropped = section_.empty() ? 0 : 1;
    section_.clear();
    return dropped;
}

// Appends to the unfinished section, and passes it on when it is complete.
//   returns  the end of the bytes used; `end` when the rest of the packet is invalid
const unsigned char *SectionAssembler::Take(const unsigned char *from, const unsigned char *end,
                                            const Handler &handler, int &given_up) {
    from = Fill(from, end, kHeaderSize);
    if (section_.size() < kHeaderSize) {
        return end;
    }
    FieldReader header(section_.data(), kHeaderSize);
    header.Skip(12);
    const uint16_t length = header.U16(12);
    if (length > LargestLength(section_[0])) {
        given_up += Drop();
        return end;
    }
    from = Fill(from, end, kHeaderSize + length);
    if (section_.size() < kHeaderSize + length) {
        return end;
    }
    handler(section_.data(), section_.size());
    section_.clear();
    return from;
}

// Appends bytes until the section has `size` bytes.
const unsigned char *SectionAssembler::Fill(const unsigned char *from, const unsigned char *end,
                                            size_t size) {
    if (section_.size() >= size) {
        return from;
    }
    const size_t count = std::min(size - section_.size(), static_cast<size_t>(end - from));
    section_.insert(section_.end(), from, from + count);
    return from + count;
}

}  // namespace receiver
