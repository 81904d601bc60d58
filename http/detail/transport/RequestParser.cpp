// One assertion of Beast's parser says too much: of a body that has no chunk but the last, the end
// may arrive byte by byte. No client is to end a process that is built with assertions.
#define BOOST_DISABLE_ASSERTS

#include "http/detail/transport/RequestParser.hpp"

#include <algorithm>
#include <boost/beast/http/basic_parser.hpp>
#include <boost/beast/http/error.hpp>
#include <cstdint>
#include <limits>
#include <optional>
#include <string>
#include <utility>

namespace velkor::http::detail::transport {
namespace {

namespace beast = boost::beast;
using beast::error_code;
using beast::http::error;
using beast::http::field;

// What a client announces is not set aside before it comes.
constexpr std::uint64_t mostReserved = std::uint64_t{64} << 10U;

std::string_view passedName(beast::string_view sent) {
    for (const std::string_view name : passedHeaders) {
        if (beast::iequals({name.data(), name.size()}, sent)) return name;
    }
    return {};
}

// Keeps of one request what is passed on.
class Message final : public beast::http::basic_parser<true> {
public:
    Message(std::size_t headerLimit, std::size_t bodyLimit) : maxHeaderBytes(headerLimit) {
        header_limit(static_cast<std::uint32_t>(
            std::min<std::size_t>(headerLimit, std::numeric_limits<std::uint32_t>::max())));
        body_limit(bodyLimit);
    }

    Request request;
    bool isOld = false;
    bool isExpected = false;  // the client waits for "100 Continue"
    bool isHeadTaken = false;

private:
    void on_request_impl(beast::http::verb /*verb*/, beast::string_view method,
                         beast::string_view target, int version, error_code& /*code*/) override {
        request.method.assign(method.data(), method.size());
        request.target.assign(target.data(), target.size());
        isOld = version < 11;
    }

    void on_field_impl(field name, beast::string_view sentName, beast::string_view value,
                       error_code& code) override {
        if (isHeadRead) return;  // a trailer
        switch (name) {
            case field::transfer_encoding:
                if (isOld || !beast::iequals(value, "chunked")) code = error::bad_transfer_encoding;
                return;
            case field::content_length:
                if (hasLength || value.find(',') != beast::string_view::npos) {
                    code = error::bad_content_length;
                }
                hasLength = true;
                return;
            case field::expect:
                isExpected = !isOld && beast::iequals(value, "100-continue");
                return;
            default:
                break;
        }
        const std::string_view passed = passedName(sentName);
        if (!passed.empty()) {
            request.headers.emplace_back(passed, std::string(value.data(), value.size()));
        }
    }

    void on_header_impl(error_code& /*code*/) override {
        isHeadRead = true;
        takeHostFromTarget();
    }

    // A target may name the host as well ("http://host/path"), which then holds.
    void takeHostFromTarget() {
        if (request.target.front() == '/') return;
        const std::string target = request.target;
        constexpr std::string_view mark = "://";
        const std::size_t scheme = target.find(mark);
        const bool isAbsolute = beast::iequals(target.substr(0, scheme), "http") ||
                                beast::iequals(target.substr(0, scheme), "https");
        if (scheme == std::string::npos || !isAbsolute) return;
        const std::size_t host = scheme + mark.size();
        const std::size_t path = std::min(target.find_first_of("/?", host), target.size());
        request.target = target.substr(path);
        if (path == target.size() || target[path] == '?') request.target.insert(0, "/");
        auto& headers = request.headers;
        const auto isHost = [](const auto& header) { return header.first == "host"; };
        headers.erase(std::remove_if(headers.begin(), headers.end(), isHost), headers.end());
        headers.emplace_back("host", target.substr(host, path - host));
    }

    void on_body_init_impl(const boost::optional<std::uint64_t>& length,
                           error_code& /*code*/) override {
        request.body.reserve(std::min(length.value_or(0), mostReserved));
    }

    std::size_t on_body_impl(beast::string_view bytes, error_code& /*code*/) override {
        request.body.append(bytes.data(), bytes.size());
        return bytes.size();
    }

    void on_chunk_header_impl(std::uint64_t /*size*/, beast::string_view extensions,
                              error_code& code) override {
        extensionBytes += extensions.size();
        if (extensionBytes > maxHeaderBytes) code = error::header_limit;
    }

