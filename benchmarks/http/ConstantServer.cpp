#include <boost/asio/io_context.hpp>
#include <boost/asio/ip/tcp.hpp>
#include <boost/beast/core/flat_buffer.hpp>
#include <boost/beast/core/tcp_stream.hpp>
#include <boost/beast/http.hpp>
#include <memory>
#include <string>
#include <thread>
#include <utility>

#include "benchmarks/http/ServerProcess.hpp"

namespace velkor::benchmarks {
namespace {

namespace asio = boost::asio;
namespace beast = boost::beast;
namespace http = beast::http;
using asio::ip::tcp;
using beast::error_code;

class Session : public std::enable_shared_from_this<Session> {
public:
    Session(tcp::socket&& socket, const std::string& constant)
        : stream(std::move(socket)), body(constant) {}

    void read() {
        request = {};
        http::async_read(stream, buffer, request,
                         [self = shared_from_this()](error_code error, std::size_t) {
                             if (!error) self->write();
                         });
    }

private:
    void write() {
        response = {http::status::ok, request.version()};
        response.set(http::field::content_type, "application/json");
        response.set("Message-Type", "velkor/configuration/ConfigurationOptionResponse");
        response.keep_alive(request.keep_alive());
        response.body() = body;
        response.prepare_payload();
        http::async_write(stream, response,
                          [self = shared_from_this()](error_code error, std::size_t) {
                              if (!error) self->read();
                          });
    }

    beast::tcp_stream stream;
    const std::string& body;
    beast::flat_buffer buffer;
    http::request<http::string_body> request;
    http::response<http::string_body> response;
};

void accept(tcp::acceptor& acceptor, const std::string& body) {
    acceptor.async_accept([&](error_code error, tcp::socket socket) {
        if (error) return;
        socket.set_option(tcp::no_delay(true));
        std::make_shared<Session>(std::move(socket), body)->read();
        accept(acceptor, body);
    });
}

}  // namespace

void serveConstant(const std::string& body, const std::function<void(std::uint16_t)>& tellPort,
                   const std::function<void()>& awaitEnd) {
    asio::io_context context(1);
    tcp::acceptor acceptor(context, {asio::ip::address_v4::loopback(), 0});
    accept(acceptor, body);
    std::thread thread([&] { context.run(); });
    tellPort(acceptor.local_endpoint().port());
    awaitEnd();
    context.stop();
    thread.join();
}

}  // namespace velkor::benchmarks
