#pragma once

#include <boost/beast/core/flat_buffer.hpp>
#include <boost/beast/http/buffer_body.hpp>
#include <boost/beast/http/parser.hpp>

#include <array>
#include <chrono>
#include <cstddef>
#include <functional>
#include <memory>
#include <optional>
#include <string>

#include "layers/etcd/EtcdOptions.hpp"
#include "layers/etcd/detail/Answers.hpp"
#include "layers/etcd/detail/Endpoint.hpp"
#include "layers/etcd/detail/Link.hpp"
#include "layers/etcd/detail/Stop.hpp"

namespace velkor::layers::etcd {

/// A connection to the JSON gateway of one member. For one thread.
///
/// Everything throws `Unreachable` when the member can't be asked, doesn't answer by the deadline,
/// or answers what makes no sense or is too long; `Refused` when it refuses; `Stopped`.
class Gateway {
public:
    using Time = Link::Time;

    /// Connects, and authenticates the user if the options name one, by `deadline`.
    Gateway(const Endpoint& where, const EtcdOptions& how, const Stop& stop, Time deadline);

    /// Whether nothing has come that ends the connection.
    bool isUsable() { return !isBroken && !link.isDisturbed(); }

    /// The answer to `body`, posted to `path`. After anything but an answer the connection is of no
    /// use. `silence` is how long it may take from one part of the answer to the next.
    std::string ask(const char* path, const std::string& body, Time deadline,
                    std::chrono::milliseconds silence = std::chrono::hours(1));

private:
    friend class WatchStream;

    std::string header(const char* path, const std::string& length) const;
    void send(const std::string& text);
    std::string receive(Time deadline, std::chrono::milliseconds silence);
    void authenticate(Time deadline);

    const Endpoint& endpoint;
    const EtcdOptions& options;
    Link link;
    boost::beast::flat_buffer buffer;
    std::string token;
    bool isBroken = false;
};

/// The changes of the keys of a prefix, as a member tells them: takes a connection for itself.
///
/// The gateway answers a stream of requests with a stream of lines, both at once. It begins its
/// answer only between two reads of the request, hence the blanks that are sent until it has begun;
/// and it takes no request for endless whose length isn't given, hence the length that no request
/// reaches.
class WatchStream {
public:
    using Time = Link::Time;

    /// Asks for the changes from `revision` on. `gateway` is used by this alone from now on, and
    /// outlives it.
    WatchStream(Gateway& gateway, const std::string& prefix, std::int64_t revision, Time deadline);

    /// Asks for a sign of life, which comes as an answer without changes.
    void askForProgress();

    /// Calls `onAnswer` for each answer that has come by `deadline`, if any, in their order. Gives
    /// whether any bytes have come; what `onAnswer` throws passes on.
    bool receive(Time deadline, const std::function<void(WatchAnswer&&)>& onAnswer);

private:
    void readHeader(Time deadline);
    bool readSome(Time deadline);
    [[noreturn]] void refuse(Time deadline);

    Gateway& gateway;
    boost::beast::http::response_parser<boost::beast::http::buffer_body> parser;
    std::array<char, 65536> part{};
    std::string lines;
};

}  // namespace velkor::layers::etcd
