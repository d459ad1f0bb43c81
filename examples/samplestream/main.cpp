// Generates a sample transport stream: an ISDB-Tb multiplex of 20 seconds with a full-segment and a
// one-seg service, reduced to what a receiver of tables needs. Every run writes the same bytes.
//   samplestream FILE
// Texts are in ISO/IEC 8859-15. One service description section is damaged on purpose.
#include <cstdint>
#include <cstdio>
#include <deque>
#include <iterator>
#include <string>
#include <utility>
#include <vector>

#include "StreamWriter.h"
#include "Varnek_File.h"

namespace {

using namespace streamwriter;

// A service_id is 11 bits of the network, two of the kind (3: one-seg) and three of the number; the
// PMT of one-seg service n is on PID 0x1FC8 + n.
constexpr uint16_t kNetwork = 0x0642;
constexpr uint16_t kOtherNetwork = 0x0643;
constexpr uint16_t kFullSegService = (kNetwork & 0x7FF) << 5;
constexpr uint16_t kOneSegService = kFullSegService | 3 << 3;
constexpr uint16_t kOtherService = (kOtherNetwork & 0x7FF) << 5;

constexpr uint16_t kPidPat = 0x0000, kPidNit = 0x0010, kPidSdt = 0x0011, kPidEit = 0x0012;
constexpr uint16_t kPidTime = 0x0014, kPidSdtt = 0x0023, kPidBit = 0x0024, kPidNbit = 0x0025;
constexpr uint16_t kPidEitOneSeg = 0x0027, kPidCdt = 0x0029;
constexpr uint16_t kPidFullSegPmt = 0x0101, kPidOneSegPmt = 0x1FC8, kPidNull = 0x1FFF;
constexpr uint16_t kPidVideo = 0x0111, kPidAudio = 0x0112, kPidCaptions = 0x0130;
constexpr uint16_t kPidCarousel = 0x0140, kPidApplications = 0x0141;
constexpr uint16_t kPidOneSegVideo = 0x0181, kPidOneSegAudio = 0x0182;

constexpr size_t kPacketSize = 188;
constexpr int kRounds = 16;
constexpr int kRoundPackets = 100;
// Ticks per packet.
constexpr uint64_t kPcrTicks = 27000000ull * 20 / (uint64_t{kRounds} * kRoundPackets);

// All times are in the official time of Brasilia, UTC-3, as in broadcasts in Brazil.
constexpr uint16_t kDay = 60476;     // 2024-06-15
constexpr int kFirstSecond = 71990;  // 19:59:50, ten seconds before the next event
constexpr int kEventChange = 72000;  // 20:00:00

struct Programme {
    uint16_t service, id;
    int start;        // seconds since the start of kDay, may be on the next day
    int duration;     // seconds
    uint8_t genre;    // two levels of Brazil's genres
    uint8_t content;  // 1 drugs, 2 violence, 4 sex
    uint8_t age;      // 1 for all, 2 from 10, 3 from 12, 4 from 14, 5 from 16, 6 from 18
    const char *name, *text;
};

constexpr Programme kProgrammes[] = {
    {kFullSegService, 0x0101, 68400, 3600, 0x80, 0, 1, "Caf\xE9 com Prosa",
     "Vizinhos contam hist\xF3rias do bairro, com receitas de p\xE3o de queijo e bolo de fub\xE1. "
     "Hoje: a fam\xEDlia que guarda o forno mais antigo da rua."},
    {kFullSegService, 0x0102, 72000, 2700, 0x00, 0, 1, "Jornal da Regi\xE3o",
     "As not\xED"
     "cias do dia, a previs\xE3o do tempo e o tr\xE2nsito.\r\nEdi\xE7\xE3o ao vivo, com closed "
     "caption e audiodescri\xE7\xE3o."},
    {kFullSegService, 0x0103, 74700, 4500, 0x30, 2, 3, "Novela: O Pi\xE3o e a Ma\xE7\xE3",
     "Cap\xEDtulo 42. Concei\xE7\xE3o descobre a carta do av\xF4 e decide voltar \xE0 ilha antes "
     "da tempestade; \xC2ngelo espera no cais."},
    {kFullSegService, 0x0104, 79200, 7200, 0xC0, 5, 4,
     "Sess\xE3o Cora\xE7\xE3o: \xC0 Procura do \xD4nibus",
     "Com\xE9"
     "dia. Tr\xEAs amigos atravessam o pa\xEDs atr\xE1s de um \xF4nibus que s\xF3 passa uma vez "
     "por ano. Ingresso na \xE9poca: 5 \xA4. T\xEDtulo original: \"S\xBDur\"."},
    {kFullSegService, 0x0105, 86400, 1800, 0x00, 0, 1, "\xDAltima Edi\xE7\xE3o",
     "O resumo do dia."},
    {kOneSegService, 0x0201, 70200, 1800, 0x00, 0, 1,
     "Not\xED"
     "cias em um Minuto",
     ""},
    {kOneSegService, 0x0202, 72000, 5400, 0x60, 0, 2, "Clipes \xE0 Noite",
     "M\xFAsica para levar no bolso."},
    {kOtherService, 0x0301, 72000, 3600, 0x10, 0, 1, "Futebol na Vizinha", ""},
};

// Tables ----------------------------------------------------------------------------------------

// Returns a component with its tag and further descriptors.
Bytes TaggedComponent(unsigned stream_type, uint16_t pid, unsigned tag, const Bytes &descriptors) {
    return MakeComponent(stream_type, pid, Descriptor(0x52, U8(tag)) + descriptors);
}

Bytes FullSegPmt() {
    const Bytes warning = U16(kFullSegService) + U8(0xBF) + U8(2) + U16(0xA5F);  // on, in one area
    const Bytes components =
        TaggedComponent(0x1B, kPidVideo, 0x00, {}) +
        TaggedComponent(0x11, kPidAudio, 0x10, Descriptor(0x0A, Raw("por") + U8(0))) +
        TaggedComponent(0x06, kPidCaptions, 0x30, Descriptor(0xFD, U16(0x0008))) +
        TaggedComponent(0x0B, kPidCarousel, 0x40, Descriptor(0xFD, U16(0x00A0))) +
        TaggedComponent(0x05, kPidApplications, 0x41, Descriptor(0x6F, U24(0x8009E0)));
    return MakePmt(kFullSegService, kPidVideo, components, Descriptor(0xFC, warning), {0, 0, 0xC7});
}

Bytes OneSegPmt() {
    return MakePmt(kOneSegService, kPidOneSegVideo,
                   TaggedComponent(0x1B, kPidOneSegVideo, 0x81, {}) +
                       TaggedComponent(0x0F, kPidOneSegAudio, 0x83, {}));
}

Bytes OwnNit() {
    const std::string name = "Ip\xEA";
    const Bytes services = U16(kFullSegService) + U8(0x01) + U16(kOneSegService) + U8(0x01);
    // The area, a guard interval of 1/16, mode 3, and a frequency in sevenths of a megahertz.
    const Bytes delivery = U16(0x0A5 << 4 | 1 << 2 | 2) + U16(0x0E07);
    // The key on the remote control, and one kind of transmission with one service.
    const Bytes information = U8(12) + U8(static_cast<unsigned>(name.size()) << 2 | 1) + Raw(name) +
                              U8(0x0F) + U8(1) + U16(kFullSegService);
    return MakeNit(kNetwork, kNetwork, Descriptor(0x40, Raw("Rede Ip\xEA do Cerrado")),
                   Descriptor(0x41, services) + Descriptor(0xFA, delivery) +
                       Descriptor(0xFB, U16(kOneSegService)) + Descriptor(0xCD, information),
                   {0, 0, 0xC3});
}

// Each service has one section.
Bytes OwnSdt(unsigned number, uint16_t service, const std::string &name) {
    return MakeSdt(kNetwork, MakeService(service, "Ip\xEA Comunica\xE7\xE3o", name),
                   {number, 1, 0xC5});
}

// Lists the makers of a programme in two descriptors, the second of which continues the first.
Bytes Credits() {
    const Bytes first = Counted("Dire\xE7\xE3o") + Counted("B\xE1rbara Le\xE3o");
    const Bytes second = Counted("") + Counted(" e J\xFAlio Ara\xFAjo");
    return Descriptor(0x4E, U8(0x01) + Raw("por") + U8(static_cast<unsigned>(first.size())) +
                                first + Counted("")) +
           Descriptor(0x4E, U8(0x11) + Raw("por") + U8(static_cast<unsigned>(second.size())) +
                                second + Counted("Cores."));
}

Bytes Entry(const Programme &programme, unsigned running) {
    Bytes descriptors = MakeShortEvent("por", programme.name, programme.text);
    if (programme.id == 0x0102) {
        descriptors = MakeShortEvent("eng", "Regional News", "In English.") + descriptors;
    }
    if (programme.id == 0x0104) {
        const Bytes audio = Bytes{0xF2, 0x01, 0x10, 0x11, 0xFF, 0xC1} + Raw("poreng");
        descriptors = descriptors + Credits() + Descriptor(0xC4, audio);
    }
    const unsigned rating = unsigned{programme.content} << 4 | programme.age;
    descriptors = descriptors + Descriptor(0x54, U8(programme.genre) + U8(0xFF)) +
                  Descriptor(0x55, Raw("BRA") + U8(rating));
    return MakeEvent(programme.id, MakeDateTime(kDay, programme.start), Bcd(programme.duration),
                     descriptors, running << 1);
}

// Returns sections for the event that is present at the time `now` and for the one that follows.
std::vector<Bytes> PresentFollowing(uint16_t service, int now) {
    const bool own = service != kOtherService;
    std::vector<Bytes> sections;
    for (const Programme &programme : kProgrammes) {
        if (programme.service == service && programme.start + programme.duration > now &&
            sections.size() < 2) {
            const auto number = static_cast<unsigned>(sections.size());
            sections.push_back(MakeEit(own ? 0x4E : 0x4F, service, own ? kNetwork : kOtherNetwork,
                                       Entry(programme, number == 0 ? 4 : 1),
                                       {number, 1, now < kEventChange ? 0xC1u : 0xC3u}));
        }
    }
    return sections;
}

// Returns the whole evening of a service, followed by an event whose time is not known.
Bytes Schedule(uint16_t service) {
    Bytes entries;
    for (const Programme &programme : kProgrammes) {
        if (programme.service == service) {
            entries = entries + Entry(programme, 0);
        }
    }
    const Bytes not_known = U24(0xFFFFFF);
    return MakeEit(0x50, service, kNetwork,
                   entries + MakeEvent(0x01FF, U16(0xFFFF) + not_known, not_known, {}));
}

// Returns the time, with two regions' offsets from Brazil's official time: zero and minus one hour.
Bytes OwnTot(int now) {
    return MakeTot(MakeDateTime(kDay, now),
                   MakeLocalOffset("BRA", 3, 0) + MakeLocalOffset("BRA", 4, -1));
}

Bytes OwnTdt(int now) {
    return Bytes{0x70, 0x70, 0x05} + MakeDateTime(kDay, now);
}

// Returns broadcaster information with one broadcaster and no descriptors.
Bytes OwnBit() {
    return MakeSection(0xC4, kNetwork, Loop(0xF, {}) + U8(0xFF) + Loop(0xF, {}));
}

// Returns a table without content, which the receiver only counts.
Bytes Empty(unsigned table) {
    return MakeSection(table, kNetwork, {});
}

// Packets ---------------------------------------------------------------------------------------

class Multiplex {
  public:
    // Queues sections, without gaps between them, in as few packets as possible.
    void Queue(uint16_t pid, const std::vector<Bytes> &sections) {
        for (Content &content : SplitSections(sections)) {
            queue_.emplace_back(pid, std::move(content));
        }
    }

