#include "http/detail/routes/Worker.hpp"

#include <utility>

namespace velkor::http::detail {

Worker::Worker(std::size_t most) : mostWaiting(most) {
    thread.emplace([this] { run(); });
}

bool Worker::post(Job job) {
    {
        const common::MutexLock lock(mutex);
        if (isStopping || jobs.size() >= mostWaiting) return false;
        jobs.push_back(std::move(job));
    }
    changed.notify_one();
    return true;
}

void Worker::stop() noexcept {
    std::deque<Job> dropped;
    {
        const common::MutexLock lock(mutex);
        isStopping = true;
        dropped.swap(jobs);
    }
    changed.notify_one();
    thread.reset();
}

void Worker::run() {
    while (const Job job = nextJob()) job();
}

Worker::Job Worker::nextJob() {
    common::MutexLock lock(mutex);
    while (jobs.empty() && !isStopping) lock.wait(changed);
    if (jobs.empty()) return nullptr;
    Job first = std::move(jobs.front());
    jobs.pop_front();
    return first;
}

}  // namespace velkor::http::detail
