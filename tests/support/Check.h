// What must hold at any moment. Its failure ends the process, where a debugger or a fuzzer sees it.
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
