#include "http/detail/transport/ListeningSocket.hpp"

#include <netinet/in.h>
#include <netinet/tcp.h>
#include <sys/stat.h>

#include <cerrno>
#include <system_error>

#include "http/Refused.hpp"

namespace velkor::http::detail::transport {
namespace {

constexpr int kind = SOCK_STREAM | SOCK_CLOEXEC | SOCK_NONBLOCK;

void set(int socket, int level, int option) {
    const int on = 1;
    ::setsockopt(socket, level, option, &on, sizeof on);
}

// Whether a process listens on the unix socket there.
bool isAlive(const Endpoint& endpoint) {
    const Descriptor probe(::socket(AF_UNIX, kind, 0));
    return ::connect(probe.get(), endpoint.data(), endpoint.length()) == 0 || errno == EAGAIN;
}

}  // namespace

ListeningSocket::ListeningSocket(const Endpoint& wanted)
    : where(wanted), socket(::socket(where.family(), kind, 0)) {
    if (!socket) refuse(errno);
    if (where.isUnix()) {
        bindUnix();
    } else {
        bindTcp();
    }
    sockaddr_storage bound{};
    socklen_t size = sizeof bound;
    const bool listens =
        ::listen(socket.get(), SOMAXCONN) == 0 &&
        ::getsockname(socket.get(), static_cast<sockaddr*>(static_cast<void*>(&bound)), &size) == 0;
    if (!listens) refuse(errno);
    if (!where.isUnix()) where = Endpoint(bound, size);
}

ListeningSocket::~ListeningSocket() {
    if (!where.isUnix()) return;
    struct stat file {};
    const bool own =
        ::lstat(where.path().c_str(), &file) == 0 && file.st_dev == device && file.st_ino == inode;
    if (own) ::unlink(where.path().c_str());
}

void ListeningSocket::bindTcp() const {
    set(socket.get(), SOL_SOCKET, SO_REUSEADDR);
    if (where.family() == AF_INET6) set(socket.get(), IPPROTO_IPV6, IPV6_V6ONLY);
    if (::bind(socket.get(), where.data(), where.length()) != 0) refuse(errno);
}

void ListeningSocket::bindUnix() {
    const std::string path = where.path();
    struct stat file {};
    if (::lstat(path.c_str(), &file) == 0) {
        if (!S_ISSOCK(file.st_mode)) refuse("a file that is no socket is there");
        if (isAlive(where)) refuse("another process listens there");
        ::unlink(path.c_str());
    }
    // The file is made with the mode of the socket: there is no moment at which others can connect.
    ::fchmod(socket.get(), S_IRUSR | S_IWUSR);
    if (::bind(socket.get(), where.data(), where.length()) != 0) refuse(errno);
    if (::lstat(path.c_str(), &file) != 0) refuse(errno);
    device = file.st_dev;
    inode = file.st_ino;
}

int ListeningSocket::accept(Arrival& arrival) const {
    sockaddr_storage from{};
    socklen_t size = sizeof from;
    arrival.socket =
        Descriptor(::accept4(socket.get(), static_cast<sockaddr*>(static_cast<void*>(&from)), &size,
                             SOCK_CLOEXEC | SOCK_NONBLOCK));
    if (!arrival.socket) return errno;
    // The client of a unix socket may have no address at all.
    if (where.isUnix()) from.ss_family = AF_UNIX;
    arrival.from = Endpoint(from, size);
    // An answer is written at once: what has to be small and what can wait is known here.
    if (!where.isUnix()) set(arrival.socket.get(), IPPROTO_TCP, TCP_NODELAY);
    return 0;
}

void ListeningSocket::refuse(const std::string& reason) const {
    throw Refused("can't listen on " + where.text() + ": " + reason, Refused::Cause::system);
}

void ListeningSocket::refuse(int error) const {
    refuse(std::generic_category().message(error));
}

}  // namespace velkor::http::detail::transport
