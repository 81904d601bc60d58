#pragma once

#include <cstdint>
#include <exception>
#include <functional>
#include <memory>
#include <optional>
#include <utility>

#include "framework/common/Mutex.hpp"
#include "framework/reactive_streams/Subscriber.hpp"
#include "framework/reactive_streams/Subscription.hpp"

namespace velkor::http::detail {

/// Holds one value of a stream until it is taken or a newer one replaces it: asks for the next one,
/// one at a time, as soon as it has one. One thread takes, any other delivers: whoever changes the
/// store does not wait for whoever shows it. Calls nobody under its mutex.
template <class T>
class Mailbox final : public reactive_streams::Subscriber<T> {
public:
    /// A mailbox that calls `whenReady`, from any thread, when there is something to take, or the
    /// stream is over, after `take` gave nothing, and for the first value.
    explicit Mailbox(std::function<void()> whenReady) : onReady(std::move(whenReady)) {}

    using reactive_streams::Subscriber<T>::onNext;

    void onSubscribe(std::weak_ptr<reactive_streams::Subscription> opened) override {
        {
            const common::MutexLock lock(mutex);
            subscription = opened;
        }
        request(opened);
    }

    void onNext(T&& newer) override {
        std::optional<T> replaced(std::move(newer));
        bool wake = false;
        std::weak_ptr<reactive_streams::Subscription> source;
        {
            const common::MutexLock lock(mutex);
            value.swap(replaced);
            if (replaced) ++conflated;
            wake = std::exchange(isAwaited, false);
            source = subscription;
        }
        request(source);
        if (wake) onReady();
    }

    void onComplete() override { end(); }
    void onError(const std::exception_ptr&) override { end(); }

    /// The value, if there is one.
    std::optional<T> take() VELKOR_EXCLUDES(mutex) {
        const common::MutexLock lock(mutex);
        isAwaited = !value && !isEnded;
        return std::exchange(value, std::nullopt);
    }

    /// Whether the stream has ended and its last value was taken.
    bool isOver() const VELKOR_EXCLUDES(mutex) {
        const common::MutexLock lock(mutex);
        return isEnded && !value;
    }

    /// How many values were replaced before they were taken, since the last call.
    std::uint64_t takeConflated() VELKOR_EXCLUDES(mutex) {
        const common::MutexLock lock(mutex);
        return std::exchange(conflated, 0);
    }

    /// Ends the stream. Waits for what the publisher waits for then.
    void cancel() VELKOR_EXCLUDES(mutex) {
        std::weak_ptr<reactive_streams::Subscription> source;
        {
            const common::MutexLock lock(mutex);
            source = subscription;
        }
        if (const auto open = source.lock()) open->cancel();
    }

private:
    static void request(const std::weak_ptr<reactive_streams::Subscription>& source) {
        if (const auto open = source.lock()) open->request(1);
    }

    void end() VELKOR_EXCLUDES(mutex) {
        bool wake = false;
        {
            const common::MutexLock lock(mutex);
            isEnded = true;
            wake = std::exchange(isAwaited, false);
        }
        if (wake) onReady();
    }

    const std::function<void()> onReady;
    mutable common::Mutex mutex;
    std::weak_ptr<reactive_streams::Subscription> subscription VELKOR_GUARDED_BY(mutex);
    std::optional<T> value VELKOR_GUARDED_BY(mutex);
    std::uint64_t conflated VELKOR_GUARDED_BY(mutex) = 0;
    bool isAwaited VELKOR_GUARDED_BY(mutex) = true;
    bool isEnded VELKOR_GUARDED_BY(mutex) = false;
};

}  // namespace velkor::http::detail
