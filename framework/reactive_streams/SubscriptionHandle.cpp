#include "framework/reactive_streams/SubscriptionHandle.hpp"

#include <utility>

namespace velkor::reactive_streams {

bool SubscriptionLink::open(std::weak_ptr<Subscription> opened) {
    {
        const common::MutexLock lock(mutex);
        if (!isOpen && !cancelled) {
            isOpen = true;
            subscription = std::move(opened);
            return true;
        }
    }
    if (const auto refused = opened.lock()) refused->cancel();
    return false;
}

void SubscriptionLink::request(std::uint64_t n) {
    if (const auto opened = find()) opened->request(n);
}

void SubscriptionLink::cancel() {
    // Whoever opens the link meanwhile either sees this or is found.
    if (cancelled.exchange(true)) return;
    if (const auto opened = find()) opened->cancel();
}

void SubscriptionLink::close() {
    const common::MutexLock lock(mutex);
    subscription.reset();
}

std::shared_ptr<Subscription> SubscriptionLink::find() {
    const common::MutexLock lock(mutex);
    return subscription.lock();
}

SubscriptionHandle::SubscriptionHandle(std::shared_ptr<SubscriptionLink> sharedLink) noexcept
    : link(std::move(sharedLink)) {}

SubscriptionHandle& SubscriptionHandle::operator=(SubscriptionHandle&& other) noexcept {
    SubscriptionHandle taken(std::move(other));
    link.swap(taken.link);
    return *this;
}

SubscriptionHandle::~SubscriptionHandle() {
    try {
        cancel();
    } catch (...) {
        return;
    }
}

void SubscriptionHandle::cancel() {
    // The callback that is destroyed with its subscriber may own this handle.
    if (const auto shared = std::move(link)) shared->cancel();
}

}  // namespace velkor::reactive_streams
