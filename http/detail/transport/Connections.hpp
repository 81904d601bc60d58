#pragma once

#include <memory>

#include "http/detail/transport/Limits.hpp"
#include "http/detail/transport/ListeningSocket.hpp"
#include "http/detail/transport/Peer.hpp"
#include "http/detail/transport/Shared.hpp"

namespace velkor::http::detail::transport {

class Loop;

/// A connection of `loop`, in plain text or through TLS, for a client that has come; without a
/// `place` it tells only that there are too many. May throw `std::bad_alloc`.
std::shared_ptr<Peer> plainConnection(Loop& loop, std::shared_ptr<Shared> shared, Arrival&& arrival,
                                      Limits::Place&& place);
std::shared_ptr<Peer> tlsConnection(Loop& loop, std::shared_ptr<Shared> shared, Arrival&& arrival,
                                    Limits::Place&& place);

}  // namespace velkor::http::detail::transport
