#pragma once

#include <cstdint>
#include <memory>
#include <string>
#include <vector>

#include "framework/common/Export.hpp"
#include "http/Refused.hpp"
#include "http/ServerOptions.hpp"

namespace velkor::configuration {
class ConfigurationImpl;
}

namespace velkor::http {

/// Puts HTTP in front of a store, on threads of its own, for as long as it lives.
///
/// It shares the store, and its threads take no signals of the process.
class VELKOR_EXPORT Server {
public:
    /// Listens on all of the options' endpoints and serves `store`. Throws `Refused` when the
    /// options are not safe or not sound, or the system refuses, and serves nothing then:
    ///
    /// - "no address to listen on is given"
    /// - "'E' is no address to listen on: give [ADDRESS:]PORT, with ADDRESS in digits, or
    ///   unix:PATH"
    /// - "other machines can reach E: that needs TLS (a certificate and a key), or saying that a
    ///   proxy ends it"
    /// - "other machines can reach E: that needs a file of tokens"
    /// - "can't listen on E: REASON", the reason being the system's, or "another process listens
    ///   there", "a file that is no socket is there", "the path is too long"
    /// - "TLS needs both a certificate and a key"
    /// - "can't use the certificate FILE: REASON", "can't use the key FILE: REASON"
    /// - "threads must be 1 to 64"
    /// - "NAME must be at least 1" of a limit that is 0; "NAME must be at least 1 ms" and "NAME
    /// must
    ///   be at most 24 h" of a time
    ///
    /// and what is said of the files that other options name. Throws `std::invalid_argument` for a
    /// null store, `std::system_error` when the system starts no thread.
    Server(std::shared_ptr<configuration::ConfigurationImpl> store, const ServerOptions& options);

    /// Stops. Not on a thread of the server itself.
    ~Server();

    Server(const Server&) = delete;
    Server& operator=(const Server&) = delete;

    /// Where it listens, in the order of the options, as these give it but with the ports that the
    /// system picked: "127.0.0.1:50312", "[::1]:8080", "unix:/run/store.socket".
    std::vector<std::string> endpoints() const;

    /// The port of the first endpoint that has one; 0 if none has.
    std::uint16_t port() const noexcept;

    /// Ends within a second: takes no more connections, ends the event streams, gives up after half
    /// a second what is being answered, and waits for its threads. From any thread, also several
    /// times; on a thread of the server itself it doesn't wait.
    void stop() noexcept;

private:
    class Impl;

    const std::unique_ptr<Impl> impl;
};

}  // namespace velkor::http
