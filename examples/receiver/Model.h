// The content of a stream's tables: the parser fills it, the report shows it. It holds only the
// tables that apply now and to this stream, and other streams' events apart from its own. Times
// are as the stream carries them.
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
#include "Name.h"

namespace receiver {

struct Program {  // a PAT entry
    uint16_t service_id;
    uint16_t pmt_pid;
};

struct Component {  // a PMT entry
    uint16_t pid;
    uint16_t data_component_id;  // where the descriptor is the one of a data component
    uint8_t stream_type;
    uint8_t descriptor;  // tag of the one that tells the kind of data, 0 for none
    Code languages[2];   // of audio
};

struct ProgramMap {    // a PMT
    uint16_t pmt_pid;  // where it came
    uint16_t pcr_pid;
    bool emergency;  // a warning to the population is on
    std::vector<Component> components;
};

struct NetworkStream {  // an entry of the NIT, about a transport stream
    uint16_t transport_stream_id;
    std::optional<uint8_t> remote_control_key;
    std::string name;
    std::optional<uint16_t> area_code;
    std::optional<uint8_t> guard_interval;
    bool dvb;                                // sent in a way that only DVB has
    std::vector<uint16_t> one_seg_services;  // service_ids
};

struct NetworkSection {
    bool emergency;
    std::vector<NetworkStream> streams;
};

struct ServiceInfo {  // an SDT entry
    uint16_t service_id;
    std::optional<uint8_t> type;
    Name provider;
    Name name;
};

struct LocalOffset {
    Code country;
    uint8_t region;
    int minutes;  // to be added to the stream's time
    std::optional<DateTime> change;
    int next_minutes;  // from then on
};

// A table that comes in numbered sections. A section takes the place of the earlier one of its
// number: repeats change nothing, and a new version takes over as it comes in.
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
    // The limit for all PMTs together is far above any stream's need.
    static constexpr size_t kMostComponents = 65536;

    std::optional<uint16_t> transport_stream_id;
    std::optional<uint16_t> network_id;
    Name network_name;
    std::optional<DateTime> time;  // the latest, as the stream carries it
    std::vector<LocalOffset> local_offsets;
    Sections<std::vector<Program>> pat;
    Sections<std::vector<ServiceInfo>> sdt;
    Sections<NetworkSection> nit;
    std::map<uint16_t, ProgramMap> pmts;  // by service_id
    size_t components = 0;                // in these
    uint64_t components_left_out = 0;     // for lack of room
    EventTable events;
    EventTable other_events;  // of other transport streams, which must not push this stream's out
};

}  // namespace receiver

#endif
