#include "http/detail/routes/Worker.hpp"

#include <utility>

namespace velkor::http::detail {

Worker::Worker(std::size_t most) : writes(most), reads(most) {
    thread.emplace([this] { run(); });
}

void Worker::post(Kind kind, const std::string& owner, Job job) {
    std::optional<Job> dropped;
    {
        const common::MutexLock lock(mutex);
        if (isStopping) return;
        dropped = (kind == Kind::write ? writes : reads).push(owner, std::move(job));
    }
    changed.notify_one();
}

void Worker::stop() noexcept {
    {
        FairQueue droppedWrites(0);
        FairQueue droppedReads(0);
        const common::MutexLock lock(mutex);
        isStopping = true;
        std::swap(droppedWrites, writes);
        std::swap(droppedReads, reads);
    }
    changed.notify_one();
    thread.reset();
}

void Worker::run() {
    while (const Job job = nextJob()) job();
}

Worker::Job Worker::nextJob() {
    common::MutexLock lock(mutex);
    while (writes.empty() && reads.empty() && !isStopping) lock.wait(changed);
    if (isStopping) return nullptr;
    return writes.empty() ? reads.pop() : writes.pop();
}

}  // namespace velkor::http::detail
