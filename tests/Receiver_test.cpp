// The example receiver: first each stage, with packets and sections made here, then the whole program on the sample
// stream, on damaged streams and on inputs that it refuses.
#include "Receiver.h"

#include <fcntl.h>
#include <pty.h>
#include <sys/ioctl.h>
#include <sys/socket.h>
#include <sys/stat.h>
#include <unistd.h>

#include <ctime>
#include <limits>
#include <sstream>

#include "BroadcastText.h"
#include "BroadcastTime.h"
#include "CommandLine.h"
#include "Paragraphs.h"
#include "Varnek_Version.h"
#include "support/Families.h"
#include "support/ReceiverRun.h"
#include "support/VarnekTest.h"

namespace receiver {
namespace {

using namespace streamwriter;
using ::testing::AllOf, ::testing::ElementsAre, ::testing::EndsWith, ::testing::HasSubstr, ::testing::StartsWith;

using Arguments = std::vector<std::string>;

class Receiver : public VarnekTest {
  protected:
    Receiver() {
        std::setlocale(LC_CTYPE, "C.UTF-8");
        setenv("COLUMNS", "80", 1);
        Show(sample_, "SAMPLE");
    }
    const std::string sample_ = TestFile("sample.ts");

    // Runs the program and notes its status and messages.
    void NoteProgram(const Arguments &arguments, std::FILE *out) {
        int status = -1;
        const std::string err = Written([&](std::FILE *file) { status = RunReceiver(arguments, {out, file}); });
        Note(::testing::PrintToString(arguments) + " = " + std::to_string(status) + "\n" + err);
    }
    // Also returns the output, and notes it up to the first empty line, unless it is JSON.
    std::string NoteProgram(const Arguments &arguments) {
        const std::string out = Written([&](std::FILE *file) { NoteProgram(arguments, file); });
        Note(out[0] == '{' ? "" : out.substr(0, (out + '\n').find("\n\n") + 1));
        return out;
    }
};

// Returns the lines of a text that are not in another one.
std::string NewLines(const std::string &text, const std::string &other) {
    std::string lines;
    std::istringstream stream(text);
    for (std::string line; std::getline(stream, line);) {
        lines += ("\n" + other).find("\n" + line + "\n") == std::string::npos ? line + "\n" : "";
    }
    return lines;
}

// Returns what the tables say, without the counters of the PIDs that they come from.
std::string TablesOf(std::string json) {
    const size_t pids = json.find("  \"pids\"");
    json.erase(pids, json.find("  \"transport_stream_id\"") - pids);
    return json.substr(json.find("  \"tables\""));
}

Bytes Changed(Bytes bytes, size_t at, unsigned char value) {
    bytes[at] = value;
    return bytes;
}

// Makes packets that are numbered in their counters and payloads.
Bytes Numbered(unsigned first, unsigned count, const Bytes &lead = {}, const Bytes &trail = {}) {
    Bytes out;
    for (unsigned i = first; i < first + count; ++i) {
        out = out + lead + MakePacket(0x100, i, U16(i)) + trail;
    }
    return out;
}

TEST_F(Receiver, FindsPacketsAmongOtherBytes) {
    std::mt19937 random(47);
    const Bytes stamp = Bytes(4, 0x11), parity = Bytes(16, 0x22), udp = Bytes(12, 0x80),
                noise = RandomBytes(random, 300);
    Bytes table, packet_cut = Numbered(5, 1);
    packet_cut.erase(packet_cut.begin() + 60, packet_cut.begin() + 100);
    for (int i = 0; i < 400; ++i) {
        table = table + Bytes{0x47} + Bytes(191, 0);
    }
    const struct {
        const char *name;
        Bytes stream;
        size_t packets, losses, size, continuity;
    } cases[] = {
        {"188", Numbered(0, 300), 300, 0, 188, 0},
        {"192", Numbered(0, 300, stamp), 300, 0, 192, 0},
        {"204", Numbered(0, 300, {}, parity), 300, 0, 204, 0},
        {"one packet", Numbered(0, 1), 1, 0, 188, 0},
        {"one of 192", Numbered(0, 1, stamp), 1, 0, 192, 0},
        {"time stamps that look like sync bytes", Numbered(0, 9, {0x47, 0x01, 0x00, 0x10}), 9, 0, 192, 0},
        {"garbage in front", noise + Numbered(0, 20), 20, 1, 188, 0},
        {"garbage between, twice", Numbered(0, 9) + noise + Numbered(9, 4) + noise + Numbered(13, 5), 18, 2, 188, 0},
        {"garbage soon", Numbered(0, 3) + noise + Numbered(3, 17), 20, 1, 188, 0},
        {"garbage before the last packet", Numbered(0, 9) + noise + Numbered(9, 1), 10, 1, 188, 0},
        {"datagrams", udp + Numbered(0, 7) + udp + Numbered(7, 7) + udp + Numbered(14, 7), 21, 3, 188, 0},
        {"a damaged sync byte", Numbered(0, 7) + Bytes(188, 0) + Numbered(8, 12), 19, 1, 188, 1},
        {"bytes missing within a packet", Numbered(0, 5) + packet_cut + Numbered(6, 14), 19, 1, 188, 1},
        {"cut in a packet", Numbered(0, 9) + Bytes{0x47, 0x01, 0x00}, 9, 0, 188, 0},
        {"cut in parity", Numbered(0, 9, {}, parity) + Numbered(9, 1), 10, 0, 204, 0},
        {"sync bytes and nothing else", Bytes(188 * 50 + 7, 0x47), 0, 0, 0, 0},
        {"less than a packet", Bytes(187, 0x47), 0, 0, 0, 0},
        {"a table with even strides", noise + table, 0, 0, 0, 0},
        {"noise", RandomBytes(random, 3000000), 0, 0, 0, 0},
    };
    for (const auto &c : cases) {
        for (const size_t block : {size_t{7}, size_t{190}, size_t{65536}}) {
            const Report report = ReadStream(c.stream, block);
            EXPECT_THAT(
                (std::array<uint64_t, 5>{report.packets.packets, report.packets.sync_losses, report.packets.packet_size,
                                         report.sections.continuity_errors, report.sections.pids[0x100].packets}),
                ElementsAre(c.packets, c.losses, c.size, c.continuity, c.packets))
                << c.name << ", block " << block;
        }
    }
}

// Demultiplexes packets of one PID, each with its counter.
DemultiplexerCounters Demultiplexed(uint16_t pid, const std::vector<std::pair<unsigned, Content>> &packets) {
    Demultiplexer demultiplexer([](uint16_t, const unsigned char *, size_t) {});
    for (const auto &[counter, content] : packets) {
        demultiplexer.Push(MakePacket(pid, counter, content.bytes, content.flags).data());
    }
    return demultiplexer.Counters();
}

TEST_F(Receiver, CountsContinuityErrors) {
    const Content plain{{}, kPayload}, scrambled{{}, kScrambled | kPayload}, nothing{{}, 0};
    const Content error{{}, kTransportError | kScrambled | kPayload};
    const Content empty{{183, 0x00}, kAdaptation}, jump{{1, 0x80}, kAdaptation | kPayload};
    const struct {
        const char *name;
        std::vector<std::pair<unsigned, Content>> packets;
        uint64_t continuity, transport, scrambled;
        uint16_t pid;
    } cases[] = {
        {"in order", {{14, plain}, {15, plain}, {0, plain}, {1, plain}}, 0, 0, 0, 0x100},
        {"one lost", {{1, plain}, {3, plain}, {4, plain}}, 1, 0, 0, 0x100},
        {"sent twice", {{1, plain}, {1, plain}, {2, plain}, {2, plain}, {3, plain}}, 0, 0, 0, 0x100},
        {"sent four times", {{1, plain}, {1, plain}, {1, plain}, {1, plain}, {2, plain}}, 2, 0, 0, 0x100},
        {"without payload", {{1, plain}, {1, empty}, {1, empty}, {2, plain}}, 0, 0, 0, 0x100},
        {"counted without payload", {{1, plain}, {2, empty}, {3, plain}}, 1, 0, 0, 0x100},
        {"announced jump", {{1, plain}, {9, jump}, {10, plain}}, 0, 0, 0, 0x100},
        {"no field at all", {{1, plain}, {7, nothing}, {2, plain}}, 0, 0, 0, 0x100},
        {"transport error", {{1, plain}, {9, error}, {2, plain}}, 0, 1, 0, 0x100},
        {"lost to a transport error", {{1, plain}, {2, error}, {3, plain}}, 1, 1, 0, 0x100},
        {"scrambled", {{1, scrambled}, {2, scrambled}, {4, plain}}, 1, 0, 2, 0x100},
        {"null packets", {{1, plain}, {7, plain}, {7, plain}, {7, plain}}, 0, 0, 0, 0x1FFF},
    };
    for (const auto &c : cases) {
        const DemultiplexerCounters counters = Demultiplexed(c.pid, c.packets);
        const PidCounters &pid = counters.pids[c.pid];
        EXPECT_THAT((std::array<uint64_t, 5>{counters.continuity_errors, counters.transport_errors, counters.scrambled,
                                             pid.continuity_errors, pid.packets}),
                    ElementsAre(c.continuity, c.transport, c.scrambled, c.continuity, c.packets.size() - c.transport))
            << c.name;
    }
}

TEST_F(Receiver, MeasuresClocks) {
    constexpr uint64_t second = 27000000, cycle = (uint64_t{1} << 33) * 300;
    PcrMeter meter;
    meter.Push(1, cycle - second / 2, 10);
    meter.Push(1, second / 2, 110);         // over the clock's end
    meter.Push(1, 7 * second, 130);         // a jump
    meter.Push(2, 0, 141);                  // another clock
    meter.Push(1, 7 * second + 9, 160);     // in step again
    meter.Push(1, 99 * second, 161);        // damaged
    meter.Push(1, 7 * second + 19, 165);    // the interval around it counts
    meter.Push(1, 7 * second + 2000, 166);  // damaged, within a second
    meter.Push(1, 7 * second + 29, 170);
    meter.Push(1, 7 * second + 1, 171);  // damaged, back
    meter.Push(1, 7 * second + 39, 175);
    meter.Push(1, 6 * second, 180);  // back for good
    meter.Push(1, 6 * second + 1, 182);
    meter.Push(2, second, 190);  // less than the first clock
    EXPECT_EQ(meter.Longest().ticks, second + 39 + 1);
    EXPECT_EQ(meter.Longest().packets, 100u + 45 + 2);
}

TEST_F(Receiver, AssemblesSections) {
    const Bytes small = MakeSection(0x4E, 1, Bytes(20, 1));   // 32 bytes
    const Bytes large = MakeSection(0x50, 1, Bytes(388, 2));  // 400 bytes, in three packets
    const Bytes damaged = Changed(small, 10, 0x11);
    constexpr unsigned start = kUnitStart | kPayload;
    const std::vector<Content> parts = SplitSections({large});
    const Content &first = parts[0], &second = parts[1], &third = parts[2];
    const Content late{second.bytes, kPayload | 1}, again{second.bytes, kPayload | 15};
    const Content last_and_next = SplitSections({large, small})[2], cut_and_next{Bytes(6, 5) + small, start};
    const Content far{Bytes{184} + small, start}, inner{small, kPayload};
    const struct {
        const char *name;
        std::vector<Content> contents;  // the flags' low four bits are steps of the counter beyond 1
        uint64_t good, bad_crc, incomplete;
    } cases[] = {
        {"two in a packet", SplitSections({small, small}), 2, 0, 0},
        {"damaged between good ones", SplitSections({small, damaged, small}), 2, 1, 0},
        {"over packets", parts, 1, 0, 0},
        {"behind an adaptation field", {{Bytes{1, 0x00, 0} + small, start | kAdaptation}}, 1, 0, 0},
        {"the longest", SplitSections({MakeSection(0x50, 1, Bytes(4084, 3))}), 1, 0, 0},
        {"too long", SplitSections({MakeSection(0x50, 1, Bytes(4085, 3))}), 0, 0, 1},
        {"too long for its table", SplitSections({MakeSection(0x42, 1, Bytes(1013, 3))}), 0, 0, 1},
        {"end, pointer and next", {first, second, last_and_next}, 2, 0, 0},
        {"header over two packets", SplitSections({MakeSection(0x4E, 1, Bytes(169, 1)), large}), 2, 0, 0},
        {"start in mid-stream", {second, last_and_next}, 1, 0, 0},
        {"a lost packet", {first, late, second}, 0, 0, 1},
        {"a packet sent twice", {first, second, again, third}, 1, 0, 0},
        {"cut short by the next", {first, cut_and_next}, 1, 0, 1},
        {"pointer beyond the packet", {first, far, inner}, 0, 0, 1},
        {"no room for a CRC", {{{0, 0x4E, 0xB0, 0, 0x4E, 0xB0, 3, 1, 2, 3}, start}}, 0, 2, 0},
        {"no CRC to check", {{{0, 0x70, 0x70, 5, 0, 0, 0, 0, 0, 0x72, 0x70, 0, 0x71, 0x70, 0}, start}}, 3, 0, 0},
        {"nothing but stuffing", {{{0}, start}, {{}, kPayload}}, 0, 0, 0},
    };
    for (const auto &c : cases) {
        std::vector<std::pair<unsigned, Content>> packets;
        for (const Content &content : c.contents) {
            const unsigned last = packets.empty() ? 0 : packets.back().first;
            packets.emplace_back(last + 1 + (content.flags & 0x0F), Content{content.bytes, content.flags & ~0x0Fu});
        }
        const DemultiplexerCounters counters = Demultiplexed(0x0012, packets);
        EXPECT_THAT((std::array<uint64_t, 3>{counters.good, counters.bad_crc, counters.incomplete}),
                    ElementsAre(c.good, c.bad_crc, c.incomplete))
            << c.name;
    }
}

TEST_F(Receiver, DecodesTimes) {
    // The system's calendar ends in 2038 where its seconds have 32 bits.
    constexpr int64_t last = std::min<int64_t>(65535, 40587 + std::numeric_limits<time_t>::max() / 86400);
    for (unsigned mjd = 40587; mjd <= last; ++mjd) {
        const time_t day = static_cast<time_t>(mjd - 40587) * 86400;
        tm utc{};
        gmtime_r(&day, &utc);
        char expected[40];
        strftime(expected, sizeof expected, "%Y-%m-%d 23:59:58", &utc);
        ASSERT_EQ(ToText(DecodeDateTime(static_cast<uint16_t>(mjd), 0x235958)), expected);
    }
    EXPECT_EQ(ToText(DecodeDateTime(0xC079, 0x124500)), "1993-10-13 12:45:00");
    EXPECT_EQ(ToText(DecodeDateTime(15079, 0)), "1900-03-01 00:00:00");
    EXPECT_EQ(ToText(DecodeDateTime(15078, 0)), "");
    for (const uint32_t bcd : {0xFFFFFFu, 0x240000u, 0x0A0000u, 0x006000u, 0x000060u, 0x00000Fu}) {
        EXPECT_EQ(ToText(DecodeDateTime(50000, bcd)), "") << bcd;
    }
    EXPECT_EQ(ToText(DecodeBcdTime(0x995959)), "99:59:59");
    EXPECT_EQ(ToText(DecodeBcdTime(0xA00000)), "");
    EXPECT_EQ(ToText(DecodeBcdTime(0xFFFFFF)), "");
}

TEST_F(Receiver, DecodesTexts) {
    using namespace std::string_literals;
    const std::pair<std::string, std::string> cases[] = {
        {"", ""},
        {"Jo\xE3o \xA4 \xBD", "João € œ"},
        {"a\0b\x86"s, "ab"},
        {"a\x0D\x0A\x62\x0A\x0D\x8A\x63", "a\nb\n\nc"},
        // the parameters of SZX, COL in two forms, RPC, CSI, ESC, SS2, APS, TIME and a macro
        {"\x8B`a\x90Hb\x90 Ac\x98\x45\x64\x9B\x31;2 S.\x1B$;e\x19zf\x1C@Ag\x9D @h\x95@xy\x95Oi", "abcd.efghi"},
        {"\x98\x0A\x1B", "\n"},
        {"\x05\xDD\xFE\x8A\xE9", "İş\né"},
        {"\x10\x00\x09\xD0\x87\xA4"s, "Ğ¤"},
        {"\x05S\xE3o", "São"},
        {"\x05", ""},
        {"\x10\x00\x0F\x41\xE9"s, "Aé"},
        {"\x10\x00"s, ""},
        {"\x1F\x41\x42", "B"},
        {"\x11\x20\xAC\x00\x41\xE0\x86\x00\x0D\x00\x0A\xE0\x8A\x00\x42\x00"s, "€A\n\nB"},
        {"\x11\xD8\x3D\xDE\x00\x00\x41\xD8\x3D\x00\x42\xDE\x00"s, "\uFFFDA\uFFFDB\uFFFD"},
        {"\x15\xE2\x82\xAC \xC3\xA9\x07\xEE\x82\x8A\x0D\x0A.\0."s, "€ é\n\n.."},
        // four bytes, a half surrogate, overlong, cut, a byte that begins no character, beyond Unicode
        {"\x15.\xF0\x9F\x98\x80.\xED\xA0\x80.\xE0\x9F\xBF.\xE2\x82.\xC0\xAF.\xF4\x90\x80\x80.\xC3",
         ".\uFFFD.\uFFFD\uFFFD\uFFFD.\uFFFD\uFFFD\uFFFD.\uFFFD.\uFFFD\uFFFD."
         "\uFFFD\uFFFD\uFFFD\uFFFD.\uFFFD"},
    };
    for (const auto &[bytes, expected] : cases) {
        EXPECT_EQ(ToUtf8(bytes), expected) << ::testing::PrintToString(bytes);
    }
}

// Reads sections in the order given, each in packets of its own. A section's first packet overtakes the rest of the
// section before it.
Report ReadSections(const std::vector<std::pair<uint16_t, Bytes>> &sections) {
    StreamWriter writer;
    std::pair<uint16_t, std::vector<Content>> rest;
    for (const auto &[pid, section] : sections) {
        std::vector<Content> contents = SplitSections({section});
        writer.Send(pid, contents[0]);
        for (const Content &content : rest.second) {
            writer.Send(rest.first, content);
        }
        rest = {pid, {contents.begin() + 1, contents.end()}};
    }
    return ReadStream(writer.Stream());
}

// Makes an event that lasts an hour on 1993-10-13.
Bytes At(unsigned id, int hour, const Bytes &descriptors) {
    return MakeEvent(id, MakeDateTime(0xC079, hour * 3600), Bcd(3600), descriptors);
}

Bytes OneEvent(unsigned table, unsigned service, unsigned id, int hour, const std::string &name) {
    return MakeEit(table, service, 1, At(id, hour, name.empty() ? Bytes() : MakeShortEvent("por", name, "")));
}

TEST_F(Receiver, KeepsTheCurrentTables) {
    const Bytes name_overrun = Changed(MakeService(3, "", "lost"), 9, 10);
    const Bytes loop_overrun = Changed(MakeService(6, "", "whole"), 4, 250);
    const Bytes pmt_overrun = Changed(MakeComponent(0x1B, 0x100), 4, 200);
    const Bytes pat = MakePat(7, {{1, 0x101}}), tot_time = MakeDateTime(0xC079, 18 * 3600 + 1800);
    const Bytes german = MakeShortEvent("deu", "Ja", ""), english = MakeShortEvent("eng", "Yes", "");
    const Bytes captions = MakeComponent(0x06, 0x130, Descriptor(0x52, U8(0x30)) + Descriptor(0xFD, U16(8))) +
                           MakeComponent(0x06, 0x138, Descriptor(0xFD, U16(8)) + Descriptor(0x52, U8(0x38)));
    const Bytes ratings = Raw("ARG") + U8(9) + Raw("BRA") + U8(0x75);
    const auto extended = [](const std::string &language, const std::string &text) {
        return Descriptor(0x4E, U8(0) + Raw(language) + U8(0) + Counted(text));
    };
    const struct {
        const char *name;
        std::vector<std::pair<uint16_t, Bytes>> sections;
    } cases[] = {
        {"a PAT of two sections, repeated between",
         {{0, MakePat(7, {{0, 0x10}, {1, 0x101}}, {0, 1})},
          {0, MakePat(7, {{2, 0x102}}, {1, 1})},
          {0x102, MakePmt(2, 0x100, MakeComponent(0x1B, 0x100), Descriptor(0x80, Bytes(198, 0)))},
          {0, MakePat(7, {{2, 0x102}}, {1, 1})},
          {0x101, MakePmt(1, 0x100, MakeComponent(0x02, 0x100))}}},
        {"a new PAT moves a service, drops another and stops its PMT",
         {{0, MakePat(7, {{1, 0x101}, {2, 0x102}})},
          {0x101, MakePmt(1, 0x100, {})},
          {0, MakePat(7, {{3, 0x103}}, {0, 0, 0xC2})},  // not yet current
          {0, MakePat(7, {{1, 0x104}}, {0, 0, 0xC3})},
          {0x102, MakePmt(2, 0x100, {})}}},
        {"the latest PMT and names, of this stream alone",
         {{0, pat},
          {0x101, MakePmt(1, 0x100, MakeComponent(0x02, 0x100))},
          {0x101, MakePmt(1, 0x100, MakeComponent(0x24, 0x100), {}, {0, 0, 0xC3})},
          {0x11, MakeSdt(7, MakeService(8, "", "gone"), {1, 1})},
          {0x11, MakeSdt(7, MakeService(1, "", "old"), {0, 1})},
          {0x11, MakeSdt(7, MakeService(1, "", "\"new\\"), {0, 0, 0xC3})},
          {0x11, MakeSdt(7, MakeService(1, "", "later"), {0, 0, 0xC4})},
          {0x11, MakeSection(0x46, 8, U16(8) + U8(0xFF) + MakeService(1, "", "foreign"))},
          {0x10, MakeNit(9, 7, Descriptor(0x40, Raw("net")), {})},
          {0x10, MakeSection(0x41, 8, Loop(0xF, Descriptor(0x40, Raw("elsewhere"))) + Loop(0xF, {}))}}},
        {"events once each, by start, latest wins, not for another stream",
         {{0x12, OneEvent(0x50, 1, 2, 20, "second")},
          {0x12, OneEvent(0x4E, 1, 1, 18, "first")},
          {0x12, OneEvent(0x51, 1, 2, 21, "")},
          {0x12, OneEvent(0x4F, 1, 1, 19, "wrong")},
          {0x12, OneEvent(0x60, 5, 1, 17, "elsewhere")},
          {0x27, OneEvent(0x4E, 9, 1, 22, "one-seg")},
          {0x14, OneEvent(0x4E, 1, 1, 18, "misplaced")}}},
        {"the nation's language, and what one table leaves out",
         {{0x12, MakeEit(0x4E, 1, 1,
                         At(1, 18,
                            english + MakeShortEvent("por", "", "") + MakeShortEvent("por", "Sim", "") +
                                Descriptor(0x55, ratings) +
                                Descriptor(0xC4, Bytes{0xF2, 1, 0x10, 0x11, 0xFF, 0x40} + Raw("spa"))) +
                             At(2, 19, german + english))},
          {0x12, MakeEit(0x58, 1, 1, At(1, 18, extended("eng", "wrong") + extended("por", "X")))}}},
        {"times elsewhere",
         {{0x14, MakeTot(tot_time, MakeLocalOffset("FRA", 0, 2))},
          {0x12, MakeEit(0x4E, 1, 1, At(1, 22, Descriptor(0x54, U16(0x2000))))}}},
        {"a DVB stream without offsets",
         {{0, pat}, {0x10, MakeNit(9, 7, {}, Descriptor(0x5A, {}))}, {0x14, MakeTot(tot_time, {})}}},
        {"no offsets, and nothing that speaks against Brazil",
         {{0, pat}, {0x10, MakeNit(9, 7, {}, Descriptor(0xFA, U16(0xFFFC)))}, {0x14, MakeTot(tot_time, {})}}},
        {"times after 2030",
         {{0x14, MakeTot(MakeDateTime(62866, 86399), MakeLocalOffset("BRA", 3, 0))},
          {0x12, MakeEit(0x4E, 1, 1, MakeEvent(1, MakeDateTime(65535, 86399), Bcd(3600), {}))}}},
        {"events that a new section moves, drops or empties",
         {{0x12, MakeEit(0x50, 1, 1, At(1, 18, {}) + At(2, 19, {}), {0, 9})},
          {0x12, MakeEit(0x50, 1, 1, At(3, 20, {}), {1, 9})},
          {0x12, MakeEit(0x50, 1, 1, At(4, 21, {}), {9, 9})},
          {0x12, MakeEit(0x50, 2, 1, At(5, 22, {}), {9, 9})},
          {0x12, MakeEit(0x50, 1, 1, At(2, 17, {}), {0, 8, 0xC3})},
          {0x12, MakeEit(0x50, 1, 1, {}, {1, 8, 0xC3})}}},
        {"the present before the schedule, whichever comes later",
         {{0x12, OneEvent(0x4E, 1, 1, 18, "now")},
          {0x12, OneEvent(0x50, 1, 1, 17, "planned")},
          {0x12, OneEvent(0x50, 1, 2, 20, "planned")},
          {0x12, MakeEit(0x4E, 1, 1, At(2, 21, {}), {1, 1})}}},
        {"PMTs before the PAT, an AIT, and what components are for",
         {{0x1FC8, MakePmt(2, 0x1FFF, MakeComponent(0x0F, 0x181, Descriptor(0x0A, Raw("por") + U8(3))))},
          {0x101, MakePmt(1, 0x100, captions + MakeComponent(0x05, 0x141, Descriptor(0xFD, U16(0xA3))))},
          {0x102, MakePmt(9, 0x100, {})},
          {0, MakePat(7, {{1, 0x101}, {2, 0x1FC8}})},
          {0x102, MakePmt(9, 0x100, {})},
          {0x141, MakeSection(0x74, 1, U16(0xF000) + U16(0xF000))},
          {0x101, MakePmt(1, 0x100, captions)},
          {0x141, MakeSection(0x74, 1, U16(0xF000) + U16(0xF000))}}},
        {"one-seg reception, without a PAT",
         {{0x1FC9, MakePmt(5, 0x181, MakeComponent(0x1B, 0x181))},
          {0x10, MakeNit(9, 7, {}, Descriptor(0xCD, U8(12) + U8(1 << 2) + Raw("T")))}}},
        {"lengths that lead outside",
         {{0, MakePat(7, {{1, 0x101}, {2, 0x102}})},
          {0x101, MakePmt(1, 0x100, pmt_overrun)},
          {0x102, MakePmt(2, 0x100, MakeComponent(0x11, 0x100, {0x0A, 2, 'p', 'o', 0xFD, 1, 0}),
                          Descriptor(0xFC, {0, 1, 0x80, 200, 0}))},
          {0x11, MakeSdt(7, MakeService(2, "", "kept") + name_overrun + MakeService(4, "", "next") + loop_overrun)},
          {0x12, MakeEit(0x4E, 1, 1, At(3, 1, {0x4E, 6, 0, 'p', 'o', 'r', 9, 9, 0x55, 3, 'B', 'R', 'A', 0x54, 0}))},
          {0x12, MakeEit(0x4E, 1, 1, Bytes{0, 1, 0xC0, 0x79, 0, 0, 0, 0, 0, 0, 0x8F, 0xFF})},
          {0x10, MakeNit(9, 7, {}, {0xCD, 2, 5, 0xFC, 0xFB, 1, 1, 0xFA, 1, 0})},
          {0x10, MakeSection(0x40, 9, {0xFF, 0xFF, 0x40, 200, 'n'}, {1, 1})},
          {0x14, {0x70, 0x70, 3, 0xC0, 0x79, 0x12}}}},
    };
    const std::string nothing = ToJson(ReadSections({})) + "  ],\n";
    for (const auto &c : cases) {
        Note(std::string(c.name) + ":\n" + NewLines(TablesOf(ToJson(ReadSections(c.sections))), nothing));
    }
}

// A table of events limits how many there are and how long their texts are.
TEST_F(Receiver, LimitsEvents) {
    EventTable few, long_ones;
    Event event;
    for (unsigned i = 0; i < EventTable::kMostEvents + 10; ++i) {
        few.Replace({0x50, i >> 16, static_cast<uint16_t>(i), 0}, 0xFF, 0xFF, {event});
    }
    EXPECT_EQ(few.LeftOut(), 10u);
    event.extended_text.assign(4096, 'x');
    event.name = "x";
    for (uint16_t i = 0; i < 5000; ++i) {
        long_ones.Replace({0x50, 0, i, 0}, 0, 0, {event});
        long_ones.Replace({0x50, 0, i, 0}, 0, 0, {event});  // no more than once
    }
    const size_t kept = long_ones.Joined().size();
    EXPECT_EQ(kept, EventTable::kMostBytes / 4097);
    EXPECT_EQ(long_ones.LeftOut(), 2 * (5000 - kept));
}

TEST_F(Receiver, ReadsTheSample) {
    Report report = ReadStream(Raw(ReadAll(sample_)));
    Note(ToJson(report));
    const std::string usual = ToSummary(report, 80);
    Note(usual);
    for (const int region : {4, 5}) {  // the sample has no region 5
        report.settings.region = region;
        Note("In region " + std::to_string(region) + ":\n" + NewLines(ToSummary(report, 80), usual));
    }
}

TEST_F(Receiver, ListsTheFirstOrAll) {
    Bytes events;
    for (unsigned id = 0; id < 13; ++id) {
        events = events + At(id, static_cast<int>(id), {});
    }
    StreamWriter writer;
    writer.SendSections(0x12, {MakeEit(0x50, 1, 1, events), OneEvent(0x60, 5, 1, 20, "elsewhere")});
    for (uint16_t pid = 0x200; pid < 0x219; ++pid) {
        writer.Send(pid, {{}, kPayload});
    }
    Report report = ReadStream(writer.Stream());
    const std::string first = ToSummary(report, 80);
    report.settings.all = true;
    const std::string all = ToSummary(report, 80);
    Note(NewLines(first, all) + "All:\n" + NewLines(all, first));
}

TEST_F(Receiver, BreaksLines) {
    const std::pair<std::string, std::string> cases[] = {
        {"", "lead\n"},
        {"one\ntwo", "lead  one two\n"},
        {std::string(34, 'a') + " b", "lead  " + std::string(34, 'a') + "\n      b\n"},
        {std::string(35, 'a') + "   b", "lead  " + std::string(34, 'a') + "\n      a   b\n"},
        {"é a" + std::string(33, 'b'), "lead  é\n      a" + std::string(33, 'b') + "\n"},
    };
    for (const auto &c : cases) {
        EXPECT_EQ(Written([&](std::FILE *file) { Paragraphs(file, 1).Add("lead  ", c.first); }), c.second);
    }
    std::setlocale(LC_CTYPE, "C");
    EXPECT_EQ(Written([&](std::FILE *file) { Paragraphs(file, 1).Add("", "maçã, 5 €"); }), "ma??, 5 ?\n");
}

TEST_F(Receiver, AnswersEveryInput) {
    WriteAll(Path("empty"), "");
    WriteAll(Path("text"), std::string(9999, 'x'));
    std::mt19937 random(20240615);
    std::string damaged;  // more than fits between two threads
    for (size_t i = 0; i < 15; ++i) {
        damaged += ReadAll(sample_);
        for (size_t damage = i * 20; damage > 0; --damage) {
            const size_t length = random() % 10 == 0 ? random() % 1000 : 1;
            damaged.replace(damaged.size() - 2000 - random() % 290000, length, 1, static_cast<char>(random()));
        }
    }
    damaged.erase(damaged.size() - 600, 100);  // nothing but the end of the stream can show packets again
    WriteAll(Path("-dash"), damaged);
    const Bytes accident = Bytes(9000, 0x11) + Numbered(0, 5, Bytes(4, 0)) + Bytes(9000, 0x11);
    WriteAll(Path("accident"), std::string(accident.begin(), accident.end()));
    Show("receiver " + std::to_string(VARNEK_VERSION_MAJOR), "receiver MAJOR");
    Show(std::string(300, 'x'), "LONG");
    const Arguments cases[] = {
        {},
        {"--nonsense", Path("text")},
        {Path("text"), Path("text")},
        {Path("text"), "--capture"},
        {"--region", "64", Path("text")},
        {"--help"},
        {"--version"},
        {Path("missing")},
        {std::string(300, 'x')},
        {"--json", Path("empty")},
        {Path("")},
        {Path("text")},
        {Path("accident")},
        {"--json", "--all", "--region", "5", sample_},
    };
    for (const Arguments &arguments : cases) {
        NoteProgram(arguments);
    }
    EXPECT_EQ(NoteProgram({"--json", "--", Path("-dash")}), ToJson(ReadStream(Raw(damaged))))
        << "the program's threads report what a single thread does";
    for (const auto &[path, mode, argument] : {std::tuple("/dev/full", "w", std::string("--version")),
                                               {"/dev/full", "w", sample_},
                                               {"/dev/null", "r", sample_}}) {  // cannot be written at all
        std::FILE *out = std::fopen(path, mode);
        Note(path + std::string(": "));
        NoteProgram({argument}, out);
        std::fclose(out);
    }
}

// A terminal of this width, which passes on what is written to it.
struct Terminal {
    explicit Terminal(unsigned short columns) {
        termios raw{};
        cfmakeraw(&raw);
        cfsetspeed(&raw, B9600);
        const winsize size{24, columns, 0, 0};
        if (openpty(&user, &program, nullptr, &raw, &size) == 0) {
            file = fdopen(program, "w");
        }
    }
    // Closes the program's end and returns what is left to read.
    std::string Finish() const {
        std::fclose(file);
        std::string text;
        for (char byte = 0; read(user, &byte, 1) == 1;) {
            text += byte;
        }
        close(user);
        return text;
    }
    int user = -1, program = -1;
    std::FILE *file = nullptr;
};

TEST_F(Receiver, FitsTheTerminal) {
    if (Terminal(0).file == nullptr) {
        GTEST_SKIP() << "this system has no terminals";
    }
    const struct {
        const char *columns;
        unsigned short out, err;  // 0 if the terminal does not know
        size_t width;
    } cases[] = {{nullptr, 0, 0, 80}, {nullptr, 0, 60, 60}, {nullptr, 50, 60, 50}, {"70", 50, 60, 70},
                 {"0", 50, 60, 50},   {"x", 0, 0, 80},      {"100", 0, 0, 100},    {"9", 0, 0, 40}};
    for (const auto &c : cases) {
        c.columns == nullptr ? unsetenv("COLUMNS") : setenv("COLUMNS", c.columns, 1);
        const Terminal out(c.out), err(c.err);
        RunReceiver({"--help"}, {out.file, err.file});
        EXPECT_EQ(out.Finish(), Written([&](std::FILE *file) { WriteHelp(file, c.width); }))
            << "COLUMNS " << c.columns << ", out " << c.out << ", err " << c.err;
        EXPECT_EQ(err.Finish(), "");
    }
}

// The other end of the socket wrote packets, and was closed before it had read what it was sent.
TEST_F(Receiver, ReportsAReadError) {
    int ends[2];
    ASSERT_EQ(socketpair(AF_UNIX, SOCK_STREAM, 0, ends), 0);
    const Bytes packets = Numbered(0, 10);
    ASSERT_EQ(write(ends[0], packets.data(), packets.size()), static_cast<ssize_t>(packets.size()));
    ASSERT_EQ(write(ends[1], "unread", 6), 6);
    close(ends[0]);
    ASSERT_EQ(dup2(ends[1], STDIN_FILENO), STDIN_FILENO);
    NoteProgram({"-"});
}

// No program writes to the pipe, so the user gives up as soon as the terminal says so.
TEST_F(Receiver, StopsWhileItWaits) {
    if (Terminal(0).file == nullptr) {
        GTEST_SKIP() << "this system has no terminals";
    }
    ASSERT_EQ(mkfifo(Path("pipe").c_str(), 0600), 0);
    const std::string shown =
        "receiver: " + Path("pipe") + ": waiting for a program that writes to this pipe\n\r0 MB\r";
    const Terminal err(80);
    std::atomic<bool> stop{false};
    std::thread user([&] {
        EXPECT_TRUE(Eventually([&] {
            int size = 0;
            return ioctl(err.user, FIONREAD, &size) == 0 && size >= static_cast<int>(shown.size());
        }));
        stop = true;
    });
    EXPECT_THAT(Written([&](std::FILE *out) {
                    EXPECT_EQ(RunReceiver({Path("pipe")}, {out, err.file, &stop}), 130);
                }),
                StartsWith("Stream    0 packets\n"));
    user.join();
    EXPECT_THAT(err.Finish(), AllOf(StartsWith(shown), EndsWith("\r0 MB\r\r    \r")));
}

// Fills a family's registry, then frees one place after each run until a run has all it needs.
TEST_F(Receiver, FreesItsObjects) {
    // During the first run the library creates the mutex that guards its threads.
    const std::string expected = NoteProgram({"--json", sample_});
    for (const Family &family : kFamilies) {
        std::vector<int32_t> fillers = family.Fill();
        for (bool enough = false; !enough; fillers.pop_back()) {
            const size_t room = family.Room();
            Note("With room for " + std::to_string(room) + " " + family.name + ": ");
            const std::string out = NoteProgram({"--json", sample_});
            enough = !out.empty();
            EXPECT_EQ(out, enough ? expected : "");
            EXPECT_EQ(family.Room(), room) << "the run left objects behind";
            ASSERT_FALSE(fillers.empty());
            family.remove(fillers.back());
        }
        std::for_each(fillers.begin(), fillers.end(), family.remove);
    }
}

// A capture has the packets that carry tables, so it is a stream with the same tables.
TEST_F(Receiver, Captures) {
    const std::string captured = Path("captured.ts");
    WriteAll(captured, std::string(1000000, 'x'));
    WriteAll(Path("text"), std::string(9999, 'x'));
    NoteProgram({"--capture", captured, Path("text")});
    EXPECT_EQ(ReadAll(captured).size(), 1000000u) << "a run without packets wrote a capture";

    const std::string first = NoteProgram({"--json", "--quiet", "--capture", captured, sample_});
    const std::string again = NoteProgram({"--json", captured});
    EXPECT_EQ(TablesOf(again), TablesOf(first));
    EXPECT_THAT(again,
                AllOf(HasSubstr("\"packets\": 163,\n"), HasSubstr("\"duration\": null,\n  \"bit_rate\": null,\n")));

    NoteProgram({"--capture", captured, captured});  // a stream is not overwritten
    NoteProgram({"--capture", Path(""), captured});
    EXPECT_EQ(NoteProgram({"--json", "--capture", "/dev/full", sample_}), first) << "it read no further";
}

}  // namespace
}  // namespace receiver
