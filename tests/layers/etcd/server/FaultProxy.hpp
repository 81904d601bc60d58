#pragma once

#include <arpa/inet.h>
#include <netinet/in.h>
#include <netinet/tcp.h>
#include <poll.h>
#include <sys/socket.h>
#include <unistd.h>

#include <atomic>
#include <chrono>
#include <cstddef>
#include <list>
#include <mutex>
#include <stdexcept>
#include <string>
#include <thread>
#include <vector>

namespace velkor::testing {

/// Stands between a client and a member, and spoils what goes through. Thread-safe.
class FaultProxy {
public:
    explicit FaultProxy(int memberPort) : target(memberPort) {
        listener = ::socket(AF_INET, SOCK_STREAM | SOCK_CLOEXEC, 0);
        sockaddr_in address = loopback(0);
        socklen_t size = sizeof address;
        auto* const generic = reinterpret_cast<sockaddr*>(&address);
        if (::bind(listener, generic, size) != 0 || ::listen(listener, 64) != 0 ||
            ::getsockname(listener, generic, &size) != 0) {
            throw std::runtime_error("the proxy can't listen");
        }
        port = ntohs(address.sin_port);
        thread = std::thread([this] { run(); });
    }

    ~FaultProxy() {
        ended = true;
        thread.join();
        ::close(listener);
    }

    FaultProxy(const FaultProxy&) = delete;
    FaultProxy& operator=(const FaultProxy&) = delete;

    std::string url() const { return "http://127.0.0.1:" + std::to_string(port); }

    /// Ends all connections, and refuses new ones until `mend`.
    void cut() {
        const std::lock_guard<std::mutex> lock(mutex);
        isCut = true;
        for (auto& each : pairs) each.isBroken = true;
    }

    /// Ends all connections; new ones are welcome.
    void cutOnce() {
        const std::lock_guard<std::mutex> lock(mutex);
        for (auto& each : pairs) each.isBroken = true;
    }

    /// Lets nothing through the connections there are, neither bytes nor their end.
    void stall() {
        const std::lock_guard<std::mutex> lock(mutex);
        for (auto& each : pairs) each.requests = each.answers = 0;
    }

    /// Lets nothing through connections to come: neither requests nor answers, or no answers.
    void stallNew() { limitNew(0, 0); }
    void dropNewAnswers() { limitNew(endless, 0); }

    /// Keeps what comes over connections to come back until it is delivered.
    void holdNew() {
        const std::lock_guard<std::mutex> lock(mutex);
        holdsNew = true;
    }

    /// Lets the member have what was kept back, also of clients that have gone, and waits for its
    /// answers.
    void deliverHeld() {
        const std::lock_guard<std::mutex> lock(mutex);
        for (auto& each : pairs) {
            if (each.held.empty()) continue;
            char answer = 0;
            const bool isAnswered =
                ::send(each.member, each.held.data(), each.held.size(), MSG_NOSIGNAL) > 0 &&
                ::recv(each.member, &answer, 1, 0) > 0;
            if (!isAnswered) throw std::runtime_error("the member doesn't answer");
            each.isBroken = true;
        }
    }

    /// Lets as many bytes of answers through the connections there are, and ends them then.
    void endAnswersAfter(std::size_t bytes) {
        const std::lock_guard<std::mutex> lock(mutex);
        for (auto& each : pairs) {
            each.answers = bytes;
            each.endsAfterwards = true;
        }
    }

    /// Keeps everything back for as long.
    void delay(std::chrono::milliseconds time) { pause = time; }

    /// Nothing is spoiled of what comes from now on. What is stalled stays so.
    void mend() {
        const std::lock_guard<std::mutex> lock(mutex);
        isCut = holdsNew = false;
        newRequests = newAnswers = endless;
        pause = std::chrono::milliseconds(0);
    }

    /// Connections so far.
    int count() const { return accepted; }

private:
    static constexpr std::size_t endless = ~std::size_t{0};

    struct Pair {
        int client;
        int member;
        std::size_t requests;
        std::size_t answers;
        bool endsAfterwards = false;
        bool isBroken = false;
        bool holds = false;
        bool isLeft = false;  // by its client
        std::string held{};
    };

