#include "http/detail/transport/Acceptor.hpp"

#include <cerrno>
#include <chrono>
#include <system_error>
#include <utility>

#include "http/detail/Loggers.hpp"

namespace velkor::http::detail::transport {
namespace {

// The most clients that are taken before others get their turn.
constexpr int mostAtOnce = 32;

// How long nobody is taken when the system has no room for one.
constexpr std::chrono::milliseconds pauseTime{100};

}  // namespace

Acceptor::Acceptor(Loop& homeLoop, std::unique_ptr<ListeningSocket> listening, bool secure,
                   std::shared_ptr<Shared> sharedByAll, Choice choice)
    : home(homeLoop),
      shared(std::move(sharedByAll)),
      choose(std::move(choice)),
      isSecure(secure),
      socket(std::move(listening)),
      readable(*home.context(), socket->descriptor()),
      pauseTimer(*home.context()) {}

Acceptor::~Acceptor() {
    if (readable.is_open()) readable.release();  // the socket closes it
}

void Acceptor::close() noexcept {
    if (!socket) return;
    boost::system::error_code ignored;
    pauseTimer.cancel(ignored);
    readable.release();
    socket.reset();
}

void Acceptor::resume() {
    if (!socket || isAwaiting) return;
    readable.async_wait(
        boost::asio::posix::stream_descriptor::wait_read,
        [self = shared_from_this()](const boost::system::error_code&) { self->acceptAll(); });
    isAwaiting = true;
}

void Acceptor::acceptAll() {
    isAwaiting = false;
    if (!socket) return;
    for (int taken = 0; taken < mostAtOnce; ++taken) {
        Arrival arrival;
        const int error = socket->accept(arrival);
        if (error == EAGAIN) break;
        if (error == EMFILE || error == ENFILE || error == ENOMEM || error == ENOBUFS) {
            return pause(error);
        }
        // Otherwise it has gone already.
        if (error != 0) continue;
        isPaused = false;
        admit(std::move(arrival));
    }
    resume();
}

void Acceptor::admit(Arrival&& arrival) noexcept {
    arrival.secure = isSecure;
    TransportCounts& counts = *shared->counts;
    ++counts.connectionsAccepted;
    bool isRefused = false;
    try {
        Limits::Place place = shared->limits->connection(arrival.from.origin());
        isRefused = !place;
        choose().take(std::move(arrival), std::move(place));
    } catch (...) {
        isRefused = true;
    }
    if (isRefused) ++counts.connectionsRefused;
}

void Acceptor::pause(int error) {
    pauseTimer.expires_after(pauseTime);
    pauseTimer.async_wait(
        [self = shared_from_this()](const boost::system::error_code&) { self->acceptAll(); });
    isAwaiting = true;
    if (!std::exchange(isPaused, true)) {
        logger.write(common::warning,
                     "New connections have to wait: ", std::generic_category().message(error));
    }
}

}  // namespace velkor::http::detail::transport
