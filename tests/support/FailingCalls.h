// Calls of the C library that a test can make fail, in programs linked with --wrap for each of
// them.
#ifndef VARNEK_TESTS_SUPPORT_FAILINGCALLS_H
#define VARNEK_TESTS_SUPPORT_FAILINGCALLS_H

// Makes the n-th call from now (1 for the next) of this function fail with `error`; 0 for none. A
// pthread call returns the error, malloc null, the others -1, with errno set.
void FailCall(const char *function, int nth, int error);

#endif
