// Nothing here changes what was read.
#include "Report.h"

#include <algorithm>
#include <cmath>

#include "Names.h"

namespace receiver {
namespace {

constexpr double kTicksPerSecond = 27e6;
constexpr int kBrasiliaMinutes = -180;  // from UTC, all year round

}  // namespace

std::optional<int64_t> DurationOf(const Report &report) {
    const uint64_t ticks = report.sections.clock.ticks;
    return ticks == 0 ? std::nullopt : std::optional<int64_t>(ticks / (uint64_t{27} * 1000));
}

std::optional<int64_t> BitRateOf(const Report &report) {
    const PcrSpan &clock = report.sections.clock;
    if (clock.ticks == 0) {
        return std::nullopt;
    }
    const double bits = static_cast<double>(clock.packets) * kPacketSize * 8;
    return std::llround(bits * kTicksPerSecond / static_cast<double>(clock.ticks));
}

std::map<uint16_t, Service> JoinServices(const Model &model) {
    std::map<uint16_t, Service> services;
    for (const auto &section : model.pat) {
        for (const Program &program : section.second) {
            services[program.service_id].pmt_pid = program.pmt_pid;
        }
    }
    for (const auto &section : model.sdt) {
        for (const ServiceInfo &info : section.second) {
            services[info.service_id].info = info;
        }
    }
    for (const auto &[id, map] : model.pmts) {
        if (!model.transport_stream_id) {
            services[id].pmt_pid = map.pmt_pid;
        }
    }
    const NetworkStream *stream = FindOwnStream(model);
    for (auto &entry : services) {
        const auto map = model.pmts.find(entry.first);
        if (map != model.pmts.end() && entry.second.pmt_pid == map->second.pmt_pid) {
            entry.second.map = &map->second;
        }
        const bool one_seg_pid = (entry.second.pmt_pid.value_or(0) & 0x1FF8) == kPidOneSegPmt;
        entry.second.one_seg =
            (one_seg_pid && (stream == nullptr || !stream->dvb)) ||
            (stream != nullptr && std::count(stream->one_seg_services.begin(),
                                             stream->one_seg_services.end(), entry.first) != 0);
    }
    return services;
}

const NetworkStream *FindOwnStream(const Model &model) {
    const NetworkStream *only = nullptr;
    size_t count = 0;
    for (const auto &section : model.nit) {
        for (const NetworkStream &stream : section.second.streams) {
            if (model.transport_stream_id == stream.transport_stream_id) {
                return &stream;
            }
            only = &stream;
            ++count;
        }
    }
    return !model.transport_stream_id && count == 1 ? only : nullptr;
}

bool IsEmergency(const Model &model, const std::map<uint16_t, Service> &services) {
    return std::any_of(model.nit.begin(), model.nit.end(),
                       [](const auto &section) { return section.second.emergency; }) ||
           std::any_of(services.begin(), services.end(), [](const auto &entry) {
               return entry.second.map != nullptr && entry.second.map->emergency;
           });
}

std::vector<ListedEvent> ListEvents(const Model &model, bool others) {
    std::vector<ListedEvent> events;
    const auto own = model.events.Joined();
    events.reserve(own.size());
    for (const auto &[key, event] : own) {
        events.push_back({key.first, event, false});
    }
    const auto foreign = others ? model.other_events.Joined() : decltype(own)();
    for (const auto &[key, event] : foreign) {
        if (own.count(key) == 0) {
            events.push_back({key.first, event, true});
        }
    }
    const auto order = [](const ListedEvent &left, const ListedEvent &right) {
        const auto &first = left.event.start;
        const auto &second = right.event.start;
        return first && (!second || *first < *second);
    };
    std::stable_sort(events.begin(), events.end(), order);
    return events;
}

StreamClock::StreamClock(const Report &report) {
    const std::vector<LocalOffset> &offsets = report.model.local_offsets;
    const Code own = Code::Of(report.settings.nation.c_str());
    const std::optional<uint8_t> &region = report.settings.region;
    bool has_own = false;
    for (const LocalOffset &offset : offsets) {
        const bool is_own = offset.country == own;
        has_own = has_own || is_own;
        if (offset_ == nullptr && is_own && region.value_or(offset.region) == offset.region) {
            offset_ = &offset;
        }
    }
    if (offset_ == nullptr && !region && !offsets.empty()) {
        offset_ = &offsets.front();
    }
    const NetworkStream *stream = FindOwnStream(report.model);
    const bool is_dvb = stream != nullptr && stream->dvb;
    if (!offsets.empty() && !has_own) {
        nation_ = offsets.front().country;
    } else if (has_own || !is_dvb) {
        nation_ = own;
    }
}

std::optional<DateTime> StreamClock::Utc(const std::optional<DateTime> &time) const {
    return time && nation_ == kBrazil ? *time - DateTime{kBrasiliaMinutes} * 60 : time;
}

std::optional<DateTime> StreamClock::Local(const std::optional<DateTime> &time) const {
    if (!time || offset_ == nullptr) {
        return std::nullopt;
    }
    const bool changed = offset_->change && !(*time < *offset_->change);
    return *time + DateTime{changed ? offset_->next_minutes : offset_->minutes} * 60;
}

std::string StreamClock::OffsetText(int minutes) const {
    const int total = minutes + (nation_ == kBrazil ? kBrasiliaMinutes : 0);
    const int size = total < 0 ? -total : total;
    return Format("%c%02d:%02d", total < 0 ? '-' : '+', size / 60, size % 60);
}

}  // namespace receiver
