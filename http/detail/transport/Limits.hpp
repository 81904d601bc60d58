#pragma once

#include <cstddef>
#include <map>
#include <memory>
#include <optional>

#include "framework/common/Mutex.hpp"
#include "http/detail/Exchange.hpp"
#include "http/detail/transport/Endpoint.hpp"

namespace velkor::http::detail::transport {

/// How many connections and streams there may be. Thread-safe.
class Limits : public std::enable_shared_from_this<Limits> {
public:
    /// No limit is 0. Writes `connectionsOpen` and `streamsOpen` of `counts`.
    Limits(std::size_t connections, std::size_t connectionsOfOneOrigin, std::size_t streams,
           std::shared_ptr<TransportCounts> counts);

    /// A place that is given back with this object.
    class Place {
    public:
        Place() = default;
        ~Place();
        Place(Place&& other) noexcept;
        Place& operator=(Place&& other) noexcept;

        Place(const Place&) = delete;
        Place& operator=(const Place&) = delete;

        explicit operator bool() const noexcept { return limits != nullptr; }

        /// Gives it back now.
        void reset() noexcept;

    private:
        friend class Limits;
        enum class Kind { connection, refusal, stream };
        Place(Limits& giving, Kind ofWhat, std::optional<Endpoint::Origin> from)
            : limits(giving.shared_from_this()), kind(ofWhat), origin(from) {}

        std::shared_ptr<Limits> limits;
        Kind kind = Kind::connection;
        std::optional<Endpoint::Origin> origin;
    };

    /// A place for a connection from `origin`; none if there are too many. May throw
    /// `std::bad_alloc`.
    Place connection(const std::optional<Endpoint::Origin>& origin);

    /// A place for telling one more client that there are too many; none if that is done for many
    /// at once already.
    Place refusal();

    /// A place for an event stream; none if there are too many.
    Place stream();

private:
    void release(const Place& place) noexcept;

    const std::size_t connections;
    const std::size_t connectionsOfOneOrigin;
    const std::size_t streams;
    const std::shared_ptr<TransportCounts> counts;

    common::Mutex mutex;
    std::map<Endpoint::Origin, std::size_t> origins VELKOR_GUARDED_BY(mutex);
    std::size_t refusals VELKOR_GUARDED_BY(mutex) = 0;
};

}  // namespace velkor::http::detail::transport
