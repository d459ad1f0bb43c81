// A shared library that keeps to itself what Varnek_Tasking.h shares within a library.
#include "Varnek_Tasking.h"

[[gnu::visibility("default")]] bool StartInOtherLibrary(varnek::Timer &timer, std::atomic<int> &called);

bool StartInOtherLibrary(varnek::Timer &timer, std::atomic<int> &called) {
    return timer.Start(std::chrono::milliseconds(1), [&called] { ++called; });
}
