// receiver [OPTION...] FILE: shows the contents of a transport stream.
#include <fcntl.h>
#include <unistd.h>

#include <clocale>
#include <csignal>

#include "Receiver.h"

namespace {

std::atomic<bool> gStop{false};
static_assert(std::atomic<bool>::is_always_lock_free, "a signal handler sets it");

// The first Ctrl-C ends the reading and shows the result so far; the second ends the program.
void OnInterrupt(int /*signal*/) {
    gStop = true;
}

// Without SA_RESTART, so that the signal also ends a wait for the other end of a pipe.
void CatchInterrupt() {
    struct sigaction action = {};
    action.sa_handler = OnInterrupt;
    action.sa_flags = static_cast<int>(SA_RESETHAND);
    sigaction(SIGINT, &action, nullptr);
}

// Opens /dev/null in place of closed standard descriptors, because other files would get their
// numbers: stdin only for writing and the others only for reading, so that using them fails.
void TakeStandardDescriptors() {
    for (int descriptor = STDIN_FILENO; descriptor <= STDERR_FILENO; ++descriptor) {
        if (fcntl(descriptor, F_GETFD) < 0) {
            open("/dev/null", descriptor == STDIN_FILENO ? O_WRONLY : O_RDONLY);
        }
    }
}

// Duplicates stderr for the messages, because descriptor 2 is redirected for the log.
std::FILE *OpenMessages() {
    const int descriptor = fcntl(STDERR_FILENO, F_DUPFD_CLOEXEC, STDERR_FILENO + 1);
    std::FILE *messages = descriptor < 0 ? nullptr : fdopen(descriptor, "w");
    if (messages != nullptr) {
        std::setvbuf(messages, nullptr, _IONBF, 0);
    }
    return messages;
}

}  // namespace

int main(int argc, char **argv) {
    TakeStandardDescriptors();
    // NOLINTBEGIN(concurrency-mt-unsafe): there is no other thread yet
    if (std::setlocale(LC_CTYPE, "") == nullptr) {
        std::setlocale(LC_CTYPE, "C.UTF-8");  // the user's locale is not installed
    }
    // NOLINTEND(concurrency-mt-unsafe)
    CatchInterrupt();
    std::FILE *const messages = OpenMessages();
    return receiver::RunReceiver(std::vector<std::string>(argv + (argc > 0 ? 1 : 0), argv + argc),
                                 {stdout, messages != nullptr ? messages : stderr, &gStop,
                                  messages != nullptr ? RECEIVER_LOG : nullptr});
}
