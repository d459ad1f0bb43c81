// The families of objects that the library keeps in registries of limited size.
#ifndef VARNEK_TESTS_SUPPORT_FAMILIES_H
#define VARNEK_TESTS_SUPPORT_FAMILIES_H

#include <cstdint>
#include <string>
#include <vector>

#include "Varnek_Semaphore.h"
#include "Varnek_Thread.h"
#include "Varnek_Timer.h"

struct Family {
    const char *name;
    int32_t (*create)(const char *name);
    BOOL (*remove)(int32_t handle);

    // Creates objects until there is no room for another one.
    std::vector<int32_t> Fill() const {
        std::vector<int32_t> handles;
        static int number = 0;
        for (int32_t handle; (handle = create(std::to_string(number++).c_str())) != -1;) {
            handles.push_back(handle);
        }
        return handles;
    }
    // Counts how many objects there is room for.
    size_t Room() const {
        const std::vector<int32_t> handles = Fill();
        for (const int32_t handle : handles) {
            remove(handle);
        }
        return handles.size();
    }
};

inline void *Nothing(void *) { return nullptr; }

inline const Family kFamilies[] = {
    {"mutexes", VarnekPGL_CreateMutex, VarnekPGL_DeleteMutex},
    {"semaphores", [](const char *name) { return VarnekPGL_CreateSemaphore(name, 0); }, VarnekPGL_DeleteSemaphore},
    {"timers", VarnekPGL_CreateTimer, [](int32_t handle) { return VarnekPGL_DeleteTimer(uint32_t(handle)); }},
    {"threads", [](const char *name) { return VarnekPGL_CreateThread(name, 1, 0, Nothing, nullptr); },
     VarnekPGL_DeleteThread},
};

#endif