    // Writes packets. At most one in three is taken from the queue; the others are filler.
    void Run(int packets) {
        for (int slot = 0; slot < packets; ++slot) {
            if (slot % 3 == 0 && !queue_.empty()) {
                writer_.Send(queue_.front().first, queue_.front().second);
                queue_.pop_front();
            } else {
                SendFiller(slot);
            }
        }
    }

    const Bytes &Stream() const { return writer_.Stream(); }

  private:
    // Writes a packet for video, audio, captions, the carousel or nobody. Its payload means
    // nothing.
    void SendFiller(int slot) {
        constexpr uint16_t kPids[] = {kPidVideo, kPidVideo,       kPidAudio, kPidVideo,
                                      kPidVideo, kPidOneSegVideo, kPidNull,  kPidVideo,
                                      kPidAudio, kPidOneSegAudio, kPidVideo, kPidCarousel};
        const uint16_t pid =
            slot == 50 ? kPidCaptions : kPids[static_cast<size_t>(slot) % std::size(kPids)];
        Content content{{}, kPayload};
        if ((pid == kPidVideo || pid == kPidOneSegVideo) && slot % 5 == 0) {
            const uint64_t clock = Stream().size() / kPacketSize * kPcrTicks;
            const auto base =
                static_cast<unsigned>(clock / 300);  // 20 seconds take 21 of its 33 bits
            content.flags |= kAdaptation;
            content.bytes = Bytes{7, 0x10} + U16(base >> 17) + U16(base >> 1) +
                            U16((base & 1) << 15 | 0x7E00 | static_cast<unsigned>(clock % 300));
        }
        content.bytes.resize(kPacketSize - 4, static_cast<unsigned char>(slot));
        writer_.Send(pid, content);
    }

