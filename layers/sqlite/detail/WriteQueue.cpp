#include "layers/sqlite/detail/WriteQueue.hpp"

#include <algorithm>
#include <map>
#include <new>
#include <thread>
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

}  // namespace

void WriteQueue::Refusal::tell() noexcept {
    CommitWaiters::refuse(waiters, reason);
    reason = nullptr;
    CommitWaiters::tell(std::move(waiters));
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
    CommitWaiters::Question question;
    {
        const MutexLock lock(mutex);
        const bool isIdle = waiting.empty() && committing.empty();
        waiters.ask(question, isIdle ? std::nullopt : std::optional(lastChange));
    }
    return question.answer();
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
    CommitWaiters::Waiters satisfied;
    {
        const MutexLock lock(mutex);
        const std::int64_t upTo = committing.back().entry.change;
        done.swap(committing);
        bytes -= weight;
        expiryPostponedUntil = {};
        satisfied = waiters.takeUpTo(upTo);
    }
    CommitWaiters::tell(std::move(satisfied));
}

WriteQueue::Keys WriteQueue::takeBack(ValueTable* values, Refusal& refusal) {
    const MutexLock lock(mutex);
    waiting.splice(waiting.begin(), committing);
    Keys keys = keysOf(waiting);
    noteRefusal(refusal.reason);
    try {
        while (!waiting.empty()) {
            restore(values, waiting.back());
            bytes -= waiting.back().weight;
            waiting.pop_back();
        }
    } catch (const std::bad_alloc&) {
        return keys;
    }
    refusal.waiters = waiters.takeAll();
    refusal.isDone = true;
    return keys;
}

void WriteQueue::noteRefusal(const std::exception_ptr& reason) {
    std::map<std::thread::id, std::int64_t> refusedUpTo;
    for (const Write& write : waiting) refusedUpTo[write.writer] = write.entry.change;
    refusedUpTo.erase(std::thread::id());
    for (const auto& [thread, last] : refusedUpTo) waiters.noteRefusal(thread, last, reason);
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
