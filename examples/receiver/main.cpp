// receiver [OPTION...] FILE: shows what a transport stream carries.
#include <fcntl.h>
#include <unistd.h>

#include <csignal>

#include "Receiver.h"

namespace {

std::atomic<bool> gStop{false};
static_assert(std::atomic<bool>::is_always_lock_free, "a signal handler sets it");

// The first Ctrl-C ends the reading, and the result so far is shown. The second one ends the
// program.
void OnInterrupt(int /*signal*/) {
    gStop = true;
}

// Leaves SA_RESTART out, so that a wait for the other end of a pipe ends too.
void CatchInterrupt() {
    struct sigaction action = {};
    action.sa_handler = OnInterrupt;
    action.sa_flags = static_cast<int>(SA_RESETHAND);
    sigaction(SIGINT, &action, nullptr);
}

// The system would give the number of a closed standard descriptor to the next file that is opened.
// A descriptor that can only do the opposite takes it instead, so that reads and writes fail.
void TakeStandardDescriptors() {
    for (int descriptor = STDIN_FILENO; descriptor <= STDERR_FILENO; ++descriptor) {
        if (fcntl(descriptor, F_GETFD) < 0) {
            open("/dev/null", descriptor == STDIN_FILENO ? O_WRONLY : O_RDONLY);
        }
    }
}

// Messages go where stderr goes, by a descriptor of their own: the log is led away from that one.
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
    CatchInterrupt();
    std::FILE *const messages = OpenMessages();
    return receiver::RunReceiver(std::vector<std::string>(argv + (argc > 0 ? 1 : 0), argv + argc),
                                 {stdout, messages != nullptr ? messages : stderr, &gStop,
                                  messages != nullptr ? RECEIVER_LOG : nullptr});
}
