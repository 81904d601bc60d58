#include "http/detail/transport/Tls.hpp"

#include <gtest/gtest.h>
#include <openssl/ssl.h>

#include <array>
#include <memory>
#include <string>
#include <string_view>

#include "http/Refused.hpp"
#include "tests/http/transport/Certificate.hpp"
#include "tests/http/transport/ListenerTesting.hpp"
#include "tests/support/TemporaryFile.hpp"
#include "tests/support/Thrown.hpp"

namespace velkor::http::detail::transport {
namespace {

using velkor::testing::Certificate;
using velkor::testing::completes;
using velkor::testing::HttpClient;
using velkor::testing::TemporaryFile;
using velkor::testing::thrownText;

const Certificate& certificate() {
    static const Certificate made;
    return made;
}

ServerOptions secureOptions() {
    ServerOptions options;
    options.tlsCertificate = certificate().certificatePath();
    options.tlsKey = certificate().keyPath();
    return options;
}

// A client that speaks TLS, no newer than `newest`.
class TlsClient {
public:
    explicit TlsClient(std::uint16_t port, int newest = TLS1_3_VERSION)
        : client(port), context(::SSL_CTX_new(::TLS_client_method()), ::SSL_CTX_free) {
        ::SSL_CTX_set_security_level(context.get(), 0);
        ::SSL_CTX_set_max_proto_version(context.get(), newest);
        connection.reset(::SSL_new(context.get()));
        ::SSL_set_fd(connection.get(), client.socket());
        isConnected = ::SSL_connect(connection.get()) == 1;
    }

    bool connected() const { return isConnected; }

    void send(std::string_view bytes) {
        ::SSL_write(connection.get(), bytes.data(), static_cast<int>(bytes.size()));
    }

    // What comes up to `mark`, or until the connection ends.
    std::string readUntil(std::string_view mark) {
        std::string text;
        while (text.find(mark) == std::string::npos) {
            std::array<char, 4096> block;
            const int size = ::SSL_read(connection.get(), block.data(), block.size());
            if (size <= 0) break;
            text.append(block.data(), static_cast<std::size_t>(size));
        }
        return text;
    }

    // Whether the server said that nothing more comes, as opposed to what somebody cut off.
    bool sawEnd() const {
        return (::SSL_get_shutdown(connection.get()) & SSL_RECEIVED_SHUTDOWN) != 0;
    }

