// Makes a sample transport stream: an ISDB-Tb multiplex of 20 seconds with a full-segment and a
// one-seg service, thinned out to what a receiver of tables needs. The same bytes on every run.
//   samplestream FILE
// Texts are in ISO/IEC 8859-15. One service description section is damaged on purpose.
#include <cstddef>
#include <cstdint>
#include <cstdio>
#include <deque>
#include <iterator>
#include <map>
#include <string>
#include <vector>

#include "Varnek_File.h"
#include "Varnek_Util.h"

namespace {

using Bytes = std::vector<unsigned char>;

// A service_id is 11 bits of the network, two of the kind (3: one-seg) and three of the number; the
// PMT of one-seg service n comes on PID 0x1FC8 + n.
constexpr uint16_t kNetwork = 0x0642;
constexpr uint16_t kFullSegService = (kNetwork & 0x7FF) << 5;
constexpr uint16_t kOneSegService = kFullSegService | 3 << 3;

constexpr uint16_t kPidPat = 0x0000, kPidNit = 0x0010, kPidSdt = 0x0011, kPidEit = 0x0012;
constexpr uint16_t kPidTime = 0x0014, kPidBit = 0x0024, kPidEitOneSeg = 0x0027;
constexpr uint16_t kPidFullSegPmt = 0x0101, kPidOneSegPmt = 0x1FC8, kPidNull = 0x1FFF;
constexpr uint16_t kPidVideo = 0x0111, kPidAudio = 0x0112, kPidCaptions = 0x0130;
constexpr uint16_t kPidCarousel = 0x0140, kPidOneSegVideo = 0x0181, kPidOneSegAudio = 0x0182;

constexpr size_t kPacketSize = 188;
constexpr int kRounds = 16;
constexpr int kRoundPackets = 100;
constexpr uint64_t kPcrTicks = 27000000ull * 20 / (uint64_t{kRounds} * kRoundPackets);  // a packet

constexpr uint16_t kDay = 60476;          // 2024-06-15
constexpr int kFirstSecond = 82790;       // 22:59:50, ten seconds before the next event begins
constexpr int kEventChange = 82800;       // 23:00:00
constexpr uint32_t kNotKnown = 0xFFFFFF;  // for a duration

struct Event {
    uint16_t service, id;
    int start;     // seconds since kDay began, may lie on the next day
    int duration;  // seconds
    const char *name, *text;
};

constexpr Event kEvents[] = {
    {kFullSegService, 0x0101, 79200, 3600, "Caf\xE9 com Prosa",
     "Vizinhos contam hist\xF3rias do bairro, com receitas de p\xE3o de queijo e bolo de fub\xE1. "
     "Hoje: a fam\xEDlia que guarda o forno mais antigo da rua."},
    {kFullSegService, 0x0102, 82800, 2700, "Jornal da Regi\xE3o",
     "As not\xED"
     "cias do dia, a previs\xE3o do tempo e o tr\xE2nsito. Edi\xE7\xE3o ao vivo, com closed "
     "caption e audiodescri\xE7\xE3o."},
    {kFullSegService, 0x0103, 85500, 4500, "Novela: O Pi\xE3o e a Ma\xE7\xE3",
     "Cap\xEDtulo 42. Concei\xE7\xE3o descobre a carta do av\xF4 e decide voltar \xE0 ilha antes "
     "da tempestade; \xC2ngelo espera no cais."},
    {kFullSegService, 0x0104, 90000, 7200, "Sess\xE3o Cora\xE7\xE3o: \xC0 Procura do \xD4nibus",
     "Com\xE9"
     "dia. Tr\xEAs amigos atravessam o pa\xEDs atr\xE1s de um \xF4nibus que s\xF3 passa uma vez "
     "por ano. Ingresso na \xE9poca: 5 \xA4. T\xEDtulo original: \"S\xBDur\"."},
    {kFullSegService, 0x0105, 97200, 1800, "\xDAltima Edi\xE7\xE3o", "O resumo do dia."},
    {kOneSegService, 0x0201, 81000, 1800,
     "Not\xED"
     "cias em um Minuto",
     ""},
    {kOneSegService, 0x0202, 82800, 5400, "Clipes \xE0 Noite", "M\xFAsica para levar no bolso."},
};

// Tables ----------------------------------------------------------------------------------------

void Put8(Bytes &out, unsigned value) {
    out.push_back(static_cast<unsigned char>(value));
}

void Put16(Bytes &out, unsigned value) {
    Put8(out, value >> 8);
    Put8(out, value);
}

void Put24(Bytes &out, unsigned value) {
    Put8(out, value >> 16);
    Put16(out, value);
}

void Put(Bytes &out, const Bytes &bytes) {
    out.insert(out.end(), bytes.begin(), bytes.end());
}

// A text behind its length.
void PutText(Bytes &out, const std::string &text) {
    Put8(out, static_cast<unsigned>(text.size()));
    out.insert(out.end(), text.begin(), text.end());
}

void PutDescriptor(Bytes &out, unsigned tag, const Bytes &body) {
    Put8(out, tag);
    Put8(out, static_cast<unsigned>(body.size()));
    Put(out, body);
}

// A loop behind its 12-bit length, with `flags` in the four bits above.
void PutLoop(Bytes &out, unsigned flags, const Bytes &loop) {
    Put16(out, flags << 12 | static_cast<unsigned>(loop.size()));
    Put(out, loop);
}

void PutBcd(Bytes &out, int seconds) {
    for (const int part : {seconds / 3600, seconds / 60 % 60, seconds % 60}) {
        Put8(out, static_cast<unsigned>(part / 10 << 4 | part % 10));
    }
}

void PutDateTime(Bytes &out, int seconds) {
    Put16(out, kDay + static_cast<unsigned>(seconds / 86400));
    PutBcd(out, seconds % 86400);
}

void PutCrc(Bytes &section) {
    const uint32_t crc = VarnekUtil_MakeCRC32(section.data(), static_cast<int32_t>(section.size()));
    Put16(section, crc >> 16);
    Put16(section, crc);
}

Bytes MakeSection(unsigned table, unsigned extension, unsigned version, unsigned number,
                  unsigned last, const Bytes &body) {
    Bytes section;
    Put8(section, table);
    Put16(section, 0xB000 | static_cast<unsigned>(body.size() + 9));
    Put16(section, extension);
    Put8(section, 0xC1 | version << 1);
    Put8(section, number);
    Put8(section, last);
    Put(section, body);
    PutCrc(section);
    return section;
}

Bytes MakePat() {
    Bytes body;
    Put16(body, 0);
    Put16(body, 0xE000 | kPidNit);
    Put16(body, kFullSegService);
    Put16(body, 0xE000 | kPidFullSegPmt);
    Put16(body, kOneSegService);
    Put16(body, 0xE000 | kPidOneSegPmt);
    return MakeSection(0x00, kNetwork, 0, 0, 0, body);
}

void PutComponent(Bytes &body, unsigned stream_type, uint16_t pid, unsigned tag, bool data) {
    Bytes loop;
    PutDescriptor(loop, 0x52, {static_cast<unsigned char>(tag)});
    if (data) {
        PutDescriptor(loop, 0xFD, {0x00, 0x08});
    }
    Put8(body, stream_type);
    Put16(body, 0xE000u | pid);
    PutLoop(body, 0xF, loop);
}

Bytes MakeFullSegPmt() {
    Bytes body;
    Put16(body, 0xE000 | kPidVideo);  // carries the clock reference
    PutLoop(body, 0xF, {});
    PutComponent(body, 0x1B, kPidVideo, 0x00, false);
    PutComponent(body, 0x11, kPidAudio, 0x10, false);
    PutComponent(body, 0x06, kPidCaptions, 0x30, true);
    PutComponent(body, 0x0B, kPidCarousel, 0x40, false);
    return MakeSection(0x02, kFullSegService, 3, 0, 0, body);
}

Bytes MakeOneSegPmt() {
    Bytes body;
    Put16(body, 0xE000 | kPidOneSegVideo);
    PutLoop(body, 0xF, {});
    PutComponent(body, 0x1B, kPidOneSegVideo, 0x81, false);
    PutComponent(body, 0x0F, kPidOneSegAudio, 0x83, false);
    return MakeSection(0x02, kOneSegService, 0, 0, 0, body);
}

Bytes MakeNit() {
    const std::string name = "Rede Ip\xEA do Cerrado";
    Bytes network;
    PutDescriptor(network, 0x40, Bytes(name.begin(), name.end()));
    Bytes services;
    for (const uint16_t service : {kFullSegService, kOneSegService}) {
        Put16(services, service);
        Put8(services, 0x01);
    }
    Bytes stream;
    PutDescriptor(stream, 0x41, services);
    Bytes streams;
    Put16(streams, kNetwork);
    Put16(streams, kNetwork);
    PutLoop(streams, 0xF, stream);
    Bytes body;
    PutLoop(body, 0xF, network);
    PutLoop(body, 0xF, streams);
    return MakeSection(0x40, kNetwork, 1, 0, 0, body);
}

// One section for each service.
Bytes MakeSdt(unsigned number, uint16_t service, const std::string &name) {
    Bytes description;
    Put8(description, 0x01);
    PutText(description, "Ip\xEA Comunica\xE7\xE3o");
    PutText(description, name);
    Bytes loop;
    PutDescriptor(loop, 0x48, description);
    Bytes body;
    Put16(body, kNetwork);
    Put8(body, 0xFF);
    Put16(body, service);
    Put8(body, 0xE3);
    PutLoop(body, 0x8, loop);
    return MakeSection(0x42, kNetwork, 2, number, 1, body);
}

void PutEvent(Bytes &body, const Event &event, unsigned running) {
    Bytes text = {'p', 'o', 'r'};
    PutText(text, event.name);
    PutText(text, event.text);
    Bytes loop;
    PutDescriptor(loop, 0x4D, text);
    Put16(body, event.id);
    PutDateTime(body, event.start);
    PutBcd(body, event.duration);
    PutLoop(body, running << 1, loop);
}

Bytes StartEit(unsigned last_section, unsigned last_table) {
    Bytes body;
    Put16(body, kNetwork);
    Put16(body, kNetwork);
    Put8(body, last_section);
    Put8(body, last_table);
    return body;
}

// The present event and the following one in a section each, as at `now`.
std::vector<Bytes> MakePresentFollowing(uint16_t service, int now) {
    std::vector<Bytes> sections;
    for (const Event &event : kEvents) {
        if (event.service == service && event.start + event.duration > now && sections.size() < 2) {
            Bytes body = StartEit(1, 0x4E);
            PutEvent(body, event, sections.empty() ? 4 : 1);
            sections.push_back(MakeSection(0x4E, service, now < kEventChange ? 0 : 1,
                                           static_cast<unsigned>(sections.size()), 1, body));
        }
    }
    return sections;
}

// The whole evening of a service, and an event without a time at the end.
Bytes MakeSchedule(uint16_t service) {
    Bytes body = StartEit(0, 0x50);
    for (const Event &event : kEvents) {
        if (event.service == service) {
            PutEvent(body, event, 0);
        }
    }
    Put16(body, 0x01FF);
    Put16(body, 0xFFFF);
    Put24(body, kNotKnown);
    Put24(body, kNotKnown);
    PutLoop(body, 0, {});
    return MakeSection(0x50, service, 0, 0, 0, body);
}

// Time, with the offset of Brazil's official time: three hours behind, and no change in sight.
Bytes MakeTot(int now) {
    Bytes offset = {'B', 'R', 'A', 0x03, 0x03, 0x00};
    PutDateTime(offset, 120 * 86400);
    Put16(offset, 0x0300);
    Bytes loop;
    PutDescriptor(loop, 0x58, offset);
    Bytes section;
    Put8(section, 0x73);
    Put16(section, 0x7000 | static_cast<unsigned>(5 + 2 + loop.size() + 4));
    PutDateTime(section, now);
    PutLoop(section, 0xF, loop);
    PutCrc(section);
    return section;
}

Bytes MakeTdt(int now) {
    Bytes section = {0x70, 0x70, 0x05};
    PutDateTime(section, now);
    return section;
}

// Broadcaster information: one broadcaster, nothing said about it.
Bytes MakeBit() {
    Bytes body;
    PutLoop(body, 0xF, {});
    Put8(body, 0xFF);
    PutLoop(body, 0xF, {});
    return MakeSection(0xC4, kNetwork, 0, 0, 0, body);
}

// Packets ---------------------------------------------------------------------------------------

class Multiplex {
  public:
    // Queues sections that follow one another without a gap, in as few packets as they take.
    void Queue(uint16_t pid, const std::vector<Bytes> &sections);
    // Sends queued packets among filler until `packets` more are written. What is queued takes
    // every third packet at most.
    void Run(int packets);
    const Bytes &Stream() const { return stream_; }

