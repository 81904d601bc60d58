#pragma once

#include <atomic>
#include <cstddef>
#include <cstdint>
#include <iterator>
#include <string>
#include <utility>
#include <vector>

#include "tests/stress/histories/StoreHistory.hpp"
#include "tests/stress/histories/StoreSubject.hpp"
#include "tests/support/Sanitizers.hpp"

namespace velkor::testing {

/// Calls a store and notes what comes of it. Each thread has a number of its own, below that of the
/// threads, which it gives to `beThread` first. The store must live as long.
class StoreRecorder {
public:
    StoreRecorder(StoreSubject& called, std::size_t threads) : subject(called), logs(threads) {}

    /// Says that the calling thread is `number` from now on.
    static void beThread(std::size_t number) { ownNumber() = number; }

    static std::size_t thisThread() { return ownNumber(); }

    /// The next moment of the clock that all threads share.
    std::uint64_t tick() { return clock.fetch_add(1, order); }

    void perform(StoreCall call) {
        const std::uint64_t invoked = tick();
        StoreSubject::Answer answer = subject.perform(call);
        const std::uint64_t responded = tick();
        logs[thisThread()].push_back({{std::move(call), std::move(answer.text), invoked, responded},
                                      thisThread(),
                                      answer.version});
    }

    /// The calls of all threads, which have ended.
    std::vector<StoreRecord> calls() const {
        std::vector<StoreRecord> all;
        for (const auto& log : logs) all.insert(all.end(), log.begin(), log.end());
        return all;
    }

private:
    // A clock that orders the threads would hide from a sanitizer what the store leaves unordered.
    static constexpr auto order =
        isSanitized ? std::memory_order_relaxed : std::memory_order_seq_cst;

    static std::size_t& ownNumber() {
        static thread_local std::size_t number = 0;
        return number;
    }

    StoreSubject& subject;
    std::atomic<std::uint64_t> clock{1};
    std::vector<std::vector<StoreRecord>> logs;  // one for each thread, used by it alone
};

}  // namespace velkor::testing
