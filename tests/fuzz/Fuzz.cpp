#include "Fuzz.h"

#include <fcntl.h>
#include <unistd.h>

#include "Varnek_Debug.h"

extern "C" int LLVMFuzzerInitialize(int *argc, char ***argv);
extern "C" const char *__asan_default_options();

// Freed memory waits in a small quarantine: blocks here are small, and cold memory costs a run a third.
const char *__asan_default_options() { return "quarantine_size_mb=1:malloc_context_size=8"; }

namespace {

std::vector<std::string> gTraces;

}  // namespace

void CollectTraces() {
    gTraces.clear();
    gOnLog = [](int, const char *tag, const char *text) { gTraces.emplace_back(BodyOf(tag, text)); };
}

void DropTraces() { gTraces.clear(); }

void CheckTraces(const std::vector<std::string> &expected) {
    if (gTraces == expected) {
        DropTraces();
        return;
    }
    for (const std::string &line : gTraces) {
        fprintf(stderr, "traced:   %s", line.c_str());
    }
    for (const std::string &line : expected) {
        fprintf(stderr, "expected: %s", line.c_str());
    }
    CHECK(gTraces == expected);
}

void DataFile::Write(const std::string &content) const {
    // Opened each time: a save of the library's puts a new file in place.
    const int fd = open((VARNEK_DATA_DIR + name_).c_str(), O_WRONLY | O_CREAT | O_CLOEXEC, 0666);
    CHECK(fd >= 0);
    CHECK(write(fd, content.data(), content.size()) == static_cast<ssize_t>(content.size()));
    CHECK(ftruncate(fd, static_cast<off_t>(content.size())) == 0);
    close(fd);
}

int LLVMFuzzerInitialize(int *, char ***) {
    StartClean();
    VarnekPGL_CheckAndInitDebug();
    CollectTraces();
    VARNEK_TRACE(VARNEK_LEVEL_LOW | VARNEK_MODULE_COMMON, "on");
    CheckTraces({"on"});
    gOnLog = nullptr;
    return 0;
}
