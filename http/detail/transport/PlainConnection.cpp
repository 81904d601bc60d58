#include <boost/asio/generic/stream_protocol.hpp>
#include <memory>
#include <utility>

#include "http/detail/transport/Connection.hpp"
#include "http/detail/transport/Connections.hpp"

namespace velkor::http::detail::transport {
namespace {

using Error = boost::system::error_code;

/// Bytes as they are, through TCP or a unix socket.
class PlainWire {
public:
    PlainWire(Loop::Context& context, Arrival&& arrival, const Shared& /*shared*/)
        : socket(context, {arrival.from.family(), 0}, arrival.socket.get()) {
        arrival.socket.release();
    }

    /// Does what comes before the first byte.
    template <class Next>
    void greet(const Next& next) {
        next(Error());
    }

    template <class Buffer, class Next>
    void readSome(const Buffer& buffer, Next&& next) {
        socket.async_read_some(buffer, std::forward<Next>(next));
    }

    template <class Buffer, class Next>
    void writeSome(const Buffer& buffer, Next&& next) {
        socket.async_write_some(buffer, std::forward<Next>(next));
    }

    /// Goes on when the client sends something or goes. Needs no buffer meanwhile.
    template <class Next>
    void awaitClient(Next&& next) {
        socket.async_wait(Socket::wait_read, std::forward<Next>(next));
    }

    /// Tells the client, if the wire has words for it, that nothing more comes.
    template <class Next>
    void sayEnd(const Next& next) {
        next(Error());
    }

    /// Reads what is beneath the wire.
    template <class Buffer, class Next>
    void readRaw(const Buffer& buffer, Next&& next) {
        readSome(buffer, std::forward<Next>(next));
    }

    void endWriting() noexcept {
        Error ignored;
        socket.shutdown(Socket::shutdown_send, ignored);
    }

    /// Gives up the operations that are under way.
    void cancel() noexcept {
        Error ignored;
        socket.cancel(ignored);
    }

    void close() noexcept {
        Error ignored;
        socket.close(ignored);
    }

private:
    using Socket = boost::asio::generic::stream_protocol::socket;

    Socket socket;
};

}  // namespace

std::shared_ptr<Peer> plainConnection(Loop& loop, std::shared_ptr<Shared> shared, Arrival&& arrival,
                                      Limits::Place&& place) {
    return std::make_shared<Connection<PlainWire>>(loop, std::move(shared), std::move(arrival),
                                                   std::move(place));
}

}  // namespace velkor::http::detail::transport
