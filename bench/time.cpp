// Converts seconds to a calendar record and back, on days that the branch predictor cannot learn.
#include <chrono>

#include "Bench.h"
#include "Varnek_Time.h"

namespace {

constexpr uint32_t kStep = 86400 * 37 + 12345;
constexpr uint32_t kEnd = 1900000000;  // 2030

template <typename Convert>
void Run(benchmark::State &state, Convert convert) {
    uint32_t seconds = 0;
    for (auto _ : state) {
        seconds = seconds < kEnd - kStep ? seconds + kStep : seconds % 100000;
        benchmark::DoNotOptimize(convert(seconds));
    }
}

VarnekCDateTime ToRecord(uint32_t seconds) {
    VarnekCDateTime record = {};
    VarnekPGL_SecondsToDataTime(seconds, &record);
    return record;
}

VarnekCDateTime ToRecordByChrono(uint32_t seconds) {
    using namespace std::chrono;
    const sys_seconds time{std::chrono::seconds{seconds}};
    const auto day = floor<days>(time);
    const year_month_day date(day);
    const hh_mm_ss clock(time - day);
    return {static_cast<int>(date.year()),
            static_cast<int>(static_cast<unsigned>(date.month())),
            static_cast<int>(static_cast<unsigned>(date.day())),
            static_cast<int>(clock.hours().count()),
            static_cast<int>(clock.minutes().count()),
            static_cast<int>(clock.seconds().count())};
}

uint32_t FromRecordByChrono(const VarnekCDateTime &record) {
    using namespace std::chrono;
    const sys_days day = year(record.iYear) / static_cast<int>(record.iMonth) / record.iDay;
    const sys_seconds time =
        day + hours(record.iHour) + minutes(record.iMinute) + seconds(record.iSecond);
    return static_cast<uint32_t>(time.time_since_epoch().count());
}

// Makes the records in advance, so that only converting them back is measured.
template <typename Convert>
void RunBack(benchmark::State &state, Convert convert) {
    constexpr size_t kCount = 512;
    std::vector<VarnekCDateTime> records;
    records.reserve(kCount);
    for (uint32_t i = 0; i < kCount; i++) {
        records.push_back(ToRecord(i * kStep));
    }
    size_t i = 0;
    for (auto _ : state) {
        benchmark::DoNotOptimize(convert(records[++i % kCount]));
    }
}

void RegisterAll() {
    bench::Add("calendar/to:ours", [](benchmark::State &state) { Run(state, ToRecord); });
    bench::Add("calendar/to:chrono", [](benchmark::State &state) { Run(state, ToRecordByChrono); });
    bench::Add("calendar/from:ours", [](benchmark::State &state) {
        RunBack(state,
                [](const VarnekCDateTime &record) { return VarnekPGL_DateTimeToSeconds(&record); });
    });
    bench::Add("calendar/from:chrono",
               [](benchmark::State &state) { RunBack(state, FromRecordByChrono); });
}

}  // namespace

int main(int argc, char **argv) {
    return bench::Main(argc, argv, RegisterAll);
}
