// Takes the place of what locks are made of. Programs come first when the libraries that they load
// look for a function: also the store's and the publisher's locks end up here. Threads that no
// scheduler runs are passed on to the system.

#include "tests/stress/schedule/Threads.hpp"

#include <dlfcn.h>
#include <sched.h>

#include "tests/stress/schedule/Scheduler.hpp"

namespace velkor::testing::schedule::real {

namespace {

template <class Function>
Function* next(const char* name) {
    return reinterpret_cast<Function*>(dlsym(RTLD_NEXT, name));
}

}  // namespace

int lock(pthread_mutex_t* mutex) {
    static auto* const function = next<int(pthread_mutex_t*)>("pthread_mutex_lock");
    return function(mutex);
}

int tryLock(pthread_mutex_t* mutex) {
    static auto* const function = next<int(pthread_mutex_t*)>("pthread_mutex_trylock");
    return function(mutex);
}

int unlock(pthread_mutex_t* mutex) {
    static auto* const function = next<int(pthread_mutex_t*)>("pthread_mutex_unlock");
    return function(mutex);
}

int wait(pthread_cond_t* condition, pthread_mutex_t* mutex) {
    static auto* const function = next<int(pthread_cond_t*, pthread_mutex_t*)>("pthread_cond_wait");
    return function(condition, mutex);
}

int waitUntil(pthread_cond_t* condition, pthread_mutex_t* mutex, const timespec* end) {
    static auto* const function =
        next<int(pthread_cond_t*, pthread_mutex_t*, const timespec*)>("pthread_cond_timedwait");
    return function(condition, mutex, end);
}

int waitUntil(pthread_cond_t* condition, pthread_mutex_t* mutex, clockid_t clock,
              const timespec* end) {
    static auto* const function =
        next<int(pthread_cond_t*, pthread_mutex_t*, clockid_t, const timespec*)>(
            "pthread_cond_clockwait");
    return function(condition, mutex, clock, end);
}

int notifyOne(pthread_cond_t* condition) {
    static auto* const function = next<int(pthread_cond_t*)>("pthread_cond_signal");
    return function(condition);
}

int notifyAll(pthread_cond_t* condition) {
    static auto* const function = next<int(pthread_cond_t*)>("pthread_cond_broadcast");
    return function(condition);
}

int yield() {
    static auto* const function = next<int()>("sched_yield");
    return function();
}

int sleep(const timespec* asked, timespec* left) {
    static auto* const function = next<int(const timespec*, timespec*)>("nanosleep");
    return function(asked, left);
}

}  // namespace velkor::testing::schedule::real

namespace {

using velkor::testing::schedule::Scheduler;
namespace real = velkor::testing::schedule::real;

}  // namespace

#define VELKOR_IN_PLACE_OF_THE_SYSTEM extern "C" __attribute__((visibility("default")))

VELKOR_IN_PLACE_OF_THE_SYSTEM int pthread_mutex_lock(pthread_mutex_t* mutex) noexcept {
    Scheduler* const scheduler = Scheduler::ofThisThread();
    return scheduler == nullptr ? real::lock(mutex) : scheduler->lock(mutex);
}

VELKOR_IN_PLACE_OF_THE_SYSTEM int pthread_mutex_trylock(pthread_mutex_t* mutex) noexcept {
    Scheduler* const scheduler = Scheduler::ofThisThread();
    return scheduler == nullptr ? real::tryLock(mutex) : scheduler->tryLock(mutex);
}

VELKOR_IN_PLACE_OF_THE_SYSTEM int pthread_mutex_unlock(pthread_mutex_t* mutex) noexcept {
    Scheduler* const scheduler = Scheduler::ofThisThread();
    return scheduler == nullptr ? real::unlock(mutex) : scheduler->unlock(mutex);
}

VELKOR_IN_PLACE_OF_THE_SYSTEM int pthread_cond_wait(pthread_cond_t* condition,
                                                    pthread_mutex_t* mutex) {
    Scheduler* const scheduler = Scheduler::ofThisThread();
    return scheduler == nullptr ? real::wait(condition, mutex) : scheduler->wait(condition, mutex);
}

VELKOR_IN_PLACE_OF_THE_SYSTEM int pthread_cond_timedwait(pthread_cond_t* condition,
                                                         pthread_mutex_t* mutex,
                                                         const timespec* end) {
    Scheduler* const scheduler = Scheduler::ofThisThread();
    return scheduler == nullptr ? real::waitUntil(condition, mutex, end)
                                : scheduler->waitForATime(condition, mutex);
}

VELKOR_IN_PLACE_OF_THE_SYSTEM int pthread_cond_clockwait(pthread_cond_t* condition,
                                                         pthread_mutex_t* mutex, clockid_t clock,
                                                         const timespec* end) {
    Scheduler* const scheduler = Scheduler::ofThisThread();
    return scheduler == nullptr ? real::waitUntil(condition, mutex, clock, end)
                                : scheduler->waitForATime(condition, mutex);
}

VELKOR_IN_PLACE_OF_THE_SYSTEM int pthread_cond_signal(pthread_cond_t* condition) noexcept {
    Scheduler* const scheduler = Scheduler::ofThisThread();
    return scheduler == nullptr ? real::notifyOne(condition) : scheduler->notifyOne(condition);
}

VELKOR_IN_PLACE_OF_THE_SYSTEM int pthread_cond_broadcast(pthread_cond_t* condition) noexcept {
    Scheduler* const scheduler = Scheduler::ofThisThread();
    return scheduler == nullptr ? real::notifyAll(condition) : scheduler->notifyAll(condition);
}

VELKOR_IN_PLACE_OF_THE_SYSTEM int sched_yield() noexcept {
    Scheduler* const scheduler = Scheduler::ofThisThread();
    return scheduler == nullptr ? real::yield() : scheduler->letOthersIn();
}

VELKOR_IN_PLACE_OF_THE_SYSTEM int nanosleep(const timespec* asked, timespec* left) {
    Scheduler* const scheduler = Scheduler::ofThisThread();
    return scheduler == nullptr ? real::sleep(asked, left) : scheduler->letOthersIn();
}
