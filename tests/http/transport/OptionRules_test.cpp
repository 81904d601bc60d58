#include "http/detail/transport/OptionRules.hpp"

#include <gtest/gtest.h>

#include <chrono>
#include <string>

#include "http/Refused.hpp"
#include "tests/support/Thrown.hpp"

namespace velkor::http::detail::transport {
namespace {

using velkor::testing::thrownText;

std::string complaint(const ServerOptions& options) {
    return thrownText<Refused>([&] { checkOptions(options); });
}

constexpr const char* none = "<nothing thrown>";

TEST(OptionRules, TakeTheDefaults) {
    EXPECT_EQ(complaint({}), none);
}

TEST(OptionRules, WantAnEndpoint) {
    ServerOptions options;
    options.endpoints.clear();
    EXPECT_EQ(complaint(options), "no address to listen on is given");
}

TEST(OptionRules, LetOtherMachinesComeOnlyWithProtection) {
    const std::string needs = "other machines can reach 0.0.0.0:80: that needs ";
    ServerOptions options;
    options.endpoints = {"127.0.0.1:0", "0.0.0.0:80"};
    EXPECT_EQ(complaint(options),
              needs + "TLS (a certificate and a key), or saying that a proxy ends it");
    options.tokenFile = "tokens";
    EXPECT_EQ(complaint(options),
              needs + "TLS (a certificate and a key), or saying that a proxy ends it");
    options.behindProxy = true;
    EXPECT_EQ(complaint(options), none);
    options.tokenFile.clear();
    EXPECT_EQ(complaint(options), needs + "a file of tokens");
    options.behindProxy = false;
    options.tlsCertificate = "certificate";
    EXPECT_EQ(complaint(options), needs + "a file of tokens");
    options.tokenFile = "tokens";
    EXPECT_EQ(complaint(options), none);
}

TEST(OptionRules, WantAThreadAndNotTooMany) {
    ServerOptions options;
    for (const unsigned threads : {0U, 65U}) {
        options.threads = threads;
        EXPECT_EQ(complaint(options), "threads must be 1 to 64");
    }
}

TEST(OptionRules, WantRoomInEveryLimit) {
    ServerOptions options;
    options.maxStreams = 0;
    EXPECT_EQ(complaint(options), "maxStreams must be at least 1");
}

TEST(OptionRules, WantTimesBetweenAMillisecondAndADay) {
    ServerOptions options;
    options.idleTimeout = std::chrono::milliseconds(0);
    EXPECT_EQ(complaint(options), "idleTimeout must be at least 1 ms");
    options.idleTimeout = std::chrono::hours(24);
    EXPECT_EQ(complaint(options), none);
    options.idleTimeout += std::chrono::milliseconds(1);
    EXPECT_EQ(complaint(options), "idleTimeout must be at most 24 h");
    options.idleTimeout = std::chrono::milliseconds::max();
    EXPECT_EQ(complaint(options), "idleTimeout must be at most 24 h");
}

}  // namespace
}  // namespace velkor::http::detail::transport
