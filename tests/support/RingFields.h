// A ring's memory: how a test brings about what no operation does.
#ifndef VARNEK_TESTS_SUPPORT_RINGFIELDS_H
#define VARNEK_TESTS_SUPPORT_RINGFIELDS_H

#include <cstring>
#include <tuple>

#include "Varnek_CRingBuffer.h"

struct Fields {
    unsigned char *storage;
    int size, w, r, wl, rl;
    int32_t mutex;
    auto State() const { return std::tie(size, w, r, wl, rl); }
};

inline Fields FieldsOf(const VarnekCRingBuffer &ring) {
    Fields fields;
    static_assert(sizeof fields == sizeof ring);
    memcpy(&fields, static_cast<const void *>(&ring), sizeof fields);
    return fields;
}

#endif
