// The order is fields, sections, tables, packets.
#include "StreamWriter.h"

#include <algorithm>

#include "Varnek_Util.h"

namespace streamwriter {
namespace {

constexpr size_t kPacketSize = 188;
constexpr size_t kContentSize = kPacketSize - 4;
constexpr uint16_t kPidNull = 0x1FFF;
constexpr int kDaySeconds = 86400;
constexpr unsigned kFarDay = 60596;  // 2024-10-13

}  // namespace

Bytes operator+(Bytes left, const Bytes &right) {
    left.insert(left.end(), right.begin(), right.end());
    return left;
}

Bytes U8(unsigned value) {
    return {static_cast<unsigned char>(value)};
}

Bytes U16(unsigned value) {
    return U8(value >> 8) + U8(value);
}

Bytes U24(unsigned value) {
    return U8(value >> 16) + U16(value);
}

Bytes Raw(const std::string &text) {
    return Bytes(text.begin(), text.end());
}

Bytes Counted(const std::string &text) {
    return U8(static_cast<unsigned>(text.size())) + Raw(text);
}

Bytes Bcd(int seconds) {
    Bytes digits;
    for (const int part : {seconds / 3600, seconds / 60 % 60, seconds % 60}) {
        digits.push_back(static_cast<unsigned char>(part / 10 << 4 | part % 10));
    }
    return digits;
}

Bytes MakeDateTime(unsigned mjd, int seconds) {
    return U16(mjd + static_cast<unsigned>(seconds / kDaySeconds)) + Bcd(seconds % kDaySeconds);
}

Bytes Descriptor(unsigned tag, const Bytes &body) {
    return U8(tag) + U8(static_cast<unsigned>(body.size())) + body;
}

Bytes Loop(unsigned flags, const Bytes &content) {
    return U16(flags << 12 | static_cast<unsigned>(content.size())) + content;
}

Bytes Seal(Bytes section) {
    const size_t length = section.size() - 3 + 4;
    section[1] = static_cast<unsigned char>((section[1] & 0xF0) | (length >> 8 & 0x0F));
    section[2] = static_cast<unsigned char>(length);
    const uint32_t crc = VarnekUtil_MakeCRC32(section.data(), static_cast<int32_t>(section.size()));
    return std::move(section) + U16(crc >> 16) + U16(crc);
}

Bytes MakeSection(unsigned table, unsigned extension, const Bytes &body, const Place &place) {
    return Seal(U8(table) + U16(0xB000) + U16(extension) + U8(place.version) + U8(place.number) +
                U8(place.last) + body);
}

Bytes MakePat(unsigned stream, const std::vector<std::pair<unsigned, unsigned>> &pids,
              const Place &place) {
    Bytes body;
    for (const auto &[service, pid] : pids) {
        body = body + U16(service) + U16(0xE000 | pid);
    }
    return MakeSection(0x00, stream, body, place);
}

Bytes MakeComponent(unsigned stream_type, unsigned pid, const Bytes &descriptors) {
    return U8(stream_type) + U16(0xE000 | pid) + Loop(0xF, descriptors);
}

Bytes MakePmt(unsigned service, unsigned pcr_pid, const Bytes &components, const Bytes &descriptors,
              const Place &place) {
    return MakeSection(0x02, service, U16(0xE000 | pcr_pid) + Loop(0xF, descriptors) + components,
                       place);
}

Bytes MakeNit(unsigned network, unsigned stream, const Bytes &network_descriptors,
              const Bytes &stream_descriptors, const Place &place) {
    const Bytes entry = U16(stream) + U16(network) + Loop(0xF, stream_descriptors);
    return MakeSection(0x40, network, Loop(0xF, network_descriptors) + Loop(0xF, entry), place);
}

Bytes MakeService(unsigned service, const std::string &provider, const std::string &name) {
    return U16(service) + U8(0xE3) +
           Loop(0x8, Descriptor(0x48, U8(0x01) + Counted(provider) + Counted(name)));
}

Bytes MakeSdt(unsigned stream, const Bytes &services, const Place &place) {
    return MakeSection(0x42, stream, U16(stream) + U8(0xFF) + services, place);
}

Bytes MakeShortEvent(const std::string &language, const std::string &name,
                     const std::string &text) {
    return Descriptor(0x4D, Raw(language) + Counted(name) + Counted(text));
}

Bytes MakeEvent(unsigned id, const Bytes &start, const Bytes &duration, const Bytes &descriptors,
                unsigned status) {
    return U16(id) + start + duration + Loop(status, descriptors);
}

Bytes MakeEit(unsigned table, unsigned service, unsigned stream, const Bytes &events,
              const Place &place) {
    return MakeSection(table, service,
                       U16(stream) + U16(stream) + U8(place.last) + U8(table) + events, place);
}

Bytes MakeLocalOffset(const std::string &country, unsigned region, int hours) {
    const unsigned size = static_cast<unsigned>(hours < 0 ? -hours : hours);
    const Bytes offset = U8(size / 10 << 4 | size % 10) + U8(0);
    return Raw(country) + U8(region << 2 | (hours < 0 ? 3u : 2u)) + offset +
           MakeDateTime(kFarDay, 0) + offset;
}

Bytes MakeTot(const Bytes &time, const Bytes &offsets) {
    return Seal(U8(0x73) + U16(0x7000) + time +
                Loop(0xF, offsets.empty() ? Bytes() : Descriptor(0x58, offsets)));
}

Bytes MakePacket(uint16_t pid, unsigned counter, const Bytes &content, unsigned flags) {
    Bytes packet =
        U8(0x47) + U16((flags & 0xFF00) | pid) + U8((flags & 0x00FF) | (counter & 0x0F)) + content;
    packet.resize(kPacketSize, 0xFF);
    return packet;
}

std::vector<Content> SplitSections(const std::vector<Bytes> &sections) {
    Bytes all;
    std::vector<size_t> starts;
    for (const Bytes &section : sections) {
        starts.push_back(all.size());
        all.insert(all.end(), section.begin(), section.end());
    }
    std::vector<Content> contents;
    auto start = starts.begin();  // the first section that has not begun
    for (size_t at = 0; at < all.size();) {
        Content content{{}, kPayload};
        if (start != starts.end() && *start < at + kContentSize - 1) {
            content.flags |= kUnitStart;
            content.bytes = U8(static_cast<unsigned>(*start - at));
        }
        const size_t end = std::min(at + kContentSize - content.bytes.size(), all.size());
        content.bytes.insert(content.bytes.end(), all.begin() + static_cast<std::ptrdiff_t>(at),
                             all.begin() + static_cast<std::ptrdiff_t>(end));
        start = std::lower_bound(start, starts.end(), end);
        contents.push_back(std::move(content));
        at = end;
    }
    return contents;
}

void StreamWriter::Send(uint16_t pid, const Content &content) {
    unsigned &counter = counters_[pid];
    const Bytes packet = MakePacket(pid, counter, content.bytes, content.flags);
    stream_.insert(stream_.end(), packet.begin(), packet.end());
    counter += pid == kPidNull ? 0 : 1;
}

void StreamWriter::SendSections(uint16_t pid, const std::vector<Bytes> &sections) {
    for (const Content &content : SplitSections(sections)) {
        Send(pid, content);
    }
}

}  // namespace streamwriter
