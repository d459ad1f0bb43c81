// Messages of 40 bytes, copied in and out: within a thread, one way to another thread, and there
// and back.
#include <pthread.h>
#include <semaphore.h>
#include <string.h>

#include "Bench.h"
#include "Varnek_Tasking.h"

#ifdef HAVE_GLIB
#include <glib.h>
#endif

namespace {

constexpr int kBatch = 1000;  // messages between two synchronisations of the threads

// A contender is a queue. Any thread may send; only the thread that owns the queue receives, and
// waits for a message.

class Ours {
  public:
    void GiveTo(int32_t handle) { handle_ = handle; }
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

// The same calls through the C++ layer.
class Typed {
  public:
    void GiveTo(int32_t handle) { handle_ = handle; }
    bool Send(const THREAD_MSG &message) { return varnek::Send(handle_, message); }
    bool Receive(THREAD_MSG *message) {
        return varnek::Receive(*message) == varnek::Outcome::kSuccess;
    }

  private:
    int32_t handle_ = -1;
};

// Two blocks of memory for each message, a list, a mutex and a semaphore.
class Bare {
  public:
    Bare() { sem_init(&count_, 0, 0); }
    ~Bare() { sem_destroy(&count_); }
    Bare(const Bare &) = delete;
    Bare &operator=(const Bare &) = delete;

    void GiveTo(int32_t) {}
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

    void GiveTo(int32_t) {}
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

// Sends to its own queue and receives, while `waiting` other messages are in the queue.
template <typename Queue, int waiting = 0>
void SameThread(benchmark::State &state) {
    Queue queue;
    queue.GiveTo(VarnekPGL_GetCurrentThread());
    THREAD_MSG message = {};
    for (int i = 0; i < waiting; i++) {
        queue.Send(message);
    }
    for (auto _ : state) {
        if (!queue.Send(message) || !queue.Receive(&message)) {
            state.SkipWithError("a message is lost");
            break;
        }
    }
    for (int i = 0; i < waiting; i++) {
        queue.Receive(&message);
    }
}

// A thread on core `core` that answers one message in `every`, the last of each such group. It ends
// at a message whose first byte is not 0.
template <typename Queue>
struct Partner {
    Partner(int core, int every)
        : thread("partner", 1024 * 1024, &Partner::Answer, this, core, every) {
        there.GiveTo(thread.Handle());
        back.GiveTo(VarnekPGL_GetCurrentThread());
    }
    ~Partner() {
        THREAD_MSG last = {};
        last.data[0] = 1;
        there.Send(last);
    }
    Partner(const Partner &) = delete;
    Partner &operator=(const Partner &) = delete;

    void Answer(int core, int every) {
        bench::PinTo(core);
        THREAD_MSG message = {};
        for (int i = 1; there.Receive(&message) && message.data[0] == 0; i++) {
            if (i % every == 0) {
                back.Send(message);
            }
        }
    }

    Queue there, back;
    varnek::Thread thread;
};

template <typename Queue>
void OneWay(benchmark::State &state) {
    bench::PinTo(0);
    Partner<Queue> partner(1, kBatch);
    THREAD_MSG message = {};
    for (auto _ : state) {
        for (int i = 0; i < kBatch; i++) {
            partner.there.Send(message);
        }
        partner.back.Receive(&message);
    }
    state.SetItemsProcessed(state.iterations() * kBatch);
}

// Sends a message there and back, between the cores 0 and `core`.
template <typename Queue, int core>
void PingPong(benchmark::State &state) {
    bench::PinTo(0);
    Partner<Queue> partner(core, 1);
    THREAD_MSG message = {};
    for (auto _ : state) {
        partner.there.Send(message);
        partner.back.Receive(&message);
    }
}

template <typename Queue>
void Register(const std::string &contender) {
    bench::Add("message/same:" + contender, SameThread<Queue>);
    bench::Add("message/oneway:" + contender, OneWay<Queue>);
    bench::Add("message/pingpong1:" + contender, PingPong<Queue, 0>);
    bench::Add("message/pingpong2:" + contender, PingPong<Queue, 1>);
}

void RegisterAll() {
    Register<Ours>("ours");
    Register<Bare>("bare");
#ifdef HAVE_GLIB
    Register<GLib>("gasync");
#endif
    bench::Add("message/queued:ours", SameThread<Ours, 1000000>);
    bench::Add("message/queued:empty", SameThread<Ours>);
    bench::Add("message/typed:ours", SameThread<Typed>);
    bench::Add("message/typed:calls", SameThread<Ours>);
}

}  // namespace

int main(int argc, char **argv) {
    return bench::Main(argc, argv, RegisterAll);
}
