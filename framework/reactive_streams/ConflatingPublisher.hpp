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

    /// Keeps the one value in `added` in the place of the one with its key. Runs no code of the
    /// subscriber, so that it may be called with a lock held that gives the values their order.
    /// Does nothing once the stream has ended. Throws `std::bad_alloc`, and nothing has changed
    /// then.
    void keep(std::list<T> added) {
        std::list<T> replaced;
        this->stream.keep(added, replaced);
    }

    /// Delivers what is kept as far as there is demand, unless another call is about to. The caller
    /// holds a reference to the stream.
    void deliver() { this->drain(); }

private:
    using Base = QueuedPublisher<T, F, detail::NewestByKey<T, KeyOf>>;
};

}  // namespace velkor::reactive_streams
