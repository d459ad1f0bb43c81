// Each table has a function that reads the fixed fields, and then the loops with readers of their
// own.
#include "Tables.h"

#include <algorithm>
#include <iterator>
#include <utility>

#include "BroadcastText.h"
#include "BroadcastTime.h"
#include "TransportStream.h"

namespace receiver {
namespace {

constexpr int kCrcSize = 4;

constexpr uint8_t kDescriptorLanguage = 0x0A;
constexpr uint8_t kDescriptorNetworkName = 0x40;
constexpr uint8_t kDescriptorService = 0x48;
constexpr uint8_t kDescriptorShortEvent = 0x4D;
constexpr uint8_t kDescriptorExtendedEvent = 0x4E;
constexpr uint8_t kDescriptorStreamIdentifier = 0x52;
constexpr uint8_t kDescriptorContent = 0x54;
constexpr uint8_t kDescriptorParentalRating = 0x55;
constexpr uint8_t kDescriptorLocalOffset = 0x58;
constexpr uint8_t kDescriptorAudioComponent = 0xC4;
constexpr uint8_t kDescriptorTsInformation = 0xCD;
constexpr uint8_t kDescriptorTerrestrialDelivery = 0xFA;
constexpr uint8_t kDescriptorPartialReception = 0xFB;
constexpr uint8_t kDescriptorEmergency = 0xFC;

// These descriptors define the kind of a component in addition to its stream_type: teletext,
// subtitles, sound codings, application signalling, data component.
constexpr uint8_t kDescriptorsOfContent[] = {0x56, 0x59, 0x6A, kDescriptorApplicationSignalling,
                                             0x7A, 0x7B, 0x7C, kDescriptorDataComponent};
// The delivery systems that ISDB-T does not have: satellite, cable and DVB's terrestrial one.
constexpr uint8_t kDescriptorsOfDvb[] = {0x43, 0x44, 0x5A};

template <size_t Count>
bool Contains(const uint8_t (&tags)[Count], uint8_t tag) {
    return std::find(std::begin(tags), std::end(tags), tag) != std::end(tags);
}

// Enters a loop after four other bits and its 12-bit length.
FieldReader EnterLoop(FieldReader &fields) {
    fields.Skip(4);
    return fields.Enter(fields.U16(12));
}

// Calls `visit(tag, body)` for each complete descriptor of a loop.
template <typename Visit>
void ForEachDescriptor(FieldReader loop, Visit visit) {
    while (loop.BytesLeft() >= 2) {
        const uint8_t tag = loop.U8();
        FieldReader body = loop.Enter(loop.U8());
        if (!loop.Ok()) {
            return;
        }
        visit(tag, body);
    }
}

std::optional<DateTime> ReadDateTime(FieldReader &fields) {
    const uint16_t mjd = fields.U16();
    return DecodeDateTime(mjd, fields.U32(24));
}

// Converts the decimal digits hhmm to minutes.
int ReadOffset(FieldReader &fields, bool negative) {
    const int minutes = DecodeBcdTime(uint32_t{fields.U16()} << 8).value_or(0) / 60;
    return negative ? -minutes : minutes;
}

Code ReadCode(FieldReader &fields) {
    return Code(fields.U32(24));
}

void ReadLocalOffsets(FieldReader &body, std::vector<LocalOffset> &offsets) {
    while (true) {
        LocalOffset offset{};
        offset.country = ReadCode(body);
        offset.region = body.U8(6);
        body.Skip(1);
        const bool negative = body.U8(1) != 0;
        offset.minutes = ReadOffset(body, negative);
        offset.change = ReadDateTime(body);
        offset.next_minutes = ReadOffset(body, negative);
        if (!body.Ok()) {
            return;
        }
        offsets.push_back(offset);
    }
}

// Whether a warning is active in any of the areas that the descriptor lists.
bool ReadsAsEmergency(FieldReader &body) {
    while (body.BytesLeft() >= 4) {
        body.Skip(16);
        const bool started = body.U8(1) != 0;
        body.Skip(7);
        body.Enter(body.U8());
        if (started && body.Ok()) {
            return true;
        }
    }
    return false;
}

// Reads the language and, if a component has two, the second one.
void ReadAudioLanguages(FieldReader &body, Code (&languages)[2]) {
    body.Skip(40);
    const bool two = body.U8(1) != 0;
    body.Skip(7);
    languages[0] = ReadCode(body);
    languages[1] = two ? ReadCode(body) : Code();
}

void ReadComponentDescriptor(uint8_t tag, FieldReader &body, Component &component) {
    if (tag == kDescriptorLanguage) {
        component.languages[0] = ReadCode(body);
        component.audio_type = body.U8();
        component.languages[1] = ReadCode(body);
    } else if (tag == kDescriptorStreamIdentifier && body.BytesLeft() >= 1) {
        component.tag = body.U8();
    } else if (tag == kDescriptorAudioComponent) {
        ReadAudioLanguages(body, component.languages);
    } else if (component.descriptor == 0 && Contains(kDescriptorsOfContent, tag)) {
        component.data_component_id = tag == kDescriptorDataComponent ? body.U16() : uint16_t{0};
        component.descriptor = body.Ok() ? tag : uint8_t{0};
    }
}

void ReadStreamDescriptor(uint8_t tag, FieldReader &body, NetworkStream &stream) {
    if (tag == kDescriptorTsInformation && body.BytesLeft() >= 2) {
        stream.remote_control_key = body.U8();
        const uint8_t length = body.U8(6);
        body.Skip(2);
        stream.name = ToUtf8(body.Bytes(length));
    } else if (tag == kDescriptorTerrestrialDelivery && body.BytesLeft() >= 2) {
        stream.area_code = body.U16(12);
        stream.guard_interval = body.U8(2);
    } else if (tag == kDescriptorPartialReception) {
        while (body.BytesLeft() >= 2) {
            stream.one_seg_services.push_back(body.U16());
        }
    } else if (Contains(kDescriptorsOfDvb, tag)) {
        stream.dvb = true;
    }
}

// A text that several descriptors of an event continue: named items, and then free text. An item
// without a name continues the previous one.
class ExtendedText {
  public:
    // Uses the descriptors in the language of the first one, until the first descriptor in the
    // wanted language; from then on it uses that language.
    void Read(FieldReader &body, const Code &wanted) {
        body.Skip(8);
        const Code language = ReadCode(body);
        if (!(language == language_) && !language_.IsEmpty()) {
            if (!(language == wanted)) {
                return;
            }
            items_.clear();
            text_.clear();
        }
        language_ = language;
        FieldReader fields = body.Enter(body.U8());
        while (fields.BytesLeft() >= 2) {
            const std::string name = ToUtf8(fields.Bytes(fields.U8()));
            const std::string item = ToUtf8(fields.Bytes(fields.U8()));
            if (!name.empty()) {
                items_.append(items_.empty() ? "" : "\n").append(name).append(": ");
            }
            items_ += item;
        }
        text_ += ToUtf8(body.Bytes(body.U8()));
    }

