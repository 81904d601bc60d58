#include "fuzz/http/LiteralWire.hpp"

#include <algorithm>
#include <optional>
#include <sstream>
#include <string>
#include <utility>
#include <vector>

#include "fuzz/Finding.hpp"
#include "http/detail/Exchange.hpp"
#include "http/detail/transport/RequestParser.hpp"

namespace velkor::fuzz::http {

namespace {

using velkor::http::detail::Request;
using velkor::http::detail::transport::RequestParser;

// Small, so that few bytes reach them.
constexpr std::size_t headLimit = 64;
constexpr std::size_t bodyLimit = 12;

constexpr std::string_view lineEnd = "\r\n";

std::string spelledRequest(const Request& request) {
    std::string text = request.method + ' ' + spelled(request.target);
    for (const auto& [name, value] : request.headers) {
        text += ' ' + std::string(name) + '=' + spelled(value);
    }
    return text + " body " + spelled(request.body) + '\n';
}

// ---- What is read, in pieces of some size

/// The requests that were read, and what became of the rest.
struct Outcome {
    std::string requests;
    bool isRefused = false;
    bool isIncomplete = false;  // it may be known already that it is none
};

Outcome readInPieces(std::string_view bytes, std::size_t size) {
    using State = RequestParser::State;
    RequestParser parser(headLimit, bodyLimit);
    Outcome outcome;
    std::size_t taken = 0;
    for (std::size_t end = 0; end < bytes.size() && parser.state() != State::refused;) {
        end = std::min(bytes.size(), end + size);
        do {
            taken += parser.put(bytes.substr(taken, end - taken));
            if (parser.state() != State::complete) break;
            outcome.requests += spelledRequest(parser.take());
        } while (taken < end);
    }
    outcome.isRefused = parser.state() == State::refused;
    const int status = parser.refusal();
    expectThat(!outcome.isRefused || status == 400 || status == 413 || status == 431,
               "A refusal has its status", std::to_string(status));
    return outcome;
}

// ---- The second reading

/// The bytes are no request.
struct NoRequest {};

/// More bytes are needed.
struct Incomplete {};

void require(bool holds) {
    if (!holds) throw NoRequest();
}

std::string lowered(std::string text) {
    for (char& byte : text) {
        if (byte >= 'A' && byte <= 'Z') byte = static_cast<char>(byte - 'A' + 'a');
    }
    return text;
}

bool consistsOf(const std::string& text, std::string_view bytes) {
    return text.find_first_not_of(bytes) == std::string::npos;
}

bool isToken(const std::string& text) {
    return !text.empty() && consistsOf(text,
                                       "!#$%&'*+-.^_`|~0123456789abcdefghijklmnopqrstuvwxyz"
                                       "ABCDEFGHIJKLMNOPQRSTUVWXYZ");
}

std::string withoutBlanks(std::string text) {
    text.erase(0, text.find_first_not_of(" \t"));
    text.erase(text.find_last_not_of(" \t") + 1);
    return text;
}

// Names with commas between, some of them left out.
bool isTokenList(const std::string& text) {
    std::istringstream elements(text);
    for (std::string element; std::getline(elements, element, ',');) {
        element = withoutBlanks(element);
        if (!element.empty() && !isToken(element)) return false;
    }
    return true;
}

bool isControl(char byte) {
    const auto code = static_cast<unsigned char>(byte);
    return (code < 0x20 && byte != '\t') || code == 0x7F;
}

/// Reads one request after the other, as RFC 9112 and the header of the parser say.
class WireReader {
public:
    explicit WireReader(std::string_view bytes) : rest(bytes) {}

    Outcome read() {
        Outcome outcome;
        try {
            while (!rest.empty()) outcome.requests += spelledRequest(readRequest());
        } catch (const NoRequest&) {
            outcome.isRefused = true;
        } catch (const Incomplete&) {
            outcome.isIncomplete = true;
        }
        return outcome;
    }

private:
    std::string takeLine() {
        const std::size_t end = rest.find(lineEnd);
        if (end == std::string_view::npos) throw Incomplete();
        std::string line(rest.substr(0, end));
        rest.remove_prefix(end + lineEnd.size());
        return line;
    }

    std::string take(std::size_t size) {
        if (rest.size() < size) throw Incomplete();
        std::string bytes(rest.substr(0, size));
        rest.remove_prefix(size);
        return bytes;
    }

    Request readRequest() {
        const std::size_t head = rest.find("\r\n\r\n");
        if (head == std::string_view::npos) throw Incomplete();
        require(head + 4 <= headLimit);
        Request request;
        length.reset();
        isChunked = false;
        readFirstLine(takeLine(), request);
        for (std::string line = takeLine(); !line.empty(); line = takeLine()) {
            readHeader(line, request);
        }
        require(!isChunked || !length);
        takeHostFromTarget(request);
        request.body = isChunked ? readChunks() : readBody();
        return request;
    }

    void readFirstLine(const std::string& line, Request& request) {
        const std::size_t first = line.find(' ');
        const std::size_t second = line.find(' ', first + 1);
        require(first != std::string::npos && second != std::string::npos);
        request.method = line.substr(0, first);
        request.target = line.substr(first + 1, second - first - 1);
        require(isToken(request.method) && !request.target.empty());
        require(std::none_of(request.target.begin(), request.target.end(),
                             [](char byte) { return isControl(byte) || byte == '\t'; }));
        const std::string version = line.substr(second + 1);
        require(version == "HTTP/1.1" || version == "HTTP/1.0");
        isOld = version == "HTTP/1.0";
    }

