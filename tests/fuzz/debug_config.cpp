// The debug configuration: any text turns on some levels and some modules, as many as the report of loading it shows,
// and a comment at its end changes nothing.
#include <cstring>
#include <map>

#include "Fuzz.h"
#include "Varnek_Debug.h"

namespace {

using Masks = std::map<uint32_t, int>;

int gTraces;
size_t gShown;

void OnLog(int, const char *tag, const char *text) {
    gTraces += strcmp(tag, "SBTVD") != 0 ? 1 : 0;
    for (const char *on = text; strcmp(tag, "SBTVD") == 0 && (on = strstr(on, "[1]")) != nullptr; ++on) {
        ++gShown;
    }
}

// Loads a text, tries every trace, and counts for each level and each module how many reach the log.
Masks Load(const std::string &text) {
    WriteInPlace(kDebugFile, text);
    gShown = 0;
    VarnekPGL_InitializeDebug();
    Masks passing;
    for (uint32_t level = VARNEK_LEVEL_LOW; level != 0; level <<= 1) {
        for (uint32_t module = 1; module <= VARNEK_MODULE_SM_PLAYER; module <<= 1) {
            gTraces = 0;
            VARNEK_TRACE(level | module, "%s", "text");
            if (gTraces != 0) {
                ++passing[level];
                ++passing[module];
            }
        }
    }
    return passing;
}

}  // namespace

int LLVMFuzzerTestOneInput(const uint8_t *data, size_t size) {
    const std::string text(reinterpret_cast<const char *>(data), size);
    gOnLog = OnLog;
    const Masks passing = Load(text);
    const int modules = passing.empty() ? 0 : passing.rbegin()->second;
    const int levels = passing.empty() ? 0 : passing.begin()->second;
    CHECK(passing.empty() || gShown == static_cast<size_t>(levels + modules));
    for (const auto &[mask, count] : passing) {
        CHECK(count == (mask < VARNEK_LEVEL_LOW ? levels : modules));
    }
    CHECK(passing.size() == static_cast<size_t>(levels + modules));
    CHECK(Load(text + "\n#LogToUSB=1 Error=1") == passing);
    return 0;
}