    std::string Text() const {
        return items_ + (items_.empty() || text_.empty() ? "" : "\n") + text_;
    }

  private:
    Code language_;
    std::string items_;
    std::string text_;
};

// Keeps the first name, until there is one in the wanted language.
void ReadShortEvent(FieldReader &body, const Code &wanted, Event &event) {
    const Code language = ReadCode(body);
    const bool named = !event.name.empty();
    if (named && (!(language == wanted) || event.language == wanted)) {
        return;
    }
    std::string name = ToUtf8(body.Bytes(body.U8()));
    if (named && name.empty()) {
        return;
    }
    event.language = language;
    event.name = std::move(name);
    event.text = ToUtf8(body.Bytes(body.U8()));
}

}  // namespace

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

ProgramMap ParsePmt(FieldReader &fields) {
    ProgramMap map{};
    fields.Skip(3);
    const uint16_t pcr_pid = fields.U16(13);
    map.pcr_pid = pcr_pid != kPidNull ? std::optional(pcr_pid) : std::nullopt;
    ForEachDescriptor(EnterLoop(fields), [&](uint8_t tag, FieldReader &body) {
        map.emergency = map.emergency || (tag == kDescriptorEmergency && ReadsAsEmergency(body));
    });
    while (fields.BytesLeft() >= 5) {
        Component component{};
        component.stream_type = fields.U8();
        fields.Skip(3);
        component.pid = fields.U16(13);
        ForEachDescriptor(EnterLoop(fields), [&](uint8_t tag, FieldReader &body) {
            ReadComponentDescriptor(tag, body, component);
        });
        map.components.push_back(component);
    }
    return map;
}

void TableParser::OnPmt(uint16_t pid, const SectionHeader &header, FieldReader &fields) {
    ProgramMap map = ParsePmt(fields);
    map.pmt_pid = pid;
    ProgramMap &kept = model_.pmts[header.extension];
    model_.components -= kept.components.size();
    const size_t fitting =
        std::min(map.components.size(), Model::kMostComponents - model_.components);
    model_.components_left_out += map.components.size() - fitting;
    model_.components += fitting;
    kept = std::move(map);
    kept.components.resize(fitting);
    kept.components.shrink_to_fit();
}

void TableParser::OnNit(const SectionHeader &header, FieldReader &fields) {
    model_.network_id = header.extension;
    NetworkSection section{};
    ForEachDescriptor(EnterLoop(fields), [&](uint8_t tag, FieldReader &body) {
        if (tag == kDescriptorNetworkName) {
            model_.network_name = ToUtf8(body.Bytes(body.BytesLeft()));
        } else if (tag == kDescriptorEmergency) {
            section.emergency = ReadsAsEmergency(body);
        }
    });
    FieldReader streams = EnterLoop(fields);
    while (streams.BytesLeft() >= 6) {
        NetworkStream stream{};
        stream.transport_stream_id = streams.U16();
        streams.Skip(16);
        ForEachDescriptor(EnterLoop(streams), [&](uint8_t tag, FieldReader &body) {
            ReadStreamDescriptor(tag, body, stream);
        });
        section.streams.push_back(std::move(stream));
    }
    model_.nit.Replace(header.number, header.last, std::move(section));
}

void TableParser::OnSdt(const SectionHeader &header, FieldReader &fields) {
    std::vector<ServiceInfo> services;
    fields.Skip(24);
    while (fields.BytesLeft() >= 5) {
        ServiceInfo service{};
        service.service_id = fields.U16();
        fields.Skip(8);
        ForEachDescriptor(EnterLoop(fields), [&](uint8_t tag, FieldReader &body) {
            if (tag == kDescriptorService) {
                service.type = body.U8();
                service.provider = ToUtf8(body.Bytes(body.U8()));
                service.name = ToUtf8(body.Bytes(body.U8()));
            }
        });
        services.push_back(std::move(service));
    }
    model_.sdt.Replace(header.number, header.last, std::move(services));
}

void TableParser::OnEit(uint8_t table_id, const SectionHeader &header, FieldReader &fields) {
    const bool other = table_id == kTableEitOther || table_id >= kTableEitOtherSchedule;
    EventTable &events = other ? model_.other_events : model_.events;
    const uint32_t stream = fields.U32();
    const uint8_t segment_last = fields.U8();
    fields.Skip(8);
    if (!fields.Ok()) {
        return;
    }
    std::vector<Event> content;
    while (fields.BytesLeft() >= 12) {
        content.push_back(ReadEvent(fields));
    }
    events.Replace({table_id, other ? stream : 0, header.extension, header.number}, segment_last,
                   header.last, std::move(content));
}

Event TableParser::ReadEvent(FieldReader &fields) const {
    Event event;
    event.id = fields.U16();
    event.start = ReadDateTime(fields);
    event.duration = DecodeBcdTime(fields.U32(24));
    ExtendedText extended;
    ForEachDescriptor(EnterLoop(fields), [&](uint8_t tag, FieldReader &body) {
        if (tag == kDescriptorShortEvent) {
            ReadShortEvent(body, language_, event);
        } else if (tag == kDescriptorExtendedEvent) {
            extended.Read(body, language_);
        } else if (tag == kDescriptorContent) {
            while (body.BytesLeft() >= 2) {
                event.genres.push_back(body.U8());
                body.Skip(8);
            }
        } else if (tag == kDescriptorParentalRating) {
            while (body.BytesLeft() >= 4) {
                const Code country = ReadCode(body);
                event.ratings.push_back({country, body.U8()});
            }
        } else if (tag == kDescriptorAudioComponent) {
            Code languages[2];
            ReadAudioLanguages(body, languages);
            std::copy_if(std::begin(languages), std::end(languages),
                         std::back_inserter(event.audio_languages),
                         [](const Code &language) { return !language.IsEmpty(); });
        }
    });
    event.extended_text = extended.Text();
    return event;
}

void TableParser::OnTime(uint8_t table_id, FieldReader &fields) {
    if (table_id != kTableTdt && table_id != kTableTot) {
        return;
    }
    fields.Skip(24);
    const std::optional<DateTime> time = ReadDateTime(fields);
    if (fields.Ok() && time) {
        model_.time = time;
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
