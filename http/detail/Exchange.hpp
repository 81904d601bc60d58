#pragma once

#include <array>
#include <atomic>
#include <cstdint>
#include <functional>
#include <memory>
#include <optional>
#include <string>
#include <string_view>
#include <utility>
#include <variant>
#include <vector>

namespace velkor::http::detail {

/// The border between what moves bytes (the transport) and what answers (the handler).

/// Who sends a request and from where.
struct Client {
    std::string address;  ///< "127.0.0.1:50312", "[::1]:50312", "unix".
    bool secure = false;  ///< The request came through TLS.
};

/// The headers, by their names in lower case, that a request passes on. All others stay behind.
inline constexpr std::array<std::string_view, 8> passedHeaders{
    "host",   "origin",        "authorization",  "content-type",
    "accept", "last-event-id", "sec-fetch-site", "if-none-match"};

/// A request, complete.
struct Request {
    std::string method;  ///< As sent: "GET".
    std::string target;  ///< As sent: path and query.
    /// Those of `passedHeaders` that were sent, the name in lower case, each occurrence, in order.
    /// Trailers of a body are none.
    std::vector<std::pair<std::string_view, std::string>> headers;
    std::string body;
    Client client;

    /// The first value of the header `name`, given in lower case; nothing if it wasn't sent.
    std::optional<std::string_view> header(std::string_view name) const {
        for (const auto& [sent, value] : headers) {
            if (sent == name) return value;
        }
        return std::nullopt;
    }
};

/// An answer that is known at once. The transport adds Date, Content-Length, Connection,
/// "Cache-Control: no-store" and "X-Content-Type-Options: nosniff", and leaves out the body for a
/// HEAD request, for which the handler answers as for GET.
struct Response {
    int status = 200;
    std::string contentType;  ///< Empty: no body.
    std::string body;
    std::vector<std::pair<std::string, std::string>> headers;  ///< Others, names as they are sent.
};

/// A stream of events, pulled by the connection that shows it. Used by one connection, on its
/// thread.
class EventFeed {
public:
    /// Ends the subscription: the client has gone or the server stops.
    virtual ~EventFeed() = default;

    /// Called once, before `next`. `onReady` may be called from any thread, also before `start`
    /// returns, and at any time, even when the feed has ended: it only posts.
    virtual void start(std::function<void()> onReady) = 0;

    /// The text of the next event ("id: 7\ndata: {...}\n\n"), or nothing while there is none; then
    /// `onReady` is called once there is one. Called again only when the former text has been
    /// written: so a slow client costs one kept value.
    virtual std::optional<std::string> next() = 0;

    /// Whether the stream is over, once `next` gave nothing.
    virtual bool isOver() const = 0;
};

using Answer = std::variant<Response, std::unique_ptr<EventFeed>>;

/// What answers requests.
class Handler {
public:
    virtual ~Handler() = default;

    /// Answers `request` by exactly one call of `answer`, before this returns or later, from any
    /// thread, even when the client has gone. Only lack of memory throws. Runs on the thread of the
    /// connection: what may take long is done on the handler's own.
    virtual void handle(Request&& request, std::function<void(Answer&&)> answer) = 0;

    /// Why a request is not answered, known from its head alone: asked before a body is read that
    /// hasn't come yet. The same is found by `handle`, which is not called then.
    virtual std::optional<Response> objection(const Request& head) = 0;

    /// The answer to what the transport refuses by itself: 400 (no HTTP), 408, 413, 431, 503 (too
    /// many connections or streams, too much for the memory). From any thread of the transport.
    virtual Response refusal(int status) const = 0;

    /// Ends the handler's own threads, once all connections are closed; `handle` is not called any
    /// more. May be called several times, from any thread.
    virtual void stop() noexcept = 0;
};

/// What the transport counts; it writes, anybody reads.
struct TransportCounts {
    using Count = std::atomic<std::uint64_t>;

    Count connectionsOpen{0};
    Count connectionsAccepted{0};
    Count connectionsRefused{0};  ///< Too many of them, or no memory for one.
    Count streamsOpen{0};
    Count streamsRefused{0};
    Count eventsWritten{0};
    Count requestsRead{0};
    Count requestsRefused{0};   ///< By the transport itself: no HTTP, or too large.
    Count answersRefused{0};    ///< No room for them, or for the bodies of their requests.
    Count requestsTimedOut{0};  ///< Not complete in time.
    Count writesTimedOut{0};    ///< Answers and events that the client did not take in time.
    Count bytesRead{0};
    Count bytesWritten{0};
};

}  // namespace velkor::http::detail
