#pragma once

#include <list>
#include <memory>
#include <utility>

#include "framework/reactive_streams/QueuedPublisher.hpp"

namespace velkor::reactive_streams {

/// A stream for exactly one subscriber that keeps the newest undelivered value of each key until
/// the subscriber asks, the key that has waited longest first; see `QueuedPublisher`. A slow
/// subscriber misses values in between and none that is the last of its key. `KeyOf` gives the key
/// of a value as a `const std::string&`, without throwing.
///
/// Deliveries never overlap and never nest: values of one key arrive in the order in which they
/// were kept.
template <class T, class KeyOf, class F>
class ConflatingPublisher final : public QueuedPublisher<T, F, detail::NewestByKey<T, KeyOf>> {
public:
    /// A stream without a subscriber.
    explicit ConflatingPublisher(F hook) : Base(detail::NewestByKey<T, KeyOf>(), std::move(hook)) {}

    /// Keeps `value` in the place of the one with its key. Runs no code of the subscriber, so that
    /// it may be called with a lock held that gives the values their order. Does nothing once the
    /// stream has ended. Throws `std::bad_alloc`, and nothing has changed then.
    void keep(T value) {
        std::list<T> added;
        added.push_back(std::move(value));
        std::list<T> replaced;
        this->stream.keep(added, replaced);
    }

    /// Delivers what is kept as far as there is demand, unless another call is about to.
    void deliver() {
        const auto keepAlive = this->weak_from_this().lock();
        this->drain();
    }

private:
    using Base = QueuedPublisher<T, F, detail::NewestByKey<T, KeyOf>>;
};

}  // namespace velkor::reactive_streams
