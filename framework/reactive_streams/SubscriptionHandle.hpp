#pragma once

#include <atomic>
#include <cstdint>
#include <memory>

#include "framework/common/Export.hpp"
#include "framework/common/Mutex.hpp"
#include "framework/reactive_streams/Subscription.hpp"

namespace velkor::reactive_streams {

/// What a `SubscriptionHandle` and the subscriber that it belongs to share: the way to the
/// subscription, and whether it was given up. Keeps neither publisher nor subscriber alive.
/// Thread-safe; the subscription is called without the mutex.
class VELKOR_EXPORT SubscriptionLink {
public:
    /// Connects to `opened` and says whether it may be used. A subscription that comes after
    /// `cancel`, or second, is cancelled instead.
    bool open(std::weak_ptr<Subscription> opened) VELKOR_EXCLUDES(mutex);

    /// Asks the subscription for `n` more values; does nothing when it is gone.
    void request(std::uint64_t n) VELKOR_EXCLUDES(mutex);

    /// Cancels the subscription, now or as soon as it is opened. A second call does nothing.
    void cancel() VELKOR_EXCLUDES(mutex);

    /// The stream has ended by itself: lets the subscription go without a call.
    void close() VELKOR_EXCLUDES(mutex);

    /// Whether `cancel` was called.
    bool isCancelled() const noexcept { return cancelled; }

private:
    std::shared_ptr<Subscription> find() VELKOR_EXCLUDES(mutex);

    common::Mutex mutex;
    std::weak_ptr<Subscription> subscription VELKOR_GUARDED_BY(mutex);
    bool isOpen VELKOR_GUARDED_BY(mutex) = false;
    std::atomic<bool> cancelled{false};
};

/// Owns the wish to be told: cancels its subscription when it is destroyed. Move-only.
///
/// May be destroyed anywhere, inside a callback of its own subscriber too: no further callback
/// begins on that thread. Destroying it does not wait for callbacks: one that another thread has
/// begun, or is about to make, may still be running afterwards. Cancelling ends the stream, which
/// for a watch of the store waits for the store's mutex: hold no lock that a subscriber needs.
///
/// One handle is used by one thread at a time.
class VELKOR_EXPORT SubscriptionHandle {
public:
    /// A handle on nothing.
    SubscriptionHandle() noexcept = default;

    /// A handle on the subscription behind `sharedLink`. For use by subscribers.
    explicit SubscriptionHandle(std::shared_ptr<SubscriptionLink> sharedLink) noexcept;

    SubscriptionHandle(SubscriptionHandle&& other) noexcept = default;

    /// Takes over the subscription of `other`; the one held before is cancelled.
    SubscriptionHandle& operator=(SubscriptionHandle&& other) noexcept;

    /// Cancels. What the publisher's end-of-stream hook throws is dropped here.
    ~SubscriptionHandle();

    /// Cancels now, and passes on what the publisher's end-of-stream hook throws. Does nothing on a
    /// handle that is empty or was cancelled, and on a stream that has ended.
    void cancel();

private:
    std::shared_ptr<SubscriptionLink> link;
};

}  // namespace velkor::reactive_streams
