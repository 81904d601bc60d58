#include "layers/etcd/detail/Outbox.hpp"

#include <algorithm>
#include <utility>

namespace velkor::layers::etcd {

using common::MutexLock;
using layers::detail::CommitWaiters;

namespace {

std::size_t sizeOf(const Write& write) {
    return sizeof write + write.key.size() + (write.text ? write.text->size() : 0);
}

std::size_t sizeOf(const Group& group) {
    std::size_t size = 0;
    for (const Write& write : group.writes) size += sizeOf(write);
    return size;
}

bool holds(const Group& group, const std::string& key) {
    return std::any_of(group.writes.begin(), group.writes.end(),
                       [&](const Write& write) { return write.key == key; });
}

}  // namespace

Outbox::Prepared Outbox::prepare(Write&& write) {
    Prepared prepared(1);
    Group& group = prepared.front();
    group.writes.push_back(std::move(write));
    group.writer = std::this_thread::get_id();
    group.accepted = std::chrono::steady_clock::now();
    return prepared;
}

bool Outbox::hasRoom() const {
    const MutexLock lock(mutex);
    return writes < mostWrites && bytes < mostBytes;
}

void Outbox::accept(Prepared&& write) noexcept {
    const MutexLock lock(mutex);
    ++writes;
    bytes += sizeOf(write.front());
    const bool isGrouped = openings > 0 && opener == std::this_thread::get_id();
    if (isGrouped && openNumber != 0) {
        auto& open = openGroup().writes;
        open.splice(open.end(), write.front().writes);
        return;
    }
    write.front().number = ++lastNumber;
    if (isGrouped) openNumber = lastNumber;
    groups.splice(groups.end(), write);
    if (!isGrouped) wakeUp.notify_one();
}

void Outbox::beginGroup() {
    const MutexLock lock(mutex);
    if (openings++ == 0) opener = std::this_thread::get_id();
}

void Outbox::endGroup() noexcept {
    const MutexLock lock(mutex);
    if (--openings > 0) return;
    openNumber = 0;
    wakeUp.notify_one();
}

Future<bool> Outbox::committed() {
    CommitWaiters::Question question;
    {
        const MutexLock lock(mutex);
        waiters.ask(question, groups.empty() ? std::nullopt : std::optional(lastNumber));
    }
    return question.answer();
}

std::size_t Outbox::count() const {
    const MutexLock lock(mutex);
    return writes;
}

void Outbox::end() noexcept {
    const MutexLock lock(mutex);
    ended = true;
    wakeUp.notify_one();
}

// Others may have written behind it.
Group& Outbox::openGroup() {
    return *std::find_if(groups.rbegin(), groups.rend(),
                         [open = openNumber](const Group& group) { return group.number == open; });
}

bool Outbox::isOpen(const Group& group) const {
    return openNumber != 0 && group.number == openNumber;
}

const Group* Outbox::overdue(std::chrono::steady_clock::time_point acceptedBefore) const {
    const MutexLock lock(mutex);
    if (groups.empty() || isOpen(groups.front())) return nullptr;
    return groups.front().accepted < acceptedBefore ? &groups.front() : nullptr;
}

const Group* Outbox::await() {
    MutexLock lock(mutex);
    while (!ended && (groups.empty() || isOpen(groups.front()))) lock.wait(wakeUp);
    return ended ? nullptr : &groups.front();
}

void Outbox::noteTaken(const Group& group, std::int64_t revision) {
    const MutexLock lock(mutex);
    for (Group& later : groups) {
        if (later.number <= group.number) continue;
        for (Write& write : later.writes) {
            if (!holds(group, write.key)) continue;
            write.seen.revision = std::max(write.seen.revision, revision);
        }
    }
}

// Whoever is told a reason has it alone then: it isn't under way here any more.
std::list<Group> Outbox::finish(std::exception_ptr refused) noexcept {
    CommitWaiters::Waiters satisfied;
    std::list<Group> finished;
    {
        const MutexLock lock(mutex);
        finished.splice(finished.end(), groups, groups.begin());
        const Group& group = finished.front();
        writes -= group.writes.size();
        bytes -= sizeOf(group);
        if (refused) noteRefusal(group, refused);
        satisfied = waiters.takeUpTo(group.number);
    }
    refused = nullptr;
    CommitWaiters::tell(std::move(satisfied));
    return finished;
}

// Without memory, those who don't wait aren't told.
void Outbox::noteRefusal(const Group& group, const std::exception_ptr& refused) noexcept {
    try {
        waiters.noteRefusal(group.writer, group.number, refused);
    } catch (...) {
        return;
    }
}

void Outbox::refuseAll(std::exception_ptr reason) noexcept {
    const auto groupsLeft = [this] {
        const MutexLock lock(mutex);
        return groups.size();
    };
    while (groupsLeft() > 1) finish(reason);
    if (groupsLeft() > 0) finish(std::move(reason));
}

}  // namespace velkor::layers::etcd