    // "Name: value", the name in lower case.
    static std::pair<std::string, std::string> readField(const std::string& line) {
        const std::size_t colon = line.find(':');
        require(colon != std::string::npos);
        const std::string name = line.substr(0, colon);
        const std::string value = withoutBlanks(line.substr(colon + 1));
        require(isToken(name) && std::none_of(value.begin(), value.end(), isControl));
        const bool isList = lowered(name) == "connection" || lowered(name) == "proxy-connection";
        require(!isList || isTokenList(value));
        return {lowered(name), value};
    }

    // What the body is made of can't be said behind it.
    static void readTrailer(const std::string& line) {
        const std::string name = readField(line).first;
        require(name != "transfer-encoding" && name != "content-length");
    }

    void readHeader(const std::string& line, Request& request) {
        const auto [name, value] = readField(line);
        if (name == "transfer-encoding") {
            require(!isOld && !isChunked && lowered(value) == "chunked");
            isChunked = true;
        } else if (name == "content-length") {
            require(!length && !value.empty() && consistsOf(value, "0123456789"));
            length = value.substr(std::min(value.find_first_not_of('0'), value.size() - 1));
        }
        for (const std::string_view passed : velkor::http::detail::passedHeaders) {
            if (passed == name) request.headers.emplace_back(passed, value);
        }
    }

    static void takeHostFromTarget(Request& request) {
        const std::string scheme = lowered(request.target.substr(0, 8));
        const std::size_t begin =
            scheme.substr(0, 7) == "http://" ? 7 : (scheme == "https://" ? 8 : 0);
        if (begin == 0) return;
        const std::size_t end =
            std::min(request.target.find_first_of("/?", begin), request.target.size());
        const std::string host = request.target.substr(begin, end - begin);
        request.target.erase(0, end);
        if (request.target.substr(0, 1) != "/") request.target.insert(0, "/");
        std::vector<std::pair<std::string_view, std::string>> headers;
        for (auto& header : request.headers) {
            if (header.first != "host") headers.push_back(header);
        }
        headers.emplace_back("host", host);
        request.headers = headers;
    }

    std::string readBody() {
        if (!length) return {};
        require(length->size() <= 2 && std::stoul(*length) <= bodyLimit);
        return take(std::stoul(*length));
    }

    std::string readChunks() {
        std::string body;
        for (;;) {
            const std::string line = takeLine();
            const std::size_t end =
                std::min(line.find_first_not_of("0123456789abcdefABCDEF"), line.size());
            std::string digits = line.substr(0, end);
            require(!digits.empty());
            readExtensions(std::string_view(line).substr(end));
            digits.erase(0, std::min(digits.find_first_not_of('0'), digits.size() - 1));
            require(digits.size() <= 2);
            const std::size_t size = std::stoul(digits, nullptr, 16);
            if (size == 0) break;
            require(body.size() + size <= bodyLimit);
            body += take(size);
            require(take(2) == lineEnd);
        }
        for (std::string line = takeLine(); !line.empty(); line = takeLine()) readTrailer(line);
        return body;
    }

    // What follows the size of a chunk: ";name", ";name=value", ";name=\"text\"".
    static void readExtensions(std::string_view text) {
        while (!text.empty()) {
            require(takeIf(text, ';'));
            takeToken(text);
            const bool isLast = text.empty();
            if (!takeIf(text, '=')) {
                require(isLast || !text.empty());  // no blanks at the end
                continue;
            }
            skipBlanks(text);
            if (text.substr(0, 1) == "\"") {
                takeQuoted(text);
            } else {
                takeToken(text);
            }
        }
    }

    static void skipBlanks(std::string_view& text) {
        text.remove_prefix(std::min(text.find_first_not_of(" \t"), text.size()));
    }

    static bool takeIf(std::string_view& text, char wanted) {
        skipBlanks(text);
        if (text.empty() || text.front() != wanted) return false;
        text.remove_prefix(1);
        return true;
    }

    static void takeToken(std::string_view& text) {
        skipBlanks(text);
        std::size_t size = 0;
        while (size < text.size() && isToken(std::string(1, text[size]))) ++size;
        require(size > 0);
        text.remove_prefix(size);
    }

    static void takeQuoted(std::string_view& text) {
        text.remove_prefix(1);
        while (!text.empty() && text.front() != '"') {
            text.remove_prefix(text.front() == '\\' ? std::min<std::size_t>(2, text.size()) : 1);
        }
        require(!text.empty());
        text.remove_prefix(1);
    }

    std::string_view rest;
    bool isOld = false;
    bool isChunked = false;
    std::optional<std::string> length;  // without zeros in front
};

}  // namespace

void checkWire(std::string_view bytes) {
    if (bytes.empty()) return;
    const std::size_t size = 1 + static_cast<unsigned char>(bytes.front()) % 16;
    bytes.remove_prefix(1);
    const Outcome expected = WireReader(bytes).read();
    for (const std::size_t each : {bytes.size(), std::size_t{1}, size}) {
        const Outcome actual = readInPieces(bytes, each);
        expectSame("Requests in " + spelled(bytes), expected.requests, actual.requests);
        expectThat(!actual.isRefused || expected.isRefused || expected.isIncomplete,
                   "What is a request is taken", spelled(bytes));
    }
}

}  // namespace velkor::fuzz::http
