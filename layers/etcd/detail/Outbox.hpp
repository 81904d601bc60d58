#pragma once

#include <chrono>
#include <condition_variable>
#include <cstddef>
#include <cstdint>
#include <exception>
#include <list>
#include <optional>
#include <string>
#include <thread>

#include "framework/Future.hpp"
#include "framework/common/Mutex.hpp"
#include "layers/detail/CommitWaiters.hpp"
#include "layers/etcd/detail/Requests.hpp"

namespace velkor::layers::etcd {

/// A write that stands in the table of a source and is to get to the server.
struct Write {
    std::string key;  ///< As the source knows it: without the prefix.
    std::optional<std::string> text{};
    KeyChange::Condition seen{};  ///< What the source knew of the key before.
};

/// Writes that are made together, in their order.
struct Group {
    std::int64_t number = 0;  ///< They grow; 0: it waits for nothing yet.
    std::list<Write> writes{};
    std::thread::id writer{};
    std::chrono::steady_clock::time_point accepted{};
};

/// The writes that wait for the server, and who waits for them.
///
/// Thread-safe. `accept` is called with the own mutex of the source held, so that the order here is
/// that of the table; the mutex of this is taken after it.
class Outbox {
public:
    /// As much waits at most.
    static constexpr std::size_t mostWrites = 100'000;
    static constexpr std::size_t mostBytes = 256U << 20U;

    /// A group of one write with all the memory that accepting it takes.
    using Prepared = std::list<Group>;
    static Prepared prepare(Write&& write);

    /// Whether one more may wait.
    bool hasRoom() const VELKOR_EXCLUDES(mutex);

    /// Lets a write wait, behind all others. Takes no memory.
    void accept(Prepared&& write) noexcept VELKOR_EXCLUDES(mutex);

    /// What this thread writes in between is one group.
    void beginGroup() VELKOR_EXCLUDES(mutex);
    void endGroup() noexcept VELKOR_EXCLUDES(mutex);

    /// Resolves with true when the server has taken all that waits. Fails when it hasn't taken some
    /// of it, or of what this thread wrote since it last asked.
    Future<bool> committed() VELKOR_EXCLUDES(mutex);

    std::size_t count() const VELKOR_EXCLUDES(mutex);

    /// Nothing more is sent.
    void end() noexcept VELKOR_EXCLUDES(mutex);

    // What follows is for the thread that writes.

    /// Waits for the next group and gives it; null when there will be none. It is that until it is
    /// finished.
    const Group* await() VELKOR_EXCLUDES(mutex);

    /// A group was taken in `revision`: what waits behind it has seen that.
    void noteTaken(const Group& group, std::int64_t revision) VELKOR_EXCLUDES(mutex);

    /// The next group if it was accepted before that and nothing more is to come to it, else null.
    const Group* overdue(std::chrono::steady_clock::time_point acceptedBefore) const
        VELKOR_EXCLUDES(mutex);

    /// Tells who waits for the group that the server has taken it, or why not. Gives the group,
    /// which is there no more. Runs continuations.
    std::list<Group> finish(std::exception_ptr refused) noexcept VELKOR_EXCLUDES(mutex);

    /// Finishes all that waits.
    void refuseAll(std::exception_ptr reason) noexcept VELKOR_EXCLUDES(mutex);

private:
    Group& openGroup() VELKOR_REQUIRES(mutex);
    bool isOpen(const Group& group) const VELKOR_REQUIRES(mutex);
    void noteRefusal(const Group& group, const std::exception_ptr& refused) noexcept
        VELKOR_REQUIRES(mutex);

    mutable common::Mutex mutex;
    std::condition_variable wakeUp;
    std::list<Group> groups VELKOR_GUARDED_BY(mutex);
    std::size_t writes VELKOR_GUARDED_BY(mutex) = 0;
    std::size_t bytes VELKOR_GUARDED_BY(mutex) = 0;
    std::int64_t lastNumber VELKOR_GUARDED_BY(mutex) = 0;
    std::size_t openings VELKOR_GUARDED_BY(mutex) = 0;
    std::thread::id opener VELKOR_GUARDED_BY(mutex){};
    std::int64_t openNumber VELKOR_GUARDED_BY(mutex) = 0;  // 0: the group has no write yet
    layers::detail::CommitWaiters waiters VELKOR_GUARDED_BY(mutex);
    bool ended VELKOR_GUARDED_BY(mutex) = false;
};

}  // namespace velkor::layers::etcd
