// The debug configuration: any text turns on some levels and some modules, as many as the report of loading it shows,
// and a comment at its end changes nothing.
#include <cstring>
#include <set>

#include "Fuzz.h"
#include "Varnek_Debug.h"

namespace {

size_t gTraces, gShown;

void OnLog(int, const char *tag, const char *text) {
    if (strcmp(tag, "SBTVD") != 0) {
        ++gTraces;
        return;
    }
    for (; (text = strstr(text, "[1]")) != nullptr; ++text) {
        ++gShown;
    }
}

// Loads a text, tries every trace, and returns the level and the module of each that reaches the log.
std::set<std::pair<uint32_t, uint32_t>> Load(const std::string &text) {
    WriteInPlace(kDebugFile, text);
    gShown = 0;
    VarnekPGL_InitializeDebug();
    std::set<std::pair<uint32_t, uint32_t>> passing;
    for (uint32_t level = VARNEK_LEVEL_LOW; level != 0; level <<= 1) {
        for (uint32_t module = 1; module <= VARNEK_MODULE_SM_PLAYER; module <<= 1) {
            gTraces = 0;
            VARNEK_TRACE(level | module, "%s", "text");
            if (gTraces != 0) {
                passing.emplace(level, module);
            }
        }
    }
    return passing;
}

}  // namespace

int LLVMFuzzerTestOneInput(const uint8_t *data, size_t size) {
    const std::string text(reinterpret_cast<const char *>(data), size);
    gOnLog = OnLog;
    const auto passing = Load(text);
    std::set<uint32_t> levels, modules;
    for (const auto &[level, module] : passing) {
        levels.insert(level);
        modules.insert(module);
    }
    CHECK(passing.size() == levels.size() * modules.size());
    CHECK(passing.empty() || gShown == levels.size() + modules.size());
    CHECK(Load(text + "\n#LogToUSB=1 Error=1") == passing);
    return 0;
}
