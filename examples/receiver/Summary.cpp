// Writes a report for people, with the stream's own names and with words for codes.
#include "Report.h"

#include <algorithm>
#include <cinttypes>
#include <map>
#include <utility>
#include <vector>

#include "Names.h"
#include "Paragraphs.h"
#include "TransportStream.h"

namespace receiver {
namespace {

constexpr size_t kEventsShown = 12;
constexpr size_t kPidsShown = 24;
constexpr size_t kWidestName = 24;  // of a column of service names

using Services = std::map<uint16_t, Service>;

std::string NameOrDash(const std::string &name) {
    return name.empty() ? "-" : name;
}

std::string NameOf(const Services &services, uint16_t service_id) {
    const auto found = services.find(service_id);
    return found != services.end() ? found->second.info.name : "";
}

// Joins the texts that are not empty.
std::string Joined(const std::vector<std::string> &texts) {
    std::string joined;
    for (const std::string &text : texts) {
        joined += (joined.empty() || text.empty() ? "" : ", ") + text;
    }
    return joined;
}

void AddStream(const Report &report, Paragraphs &out) {
    const Model &model = report.model;
    const PacketCounters &packets = report.packets;
    const std::optional<int64_t> duration = DurationOf(report);
    const std::optional<int64_t> bit_rate = BitRateOf(report);
    const auto &id = model.transport_stream_id;
    out.Add("Stream    ",
            (id ? Format("transport stream 0x%04X, ", *id) : "") +
                Format("%" PRIu64 " packets", packets.packets) +
                (packets.packets != 0 ? Format(" of %u bytes", packets.packet_size) : ""));
    if (duration && bit_rate) {
        out.Add("Duration  ",
                Format("%.1f s at %.3f Mbit/s, by the clock reference",
                       static_cast<double>(*duration) / 1e3, static_cast<double>(*bit_rate) / 1e6));
    }
    out.Add("Receiver  ", "nation " + report.settings.nation +
                              (report.settings.bml ? ", BML supported" : ", BML not supported") +
                              Format(", standard type %d", report.settings.standard_type));
    out.Add("Network   ", NameOrDash(model.network_name) +
                              (model.network_id ? Format(" (0x%04X)", *model.network_id) : ""));
}

void AddChannel(const NetworkStream &stream, Paragraphs &out) {
    std::vector<std::string> items;
    if (stream.remote_control_key) {
        items.push_back(Format("remote control key %d", *stream.remote_control_key));
        items.push_back(stream.name);
    }
    if (stream.area_code) {
        items.push_back(Format("area code 0x%03X", *stream.area_code));
        items.push_back("guard interval " + NameOfGuardInterval(stream.guard_interval.value_or(0)));
    }
    if (!items.empty()) {
        out.Add("Channel   ", Joined(items));
    }
}

void AddClock(const Model &model, const StreamClock &clock, Paragraphs &out) {
    const std::optional<DateTime> utc = clock.Utc(model.time);
    const std::optional<DateTime> local = clock.Local(model.time);
    std::string text = utc ? ToText(utc) + " UTC" : "-";
    for (const LocalOffset &offset : model.local_offsets) {
        text = Joined({text, offset.country.Text()});
        text += offset.region != 0 ? Format(" region %d ", offset.region) : " ";
        text += clock.OffsetText(offset.minutes);
    }
    out.Add("Clock     ", text + (local ? ", local " + ToText(local) : ""));
}

void AddServices(const Services &services, Paragraphs &out) {
    out.AddEmptyLine();
    out.Add("", services.empty() ? "Services  none named" : "Services");
    size_t width = 0;
    for (const auto &entry : services) {
        width = std::max(width, WidthOf(NameOf(services, entry.first)));
    }
    width = std::min(width, kWidestName);
    for (const auto &[id, service] : services) {
        const ServiceInfo &info = service.info;
        const std::string facts = Joined({info.type ? NameOfServiceType(*info.type) : "",
                                          service.one_seg ? "one-seg" : "", info.provider});
        out.Add(Format("  0x%04X  ", id),
                Padded(NameOrDash(info.name), width) + (facts.empty() ? "" : "  " + facts) +
                    (service.pmt_pid ? Format("  (PMT 0x%04X)", *service.pmt_pid)
                                     : "  (not in the PAT)"));
        if (service.map == nullptr) {
            continue;
        }
        std::vector<std::string> components;
        for (const Component &component : service.map->components) {
            components.push_back(Format("0x%04X ", component.pid) + NameOfComponent(component));
        }
        out.AddList("          ",
                    components.empty() ? std::vector<std::string>{"no components"} : components);
    }
}

// Whether an event is over at this time, as far as the stream says.
bool IsOver(const Event &event, const std::optional<DateTime> &now) {
    return now && event.start && event.duration && *now >= *event.start + *event.duration;
}

// Returns the genre and the nation's own rating, in parentheses.
std::string DescribeContent(const Event &event, const Code &nation) {
    std::vector<std::string> items;
    for (const uint8_t genre : event.genres) {
        const std::string name = NameOfGenre(genre, nation);
        if (std::find(items.begin(), items.end(), name) == items.end()) {
            items.push_back(name);
        }
    }
    for (const Rating &rating : event.ratings) {
        if (rating.country == nation) {
            items.push_back(NameOfRating(rating));
        }
    }
    return items.empty() ? "" : " (" + Joined(items) + ")";
}

// Lists events, the past ones last.
void AddEvents(const Report &report, const Services &services, const StreamClock &clock,
               Paragraphs &out) {
    const Model &model = report.model;
    std::vector<ListedEvent> events = ListEvents(model, report.settings.all);
    const auto over = std::stable_partition(
        events.begin(), events.end(),
        [&](const ListedEvent &event) { return !IsOver(event.event, model.time); });
    const auto first_over = static_cast<size_t>(over - events.begin());
    const size_t shown =
        report.settings.all ? events.size() : std::min(events.size(), kEventsShown);
    const auto name_of = [&](const ListedEvent &event) {
        const std::string name = NameOf(services, event.service_id);
        return !name.empty() ? name : Format("0x%04X", event.service_id);
    };
    size_t width = 0;
    for (size_t i = 0; i < shown; ++i) {
        width = std::max(width, WidthOf(name_of(events[i])));
    }
    width = std::min(width, kWidestName);
    const bool local = clock.Offset() != nullptr;
    const std::string heading = local ? "Events (local time)" : "Events (UTC)";
    out.AddEmptyLine();
    out.Add("", events.empty() ? "Events    none" : heading);
    for (size_t i = 0; i < shown; ++i) {
        const Event &event = events[i].event;
        const std::string start = ToText(local ? clock.Local(event.start) : clock.Utc(event.start));
        out.Add("  " + Padded(start.empty() ? "start not known" : start, 19) + "  " +
                    Padded(NameOrDash(ToText(event.duration)), 8) + "  ",
                Padded(name_of(events[i]), width) + "  " + NameOrDash(event.name) +
                    DescribeContent(event, clock.Nation()) + (i < first_over ? "" : ", over") +
                    (events[i].other_stream ? ", other stream" : ""));
    }
    if (events.size() > shown) {
        out.Add("  ", Format("and %zu more", events.size() - shown));
    }
    if (model.events.LeftOut() != 0) {
        out.Add("  ", std::to_string(model.events.LeftOut()) +
                          " times an event was left out for lack of room");
    }
}

void AddCounters(const Report &report, Paragraphs &out) {
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
    out.AddEmptyLine();
    out.Add("", "Counters");
    for (const auto &counter : counters) {
        out.Add("  ", Format("%-24s %9" PRIu64, counter.name, counter.value));
    }
}

void AddTables(const DemultiplexerCounters &sections, Paragraphs &out) {
    std::vector<std::string> items;
    for (size_t table = 0; table < sections.tables.size(); ++table) {
        if (sections.tables[table] != 0) {
            const auto id = static_cast<uint8_t>(table);
            items.push_back(Format("0x%02X ", id) + NameOfTable(id) + ' ' +
                            std::to_string(sections.tables[table]));
        }
    }
    if (!items.empty()) {
        out.AddEmptyLine();
        out.Add("", "Good sections by table");
        out.AddList("  ", items);
    }
}

// Lists the names of the PIDs that the services use.
std::map<uint16_t, std::string> NamePids(const Services &services) {
    std::map<uint16_t, std::string> names;
    for (const auto &[id, service] : services) {
        if (service.pmt_pid) {
            names.emplace(*service.pmt_pid, "PMT");
        }
        if (service.map == nullptr) {
            continue;
        }
        for (const Component &component : service.map->components) {
            names.emplace(component.pid, NameOfComponent(component));
        }
        if (service.map->pcr_pid) {
            names.emplace(*service.map->pcr_pid, "clock reference");
        }
    }
    return names;
}

void AddPids(const Report &report, const Services &services, Paragraphs &out) {
    const std::vector<PidCounters> &counters = report.sections.pids;
    std::vector<uint16_t> pids;
    for (size_t pid = 0; pid < counters.size(); ++pid) {
        if (counters[pid].packets != 0) {
            pids.push_back(static_cast<uint16_t>(pid));
        }
    }
    if (pids.empty()) {
        return;
    }
    std::stable_sort(pids.begin(), pids.end(), [&](uint16_t left, uint16_t right) {
        return counters[left].packets > counters[right].packets;
    });
    const std::map<uint16_t, std::string> names = NamePids(services);
    out.AddEmptyLine();
    out.Add("", "PIDs (packets, share, continuity errors)");
    const size_t shown = report.settings.all ? pids.size() : std::min(pids.size(), kPidsShown);
    for (size_t i = 0; i < shown; ++i) {
        const PidCounters &own = counters[pids[i]];
        const auto found = names.find(pids[i]);
        const double share =
            100.0 * static_cast<double>(own.packets) / static_cast<double>(report.packets.packets);
        out.Add(Format("  0x%04X  ", pids[i]),
                Format("%9" PRIu64 "  %6.2f %%  %6" PRIu64 "  ", own.packets, share,
                       own.continuity_errors) +
                    (found != names.end() ? found->second : NameOfPid(pids[i])));
    }
    if (pids.size() > shown) {
        out.Add("  ", Format("and %zu more", pids.size() - shown));
    }
}

}  // namespace

void WriteSummary(const Report &report, size_t width, std::FILE *out) {
    const Services services = JoinServices(report.model);
    const NetworkStream *stream = FindOwnStream(report.model);
    const StreamClock clock(report);
    Paragraphs text(out, width);
    AddStream(report, text);
    if (stream != nullptr) {
        AddChannel(*stream, text);
    }
    AddClock(report.model, clock, text);
    if (IsEmergency(report.model, services)) {
        text.Add("Warning   ", "EWBS signalled");
    }
    AddServices(services, text);
    AddEvents(report, services, clock, text);
    AddCounters(report, text);
    AddTables(report.sections, text);
    AddPids(report, services, text);
}

}  // namespace receiver
