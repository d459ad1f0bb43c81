// The debug configuration: what a text enables, against a reading of it by other means, as the
// traces of every level and module and as the load's own report show it.
#include <cstring>
#include <string_view>

#include "Fuzz.h"
#include "Varnek_Debug.h"

namespace {

// In the order in which the keys are tried, with the bit that each stands for.
constexpr struct {
    const char *text;
    uint32_t bit;
} kKeys[] = {
    {"LogToUSB", 1u << 24},
    {"Error", VARNEK_LEVEL_ERROR},
    {"High", VARNEK_LEVEL_HIGH},
    {"Mid", VARNEK_LEVEL_MID},
    {"Low", VARNEK_LEVEL_LOW},
    {"Common", VARNEK_MODULE_COMMON},
    {"JNI", VARNEK_MODULE_JNI},
    {"MainControl", VARNEK_MODULE_MAIN_CONTROL},
    {"ESG", VARNEK_MODULE_ESG},
    {"SessionManager", VARNEK_MODULE_SESSION_MANAGER},
    {"SectionParser", VARNEK_MODULE_SECTION_PARSER},
    {"DsmccDC", VARNEK_MODULE_DSMCC_DC},
    {"DsmccOC", VARNEK_MODULE_DSMCC_OC},
    {"TsDemux", VARNEK_MODULE_TS_DEMUX},
    {"CPRM", VARNEK_MODULE_CPRM},
    {"SMPlayer", VARNEK_MODULE_SM_PLAYER},
    {"GingaAppMgr", VARNEK_MODULE_GINGA},
};

uint32_t Expected(std::string_view text) {
    constexpr char kEnds[] = "\r\n";
    uint32_t enabled = 0;
    if (text.find_first_of(kEnds) == 0) {
        return 0;
    }
    while (!text.empty()) {
        const size_t end = text.find_first_of(kEnds);
        std::string_view line = text.substr(0, end).substr(0, 51);
        line = line.substr(0, line.find('\0'));
        for (const auto &key : kKeys) {
            if (line.find(key.text) != std::string_view::npos) {
                const bool on = line[0] != '#' && line.find('1') != std::string_view::npos;
                enabled |= on ? key.bit : 0;
                break;
            }
        }
        const size_t next = text.find_first_not_of(kEnds, end);
        text.remove_prefix(next == std::string_view::npos ? text.size() : next);
    }
    return enabled;
}

int gTraces;
std::string gReport;

void OnLog(int, const char *tag, const char *text) {
    if (strcmp(tag, "SBTVD") == 0) {
        gReport += text;
    } else {
        ++gTraces;
    }
}

}  // namespace

int LLVMFuzzerTestOneInput(const uint8_t *data, size_t size) {
    static const DataFile file("debug_ltn.ini");
    const std::string text(reinterpret_cast<const char *>(data), size);
    const uint32_t expected = Expected(text);
    file.Write(text);
    gOnLog = OnLog;
    gReport.clear();
    VarnekPGL_InitializeDebug();
    int levels = 0;
    for (uint32_t level = VARNEK_LEVEL_LOW; level != 0; level <<= 1) {
        levels += (expected & level) != 0 ? 1 : 0;
    }
    for (uint32_t module = 1; module <= VARNEK_MODULE_SM_PLAYER; module <<= 1) {
        gTraces = 0;
        for (uint32_t level = VARNEK_LEVEL_LOW; level != 0; level <<= 1) {
            VARNEK_TRACE(level | module, "%s", "text");
        }
        CHECK(gTraces == ((expected & 1u << 24) != 0 && (expected & module) != 0 ? levels : 0));
    }
    // The report has one "[1]" for each level and module.
    size_t shown = 0;
    for (size_t at = 0; (at = gReport.find("[1]", at)) != std::string::npos; ++at) {
        ++shown;
    }
    CHECK(shown == static_cast<size_t>(__builtin_popcount(expected & ~(1u << 24))));
    return 0;
}
