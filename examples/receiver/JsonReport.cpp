// One JSON member for each thing that was read; what lies deeper is an object of its own.
#include "JsonReport.h"

#include "JsonWriter.h"

namespace receiver {
namespace {

void WriteServices(const Model &model, JsonWriter &json) {
    json.BeginArray("services");
    for (const auto &entry : JoinServices(model)) {
        const Service &service = entry.second;
        const ServiceInfo *info = service.info;
        json.BeginObject(nullptr);
        json.Number("id", entry.first);
        json.Text("name", info != nullptr ? info->name.Text() : "");
        json.Text("provider", info != nullptr ? info->provider.Text() : "");
        json.Number("type", info != nullptr ? info->type : std::nullopt);
        json.Number("pmt_pid", service.pmt_pid);
        json.Number("pcr_pid",
                    service.map != nullptr ? std::optional(service.map->pcr_pid) : std::nullopt);
        json.BeginArray("components");
        if (service.map != nullptr) {
            for (const Component &component : service.map->components) {
                json.BeginObject(nullptr);
                json.Number("pid", component.pid);
                json.Number("type", component.stream_type);
                json.EndObject();
            }
        }
        json.EndArray();
        json.EndObject();
    }
    json.EndArray();
}

void WriteEvents(const Report &report, JsonWriter &json) {
    json.BeginArray("events");
    for (const EventEntry entry : SortEvents(report.model)) {
        const Event &event = entry->second;
        json.BeginObject(nullptr);
        json.Number("service_id", entry->first.service_id);
        json.Number("event_id", entry->first.event_id);
        json.Text("start", ToText(event.start));
        json.Text("local_start", ToText(ToLocal(event.start, OffsetFor(report))));
        json.Text("duration", ToText(event.duration));
        json.Text("name", event.name);
        json.Text("text", event.text);
        json.EndObject();
    }
    json.EndArray();
}

void WriteLocalOffsets(const Model &model, JsonWriter &json) {
    json.BeginArray("local_time_offsets");
    for (const LocalOffset &offset : model.local_offsets) {
        json.BeginObject(nullptr);
        json.Text("country", offset.country);
        json.Number("region", offset.region);
        json.Text("offset", ToOffsetText(offset.minutes));
        json.Text("change", ToText(offset.change));
        json.Text("next_offset", ToOffsetText(offset.next_minutes));
        json.EndObject();
    }
    json.EndArray();
}

}  // namespace

std::string ToJson(const Report &report) {
    const DemultiplexerCounters &sections = report.sections;
    const Model &model = report.model;
    const auto count = [](uint64_t value) { return static_cast<int64_t>(value); };
    JsonWriter json;
    json.BeginObject(nullptr);
    json.Number("packets", count(report.packets.packets));
    json.Number("packet_size", report.packets.packet_size);
    json.Number("sync_losses", count(report.packets.sync_losses));
    json.Number("continuity_errors", count(sections.continuity_errors));
    json.Number("transport_errors", count(sections.transport_errors));
    json.Number("scrambled", count(sections.scrambled));
    json.BeginObject("sections");
    json.Number("good", count(sections.good));
    json.Number("bad_crc", count(sections.bad_crc));
    json.Number("incomplete", count(sections.incomplete));
    json.EndObject();
    json.BeginObject("tables");
    for (size_t table = 0; table < sections.tables.size(); ++table) {
        if (sections.tables[table] != 0) {
            json.Number(Format("0x%02X", static_cast<unsigned>(table)).c_str(),
                        count(sections.tables[table]));
        }
    }
    json.EndObject();
    json.Number("transport_stream_id", model.transport_stream_id);
    json.Number("network_id", model.network_id);
    json.Text("network_name", model.network_name.Text());
    json.Text("utc_time", ToText(model.utc_time));
    json.Text("local_time", ToText(ToLocal(model.utc_time, OffsetFor(report))));
    WriteLocalOffsets(model, json);
    WriteServices(model, json);
    WriteEvents(report, json);
    json.Number("events_left_out", count(model.events_left_out));
    json.Number("standard_type", report.settings.standard_type);
    json.Text("nation", report.settings.nation);
    json.Boolean("bml", report.settings.bml);
    json.EndObject();
    return json.Out() + '\n';
}

}  // namespace receiver
