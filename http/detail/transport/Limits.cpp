#include "http/detail/transport/Limits.hpp"

#include <utility>

namespace velkor::http::detail::transport {
namespace {

// Clients beyond the limits that are told so at the same time; more are just closed.
constexpr std::size_t mostRefusals = 64;

}  // namespace

Limits::Limits(std::size_t connectionLimit, std::size_t originLimit, std::size_t streamLimit,
               std::shared_ptr<TransportCounts> countsToWrite)
    : connections(connectionLimit),
      connectionsOfOneOrigin(originLimit),
      streams(streamLimit),
      counts(std::move(countsToWrite)) {}

Limits::Place Limits::connection(const std::optional<Endpoint::Origin>& origin) {
    const common::MutexLock lock(mutex);
    if (counts->connectionsOpen >= connections) return {};
    if (origin) {
        std::size_t& ofOrigin = origins[*origin];
        if (ofOrigin >= connectionsOfOneOrigin) return {};
        ++ofOrigin;
    }
    ++counts->connectionsOpen;
    return {*this, Place::Kind::connection, origin};
}

Limits::Place Limits::refusal() {
    const common::MutexLock lock(mutex);
    if (refusals >= mostRefusals) return {};
    ++refusals;
    return {*this, Place::Kind::refusal, std::nullopt};
}

Limits::Place Limits::stream() {
    const common::MutexLock lock(mutex);
    if (counts->streamsOpen >= streams) return {};
    ++counts->streamsOpen;
    return {*this, Place::Kind::stream, std::nullopt};
}

void Limits::release(const Place& place) noexcept {
    const common::MutexLock lock(mutex);
    switch (place.kind) {
        case Place::Kind::refusal:
            --refusals;
            return;
        case Place::Kind::stream:
            --counts->streamsOpen;
            return;
        case Place::Kind::connection:
            --counts->connectionsOpen;
            if (!place.origin) return;
            const auto found = origins.find(*place.origin);
            if (--found->second == 0) origins.erase(found);
    }
}

Limits::Place::~Place() {
    reset();
}

Limits::Place::Place(Place&& other) noexcept
    : limits(std::move(other.limits)), kind(other.kind), origin(std::move(other.origin)) {}

Limits::Place& Limits::Place::operator=(Place&& other) noexcept {
    std::swap(limits, other.limits);
    std::swap(kind, other.kind);
    std::swap(origin, other.origin);
    return *this;
}

void Limits::Place::reset() noexcept {
    if (limits) limits->release(*this);
    limits.reset();
}

}  // namespace velkor::http::detail::transport
