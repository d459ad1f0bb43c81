/// @file
/// The tasking calls as C++17 objects; C sees the C calls. Objects cannot be moved; any thread may
/// use them. Send, Signal, unlock and starting a thread or timer make all that came before visible
/// to the matching Receive, Wait, lock or callable; Join does so for what the callable did. An
/// object that could not be made, perhaps because its name (which is copied) is too long or has a
/// NUL, is false, and all its functions except Join fail. Callables are copied, as by std::bind; an
/// exception from one ends the program. Never unload a module that uses them (-Wl,-z,nodelete).
/// @see [Guide: tasking](docs/guide/tasking.md)
#ifndef VARNEK_TASKING_H
#define VARNEK_TASKING_H
#include "Varnek_Debug.h"
#include "Varnek_Semaphore.h"
#include "Varnek_Thread.h"
#include "Varnek_Timer.h"
#if defined(__cplusplus) && __cplusplus >= 201703L
#include <algorithm>
#include <atomic>
#include <cerrno>
#include <chrono>
#include <condition_variable>
#include <cstdlib>
#include <cstring>
#include <functional>
#include <map>
#include <mutex>
#include <string>
#include <thread>

namespace varnek {
/// How a wait ended. Without a limit it goes on after a POSIX signal. kGone: the calling thread has
/// no record, or there is no such semaphore. Waiting changes errno.
enum class Outcome { kSuccess, kTimeout, kInterrupted, kGone };
/// What becomes of an object that has the name: kReplace deletes it and owns the new one, but fails
/// for a held mutex; kUse finds or makes it, atomically within one module, and never deletes.
enum class Existing { kReplace, kUse };
/// Milliseconds from any std::chrono duration, rounded up, from 0 to 49 days; only None() is for
/// ever. Waits go by the wall clock, timers do not; Join waits as std::condition_variable does.
class Limit {
  public:
    /// From a duration, so that it can be given wherever a limit is wanted.
    template <typename Rep, typename Period>
    constexpr Limit(std::chrono::duration<Rep, Period> time) {
        const double exact = std::chrono::duration<double, std::milli>(time).count();
        if (exact < milliseconds_) {
            milliseconds_ = exact > 0 ? static_cast<uint32_t>(exact) : 0;
            milliseconds_ += exact > milliseconds_;
        }
    }
    static constexpr Limit None() { return {}; }                             ///< for ever
    constexpr uint32_t Milliseconds() const { return milliseconds_; }        ///< for the C calls
    constexpr bool IsNone() const { return milliseconds_ == WAIT_FOREVER; }  ///< whether for ever
  private:
    constexpr Limit() : milliseconds_(WAIT_FOREVER) {}
    uint32_t milliseconds_ = WAIT_FOREVER - 1;
};

namespace detail {
// A name that must be refused becomes one that is too long for the C calls.
inline std::string Name(std::string_view text) {
    return text.find('\0') == std::string_view::npos ? std::string(text) : std::string(99, '?');
}

// Common to the objects of a program or shared library; never destroyed, as timers outlive main.
struct Shared {
    struct Call {
        std::function<void()> function;
        uintptr_t owner;
        std::thread::id runner;  // nobody before it begins
    };
    std::mutex lock;  // also makes finding and creating an object one step
    std::condition_variable ended;
    std::map<uintptr_t, Call> calls;   // that wait or run
    std::atomic<uintptr_t> owners{0};  // the number of the last; an address could be reused
    uintptr_t number = 0;              // of the last call
    static Shared &Get() {
        static Shared *const shared = new Shared;
        return *shared;
    }
};

// The calls of one thread or timer.
struct Calls {
    Shared &shared = Shared::Get();
    const uintptr_t owner = ++shared.owners;
    // `start` takes the argument for Run, and says whether it succeeded.
    template <typename Start, typename... Parts>
    bool Add(Start start, Parts &&...parts) {
        decltype(Shared::calls) failed;  // destroyed without the lock
        Shared::Call call{std::bind(std::forward<Parts>(parts)...), owner, {}};
        const std::lock_guard<std::mutex> hold(shared.lock);
        while (shared.calls.count(++shared.number) != 0) {  // 32 bits wrap
        }
        const auto added = shared.calls.emplace(shared.number, std::move(call)).first;
        if (!start(reinterpret_cast<void *>(added->first))) {
            failed.insert(shared.calls.extract(added));
        }
        return failed.empty();
    }
    static void *Run(void *number) noexcept {
        Shared &all = Shared::Get();
        std::unique_lock<std::mutex> hold(all.lock);
        const auto call = all.calls.find(reinterpret_cast<uintptr_t>(number));
        if (call != all.calls.end()) {
            call->second.runner = std::this_thread::get_id();
            hold.unlock();
            call->second.function();
            call->second.function = nullptr;
            hold.lock();
            all.calls.erase(call);
            all.ended.notify_all();
        }
        return nullptr;
    }
    // Drops the calls that have not begun, tells `stop` whether there were any, returns its result.
    template <typename Stop>
    bool Drop(Stop stop) {
        decltype(Shared::calls) dropped;  // destroyed without the lock
        const std::lock_guard<std::mutex> hold(shared.lock);
        for (auto next = shared.calls.begin(); next != shared.calls.end();) {
            const auto call = next++;
            if (call->second.owner == owner && call->second.runner == std::thread::id()) {
                dropped.insert(shared.calls.extract(call));
            }
        }
        return stop(!dropped.empty());
    }
    // Waits until no call is left but one that runs in this thread. Returns false on a time-out.
    bool Wait(Limit limit) {
        const auto isDone = [this, self = std::this_thread::get_id()] {
            return std::all_of(shared.calls.begin(), shared.calls.end(), [&](const auto &call) {
                return call.second.owner != owner || call.second.runner == self;
            });
        };
        std::unique_lock<std::mutex> hold(shared.lock);
        const std::chrono::milliseconds time(limit.Milliseconds());
        return limit.IsNone() ? (shared.ended.wait(hold, isDone), true)
                              : shared.ended.wait_for(hold, time, isDone);
    }
};

template <auto kFind, auto kCreate, auto kDelete>
class Own {
  public:
    template <typename... Count>
    Own(std::string_view name, Existing existing, Count... count)
        : isOwned_(existing == Existing::kReplace) {
        const std::string text = Name(name);
        const std::lock_guard<std::mutex> hold(Shared::Get().lock);
        handle_ = isOwned_ ? -1 : kFind(text.c_str());
        handle_ = *this ? handle_ : kCreate(text.c_str(), count...);
    }
    ~Own() { (void)(isOwned_ && *this && kDelete(handle_)); }
    Own(const Own &) = delete;
    explicit operator bool() const { return handle_ != -1; }
    int32_t Handle() const { return handle_; }  // -1 for none
  private:
    const bool isOwned_;  // const, which rules out assignment
    int32_t handle_ = -1;
};
template <typename Wait, typename IsGone>
[[gnu::always_inline]] inline Outcome Await(Limit limit, Wait wait, IsGone isGone) {
    do {
        errno = 0;  // a C call that fails without waiting leaves it alone
        if (wait(limit.Milliseconds()) != FALSE) {
            return Outcome::kSuccess;
        }
    } while (errno == EINTR ? limit.IsNone() : errno != ETIMEDOUT && !isGone());
    return errno == ETIMEDOUT ? Outcome::kTimeout
           : errno == EINTR   ? Outcome::kInterrupted
                              : Outcome::kGone;
}
template <typename T>
using IfMessage = std::enable_if_t<std::is_trivially_copyable_v<T> && sizeof(T) <= 40>;
}  // namespace detail

/// A mutex for std::lock_guard and std::unique_lock; not recursive. Nobody may use it when its
/// owner is destroyed. If the mutex cannot be acquired, lock() aborts after an assertion report,
/// even where it could throw, because no section may run unprotected.
struct Mutex : detail::Own<VarnekPGL_GetMutexByName, VarnekPGL_CreateMutex, VarnekPGL_DeleteMutex> {
    Mutex(std::string_view name, Existing old) : Own(name, old) {}  ///< see Existing
    /// Waits without limit.
    void lock() {
        if (VarnekPGL_AcquireMutex(Handle()) == FALSE) {
            VARNEK_PANIC();
            std::abort();
        }
    }
    void unlock() { VarnekPGL_ReleaseMutex(Handle()); }  ///< releases it
};

/// A counting semaphore; a new one has `count` units. Nobody may use it when its owner is
/// destroyed; a thread that a Signal wakes may run before that Signal returns.
struct Semaphore
    : detail::Own<VarnekPGL_SemaphoreByName, VarnekPGL_CreateSemaphore, VarnekPGL_DeleteSemaphore> {
    /// See Existing.
    Semaphore(std::string_view name, Existing old, uint32_t count) : Own(name, old, count) {}
    bool Signal() { return VarnekPGL_SignalSemaphore(Handle()) != FALSE; }  ///< adds a unit
    /// Takes a unit, waiting for it if need be.
    [[nodiscard]] Outcome Wait(Limit limit = Limit::None()) {
        const auto wait = [this](uint32_t time) { return VarnekPGL_WaitSemaphore(Handle(), time); };
        return detail::Await(limit, wait, [] { return true; });
    }
};

/// Sends a trivially copyable value of up to 40 bytes to a thread; with SendUrgent it overtakes all
/// others. Returns false where VarnekPGL_SendMessage returns FALSE.
template <typename Content, typename = detail::IfMessage<Content>>
bool Send(int32_t hThread, const Content &content,
          BOOL (*send)(int32_t, const THREAD_MSG *) = VarnekPGL_SendMessage) {
    THREAD_MSG message = {};
    std::memcpy(message.data, &content, sizeof content);
    return send(hThread, &message) != FALSE;
}
/// Like Send, but overtakes.
template <typename Content>
bool SendUrgent(int32_t hThread, const Content &content) {
    return Send(hThread, content, VarnekPGL_SendUrgentMessage);
}

/// Takes the first message of the calling thread's queue; `content` changes only on kSuccess.
/// Sender and receiver must agree on the type. Only threads of the registry have a queue.
template <typename T, typename = detail::IfMessage<T>>
[[nodiscard, gnu::always_inline]] inline Outcome Receive(T &content, Limit limit = Limit::None()) {
    THREAD_MSG message;
    int32_t left = 0;
    const auto wait = [&](uint32_t ms) { return VarnekPGL_ReceiveMessage(ms, &message, &left); };
    const auto isGone = [] { return VarnekPGL_GetCurrentThread() == -1; };  // else a peek took it
    const Outcome outcome = detail::Await(limit, wait, isGone);
    if (outcome == Outcome::kSuccess) {
        std::memcpy(static_cast<void *>(&content), message.data, sizeof content);
    }
    return outcome;
}

/// A registered thread that runs its own copy of a callable. To stop it, send it a message or set a
/// flag that it reads, and Join. The destructor removes the record, so that Receive returns kGone
/// and unread messages are lost, and waits for the callable, unless that destroys the Thread.
class Thread {
  public:
    /// Starts a thread, whose name has 1 to 31 characters and must be free.
    template <typename... Callable>
    explicit Thread(std::string_view name, uint32_t stack, Callable &&...callable) {
        const auto start = [this, text = detail::Name(name), stack](void *call) {
            if (VarnekPGL_GetThreadByName(text.c_str()) == -1) {
                handle_ = VarnekPGL_CreateThread(text.c_str(), 1, stack, detail::Calls::Run, call);
            }
            return handle_ != -1;
        };
        calls_.Add(start, std::forward<Callable>(callable)...);
    }
    ~Thread() { (void)(Remove() && calls_.Wait(Limit::None())); }
    explicit operator bool() const { return handle_ != -1; }  ///< whether it has a record
    int32_t Handle() const { return handle_; }                ///< to send to; -1 for none
    /// Waits until the callable, which must not call this, has returned, and then removes the
    /// record. Returns false on a time-out, and true if there is no thread.
    bool Join(Limit limit = Limit::None()) { return calls_.Wait(limit) && Remove(); }

