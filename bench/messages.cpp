// Messages of 40 bytes, copied in and out: within a thread, one way between two threads, and back
// and forth.
#include <pthread.h>
#include <semaphore.h>
#include <string.h>

#include <memory>
#include <thread>

#include "Bench.h"
#include "Varnek_Thread.h"

#ifdef HAVE_GLIB
#include <glib.h>
#endif

namespace {

constexpr int kBatch = 1000;  // messages between two synchronisations of the threads

// A contender is a queue. Any thread may call Send. Only the thread that `Owner` made the owner of
// the queue calls Receive, which waits.

class Ours {
  public:
    void Own() { handle_ = VarnekPGL_GetCurrentThread(); }
    bool Send(const THREAD_MSG &message) {
        return VarnekPGL_SendMessage(handle_, &message) != FALSE;
    }
    bool Receive(THREAD_MSG *message) {
        int32_t left = 0;
        return VarnekPGL_ReceiveMessage(WAIT_FOREVER, message, &left) != FALSE;
    }

  private:
    int32_t handle_ = -1;
};

// A block and a node for each message, a list, a mutex and a semaphore.
class Bare {
  public:
    Bare() { sem_init(&count_, 0, 0); }
    ~Bare() { sem_destroy(&count_); }
    Bare(const Bare &) = delete;
    Bare &operator=(const Bare &) = delete;

    void Own() {}
    bool Send(const THREAD_MSG &message) {
        void *block = malloc(sizeof message);
        Node *node = static_cast<Node *>(malloc(sizeof *node));
        if (block == nullptr || node == nullptr) {
            free(block);
            free(node);
            return false;
        }
        memcpy(block, &message, sizeof message);
        *node = {nullptr, block};
        pthread_mutex_lock(&mutex_);
        *last_ = node;
        last_ = &node->next;
        pthread_mutex_unlock(&mutex_);
        return sem_post(&count_) == 0;
    }
    bool Receive(THREAD_MSG *message) {
        if (sem_wait(&count_) != 0) {
            return false;
        }
        pthread_mutex_lock(&mutex_);
        Node *node = first_;
        first_ = node->next;
        if (first_ == nullptr) {
            last_ = &first_;
        }
        pthread_mutex_unlock(&mutex_);
        memcpy(message, node->block, sizeof *message);
        free(node->block);
        free(node);
        return true;
    }

  private:
    struct Node {
        Node *next;
        void *block;
    };
    pthread_mutex_t mutex_ = PTHREAD_MUTEX_INITIALIZER;
    sem_t count_ = {};
    Node *first_ = nullptr;
    Node **last_ = &first_;
};

#ifdef HAVE_GLIB
class GLib {
  public:
    GLib() = default;
    ~GLib() { g_async_queue_unref(queue_); }
    GLib(const GLib &) = delete;
    GLib &operator=(const GLib &) = delete;

    void Own() {}
    bool Send(const THREAD_MSG &message) {
        void *block = g_malloc(sizeof message);
        memcpy(block, &message, sizeof message);
        g_async_queue_push(queue_, block);
        return true;
    }
    bool Receive(THREAD_MSG *message) {
        void *block = g_async_queue_pop(queue_);
        memcpy(message, block, sizeof *message);
        g_free(block);
        return true;
    }

  private:
    GAsyncQueue *queue_ = g_async_queue_new();
};
#endif

template <typename Queue>
void SameThread(benchmark::State &state) {
    Queue queue;
    queue.Own();
    THREAD_MSG message = {};
    for (int64_t i = 0; i < state.range(0); i++) {
        queue.Send(message);
    }
    for (auto _ : state) {
        if (!queue.Send(message) || !queue.Receive(&message)) {
            state.SkipWithError("a message is lost");
            break;
        }
    }
    for (int64_t i = 0; i < state.range(0); i++) {
        queue.Receive(&message);
    }
}

// A thread of the library that answers messages: with `echo` every one, otherwise the last one of a
// batch. The first byte of a message says whether it is the last message of the benchmark.
template <typename Queue>
class Partner {
  public:
    Partner(bool echo, int core) : echo_(echo), core_(core) {
        sem_init(&ready_, 0, 0);
        sem_init(&ended_, 0, 0);
        back_.Own();
        handle_ = VarnekPGL_CreateThread("partner", 1, 1024 * 1024, Run, this);
        Wait(&ready_);
    }
    ~Partner() {
        THREAD_MSG message = {};
        message.data[0] = 1;
        there_.Send(message);
        Wait(&ended_);
        VarnekPGL_DeleteThread(handle_);
        sem_destroy(&ready_);
        sem_destroy(&ended_);
    }
    Partner(const Partner &) = delete;
    Partner &operator=(const Partner &) = delete;

    Queue &There() { return there_; }
    Queue &Back() { return back_; }

  private:
    static void Wait(sem_t *semaphore) {
        while (sem_wait(semaphore) != 0) {
        }
    }
    static void *Run(void *self) {
        static_cast<Partner *>(self)->Answer();
        return nullptr;
    }
    void Answer() {
        bench::PinTo(core_);
        there_.Own();
        sem_post(&ready_);
        THREAD_MSG message = {};
        for (int i = 0; there_.Receive(&message) && message.data[0] == 0;) {
            if (echo_ || ++i % kBatch == 0) {
                back_.Send(message);
            }
        }
        sem_post(&ended_);
    }

    Queue there_, back_;
    sem_t ready_ = {}, ended_ = {};
    const bool echo_;
    const int core_;
    int32_t handle_ = -1;
};

template <typename Queue>
void OneWay(benchmark::State &state) {
    bench::PinTo(0);
    Partner<Queue> partner(false, 1);
    THREAD_MSG message = {};
    for (auto _ : state) {
        for (int i = 0; i < kBatch; i++) {
            partner.There().Send(message);
        }
        partner.Back().Receive(&message);
    }
    state.SetItemsProcessed(state.iterations() * kBatch);
}

// Sends a message there and back, between the cores 0 and `core`.
template <typename Queue, int core>
void PingPong(benchmark::State &state) {
    bench::PinTo(0);
    Partner<Queue> partner(true, core);
    THREAD_MSG message = {};
    for (auto _ : state) {
        partner.There().Send(message);
        partner.Back().Receive(&message);
    }
}

template <typename Queue>
void Register(const std::string &contender) {
    bench::Add("message/same:" + contender, SameThread<Queue>)->Arg(0);
    bench::Add("message/oneway:" + contender, OneWay<Queue>);
    bench::Add("message/pingpong1:" + contender, PingPong<Queue, 0>);
    bench::Add("message/pingpong2:" + contender, PingPong<Queue, 1>);
}

void RegisterAll() {
    Register<Ours>("ours");
    Register<Bare>("bare");
#ifdef HAVE_GLIB
    Register<GLib>("gasync");
#else
    for (const char *row : {"same", "oneway", "pingpong1", "pingpong2"}) {
        bench::AddMissing(std::string("message/") + row + ":gasync");
    }
#endif
    for (const int64_t length : {1, 10000, 1000000}) {
        bench::Add("grow_queue/" + std::to_string(length) + ":ours", SameThread<Ours>)->Arg(length);
    }
}

}  // namespace

int main(int argc, char **argv) {
    return bench::Main(argc, argv, RegisterAll);
}
