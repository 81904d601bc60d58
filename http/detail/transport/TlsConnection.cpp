#include <openssl/ssl.h>

#include <array>
#include <boost/asio/generic/stream_protocol.hpp>
#include <boost/asio/ssl/context.hpp>
#include <boost/asio/ssl/stream.hpp>
#include <memory>
#include <utility>

#include "http/detail/transport/Connection.hpp"
#include "http/detail/transport/Connections.hpp"

namespace velkor::http::detail::transport {
namespace {

namespace ssl = boost::asio::ssl;
using Error = boost::system::error_code;

// A reference of its own to the context of all connections.
SSL_CTX* another(SSL_CTX* context) {
    ::SSL_CTX_up_ref(context);
    return context;
}

/// Bytes through TLS; members as those of `PlainWire`.
class TlsWire {
public:
    TlsWire(Loop::Context& context, Arrival&& arrival, const Shared& shared)
        : tls(another(shared.tls.get())),
          stream(Socket(context, {arrival.from.family(), 0}, arrival.socket.get()), tls) {
        arrival.socket.release();
    }

    template <class Next>
    void greet(Next&& next) {
        stream.async_handshake(ssl::stream_base::server, std::forward<Next>(next));
    }

    template <class Buffer, class Next>
    void readSome(const Buffer& buffer, Next&& next) {
        stream.async_read_some(buffer, std::forward<Next>(next));
    }

    template <class Buffer, class Next>
    void writeSome(const Buffer& buffer, Next&& next) {
        stream.async_write_some(buffer, std::forward<Next>(next));
    }

    template <class Next>
    void awaitClient(Next&& next) {
        stream.async_read_some(
            boost::asio::buffer(unwanted),
            [next = std::forward<Next>(next)](const Error& error, std::size_t) { next(error); });
    }

    template <class Next>
    void sayEnd(Next&& next) {
        stream.async_shutdown(std::forward<Next>(next));
    }

    template <class Buffer, class Next>
    void readRaw(const Buffer& buffer, Next&& next) {
        stream.next_layer().async_read_some(buffer, std::forward<Next>(next));
    }

    void endWriting() noexcept {
        Error ignored;
        stream.next_layer().shutdown(Socket::shutdown_send, ignored);
    }

    void cancel() noexcept {
        Error ignored;
        stream.next_layer().cancel(ignored);
    }

    void close() noexcept {
        Error ignored;
        stream.next_layer().close(ignored);
    }

private:
    using Socket = boost::asio::generic::stream_protocol::socket;

    ssl::context tls;
    ssl::stream<Socket> stream;
    std::array<char, 1> unwanted{};
};

}  // namespace

std::shared_ptr<Peer> tlsConnection(Loop& loop, std::shared_ptr<Shared> shared, Arrival&& arrival,
                                    Limits::Place&& place) {
    return std::make_shared<Connection<TlsWire>>(loop, std::move(shared), std::move(arrival),
                                                 std::move(place));
}

}  // namespace velkor::http::detail::transport
