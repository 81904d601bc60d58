#include "benchmarks/http/LoadClient.hpp"

#include <arpa/inet.h>
#include <fcntl.h>
#include <netinet/in.h>
#include <netinet/tcp.h>
#include <sys/epoll.h>
#include <sys/socket.h>
#include <unistd.h>

#include <algorithm>
#include <array>
#include <stdexcept>
#include <utility>

namespace velkor::benchmarks {
namespace {

// The bytes of the whole answer, once its head is there; 0 before.
std::size_t lengthOf(const std::string& answer) {
    const std::size_t head = answer.find("\r\n\r\n");
    if (head == std::string::npos) return 0;
    const std::size_t field = answer.find("Content-Length: ");
    if (field > head) throw std::runtime_error("an answer without a length: " + answer);
    return head + 4 + std::stoul(answer.substr(field + 16));
}

// Has one answer given to `request`, to know its length.
std::size_t answerLengthAt(std::uint16_t port, const std::string& request) {
    const int socket = connectTo(port);
    ::fcntl(socket, F_SETFL, ::fcntl(socket, F_GETFL) & ~O_NONBLOCK);
    ::send(socket, request.data(), request.size(), MSG_NOSIGNAL);
    std::string answer;
    while (lengthOf(answer) == 0) {
        std::array<char, 4096> block;
        const ssize_t size = ::recv(socket, block.data(), block.size(), 0);
        if (size <= 0) throw std::runtime_error("no answer");
        answer.append(block.data(), static_cast<std::size_t>(size));
    }
    ::close(socket);
    if (answer.rfind("HTTP/1.1 200", 0) != 0) throw std::runtime_error(answer);
    return lengthOf(answer);
}

}  // namespace

int connectTo(std::uint16_t port) {
    const int socket = ::socket(AF_INET, SOCK_STREAM, 0);
    sockaddr_in address{};
    address.sin_family = AF_INET;
    address.sin_port = htons(port);
    address.sin_addr.s_addr = htonl(INADDR_LOOPBACK);
    const void* const plain = &address;
    if (::connect(socket, static_cast<const sockaddr*>(plain), sizeof address) != 0) {
        throw std::runtime_error("no connection");
    }
    const int on = 1;
    ::setsockopt(socket, IPPROTO_TCP, TCP_NODELAY, &on, sizeof on);
    ::fcntl(socket, F_SETFL, ::fcntl(socket, F_GETFL) | O_NONBLOCK);
    return socket;
}

LoadClient::LoadClient(std::uint16_t port, std::size_t count, std::string repeated)
    : request(std::move(repeated)),
      answerLength(answerLengthAt(port, request)),
      poller(::epoll_create1(0)),
      connections(count) {
    for (std::size_t i = 0; i < count; ++i) {
        connections[i].socket = connectTo(port);
        epoll_event event{};
        event.events = EPOLLIN;
        event.data.u64 = i;
        ::epoll_ctl(poller, EPOLL_CTL_ADD, connections[i].socket, &event);
    }
}

LoadClient::~LoadClient() {
    for (const Connection& connection : connections) ::close(connection.socket);
    ::close(poller);
}

void LoadClient::send(Connection& connection) {
    connection.awaited = answerLength;
    connection.sent = Clock::now();
    ::send(connection.socket, request.data(), request.size(), MSG_NOSIGNAL);
}

// Reads what there is of an answer; false when the connection has ended.
bool LoadClient::receive(Connection& connection) {
    std::array<char, 16384> block;
    const ssize_t size = ::recv(connection.socket, block.data(), block.size(), 0);
    if (size <= 0) return false;
    connection.awaited -= std::min(connection.awaited, static_cast<std::size_t>(size));
    return true;
}

LoadClient::Result LoadClient::run(std::size_t count, std::chrono::seconds limit,
                                   const std::function<void()>& meanwhile) {
    Result result;
    result.latencies.reserve(count);
    const auto begin = Clock::now();
    std::size_t unsent = count;
    for (Connection& connection : connections) {
        send(connection);
        --unsent;
    }
    std::array<epoll_event, 64> events;
    while (result.latencies.size() + result.failures < count && Clock::now() - begin < limit) {
        const int ready = ::epoll_wait(poller, events.data(), events.size(), 50);
        if (meanwhile) meanwhile();
        for (int i = 0; i < ready; ++i) {
            Connection& connection = connections[events[static_cast<std::size_t>(i)].data.u64];
            if (!receive(connection)) {
                ++result.failures;
                ::epoll_ctl(poller, EPOLL_CTL_DEL, connection.socket, nullptr);
                continue;
            }
            if (connection.awaited > 0) continue;
            const std::chrono::duration<double> latency = Clock::now() - connection.sent;
            result.latencies.push_back(latency.count());
            if (unsent == 0) continue;
            --unsent;
            send(connection);
        }
    }
    result.seconds = std::chrono::duration<double>(Clock::now() - begin).count();
    return result;
}

double quantile(std::vector<double> values, double share) {
    if (values.empty()) return 0;
    const auto at = values.begin() +
                    static_cast<std::ptrdiff_t>(share * static_cast<double>(values.size() - 1));
    std::nth_element(values.begin(), at, values.end());
    return *at;
}

}  // namespace velkor::benchmarks
