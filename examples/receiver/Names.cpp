// The tables of codes and words come first, followed by the functions that search them. Codes
// without a word are shown as numbers.
#include "Names.h"

#include <algorithm>
#include <cstdarg>
#include <cstdio>
#include <iterator>

#include "TransportStream.h"

namespace receiver {
namespace {

struct Word {
    uint16_t value;
    const char *text;
};

constexpr Word kPids[] = {
    {kPidPat, "PAT"},
    {kPidCat, "CAT"},
    {kPidNit, "NIT"},
    {kPidSdt, "SDT"},
    {kPidEit, "EIT"},
    {kPidTime, "TDT and TOT"},
    {kPidSdtt, "SDTT"},
    {kPidBit, "BIT"},
    {kPidNbit, "NBIT"},
    {kPidEitMobile, "EIT, portable"},
    {kPidEitOneSeg, "EIT, one-seg"},
    {kPidSdttOneSeg, "SDTT, one-seg"},
    {kPidCdt, "CDT"},
    {kPidNull, "null packets"},
};

constexpr Word kTables[] = {
    {0x00, "PAT"},
    {0x01, "CAT"},
    {0x02, "PMT"},
    {0x03, "TSDT"},
    {0x3C, "DSM-CC"},
    {0x3B, "DSM-CC"},
    {0x3D, "DSM-CC"},
    {0x40, "NIT"},
    {0x41, "NIT other"},
    {0x42, "SDT"},
    {0x46, "SDT other"},
    {0x4A, "BAT"},
    {0x4E, "EIT p/f"},
    {0x4F, "EIT p/f other"},
    {0x70, "TDT"},
    {0x71, "RST"},
    {0x72, "ST"},
    {0x73, "TOT"},
    {0x74, "AIT"},
    {0xC3, "SDTT"},
    {0xC4, "BIT"},
    {0xC5, "NBIT"},
    {0xC6, "NBIT reference"},
    {0xC7, "LDT"},
    {0xC8, "CDT"},
};

constexpr Word kServiceTypes[] = {
    {0x01, "television"},
    {0x02, "radio"},
    {0x03, "teletext"},
    {0x04, "near-video-on-demand reference"},
    {0x05, "near-video-on-demand"},
    {0x06, "mosaic"},
    {0x07, "FM radio"},
    {0x08, "system renewability"},
    {0x0A, "radio"},
    {0x0B, "mosaic"},
    {0x0C, "data"},
    {0x0E, "RCS map"},
    {0x0F, "RCS forward link"},
    {0x10, "DVB MHP"},
    {0x11, "HD television"},
    {0x16, "television"},
    {0x17, "near-video-on-demand"},
    {0x18, "near-video-on-demand reference"},
    {0x19, "HD television"},
    {0x1A, "HD near-video-on-demand"},
    {0x1B, "HD near-video-on-demand reference"},
    {0x1C, "3D HD television"},
    {0x1D, "3D HD near-video-on-demand"},
    {0x1E, "3D HD near-video-on-demand reference"},
    {0x1F, "HEVC television"},
    {0x20, "HEVC UHD television"},
    {0xA1, "special video"},
    {0xA2, "special audio"},
    {0xA3, "special data"},
    {0xA4, "engineering"},
    {0xA5, "promotion video"},
    {0xA6, "promotion audio"},
    {0xA7, "promotion data"},
    {0xA8, "data for storage beforehand"},
    {0xA9, "data for storage only"},
    {0xAA, "bookmark list"},
    {0xAB, "server-type simultaneous"},
    {0xAC, "independent file"},
    {0xC0, "data"},
};

constexpr Word kStreamTypes[] = {
    {0x01, "MPEG-1 video"},
    {0x02, "MPEG-2 video"},
    {0x03, "MPEG-1 audio"},
    {0x04, "MPEG-2 audio"},
    {0x05, "private sections"},
    {0x06, "private data"},
    {0x07, "MHEG"},
    {0x08, "DSM-CC"},
    {0x09, "H.222.1"},
    {0x0A, "DSM-CC type A"},
    {0x0B, "DSM-CC type B"},
    {0x0C, "DSM-CC type C"},
    {0x0D, "DSM-CC type D"},
    {0x0E, "auxiliary data"},
    {0x0F, "AAC audio (ADTS)"},
    {0x10, "MPEG-4 video"},
    {0x11, "AAC audio (LATM)"},
    {0x12, "MPEG-4 systems"},
    {0x13, "MPEG-4 systems sections"},
    {0x14, "synchronised download"},
    {0x15, "metadata"},
    {0x16, "metadata sections"},
    {0x17, "metadata in a data carousel"},
    {0x18, "metadata in an object carousel"},
    {0x19, "metadata in a synchronised download"},
    {0x1A, "IPMP"},
    {0x1B, "H.264 video"},
    {0x1C, "MPEG-4 raw audio"},
    {0x1D, "MPEG-4 text"},
    {0x1E, "auxiliary video"},
    {0x1F, "SVC video"},
    {0x20, "MVC video"},
    {0x21, "JPEG 2000 video"},
    {0x22, "MPEG-2 video, second view"},
    {0x23, "H.264 video, second view"},
    {0x24, "HEVC video"},
    {0x25, "HEVC video, temporal layer"},
    {0x26, "MVC depth video"},
    {0x27, "timeline and external media"},
    {0x28, "HEVC video, enhancement"},
    {0x29, "HEVC video, temporal enhancement"},
    {0x2A, "HEVC video, enhancement"},
    {0x2B, "HEVC video, temporal enhancement"},
    {0x2C, "green access units"},
    {0x2D, "MPEG-H audio"},
    {0x2E, "MPEG-H audio, auxiliary"},
    {0x2F, "quality access units"},
    {0x30, "media orchestration"},
    {0x31, "HEVC video, tiles"},
    {0x32, "JPEG XS video"},
    {0x33, "VVC video"},
    {0x34, "VVC video, temporal layer"},
    {0x35, "EVC video"},
    {0x36, "LCEVC video"},
    {0x7F, "IPMP"},
    {0x81, "AC-3 audio"},
    {0x87, "E-AC-3 audio"},
};

// The tag of a descriptor defines the kind of private data and sections.
constexpr Word kPrivateData[] = {
    {0x56, "teletext"},     {0x59, "subtitles"}, {0x6A, "AC-3 audio"}, {0x6F, "AIT"},
    {0x7A, "E-AC-3 audio"}, {0x7B, "DTS audio"}, {0x7C, "AAC audio"},
};

constexpr Word kDataComponents[] = {
    {0x0007, "BML"},   {kDataCaptions, "captions"},       {0x000C, "BML"},
    {0x000D, "BML"},   {kDataCaptionsOneSeg, "captions"}, {0x00A0, "Ginga"},
    {kDataAit, "AIT"},
};

constexpr Word kAudioTypes[] = {
    {1, "clean effects"},
    {2, "hearing impaired"},
    {3, "audio description"},
};

constexpr Word kBrazilianGenres[] = {
    {0x0, "news"},        {0x1, "sports"},          {0x2, "education"}, {0x3, "telenovela"},
    {0x4, "miniseries"},  {0x5, "series"},          {0x6, "variety"},   {0x7, "reality show"},
    {0x8, "information"}, {0x9, "comedy"},          {0xA, "children"},  {0xB, "erotic"},
    {0xC, "film"},        {0xD, "draws and sales"}, {0xE, "debate"},    {0xF, "other"},
};

constexpr Word kDvbGenres[] = {
    {0x1, "film or drama"}, {0x2, "news"},    {0x3, "show"},    {0x4, "sports"},
    {0x5, "children"},      {0x6, "music"},   {0x7, "arts"},    {0x8, "politics or economics"},
    {0x9, "education"},     {0xA, "leisure"}, {0xB, "special"},
};

constexpr Word kBrazilianAges[] = {
    {1, "all ages"}, {2, "from 10"}, {3, "from 12"}, {4, "from 14"}, {5, "from 16"}, {6, "from 18"},
};

constexpr Word kBrazilianContents[] = {{0x10, "drugs"}, {0x20, "violence"}, {0x40, "sex"}};

// The nations with ISDB-T.
constexpr struct {
    const char *language;
    const char *nations;
} kLanguages[] = {
    {"por", "BRA AGO"},
    {"spa", "ARG BOL CHL CRI ECU GTM HND NIC PER PRY SLV URY VEN"},
    {"jpn", "JPN"},
    {"fil", "PHL"},
};

template <size_t Count>
const char *Find(const Word (&words)[Count], uint16_t value) {
    const auto found = std::find_if(std::begin(words), std::end(words),
                                    [value](const Word &word) { return word.value == value; });
    return found == std::end(words) ? nullptr : found->text;
}

std::string OrNumber(const char *word, const char *format, unsigned value) {
    char number[40];
    std::snprintf(number, sizeof number, "%s 0x%02X", format, value);
    return word != nullptr ? word : number;
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
    const char *name = Find(kPids, pid);
    return name != nullptr ? name : "";
}

std::string NameOfTable(uint8_t table_id) {
    if (table_id >= 0x50 && table_id <= 0x6F) {
        return table_id < 0x60 ? "EIT schedule" : "EIT schedule other";
    }
    const char *name = Find(kTables, table_id);
    return name != nullptr ? name : "private";
}

std::string NameOfServiceType(uint8_t type) {
    return OrNumber(Find(kServiceTypes, type), "service type", type);
}

std::string RoleOfComponent(const Component &component) {
    const bool data = component.descriptor == kDescriptorDataComponent;
    const uint16_t id = component.data_component_id;
    if (data && (id == kDataCaptions || id == kDataCaptionsOneSeg)) {
        const uint8_t tag = component.tag.value_or(0);
        return (tag & 0xF8) == 0x38 || tag == 0x88 ? "superimposed text" : "captions";
    }
    const char *audio = Find(kAudioTypes, component.audio_type);
    return component.IsAit() ? "AIT" : audio != nullptr ? audio : "";
}

std::string NameOfComponent(const Component &component) {
    const bool is_private = component.stream_type == 0x05 || component.stream_type == 0x06;
    const char *by_descriptor = is_private ? Find(kPrivateData, component.descriptor) : nullptr;
    std::string name = OrNumber(
        by_descriptor != nullptr ? by_descriptor : Find(kStreamTypes, component.stream_type),
        "stream type", component.stream_type);
    if (component.descriptor == kDescriptorDataComponent) {
        const uint16_t id = component.data_component_id;
        const std::string role = RoleOfComponent(component);
        const std::string data = role == "superimposed text"
                                     ? role
                                     : OrNumber(Find(kDataComponents, id), "data component", id);
        name = is_private ? data : name + " (" + data + ")";
    }
    for (const Code &language : component.languages) {
        name += language.IsEmpty() ? "" : " " + language.Text();
    }
    const char *audio = Find(kAudioTypes, component.audio_type);
    name += audio != nullptr ? std::string(" (") + audio + ")" : "";
    return name;
}

std::string NameOfGuardInterval(uint8_t code) {
    return code < 4 ? "1/" + std::to_string(32 >> code) : "";
}

std::string NameOfGenre(uint8_t genre, const Code &nation) {
    const uint16_t first = genre >> 4;
    const char *name = nullptr;
    if (nation == kBrazil) {
        name = Find(kBrazilianGenres, first);
    } else if (LanguageOf(nation).IsEmpty()) {
        name = Find(kDvbGenres, first);
    }
    return OrNumber(name, "genre", genre);
}

std::string NameOfRating(const Rating &rating) {
    if (rating.country == kBrazil) {
        const char *age = Find(kBrazilianAges, rating.value & 0x0F);
        std::string name = OrNumber(age, "rating", rating.value);
        for (const Word &content : kBrazilianContents) {
            name += (age != nullptr && (rating.value & content.value) != 0)
                        ? std::string(", ") + content.text
                        : "";
        }
        return name;
    }
    const bool is_age = rating.value > 0 && rating.value < 0x10;
    return is_age ? "from " + std::to_string(rating.value + 3)
                  : OrNumber(nullptr, "rating", rating.value);
}

Code LanguageOf(const Code &nation) {
    for (const auto &entry : kLanguages) {
        if (!nation.IsEmpty() &&
            std::string(entry.nations).find(nation.Text()) != std::string::npos) {
            return Code::Of(entry.language);
        }
    }
    return {};
}

}  // namespace receiver
