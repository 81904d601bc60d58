#include "layers/etcd/detail/Endpoint.hpp"

#include <gtest/gtest.h>

#include <chrono>
#include <stdexcept>
#include <string>

#include "layers/etcd/detail/Backoff.hpp"
#include "tests/support/Thrown.hpp"

namespace velkor::layers::etcd {
namespace {

using std::chrono::milliseconds;
using testing::thrownText;

std::string partsOf(const std::string& text) {
    const Endpoint endpoint = toEndpoints({text}).front();
    return endpoint.host + " " + endpoint.port + (endpoint.isSecure ? " secure" : "");
}

TEST(EtcdEndpoint, HasHostAndPort) {
    EXPECT_EQ(partsOf("http://a.example:23790"), "a.example 23790");
    EXPECT_EQ(partsOf("https://10.0.0.1:1/"), "10.0.0.1 1 secure");
    EXPECT_EQ(partsOf("http://[::1]:5"), "::1 5");
    EXPECT_EQ(partsOf("https://[fe80::1]"), "fe80::1 2379 secure");
    EXPECT_EQ(partsOf("http://localhost"), "localhost 2379");
}

TEST(EtcdEndpoint, IsRefusedWhenItIsNone) {
    for (const char* text : {"", "localhost:2379", "ftp://a", "http://", "http://a:", "http://a:x",
                             "http://a:65536", "http://a:1/x", "http://a b", "http://[::1",
                             "http://::1", "http://a\r\nX: y", "http://a:1:2"}) {
        EXPECT_EQ(thrownText<std::invalid_argument>([&] { toEndpoints({text}); }),
                  std::string("Not an etcd endpoint: ") + text);
    }
}

TEST(EtcdEndpoint, WithAPasswordIsRefusedWithoutIt) {
    EXPECT_EQ(thrownText<std::invalid_argument>([] { toEndpoints({"http://me:secret@a:1"}); }),
              "Not an etcd endpoint: a:1");
}

TEST(EtcdEndpoint, IsNeeded) {
    EXPECT_EQ(thrownText<std::invalid_argument>([] { toEndpoints({}); }),
              "An etcd endpoint is needed.");
}

TEST(EtcdEndpoint, ComesRound) {
    EndpointRound round(toEndpoints({"http://a", "http://b"}), 3);
    EXPECT_EQ(round.current().host, "b");
    round.next();
    EXPECT_EQ(round.current().host, "a");
    round.next();
    EXPECT_EQ(round.current().host, "b");
}

TEST(EtcdBackoff, GrowsToTheLongestAndStartsAgain) {
    Backoff backoff(milliseconds(100), milliseconds(350), 1);
    for (const int whole : {100, 200, 350, 350}) {
        const auto pause = backoff.next();
        EXPECT_LE(pause, milliseconds(whole));
        EXPECT_GE(pause, milliseconds(whole / 2));
    }
    backoff.reset();
    EXPECT_LE(backoff.next(), milliseconds(100));
}

TEST(EtcdBackoff, DiffersFromOneToTheOther) {
    Backoff one(milliseconds(100'000), milliseconds(100'000), 1);
    Backoff other(milliseconds(100'000), milliseconds(100'000), 2);
    EXPECT_NE(one.next(), other.next());
}

}  // namespace
}  // namespace velkor::layers::etcd
