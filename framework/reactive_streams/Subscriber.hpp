#pragma once

#include <exception>
#include <memory>

#include "framework/reactive_streams/Subscription.hpp"

namespace velkor::reactive_streams {

/// What a consumer of a stream implements.
///
/// The publisher promises: `onSubscribe` first and once; values only as far as they were requested;
/// at most one of `onComplete` and `onError`, and no value that is published after it; no lock of
/// the publisher held during any call. A value that another thread is delivering when the stream
/// ends may still come. Every method may call `request` and `cancel` on the subscription.
/// The implementer keeps the subscription weakly and expects calls on whatever thread publishes.
template <class T>
class Subscriber {
public:
    virtual ~Subscriber() = default;

    /// The stream is open. Nothing is delivered until the subscription is asked for values.
    virtual void onSubscribe(std::weak_ptr<Subscription> subscription) = 0;

    /// The stream has ended normally.
    virtual void onComplete() = 0;

    /// A value that the publisher keeps. Copies it and passes the copy on unless overridden.
    /// A subscriber that overrides only the other overload says `using Subscriber::onNext`.
    virtual void onNext(const T& value) { onNext(T(value)); }

    /// A value that is the subscriber's to keep.
    virtual void onNext(T&& value) = 0;

    /// The stream has failed with `error`, which is not null.
    virtual void onError(const std::exception_ptr& error) = 0;
};

}  // namespace velkor::reactive_streams
