#pragma once

#include <arpa/inet.h>
#include <netinet/in.h>
#include <poll.h>
#include <sys/socket.h>
#include <unistd.h>

#include <array>
#include <atomic>
#include <cstdlib>
#include <functional>
#include <list>
#include <mutex>
#include <stdexcept>
#include <string>
#include <thread>

namespace velkor::testing {

/// Answers requests as a script says, which need not make sense. A connection ends with an answer
/// that ends in the middle of a line, and doesn't say how long it is. Thread-safe.
class ScriptedServer {
public:
    /// Gives the bytes that answer a request to a path; called on several threads.
    using Script = std::function<std::string(const std::string& path)>;

    explicit ScriptedServer(Script answers) : script(std::move(answers)) {
        listener = ::socket(AF_INET, SOCK_STREAM | SOCK_CLOEXEC, 0);
        sockaddr_in address{};
        address.sin_family = AF_INET;
        address.sin_addr.s_addr = htonl(INADDR_LOOPBACK);
        socklen_t size = sizeof address;
        auto* const generic = reinterpret_cast<sockaddr*>(&address);
        if (::bind(listener, generic, size) != 0 || ::listen(listener, 16) != 0 ||
            ::getsockname(listener, generic, &size) != 0) {
            throw std::runtime_error("the server can't listen");
        }
        port = ntohs(address.sin_port);
        threads.emplace_back([this] { welcome(); });
    }

    ~ScriptedServer() {
        ended = true;
        threads.front().join();  // starts the others
        threads.pop_front();
        for (auto& each : threads) each.join();
        ::close(listener);
    }

    ScriptedServer(const ScriptedServer&) = delete;
    ScriptedServer& operator=(const ScriptedServer&) = delete;

    std::string url() const { return "http://127.0.0.1:" + std::to_string(port); }

    static std::string ok(const std::string& body) {
        return "HTTP/1.1 200 OK\r\nContent-Length: " + std::to_string(body.size()) + "\r\n\r\n" +
               body;
    }

    /// The beginning of an answer in parts of 4096 bytes; `endless` is such a part, and what it
    /// stands at the end of is followed by it again and again.
    static std::string inParts() { return "HTTP/1.1 200 OK\r\nTransfer-Encoding: chunked\r\n\r\n"; }
    static const std::string& endless() {
        static const std::string part = "1000\r\n" + std::string(4096, ' ') + "\r\n";
        return part;
    }

private:
    bool awaits(int socket) const {
        while (!ended) {
            pollfd polled{socket, POLLIN, 0};
            if (::poll(&polled, 1, 5) > 0) return true;
        }
        return false;
    }

    void welcome() {
        while (awaits(listener)) {
            const int client = ::accept4(listener, nullptr, nullptr, SOCK_CLOEXEC);
            if (client < 0) continue;
            threads.emplace_back([this, client] {
                serve(client);
                ::close(client);
            });
        }
    }

    void serve(int client) const {
        std::string received;
        std::array<char, 4096> part{};
        while (awaits(client)) {
            const auto size = ::recv(client, part.data(), part.size(), MSG_DONTWAIT);
            if (size <= 0) return;
            received.append(part.data(), static_cast<std::size_t>(size));
            const std::size_t end = received.find("\r\n\r\n");
            if (end == std::string::npos || !isWhole(received, end)) continue;
            const std::size_t begin = received.find(' ') + 1;
            const std::string answer =
                script(received.substr(begin, received.find(' ', begin) - begin));
            received.clear();
            if (!send(client, answer) || isLast(answer)) return;
        }
    }

    // A body without an end counts as whole.
    static bool isWhole(const std::string& received, std::size_t end) {
        constexpr long long longestBody = 1'000'000;
        const std::size_t length = received.find("Content-Length: ");
        if (length == std::string::npos) return true;
        const long long size = std::atoll(received.c_str() + length + 16);
        return size > longestBody || received.size() >= end + 4 + static_cast<std::size_t>(size);
    }

    static bool isLast(const std::string& answer) {
        return !answer.empty() && answer.back() != '\n' &&
               answer.find("Content-Length: ") == std::string::npos;
    }

    bool send(int client, const std::string& answer) const {
        const std::string& part = endless();
        const bool isEndless = answer.size() >= part.size() &&
                               answer.compare(answer.size() - part.size(), part.size(), part) == 0;
        if (!sendAll(client, answer)) return false;
        while (isEndless && !ended) {
            if (!sendAll(client, part)) return false;
        }
        return true;
    }

    static bool sendAll(int client, const std::string& text) {
        for (std::size_t sent = 0; sent < text.size();) {
            const auto more = ::send(client, text.data() + sent, text.size() - sent, MSG_NOSIGNAL);
            if (more <= 0) return false;
            sent += static_cast<std::size_t>(more);
        }
        return true;
    }

    const Script script;
    int listener = -1;
    int port = 0;
    std::atomic<bool> ended{false};
    std::list<std::thread>
        threads;  // used by the first of them and, when that has ended, at the end
};

}  // namespace velkor::testing
