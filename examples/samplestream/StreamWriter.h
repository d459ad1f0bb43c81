// Writes tables, sections and packets of a transport stream, for the sample, tests and fuzz
// targets.
#ifndef SAMPLESTREAM_STREAMWRITER_H
#define SAMPLESTREAM_STREAMWRITER_H

#include <cstdint>
#include <map>
#include <string>
#include <utility>
#include <vector>

namespace streamwriter {

using Bytes = std::vector<unsigned char>;

Bytes operator+(Bytes left, const Bytes &right);

// Return a field, with the low bits of a value that is too large for it.
Bytes U8(unsigned value);
Bytes U16(unsigned value);
Bytes U24(unsigned value);
// Return the bytes of a text, and the same preceded by their number.
Bytes Raw(const std::string &text);
Bytes Counted(const std::string &text);
// Take seconds, and return them as a time of day or a duration of six decimal digits, and as a time
// of that form on a day.
Bytes Bcd(int seconds);
Bytes MakeDateTime(unsigned mjd, int seconds);
// Return a descriptor, and a loop preceded by its 12-bit length, with `flags` in the four bits
// above.
Bytes Descriptor(unsigned tag, const Bytes &body);
Bytes Loop(unsigned flags, const Bytes &content);

// Completes a section, whose bytes 1 and 2 contain the flags, with its length and its CRC.
Bytes Seal(Bytes section);

// The place of a section in its table, and the byte with version_number and current_next_indicator.
struct Place {
    unsigned number = 0;
    unsigned last = 0;
    unsigned version = 0xC1;
};
// Returns a section with the usual header.
Bytes MakeSection(unsigned table, unsigned extension, const Bytes &body, const Place &place = {});

// Return tables, or what their loops consist of, which may be concatenated with +.
Bytes MakePat(unsigned stream, const std::vector<std::pair<unsigned, unsigned>> &pids,
              const Place &place = {});  // by service_id
Bytes MakeComponent(unsigned stream_type, unsigned pid, const Bytes &descriptors = {});
Bytes MakePmt(unsigned service, unsigned pcr_pid, const Bytes &components,
              const Bytes &descriptors = {}, const Place &place = {});
Bytes MakeNit(unsigned network, unsigned stream, const Bytes &network_descriptors,
              const Bytes &stream_descriptors, const Place &place = {});
Bytes MakeService(unsigned service, const std::string &provider, const std::string &name);
Bytes MakeSdt(unsigned stream, const Bytes &services, const Place &place = {});
Bytes MakeShortEvent(const std::string &language, const std::string &name, const std::string &text);
// `status` contains running_status and free_CA_mode.
Bytes MakeEvent(unsigned id, const Bytes &start, const Bytes &duration, const Bytes &descriptors,
                unsigned status = 0);
Bytes MakeEit(unsigned table, unsigned service, unsigned stream, const Bytes &events,
              const Place &place = {});
// Returns the offset of a region in whole hours, without a change in the near future.
Bytes MakeLocalOffset(const std::string &country, unsigned region, int hours);
Bytes MakeTot(const Bytes &time, const Bytes &offsets);

// Header flags: the high byte belongs to byte 1 of a packet, the low byte to byte 3.
constexpr unsigned kTransportError = 0x8000;
constexpr unsigned kUnitStart = 0x4000;
constexpr unsigned kScrambled = 0x0080;
constexpr unsigned kAdaptation = 0x0020;
constexpr unsigned kPayload = 0x0010;

// Returns a packet of 188 bytes.
//   content  what follows the header, padded with 0xFF: if the flags announce one, an adaptation
//            field with its length, and then the payload
Bytes MakePacket(uint16_t pid, unsigned counter, const Bytes &content, unsigned flags = kPayload);

// The content of a packet, with the header flags that it needs.
struct Content {
    Bytes bytes;
    unsigned flags;
};

// Packs sections without gaps into as few packets as possible.
std::vector<Content> SplitSections(const std::vector<Bytes> &sections);

// A stream that grows packet by packet, with a continuity counter for each PID.
class StreamWriter {
  public:
    void Send(uint16_t pid, const Content &content);
    void SendSections(uint16_t pid, const std::vector<Bytes> &sections);
    const Bytes &Stream() const { return stream_; }

  private:
    Bytes stream_;
    std::map<uint16_t, unsigned> counters_;
};

}  // namespace streamwriter

#endif
