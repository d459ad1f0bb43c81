// Calls of the C library that a test can make fail, in programs linked with --wrap for each of
// them.
#ifndef VARNEK_TESTS_SUPPORT_FAILINGCALLS_H
#define VARNEK_TESTS_SUPPORT_FAILINGCALLS_H

#include <vector>

// The names of all of them, that of operator new[] mangled.
std::vector<const char *> FailingCalls();

// Makes the n-th call from now (1 for the next) of this function fail with `error`; 0 for none. A
// pthread call returns the error, a stream's read or write 0, what returns a pointer null, the others -1, with errno
// set.
void FailCall(const char *function, int nth, int error);

// Whether the call that FailCall() asked for has not been made yet.
bool IsStillToFail(const char *function);

// Has the system drop its next delivery of a timer's expiry, and whether that has happened.
void DropDelivery();
bool IsDeliveryDropped();

#endif
