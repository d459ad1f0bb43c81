// receiver [OPTION...] FILE: shows what a transport stream carries.
#include <csignal>

#include "Receiver.h"

namespace {

std::atomic<bool> gStop{false};
static_assert(std::atomic<bool>::is_always_lock_free, "a signal handler sets it");

// The first Ctrl-C ends the reading; what was read so far is shown. The second one ends the
// program.
void OnInterrupt(int /*signal*/) {
    gStop = true;
}

}  // namespace

int main(int argc, char **argv) {
    struct sigaction action = {};
    action.sa_handler = OnInterrupt;
    action.sa_flags = static_cast<int>(SA_RESTART | SA_RESETHAND);
    sigaction(SIGINT, &action, nullptr);
    return receiver::RunReceiver(std::vector<std::string>(argv + (argc > 0 ? 1 : 0), argv + argc),
                                 stdout, stderr, &gStop);
}
