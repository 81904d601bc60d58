#include "layers/etcd/detail/Connecting.hpp"

#include <netinet/in.h>
#include <netinet/tcp.h>
#include <poll.h>
#include <sys/socket.h>
#include <unistd.h>

#include <cerrno>
#include <string>
#include <system_error>
#include <utility>

#include "layers/etcd/detail/GatewayErrors.hpp"

namespace velkor::layers::etcd {

namespace {

using Clock = std::chrono::steady_clock;

class Socket {
public:
    explicit Socket(int family)
        : descriptor(::socket(family, SOCK_STREAM | SOCK_NONBLOCK | SOCK_CLOEXEC, 0)) {}
    ~Socket() {
        if (descriptor >= 0) ::close(descriptor);
    }

    Socket(const Socket&) = delete;
    Socket& operator=(const Socket&) = delete;

    int get() const { return descriptor; }
    int release() { return std::exchange(descriptor, -1); }

private:
    int descriptor;
};

int pendingError(int socket) {
    int error = 0;
    socklen_t size = sizeof error;
    return ::getsockopt(socket, SOL_SOCKET, SO_ERROR, &error, &size) == 0 ? error : errno;
}

// Gives 0 or why not, as errno says it.
int tryConnect(const Socket& socket, const addrinfo& address, const Stop& stop,
               Clock::time_point end) {
    if (socket.get() < 0) return errno;
    const int on = 1;
    ::setsockopt(socket.get(), IPPROTO_TCP, TCP_NODELAY, &on, sizeof on);
    if (::connect(socket.get(), address.ai_addr, address.ai_addrlen) == 0) return 0;
    if (errno != EINPROGRESS) return errno;
    return stop.await(socket.get(), POLLOUT, end) ? pendingError(socket.get()) : ETIMEDOUT;
}

int lengthOf(const addrinfo* chain) {
    int length = 0;
    for (; chain != nullptr; chain = chain->ai_next) ++length;
    return length;
}

}  // namespace

int connectToOne(const addrinfo& addresses, const Stop& stop, Clock::time_point deadline) {
    int error = 0;
    int left = lengthOf(&addresses);
    for (const addrinfo* each = &addresses; each != nullptr; each = each->ai_next, --left) {
        const auto now = Clock::now();
        Socket socket(each->ai_family);
        error = tryConnect(socket, *each, stop, now + (deadline - now) / left);
        if (error == 0) return socket.release();
    }
    throw Unreachable(std::generic_category().message(error));
}

}  // namespace velkor::layers::etcd
