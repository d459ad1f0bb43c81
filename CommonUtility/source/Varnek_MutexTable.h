// The table of the named mutexes, which only Varnek_Semaphore.cpp changes. Private.
#ifndef VARNEK_SOURCE_MUTEXTABLE_H
#define VARNEK_SOURCE_MUTEXTABLE_H

#include <pthread.h>

#include "Varnek_SlotTable.h"

constexpr int MAX_MUTEX_MGR_INFO_ARR_SIZE = 40;
struct MUTEX_MGR_INFO {
    pthread_mutex_t linuxMutex;
};
using Mutexes = SlotTable<MUTEX_MGR_INFO, MAX_MUTEX_MGR_INFO_ARR_SIZE>;
// Hidden and not inline: otherwise the table's address would have to be loaded first.
extern __attribute__((visibility("hidden"))) Mutexes gMutexArr;

#endif
