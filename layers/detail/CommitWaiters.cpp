#include "layers/detail/CommitWaiters.hpp"

#include <algorithm>
#include <utility>

namespace velkor::layers::detail {

CommitWaiters::Question::Question() : waiter(1), later(waiter.front().promise.getFuture()) {
    waiter.front().thread = std::this_thread::get_id();
}

Future<bool> CommitWaiters::Question::answer() {
    const bool isWaiting = waiter.empty();
    if (isWaiting) return std::move(later);
    if (refused) return makeFailedFuture<bool>(std::move(refused));
    return makeReadyFuture(true);
}

void CommitWaiters::ask(Question& question, std::optional<std::int64_t> lastWrite) noexcept {
    Waiter& asking = question.waiter.front();
    std::exception_ptr refused;
    const auto mine = untold.find(asking.thread);
    if (mine != untold.end()) {
        refused = std::move(mine->second);
        untold.erase(mine);
    }
    if (!lastWrite) {
        question.refused = std::move(refused);
        return;
    }
    asking.refused = std::move(refused);
    asking.upTo = *lastWrite;
    waiters.splice(waiters.end(), question.waiter);
}

void CommitWaiters::noteRefusal(std::thread::id thread, std::int64_t write,
                                const std::exception_ptr& reason) {
    bool isWaitedFor = false;
    for (Waiter& each : waiters) {
        if (each.upTo < write) continue;
        if (!each.refused) each.refused = reason;
        isWaitedFor = isWaitedFor || each.thread == thread;
    }
    if (!isWaitedFor) untold.try_emplace(thread, reason);
}

CommitWaiters::Waiters CommitWaiters::takeUpTo(std::int64_t write) noexcept {
    Waiters taken;
    const auto end = std::find_if(waiters.begin(), waiters.end(),
                                  [write](const Waiter& each) { return each.upTo > write; });
    taken.splice(taken.end(), waiters, waiters.begin(), end);
    return taken;
}

CommitWaiters::Waiters CommitWaiters::takeAll() noexcept {
    Waiters taken;
    taken.splice(taken.end(), waiters);
    return taken;
}

void CommitWaiters::refuse(Waiters& told, const std::exception_ptr& reason) noexcept {
    for (Waiter& each : told) {
        if (!each.refused) each.refused = reason;
    }
}

void CommitWaiters::tell(Waiters&& told) noexcept {
    Waiters gone;
    gone.splice(gone.end(), told);
    for (Waiter& each : gone) {
        try {
            if (each.refused) {
                each.promise.setException(std::move(each.refused));
            } else {
                each.promise.setValue(true);
            }
        } catch (...) {
            continue;
        }
    }
}

}  // namespace velkor::layers::detail
