#include "benchmarks/http/StreamClients.hpp"

#include <sys/epoll.h>
#include <sys/socket.h>
#include <unistd.h>

#include <array>

namespace velkor::benchmarks {
namespace {

// The last complete event in `text`, and what follows it.
std::string newestOf(const std::string& text) {
    const std::size_t end = text.rfind("\n\n");
    if (end == std::string::npos || end == 0) return text;
    const std::size_t before = text.rfind("\n\n", end - 1);
    return before == std::string::npos ? text : text.substr(before + 2);
}

}  // namespace

StreamClients::StreamClients(std::uint16_t port, std::size_t count, const std::string& target)
    : poller(::epoll_create1(0)), streams(count) {
    const std::string request = "GET " + target + " HTTP/1.1\r\nHost: localhost\r\n\r\n";
    for (std::size_t i = 0; i < count; ++i) {
        streams[i].socket = connectTo(port);
        ::send(streams[i].socket, request.data(), request.size(), MSG_NOSIGNAL);
        epoll_event event{};
        event.events = EPOLLIN;
        event.data.u64 = i;
        ::epoll_ctl(poller, EPOLL_CTL_ADD, streams[i].socket, &event);
    }
    awaitText("data: ", Clock::now(), std::chrono::seconds(10));
}

StreamClients::~StreamClients() {
    for (const Stream& stream : streams) ::close(stream.socket);
    ::close(poller);
}

std::vector<double> StreamClients::awaitText(const std::string& text, Clock::time_point begin,
                                             std::chrono::seconds limit) {
    std::vector<double> times;
    std::vector<bool> has(streams.size());
    while (times.size() < streams.size() && Clock::now() - begin < limit) {
        std::array<epoll_event, 256> events;
        const int ready = ::epoll_wait(poller, events.data(), events.size(), 50);
        for (int i = 0; i < ready; ++i) {
            const std::size_t index = events[static_cast<std::size_t>(i)].data.u64;
            Stream& stream = streams[index];
            std::array<char, 16384> block;
            const ssize_t size = ::recv(stream.socket, block.data(), block.size(), 0);
            if (size <= 0) {
                ::epoll_ctl(poller, EPOLL_CTL_DEL, stream.socket, nullptr);
                continue;
            }
            stream.tail.append(block.data(), static_cast<std::size_t>(size));
            stream.tail = newestOf(stream.tail);
            if (has[index] || stream.tail.find(text) == std::string::npos) continue;
            has[index] = true;
            times.push_back(std::chrono::duration<double>(Clock::now() - begin).count());
        }
    }
    return times;
}

}  // namespace velkor::benchmarks
