#include "http/detail/routes/PendingChanges.hpp"

#include <list>
#include <utility>

namespace velkor::http::detail {

PendingChanges::PendingChanges(std::string keyPrefix, std::size_t most)
    : prefix(std::move(keyPrefix)), mostKeys(most) {}

void PendingChanges::start(std::function<void()> whenReady) {
    auto ready = std::make_shared<const std::function<void()>>(std::move(whenReady));
    bool isDue = false;
    {
        const common::MutexLock lock(mutex);
        onReady = std::move(ready);
        isDue = isEnded || !queue.empty();
    }
    if (isDue) wake();
}

bool PendingChanges::add(const SharedChange& change) {
    if (change->key.compare(0, prefix.size(), prefix) != 0) return true;
    std::list<SharedChange> added{change};
    std::list<SharedChange> dropped;
    bool isOpen = true;
    {
        const common::MutexLock lock(mutex);
        if (isEnded) return false;
        queue.push(added, dropped);
        conflated += dropped.size();
        count += 1;
        count -= dropped.size();
        if (count > mostKeys) {
            isEnded = true;
            isOpen = false;
            dropped = queue.takeAll();
            count = 0;
        }
    }
    wake();
    return isOpen;
}

void PendingChanges::end() {
    {
        const common::MutexLock lock(mutex);
        isEnded = true;
    }
    wake();
}

void PendingChanges::abandon() {
    std::shared_ptr<const std::function<void()>> released;
    const common::MutexLock lock(mutex);
    isEnded = true;
    onReady.swap(released);
}

SharedChange PendingChanges::take() {
    const common::MutexLock lock(mutex);
    if (queue.empty()) {
        isAwaited = !isEnded;
        return nullptr;
    }
    --count;
    return std::move(queue.takeFirst().front());
}

bool PendingChanges::isOver() const {
    const common::MutexLock lock(mutex);
    return isEnded && queue.empty();
}

std::uint64_t PendingChanges::takeConflated() {
    const common::MutexLock lock(mutex);
    return std::exchange(conflated, 0);
}

void PendingChanges::wake() {
    std::shared_ptr<const std::function<void()>> ready;
    {
        const common::MutexLock lock(mutex);
        if (onReady == nullptr || !std::exchange(isAwaited, false)) return;
        ready = onReady;
    }
    (*ready)();
}

}  // namespace velkor::http::detail
