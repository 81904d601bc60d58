#pragma once

#include <pthread.h>
#include <semaphore.h>

#include <cstddef>
#include <deque>
#include <exception>
#include <functional>
#include <map>
#include <string>
#include <thread>
#include <vector>

namespace velkor::testing::schedule {

/// What threads do, one function each.
using Bodies = std::vector<std::function<void()>>;

/// Decides who goes on.
class Strategy {
public:
    virtual ~Strategy() = default;

    /// One of `able`, the numbers of the threads that can go on, sorted and one at least. The one
    /// that has come to the point is `current`; not among them if it can't go on.
    virtual std::size_t choose(const std::vector<std::size_t>& able, std::size_t current) = 0;
};

/// Runs threads one at a time. At each point at which they lock, try to lock, have unlocked, notify
/// or wait, yield or sleep, and when one ends, a strategy decides who goes on, and nothing else
/// does: the same choices make the same schedule. What lies between two points is one step, so that
/// it finds a lock that is given back too early and not one that was never taken.
///
/// A lock that a thread has already is no point. A wait with a limit reaches it when nobody else
/// can go on. Sleeping takes no time. Other threads of the program run as ever, and must neither
/// notify those that are run here nor wait for them while they hold a lock.
class Scheduler {
public:
    /// Takes what is wrong with a schedule that can't be gone on with, and ends the process.
    using GiveUp = std::function<void(const std::string& complaint)>;

    Scheduler(Strategy& decidingStrategy, GiveUp howToGiveUp)
        : strategy(decidingStrategy), giveUp(std::move(howToGiveUp)) {}

    Scheduler(const Scheduler&) = delete;
    Scheduler& operator=(const Scheduler&) = delete;

    /// Runs a thread for each of `bodies` until all have ended, and throws what one of them threw.
    /// To be called once.
    void run(const Bodies& bodies);

    /// Who went on at each point, a digit for each.
    const std::string& choices() const noexcept { return chosen; }

    /// What the threads did, a line for each point.
    std::string trace() const;

    /// The one that runs the calling thread; null when none does.
    static Scheduler* ofThisThread() noexcept;

    // What the running thread does; as the functions of the system.
    int lock(pthread_mutex_t* mutex);
    int tryLock(pthread_mutex_t* mutex);
    int unlock(pthread_mutex_t* mutex);
    int wait(pthread_cond_t* condition, pthread_mutex_t* mutex);
    int waitForATime(pthread_cond_t* condition, pthread_mutex_t* mutex);
    int notifyOne(pthread_cond_t* condition);
    int notifyAll(pthread_cond_t* condition);
    int letOthersIn();

private:
    enum class State { able, locking, waiting, waitingForATime, ended };

    struct Thread {
        Thread() { sem_init(&turn, 0, 0); }
        ~Thread() { sem_destroy(&turn); }
        Thread(const Thread&) = delete;
        Thread& operator=(const Thread&) = delete;

        sem_t turn{};
        State state = State::able;
        pthread_mutex_t* mutex = nullptr;     // that it waits for, or will after a notification
        pthread_cond_t* condition = nullptr;  // that it waits for
        bool timedOut = false;
        std::thread native{};
    };

    struct Holder {
        std::size_t thread;
        std::size_t levels;
    };

    struct Event {
        std::size_t thread;
        const char* what;
        const void* object;
    };

    void runBody(std::size_t number, const std::function<void()>& body);
    bool isMine(pthread_mutex_t* mutex) const;
    int take(pthread_mutex_t* mutex);
    int giveBack(pthread_mutex_t* mutex);
    int await(State how, pthread_cond_t* condition, pthread_mutex_t* mutex);
    void wake(Thread& thread);
    void point(const char* what, const void* object);
    void passOn();
    std::size_t next();
    std::vector<std::size_t> able() const;
    std::vector<std::size_t> ableInTheEnd();
    bool isAble(const Thread& thread) const;
    std::map<const void*, std::string> names() const;
    std::string deadlock() const;
    void note(const char* what, const void* object);

    // Used by the thread whose turn it is, and by `run` while it is nobody's.
    Strategy& strategy;
    const GiveUp giveUp;
    std::deque<Thread> threads;
    std::map<const pthread_mutex_t*, Holder> holders;
    std::vector<std::size_t> waiters;  // of all conditions, who has waited longest first
    std::size_t current = 0;
    std::size_t steps = 0;
    std::size_t ended = 0;
    std::string chosen;
    std::vector<Event> events;
    std::exception_ptr thrown;
    sem_t done{};
};

}  // namespace velkor::testing::schedule
