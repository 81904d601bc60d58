#include "host/serving/ListenOptions.hpp"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <ostream>
#include <string>
#include <vector>

#include "host/Options.hpp"
#include "tests/support/Thrown.hpp"

namespace velkor::host {
namespace {

using http::ServerOptions;
using ::testing::HasSubstr;
using velkor::testing::thrownText;
using Words = std::vector<std::string>;

ServerOptions serverOf(const Words& arguments) {
    Words all{"--listen", "0"};
    all.insert(all.end(), arguments.begin(), arguments.end());
    return parseOptions(all).serving.value().server;
}

std::string usageError(const Words& arguments) {
    return thrownText<UsageError>([&] { parseOptions(arguments); });
}

TEST(ListenOptions, ServeNobodyUnlessTheySaySo) {
    EXPECT_FALSE(parseOptions({}).serving.has_value());
    EXPECT_FALSE(parseOptions({"a", "-c", "list"}).serving.has_value());
}

TEST(ListenOptions, AreSafeUnlessTheySayOtherwise) {
    const auto serving = parseOptions({"--listen", "8080"}).serving.value();
    EXPECT_FALSE(serving.withConsole);
    EXPECT_FALSE(serving.server.allowWrites);
    EXPECT_FALSE(serving.server.behindProxy);
    EXPECT_EQ(serving.server.tokenFile, "");
    EXPECT_EQ(serving.server.tlsCertificate, "");
    EXPECT_EQ(serving.server.tlsKey, "");
    EXPECT_EQ(serving.server.propertyRoot, "");
    EXPECT_EQ(serving.server.names, Words{});
}

TEST(ListenOptions, TakeSeveralEndpointsInTheirOrder) {
    EXPECT_EQ(serverOf({}).endpoints, Words{"0"});
    EXPECT_EQ(parseOptions({"--listen", "[::1]:80", "a", "--listen=unix:/run/x"})
                  .serving.value()
                  .server.endpoints,
              (Words{"[::1]:80", "unix:/run/x"}));
}

TEST(ListenOptions, LeaveFilesAlone) {
    EXPECT_EQ(parseOptions({"--listen", "0", "a"}).sources.at(0).location, "a");
}

TEST(ListenOptions, KeepTheConsoleWhenAskedTo) {
    EXPECT_TRUE(parseOptions({"--listen", "0", "--console"}).serving.value().withConsole);
}

TEST(ListenOptions, SayWhoMayDoWhat) {
    const auto server = serverOf({"--allow-writes", "--token-file", "t", "--tls-cert", "c",
                                  "--tls-key", "k", "--behind-proxy", "--host-name", "a.example",
                                  "--host-name=b.example", "--property-root", "[r]"});
    EXPECT_TRUE(server.allowWrites);
    EXPECT_EQ(server.tokenFile, "t");
    EXPECT_EQ(server.tlsCertificate, "c");
    EXPECT_EQ(server.tlsKey, "k");
    EXPECT_TRUE(server.behindProxy);
    EXPECT_EQ(server.names, (Words{"a.example", "b.example"}));
    EXPECT_EQ(server.propertyRoot, "[r]");
}

TEST(ListenOptions, LimitFilesOfClientsAsOthers) {
    EXPECT_EQ(serverOf({}).maxPropertyFileBytes, std::uintmax_t{256} << 20U);
    EXPECT_EQ(serverOf({"--max-file-size", "1KiB"}).maxPropertyFileBytes, 1024U);
}

/// An option with a number, and what the server makes of it.
struct LimitCase {
    const char* option;
    const char* text;
    const char* usual;  ///< As the help shows the default.
    std::uint64_t (*read)(const ServerOptions&);
    std::uint64_t expected;
};

std::ostream& operator<<(std::ostream& out, const LimitCase& row) {
    return out << row.option;
}

template <auto member>
std::uint64_t number(const ServerOptions& server) {
    return server.*member;
}

template <auto member>
std::uint64_t milliseconds(const ServerOptions& server) {
    return static_cast<std::uint64_t>((server.*member).count());
}

const LimitCase limitCases[] = {
    {"--listen-threads", "4", "1", number<&ServerOptions::threads>, 4},
    {"--max-header-bytes", "8KiB", "16KiB", number<&ServerOptions::maxHeaderBytes>, 8192},
    {"--max-body-bytes", "17", "1MiB", number<&ServerOptions::maxBodyBytes>, 17},
    {"--max-json-depth", "3", "64", number<&ServerOptions::maxJsonDepth>, 3},
    {"--max-json-containers", "10", "65536", number<&ServerOptions::maxJsonContainers>, 10},
    {"--request-timeout", "250ms", "10s", milliseconds<&ServerOptions::requestTimeout>, 250},
    {"--write-timeout", "1.5s", "30s", milliseconds<&ServerOptions::writeTimeout>, 1500},
    {"--idle-timeout", "2min", "1min", milliseconds<&ServerOptions::idleTimeout>, 120'000},
    {"--comment-interval", "1s", "15s", milliseconds<&ServerOptions::commentInterval>, 1000},
    {"--max-connections", "7", "2000", number<&ServerOptions::maxConnections>, 7},
    {"--max-connections-per-address", "5", "1100", number<&ServerOptions::maxConnectionsPerAddress>,
     5},
    {"--max-buffered-bytes", "2MiB", "64MiB", number<&ServerOptions::maxBufferedBytes>, 2U << 20U},
    {"--max-streams", "9", "1500", number<&ServerOptions::maxStreams>, 9},
};

class ListenLimit : public ::testing::TestWithParam<LimitCase> {};

TEST_P(ListenLimit, IsTheServers) {
    const auto& row = GetParam();
    EXPECT_EQ(row.read(serverOf({row.option, row.text})), row.expected);
    EXPECT_EQ(row.read(serverOf({row.option, "1ms1ms1", row.option, row.text})), row.expected);
}

TEST_P(ListenLimit, ShowsItsDefaultInTheHelp) {
    const auto& row = GetParam();
    const std::string help = parseOptions({"--help"}).information;
    const std::string option = help.substr(help.find(std::string(row.option) + ' '));
    EXPECT_THAT(option.substr(0, option.find("unless")), HasSubstr(row.usual));
}

TEST_P(ListenLimit, RefusesWhatIsNoQuantity) {
    const auto& row = GetParam();
    EXPECT_THAT(usageError({"--listen", "0", row.option, "few"}),
                HasSubstr(row.option + std::string(" few: ")));
}

INSTANTIATE_TEST_SUITE_P(All, ListenLimit, ::testing::ValuesIn(limitCases), [](const auto& row) {
    std::string name;
    for (const char byte : std::string(row.param.option)) {
        if (byte != '-') name += byte;
    }
    return name;
});

TEST(ListenOptions, AreOnlyForServing) {
    EXPECT_EQ(usageError({"--console"}), "--console needs --listen");
    EXPECT_EQ(usageError({"--allow-writes", "a"}), "--allow-writes needs --listen");
    EXPECT_EQ(usageError({"--token-file", "t"}), "--token-file needs --listen");
    EXPECT_EQ(usageError({"--host-name", "n"}), "--host-name needs --listen");
    EXPECT_EQ(usageError({"--max-streams", "1"}), "--max-streams needs --listen");
}

TEST(ListenOptions, NeedTheirValues) {
    EXPECT_THAT(usageError({"--listen"}), HasSubstr("--listen"));
}

}  // namespace
}  // namespace velkor::host
