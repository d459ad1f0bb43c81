#include "Fuzz.h"

#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

#include <cstring>

#include "Varnek_Debug.h"
#include "varnek_platform.h"

extern "C" int LLVMFuzzerInitialize(int *argc, char ***argv);
extern "C" const char *__asan_default_options();

// Freed memory waits in a small quarantine: blocks here are small, and cold memory costs a run a third.
const char *__asan_default_options() { return "quarantine_size_mb=1:malloc_context_size=8"; }

void (*gOnLog)(const char *tag, const char *text) = nullptr;
std::string gFeature;

namespace {

std::vector<std::string> gTraces;
std::vector<std::string> gDataFiles;

}  // namespace

void CollectTraces() {
    gTraces.clear();
    gOnLog = [](const char *, const char *text) {
        const char *body = strstr(text, "][");
        body = body != nullptr ? strstr(body, "] ") : nullptr;
        gTraces.emplace_back(body != nullptr ? body + 2 : text);
    };
}

void DropTraces() { gTraces.clear(); }

void CheckTraces(const std::vector<std::string> &expected) {
    if (gTraces == expected) {
        return DropTraces();
    }
    for (const std::string &line : gTraces) {
        fprintf(stderr, "traced:   %s", line.c_str());
    }
    for (const std::string &line : expected) {
        fprintf(stderr, "expected: %s", line.c_str());
    }
    CHECK(gTraces == expected);
}

DataFile::DataFile(const char *name) : fd_(-1) {
    gDataFiles.push_back(VARNEK_DATA_DIR + std::string(name));
    fd_ = open(gDataFiles.back().c_str(), O_WRONLY | O_CREAT | O_CLOEXEC, 0666);
    CHECK(fd_ >= 0);
}

void DataFile::Write(const std::string &content) const {
    CHECK(pwrite(fd_, content.data(), content.size(), 0) == static_cast<ssize_t>(content.size()));
    CHECK(ftruncate(fd_, static_cast<off_t>(content.size())) == 0);
}

void RemoveDataFiles() {
    for (const std::string &path : gDataFiles) {
        unlink(path.c_str());
    }
}

// Takes the place of the platform's log function. 2047 characters are what a line may have.
extern "C" __attribute__((visibility("default"))) int __android_log_write(int priority, const char *tag,
                                                                          const char *text) {
    CHECK(priority >= 2 && priority <= 7);
    CHECK(strnlen(tag, 32) < 32 && strnlen(text, 2048) < 2048);
    if (gOnLog != nullptr) {
        gOnLog(tag, text);
    }
    return 1;
}

extern "C" __attribute__((visibility("default"))) const char *VellNativeFeature_getStringWithDefault(
    const char *key, const char *defaultValue) {
    CHECK(*key != '\0' && *defaultValue == '\0');
    return gFeature.c_str();
}

int LLVMFuzzerInitialize(int *, char ***) {
    mkdir(VARNEK_DATA_DIR, 0777);
    DataFile("debug_ltn.ini")
        .Write(
            "LogToUSB=1\nError=1\nHigh=1\nMid=1\nLow=1\nCommon=1\nJNI=1\nMainControl=1\nESG=1\n"
            "SessionManager=1\nSectionParser=1\nDsmccDC=1\nDsmccOC=1\nTsDemux=1\nCPRM=1\nSMPlayer=1\nGingaAppMgr=1\n");
    VarnekPGL_CheckAndInitDebug();
    CollectTraces();
    VARNEK_TRACE(VARNEK_LEVEL_LOW | VARNEK_MODULE_COMMON, "on");
    CheckTraces({"on"});
    gOnLog = nullptr;
    return 0;
}
