// The table of the named mutexes. Varnek_Semaphore.cpp changes it; HoldMutex only looks mutexes up.
// Private.
#ifndef VARNEK_SOURCE_MUTEXTABLE_H
#define VARNEK_SOURCE_MUTEXTABLE_H

#include <pthread.h>

#include "Varnek_SlotTable.h"

constexpr int MAX_MUTEX_MGR_INFO_ARR_SIZE = 40;
struct MUTEX_MGR_INFO {
    pthread_mutex_t linuxMutex;
};
inline SlotTable<MUTEX_MGR_INFO, MAX_MUTEX_MGR_INFO_ARR_SIZE> gMutexArr;

#endif
