#pragma once

#include <cstdint>
#include <list>
#include <utility>

#include "framework/reactive_streams/QueuedPublisher.hpp"

namespace velkor::reactive_streams {

/// A stream for exactly one subscriber that keeps the newest undelivered values, as many as its
/// capacity allows, until the subscriber asks; see `QueuedPublisher`.
///
/// Deliveries are not serialised: a value that is published while the subscriber waits is handed
/// straight to it, from inside `onNext` or beside another delivery.
template <class T, class F>
class CachedValuePublisher final : public QueuedPublisher<T, F, detail::NewestValues<T>> {
public:
    /// A stream without a subscriber. Throws `std::invalid_argument` "A publisher needs a capacity
    /// of at least 1." when `mostKept` is 0.
    CachedValuePublisher(std::uint64_t mostKept, F hook)
        : Base(detail::NewestValues<T>(mostKept), std::move(hook)) {}

    /// Delivers a copy of `value` at once when the subscriber waits for one, else keeps it,
    /// dropping the oldest kept ones beyond the capacity. Does nothing once the stream has ended.
    void publish(const T& value) {
        std::list<T> dropped;
        T copy(value);
        if (const auto waiting = this->stream.keepUnlessAwaited(copy, dropped)) {
            return waiting->onNext(std::move(copy));
        }
        const auto keepAlive = this->weak_from_this().lock();
        this->drain();
    }

    /// Keeps a copy of `value` as the first one unless something is kept already, which is newer:
    /// for a value that was read before others could publish. Called before there is a subscriber.
    void publishFirst(const T& value) {
        std::list<T> first;
        first.push_back(value);
        this->stream.keepFirst(first);
    }

private:
    using Base = QueuedPublisher<T, F, detail::NewestValues<T>>;
};

}  // namespace velkor::reactive_streams
