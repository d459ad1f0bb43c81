// Writes tables, sections and packets of a transport stream: for the sample program, and for tests
// and fuzz targets that need streams of their own.
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

// Fields; a value is cut to their width.
Bytes U8(unsigned value);
Bytes U16(unsigned value);
Bytes U24(unsigned value);
// A text's bytes; the same behind their number.
Bytes Raw(const std::string &text);
Bytes Counted(const std::string &text);
// A time of day or a duration as six decimal digits; a day with seconds from its beginning on.
Bytes Bcd(int seconds);
Bytes MakeDateTime(unsigned mjd, int seconds);
// A descriptor; a loop behind its 12-bit length, with `flags` in the four bits above.
Bytes Descriptor(unsigned tag, const Bytes &body);
Bytes Loop(unsigned flags, const Bytes &content);

// Gives a section, whose bytes 1 and 2 hold the flags above its length, that length and its CRC.
Bytes Seal(Bytes section);

// Where a section belongs: version is a byte with reserved bits, version_number and
// current_next_indicator.
struct Place {
    unsigned number = 0;
    unsigned last = 0;
    unsigned version = 0xC1;
};
// A section with the usual header.
Bytes MakeSection(unsigned table, unsigned extension, const Bytes &body, const Place &place = {});

// Tables. Their loops are made of entries, which may be added up.
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
// `status` is running_status and free_CA_mode.
Bytes MakeEvent(unsigned id, const Bytes &start, const Bytes &duration, const Bytes &descriptors,
                unsigned status = 0);
Bytes MakeEit(unsigned table, unsigned service, unsigned stream, const Bytes &events,
              const Place &place = {});
// The offset of a region in whole hours, without a change in sight.
Bytes MakeLocalOffset(const std::string &country, unsigned region, int hours);
Bytes MakeTot(const Bytes &time, const Bytes &offsets);

// Header flags: the high byte is that of byte 1 of a packet, the low byte that of byte 3.
constexpr unsigned kTransportError = 0x8000;
constexpr unsigned kUnitStart = 0x4000;
constexpr unsigned kScrambled = 0x0080;
constexpr unsigned kAdaptation = 0x0020;
constexpr unsigned kPayload = 0x0010;

// A packet of 188 bytes.
//   content  what follows the header: an adaptation field with its length when the flags announce
//            one, then the payload; it is filled up with 0xFF
Bytes MakePacket(uint16_t pid, unsigned counter, const Bytes &content, unsigned flags = kPayload);

// A packet's content with the flags that it needs.
struct Content {
    Bytes bytes;
    unsigned flags;
};

// Sections that follow one another without a gap, in as few packets as they take.
std::vector<Content> SplitSections(const std::vector<Bytes> &sections);

// A stream that grows packet by packet, each PID's counted on.
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
