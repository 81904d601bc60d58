#pragma once

#include <atomic>
#include <cstdlib>
#include <exception>
#include <functional>
#include <string>
#include <thread>

namespace velkor::testing {

/// How often each race is run: VELKOR_STRESS_ROUNDS, or `otherwise` when that is not set.
inline int stressRounds(int otherwise = 100'000) {
    const char* rounds = std::getenv("VELKOR_STRESS_ROUNDS");
    return rounds == nullptr ? otherwise : std::stoi(rounds);
}

/// Holds two threads until both have come, again and again. They spin, so that they leave as close
/// together as the machine allows.
class Barrier {
public:
    void arriveAndWait() {
        const unsigned round = generation.load();
        if (arrived.fetch_add(1) == 1) {
            arrived = 0;
            ++generation;
            return;
        }
        while (generation.load() == round) std::this_thread::yield();
    }

private:
    std::atomic<unsigned> arrived{0};
    std::atomic<unsigned> generation{0};
};

/// Runs rounds of `prepare`, then `left` and `right` at the same time, then `check`; all but
/// `right` on the calling thread. A deadlock hangs: the runner's time limit finds it.
inline void race(const std::function<void()>& prepare, const std::function<void()>& left,
                 const std::function<void()>& right, const std::function<void()>& check) {
    const int rounds = stressRounds();
    Barrier start;
    Barrier finish;
    std::thread other([&] {
        for (int round = 0; round < rounds; ++round) {
            start.arriveAndWait();
            right();
            finish.arriveAndWait();
        }
    });
    for (int round = 0; round < rounds; ++round) {
        prepare();
        start.arriveAndWait();
        left();
        finish.arriveAndWait();
        check();
    }
    other.join();
}

}  // namespace velkor::testing
