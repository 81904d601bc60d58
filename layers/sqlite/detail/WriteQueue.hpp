#pragma once

#include <chrono>
#include <condition_variable>
#include <cstddef>
#include <cstdint>
#include <exception>
#include <functional>
#include <optional>
#include <string>
#include <vector>

#include "configuration/sources/ValueTable.hpp"
#include "framework/Future.hpp"
#include "framework/common/Mutex.hpp"
#include "layers/detail/CommitWaiters.hpp"
#include "layers/sqlite/detail/Deadlines.hpp"
#include "layers/sqlite/detail/Write.hpp"

namespace velkor::layers::detail {

/// The writes that stand in the table of a source and not yet on the disk, and who waits for them.
///
/// Thread-safe. `accept`, `begin` and `takeBack` are called with the own mutex of the source
/// held, so that the order here is that of the table; the mutex of this is taken after it.
class WriteQueue {
public:
    /// As much waits at most: what is in the table and not on the disk is lost in a power cut, and
    /// takes memory.
    static constexpr std::size_t mostWrites = 100'000;
    static constexpr std::size_t mostBytes = 256U << 20U;

    using Keys = std::vector<std::string>;

    /// What the thread of the source does next.
    enum class Task { commit, expire, end };

    /// Writes that are to be taken back, and those who are to be told.
    struct Refusal {
        std::exception_ptr reason;
        bool isDone = false;
        CommitWaiters::Waiters waiters{};

        /// Fails what they wait for; the reason is theirs alone afterwards, if there are any.
        void tell() noexcept;
    };

    /// `newestChange` is the number of the last change on the disk.
    WriteQueue(std::int64_t newestChange, Deadlines::Map&& initialDeadlines);

    /// Whether one more of that weight may wait.
    bool hasRoomFor(std::size_t weight) const VELKOR_EXCLUDES(mutex);

    /// Lets a write wait, behind all others, and gives its number. Takes no memory. There is room.
    std::int64_t accept(PreparedWrite&& write) noexcept VELKOR_EXCLUDES(mutex);

    /// Resolves with true when all that waits is on the disk. Fails when some of it is refused, or
    /// when something was that this thread wrote since it last asked; in each case when nothing of
    /// it waits any more.
    Future<bool> committed() VELKOR_EXCLUDES(mutex);

    /// The change of that number, or the last one, if it waits.
    std::optional<JournalEntry> find(std::optional<std::int64_t> change) const
        VELKOR_EXCLUDES(mutex);

    /// Nothing is accepted any more, and nothing expires: what waits is the last to commit.
    void end() noexcept VELKOR_EXCLUDES(mutex);

    // What follows is for the thread of the source.

    /// Waits until there is something to do. `clock` tells the time; it is looked at every second
    /// at least while something is to expire, since it may be set.
    Task awaitTask(const std::function<Time()>& clock) VELKOR_EXCLUDES(mutex);

    /// Makes all that waits the batch that is to be written; there is none.
    void begin() noexcept VELKOR_EXCLUDES(mutex);

    /// What is being written. Changed by this thread alone.
    const Writes& batch() const noexcept { return committing; }

    /// The batch is on the disk: tells those who waited for it.
    void finish() VELKOR_EXCLUDES(mutex);

    /// Takes all that waits back, the last first, in `values` too unless that is null, until
    /// `refusal` is done or memory runs out; gives the keys of all. Throws `std::bad_alloc` when
    /// nothing could be done.
    Keys takeBack(configuration::ValueTable* values, Refusal& refusal) VELKOR_EXCLUDES(mutex);

    /// The keys whose values are to go at `now`.
    Keys due(Time now) VELKOR_EXCLUDES(mutex);

    /// Lets nothing expire for a while, or until something has been written: what can't be written
    /// isn't tried again and again.
    void postponeExpiry() noexcept VELKOR_EXCLUDES(mutex);

private:
    using Steady = std::chrono::steady_clock;

    void noteRefusal(const std::exception_ptr& reason) VELKOR_REQUIRES(mutex);
    void restore(configuration::ValueTable* values, const Write& write) VELKOR_REQUIRES(mutex);
    std::chrono::nanoseconds untilExpiry(Time now) const VELKOR_REQUIRES(mutex);

    mutable common::Mutex mutex;
    std::condition_variable wakeUp;
    Writes waiting VELKOR_GUARDED_BY(mutex);
    Writes committing;  // guarded too; the thread of the source reads it without, since it alone
                        // changes it
    std::size_t bytes VELKOR_GUARDED_BY(mutex) = 0;
    std::int64_t lastChange VELKOR_GUARDED_BY(mutex);
    CommitWaiters waiters VELKOR_GUARDED_BY(mutex);
    Deadlines deadlines VELKOR_GUARDED_BY(mutex);
    Steady::time_point expiryPostponedUntil VELKOR_GUARDED_BY(mutex){};
    bool ended VELKOR_GUARDED_BY(mutex) = false;
};

}  // namespace velkor::layers::detail
