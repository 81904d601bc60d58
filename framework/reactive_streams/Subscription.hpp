#pragma once

#include <cstdint>

#include "framework/common/Export.hpp"

namespace velkor::reactive_streams {

/// The link between one publisher and its subscriber, through which the subscriber asks for values
/// and ends the stream. Owned by the publisher; the subscriber holds a weak reference.
class VELKOR_EXPORT Subscription {
public:
    virtual ~Subscription();

    /// Asks for `n` more values; they may be delivered before this call returns. Demand adds up to
    /// at most 2^64 - 1, which stands for "all there will ever be". A request of 0 adds nothing.
    /// What the subscriber throws while it is served passes on to the caller.
    virtual void request(std::uint64_t n) = 0;

    /// Ends the stream without a further signal to the subscriber. A second call does nothing.
    virtual void cancel() = 0;
};

}  // namespace velkor::reactive_streams
