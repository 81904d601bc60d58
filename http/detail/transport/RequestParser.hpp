#pragma once

#include <cstddef>
#include <memory>
#include <string_view>

#include "http/detail/Exchange.hpp"

namespace velkor::http::detail::transport {

/// Reads requests, one after the other, from pieces of bytes.
///
/// Refused are, beside what is no HTTP/1.0 or 1.1: a transfer coding other than "chunked", any in
/// HTTP/1.0, one together with a length, a length that is given twice, a folded line (all 400:
/// whoever stands between might read another request than we do), a head that is too large, with
/// its trailers and the extensions of its chunks (431), and a body that is (413).
class RequestParser {
public:
    enum class State {
        incomplete,  ///< More bytes are needed.
        complete,    ///< `take` gives the request.
        refused      ///< `refusal` says the status; no more can be read.
    };

    /// The most bytes of first line and headers, and of the body.
    RequestParser(std::size_t maxHeaderBytes, std::size_t maxBodyBytes);
    ~RequestParser();

    RequestParser(const RequestParser&) = delete;
    RequestParser& operator=(const RequestParser&) = delete;

    /// Takes bytes from the beginning of `bytes` and says how many. Those that it leaves are given
    /// again next time, with those that follow: those of a line that isn't complete, or of the next
    /// request. May throw `std::bad_alloc`.
    std::size_t put(std::string_view bytes);

    State state() const noexcept;
    int refusal() const noexcept;

    /// Whether the client waits for "100 Continue" before it sends the body. Says so once.
    bool takeExpectation() noexcept;

    /// The request as far as it has been read, once its head has been; null before, and when it has
    /// been given already. Its client is missing.
    const Request* takeHead() noexcept;

    /// Bytes of the body so far.
    std::size_t bodySize() const noexcept;

    /// Of a complete request: whether the connection may stay open, and whether it asks for no
    /// body.
    bool keepsAlive() const noexcept;
    bool isHead() const noexcept;

    /// Whether the client speaks HTTP/1.0, to which staying open must be said.
    bool isOld() const noexcept;

    /// Gives the complete request, without its client, and begins with the next.
    Request take();

private:
    class Reading;

    const std::unique_ptr<Reading> reading;
};

}  // namespace velkor::http::detail::transport
