// A thread of the library for the tests.
#ifndef VARNEK_TESTS_SUPPORT_WORKER_H
#define VARNEK_TESTS_SUPPORT_WORKER_H

#include <functional>
#include <future>
#include <utility>

#include "Varnek_Thread.h"

// A registered thread that does one piece of work. Wait returns when the work is done.
class Worker {
  public:
    explicit Worker(std::function<void()> work, const char *name = "worker")
        : work_(std::move(work)), handle_(VarnekPGL_CreateThread(name, 50, 256 * 1024, Run, this)) {}
    ~Worker() { Wait(); }

    int32_t Handle() const { return handle_; }
    void Wait() {
        if (handle_ != -1) {
            done_.get_future().wait();
            handle_ = -1;
        }
    }

  private:
    static void *Run(void *self) {
        auto *worker = static_cast<Worker *>(self);
        worker->work_();
        worker->done_.set_value();
        return nullptr;
    }

    std::function<void()> work_;
    std::promise<void> done_;
    int32_t handle_;
};

#endif
