// Calls of the C library that a test can make fail. The program is linked with --wrap for each of them.
#ifndef VARNEK_TESTS_SUPPORT_FAILINGCALLS_H
#define VARNEK_TESTS_SUPPORT_FAILINGCALLS_H

#include <vector>

// Returns the names of all of them. That of operator new[] is mangled.
std::vector<const char *> FailingCalls();

// Makes the n-th call of this function from now on fail with `error`: 1 is the next, 0 is none. A pthread function
// returns the error. The others set errno and return null, 0 (fread, fwrite) or -1. The function "delivery" is the
// system's delivery of a timer's expiry, which is dropped.
void FailCall(const char *function, int nth, int error);

// Returns whether the call that is to fail is still to come.
bool IsStillToFail(const char *function);

#endif
