// The example receiver, stage by stage on made packets and sections, then whole on the sample
// stream: its JSON to the letter, its exit statuses, and damaged streams.
#include "Receiver.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <cstdlib>
#include <ctime>
#include <functional>
#include <limits>
#include <random>

#include "BroadcastText.h"
#include "BroadcastTime.h"
#include "Demultiplexer.h"
#include "JsonReport.h"
#include "PacketSource.h"
#include "Summary.h"
#include "Tables.h"
#include "TransportStream.h"
#include "Varnek_Semaphore.h"
#include "Varnek_Thread.h"
#include "Varnek_Util.h"
#include "support/VarnekTest.h"

namespace receiver {
namespace {

using ::testing::HasSubstr;
using Bytes = std::vector<unsigned char>;

Bytes operator+(Bytes left, const Bytes &right) {
    left.insert(left.end(), right.begin(), right.end());
    return left;
}

Bytes Fill(size_t size, unsigned char value) { return Bytes(size, value); }

unsigned char Low(size_t value) { return static_cast<unsigned char>(value); }

// A packet whose payload is filled up with stuffing. `flags` or-ed into bytes 1 and 3: unit start
// 0x40, transport error 0x80; scrambled 0x80, adaptation field 0x20, payload 0x10.
Bytes Packet(uint16_t pid, unsigned counter, const Bytes &payload, unsigned flags1 = 0, unsigned flags3 = 0x10) {
    Bytes packet = {0x47, Low(flags1 | pid >> 8), Low(pid), Low(flags3 | counter)};
    packet = packet + payload;
    packet.resize(188, 0xFF);
    return packet;
}

// Packets that carry their number in the payload.
Bytes Numbered(size_t first, size_t count, size_t lead = 0, size_t trail = 0) {
    Bytes out;
    for (size_t i = first; i < first + count; ++i) {
        const Bytes packet = Packet(0x100, Low(i % 16), {Low(i >> 8), Low(i)});
        out = out + Fill(lead, 0x11) + packet + Fill(trail, 0x22);
    }
    return out;
}

Bytes Section(unsigned char table, uint16_t extension, const Bytes &body, unsigned char number = 0,
              unsigned char last = 0, unsigned char version = 0xC1) {
    const size_t length = body.size() + 9;
    Bytes section = {table, Low(0xB0 | length >> 8), Low(length), Low(extension >> 8u), Low(extension), version, number,
                     last};
    section = section + body;
    const uint32_t crc = VarnekUtil_MakeCRC32(section.data(), static_cast<int32_t>(section.size()));
    return section + Bytes{Low(crc >> 24), Low(crc >> 16), Low(crc >> 8), Low(crc)};
}

Report ReadStream(const Bytes &stream, size_t block = 4096) {
    Report report;
    TableParser parser(report.model);
    Demultiplexer demultiplexer([&](uint16_t pid, const unsigned char *section, size_t size) {
        parser.Push(pid, Bytes(section, section + size).data(), size);
    });
    PacketSource source([&](const unsigned char *packet) { demultiplexer.Push(packet); });
    for (size_t at = 0; at < stream.size(); at += block) {
        source.Feed(stream.data() + at, std::min(block, stream.size() - at));
    }
    source.Finish();
    report.packets = source.Counters();
    report.sections = demultiplexer.Counters();
    return report;
}

std::string SampleText() { return ReadAll(VARNEK_SAMPLE); }

Bytes Sample() {
    const std::string text = SampleText();
    return Bytes(text.begin(), text.end());
}

Bytes Random(std::mt19937 &random, size_t size) {
    Bytes bytes(size);
    for (unsigned char &byte : bytes) {
        byte = Low(random());
    }
    return bytes;
}

TEST(Receiver, FindsPacketsInAnyCompany) {
    std::mt19937 random(47);
    Bytes damaged = Numbered(0, 20);
    damaged[1316] = 0x46;  // the eighth's
    Bytes cut = Numbered(0, 20);
    cut.erase(cut.begin() + 1000, cut.begin() + 1040);
    Bytes text;
    while (text.size() < 5000) {
        text = text + Bytes{'G', 'o', 'o', 'd', ' ', 'm', 'o', 'r', 'n', 'i', 'n', 'g', ' '};
    }
    const Bytes noise = Random(random, 300);
    Bytes table;
    for (int i = 0; i < 40; ++i) {
        table = table + Bytes{0x47} + Fill(191, 0);
    }
    const struct {
        const char *name;
        Bytes stream;
        size_t packets, losses, size;
    } cases[] = {
        {"188", Numbered(0, 300), 300, 0, 188},
        {"192", Numbered(0, 300, 4, 0), 300, 0, 192},
        {"204", Numbered(0, 300, 0, 16), 300, 0, 204},
        {"one packet", Numbered(0, 1), 1, 0, 188},
        {"one of 192", Numbered(0, 1, 4, 0), 1, 0, 192},
        {"one of 204", Numbered(0, 1, 0, 16), 1, 0, 204},
        {"time stamps that look like sync bytes",
         [] {
             Bytes out;
             for (size_t i = 0; i < 9; ++i) {
                 out = out + Bytes{0x47, 0x01, 0x00, 0x10} + Numbered(i, 1);
             }
             return out;
         }(),
         9, 0, 192},
        {"garbage in front", noise + Numbered(0, 20), 20, 1, 188},
        {"garbage in front of 192", noise + Numbered(0, 20, 4, 0), 20, 1, 192},
        {"garbage between, twice", Numbered(0, 9) + noise + Numbered(9, 4) + noise + Numbered(13, 5), 18, 2, 188},
        {"garbage soon", Numbered(0, 3) + noise + Numbered(3, 17), 20, 1, 188},
        {"a table with even strides", noise + table, 0, 0, 0},
        {"garbage before the last packet", Numbered(0, 9) + noise + Numbered(9, 1), 10, 1, 188},
        {"garbage behind", Numbered(0, 9) + Fill(500, 0), 9, 1, 188},
        {"a damaged sync byte", damaged, 19, 1, 188},
        {"bytes missing within a packet", cut, 19, 1, 188},
        {"cut in a packet", Numbered(0, 9) + Bytes{0x47, 0x01, 0x00}, 9, 0, 188},
        {"cut in parity", Numbered(0, 9, 0, 16) + Numbered(9, 1), 10, 0, 204},
        {"sync bytes and nothing else", Fill(188 * 50 + 7, 0x47), 50, 0, 188},
        {"nothing", {}, 0, 0, 0},
        {"less than a packet", Fill(187, 0x47), 0, 0, 0},
        {"text", text, 0, 0, 0},
        {"noise", Random(random, 3000000), 0, 0, 0},
    };
    for (const auto &c : cases) {
        for (const size_t block : {size_t{1}, size_t{190}, size_t{65536}}) {
            if (block == 1 && c.stream.size() > 100000) {
                continue;
            }
            Bytes numbers;
            PacketSource source([&](const unsigned char *packet) {
                EXPECT_EQ(packet[0], 0x47);
                numbers.push_back(packet[5]);
            });
            for (size_t at = 0; at < c.stream.size(); at += block) {
                source.Feed(&c.stream[at], std::min(block, c.stream.size() - at));
            }
            source.Finish();
            EXPECT_EQ(source.Counters().packets, c.packets) << c.name << ", block " << block;
            EXPECT_EQ(source.Counters().sync_losses, c.losses) << c.name << ", block " << block;
            EXPECT_EQ(source.Counters().packet_size, c.size) << c.name << ", block " << block;
            EXPECT_EQ(numbers.size(), c.packets) << c.name;
            for (size_t i = 0; i < numbers.size() && c.stream[1] != kSyncByte; ++i) {
                EXPECT_LE(Low(i == 0 ? numbers[0] : numbers[i] - numbers[i - 1] - 1u), 1) << c.name;
            }
        }
    }
}

TEST(Receiver, FollowsContinuity) {
    struct Kind {
        unsigned flags1, flags3;
        Bytes field;
    };
    const Kind plain{0, 0x10, {}};
    const Kind error{0x80, 0x90, {}};
    const Kind scrambled{0, 0x90, {}};
    const Kind no_field{0, 0, {}};
    const Kind empty{0, 0x20, {183, 0x00}};
    const Kind jump{0, 0x30, {1, 0x80}};
    const struct {
        const char *name;
        std::vector<std::pair<unsigned, const Kind &>> packets;  // with their counters
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
        {"no field at all", {{1, plain}, {7, no_field}, {2, plain}}, 0, 0, 0, 0x100},
        {"transport error", {{1, plain}, {9, error}, {2, plain}}, 0, 1, 0, 0x100},
        {"lost to a transport error", {{1, plain}, {2, error}, {3, plain}}, 1, 1, 0, 0x100},
        {"scrambled", {{1, scrambled}, {2, scrambled}, {4, plain}}, 1, 0, 2, 0x100},
        {"null packets", {{1, plain}, {7, plain}, {7, plain}, {7, plain}}, 0, 0, 0, 0x1FFF},
    };
    for (const auto &c : cases) {
        Demultiplexer demultiplexer([](uint16_t, const unsigned char *, size_t) {});
        for (const auto &[counter, kind] : c.packets) {
            const Bytes packet = Packet(c.pid, counter, kind.field, kind.flags1, kind.flags3);
            demultiplexer.Push(packet.data());
        }
        EXPECT_EQ(demultiplexer.Counters().continuity_errors, c.continuity) << c.name;
        EXPECT_EQ(demultiplexer.Counters().transport_errors, c.transport) << c.name;
        EXPECT_EQ(demultiplexer.Counters().scrambled, c.scrambled) << c.name;
    }
}

TEST(Receiver, AssemblesSections) {
    const Bytes small = Section(0x4E, 1, Fill(20, 1));   // 32 bytes
    const Bytes large = Section(0x50, 1, Fill(388, 2));  // 400 bytes
    const auto part = [&large](size_t from, size_t count) {
        return Bytes(large.begin() + static_cast<std::ptrdiff_t>(from),
                     large.begin() + static_cast<std::ptrdiff_t>(from + count));
    };
    Bytes damaged = small;
    damaged[10] ^= 0x10;
    const Bytes longest = Section(0x50, 1, Fill(4084, 3));
    const auto whole = [](const Bytes &section) {
        std::vector<std::pair<unsigned, Bytes>> payloads;
        for (size_t at = 0; at < section.size(); at += payloads.size() == 1 ? 183u : 184u) {
            payloads.emplace_back(at == 0 ? 0x40 : 0, at == 0 ? Bytes{0} : Bytes{});
            Bytes &payload = payloads.back().second;
            const size_t count = std::min(184 - payload.size(), section.size() - at);
            payload.insert(payload.end(), section.begin() + static_cast<std::ptrdiff_t>(at),
                           section.begin() + static_cast<std::ptrdiff_t>(at + count));
        }
        return payloads;
    };
    const struct {
        const char *name;
        std::vector<std::pair<unsigned, Bytes>> payloads;  // unit start 0x40; steps of the counter beside 1
        uint64_t good, bad_crc, incomplete;
    } cases[] = {
        {"two in a packet", {{0x40, Bytes{0} + small + small}}, 2, 0, 0},
        {"damaged between good ones", {{0x40, Bytes{0} + small + damaged + small}}, 2, 1, 0},
        {"over packets", whole(large), 1, 0, 0},
        {"the longest", whole(longest), 1, 0, 0},
        {"too long", whole(Section(0x50, 1, Fill(4085, 3))), 0, 0, 1},
        {"too long for its table", whole(Section(0x42, 1, Fill(1013, 3))), 0, 0, 1},
        {"end, pointer and next",
         {{0x40, Bytes{0} + part(0, 183)}, {0, part(183, 184)}, {0x40, Bytes{33} + part(367, 33) + small}},
         2,
         0,
         0},
        {"header over two packets",
         {{0x40, Bytes{0} + Section(0x4E, 1, Fill(169, 1)) + part(0, 2)},
          {0, part(2, 184)},
          {0, part(186, 184)},
          {0, part(370, 30)}},
         2,
         0,
         0},
        {"start in mid-stream", {{0, part(183, 184)}, {0x40, Bytes{33} + part(367, 33) + small}}, 1, 0, 0},
        {"a lost packet", {{0x40, Bytes{0} + part(0, 183)}, {1, part(183, 184)}, {0, part(183, 184)}}, 0, 0, 1},
        {"a packet sent twice",
         {{0x40, Bytes{0} + part(0, 183)}, {0, part(183, 184)}, {15, part(183, 184)}, {0, part(367, 33)}},
         1,
         0,
         0},
        {"cut short by the next", {{0x40, Bytes{0} + part(0, 183)}, {0x40, Bytes{5} + part(183, 5) + small}}, 1, 0, 1},
        {"pointer beyond the packet",
         {{0x40, Bytes{0} + part(0, 183)}, {0x40, Bytes{184} + small}, {0, small}},
         0,
         0,
         1},
        {"no room for a CRC", {{0x40, Bytes{0, 0x4E, 0xB0, 0, 0x4E, 0xB0, 3, 1, 2, 3}}}, 0, 2, 0},
        {"no CRC to check", {{0x40, Bytes{0, 0x70, 0x70, 5, 0, 0, 0, 0, 0, 0x72, 0x70, 0, 0x71, 0x70, 0}}}, 3, 0, 0},
        {"nothing but stuffing", {{0x40, Bytes{0}}, {0, {}}}, 0, 0, 0},
    };
    for (const auto &c : cases) {
        Demultiplexer demultiplexer([](uint16_t, const unsigned char *, size_t) {});
        unsigned counter = 0;
        for (const auto &[flags, payload] : c.payloads) {
            counter = (counter + 1 + (flags & 0x0F)) % 16;
            demultiplexer.Push(Packet(0x0012, counter, payload, flags & 0x40).data());
        }
        EXPECT_EQ(demultiplexer.Counters().good, c.good) << c.name;
        EXPECT_EQ(demultiplexer.Counters().bad_crc, c.bad_crc) << c.name;
        EXPECT_EQ(demultiplexer.Counters().incomplete, c.incomplete) << c.name;
    }
}

TEST(Receiver, DecodesTimes) {
    // The system's calendar is the judge, up to 2038 where its seconds have 32 bits.
    constexpr int64_t last = std::min<int64_t>(65535, 40587 + std::numeric_limits<time_t>::max() / 86400);
    for (unsigned mjd = 40587; mjd <= last; ++mjd) {
        const time_t day = static_cast<time_t>(mjd - 40587) * 86400;
        tm utc{};
        gmtime_r(&day, &utc);
        char expected[40];
        strftime(expected, sizeof expected, "%Y-%m-%d 23:59:58", &utc);
        ASSERT_EQ(ToText(DecodeDateTime(static_cast<uint16_t>(mjd), 0x235958)), expected);
    }
    const struct {
        uint16_t mjd;
        uint32_t bcd;
        const char *expected;
    } cases[] = {
        {0xC079, 0x124500, "1993-10-13 12:45:00"},
        {15079, 0, "1900-03-01 00:00:00"},
        {15078, 0, ""},
        {0xFFFF, 0xFFFFFF, ""},
        {50000, 0x240000, ""},
        {50000, 0x0A0000, ""},
        {50000, 0x006000, ""},
        {50000, 0x000060, ""},
        {50000, 0x00000F, ""},
    };
    for (const auto &c : cases) {
        EXPECT_EQ(ToText(DecodeDateTime(c.mjd, c.bcd)), c.expected);
    }
    EXPECT_EQ(ToText(DecodeBcdTime(0x995959)), "99:59:59");
    EXPECT_EQ(ToText(DecodeBcdTime(0xA00000)), "");
    EXPECT_EQ(ToText(DecodeBcdTime(0xFFFFFF)), "");
}

TEST(Receiver, DecodesTexts) {
    const std::pair<std::string, std::string> cases[] = {
        {"", ""},
        {"Jo\xE3o \xA4 \xBD", "João € œ"},
        {std::string("a\0b\x86\x0D"
                     "c",
                     6),
         "abc"},
        {"\x05S\xE3o", "São"},
        {"\x05", ""},
        {std::string("\x10\x00\x0F"
                     "A\xE9",
                     5),
         "Aé"},
        {std::string("\x10\x00", 2), ""},
        {"\x1F\x41"
         "B",
         "B"},
        {std::string("\x11\x20\xAC\x00\x41\xD8\x00\xE0\x86\x00", 10), "€A"},
        {"\x15\xE2\x82\xAC \xC3\xA9\xED\xA0\x80\x07", "€ é"},
    };
    for (const auto &[bytes, expected] : cases) {
        EXPECT_EQ(ToUtf8(bytes), expected) << ::testing::PrintToString(bytes);
    }
}

// The sections in the order given, each in packets of its own. What does not fit the first packet
// of one comes behind the first packet of the next.
Report ReadSections(const std::vector<std::pair<uint16_t, Bytes>> &sections) {
    Bytes stream;
    std::map<uint16_t, unsigned> counters;
    std::pair<uint16_t, Bytes> rest;
    for (const auto &[pid, section] : sections) {
        const auto split = section.begin() + std::min<std::ptrdiff_t>(183, static_cast<std::ptrdiff_t>(section.size()));
        stream = stream + Packet(pid, counters[pid]++ % 16, Bytes{0} + Bytes(section.begin(), split), 0x40);
        if (!rest.second.empty()) {
            stream = stream + Packet(rest.first, counters[rest.first]++ % 16, rest.second);
        }
        rest = {pid, Bytes(split, section.end())};
    }
    return ReadStream(stream);
}

Bytes Pat(const std::vector<std::pair<uint16_t, uint16_t>> &programs) {
    Bytes body;
    for (const auto &[id, pid] : programs) {
        body = body + Bytes{Low(id >> 8), Low(id), Low(0xE0 | pid >> 8), Low(pid)};
    }
    return body;
}

Bytes Pmt(unsigned char type) { return {0xE1, 0x00, 0xF0, 0, type, 0xE1, 0x00, 0xF0, 0}; }

const Bytes kSdtStart = {0, 1, 0xFF};

Bytes Sdt(uint16_t id, const std::string &name) {
    const size_t size = name.size();
    return Bytes{Low(id >> 8), Low(id), 0xFC, 0x80, Low(size + 5), 0x48, Low(size + 3), 1, 0, Low(size)} +
           Bytes(name.begin(), name.end());
}

// An event of one hour, at `hour` on 1993-10-13.
Bytes Eit(unsigned char id, unsigned char hour, const std::string &name) {
    const size_t size = name.size();
    return Bytes{0,    1,
                 0,    1,
                 0,    0x4E,
                 0,    id,
                 0xC0, 0x79,
                 hour, 0,
                 0,    1,
                 0,    0,
                 0x80, Low(size + 7),
                 0x4D, Low(size + 5),
                 'p',  'o',
                 'r',  Low(size)} +
           Bytes(name.begin(), name.end()) + Bytes{0};
}

TEST(Receiver, KeepsWhatApplies) {
    Bytes overrun = Sdt(3, "lost");
    overrun[9] = 10;  // the name's length
    Bytes loop_overrun = Sdt(6, "whole");
    loop_overrun[4] = 250;
    const Bytes long_pmt = Bytes{0xE1, 0, 0xF0, 200, 0x80, 198} + Fill(198, 0) + Bytes{0x1B, 0xE1, 0, 0xF0, 0};
    Bytes loop_in_pmt = Pmt(0x1B);
    loop_in_pmt[3] = 200;
    const struct {
        const char *name;
        std::vector<std::pair<uint16_t, Bytes>> sections;
        std::vector<std::string> expected, unexpected;
    } cases[] = {
        {"a PAT of two sections, repeated between",
         {{0, Section(0, 7, Pat({{0, 0x10}, {1, 0x101}}), 0, 1)},
          {0, Section(0, 7, Pat({{2, 0x102}}), 1, 1)},
          {0x102, Section(2, 2, long_pmt)},
          {0, Section(0, 7, Pat({{2, 0x102}}), 1, 1)},
          {0x101, Section(2, 1, Pmt(0x02))}},
         {R"("pmt_pid": 257, "pcr_pid": 256, "components": [{"pid": 256, "type": 2}])",
          R"("pmt_pid": 258, "pcr_pid": 256, "components": [{"pid": 256, "type": 27}])", R"("transport_stream_id": 7)"},
         {R"("id": 0,)"}},
        {"a new PAT moves a service, drops another and stops its PMT",
         {{0, Section(0, 7, Pat({{1, 0x101}, {2, 0x102}}))},
          {0x101, Section(2, 1, Pmt(0x02))},
          {0, Section(0, 7, Pat({{3, 0x103}}), 0, 0, 0xC2)},  // not yet current
          {0, Section(0, 7, Pat({{1, 0x104}}), 0, 0, 0xC3)},
          {0x102, Section(2, 2, Pmt(0x02))}},
         {R"("tables": {"0x00": 3, "0x02": 1})", R"("pmt_pid": 260, "pcr_pid": null)"},
         {R"("id": 2,)", R"("id": 3,)"}},
        {"the latest PMT and names, of this stream alone",
         {{0, Section(0, 7, Pat({{1, 0x101}}))},
          {0x101, Section(2, 1, Pmt(0x02))},
          {0x101, Section(2, 1, Pmt(0x24), 0, 0, 0xC3)},
          {0x11, Section(0x42, 7, kSdtStart + Sdt(8, "gone"), 1, 1)},
          {0x11, Section(0x42, 7, kSdtStart + Sdt(1, "old"), 0, 1)},
          {0x11, Section(0x42, 7, kSdtStart + Sdt(1, "\"new\\"), 0, 0, 0xC3)},
          {0x11, Section(0x42, 7, kSdtStart + Sdt(1, "later"), 0, 0, 0xC4)},
          {0x11, Section(0x46, 8, kSdtStart + Sdt(1, "other"))},
          {0x10, Section(0x40, 9, {0xF0, 5, 0x40, 3, 'n', 'e', 't', 0xF0, 0})},
          {0x10, Section(0x41, 8, {0xF0, 5, 0x40, 3, 'o', 't', 'h', 0xF0, 0})}},
         {R"("name": "\"new\\")", R"([{"pid": 256, "type": 36}])", R"("network_name": "net")", R"("network_id": 9)"},
         {"old", "gone", "later", "other", "oth\""}},
        {"events once each, by start, latest wins, not for another stream",
         {{0x12, Section(0x50, 1, Eit(2, 0x20, "second"))},
          {0x12, Section(0x4E, 1, Eit(1, 0x18, "first"))},
          {0x12, Section(0x51, 1, Eit(2, 0x21, ""))},
          {0x12, Section(0x4F, 1, Eit(1, 0x19, "wrong"))},
          {0x12, Section(0x60, 5, Eit(1, 0x17, "elsewhere"))},
          {0x27, Section(0x4E, 9, Eit(1, 0x22, "one-seg"))},
          {0x14, Section(0x4E, 1, Eit(1, 0x18, "misplaced"))}},
         {"\"events\": [\n"
          R"(    {"service_id": 5, "event_id": 1, "start": "1993-10-13 17:00:00", "local_start": "", "duration": "01:00:00", "name": "elsewhere", "text": ""},)"
          "\n"
          R"(    {"service_id": 1, "event_id": 1, "start": "1993-10-13 18:00:00", "local_start": "", "duration": "01:00:00", "name": "first", "text": ""},)"
          "\n"
          R"(    {"service_id": 1, "event_id": 2, "start": "1993-10-13 21:00:00", "local_start": "", "duration": "01:00:00", "name": "second", "text": ""},)"
          "\n"
          R"(    {"service_id": 9, "event_id": 1, "start": "1993-10-13 22:00:00", "local_start": "", "duration": "01:00:00", "name": "one-seg", "text": ""})"
          "\n  ]"},
         {"wrong", "misplaced"}},
        {"lengths that lead outside",
         {{0, Section(0, 7, Pat({{1, 0x101}}))},
          {0x101, Section(2, 1, loop_in_pmt)},
          {0x11, Section(0x42, 7, kSdtStart + Sdt(2, "kept") + overrun + Sdt(4, "next") + loop_overrun)},
          {0x12, Section(0x4E, 1, {0, 1, 0, 1, 0, 0x4E, 0, 1, 0xC0, 0x79, 0, 0, 0, 0, 0, 0, 0x8F, 0xFF})},
          {0x10, Section(0x40, 9, {0xFF, 0xFF, 0x40, 200, 'n'})},
          {0x14, {0x70, 0x70, 3, 0xC0, 0x79, 0x12}}},
         {"kept", "next", "whole", R"("id": 3, "name": "", "provider": "")", R"("utc_time": "")"},
         {"lost"}},
    };
    for (const auto &c : cases) {
        const Report report = ReadSections(c.sections);
        const std::string json = ToJson(report);
        EXPECT_EQ(report.sections.bad_crc + report.sections.incomplete, 0u) << c.name;
        for (const std::string &text : c.expected) {
            EXPECT_THAT(json, HasSubstr(text)) << c.name;
        }
        for (const std::string &text : c.unexpected) {
            EXPECT_EQ(json.find(text), std::string::npos) << c.name << ": " << text << "\n" << json;
        }
    }
}

TEST(Receiver, ReadsTheSample) {
    const std::string expected = ReadAll(VARNEK_EXPECTED_REPORT);
    EXPECT_EQ(ToJson(ReadStream(Sample())), expected);
    EXPECT_EQ(ToJson(ReadStream(Sample(), 1)), expected);
    const std::string summary = ToSummary(ReadStream(Sample()));
    for (const char *line :
         {"Clock     2024-06-15 23:00:08 UTC, BRA -03:00, local 2024-06-15 20:00:08\n",
          "  0xC858  TV Ipê Móvel  television, Ipê Comunicação  (PMT 0x1FC8)\n",
          "          0x0181 H.264 video, 0x0182 AAC audio (ADTS)\n",
          "  2024-06-15 22:30:00  2024-06-15 19:30:00  00:30:00  TV Ipê Móvel  Notícias em um Minuto\n",
          "  start not known      -                    -         TV Ipê HD     -\n",
          "  sections with a bad CRC          1\n"}) {
        EXPECT_THAT(summary, HasSubstr(line));
    }
}

struct Result {
    int status;
    std::string out, err;
};

Result RunProgram(const std::vector<std::string> &arguments) {
    char *texts[2] = {};
    size_t sizes[2] = {};
    std::FILE *files[2];
    for (int i = 0; i < 2; ++i) {
        files[i] = open_memstream(&texts[i], &sizes[i]);
    }
    Result result{RunReceiver(arguments, files[0], files[1]), "", ""};
    for (int i = 0; i < 2; ++i) {
        std::fclose(files[i]);
        (i == 0 ? result.out : result.err).assign(texts[i], sizes[i]);
        std::free(texts[i]);
    }
    return result;
}

class ReceiverFiles : public VarnekTest {};

TEST_F(ReceiverFiles, AnswersEveryInput) {
    WriteAll(Path("empty"), "");
    WriteAll(Path("text"), std::string(9999, 'x'));
    WriteAll(Path("cut.ts"), SampleText().substr(0, 100000));
    WriteAll(Path("-dash"), SampleText());
    const struct {
        std::vector<std::string> arguments;
        int status;
        std::string out, err;
    } cases[] = {
        {{}, 2, "", "usage: "},
        {{"--nonsense", Path("text")}, 2, "", "usage: "},
        {{Path("text"), Path("text")}, 2, "", "usage: "},
        {{"--help"}, 0, "usage: ", ""},
        {{Path("missing")}, 1, "", "cannot be opened: No such file or directory"},
        {{std::string(300, 'x')}, 1, "", "x: cannot be opened: File name too long\n"},
        {{"--json", Path("empty")}, 1, "", "is empty"},
        {{Path("")}, 1, "", "is a directory"},
        {{Path("text")}, 1, "", "no transport stream packets in 9999 bytes"},
        {{Path("cut.ts"), "--json"}, 0, "{\n  \"packets\": 531,\n", ""},
        {{"--", Path("-dash")}, 0, "1600 packets of 188 bytes", ""},
    };
    for (const auto &c : cases) {
        const Result result = RunProgram(c.arguments);
        EXPECT_EQ(result.status, c.status) << c.err;
        EXPECT_THAT(result.out, HasSubstr(c.out));
        EXPECT_THAT(result.err, HasSubstr(c.err));
        EXPECT_EQ(result.out.empty(), c.out.empty()) << result.out;
        EXPECT_EQ(result.err.empty(), c.err.empty()) << result.err;
    }
    std::FILE *full = std::fopen("/dev/full", "w");
    ASSERT_NE(full, nullptr);
    EXPECT_EQ(RunReceiver({VARNEK_SAMPLE}, full, stderr), 1);
    std::fclose(full);
}

// Fills a registry up.
std::vector<int32_t> CreateAll(const std::function<int32_t(const char *)> &create, const std::string &name) {
    std::vector<int32_t> handles;
    do {
        handles.push_back(create((name + std::to_string(handles.size())).c_str()));
    } while (handles.back() != -1);
    handles.pop_back();
    return handles;
}

// With the registry of one family full but for 0, 1, 2 ... places: no more places are needed than
// there are objects, and each run leaves as many as it found.
TEST_F(ReceiverFiles, LeavesNothingBehind) {
    const struct {
        const char *family;
        std::function<int32_t(const char *)> create;
        BOOL (*remove)(int32_t);
        size_t needed;
    } families[] = {
        {"thread",
         [](const char *name) {
             return VarnekPGL_CreateThread(
                 name, 1, 65536, [](void *) -> void * { return nullptr; }, nullptr);
         },
         VarnekPGL_DeleteThread, 4},
        {"semaphore", [](const char *name) { return VarnekPGL_CreateSemaphore(name, 0); }, VarnekPGL_DeleteSemaphore,
         3},
        {"mutex", VarnekPGL_CreateMutex, VarnekPGL_DeleteMutex, 2},
    };
    const std::string expected = RunProgram({"--json", VARNEK_SAMPLE}).out;
    for (const auto &family : families) {
        std::vector<int32_t> fillers = CreateAll(family.create, "filler");
        ASSERT_GT(fillers.size(), family.needed);
        for (size_t places = 0; places <= family.needed; ++places) {
            const Result result = RunProgram({"--json", VARNEK_SAMPLE});
            const bool enough = places == family.needed;
            EXPECT_EQ(result.status, enough ? 0 : 1) << family.family << places;
            EXPECT_EQ(result.out, enough ? expected : "") << family.family << places;
            EXPECT_EQ(result.err.find(std::string("the ") + family.family) != std::string::npos, !enough) << result.err;
            const std::vector<int32_t> free = CreateAll(family.create, "free");
            EXPECT_EQ(free.size(), places) << family.family;
            for (const int32_t handle : free) {
                family.remove(handle);
            }
            family.remove(fillers.back());
            fillers.pop_back();
        }
        for (const int32_t handle : fillers) {
            family.remove(handle);
        }
    }
}

// The packets that the tables come from make a stream of their own, with the same tables.
TEST_F(ReceiverFiles, CapturesAndStops) {
    const std::string captured = Path("captured.ts");
    const Result first = RunProgram({"--json", "--quiet", "--capture", captured, VARNEK_SAMPLE});
    EXPECT_EQ(first.status, 0) << first.err;
    const Result again = RunProgram({"--json", captured});
    const auto tables = [](const Result &result) { return result.out.substr(result.out.find("\"sections\"")); };
    EXPECT_EQ(tables(again), tables(first));
    EXPECT_LT(ReadAll(captured).size(), SampleText().size());

    EXPECT_EQ(RunProgram({"--capture", captured, captured}).status, 1) << "a stream is not overwritten";
    EXPECT_EQ(RunProgram({"--capture", Path(""), captured}).status, 1);
    const Result full = RunProgram({"--capture", "/dev/full", VARNEK_SAMPLE});
    EXPECT_EQ(full.status, 1);
    EXPECT_THAT(full.err, HasSubstr("the capture ended early: no space is left"));
    EXPECT_THAT(full.out, HasSubstr("1600 packets")) << "the reading goes on";

    const std::atomic<bool> stop{true};
    std::FILE *nowhere = std::fopen("/dev/null", "w");
    EXPECT_EQ(RunReceiver({VARNEK_SAMPLE}, nowhere, nowhere, &stop), 1) << "nothing was read yet";
    std::fclose(nowhere);
}

// The threads of the program come to what one thread makes of the same bytes.
TEST_F(ReceiverFiles, SurvivesDamage) {
    std::mt19937 random(20240615);
    for (int round = 0; round < 15; ++round) {
        Bytes stream = Sample();
        for (size_t damage = random() % 200; damage > 0; --damage) {
            const auto place = stream.begin() + static_cast<std::ptrdiff_t>(random() % (stream.size() - 2000));
            const auto count = static_cast<std::ptrdiff_t>(random() % 1000);
            switch (random() % 20) {
                case 0:
                    stream.erase(place, place + count);
                    break;
                case 1: {
                    const Bytes noise = Random(random, static_cast<size_t>(count));
                    stream.insert(place, noise.begin(), noise.end());
                    break;
                }
                default:
                    *place = Low(random());
            }
        }
        WriteAll(Path("damaged.ts"), std::string(stream.begin(), stream.end()));
        const Result result = RunProgram({"--json", Path("damaged.ts")});
        ASSERT_EQ(result.out, ToJson(ReadStream(stream, 1 + random() % 9000))) << result.err;
    }
}

}  // namespace
}  // namespace receiver
