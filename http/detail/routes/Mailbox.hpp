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

/// When a `Mailbox` asks for the next value, one at a time in any case.
enum class Asking {
    always,     ///< As soon as it has one, which the next one replaces.
    whenTaken,  ///< When the one that was taken is done with; the publisher keeps the others.
};

/// Holds one value of a stream until it is taken. One thread takes, any other delivers: whoever
/// changes the store does not wait for whoever shows it. Calls nobody under its mutex.
template <class T>
class Mailbox final : public reactive_streams::Subscriber<T> {
public:
    /// A mailbox that calls `whenReady`, from any thread, when there is something to take, or the
    /// stream is over, after `take` gave nothing, and for the first value.
    Mailbox(Asking whenAsking, std::function<void()> whenReady)
        : asking(whenAsking), onReady(std::move(whenReady)) {}

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
        if (asking == Asking::always) request(source);
        if (wake) onReady();
    }

    void onComplete() override { end(); }
    void onError(const std::exception_ptr&) override { end(); }

    /// The value, if there is one; says that the one before is done with.
    std::optional<T> take() VELKOR_EXCLUDES(mutex) {
        if (std::exchange(owesRequest, false)) request(link());
        const common::MutexLock lock(mutex);
        isAwaited = !value && !isEnded;
        owesRequest = asking == Asking::whenTaken && value;
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
        if (const auto open = link().lock()) open->cancel();
    }

private:
    static void request(const std::weak_ptr<reactive_streams::Subscription>& source) {
        if (const auto open = source.lock()) open->request(1);
    }

    std::weak_ptr<reactive_streams::Subscription> link() const VELKOR_EXCLUDES(mutex) {
        const common::MutexLock lock(mutex);
        return subscription;
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

    const Asking asking;
    const std::function<void()> onReady;
    bool owesRequest = false;  // of the thread that takes
    mutable common::Mutex mutex;
    std::weak_ptr<reactive_streams::Subscription> subscription VELKOR_GUARDED_BY(mutex);
    std::optional<T> value VELKOR_GUARDED_BY(mutex);
    std::uint64_t conflated VELKOR_GUARDED_BY(mutex) = 0;
    bool isAwaited VELKOR_GUARDED_BY(mutex) = true;
    bool isEnded VELKOR_GUARDED_BY(mutex) = false;
};

}  // namespace velkor::http::detail
