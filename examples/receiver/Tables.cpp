// One function per table. Each reads its fixed fields, then its loops through readers that end
// where the loop ends.
#include "Tables.h"

#include <utility>

#include "BroadcastText.h"
#include "BroadcastTime.h"
#include "TransportStream.h"

namespace receiver {
namespace {

constexpr int kCrcSize = 4;

constexpr uint8_t kDescriptorNetworkName = 0x40;
constexpr uint8_t kDescriptorService = 0x48;
constexpr uint8_t kDescriptorShortEvent = 0x4D;
constexpr uint8_t kDescriptorLocalOffset = 0x58;
// Tell what a component of private data is: teletext, subtitles, sound codings, data component.
constexpr uint8_t kDescriptorsOfContent[] = {0x56, 0x59, 0x6A, 0x7A, 0x7B, 0x7C, 0xFD};

// Calls `visit(tag, body)` for each whole descriptor of a loop.
template <typename Visit>
void ForEachDescriptor(FieldReader loop, Visit visit) {
    while (loop.BytesLeft() >= 2) {
        const uint8_t tag = loop.U8();
        const uint8_t length = loop.U8();
        FieldReader body = loop.Enter(length);
        if (!loop.Ok()) {
            return;
        }
        visit(tag, body);
    }
}

// Reads up to the section's own fields; `fields` ends in front of the CRC then.
bool ReadHeader(FieldReader &fields, SectionHeader &header) {
    fields.Skip(24);
    header.extension = fields.U16();
    fields.Skip(7);
    header.current = fields.U8(1) != 0;
    header.number = fields.U8();
    header.last = fields.U8();
    if (!fields.Ok() || fields.BytesLeft() < kCrcSize) {
        return false;
    }
    fields = fields.Enter(fields.BytesLeft() - kCrcSize);
    return header.current && header.number <= header.last;
}

std::optional<DateTime> ReadDateTime(FieldReader &fields) {
    const uint16_t mjd = fields.U16();
    return DecodeDateTime(mjd, fields.U32(24));
}

// hhmm in decimal digits, as minutes.
int ReadOffset(FieldReader &fields, bool negative) {
    const int minutes = DecodeBcdTime(uint32_t{fields.U16()} << 8).value_or(0) / 60;
    return negative ? -minutes : minutes;
}

void ReadLocalOffsets(FieldReader &body, std::vector<LocalOffset> &offsets) {
    while (true) {
        LocalOffset offset{};
        offset.country = ToUtf8(body.Bytes(3));
        offset.region = body.U8(6);
        body.Skip(1);
        const bool negative = body.U8(1) != 0;
        offset.minutes = ReadOffset(body, negative);
        offset.change = ReadDateTime(body);
        offset.next_minutes = ReadOffset(body, negative);
        if (!body.Ok()) {
            return;
        }
        offsets.push_back(std::move(offset));
    }
}

}  // namespace

bool ParsePat(const unsigned char *section, size_t size, SectionHeader &header, Pat &pat) {
    FieldReader fields(section, size);
    if (!ReadHeader(fields, header)) {
        return false;
    }
    while (fields.BytesLeft() >= 4) {
        const uint16_t number = fields.U16();
        fields.Skip(3);
        const uint16_t pid = fields.U16(13);
        if (number != 0) {
            pat.push_back({number, pid});
        }
    }
    return true;
}

void TableParser::Push(uint16_t pid, const unsigned char *section, size_t size) {
    const uint8_t table_id = section[0];
    FieldReader fields(section, size);
    if (pid == kPidTime) {
        OnTime(table_id, fields);
        return;
    }
    if (pid == kPidPat && table_id == kTablePat) {
        OnPat(section, size);
        return;
    }
    SectionHeader header{};
    if (!ReadHeader(fields, header)) {
        return;
    }
    const bool event_pid = pid == kPidEit || pid == kPidEitMobile || pid == kPidEitOneSeg;
    if (table_id == kTablePmt) {
        OnPmt(pid, header, fields);
    } else if (pid == kPidNit && table_id == kTableNitActual) {
        OnNit(header, fields);
    } else if (pid == kPidSdt && table_id == kTableSdtActual) {
        OnSdt(header, fields);
    } else if (event_pid && table_id >= kTableEitActual && table_id <= kTableEitLast) {
        OnEit(table_id, header, fields);
    }
}

void TableParser::OnPat(const unsigned char *section, size_t size) {
    SectionHeader header{};
    Pat pat;
    if (ParsePat(section, size, header, pat)) {
        model_.transport_stream_id = header.extension;
        model_.pat.Replace(header.number, header.last, std::move(pat));
    }
}

void TableParser::OnPmt(uint16_t pid, const SectionHeader &header, FieldReader &fields) {
    ProgramMap map{};
    map.pmt_pid = pid;
    fields.Skip(3);
    map.pcr_pid = fields.U16(13);
    fields.Skip(4);
    const uint16_t info_length = fields.U16(12);
    fields.Enter(info_length);
    while (fields.BytesLeft() >= 5) {
        Component component{};
        component.stream_type = fields.U8();
        fields.Skip(3);
        component.pid = fields.U16(13);
        fields.Skip(4);
        const uint16_t length = fields.U16(12);
        ForEachDescriptor(fields.Enter(length), [&](uint8_t tag, FieldReader &) {
            for (const uint8_t known : kDescriptorsOfContent) {
                if (tag == known && component.descriptor == 0) {
                    component.descriptor = tag;
                }
            }
        });
        map.components.push_back(component);
    }
    model_.pmts[header.extension] = std::move(map);
}

void TableParser::OnNit(const SectionHeader &header, FieldReader &fields) {
    model_.network_id = header.extension;
    fields.Skip(4);
    const uint16_t length = fields.U16(12);
    ForEachDescriptor(fields.Enter(length), [&](uint8_t tag, FieldReader &body) {
        if (tag == kDescriptorNetworkName) {
            model_.network_name = ToUtf8(body.Bytes(body.BytesLeft()));
        }
    });
}

void TableParser::OnSdt(const SectionHeader &header, FieldReader &fields) {
    std::vector<ServiceInfo> services;
    fields.Skip(24);
    while (fields.BytesLeft() >= 5) {
        ServiceInfo service{};
        service.service_id = fields.U16();
        fields.Skip(12);
        const uint16_t length = fields.U16(12);
        ForEachDescriptor(fields.Enter(length), [&](uint8_t tag, FieldReader &body) {
            if (tag != kDescriptorService) {
                return;
            }
            service.type = body.U8();
            service.provider = ToUtf8(body.Bytes(body.U8()));
            service.name = ToUtf8(body.Bytes(body.U8()));
        });
        services.push_back(std::move(service));
    }
    model_.sdt.Replace(header.number, header.last, std::move(services));
}

void TableParser::OnEit(uint8_t table_id, const SectionHeader &header, FieldReader &fields) {
    const bool other = table_id == kTableEitOther || table_id >= kTableEitOtherSchedule;
    fields.Skip(48);
    while (fields.BytesLeft() >= 12) {
        Event event{};
        event.other_stream = other;
        const uint16_t event_id = fields.U16();
        event.start = ReadDateTime(fields);
        event.duration = DecodeBcdTime(fields.U32(24));
        fields.Skip(4);
        const uint16_t length = fields.U16(12);
        ForEachDescriptor(fields.Enter(length), [&](uint8_t tag, FieldReader &body) {
            if (tag != kDescriptorShortEvent || !event.name.empty()) {
                return;
            }
            body.Skip(24);
            event.name = ToUtf8(body.Bytes(body.U8()));
            event.text = ToUtf8(body.Bytes(body.U8()));
        });
        KeepEvent(header.extension, event_id, std::move(event));
    }
}

// The latest wins, but another stream's account of an event never replaces this stream's own, and a
// section without the name leaves it.
void TableParser::KeepEvent(uint16_t service_id, uint16_t event_id, Event event) {
    const EventKey key{service_id, event_id};
    const auto found = model_.events.find(key);
    if (found == model_.events.end()) {
        if (model_.events.size() < Model::kMostEvents) {
            model_.events.emplace(key, std::move(event));
        } else {
            ++model_.events_left_out;
        }
        return;
    }
    Event &kept = found->second;
    if (event.other_stream && !kept.other_stream) {
        return;
    }
    if (event.name.empty()) {
        event.name = std::move(kept.name);
        event.text = std::move(kept.text);
    }
    kept = std::move(event);
}

void TableParser::OnTime(uint8_t table_id, FieldReader &fields) {
    if (table_id != kTableTdt && table_id != kTableTot) {
        return;
    }
    fields.Skip(24);
    const std::optional<DateTime> time = ReadDateTime(fields);
    if (fields.Ok() && time) {
        model_.utc_time = time;
    }
    if (table_id != kTableTot) {
        return;
    }
    fields.Skip(4);
    const uint16_t length = fields.U16(12);
    if (!fields.Ok() || length + kCrcSize > fields.BytesLeft()) {
        return;
    }
    std::vector<LocalOffset> offsets;
    ForEachDescriptor(fields.Enter(length), [&](uint8_t tag, FieldReader &body) {
        if (tag == kDescriptorLocalOffset) {
            ReadLocalOffsets(body, offsets);
        }
    });
    model_.local_offsets = std::move(offsets);
}

}  // namespace receiver
