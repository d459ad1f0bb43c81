// Checks a condition that must always hold. A failure aborts the process, so that a debugger or a fuzzer sees it.
#ifndef VARNEK_TESTS_SUPPORT_CHECK_H
#define VARNEK_TESTS_SUPPORT_CHECK_H

#include <cstdio>
#include <cstdlib>

#define CHECK(condition)                                                           \
    do {                                                                           \
        const bool holds = (condition);                                            \
        if (!holds) {                                                              \
            fprintf(stderr, "%s:%d: CHECK(%s)\n", __FILE__, __LINE__, #condition); \
            abort();                                                               \
        }                                                                          \
    } while (false)

#endif
