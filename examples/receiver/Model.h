// The content of a stream's tables, as far as they apply now. The parser fills it, and the report
// shows it. Times are those of the stream, not converted.
#ifndef RECEIVER_MODEL_H
#define RECEIVER_MODEL_H

#include <cstddef>
#include <cstdint>
#include <map>
#include <optional>
#include <string>
#include <utility>
#include <vector>

#include "BroadcastTime.h"
#include "Code.h"
#include "Events.h"
#include "TransportStream.h"

namespace receiver {

struct Program {  // a PAT entry
    uint16_t service_id;
    uint16_t pmt_pid;
};

struct Component {  // a PMT entry
    uint16_t pid;
    uint16_t data_component_id;  // if the descriptor is that of a data component
    uint8_t stream_type;
    uint8_t descriptor;          // the one that says what kind of data it is, 0 for none
    uint8_t audio_type;          // of ISO/IEC 13818-1, 0 when it is not defined
    std::optional<uint8_t> tag;  // component_tag
    Code languages[2];           // empty for none

    // Whether it carries application information tables.
    bool IsAit() const {
        return stream_type == kStreamPrivateSections &&
               (descriptor == kDescriptorApplicationSignalling ||
                (descriptor == kDescriptorDataComponent && data_component_id == kDataAit));
    }
};

struct ProgramMap {    // a PMT
    uint16_t pmt_pid;  // the PID that carried it
    std::optional<uint16_t> pcr_pid;
    bool emergency;  // an emergency warning is active
    std::vector<Component> components;
};

struct NetworkStream {  // an entry of the NIT, about a transport stream
    uint16_t transport_stream_id;
    std::optional<uint8_t> remote_control_key;
    std::string name;
    std::optional<uint16_t> area_code;
    std::optional<uint8_t> guard_interval;
    bool dvb;                                // uses a delivery system that ISDB-T does not have
    std::vector<uint16_t> one_seg_services;  // service_ids
};

struct NetworkSection {
    bool emergency;
    std::vector<NetworkStream> streams;
};

struct ServiceInfo {  // an SDT entry
    uint16_t service_id;
    std::optional<uint8_t> type;
    std::string provider;
    std::string name;
};

struct LocalOffset {
    Code country;
    uint8_t region;
    int minutes;  // to be added to the stream's time
    std::optional<DateTime> change;
    int next_minutes;  // from then on
};

// A table of numbered sections, each of which replaces the earlier one with its number. So a new
// version replaces the old one section by section.
template <typename Content>
class Sections {
  public:
    void Replace(uint8_t number, uint8_t last, Content content) {
        sections_.erase(sections_.upper_bound(last), sections_.end());
        if (number <= last) {
            sections_[number] = std::move(content);
        }
    }
    auto begin() const { return sections_.begin(); }
    auto end() const { return sections_.end(); }

  private:
    std::map<uint8_t, Content> sections_;
};

struct Model {
    // The limit for all PMTs together; no stream comes near it.
    static constexpr size_t kMostComponents = 65536;

    std::optional<uint16_t> transport_stream_id;
    std::optional<uint16_t> network_id;
    std::string network_name;
    std::optional<DateTime> time;  // the latest, not converted
    std::vector<LocalOffset> local_offsets;
    Sections<std::vector<Program>> pat;
    Sections<std::vector<ServiceInfo>> sdt;
    Sections<NetworkSection> nit;
    std::map<uint16_t, ProgramMap> pmts;  // by service_id
    size_t components = 0;                // in all PMTs
    uint64_t components_left_out = 0;     // because there was no room
    EventTable events;
    EventTable other_events;  // of other streams, apart so that they leave room for this one's
};

}  // namespace receiver

#endif
