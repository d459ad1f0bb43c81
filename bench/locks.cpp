// Uses mutexes and semaphores of a full table by handle, in one thread, and in two threads at the
// same time with unrelated objects.
#include <pthread.h>
#include <semaphore.h>

#include <memory>

#include "Bench.h"
#include "Varnek_Semaphore.h"

namespace {

constexpr int kSlots = 39;  // the thread registry uses one of the 40 mutexes

// Has `count` objects of a family, in the slots from 0 on.
class Table {
  public:
    Table(bool semaphores, int count) : semaphores_(semaphores) {
        for (int i = 0; i < count; i++) {
            const std::string name = "bench" + std::to_string(i);
            handles_.push_back(semaphores ? VarnekPGL_CreateSemaphore(name.c_str(), 1)
                                          : VarnekPGL_CreateMutex(name.c_str()));
        }
    }
    ~Table() {
        for (const int32_t handle : handles_) {
            if (semaphores_) {
                VarnekPGL_DeleteSemaphore(handle);
            } else {
                VarnekPGL_DeleteMutex(handle);
            }
        }
    }
    Table(const Table &) = delete;
    Table &operator=(const Table &) = delete;

    int32_t operator[](int slot) const { return handles_[static_cast<size_t>(slot)]; }

  private:
    const bool semaphores_;
    std::vector<int32_t> handles_;
};

void AcquireRelease(benchmark::State &state, int32_t handle) {
    for (auto _ : state) {
        if (VarnekPGL_AcquireMutex(handle) == FALSE || VarnekPGL_ReleaseMutex(handle) == FALSE) {
            state.SkipWithError("the mutex is refused");
            break;
        }
    }
}

void SignalWait(benchmark::State &state, int32_t handle) {
    for (auto _ : state) {
        if (VarnekPGL_SignalSemaphore(handle) == FALSE ||
            VarnekPGL_WaitSemaphore(handle, WAIT_FOREVER) == FALSE) {
            state.SkipWithError("the semaphore is refused");
            break;
        }
    }
}

// One slot of a table with `fill` objects.
void RegisterSlot(const std::string &name, bool semaphores, int fill, int slot) {
    bench::Add(name, [semaphores, fill, slot](benchmark::State &state) {
        const Table table(semaphores, fill);
        (semaphores ? SignalWait : AcquireRelease)(state, table[slot]);
    });
}

// Two threads, each with its own core and mutex.
void RegisterTwo(const std::string &name, int slotA, int slotB) {
    static std::unique_ptr<Table> table;
    bench::Add(name,
               [slotA, slotB](benchmark::State &state) {
                   bench::PinTo(state.thread_index());
                   AcquireRelease(state, (*table)[state.thread_index() == 0 ? slotA : slotB]);
               })
        ->Setup([](const benchmark::State &) { table = std::make_unique<Table>(false, kSlots); })
        ->Teardown([](const benchmark::State &) { table.reset(); })
        ->Threads(2);
}

void BareMutex(benchmark::State &state) {
    pthread_mutex_t mutex = PTHREAD_MUTEX_INITIALIZER;
    for (auto _ : state) {
        benchmark::DoNotOptimize(pthread_mutex_lock(&mutex));
        benchmark::DoNotOptimize(pthread_mutex_unlock(&mutex));
    }
}

void BareSemaphore(benchmark::State &state) {
    sem_t semaphore;
    sem_init(&semaphore, 0, 1);
    for (auto _ : state) {
        benchmark::DoNotOptimize(sem_post(&semaphore));
        benchmark::DoNotOptimize(sem_wait(&semaphore));
    }
    sem_destroy(&semaphore);
}

// Looks up the mutex in `slot` of a table with `fill` objects.
void RegisterByName(const std::string &name, int fill, int slot) {
    bench::Add(name, [fill, slot](benchmark::State &state) {
        const Table table(false, fill);
        const std::string mutex = "bench" + std::to_string(slot);
        for (auto _ : state) {
            benchmark::DoNotOptimize(VarnekPGL_GetMutexByName(mutex.c_str()));
        }
    });
}

void RegisterAll() {
    // The thread registry's mutex is in the first slot.
    RegisterByName("byname:ours", kSlots, 29);
    RegisterSlot("mutex/last:ours", false, kSlots, kSlots - 1);
    bench::Add("mutex/last:bare", BareMutex);
    RegisterSlot("semaphore/last:ours", true, kSlots, kSlots - 1);
    bench::Add("semaphore/last:bare", BareSemaphore);
    RegisterTwo("mutex/two:ours", 0, 1);
    RegisterSlot("mutex/two:onethread", false, kSlots, 0);
    for (const int fill : {1, 10, kSlots}) {
        const std::string count = std::to_string(fill);
        RegisterSlot("grow_mutex/" + count + ":ours", false, fill, fill - 1);
        RegisterSlot("grow_semaphore/" + count + ":ours", true, fill, fill - 1);
        RegisterByName("grow_byname/" + count + ":ours", fill, fill - 1);
    }
}

}  // namespace

int main(int argc, char **argv) {
    return bench::Main(argc, argv, RegisterAll);
}
