#pragma once

#include <arpa/inet.h>
#include <netinet/in.h>
#include <poll.h>
#include <strings.h>
#include <sys/socket.h>
#include <sys/un.h>
#include <unistd.h>

#include <array>
#include <cerrno>
#include <chrono>
#include <cstdint>
#include <cstring>
#include <stdexcept>
#include <string>
#include <string_view>
#include <system_error>
#include <utility>

#include "tests/support/BoundedWait.hpp"

namespace velkor::testing {

/// An answer as a client reads it.
struct HttpAnswer {
    int status = 0;  ///< 0: the connection ended before the answer did.
    std::string head;
    std::string body;

    /// The value of a header, or "" if there is none.
    std::string header(std::string_view name) const {
        const std::string wanted = "\r\n" + std::string(name) + ": ";
        const char* const found = ::strcasestr(head.c_str(), wanted.c_str());
        if (found == nullptr) return "";
        const std::string_view rest(found + wanted.size());
        return std::string(rest.substr(0, rest.find("\r\n")));
    }
};

/// A client with one blocking socket, which says exactly what a test tells it to. Waiting for what
/// never comes throws, after the usual patience.
class HttpClient {
public:
    /// Connects to a port of 127.0.0.1; `receiveBytes` is the room for what isn't read yet.
    explicit HttpClient(std::uint16_t port, int receiveBytes = 0)
        : descriptor(::socket(AF_INET, SOCK_STREAM | SOCK_CLOEXEC, 0)) {
        if (receiveBytes > 0) {
            ::setsockopt(descriptor, SOL_SOCKET, SO_RCVBUF, &receiveBytes, sizeof receiveBytes);
        }
        sockaddr_in address{};
        address.sin_family = AF_INET;
        address.sin_port = htons(port);
        address.sin_addr.s_addr = htonl(INADDR_LOOPBACK);
        connect(&address, sizeof address);
    }

    /// Connects to the unix socket at `path`.
    explicit HttpClient(const std::string& path)
        : descriptor(::socket(AF_UNIX, SOCK_STREAM | SOCK_CLOEXEC, 0)) {
        sockaddr_un address{};
        address.sun_family = AF_UNIX;
        path.copy(address.sun_path, sizeof address.sun_path - 1);
        connect(&address, sizeof address);
    }

    ~HttpClient() { close(); }

    HttpClient(HttpClient&& other) noexcept
        : descriptor(std::exchange(other.descriptor, -1)), unread(std::move(other.unread)) {}
    HttpClient& operator=(HttpClient&&) = delete;

    /// Sends all of `bytes`; what can't be sent because the server is through with us is lost.
    void send(std::string_view bytes) {
        while (!bytes.empty()) {
            const ssize_t sent = ::send(descriptor, bytes.data(), bytes.size(), MSG_NOSIGNAL);
            if (sent < 0) return;
            bytes.remove_prefix(static_cast<std::size_t>(sent));
        }
    }

    /// Sends a request of one line, with the headers (each ended by "\r\n"), and reads the answer.
    HttpAnswer ask(const std::string& line, const std::string& headers = "") {
        send(line + " HTTP/1.1\r\nHost: localhost\r\n" + headers + "\r\n");
        return answer(line.substr(0, 5) != "HEAD ");
    }

    /// The next answer, with its body if that is to be expected.
    HttpAnswer answer(bool hasBody = true) {
        HttpAnswer result;
        result.head = readUntil("\r\n\r\n");
        if (result.head.empty()) return result;
        const std::string length = result.header("Content-Length");
        if (hasBody && !length.empty()) result.body = read(std::stoul(length));
        result.status = std::stoi(result.head.substr(9, 3));
        return result;
    }

    /// What comes up to `mark`, which is included; "" when the connection ends before.
    std::string readUntil(std::string_view mark) {
        for (;;) {
            const std::size_t found = unread.find(mark);
            if (found != std::string::npos) return cut(found + mark.size());
            if (!readMore()) return "";
        }
    }

    /// The next `size` bytes; fewer when the connection ends before.
    std::string read(std::size_t size) {
        while (unread.size() < size && readMore()) continue;
        return cut(size);
    }

    /// All that comes until the server closes the connection.
    std::string readToEnd() {
        while (readMore()) continue;
        return cut(unread.size());
    }

    /// Says that nothing more will be sent.
    void endSending() { ::shutdown(descriptor, SHUT_WR); }

    void close() {
        if (descriptor >= 0) ::close(std::exchange(descriptor, -1));
    }

    /// Closes so that the server meets an error.
    void reset() {
        const linger now{1, 0};
        ::setsockopt(descriptor, SOL_SOCKET, SO_LINGER, &now, sizeof now);
        close();
    }

    int socket() const { return descriptor; }

private:
    void connect(const void* address, socklen_t size) {
        if (::connect(descriptor, static_cast<const sockaddr*>(address), size) != 0) {
            const int error = errno;
            close();
            throw std::system_error(error, std::generic_category(), "connect");
        }
    }

    // Reads what there is; false at the end of the connection.
    bool readMore() {
        pollfd waiting{descriptor, POLLIN, 0};
        const auto limit = std::chrono::milliseconds(patience).count();
        if (::poll(&waiting, 1, static_cast<int>(limit)) <= 0) {
            throw std::runtime_error("the server says nothing; so far: " + unread);
        }
        std::array<char, 65536> block;
        const ssize_t size = ::recv(descriptor, block.data(), block.size(), 0);
        if (size <= 0) return false;
        unread.append(block.data(), static_cast<std::size_t>(size));
        return true;
    }

    std::string cut(std::size_t size) {
        std::string result = unread.substr(0, size);
        unread.erase(0, size);
        return result;
    }

    int descriptor;
    std::string unread;
};

}  // namespace velkor::testing
