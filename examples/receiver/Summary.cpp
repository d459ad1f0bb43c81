// Joins the parts of a report and writes them for people: lines of bounded width, names as the
// stream gives them.
#include "Summary.h"

#include <algorithm>
#include <iterator>
#include <map>
#include <vector>

#include "TransportStream.h"

namespace receiver {
namespace {

struct Named {
    uint8_t value;
    const char *name;
};

constexpr Named kStreamTypes[] = {
    {0x01, "MPEG-1 video"},  {0x02, "MPEG-2 video"},     {0x03, "MPEG-1 audio"},
    {0x04, "MPEG-2 audio"},  {0x05, "private sections"}, {0x06, "private data"},
    {0x07, "MHEG"},          {0x0A, "DSM-CC type A"},    {0x0B, "DSM-CC type B"},
    {0x0C, "DSM-CC type C"}, {0x0D, "DSM-CC type D"},    {0x0F, "AAC audio (ADTS)"},
    {0x10, "MPEG-4 video"},  {0x11, "AAC audio (LATM)"}, {0x1B, "H.264 video"},
    {0x24, "HEVC video"},    {0x33, "VVC video"},        {0x81, "AC-3 audio"},
    {0x87, "E-AC-3 audio"},
};

constexpr Named kPrivateData[] = {
    {0x56, "teletext"},  {0x59, "subtitles"}, {0x6A, "AC-3 audio"},       {0x7A, "E-AC-3 audio"},
    {0x7B, "DTS audio"}, {0x7C, "AAC audio"}, {0xFD, "captions or data"},
};

constexpr Named kServiceTypes[] = {
    {0x01, "television"},    {0x02, "radio"},         {0x03, "teletext"},
    {0x0A, "radio"},         {0x0C, "data"},          {0x11, "HD television"},
    {0x16, "television"},    {0x19, "HD television"}, {0x1F, "HEVC television"},
    {0xA1, "special video"}, {0xA4, "engineering"},   {0xA8, "prior storage data"},
    {0xC0, "data"},
};

constexpr Named kTables[] = {
    {0x00, "PAT"},           {0x01, "CAT"}, {0x02, "PMT"},       {0x03, "TSDT"}, {0x40, "NIT"},
    {0x41, "NIT other"},     {0x42, "SDT"}, {0x46, "SDT other"}, {0x4A, "BAT"},  {0x4E, "EIT p/f"},
    {0x4F, "EIT p/f other"}, {0x70, "TDT"}, {0x71, "RST"},       {0x72, "ST"},   {0x73, "TOT"},
    {0xC3, "SDTT"},          {0xC4, "BIT"},
};

constexpr size_t kEventsShown = 12;
constexpr size_t kLineWidth = 100;

template <size_t Count>
const char *NameOf(const Named (&names)[Count], uint8_t value) {
    const auto found = std::find_if(std::begin(names), std::end(names),
                                    [value](const Named &entry) { return entry.value == value; });
    return found == std::end(names) ? nullptr : found->name;
}

std::string NameOfComponent(const Component &component) {
    const bool is_private = component.stream_type == 0x05 || component.stream_type == 0x06;
    const char *name = is_private ? NameOf(kPrivateData, component.descriptor) : nullptr;
    if (name == nullptr) {
        name = NameOf(kStreamTypes, component.stream_type);
    }
    return name != nullptr ? name : Format("stream type 0x%02X", component.stream_type);
}

// Columns that a text takes: its characters, which are its bytes but for continuation bytes.
size_t WidthOf(const std::string &text) {
    return static_cast<size_t>(std::count_if(text.begin(), text.end(), [](char c) {
        return (static_cast<unsigned char>(c) & 0xC0) != 0x80;
    }));
}

std::string Padded(const std::string &text, size_t width) {
    const size_t used = WidthOf(text);
    return used < width ? text + std::string(width - used, ' ') : text;
}

std::string NameOrDash(const std::string &name) {
    return name.empty() ? "-" : name;
}

void AppendStream(const Report &report, std::string &out) {
    const Model &model = report.model;
    out += "Stream    ";
    out += model.transport_stream_id
               ? Format("transport stream 0x%04X, ", *model.transport_stream_id)
               : std::string();
    out +=
        Format("%llu packets of %u bytes\n",
               static_cast<unsigned long long>(report.packets.packets), report.packets.packet_size);
    out += "Receiver  nation " + report.settings.nation;
    out += report.settings.bml ? ", BML supported" : ", BML not supported";
    out += Format(", standard type %d\n", report.settings.standard_type);
    out += "Network   " + NameOrDash(model.network_name.Text());
    out += model.network_id ? Format(" (0x%04X)\n", *model.network_id) : "\n";
    out += "Clock     ";
    out += model.utc_time ? ToText(model.utc_time) + " UTC" : "-";
    for (const LocalOffset &offset : model.local_offsets) {
        out += ", " + offset.country;
        out += offset.region != 0 ? Format(" region %d ", offset.region) : " ";
        out += ToOffsetText(offset.minutes);
    }
    const std::optional<DateTime> local = ToLocal(model.utc_time, OffsetFor(report));
    out += local ? ", local " + ToText(local) + "\n" : "\n";
}

// "one, two, three" over as many lines as it takes.
void AppendWrapped(const std::vector<std::string> &items, size_t margin, std::string &out) {
    const std::string indent(margin, ' ');
    std::string line = indent;
    for (size_t i = 0; i < items.size(); ++i) {
        const std::string item = items[i] + (i + 1 < items.size() ? "," : "");
        if (line.size() > indent.size() && line.size() + 1 + item.size() > kLineWidth) {
            out += line + '\n';
            line = indent;
        }
        line += (line.size() > indent.size() ? " " : "") + item;
    }
    out += line + '\n';
}

void AppendComponents(const ProgramMap &map, std::string &out) {
    std::vector<std::string> items;
    for (const Component &component : map.components) {
        items.push_back(Format("0x%04X ", component.pid) + NameOfComponent(component));
    }
    AppendWrapped(items.empty() ? std::vector<std::string>{"no components"} : items, 10, out);
}

void AppendServices(const std::map<uint16_t, Service> &services, std::string &out) {
    out += services.empty() ? "\nServices  none named\n" : "\nServices\n";
    size_t width = 0;
    for (const auto &entry : services) {
        width = std::max(
            width, entry.second.info != nullptr ? WidthOf(entry.second.info->name.Text()) : 0);
    }
    for (const auto &entry : services) {
        const Service &service = entry.second;
        out += Format("  0x%04X  ", entry.first);
        out += Padded(service.info != nullptr ? NameOrDash(service.info->name.Text()) : "-", width);
        if (service.info != nullptr && service.info->type) {
            const char *type = NameOf(kServiceTypes, *service.info->type);
            out += "  ";
            out += type != nullptr ? type : Format("service type 0x%02X", *service.info->type);
            const std::string provider = service.info->provider.Text();
            out += provider.empty() ? "" : ", " + provider;
        }
        out +=
            service.pmt_pid ? Format("  (PMT 0x%04X)\n", *service.pmt_pid) : "  (not in the PAT)\n";
        if (service.map != nullptr) {
            AppendComponents(*service.map, out);
        }
    }
}

void AppendEvents(const Report &report, const std::map<uint16_t, Service> &services,
                  std::string &out) {
    const Model &model = report.model;
    const LocalOffset *offset = OffsetFor(report);
    const std::vector<EventEntry> events = SortEvents(model);
    std::vector<EventEntry> shown;
    for (const EventEntry entry : events) {
        if (services.count(entry->first.service_id) != 0 && shown.size() < kEventsShown) {
            shown.push_back(entry);
        }
    }
    if (events.empty()) {
        out += "\nEvents    none\n";
        return;
    }
    const auto name_of = [&services](EventEntry entry) {
        const ServiceInfo *info = services.at(entry->first.service_id).info;
        const std::string name = info != nullptr ? info->name.Text() : "";
        return !name.empty() ? name : Format("0x%04X", entry->first.service_id);
    };
    size_t width = 0;
    for (const EventEntry entry : shown) {
        width = std::max(width, WidthOf(name_of(entry)));
    }
    out += offset != nullptr ? "\nEvents (UTC, local time)\n" : "\nEvents (UTC)\n";
    for (const EventEntry entry : shown) {
        const Event &event = entry->second;
        out += "  " + Padded(event.start ? ToText(event.start) : "start not known", 19) + "  ";
        if (offset != nullptr) {
            out += Padded(NameOrDash(ToText(ToLocal(event.start, offset))), 19) + "  ";
        }
        out += Padded(NameOrDash(ToText(event.duration)), 8) + "  ";
        out += Padded(name_of(entry), width) + "  " + NameOrDash(event.name) + '\n';
    }
    if (events.size() > shown.size()) {
        out += Format("  and %zu more\n", events.size() - shown.size());
    }
    if (model.events_left_out != 0) {
        out += Format("  %llu times an event was left out for lack of room\n",
                      static_cast<unsigned long long>(model.events_left_out));
    }
}

void AppendCounters(const Report &report, std::string &out) {
    const struct {
        const char *name;
        uint64_t value;
    } counters[] = {
        {"sync losses", report.packets.sync_losses},
        {"continuity errors", report.sections.continuity_errors},
        {"transport errors", report.sections.transport_errors},
        {"scrambled packets", report.sections.scrambled},
        {"good sections", report.sections.good},
        {"sections with a bad CRC", report.sections.bad_crc},
        {"incomplete sections", report.sections.incomplete},
    };
    out += "\nCounters\n";
    for (const auto &counter : counters) {
        out +=
            Format("  %-24s %9llu\n", counter.name, static_cast<unsigned long long>(counter.value));
    }
}

void AppendTables(const DemultiplexerCounters &sections, std::string &out) {
    std::vector<std::string> items;
    for (size_t table = 0; table < sections.tables.size(); ++table) {
        if (sections.tables[table] == 0) {
            continue;
        }
        const char *name = NameOf(kTables, static_cast<uint8_t>(table));
        if (table >= kTableEitActualSchedule && table <= kTableEitLast) {
            name = table < kTableEitOtherSchedule ? "EIT schedule" : "EIT schedule other";
        }
        items.push_back(Format("0x%02X %s: %llu", static_cast<unsigned>(table),
                               name != nullptr ? name
                               : table < 0x80  ? "other"
                                               : "private",
                               static_cast<unsigned long long>(sections.tables[table])));
    }
    if (!items.empty()) {
        out += "\nGood sections by table\n";
        AppendWrapped(items, 2, out);
    }
}

}  // namespace

std::string ToSummary(const Report &report) {
    const std::map<uint16_t, Service> services = JoinServices(report.model);
    std::string out;
    AppendStream(report, out);
    AppendServices(services, out);
    AppendEvents(report, services, out);
    AppendCounters(report, out);
    AppendTables(report.sections, out);
    return out;
}

}  // namespace receiver
