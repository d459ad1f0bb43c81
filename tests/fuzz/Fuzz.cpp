#include "Fuzz.h"

#include <fcntl.h>
#include <unistd.h>

#include "Varnek_Debug.h"

extern "C" const char *__asan_default_options();

// A small quarantine for freed memory, because a large one, which is always cold, takes a third of a run.
const char *__asan_default_options() { return "quarantine_size_mb=1:malloc_context_size=8"; }

void WriteInPlace(const char *path, const std::string &content) {
    // Opened each time, since saving replaces the file.
    const int fd = open(path, O_WRONLY | O_CREAT | O_CLOEXEC, 0666);
    CHECK(fd >= 0);
    CHECK(write(fd, content.data(), content.size()) == static_cast<ssize_t>(content.size()));
    CHECK(ftruncate(fd, static_cast<off_t>(content.size())) == 0);
    close(fd);
}

int LLVMFuzzerInitialize(int *, char ***) {
    StartClean();
    VarnekPGL_CheckAndInitDebug();
    static int traces = 0;
    gOnLog = [](int, const char *, const char *) { ++traces; };
    VARNEK_TRACE(VARNEK_LEVEL_LOW | VARNEK_MODULE_COMMON, "on");
    CHECK(traces == 1);
    gOnLog = nullptr;
    return 0;
}