    const SSL* ssl() const { return connection.get(); }
    HttpClient client;

private:
    std::unique_ptr<SSL_CTX, decltype(&::SSL_CTX_free)> context;
    std::unique_ptr<SSL, decltype(&::SSL_free)> connection{nullptr, ::SSL_free};
    bool isConnected = false;
};

TEST(Tls, CarriesRequestsAndAnswers) {
    const Serving serving(secureOptions());
    for (const int version : {TLS1_2_VERSION, TLS1_3_VERSION}) {
        TlsClient client(serving.port(), version);
        ASSERT_TRUE(client.connected());
        EXPECT_EQ(::SSL_version(client.ssl()), version);
        for (int i = 0; i < 3; ++i) {
            client.send("GET /secret HTTP/1.1\r\n\r\n");
            EXPECT_NE(client.readUntil("GET /secret ").find("HTTP/1.1 200 OK"), std::string::npos);
        }
    }
}

TEST(Tls, OlderThan12IsRefused) {
    const Serving serving(secureOptions());
    EXPECT_FALSE(TlsClient(serving.port(), TLS1_1_VERSION).connected());
}

TEST(Tls, IsKnownToTheHandler) {
    const TemporaryFile folder("");
    ServerOptions options = secureOptions();
    const std::string path = folder.path().string() + ".socket";
    options.endpoints.push_back("unix:" + path);
    const Serving serving(options, [](Request&& request, const ScriptedHandler::Reply& answer) {
        answer(ScriptedHandler::text(request.client.secure ? "secure" : "plain"));
    });
    TlsClient client(serving.port());
    client.send("GET / HTTP/1.1\r\n\r\n");
    EXPECT_NE(client.readUntil("secure").find("secure"), std::string::npos);
    // A unix socket needs none.
    EXPECT_EQ(HttpClient(path).ask("GET /").body, "plain");
}

TEST(Tls, EndsSoThatNothingCanBeCutOff) {
    const Serving serving(secureOptions());
    TlsClient client(serving.port());
    client.send("GET / HTTP/1.1\r\nConnection: close\r\n\r\n");
    client.readUntil("never");
    EXPECT_TRUE(client.sawEnd());
}

TEST(Tls, CarriesLargeAnswers) {
    constexpr std::size_t size = std::size_t{3} << 20U;
    const Serving serving(secureOptions(), [](Request&&, const ScriptedHandler::Reply& answer) {
        answer(ScriptedHandler::text(std::string(size, 'x') + "end"));
    });
    TlsClient client(serving.port());
    client.send("GET / HTTP/1.1\r\n\r\n");
    EXPECT_GT(client.readUntil("end").size(), size);
}

TEST(Tls, RefusesTooLargeABodyWithAnAnswer) {
    const Serving serving(secureOptions());
    TlsClient client(serving.port());
    client.send("POST / HTTP/1.1\r\nContent-Length: 2000000\r\n\r\n" + std::string(100'000, 'b'));
    EXPECT_NE(client.readUntil("refused with 413").find("HTTP/1.1 413 "), std::string::npos);
}

TEST(Tls, CarriesStreamsUntilTheClientGoes) {
    const auto control = std::make_shared<FeedControl>();
    const Serving serving(secureOptions(), streaming(control));
    {
        TlsClient client(serving.port());
        client.send("GET /stream HTTP/1.1\r\n\r\n");
        control->push("event\n\n");
        EXPECT_NE(client.readUntil("event\n\n").find("event\n\n"), std::string::npos);
    }
    EXPECT_TRUE(control->ended.wait());
}

TEST(Tls, StreamsEndWithTheServer) {
    const auto control = std::make_shared<FeedControl>();
    const Serving serving(secureOptions(), streaming(control));
    TlsClient client(serving.port());
    client.send("GET /stream HTTP/1.1\r\n\r\n");
    client.readUntil("\r\n\r\n");
    EXPECT_TRUE(completes([&] { serving.listener->stop(); }));
    EXPECT_TRUE(control->ended.isOpen());
}

TEST(Tls, AStreamThatIsOverEndsSoThatNothingCanBeCutOff) {
    const auto control = std::make_shared<FeedControl>();
    const Serving serving(secureOptions(), streaming(control));
    TlsClient client(serving.port());
    client.send("GET /stream HTTP/1.1\r\n\r\n");
    client.readUntil("\r\n\r\n");
    control->push("last\n\n");
    control->finish();
    EXPECT_EQ(client.readUntil("never"), "last\n\n");
    EXPECT_TRUE(client.sawEnd());
}

TEST(Tls, ARequestThatIsNotCompleteInTimeIsToldSo) {
    ServerOptions options = secureOptions();
    options.requestTimeout = std::chrono::milliseconds(1000);
    const Serving serving(options);
    TlsClient client(serving.port());
    ASSERT_TRUE(client.connected());
    client.send("GET / HTTP/1.1\r\nX: ");
    EXPECT_NE(client.readUntil("refused with 408").find("HTTP/1.1 408 "), std::string::npos);
}

TEST(Tls, IsNotSpokenForEver) {
    ServerOptions options = secureOptions();
    options.requestTimeout = std::chrono::milliseconds(20);
    const Serving serving(options);
    EXPECT_EQ(HttpClient(serving.port()).readToEnd(), "");
}

TEST(Tls, PlainTextEndsTheConnection) {
    const Serving serving(secureOptions());
    HttpClient client(serving.port());
    client.send("GET / HTTP/1.1\r\n\r\n");
    client.readToEnd();
    EXPECT_EQ(serving.counts->requestsRead, 0U);
    EXPECT_TRUE(TlsClient(serving.port()).connected());
}

TEST(TlsFiles, GiveNothingIfThereAreNone) {
    EXPECT_EQ(tlsContext("", ""), nullptr);
}

TEST(TlsFiles, AreTwo) {
    const char* const text = "TLS needs both a certificate and a key";
    EXPECT_EQ(thrownText<Refused>([] { tlsContext(certificate().certificatePath(), ""); }), text);
    EXPECT_EQ(thrownText<Refused>([] { tlsContext("", certificate().keyPath()); }), text);
}

TEST(TlsFiles, SayWhyTheyCanNotBeUsed) {
    const TemporaryFile other("hello\n");
    const Certificate another;
    const std::string good = certificate().certificatePath();
    const std::string wrong = other.path().string();
    const auto complaint = [](const std::string& chain, const std::string& key) {
        return thrownText<Refused>([&] { tlsContext(chain, key); });
    };
    EXPECT_EQ(complaint("/missing.pem", certificate().keyPath()),
              "can't use the certificate /missing.pem: No such file or directory");
    EXPECT_EQ(complaint(good, "/missing.pem"),
              "can't use the key /missing.pem: No such file or directory");
    EXPECT_EQ(complaint(wrong, certificate().keyPath()),
              "can't use the certificate " + wrong + ": no certificate in PEM is in it");
    EXPECT_EQ(complaint(good, wrong), "can't use the key " + wrong + ": no key in PEM is in it");
    EXPECT_EQ(complaint(good, another.keyPath()),
              "can't use the key " + another.keyPath() + ": it is not that of the certificate");
}

}  // namespace
}  // namespace velkor::http::detail::transport
