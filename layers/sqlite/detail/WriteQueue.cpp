#include "layers/sqlite/detail/WriteQueue.hpp"

#include <algorithm>
#include <new>
#include <unordered_set>
#include <utility>

#include "layers/sqlite/detail/TableWrite.hpp"

namespace velkor::layers::detail {

using common::MutexLock;
using configuration::ValueTable;

namespace {

constexpr std::chrono::seconds expiryPause{5};
constexpr std::chrono::seconds longestSleep{1};

std::size_t totalWeight(const Writes& writes) {
    std::size_t weight = 0;
    for (const Write& write : writes) weight += write.weight;
    return weight;
}

const Write* findIn(const Writes& writes, std::int64_t change) {
    const auto found = std::find_if(writes.begin(), writes.end(), [change](const Write& write) {
        return write.entry.change == change;
    });
    return found == writes.end() ? nullptr : &*found;
}

WriteQueue::Keys keysOf(const Writes& writes) {
    WriteQueue::Keys keys;
    std::unordered_set<std::string> seen;
    for (const Write& write : writes) {
        if (seen.insert(write.entry.key).second) keys.push_back(write.entry.key);
    }
    return keys;
}

/// Runs `resolve` on each waiter. A promise for which memory is short is broken, which its future
/// tells as well.
template <class Resolve>
void tellAll(WriteQueue::Waiters& waiters, Resolve resolve) noexcept {
    for (WriteQueue::Waiter& each : waiters) {
        try {
            resolve(each);
        } catch (...) {
            continue;
        }
    }
}

}  // namespace

void WriteQueue::Refusal::tell() noexcept {
    tellAll(waiters, [this](Waiter& each) {
        const bool isLast = &each == &waiters.back();
        each.promise.setException(isLast ? std::move(reason) : reason);
    });
}

WriteQueue::WriteQueue(std::int64_t newestChange, Deadlines::Map&& initialDeadlines)
    : lastChange(newestChange), deadlines(std::move(initialDeadlines)) {}

bool WriteQueue::hasRoomFor(std::size_t weight) const {
    const MutexLock lock(mutex);
    const std::size_t count = waiting.size() + committing.size();
    return count == 0 || (count < mostWrites && weight <= mostBytes - std::min(bytes, mostBytes));
}

std::int64_t WriteQueue::accept(PreparedWrite&& write) noexcept {
    const MutexLock lock(mutex);
    Write& accepted = write.write();
    accepted.entry.change = ++lastChange;
    accepted.expiredBefore = deadlines.replace(accepted.entry.key, std::move(write.deadline));
    bytes += accepted.weight;
    waiting.splice(waiting.end(), write.element);
    wakeUp.notify_one();
    return lastChange;
}

Future<bool> WriteQueue::committed() {
    Waiters waiter(1);
    auto future = waiter.front().promise.getFuture();
    const auto thread = std::this_thread::get_id();
    std::exception_ptr refused;
    {
        const MutexLock lock(mutex);
        const auto mine = untold.find(thread);
        if (mine != untold.end()) {
            refused = mine->second;
            untold.erase(mine);
        }
        if (!waiting.empty() || !committing.empty()) {
            waiter.front().refused = refused;
            waiter.front().upTo = lastChange;
            waiter.front().thread = thread;
            waiters.splice(waiters.end(), waiter);
            return future;
        }
    }
    if (refused) return makeFailedFuture<bool>(refused);
    return makeReadyFuture(true);
}

std::optional<JournalEntry> WriteQueue::find(std::optional<std::int64_t> change) const {
    const MutexLock lock(mutex);
    const std::int64_t wanted = change.value_or(lastChange);
    const Write* found = findIn(waiting, wanted);
    if (found == nullptr) found = findIn(committing, wanted);
    return found == nullptr ? std::nullopt : std::optional(found->entry);
}

void WriteQueue::end() noexcept {
    const MutexLock lock(mutex);
    ended = true;
    wakeUp.notify_one();
}

WriteQueue::Task WriteQueue::awaitTask(const std::function<Time()>& clock) {
    MutexLock lock(mutex);
    for (;;) {
        if (ended) return waiting.empty() ? Task::end : Task::commit;
        const auto left = untilExpiry(clock());
        if (left <= left.zero()) return Task::expire;
        if (!waiting.empty()) return Task::commit;
        if (deadlines.next()) {
            lock.waitFor(wakeUp, left);
        } else {
            lock.wait(wakeUp);
        }
    }
}

// How long to sleep at most before something expires.
std::chrono::nanoseconds WriteQueue::untilExpiry(Time now) const {
    const auto next = deadlines.next();
    if (!next) return longestSleep;
    const auto postponed = expiryPostponedUntil - Steady::now();
    const auto left = *next > now + longestSleep ? longestSleep : *next - now;
    return std::min<std::chrono::nanoseconds>(longestSleep, std::max(left, postponed));
}

void WriteQueue::begin() noexcept {
    const MutexLock lock(mutex);
    committing.splice(committing.end(), waiting);
}

void WriteQueue::finish() {
    const std::size_t weight = totalWeight(committing);
    Writes done;
    Waiters satisfied;
    {
        const MutexLock lock(mutex);
        const std::int64_t upTo = committing.back().entry.change;
        done.swap(committing);
        bytes -= weight;
        expiryPostponedUntil = {};
        const auto end = std::find_if(waiters.begin(), waiters.end(),
                                      [upTo](const Waiter& each) { return each.upTo > upTo; });
        satisfied.splice(satisfied.end(), waiters, waiters.begin(), end);
    }
    tellAll(satisfied, [](Waiter& each) {
        if (each.refused) return each.promise.setException(each.refused);
        each.promise.setValue(true);
    });
}

WriteQueue::Keys WriteQueue::takeBack(ValueTable* values, Refusal& refusal) {
    const MutexLock lock(mutex);
    waiting.splice(waiting.begin(), committing);
    Keys keys = keysOf(waiting);
    noteWhoIsToBeTold(refusal);
    try {
        while (!waiting.empty()) {
            restore(values, waiting.back());
            bytes -= waiting.back().weight;
            waiting.pop_back();
        }
    } catch (const std::bad_alloc&) {
        return keys;
    }
    refusal.waiters.splice(refusal.waiters.end(), waiters);
    refusal.isDone = true;
    return keys;
}

// A thread that waits is told thereby of what it wrote before.
void WriteQueue::noteWhoIsToBeTold(const Refusal& refusal) {
    std::map<std::thread::id, std::int64_t> refusedUpTo;
    for (const Write& write : waiting) refusedUpTo[write.writer] = write.entry.change;
    refusedUpTo.erase(std::thread::id());
    for (const Waiter& each : waiters) {
        const auto found = refusedUpTo.find(each.thread);
        if (found != refusedUpTo.end() && found->second <= each.upTo) refusedUpTo.erase(found);
    }
    for (const auto& each : refusedUpTo) untold[each.first] = refusal.reason;
}

void WriteQueue::restore(ValueTable* values, const Write& write) {
    deadlines.put(write.entry.key, write.expiredBefore);
    if (values != nullptr) putBack(*values, write);
}

WriteQueue::Keys WriteQueue::due(Time now) {
    const MutexLock lock(mutex);
    return deadlines.due(now);
}

void WriteQueue::postponeExpiry() noexcept {
    const MutexLock lock(mutex);
    expiryPostponedUntil = Steady::now() + expiryPause;
}

}  // namespace velkor::layers::detail