  private:
    bool Remove() {
        const int32_t handle = handle_.exchange(-1);
        return (handle != -1 && VarnekPGL_DeleteThread(handle)), true;
    }
    detail::Calls calls_;
    std::atomic<int32_t> handle_{-1};
};

/// A one-shot timer that runs callables on threads of the system; its name, of 0 to 40 characters,
/// must be free. Each start calls once, unless Cancel or the destructor comes first. The destructor
/// waits for a running callable, unless that destroys the Timer; hold no lock that it may take.
class Timer {
  public:
    /// Creates the timer; nothing is armed yet.
    explicit Timer(std::string_view name)
        : handle_(static_cast<uint32_t>(VarnekPGL_CreateTimer(detail::Name(name).c_str()))) {}
    ~Timer() {
        calls_.Drop([&](bool) { return *this && VarnekPGL_DeleteTimer(handle_.exchange(-1u)); });
        calls_.Wait(Limit::None());
    }
    explicit operator bool() const { return handle_ != -1u; }  ///< whether it was created
    /// Starts it for 1 ms to 49 days (None() is 49 days); false if armed. A callable may call this.
    template <typename... Callable>
    [[nodiscard]] bool Start(Limit delay, Callable &&...callable) {
        const uint32_t ms = std::max(delay.Milliseconds(), 1u);
        const auto arm = [&](void *call) { return VarnekPGL_StartTimer(handle_, ms, run_, call); };
        return calls_.Add(arm, std::forward<Callable>(callable)...);
    }
    /// Drops the starts whose callables have not begun. Returns whether there was one.
    bool Cancel() {
        return calls_.Drop([&](bool any) { return any && (VarnekPGL_CancelTimer(handle_), any); });
    }
    bool IsActive() const { return VarnekPGL_IsTimerActive(handle_) != FALSE; }  ///< armed
  private:
    // From the shared library that made calls_, because another one may have its own Shared.
    void (*const run_)(uint32_t, void *) = [](uint32_t, void *call) { detail::Calls::Run(call); };
    detail::Calls calls_;
    std::atomic<uint32_t> handle_;
};
}  // namespace varnek
#endif
#endif
