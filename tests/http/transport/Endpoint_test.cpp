#include "http/detail/transport/Endpoint.hpp"

#include <gtest/gtest.h>

#include <string>

#include "http/Refused.hpp"
#include "tests/support/Thrown.hpp"

namespace velkor::http::detail::transport {
namespace {

using velkor::testing::thrownText;

TEST(Endpoint, ReadsAddresses) {
    struct Row {
        const char* text;
        const char* read;
        bool isLocal;
        std::uint16_t port;
    };
    const Row rows[] = {{"8080", "127.0.0.1:8080", true, 8080},
                        {"0", "127.0.0.1:0", true, 0},
                        {"127.0.0.1:65535", "127.0.0.1:65535", true, 65535},
                        {"127.1.2.3:1", "127.1.2.3:1", true, 1},
                        {"0.0.0.0:80", "0.0.0.0:80", false, 80},
                        {"192.168.1.2:80", "192.168.1.2:80", false, 80},
                        {"[::1]:80", "[::1]:80", true, 80},
                        {"[0:0:0:0:0:0:0:1]:80", "[::1]:80", true, 80},
                        {"[::]:80", "[::]:80", false, 80},
                        {"[2001:db8::1]:80", "[2001:db8::1]:80", false, 80},
                        {"[::ffff:127.0.0.1]:80", "[::ffff:127.0.0.1]:80", false, 80},
                        {"unix:/run/a b:c", "unix:/run/a b:c", true, 0},
                        {"unix:relative", "unix:relative", true, 0}};
    for (const Row& row : rows) {
        SCOPED_TRACE(row.text);
        const Endpoint endpoint{std::string_view(row.text)};
        EXPECT_EQ(endpoint.text(), row.read);
        EXPECT_EQ(endpoint.isLocal(), row.isLocal);
        EXPECT_EQ(endpoint.port(), row.port);
    }
}

TEST(Endpoint, RefusesWhatIsNone) {
    using namespace std::string_literals;
    for (const std::string& text : {""s,           "a"s,
                                    ":80"s,        "65536"s,
                                    "-1"s,         "+1"s,
                                    " 80"s,        "80 "s,
                                    "0x50"s,       "localhost:80"s,
                                    "127.0.0.1"s,  "127.0.0.1:"s,
                                    "127.0.0:80"s, "127.0.0.1.1:80"s,

                                    "::1:80"s,     "[::1]"s,
                                    "[::1]80"s,    "[]:80"s,
                                    "[::1:80"s,    "[127.0.0.1]:80"s,
                                    "Unix:/a"s}) {
        SCOPED_TRACE(text);
        EXPECT_EQ(thrownText<Refused>([&] { Endpoint{std::string_view(text)}; }),
                  "'" + text +
                      "' is no address to listen on: give [ADDRESS:]PORT, with ADDRESS in digits, "
                      "or unix:PATH");
    }
}

TEST(Endpoint, DoesNotStopAtANul) {
    EXPECT_THROW(Endpoint(std::string_view("127.0.0.1\0:80", 13)), Refused);
    EXPECT_THROW(Endpoint(std::string_view("unix:a\0b", 8)), Refused);
}

TEST(Endpoint, RefusesPathsThatTheSystemHasNoRoomFor) {
    const std::string longest(107, 'p');
    EXPECT_EQ(Endpoint("unix:" + longest).path(), longest);
    EXPECT_EQ(thrownText<Refused>([&] { Endpoint("unix:" + longest + "p"); }),
              "can't listen on unix:" + longest + "p: the path is too long");
    EXPECT_EQ(thrownText<Refused>([] { Endpoint("unix:"); }),
              "can't listen on unix:: no path is given");
}

TEST(Endpoint, CountsAnAddressOrANetworkAsOneOrigin) {
    const auto origin = [](const char* text) { return Endpoint(std::string_view(text)).origin(); };
    EXPECT_EQ(origin("1.2.3.4:1"), origin("1.2.3.4:2"));
    EXPECT_NE(origin("1.2.3.4:1"), origin("1.2.3.5:1"));
    EXPECT_EQ(origin("[1:2:3:4:5::]:1"), origin("[1:2:3:4:6::]:1"));
    EXPECT_NE(origin("[1:2:3:4::]:1"), origin("[1:2:3:5::]:1"));
    EXPECT_EQ(origin("127.0.0.1:1"), origin("127.9.9.9:1"));
    EXPECT_NE(origin("0.0.0.0:1"), origin("[::1]:1"));
    EXPECT_FALSE(origin("unix:/a"));
}

}  // namespace
}  // namespace velkor::http::detail::transport
