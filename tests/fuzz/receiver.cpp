// The example receiver from bytes to JSON: one stream, fed whole and in pieces, gives one report,
// its counters add up, and its text is what JSON may hold. An input whose first byte is even is a
// stream as it stands; any other is a list of sections {PID, length, bytes}, which get their lengths
// and CRCs and are put into packets, so that a run gets behind those.
#include <algorithm>
#include <numeric>

#include "Demultiplexer.h"
#include "Fuzz.h"
#include "JsonReport.h"
#include "PacketSource.h"
#include "Summary.h"
#include "Tables.h"
#include "TransportStream.h"
#include "Varnek_Util.h"

namespace {

using Bytes = std::vector<uint8_t>;
using receiver::kPacketSize;

// Every PID that the receiver knows by itself, and two for the PAT to name.
constexpr uint16_t kPids[] = {0x0000, 0x0010, 0x0011, 0x0012, 0x0014, 0x0026, 0x0027, 0x0101, 0x1FC8};

void AppendPackets(Bytes &stream, uint16_t pid, uint8_t &counter, const Bytes &section) {
    for (size_t at = 0; at < section.size() || at == 0;) {
        const bool first = at == 0;
        const size_t begin = stream.size();
        stream.insert(stream.end(), {receiver::kSyncByte, static_cast<uint8_t>((first ? 0x40 : 0) | pid >> 8),
                                     static_cast<uint8_t>(pid), static_cast<uint8_t>(0x10 | (counter++ & 15))});
        if (first) {
            stream.push_back(0);  // pointer_field
        }
        const size_t count = std::min(begin + kPacketSize - stream.size(), section.size() - at);
        stream.insert(stream.end(), section.begin() + static_cast<std::ptrdiff_t>(at),
                      section.begin() + static_cast<std::ptrdiff_t>(at + count));
        stream.resize(begin + kPacketSize, 0xFF);
        at += count;
    }
}

Bytes StreamOf(Input &input) {
    Bytes stream;
    uint8_t counters[std::size(kPids)] = {};
    while (!input.Empty()) {
        const size_t pid = input.Byte() % std::size(kPids);
        const size_t length = input.Byte();
        Bytes section = input.Bytes(length);
        section.resize(std::max<size_t>(section.size(), 3));
        const size_t rest = section.size() + 4 - 3;
        section[1] = static_cast<uint8_t>(0xB0 | rest >> 8);
        section[2] = static_cast<uint8_t>(rest);
        const uint32_t crc = VarnekUtil_MakeCRC32(section.data(), static_cast<int32_t>(section.size()));
        for (int shift = 24; shift >= 0; shift -= 8) {
            section.push_back(static_cast<uint8_t>(crc >> shift));
        }
        CHECK(VarnekUtil_CheckSectionCRC32(section.data()) == TRUE);
        AppendPackets(stream, kPids[pid], counters[pid], section);
    }
    return stream;
}

// Feeds blocks of up to `block` bytes, each in memory of exactly its size.
receiver::Report Read(const Bytes &stream, size_t block) {
    receiver::Report report;
    receiver::TableParser parser(report.model);
    receiver::Demultiplexer demultiplexer([&parser](uint16_t pid, const uint8_t *section, size_t size) {
        parser.Push(pid, Bytes(section, section + size).data(), size);
    });
    receiver::PacketSource source(
        [&demultiplexer](const uint8_t *packet) { demultiplexer.Push(Bytes(packet, packet + kPacketSize).data()); });
    for (size_t at = 0; at < stream.size(); at += block) {
        const auto begin = stream.begin() + static_cast<std::ptrdiff_t>(at);
        const Bytes exact(begin, begin + static_cast<std::ptrdiff_t>(std::min(block, stream.size() - at)));
        source.Feed(exact.data(), exact.size());
    }
    source.Finish();
    report.packets = source.Counters();
    report.sections = demultiplexer.Counters();
    return report;
}

// Well-formed UTF-8 without a control character but line feeds.
bool IsText(const std::string &text) {
    for (size_t i = 0; i < text.size();) {
        const auto byte = [&](size_t at) { return at < text.size() ? static_cast<uint8_t>(text[at]) : uint8_t{0}; };
        const uint8_t lead = byte(i);
        const size_t length = lead < 0x80 ? 1 : lead >= 0xC2 && lead < 0xE0 ? 2 : lead >= 0xE0 && lead < 0xF0 ? 3 : 0;
        if (length == 0 || (lead < 0x20 && lead != '\n') || (lead == 0xE0 && byte(i + 1) < 0xA0) ||
            (lead == 0xED && byte(i + 1) >= 0xA0)) {
            return false;
        }
        for (size_t k = 1; k < length; ++k) {
            if ((byte(i + k) & 0xC0) != 0x80) {
                return false;
            }
        }
        i += length;
    }
    return true;
}

}  // namespace

int LLVMFuzzerTestOneInput(const uint8_t *data, size_t size) {
    Input input(data, size);
    const uint8_t mode = input.Byte();
    const bool raw = mode % 2 == 0;
    const Bytes stream = raw ? input.Bytes() : StreamOf(input);

    const receiver::Report report = Read(stream, SIZE_MAX / 2);
    CHECK(report.packets.bytes == stream.size());
    CHECK(report.packets.packets * kPacketSize <= stream.size());
    CHECK(raw || report.packets.packets * kPacketSize == stream.size());
    const auto &tables = report.sections.tables;
    CHECK(std::accumulate(tables.begin(), tables.end(), uint64_t{0}) == report.sections.good);
    CHECK(raw || report.sections.continuity_errors == 0);

    const std::string json = ToJson(report);
    CHECK(IsText(json) && IsText(ToSummary(report)));
    CHECK(ToJson(Read(stream, mode / 2u + 1)) == json);
    return 0;
}