  private:
    void Send(uint16_t pid, bool unit_start, Bytes adaptation, const Bytes &payload);
    void SendFiller(int slot);

    struct Payload {
        uint16_t pid;
        bool unit_start;
        Bytes bytes;
    };

    Bytes stream_;
    std::deque<Payload> queue_;
    std::map<uint16_t, unsigned> counters_;
};

void Multiplex::Queue(uint16_t pid, const std::vector<Bytes> &sections) {
    constexpr size_t kRoom = kPacketSize - 4;
    Bytes all;
    std::vector<size_t> starts;
    for (const Bytes &section : sections) {
        starts.push_back(all.size());
        Put(all, section);
    }
    size_t next_start = 0;  // index of the first start that has not been sent
    for (size_t at = 0; at < all.size();) {
        Payload payload{pid, false, {}};
        if (next_start < starts.size() && starts[next_start] < at + kRoom - 1) {
            payload.unit_start = true;
            Put8(payload.bytes, static_cast<unsigned>(starts[next_start] - at));
        }
        while (at < all.size() && payload.bytes.size() < kRoom) {
            if (next_start < starts.size() && starts[next_start] == at) {
                ++next_start;
            }
            payload.bytes.push_back(all[at++]);
        }
        payload.bytes.resize(kRoom, 0xFF);
        queue_.push_back(std::move(payload));
    }
}

void Multiplex::Run(int packets) {
    for (int slot = 0; slot < packets; ++slot) {
        if (slot % 3 == 0 && !queue_.empty()) {
            Send(queue_.front().pid, queue_.front().unit_start, {}, queue_.front().bytes);
            queue_.pop_front();
        } else {
            SendFiller(slot);
        }
    }
}

// `adaptation` is the adaptation field behind its length; the rest of the packet is the payload.
void Multiplex::Send(uint16_t pid, bool unit_start, Bytes adaptation, const Bytes &payload) {
    unsigned &counter = counters_[pid];
    Put8(stream_, 0x47);
    Put16(stream_, (unit_start ? 0x4000u : 0u) | pid);
    Put8(stream_, (adaptation.empty() ? 0x10 : 0x30) | counter);
    if (!adaptation.empty()) {
        PutText(stream_, std::string(adaptation.begin(), adaptation.end()));
    }
    Put(stream_, payload);
    counter = pid == kPidNull ? 0 : (counter + 1) & 0x0F;
}

// Stands for video, audio, captions and the carousel: packets that only their headers tell apart.
void Multiplex::SendFiller(int slot) {
    constexpr uint16_t kPids[] = {kPidVideo, kPidVideo,       kPidAudio, kPidVideo,
                                  kPidVideo, kPidOneSegVideo, kPidNull,  kPidVideo,
                                  kPidAudio, kPidOneSegAudio, kPidVideo, kPidCarousel};
    const uint16_t pid =
        slot == 50 ? kPidCaptions : kPids[static_cast<size_t>(slot) % std::size(kPids)];
    Bytes adaptation;
    if ((pid == kPidVideo || pid == kPidOneSegVideo) && slot % 5 == 0) {
        const uint64_t clock = stream_.size() / kPacketSize * kPcrTicks;
        const uint64_t base = clock / 300;
        const unsigned extension = static_cast<unsigned>(clock % 300);
        Put8(adaptation, 0x10);
        Put16(adaptation, static_cast<unsigned>(base >> 17));
        Put16(adaptation, static_cast<unsigned>(base >> 1));
        Put16(adaptation, static_cast<unsigned>(base & 1) << 15 | 0x7E00u | extension);
    }
    const size_t header = 4 + (adaptation.empty() ? 0 : 1 + adaptation.size());
    Send(pid, false, adaptation, Bytes(kPacketSize - header, static_cast<unsigned char>(slot)));
}

Bytes MakeStream() {
    Bytes damaged = MakeSdt(0, kFullSegService, "TV Ip\xEA danificada");
    damaged.back() ^= 0x01;
    Multiplex multiplex;
    for (int round = 0; round < kRounds; ++round) {
        const int now = kFirstSecond + round * 20 / kRounds;
        multiplex.Queue(kPidPat, {MakePat()});
        multiplex.Queue(kPidFullSegPmt, {MakeFullSegPmt()});
        multiplex.Queue(kPidOneSegPmt, {MakeOneSegPmt()});
        multiplex.Queue(kPidTime, {round % 2 == 0 ? MakeTot(now) : MakeTdt(now)});
        std::vector<Bytes> events = MakePresentFollowing(kFullSegService, now);
        if (round % 4 == 1) {
            events.push_back(MakeSchedule(kFullSegService));
            multiplex.Queue(kPidSdt, {MakeSdt(0, kFullSegService, "TV Ip\xEA HD"),
                                      MakeSdt(1, kOneSegService, "TV Ip\xEA M\xF3vel")});
        }
        multiplex.Queue(kPidEit, events);
        multiplex.Queue(kPidEitOneSeg, MakePresentFollowing(kOneSegService, now));
        if (round % 4 == 2) {
            multiplex.Queue(kPidNit, {MakeNit()});
            multiplex.Queue(kPidBit, {MakeBit()});
        }
        if (round == 7) {
            multiplex.Queue(kPidSdt, {damaged});
        }
        multiplex.Run(kRoundPackets);
    }
    return multiplex.Stream();
}

}  // namespace

int main(int argc, char **argv) {
    if (argc != 2) {
        std::fputs("usage: samplestream FILE\n", stderr);
        return 2;
    }
    const Bytes stream = MakeStream();
    const int32_t written =
        VarnekPGL_WriteFile(argv[1], stream.data(), static_cast<uint32_t>(stream.size()));
    if (written != static_cast<int32_t>(stream.size())) {
        std::fprintf(stderr, "samplestream: %s: cannot be written\n", argv[1]);
        return 1;
    }
    return 0;
}
