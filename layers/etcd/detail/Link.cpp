#include "layers/etcd/detail/Link.hpp"

#include <arpa/inet.h>
#include <netdb.h>
#include <openssl/err.h>
#include <openssl/ssl.h>
#include <openssl/x509v3.h>
#include <poll.h>
#include <sys/socket.h>
#include <unistd.h>

#include <algorithm>
#include <cerrno>
#include <climits>
#include <new>
#include <string>
#include <system_error>

#include "layers/etcd/detail/Connecting.hpp"
#include "layers/etcd/detail/GatewayErrors.hpp"
#include "layers/etcd/detail/Tls.hpp"

namespace velkor::layers::etcd {

using boost::system::error_code;

namespace {

using Addresses = std::unique_ptr<addrinfo, void (*)(addrinfo*)>;

Addresses addressesOf(const Endpoint& endpoint) {
    addrinfo wanted{};
    wanted.ai_socktype = SOCK_STREAM;
    wanted.ai_flags = AI_NUMERICSERV;
    addrinfo* found = nullptr;
    const int problem =
        ::getaddrinfo(endpoint.host.c_str(), endpoint.port.c_str(), &wanted, &found);
    if (problem != 0) throw Unreachable(::gai_strerror(problem));
    return {found, ::freeaddrinfo};
}

bool isAddress(const std::string& host) {
    in6_addr address{};
    return ::inet_pton(AF_INET, host.c_str(), &address) == 1 ||
           ::inet_pton(AF_INET6, host.c_str(), &address) == 1;
}

std::string tlsProblem(const SSL* tls) {
    const long verification = ::SSL_get_verify_result(tls);
    if (verification != X509_V_OK) {
        return std::string("the certificate is not trusted: ") +
               ::X509_verify_cert_error_string(verification);
    }
    const unsigned long error = ::ERR_peek_error();
    const char* const reason = error == 0 ? nullptr : ::ERR_reason_error_string(error);
    return std::string("TLS failed") + (reason == nullptr ? "" : std::string(": ") + reason);
}

int bounded(std::size_t size) {
    return static_cast<int>(std::min<std::size_t>(size, INT_MAX));
}

}  // namespace

Link::Link(const Endpoint& endpoint, const EtcdOptions& options, const Stop& ending, Time end)
    : stop(ending),
      deadline(end),
      socket(connectToOne(*addressesOf(endpoint), ending, end)),
      tls(nullptr, ::SSL_free) {
    try {
        if (endpoint.isSecure) secure(endpoint, options);
    } catch (...) {
        ::close(socket);
        throw;
    }
}

Link::~Link() {
    ::close(socket);
}

void Link::secure(const Endpoint& endpoint, const EtcdOptions& options) {
    const auto context = tlsContext(options);
    tls.reset(::SSL_new(context.get()));
    if (!tls || ::SSL_set_fd(tls.get(), socket) != 1) throw std::bad_alloc();
    // A check that can't be set up would not be made.
    const char* const host = endpoint.host.c_str();
    const int isChecked = isAddress(endpoint.host)
                              ? ::X509_VERIFY_PARAM_set1_ip_asc(::SSL_get0_param(tls.get()), host)
                              : ::SSL_set1_host(tls.get(), host);
    if (isChecked != 1) throw std::bad_alloc();
    if (!isAddress(endpoint.host)) {
        std::string name = endpoint.host;  // the macro for this has a cast that warns
        ::SSL_ctrl(tls.get(), SSL_CTRL_SET_TLSEXT_HOSTNAME, TLSEXT_NAMETYPE_host_name, name.data());
    }
    error_code error;
    untilDone([this] { return ::SSL_connect(tls.get()); }, 0, error);
    if (error == boost::asio::error::timed_out)
        throw Unreachable(std::generic_category().message(ETIMEDOUT));
    if (error) throw Unreachable(tlsProblem(tls.get()));
}

bool Link::isDisturbed() {
    return stop.await(socket, POLLIN, Time::min());
}

// `events` are what a socket without TLS waits for.
template <class Attempt>
std::size_t Link::untilDone(Attempt attempt, short events, error_code& error) {
    error = {};
    for (;;) {
        ::ERR_clear_error();
        const auto done = attempt();
        if (done > 0) return static_cast<std::size_t>(done);
        short awaited = events;
        if (tls) {
            const int reason = ::SSL_get_error(tls.get(), static_cast<int>(done));
            awaited = reason == SSL_ERROR_WANT_WRITE ? POLLOUT : POLLIN;
            if (reason != SSL_ERROR_WANT_READ && reason != SSL_ERROR_WANT_WRITE) {
                error = reason == SSL_ERROR_ZERO_RETURN ? error_code(boost::asio::error::eof)
                                                        : boost::asio::error::connection_reset;
                return 0;
            }
        } else if (done == 0) {
            error = boost::asio::error::eof;
            return 0;
        } else if (errno != EAGAIN && errno != EINTR) {
            error.assign(errno, boost::system::system_category());
            return 0;
        }
        if (!stop.await(socket, awaited, deadline)) {
            error = boost::asio::error::timed_out;
            return 0;
        }
    }
}

std::size_t Link::read(void* target, std::size_t size, error_code& error) {
    if (size == 0) return 0;
    return untilDone(
        [&]() -> ssize_t {
            if (tls) return ::SSL_read(tls.get(), target, bounded(size));
            return ::recv(socket, target, size, 0);
        },
        POLLIN, error);
}

std::size_t Link::write(const void* content, std::size_t size, error_code& error) {
    if (size == 0) return 0;
    return untilDone(
        [&]() -> ssize_t {
            if (tls) return ::SSL_write(tls.get(), content, bounded(size));
            return ::send(socket, content, size, MSG_NOSIGNAL);
        },
        POLLOUT, error);
}

}  // namespace velkor::layers::etcd
