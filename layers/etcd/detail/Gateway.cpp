#include "layers/etcd/detail/Gateway.hpp"

#include <boost/asio/write.hpp>
#include <boost/beast/http/error.hpp>
#include <boost/beast/http/read.hpp>
#include <boost/beast/http/string_body.hpp>

#include <algorithm>
#include <filesystem>
#include <fstream>
#include <string_view>
#include <system_error>
#include <utility>

#include "layers/etcd/detail/GatewayErrors.hpp"
#include "layers/etcd/detail/JsonReader.hpp"
#include "layers/etcd/detail/Requests.hpp"

namespace velkor::layers::etcd {

namespace http = boost::beast::http;
using boost::system::error_code;
using std::chrono::milliseconds;
using std::chrono::steady_clock;

namespace {

constexpr std::uint32_t longestHeader = 64U << 10U;
constexpr const char* endlessLength = "4611686018427387904";
constexpr milliseconds firstBlank{1};
constexpr milliseconds longestBlank{100};

[[noreturn]] void giveUp(const error_code& error) {
    if (error == boost::asio::error::timed_out) throw Unreachable("no answer in time");
    if (error == boost::asio::error::eof || error == http::error::end_of_stream ||
        error == http::error::partial_message) {
        throw Unreachable("the connection has ended");
    }
    throw Unreachable(error.message());
}

// What is no file might wait for somebody who writes, or never end.
std::string passwordIn(const std::string& file) {
    std::error_code missing;
    std::ifstream in;
    if (std::filesystem::is_regular_file(file, missing)) in.open(file);
    std::string password;
    if (!std::getline(in, password)) throw Unreachable("can't read the password in " + file);
    return password;
}

}  // namespace

Gateway::Gateway(const Endpoint& where, const EtcdOptions& how, const Stop& stop, Time deadline)
    : endpoint(where), options(how), link(where, how, stop, deadline) {
    if (!options.user.empty()) authenticate(deadline);
}

void Gateway::authenticate(Time deadline) {
    const std::string body = authenticationRequest(options.user, passwordIn(options.passwordFile));
    const std::string newToken = readToken(ask("/v3/auth/authenticate", body, deadline));
    const auto isPlain = [](char c) { return c > ' ' && c < '\x7F'; };
    if (!std::all_of(newToken.begin(), newToken.end(), isPlain)) {
        throw Unreachable("the token makes no sense");
    }
    token = newToken;
}

std::string Gateway::header(const char* path, const std::string& length) const {
    const bool isBracketed = endpoint.host.find(':') != std::string::npos;
    const std::string host = isBracketed ? "[" + endpoint.host + "]" : endpoint.host;
    // A member that has lost its leader is to say so instead of being silent.
    return std::string("POST ") + path + " HTTP/1.1\r\nHost: " + host + ":" + endpoint.port +
           "\r\nContent-Type: application/json\r\nGrpc-Metadata-hasleader: true\r\n" +
           (token.empty() ? "" : "Authorization: " + token + "\r\n") + "Content-Length: " + length +
           "\r\n\r\n";
}

std::string Gateway::ask(const char* path, const std::string& body, Time deadline,
                         milliseconds silence) {
    isBroken = true;
    link.setDeadline(deadline);
    send(header(path, std::to_string(body.size())) + body);
    return receive(deadline, silence);
}

void Gateway::send(const std::string& text) {
    error_code error;
    boost::asio::write(link, boost::asio::buffer(text), error);
    if (error) giveUp(error);
}

std::string Gateway::receive(Time deadline, milliseconds silence) {
    http::response_parser<http::string_body> parser;
    parser.header_limit(longestHeader);
    parser.body_limit(options.longestAnswer);
    while (!parser.is_done()) {
        const auto left = deadline - steady_clock::now();
        link.setDeadline(left > silence ? steady_clock::now() + silence : deadline);
        error_code error;
        http::read_some(link, buffer, parser, error);
        if (error) giveUp(error);
    }
    isBroken = !parser.keep_alive();
    if (parser.get().result() == http::status::ok) return std::move(parser.get().body());
    const ErrorAnswer answer = readError(parser.get().body());
    throw Refused(answer.code, answer.message);
}

WatchStream::WatchStream(Gateway& taken, const std::string& prefix, std::int64_t revision,
                         Time deadline)
    : gateway(taken) {
    parser.header_limit(longestHeader);
    parser.body_limit(boost::none);
    gateway.isBroken = true;
    gateway.link.setDeadline(deadline);
    gateway.send(gateway.header("/v3/watch", endlessLength) + watchRequest(prefix, revision));
    readHeader(deadline);
    if (parser.get().result() != http::status::ok) refuse(deadline);
}

void WatchStream::readHeader(Time deadline) {
    milliseconds pause = firstBlank;
    while (!parser.is_header_done()) {
        const Time now = steady_clock::now();
        if (now >= deadline) giveUp(boost::asio::error::timed_out);
        gateway.link.setDeadline(std::min(deadline, now + pause));
        error_code error;
        http::read_some(gateway.link, gateway.buffer, parser, error);
        if (error && error != boost::asio::error::timed_out) giveUp(error);
        if (!error) continue;
        pause = std::min(2 * pause, longestBlank);
        gateway.link.setDeadline(deadline);
        gateway.send("\n");
    }
}

// The body says why.
void WatchStream::refuse(Time deadline) {
    while (!parser.is_done() && lines.size() < longestHeader && readSome(deadline)) continue;
    const ErrorAnswer answer = readError(lines);
    throw Refused(answer.code, answer.message);
}

void WatchStream::askForProgress() {
    gateway.link.setDeadline(steady_clock::now() + gateway.options.silence);
    gateway.send(progressRequest());
}

bool WatchStream::readSome(Time deadline) {
    gateway.link.setDeadline(deadline);
    parser.get().body().data = part.data();
    parser.get().body().size = part.size();
    error_code error;
    http::read_some(gateway.link, gateway.buffer, parser, error);
    const std::size_t size = part.size() - parser.get().body().size;
    lines.append(part.data(), size);
    if (error && error != boost::asio::error::timed_out && error != http::error::need_buffer) {
        giveUp(error);
    }
    return size > 0;
}

bool WatchStream::receive(Time deadline, const std::function<void(WatchAnswer&&)>& onAnswer) {
    if (parser.is_done()) throw Unreachable("the connection has ended");
    const std::size_t before = lines.size();
    if (!readSome(deadline)) return false;
    std::size_t begin = 0;
    std::size_t end = lines.find('\n', before);
    while (end != std::string::npos) {
        const auto line = std::string_view(lines).substr(begin, end - begin);
        if (!line.empty()) onAnswer(readWatch(line));
        begin = end + 1;
        end = lines.find('\n', begin);
    }
    lines.erase(0, begin);
    if (lines.size() > gateway.options.longestAnswer) throw Unreachable("the answer is too long");
    return true;
}

}  // namespace velkor::layers::etcd
