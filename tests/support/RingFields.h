// A ring's fields, so that a test can make a state that no operation leaves behind.
#ifndef VARNEK_TESTS_SUPPORT_RINGFIELDS_H
#define VARNEK_TESTS_SUPPORT_RINGFIELDS_H

#include <cstring>

#include "Varnek_CRingBuffer.h"

struct Fields {
    unsigned char *storage;
    int size, w, r, wl, rl;
    int32_t mutex;
};

inline Fields FieldsOf(const VarnekCRingBuffer &ring) {
    Fields fields;
    static_assert(sizeof fields == sizeof ring);
    memcpy(&fields, static_cast<const void *>(&ring), sizeof fields);
    return fields;
}

inline void SetFields(VarnekCRingBuffer &ring, const Fields &fields) {
    memcpy(static_cast<void *>(&ring), &fields, sizeof fields);
}

#endif
