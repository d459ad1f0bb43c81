// The example receiver from bytes to JSON: one stream, fed whole and in pieces, gives one report, its counters add up,
// its text is fit for JSON, and no line of the summary is too wide. An input whose first byte is even is a stream. Any
// other input is a list of sections {PID, length, bytes}, which are given their lengths and CRCs and put into packets,
// so that they pass those checks.
#include <numeric>
#include <sstream>

#include "BroadcastText.h"
#include "Fuzz.h"
#include "Paragraphs.h"
#include "Varnek_Util.h"
#include "support/ReceiverRun.h"

namespace {

using receiver::Bytes;
using receiver::kPacketSize;

// Every PID whose tables the receiver reads without a PAT, and two that a PAT may name.
constexpr uint16_t kPids[] = {0x0000, 0x0010, 0x0011, 0x0012, 0x0014, 0x0026, 0x0027, 0x0101, 0x1FC8};

Bytes StreamOf(Input &input) {
    streamwriter::StreamWriter writer;
    while (!input.Empty()) {
        const size_t pid = input.Byte() % std::size(kPids);
        const size_t length = input.Byte();
        Bytes section = input.Bytes(length);
        section.resize(std::max<size_t>(section.size(), 3));
        section[1] = 0xB0;
        section = streamwriter::Seal(std::move(section));
        CHECK(VarnekUtil_CheckSectionCRC32(section.data()) == TRUE);
        writer.SendSections(kPids[pid], {section});
    }
    return writer.Stream();
}

// Whether a text is well-formed UTF-8 without control characters but line feeds, and so decodes to itself.
bool IsText(const std::string &text) { return receiver::ToUtf8("\x15" + text) == text; }

}  // namespace

int LLVMFuzzerTestOneInput(const uint8_t *data, size_t size) {
    Input input(data, size);
    const uint8_t mode = input.Byte();
    const bool raw = mode % 2 == 0;
    const Bytes stream = raw ? input.Bytes() : StreamOf(input);

    const receiver::Report report = receiver::ReadStream(stream, SIZE_MAX / 2);
    const receiver::DemultiplexerCounters &sections = report.sections;
    CHECK(report.packets.bytes == stream.size());
    CHECK(report.packets.packets * kPacketSize <= stream.size());
    CHECK(raw || report.packets.packets * kPacketSize == stream.size());
    CHECK(std::accumulate(sections.tables.begin(), sections.tables.end(), uint64_t{0}) == sections.good);
    CHECK(raw || sections.continuity_errors == 0);
    uint64_t packets = sections.transport_errors;
    uint64_t errors = 0;
    for (const receiver::PidCounters &pid : sections.pids) {
        packets += pid.packets;
        errors += pid.continuity_errors;
    }
    CHECK(packets == report.packets.packets && errors == sections.continuity_errors);

    const size_t width = 40 + mode % 80u;
    const std::string json = ToJson(report);
    const std::string summary = ToSummary(report, width);
    CHECK(IsText(json) && IsText(summary));
    std::istringstream lines(summary);
    for (std::string line; std::getline(lines, line);) {
        CHECK(receiver::WidthOf(line) <= width);
    }
    CHECK(ToJson(receiver::ReadStream(stream, mode / 2u + 1)) == json);
    return 0;
}
