// Uses mutexes and semaphores by handle and finds mutexes by name, one alone and one of 39, and
// uses two mutexes in two threads at the same time.
#include <pthread.h>
#include <semaphore.h>

#include <deque>

#include "Bench.h"
#include "Varnek_Tasking.h"

namespace {

constexpr int kFull = 39;  // the thread registry has the first of the 40 mutexes

std::string Name(int number) {
    return "bench" + std::to_string(number);
}

// Makes `count` objects, in consecutive slots.
template <typename Object, typename... Units>
std::deque<Object> Make(int count, Units... units) {
    std::deque<Object> objects;
    for (int i = 0; i < count; i++) {
        objects.emplace_back(Name(i), varnek::Existing::kReplace, units...);
    }
    return objects;
}

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

// Uses a mutex of the calling thread's own. Those of two threads are in adjacent slots.
void OwnMutex(benchmark::State &state) {
    bench::PinTo(state.thread_index());
    const varnek::Mutex mutex(Name(state.thread_index()), varnek::Existing::kReplace);
    AcquireRelease(state, mutex.Handle());
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

void RegisterAll() {
    for (const int count : {kFull, 1}) {
        const std::string contender = count == kFull ? ":ours" : ":alone";
        bench::Add("byname" + contender, [count](benchmark::State &state) {
            const auto mutexes = Make<varnek::Mutex>(count);
            const std::string name = Name(count == kFull ? 29 : 0);
            for (auto _ : state) {
                benchmark::DoNotOptimize(VarnekPGL_GetMutexByName(name.c_str()));
            }
        });
        bench::Add("mutex/last" + contender, [count](benchmark::State &state) {
            AcquireRelease(state, Make<varnek::Mutex>(count).back().Handle());
        });
        bench::Add("semaphore/last" + contender, [count](benchmark::State &state) {
            SignalWait(state, Make<varnek::Semaphore>(count, 1u).back().Handle());
        });
    }
    bench::Add("mutex/scoped:calls", OwnMutex);
    bench::Add("mutex/scoped:ours", [](benchmark::State &state) {
        varnek::Mutex mutex(Name(0), varnek::Existing::kReplace);
        for (auto _ : state) {
            const std::lock_guard<varnek::Mutex> hold(mutex);
        }
    });
    bench::Add("mutex/last:bare", BareMutex);
    bench::Add("semaphore/last:bare", BareSemaphore);
    bench::Add("mutex/two:ours", OwnMutex)->Threads(2);
    bench::Add("mutex/two:onethread", OwnMutex);
}

}  // namespace

int main(int argc, char **argv) {
    return bench::Main(argc, argv, RegisterAll);
}