    static sockaddr_in loopback(int port) {
        sockaddr_in address{};
        address.sin_family = AF_INET;
        address.sin_addr.s_addr = htonl(INADDR_LOOPBACK);
        address.sin_port = htons(static_cast<std::uint16_t>(port));
        return address;
    }

    void limitNew(std::size_t requests, std::size_t answers) {
        const std::lock_guard<std::mutex> lock(mutex);
        newRequests = requests;
        newAnswers = answers;
    }

    void run() {
        while (!ended) {
            std::vector<pollfd> polled{{listener, POLLIN, 0}};
            {
                const std::lock_guard<std::mutex> lock(mutex);
                pairs.remove_if([](const Pair& each) {
                    if (!each.isBroken) return false;
                    ::close(each.client);
                    ::close(each.member);
                    return true;
                });
                for (const auto& each : pairs) {
                    const bool isRead = each.requests > 0 && !each.isLeft;
                    polled.push_back({isRead ? each.client : -1, POLLIN, 0});
                    polled.push_back({each.answers > 0 ? each.member : -1, POLLIN, 0});
                }
            }
            if (::poll(polled.data(), polled.size(), 5) <= 0) continue;
            std::this_thread::sleep_for(pause.load());
            const std::lock_guard<std::mutex> lock(mutex);
            std::size_t index = 1;
            for (auto& each : pairs) {
                const bool hasRequest = polled[index++].revents != 0;
                const bool hasAnswer = polled[index++].revents != 0;
                if (hasRequest && each.holds) {
                    hold(each);
                } else if (hasRequest) {
                    pass(each, each.client, each.member, each.requests);
                }
                if (hasAnswer) pass(each, each.member, each.client, each.answers);
            }
            if (polled[0].revents != 0) welcome();
        }
        for (const auto& each : pairs) {
            ::close(each.client);
            ::close(each.member);
        }
    }

    static void hold(Pair& pair) {
        char bytes[16384];
        const auto size = ::recv(pair.client, bytes, sizeof bytes, MSG_DONTWAIT);
        pair.isLeft = size <= 0;
        if (size > 0) pair.held.append(bytes, static_cast<std::size_t>(size));
    }

    static void pass(Pair& pair, int from, int to, std::size_t& limit) {
        char bytes[16384];
        if (limit == 0) return;
        const auto size = ::recv(from, bytes, std::min(sizeof bytes, limit), MSG_DONTWAIT);
        if (size <= 0) {
            pair.isBroken = true;
            return;
        }
        for (ssize_t sent = 0; sent < size;) {
            const auto more =
                ::send(to, bytes + sent, static_cast<std::size_t>(size - sent), MSG_NOSIGNAL);
            if (more <= 0) pair.isBroken = true;
            if (more <= 0) return;
            sent += more;
        }
        if (limit == endless) return;
        limit -= static_cast<std::size_t>(size);
        if (limit == 0 && pair.endsAfterwards) pair.isBroken = true;
    }

    void welcome() {
        const int client = ::accept4(listener, nullptr, nullptr, SOCK_CLOEXEC);
        if (client < 0) return;
        ++accepted;
        const int member = isCut ? -1 : connectTarget();
        if (member < 0) {
            ::close(client);
            return;
        }
        pairs.push_back({client, member, newRequests, newAnswers});
        pairs.back().holds = holdsNew;
    }

    int connectTarget() const {
        const int member = ::socket(AF_INET, SOCK_STREAM | SOCK_CLOEXEC, 0);
        const sockaddr_in address = loopback(target);
        const int on = 1;
        ::setsockopt(member, IPPROTO_TCP, TCP_NODELAY, &on, sizeof on);
        if (::connect(member, reinterpret_cast<const sockaddr*>(&address), sizeof address) == 0) {
            return member;
        }
        ::close(member);
        return -1;
    }

    const int target;
    int listener = -1;
    int port = 0;
    std::atomic<bool> ended{false};
    std::atomic<int> accepted{0};
    std::atomic<std::chrono::milliseconds> pause{std::chrono::milliseconds(0)};
    std::mutex mutex;
    std::list<Pair> pairs;              // guarded by mutex
    bool isCut = false;                 // guarded by mutex
    bool holdsNew = false;              // guarded by mutex
    std::size_t newRequests = endless;  // guarded by mutex
    std::size_t newAnswers = endless;   // guarded by mutex
    std::thread thread;
};

}  // namespace velkor::testing