    StreamWriter writer_;
    std::deque<std::pair<uint16_t, Content>> queue_;
};

Bytes MakeStream() {
    Bytes damaged = OwnSdt(0, kFullSegService, "TV Ip\xEA danificada");
    damaged.back() ^= 0x01;
    Multiplex multiplex;
    for (int round = 0; round < kRounds; ++round) {
        const int now = kFirstSecond + round * 20 / kRounds;
        multiplex.Queue(kPidPat, {MakePat(kNetwork, {{0, kPidNit},
                                                     {kFullSegService, kPidFullSegPmt},
                                                     {kOneSegService, kPidOneSegPmt}})});
        multiplex.Queue(kPidFullSegPmt, {FullSegPmt()});
        multiplex.Queue(kPidOneSegPmt, {OneSegPmt()});
        multiplex.Queue(kPidTime, {round % 2 == 0 ? OwnTot(now) : OwnTdt(now)});
        std::vector<Bytes> events = PresentFollowing(kFullSegService, now);
        if (round % 4 == 1) {
            events.push_back(Schedule(kFullSegService));
            multiplex.Queue(kPidSdt, {OwnSdt(0, kFullSegService, "TV Ip\xEA HD"),
                                      OwnSdt(1, kOneSegService, "TV Ip\xEA M\xF3vel")});
        }
        multiplex.Queue(kPidEit, events);
        multiplex.Queue(kPidEitOneSeg, PresentFollowing(kOneSegService, now));
        if (round % 4 == 2) {
            multiplex.Queue(kPidNit, {OwnNit()});
            multiplex.Queue(kPidBit, {OwnBit()});
        }
        if (round == 3) {
            multiplex.Queue(kPidEit, PresentFollowing(kOtherService, now));
            multiplex.Queue(kPidSdtt, {Empty(0xC3)});
            multiplex.Queue(kPidNbit, {Empty(0xC5)});
            multiplex.Queue(kPidCdt, {Empty(0xC8)});
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
