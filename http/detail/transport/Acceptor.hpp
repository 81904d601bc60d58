#pragma once

#include <boost/asio/posix/stream_descriptor.hpp>
#include <boost/asio/steady_timer.hpp>
#include <functional>
#include <memory>

#include "http/detail/transport/ListeningSocket.hpp"
#include "http/detail/transport/Loop.hpp"
#include "http/detail/transport/Shared.hpp"

namespace velkor::http::detail::transport {

/// Takes the clients that come to one listening socket, on the thread of `home`, and hands them to
/// the loops. Out of descriptors or of memory it pauses.
class Acceptor : public std::enable_shared_from_this<Acceptor> {
public:
    /// The loop that serves the next client.
    using Choice = std::function<Loop&()>;

    /// For `home`, on whose thread the other members are called.
    Acceptor(Loop& home, std::unique_ptr<ListeningSocket> listening, bool secure,
             std::shared_ptr<Shared> sharedByAll, Choice choice);

    ~Acceptor();

    Acceptor(const Acceptor&) = delete;
    Acceptor& operator=(const Acceptor&) = delete;

    /// Waits for clients, unless it does so or has been closed. May throw `std::bad_alloc`, as may
    /// the handler of what it waits for: it is to be called again then.
    void resume();

    /// Takes no more clients and closes the socket.
    void close() noexcept;

private:
    void acceptAll();
    void admit(Arrival&& arrival) noexcept;
    void pause(int error);

    Loop& home;
    const std::shared_ptr<Shared> shared;
    const Choice choose;
    const bool isSecure;
    std::unique_ptr<ListeningSocket> socket;  // null: closed
    boost::asio::posix::stream_descriptor readable;
    boost::asio::steady_timer pauseTimer;
    bool isAwaiting = false;  // clients, or the end of a pause
    bool isPaused = false;    // since the last client
};

}  // namespace velkor::http::detail::transport
