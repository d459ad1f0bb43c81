// Each function writes some members of the outermost object, or an array.
#include "Report.h"

#include "JsonWriter.h"
#include "Names.h"

namespace receiver {
namespace {

int64_t Number(uint64_t value) {
    return static_cast<int64_t>(value);
}

void WriteCounters(const Report &report, JsonWriter &json) {
    const DemultiplexerCounters &sections = report.sections;
    json.Number("packets", Number(report.packets.packets));
    json.Number("packet_size", report.packets.packet_size);
    json.Thousandths("duration", DurationOf(report));
    json.Number("bit_rate", BitRateOf(report));
    json.Number("sync_losses", Number(report.packets.sync_losses));
    json.Number("continuity_errors", Number(sections.continuity_errors));
    json.Number("transport_errors", Number(sections.transport_errors));
    json.Number("scrambled", Number(sections.scrambled));
    json.BeginObject("sections");
    json.Number("good", Number(sections.good));
    json.Number("bad_crc", Number(sections.bad_crc));
    json.Number("incomplete", Number(sections.incomplete));
    json.EndObject();
    json.BeginObject("tables");
    for (size_t table = 0; table < sections.tables.size(); ++table) {
        if (sections.tables[table] != 0) {
            json.Number(Format("0x%02X", static_cast<unsigned>(table)).c_str(),
                        Number(sections.tables[table]));
        }
    }
    json.EndObject();
}

void WritePids(const Report &report, JsonWriter &json) {
    const std::vector<PidCounters> &pids = report.sections.pids;
    json.BeginArray("pids");
    for (size_t pid = 0; pid < pids.size(); ++pid) {
        if (pids[pid].packets == 0) {
            continue;
        }
        json.BeginObject(nullptr);
        json.Number("pid", Number(pid));
        json.Number("packets", Number(pids[pid].packets));
        json.Thousandths("share", Number(pids[pid].packets * 100000 / report.packets.packets));
        json.Number("continuity_errors", Number(pids[pid].continuity_errors));
        json.EndObject();
    }
    json.EndArray();
}

void WriteNetwork(const Model &model, JsonWriter &json) {
    static const NetworkStream kNone{};
    const NetworkStream *own = FindOwnStream(model);
    const NetworkStream &stream = own != nullptr ? *own : kNone;
    json.Number("transport_stream_id", model.transport_stream_id);
    json.Number("network_id", model.network_id);
    json.Text("network_name", model.network_name);
    json.Number("remote_control_key", stream.remote_control_key);
    json.Text("ts_name", stream.name);
    json.Number("area_code", stream.area_code);
    json.Text("guard_interval",
              stream.guard_interval ? NameOfGuardInterval(*stream.guard_interval) : "");
}

void WriteTime(const Model &model, const StreamClock &clock, JsonWriter &json) {
    json.Text("utc_time", ToText(clock.Utc(model.time)));
    json.Text("local_time", ToText(clock.Local(model.time)));
    json.BeginArray("local_time_offsets");
    for (const LocalOffset &offset : model.local_offsets) {
        json.BeginObject(nullptr);
        json.Text("country", offset.country.Text());
        json.Number("region", offset.region);
        json.Text("offset", clock.OffsetText(offset.minutes));
        json.Text("change", ToText(clock.Utc(offset.change)));
        json.Text("next_offset", clock.OffsetText(offset.next_minutes));
        json.EndObject();
    }
    json.EndArray();
}

void WriteComponent(const Component &component, JsonWriter &json) {
    json.BeginObject(nullptr);
    json.Number("pid", component.pid);
    json.Number("type", component.stream_type);
    json.Number("tag", component.tag);
    json.Text("language", component.languages[0].Text());
    json.Text("second_language", component.languages[1].Text());
    json.Text("role", RoleOfComponent(component));
    json.Text("name", NameOfComponent(component));
    json.EndObject();
}

void WriteServices(const std::map<uint16_t, Service> &services, JsonWriter &json) {
    json.BeginArray("services");
    for (const auto &[id, service] : services) {
        json.BeginObject(nullptr);
        json.Number("id", id);
        json.Text("name", service.info.name);
        json.Text("provider", service.info.provider);
        json.Number("type", service.info.type);
        json.Boolean("one_seg", service.one_seg);
        json.Number("pmt_pid", service.pmt_pid);
        json.Number("pcr_pid", service.map != nullptr ? service.map->pcr_pid : std::nullopt);
        json.BeginArray("components");
        if (service.map != nullptr) {
            for (const Component &component : service.map->components) {
                WriteComponent(component, json);
            }
        }
        json.EndArray();
        json.EndObject();
    }
    json.EndArray();
}

void WriteEvent(const ListedEvent &listed, const StreamClock &clock, JsonWriter &json) {
    const Event &event = listed.event;
    json.BeginObject(nullptr);
    json.Number("service_id", listed.service_id);
    json.Number("event_id", event.id);
    json.Boolean("other_stream", listed.other_stream);
    json.Text("start", ToText(clock.Utc(event.start)));
    json.Text("local_start", ToText(clock.Local(event.start)));
    json.Text("duration", ToText(event.duration));
    json.Text("language", event.language.Text());
    json.Text("name", event.name);
    json.Text("text", event.text);
    json.Text("extended_text", event.extended_text);
    json.BeginArray("audio_languages");
    for (const Code &language : event.audio_languages) {
        json.Text(nullptr, language.Text());
    }
    json.EndArray();
    json.BeginArray("genres");
    for (const uint8_t genre : event.genres) {
        json.Text(nullptr, NameOfGenre(genre, clock.Nation()));
    }
    json.EndArray();
    json.BeginArray("ratings");
    for (const Rating &rating : event.ratings) {
        json.BeginObject(nullptr);
        json.Text("country", rating.country.Text());
        json.Text("rating", NameOfRating(rating));
        json.EndObject();
    }
    json.EndArray();
    json.EndObject();
}

}  // namespace

void WriteJson(const Report &report, std::FILE *out) {
    const Model &model = report.model;
    const StreamClock clock(report);
    const std::map<uint16_t, Service> services = JoinServices(model);
    JsonWriter json(out);
    json.BeginObject(nullptr);
    WriteCounters(report, json);
    WritePids(report, json);
    WriteNetwork(model, json);
    WriteTime(model, clock, json);
    json.Boolean("ewbs", IsEmergency(model, services));
    WriteServices(services, json);
    json.Number("components_left_out", Number(model.components_left_out));
    json.BeginArray("events");
    for (const ListedEvent &event : ListEvents(model, true)) {
        WriteEvent(event, clock, json);
    }
    json.EndArray();
    json.Number("events_left_out", Number(model.events.LeftOut() + model.other_events.LeftOut()));
    json.Number("standard_type", report.settings.standard_type);
    json.Text("nation", report.settings.nation);
    json.Boolean("bml", report.settings.bml);
    json.EndObject();
    std::fputc('\n', out);
}

}  // namespace receiver
