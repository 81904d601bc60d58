#include "http/detail/access/OwnNames.hpp"

#include <gtest/gtest.h>

#include <string>
#include <vector>

namespace velkor::http::detail {
namespace {

OwnNames namesOf(const std::vector<std::string>& endpoints,
                 const std::vector<std::string>& names = {}) {
    ServerOptions options;
    options.endpoints = endpoints;
    options.names = names;
    return OwnNames(options);
}

TEST(OwnNames, AreThoseOfTheMachineItself) {
    const OwnNames names = namesOf({"127.0.0.1:0"});
    for (const char* const host : {"localhost", "LocalHost:80", "127.0.0.1", "127.0.0.1:50312",
                                   "[::1]", "[::1]:8080", "[0:0:0:0:0:0:0:1]:1", "localhost:"}) {
        EXPECT_TRUE(names.contain(host)) << host;
    }
}

TEST(OwnNames, AreNoOthers) {
    const OwnNames names = namesOf({"127.0.0.1:0", "unix:/run/socket"});
    for (const char* const host : {"",
                                   "example.org",
                                   "localhost.example.org",
                                   "localhost.",
                                   "xlocalhost",
                                   "127.0.0.2",
                                   "10.0.0.1",
                                   "[::2]",
                                   "localhost:80:80",
                                   "localhost:x",
                                   "user@localhost",
                                   "[::1",
                                   "::1",
                                   "[::1]x",
                                   "[]",
                                   "127.1",
                                   "2130706433",
                                   "0.0.0.0",
                                   "localhost/",
                                   "localhost "}) {
        EXPECT_FALSE(names.contain(host)) << host;
    }
}

TEST(OwnNames, AreThoseThatAreGiven) {
    const OwnNames names = namesOf({"10.1.2.3:80"}, {"config.example.org"});
    EXPECT_TRUE(names.contain("config.example.org:443"));
    EXPECT_TRUE(names.contain("CONFIG.example.ORG"));
    EXPECT_FALSE(names.contain("other.example.org"));
}

TEST(OwnNames, AreTheAddressesThatAreListenedOn) {
    const OwnNames names = namesOf({"10.1.2.3:80", "[fe80:0:0::1]:80"});
    EXPECT_TRUE(names.contain("10.1.2.3:80"));
    EXPECT_TRUE(names.contain("[fe80::1]"));
    EXPECT_FALSE(names.contain("10.1.2.4"));
}

TEST(OwnNames, AreAllAddressesWhereAllAreListenedOn) {
    for (const char* const endpoint : {"0.0.0.0:80", "[::]:80"}) {
        const OwnNames names = namesOf({endpoint});
        EXPECT_TRUE(names.contain("192.168.7.7:80"));
        EXPECT_TRUE(names.contain("[2001:db8::7]:80"));
        EXPECT_FALSE(names.contain("rebound.example.org"));
    }
}

}  // namespace
}  // namespace velkor::http::detail
