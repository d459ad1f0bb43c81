// Each table is a text of entries "|code name|", with the code in two or more hexadecimal digits.
#include "Names.h"

#include <cstdarg>
#include <cstdio>
#include <utility>

#include "TransportStream.h"

namespace receiver {
namespace {

constexpr char kPids[] =
    "|00 PAT|01 CAT|10 NIT|11 SDT|12 EIT|14 TDT and TOT|23 SDTT|24 BIT|25 NBIT|26 EIT, portable|"
    "27 EIT, one-seg|28 SDTT, one-seg|29 CDT|1FFF null packets|";

constexpr char kTables[] =
    "|00 PAT|01 CAT|02 PMT|03 TSDT|3B DSM-CC|3C DSM-CC|3D DSM-CC|40 NIT|41 NIT other|42 SDT|"
    "46 SDT other|4A BAT|4E EIT p/f|4F EIT p/f other|70 TDT|71 RST|72 ST|73 TOT|74 AIT|C3 SDTT|"
    "C4 BIT|C5 NBIT|C6 NBIT reference|C7 LDT|C8 CDT|";

constexpr char kServiceTypes[] =
    "|01 television|02 radio|03 teletext|04 near-video-on-demand reference|"
    "05 near-video-on-demand|06 mosaic|07 FM radio|08 system renewability|0A radio|0B mosaic|"
    "0C data|0E RCS map|0F RCS forward link|10 DVB MHP|11 HD television|16 television|"
    "17 near-video-on-demand|18 near-video-on-demand reference|19 HD television|"
    "1A HD near-video-on-demand|1B HD near-video-on-demand reference|1C 3D HD television|"
    "1D 3D HD near-video-on-demand|1E 3D HD near-video-on-demand reference|1F HEVC television|"
    "20 HEVC UHD television|A1 special video|A2 special audio|A3 special data|A4 engineering|"
    "A5 promotion video|A6 promotion audio|A7 promotion data|A8 data for storage beforehand|"
    "A9 data for storage only|AA bookmark list|AB server-type simultaneous|AC independent file|"
    "C0 data|";

constexpr char kStreamTypes[] =
    "|01 MPEG-1 video|02 MPEG-2 video|03 MPEG-1 audio|04 MPEG-2 audio|05 private sections|"
    "06 private data|07 MHEG|08 DSM-CC|09 H.222.1|0A DSM-CC type A|0B DSM-CC type B|"
    "0C DSM-CC type C|0D DSM-CC type D|0E auxiliary data|0F AAC audio (ADTS)|10 MPEG-4 video|"
    "11 AAC audio (LATM)|12 MPEG-4 systems|13 MPEG-4 systems sections|14 synchronised download|"
    "15 metadata|16 metadata sections|17 metadata in a data carousel|"
    "18 metadata in an object carousel|19 metadata in a synchronised download|1A IPMP|"
    "1B H.264 video|1C MPEG-4 raw audio|1D MPEG-4 text|1E auxiliary video|1F SVC video|"
    "20 MVC video|21 JPEG 2000 video|22 MPEG-2 video, second view|23 H.264 video, second view|"
    "24 HEVC video|25 HEVC video, temporal layer|26 MVC depth video|"
    "27 timeline and external media|28 HEVC video, enhancement|"
    "29 HEVC video, temporal enhancement|2A HEVC video, enhancement|"
    "2B HEVC video, temporal enhancement|2C green access units|2D MPEG-H audio|"
    "2E MPEG-H audio, auxiliary|2F quality access units|30 media orchestration|"
    "31 HEVC video, tiles|32 JPEG XS video|33 VVC video|34 VVC video, temporal layer|35 EVC video|"
    "36 LCEVC video|7F IPMP|81 AC-3 audio|87 E-AC-3 audio|";

// The tag of a descriptor defines the kind of private data and sections.
constexpr char kPrivateData[] =
    "|56 teletext|59 subtitles|6A AC-3 audio|6F AIT|7A E-AC-3 audio|7B DTS audio|7C AAC audio|";

constexpr char kDataComponents[] = "|07 BML|08 captions|0C BML|0D BML|12 captions|A0 Ginga|A3 AIT|";

constexpr char kAudioTypes[] = "|01 clean effects|02 hearing impaired|03 audio description|";

constexpr char kBrazilianGenres[] =
    "|00 news|01 sports|02 education|03 telenovela|04 miniseries|05 series|06 variety|"
    "07 reality show|08 information|09 comedy|0A children|0B erotic|0C film|0D draws and sales|"
    "0E debate|0F other|";

constexpr char kDvbGenres[] =
    "|01 film or drama|02 news|03 show|04 sports|05 children|06 music|07 arts|"
    "08 politics or economics|09 education|0A leisure|0B special|";

constexpr char kBrazilianAges[] =
    "|01 all ages|02 from 10|03 from 12|04 from 14|05 from 16|06 from 18|";

constexpr char kBrazilianContents[] = "|10 drugs|20 violence|40 sex|";

// The nations with ISDB-T, by the language of their events.
constexpr std::pair<const char *, const char *> kLanguages[] = {
    {"por", "BRA AGO"},
    {"spa", "ARG BOL CHL CRI ECU GTM HND NIC PER PRY SLV URY VEN"},
    {"jpn", "JPN"},
    {"fil", "PHL"},
};

// Returns the name of a code; empty if the table has none.
std::string Find(const std::string &table, unsigned code) {
    const std::string key = Format("|%02X ", code);
    const size_t found = table.find(key);
    const size_t name = found + key.size();
    return found == std::string::npos ? "" : table.substr(name, table.find('|', name) - name);
}

std::string OrNumber(const std::string &name, const char *kind, unsigned code) {
    return name.empty() ? Format("%s 0x%02X", kind, code) : name;
}

}  // namespace

std::string Format(const char *format, ...) {
    char text[160];
    va_list arguments;
    va_start(arguments, format);
    std::vsnprintf(text, sizeof text, format, arguments);
    va_end(arguments);
    return text;
}

std::string NameOfPid(uint16_t pid) {
    return Find(kPids, pid);
}

std::string NameOfTable(uint8_t table_id) {
    if (table_id >= kTableEitActualSchedule && table_id <= kTableEitLast) {
        return table_id < kTableEitOtherSchedule ? "EIT schedule" : "EIT schedule other";
    }
    const std::string name = Find(kTables, table_id);
    return name.empty() ? "private" : name;
}

std::string NameOfServiceType(uint8_t type) {
    return OrNumber(Find(kServiceTypes, type), "service type", type);
}

std::string RoleOfComponent(const Component &component) {
    const uint16_t id = component.data_component_id;
    if (component.descriptor == kDescriptorDataComponent &&
        (id == kDataCaptions || id == kDataCaptionsOneSeg)) {
        const uint8_t tag = component.tag.value_or(0);
        return (tag & 0xF8) == 0x38 || tag == 0x88 ? "superimposed text" : "captions";
    }
    return component.IsAit() ? "AIT" : Find(kAudioTypes, component.audio_type);
}

std::string NameOfComponent(const Component &component) {
    const uint8_t type = component.stream_type;
    const bool is_private = type == kStreamPrivateSections || type == kStreamPrivateData;
    std::string name = is_private ? Find(kPrivateData, component.descriptor) : "";
    name = OrNumber(name.empty() ? Find(kStreamTypes, type) : name, "stream type", type);
    if (component.descriptor == kDescriptorDataComponent) {
        const uint16_t id = component.data_component_id;
        std::string data = RoleOfComponent(component);
        if (data != "superimposed text") {
            data = OrNumber(Find(kDataComponents, id), "data component", id);
        }
        name = is_private ? data : name + " (" + data + ")";
    }
    for (const Code &language : component.languages) {
        name += language.IsEmpty() ? "" : " " + language.Text();
    }
    const std::string audio = Find(kAudioTypes, component.audio_type);
    return audio.empty() ? name : name + " (" + audio + ")";
}

std::string NameOfGuardInterval(uint8_t code) {
    return code < 4 ? "1/" + std::to_string(32 >> code) : "";
}

std::string NameOfGenre(uint8_t genre, const Code &nation) {
    const bool is_dvb = LanguageOf(nation).IsEmpty();
    const char *const table = nation == kBrazil ? kBrazilianGenres : is_dvb ? kDvbGenres : "";
    return OrNumber(Find(table, genre >> 4), "genre", genre);
}

std::string NameOfRating(const Rating &rating) {
    const uint8_t value = rating.value;
    if (!(rating.country == kBrazil)) {
        return OrNumber(value > 0 && value < 0x10 ? "from " + std::to_string(value + 3) : "",
                        "rating", value);
    }
    const std::string age = Find(kBrazilianAges, value & 0x0F);
    std::string name = OrNumber(age, "rating", value);
    for (const unsigned content : {0x10u, 0x20u, 0x40u}) {
        name +=
            age.empty() || (value & content) == 0 ? "" : ", " + Find(kBrazilianContents, content);
    }
    return name;
}

Code LanguageOf(const Code &nation) {
    for (const auto &[language, nations] : kLanguages) {
        if (!nation.IsEmpty() && std::string(nations).find(nation.Text()) != std::string::npos) {
            return Code::Of(language);
        }
    }
    return {};
}

}  // namespace receiver
