#include "support/Platform.h"

#include <unistd.h>

#include <cstring>
#include <filesystem>
#include <fstream>
#include <iterator>
#include <string>

#include "support/Check.h"
#include "varnek_platform.h"

void (*gOnLog)(int priority, const char *tag, const char *text) = nullptr;
const char *gFeature = "";

namespace {

constexpr char kEverythingOn[] =
    "LogToUSB=1\nError=1\nHigh=1\nMid=1\nLow=1\n"
    "Common=1\nJNI=1\nMainControl=1\nESG=1\nSessionManager=1\nSectionParser=1\nDsmccDC=1\n"
    "DsmccOC=1\nTsDemux=1\nCPRM=1\nSMPlayer=1\nGingaAppMgr=1\n";

// Other processes may remove the same entries, or may be about to rename their draft of the configuration.
void EmptyDataDirectory(bool keepConfig) {
    std::error_code ignored;
    std::filesystem::create_directories(VARNEK_DATA_DIR, ignored);
    for (const auto &entry : std::filesystem::directory_iterator(VARNEK_DATA_DIR, ignored)) {
        const bool isConfig = entry.path().string().rfind(kDebugFile, 0) == 0;
        if (!keepConfig || !isConfig || entry.is_directory(ignored)) {
            std::filesystem::remove_all(entry.path(), ignored);
        }
    }
}

}  // namespace

const char *BodyOf(const char *tag, const char *text) {
    if (strncmp(tag, "SBTVD_", 6) != 0 || strcmp(tag, "SBTVD_File") == 0) {
        return text;
    }
    const char *place = strstr(text, "][");
    const char *end = place != nullptr ? strstr(place, "] ") : nullptr;
    return end != nullptr ? end + 2 : text;
}

void StartClean() {
    EmptyDataDirectory(true);
    std::ifstream file(kDebugFile, std::ios::binary);
    if (std::string(std::istreambuf_iterator<char>(file), {}) == kEverythingOn) {
        return;
    }
    // Other processes may be reading the file, so a rename replaces it as a whole.
    const std::string draft = kDebugFile + std::to_string(getpid());
    std::ofstream(draft, std::ios::binary) << kEverythingOn;
    std::filesystem::rename(draft, kDebugFile);
}

void LeaveClean() { EmptyDataDirectory(false); }

__attribute__((visibility("default"))) int __android_log_write(int priority, const char *tag, const char *text) {
    CHECK(priority >= VARNEK_LOG_VERBOSE && priority <= VARNEK_LOG_FATAL && strnlen(tag, 32) < 32 &&
          strnlen(text, 2048) < 2048);
    if (gOnLog != nullptr) {
        gOnLog(priority, tag, text);
    }
    return 1;
}

__attribute__((visibility("default"))) const char *VellNativeFeature_getStringWithDefault(const char *key,
                                                                                          const char *defaultValue) {
    CHECK(strcmp(key, "TarnFeature_MobileTV_EnableServiceAs") == 0 && *defaultValue == '\0');
    return gFeature;
}
