#pragma once

#include <condition_variable>
#include <cstddef>
#include <deque>
#include <functional>
#include <optional>

#include "framework/common/Mutex.hpp"
#include "layers/OwnThread.hpp"

namespace velkor::http::detail {

/// A thread that does one job after the other, in their order. Thread-safe; jobs run, and are
/// destroyed, under no lock.
class Worker {
public:
    /// What is to be done; it throws nothing.
    using Job = std::function<void()>;

    /// Starts the thread; at most `most` jobs wait. Throws `std::system_error` when the system
    /// refuses.
    explicit Worker(std::size_t most);
    ~Worker() { stop(); }

    Worker(const Worker&) = delete;
    Worker& operator=(const Worker&) = delete;

    /// Lets `job` be done; false, and nothing has happened, when too many wait or the thread has
    /// ended.
    bool post(Job job) VELKOR_EXCLUDES(mutex);

    /// Ends the thread once it has done the job it is at, for which it waits; those that wait are
    /// destroyed. May be called several times, by one thread at a time, and not by a job.
    void stop() noexcept VELKOR_EXCLUDES(mutex);

private:
    void run() VELKOR_EXCLUDES(mutex);
    Job nextJob() VELKOR_EXCLUDES(mutex);

    const std::size_t mostWaiting;
    common::Mutex mutex;
    std::condition_variable changed;
    std::deque<Job> jobs VELKOR_GUARDED_BY(mutex);
    bool isStopping VELKOR_GUARDED_BY(mutex) = false;
    std::optional<layers::OwnThread> thread;  // the last member: it uses the others
};

}  // namespace velkor::http::detail