    std::size_t on_chunk_body_impl(std::uint64_t /*remaining*/, beast::string_view bytes,
                                   error_code& code) override {
        return on_body_impl(bytes, code);
    }

    void on_finish_impl(error_code& /*code*/) override {}

    void on_response_impl(int /*status*/, beast::string_view /*reason*/, int /*version*/,
                          error_code& /*code*/) override {}

    const std::size_t maxHeaderBytes;
    std::size_t extensionBytes = 0;
    bool isHeadRead = false;
    bool hasLength = false;
};

int statusOf(const error_code& code) {
    if (code == error::header_limit) return 431;
    if (code == error::body_limit) return 413;
    return 400;
}

}  // namespace

class RequestParser::Reading {
public:
    Reading(std::size_t headerLimit, std::size_t bodyLimit)
        : maxHeaderBytes(headerLimit), maxBodyBytes(bodyLimit) {
        begin();
    }

    void begin() {
        message.emplace(maxHeaderBytes, maxBodyBytes);
        headBytes = 0;
    }

    std::size_t put(std::string_view bytes) {
        std::size_t taken = 0;
        error_code code;
        while (!code && taken < bytes.size() && !message->is_done()) {
            const bool inHead = !message->is_header_done();
            const std::size_t now =
                message->put({bytes.data() + taken, bytes.size() - taken}, code);
            // What is taken of the head is whole headers.
            if (inHead && isFolded(bytes.substr(taken, now))) code = error::bad_obs_fold;
            taken += now;
            if (inHead) headBytes += now;
            // Only now: the head is to be counted alone.
            if (message->is_header_done()) message->eager(true);
        }
        if (code == error::need_more) code = lineLimit(bytes.size() - taken);
        if (code || headBytes > maxHeaderBytes) status = code ? statusOf(code) : 431;
        return taken;
    }

    std::optional<Message> message;
    int status = 0;  // of the refusal; 0: none

private:
    // A header that goes on in the next line: others might read two of it.
    static bool isFolded(std::string_view head) {
        return head.find("\r\n ") != std::string_view::npos ||
               head.find("\r\n\t") != std::string_view::npos;
    }

    // The rest, `left` bytes, is part of the head, or of a line between chunks.
    error_code lineLimit(std::size_t left) const {
        const std::size_t before = message->is_header_done() ? 0 : headBytes;
        if (before + left < maxHeaderBytes) return {};
        return error::header_limit;
    }

    const std::size_t maxHeaderBytes;
    const std::size_t maxBodyBytes;
    std::size_t headBytes = 0;
};

RequestParser::RequestParser(std::size_t maxHeaderBytes, std::size_t maxBodyBytes)
    : reading(std::make_unique<Reading>(maxHeaderBytes, maxBodyBytes)) {}

RequestParser::~RequestParser() = default;

std::size_t RequestParser::put(std::string_view bytes) {
    return reading->put(bytes);
}

RequestParser::State RequestParser::state() const noexcept {
    if (reading->status != 0) return State::refused;
    return reading->message->is_done() ? State::complete : State::incomplete;
}

int RequestParser::refusal() const noexcept {
    return reading->status;
}

bool RequestParser::takeExpectation() noexcept {
    Message& message = *reading->message;
    const bool hasBegun = !message.request.body.empty();
    return message.is_header_done() && std::exchange(message.isExpected, false) && !hasBegun;
}

const Request* RequestParser::takeHead() noexcept {
    Message& message = *reading->message;
    const bool isNew = message.is_header_done() && !std::exchange(message.isHeadTaken, true);
    return isNew ? &message.request : nullptr;
}

std::size_t RequestParser::bodySize() const noexcept {
    return reading->message->request.body.size();
}

bool RequestParser::keepsAlive() const noexcept {
    return reading->message->keep_alive();
}

bool RequestParser::isHead() const noexcept {
    return reading->message->request.method == "HEAD";
}

bool RequestParser::isOld() const noexcept {
    return reading->message->isOld;
}

Request RequestParser::take() {
    Request request = std::move(reading->message->request);
    reading->begin();
    return request;
}

}  // namespace velkor::http::detail::transport
