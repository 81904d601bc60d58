#pragma once

#include <memory>

#include "framework/Future.hpp"
#include "framework/common/Export.hpp"
#include "framework/reactive_streams/Subscriber.hpp"

namespace velkor::reactive_streams {

/// A stream, whatever it carries.
class VELKOR_EXPORT Publisher {
public:
    virtual ~Publisher();

    /// Settles when the stream ends: true when it completed, false when the subscriber cancelled,
    /// the error when it failed. May be called once; a second call throws `std::runtime_error`
    /// "Promise already returned a future.".
    virtual Future<bool> getCompletionFuture() = 0;
};

/// A stream of `T`.
template <class T>
class PublisherAPI : public Publisher {
public:
    /// Opens the stream for `subscriber`, which the publisher then shares.
    virtual void subscribe(std::shared_ptr<Subscriber<T>> subscriber) = 0;
};

}  // namespace velkor::reactive_streams
