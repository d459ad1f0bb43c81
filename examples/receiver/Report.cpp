// Nothing here changes what was read.
#include "Report.h"

#include <algorithm>
#include <cstdarg>
#include <cstdio>

namespace receiver {

std::string Format(const char *format, ...) {
    char text[160];
    va_list arguments;
    va_start(arguments, format);
    std::vsnprintf(text, sizeof text, format, arguments);
    va_end(arguments);
    return text;
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
            services[info.service_id].info = &info;
        }
    }
    for (auto &entry : services) {
        const auto map = model.pmts.find(entry.first);
        if (map != model.pmts.end() && entry.second.pmt_pid == map->second.pmt_pid) {
            entry.second.map = &map->second;
        }
    }
    return services;
}

std::vector<EventEntry> SortEvents(const Model &model) {
    std::vector<EventEntry> events;
    for (const auto &entry : model.events) {
        events.push_back(&entry);
    }
    std::stable_sort(events.begin(), events.end(), [](EventEntry left, EventEntry right) {
        const auto &first = left->second.start;
        const auto &second = right->second.start;
        return first && (!second || *first < *second);
    });
    return events;
}

std::string ToOffsetText(int minutes) {
    const int size = minutes < 0 ? -minutes : minutes;
    return Format("%c%02d:%02d", minutes < 0 ? '-' : '+', size / 60, size % 60);
}

const LocalOffset *OffsetFor(const Report &report) {
    const std::vector<LocalOffset> &offsets = report.model.local_offsets;
    const auto own = std::find_if(offsets.begin(), offsets.end(), [&](const LocalOffset &offset) {
        return offset.country == report.settings.nation;
    });
    if (own != offsets.end()) {
        return &*own;
    }
    return offsets.empty() ? nullptr : &offsets.front();
}

std::optional<DateTime> ToLocal(const std::optional<DateTime> &time, const LocalOffset *offset) {
    if (!time || offset == nullptr) {
        return std::nullopt;
    }
    const bool changed = offset->change && !(*time < *offset->change);
    return Shifted(*time, changed ? offset->next_minutes : offset->minutes);
}

}  // namespace receiver
