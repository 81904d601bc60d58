#pragma once

#include <condition_variable>
#include <cstddef>
#include <optional>
#include <string>

#include "framework/common/Mutex.hpp"
#include "http/detail/routes/FairQueue.hpp"
#include "http/detail/routes/Jobs.hpp"
#include "layers/OwnThread.hpp"

namespace velkor::http::detail {

/// A thread that does one job after the other: those that write before those that read, and among
/// them in turn those of each owner. Thread-safe; jobs run, and are destroyed, under no lock.
class Worker final : public Jobs {
public:
    /// Starts the thread; at most `most` jobs of each kind wait. Throws `std::system_error` when
    /// the system refuses.
    explicit Worker(std::size_t most);
    ~Worker() override { stop(); }

    Worker(const Worker&) = delete;
    Worker& operator=(const Worker&) = delete;

    /// Lets `job` of `owner` be done. Where too many wait, the newest job of whoever has the most
    /// waiting is destroyed instead, which may be this one, as all are once the thread has ended.
    void post(Kind kind, const std::string& owner, Job job) override VELKOR_EXCLUDES(mutex);

    /// Ends the thread once it has done the job it is at, for which it waits; those that wait are
    /// destroyed before. May be called several times, by one thread at a time, and not by a job.
    void stop() noexcept override VELKOR_EXCLUDES(mutex);

private:
    void run() VELKOR_EXCLUDES(mutex);
    Job nextJob() VELKOR_EXCLUDES(mutex);

    common::Mutex mutex;
    std::condition_variable changed;
    FairQueue writes VELKOR_GUARDED_BY(mutex);
    FairQueue reads VELKOR_GUARDED_BY(mutex);
    bool isStopping VELKOR_GUARDED_BY(mutex) = false;
    std::optional<layers::OwnThread> thread;  // the last member: it uses the others
};

}  // namespace velkor::http::detail
