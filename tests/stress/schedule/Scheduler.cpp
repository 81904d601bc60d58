#include "tests/stress/schedule/Scheduler.hpp"

#include <algorithm>
#include <cerrno>
#include <utility>

#include "tests/stress/schedule/Threads.hpp"

namespace velkor::testing::schedule {

namespace {

// Far more than there are points in any schedule that ends.
constexpr std::size_t mostSteps = 200'000;

thread_local Scheduler* ownScheduler = nullptr;

void take(sem_t& semaphore) {
    while (sem_wait(&semaphore) != 0) continue;
}

}  // namespace

Scheduler* Scheduler::ofThisThread() noexcept {
    return ownScheduler;
}

void Scheduler::run(const Bodies& bodies) {
    sem_init(&done, 0, 0);
    for (std::size_t i = 0; i < bodies.size(); ++i) threads.emplace_back();
    for (std::size_t number = 0; number < bodies.size(); ++number) {
        threads[number].native = std::thread([&, number] { runBody(number, bodies[number]); });
    }
    current = bodies.size();  // nobody
    sem_post(&threads[next()].turn);
    schedule::take(done);
    for (auto& thread : threads) thread.native.join();
    sem_destroy(&done);
    if (thrown) std::rethrow_exception(thrown);
}

void Scheduler::runBody(std::size_t number, const std::function<void()>& body) {
    Thread& self = threads[number];
    schedule::take(self.turn);
    ownScheduler = this;
    try {
        body();
    } catch (...) {
        if (!thrown) thrown = std::current_exception();
    }
    ownScheduler = nullptr;
    note("ends", nullptr);
    self.state = State::ended;
    if (++ended == threads.size()) {
        sem_post(&done);
    } else {
        sem_post(&threads[next()].turn);
    }
}

int Scheduler::lock(pthread_mutex_t* mutex) {
    // Of a mutex that isn't recursive this fails, and nobody can ever go on.
    if (isMine(mutex) && real::tryLock(mutex) == 0) {
        ++holders[mutex].levels;
        return 0;
    }
    Thread& self = threads[current];
    self.state = State::locking;
    self.mutex = mutex;
    point("wants", mutex);
    return take(mutex);
}

int Scheduler::tryLock(pthread_mutex_t* mutex) {
    point("tries", mutex);
    if (const int error = real::tryLock(mutex)) return error;
    const auto holder = holders.emplace(mutex, Holder{current, 0}).first;
    ++holder->second.levels;
    note("locks", mutex);
    return 0;
}

int Scheduler::unlock(pthread_mutex_t* mutex) {
    if (!isMine(mutex)) return real::unlock(mutex);  // locked before the threads began
    Holder& holder = holders[mutex];
    if (holder.levels > 1) {
        --holder.levels;
        return real::unlock(mutex);
    }
    const int error = giveBack(mutex);
    point("has unlocked", mutex);
    return error;
}

int Scheduler::wait(pthread_cond_t* condition, pthread_mutex_t* mutex) {
    return await(State::waiting, condition, mutex);
}

int Scheduler::waitForATime(pthread_cond_t* condition, pthread_mutex_t* mutex) {
    return await(State::waitingForATime, condition, mutex);
}

int Scheduler::notifyOne(pthread_cond_t* condition) {
    point("notifies one of", condition);
    const auto longest = std::find_if(waiters.begin(), waiters.end(), [&](std::size_t waiter) {
        return threads[waiter].condition == condition;
    });
    if (longest != waiters.end()) wake(threads[*longest]);
    return 0;
}

int Scheduler::notifyAll(pthread_cond_t* condition) {
    point("notifies all of", condition);
    for (Thread& thread : threads) {
        if (thread.condition == condition) wake(thread);
    }
    return 0;
}

int Scheduler::letOthersIn() {
    point("lets others in", nullptr);
    return 0;
}

bool Scheduler::isMine(pthread_mutex_t* mutex) const {
    const auto holder = holders.find(mutex);
    return holder != holders.end() && holder->second.thread == current;
}

// Nobody who is run here has it now.
int Scheduler::take(pthread_mutex_t* mutex) {
    Thread& self = threads[current];
    self.state = State::able;
    self.mutex = nullptr;
    holders[mutex] = {current, 1};
    note("locks", mutex);
    return real::lock(mutex);
}

int Scheduler::giveBack(pthread_mutex_t* mutex) {
    holders.erase(mutex);
    return real::unlock(mutex);
}

int Scheduler::await(State how, pthread_cond_t* condition, pthread_mutex_t* mutex) {
    Thread& self = threads[current];
    self.state = how;
    self.mutex = mutex;
    self.condition = condition;
    self.timedOut = false;
    waiters.push_back(current);
    giveBack(mutex);
    point("waits on", condition);
    const bool timedOut = self.timedOut;
    take(mutex);
    return timedOut ? ETIMEDOUT : 0;
}

void Scheduler::wake(Thread& thread) {
    thread.state = State::locking;
    thread.condition = nullptr;
    waiters.erase(std::remove_if(waiters.begin(), waiters.end(),
                                 [&](std::size_t waiter) { return &threads[waiter] == &thread; }),
                  waiters.end());
}

void Scheduler::point(const char* what, const void* object) {
    note(what, object);
    passOn();
}

void Scheduler::passOn() {
    const std::size_t self = current;
    const std::size_t chosenThread = next();
    if (chosenThread == self) return;
    sem_post(&threads[chosenThread].turn);
    schedule::take(threads[self].turn);
}

// Who goes on, from now on the current one.
std::size_t Scheduler::next() {
    const auto candidates = ableInTheEnd();
    if (candidates.empty()) giveUp("nobody can go on:" + deadlock());
    if (++steps > mostSteps) giveUp("the threads don't come to an end");
    current = strategy.choose(candidates, current);
    chosen += static_cast<char>('0' + current);
    return current;
}

std::vector<std::size_t> Scheduler::able() const {
    std::vector<std::size_t> found;
    for (std::size_t number = 0; number < threads.size(); ++number) {
        if (isAble(threads[number])) found.push_back(number);
    }
    return found;
}

// When nobody is, time passes for those that wait for a time.
std::vector<std::size_t> Scheduler::ableInTheEnd() {
    auto found = able();
    if (!found.empty()) return found;
    for (Thread& thread : threads) {
        if (thread.state != State::waitingForATime) continue;
        thread.timedOut = true;
        wake(thread);
    }
    return able();
}

bool Scheduler::isAble(const Thread& thread) const {
    if (thread.state == State::locking) return holders.count(thread.mutex) == 0;
    return thread.state == State::able;
}

std::string Scheduler::deadlock() const {
    std::string text;
    const auto objects = names();
    for (std::size_t number = 0; number < threads.size(); ++number) {
        const Thread& thread = threads[number];
        if (thread.state == State::ended) continue;
        text += "\n  thread " + std::to_string(number);
        if (thread.state == State::locking) {
            text += " wants " + objects.at(thread.mutex) + ", which thread " +
                    std::to_string(holders.at(thread.mutex).thread) + " has";
        } else {
            text += " waits on " + objects.at(thread.condition);
        }
    }
    return text;
}

void Scheduler::note(const char* what, const void* object) {
    events.push_back({current, what, object});
}

// Numbers in the order in which the threads came to them.
std::map<const void*, std::string> Scheduler::names() const {
    std::map<const void*, std::string> known;
    for (const Event& event : events) {
        if (event.object != nullptr) {
            known.emplace(event.object, "#" + std::to_string(known.size() + 1));
        }
    }
    return known;
}

std::string Scheduler::trace() const {
    const auto objects = names();
    std::string text;
    for (const Event& event : events) {
        text += "  thread " + std::to_string(event.thread) + " " + event.what;
        if (event.object != nullptr) text += " " + objects.at(event.object);
        text += "\n";
    }
    return text;
}

}  // namespace velkor::testing::schedule
