#pragma once

#include <chrono>
#include <condition_variable>
#include <cstddef>
#include <exception>
#include <mutex>
#include <stdexcept>
#include <string>
#include <utility>
#include <vector>

#include "configuration/sources/DurableSource.hpp"
#include "framework/Future.hpp"
#include "tests/support/BoundedWait.hpp"
#include "tests/support/HookedSource.hpp"

namespace velkor::testing {

/// A source that commits when the test says so.
class LastingSource final : public HookedSource, public configuration::DurableSource {
public:
    Future<bool> committed() override {
        const std::lock_guard<std::mutex> lock(mutex);
        promises.emplace_back();
        asked.notify_all();
        return promises.back().getFuture();
    }

    /// Waits until it was asked that often.
    void awaitCommits(std::size_t count) {
        std::unique_lock<std::mutex> lock(mutex);
        if (!asked.wait_for(lock, patience, [&] { return promises.size() >= count; })) {
            throw std::runtime_error("not asked to commit");
        }
    }

    void commit() {
        for (auto& promise : taken()) promise.setValue(true);
    }

    void fail(const std::string& reason) {
        for (auto& promise : taken()) {
            promise.setException(std::make_exception_ptr(std::runtime_error(reason)));
        }
    }

    /// Gives up without an answer.
    void abandon() { taken(); }

private:
    std::vector<Promise<bool>> taken() {
        const std::lock_guard<std::mutex> lock(mutex);
        return std::exchange(promises, {});
    }

    std::mutex mutex;
    std::condition_variable asked;
    std::vector<Promise<bool>> promises;  // guarded by mutex
};

}  // namespace velkor::testing
