#include "settings/Bound.hpp"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <optional>
#include <stdexcept>
#include <string>
#include <utility>
#include <vector>

#include "settings/Setting.hpp"
#include "tests/configuration/StoreTesting.hpp"
#include "tests/support/LogCapture.hpp"

namespace velkor::settings::testing {
namespace {

using configuration::ConfigurationValue;
using ::testing::ElementsAre;
using ::testing::Optional;
using velkor::testing::LogCapture;

struct Server {
    int port = 0;
    std::string host{};
    std::vector<std::string> peers{};
};

class BoundTest : public velkor::testing::StoreTest {
protected:
    static Fields<Server> all() {
        return fields(&Server::port, "port", 8080, between(1, 65535), &Server::host, "host",
                      "localhost", notEmpty(), &Server::peers, "peers",
                      std::vector<std::string>{"a"});
    }

    template <class... Parts>
    std::string refusalOf(Parts&&... parts) {
        try {
            const Bound<Server> bound(store, "server", std::forward<Parts>(parts)...);
        } catch (const SettingError& error) {
            return error.what();
        }
        return "";
    }
};

TEST_F(BoundTest, HasDefaultsAndValues) {
    store->set("server.host", "example.org");
    const Bound<Server> server(store, "server", all());
    EXPECT_EQ(server.snapshot()->port, 8080);
    EXPECT_EQ(server.snapshot()->host, "example.org");
    EXPECT_THAT(server.snapshot()->peers, ElementsAre("a"));
}

TEST_F(BoundTest, TakesFieldsFromSeveralParts) {
    const Bound<Server> server(store, "server", fields(&Server::port, "port", 1),
                               fields(&Server::host, "host", "h"));
    EXPECT_EQ(server.snapshot()->port, 1);
    EXPECT_EQ(server.snapshot()->host, "h");
}

TEST_F(BoundTest, NeedsNoPrefix) {
    store->set("port", 1);
    const Bound<Server> server(store, "", fields(&Server::port, "port"));
    EXPECT_EQ(server.snapshot()->port, 1);
}

TEST_F(BoundTest, FollowsEachKey) {
    const Bound<Server> server(store, "server", all());
    store->set("server.port", 1);
    store->set("server.host", "h");
    EXPECT_EQ(server.snapshot()->port, 1);
    EXPECT_EQ(server.snapshot()->host, "h");
}

TEST_F(BoundTest, ChangesOnceForKeysThatAreAppliedTogether) {
    Bound<Server> server(store, "server", all());
    std::vector<std::string> seen;
    const auto handle = server.onChange([&](const Server&, const Server& now) {
        seen.push_back(now.host + std::to_string(now.port));
    });
    store->apply({{"server.port", ConfigurationValue(1)},
                  {"server.host", ConfigurationValue(std::string("h"))}});
    EXPECT_THAT(seen, ElementsAre("h1"));
}

TEST_F(BoundTest, IsReadThroughAReader) {
    const Bound<Server> server(store, "server", all());
    Bound<Server>::Reader reader(server);
    store->set("server.port", 1);
    EXPECT_EQ(reader.get().port, 1);
}

TEST_F(BoundTest, ReportsAllErrorsTogether) {
    store->set("server.port", 70000);
    store->set("server.host", "");
    EXPECT_EQ(refusalOf(all()),
              "server.port: 70000 from source \"override\" is no int: not between 1 and 65535; "
              "server.host: '' from source \"override\" is no text: empty");
}

TEST_F(BoundTest, NeedsAValueOrADefaultForEachField) {
    EXPECT_EQ(refusalOf(fields(&Server::host, "host")), "server.host: no value, and no default");
}

TEST_F(BoundTest, RefusesADefaultThatIsNotRight) {
    EXPECT_EQ(refusalOf(fields(&Server::port, "port", 0, atLeast(1))),
              "server.port: the default 0 is not right: not at least 1");
}

TEST_F(BoundTest, AsksValidatorsThatGiveATextAboutTheWhole) {
    EXPECT_EQ(refusalOf(all(),
                        [](const Server& server) -> std::string {
                            return server.port == 8080 && server.host == "localhost"
                                       ? "both default"
                                       : "";
                        }),
              "server: both default");
}

TEST_F(BoundTest, AsksValidatorsThatGiveAReason) {
    EXPECT_EQ(
        refusalOf(all(), [](const Server&) { return std::optional<Reason>(Reason{"never"}); }),
        "server: never");
}

TEST_F(BoundTest, TakesWhatAValidatorThrowsForAnError) {
    EXPECT_EQ(
        refusalOf(all(), [](const Server&) -> std::string { throw std::runtime_error("broken"); }),
        "server: the check has failed: broken");
}

TEST_F(BoundTest, KeepsTheLastGoodStructAsAWhole) {
    const Bound<Server> server(store, "server", all());
    const LogCapture log("velkor::settings");
    store->apply({{"server.port", ConfigurationValue(0)},
                  {"server.host", ConfigurationValue(std::string("h"))}});
    EXPECT_EQ(server.snapshot()->host, "localhost");
    EXPECT_EQ(log.records().size(), 1U);
    store->set("server.port", 1);
    EXPECT_EQ(server.snapshot()->host, "h");
}

TEST_F(BoundTest, TellsHowItStands) {
    const Bound<Server> server(store, "server", all());
    store->set("server.host", "h");
    store->set("server.port", 0);
    const BoundStatus status = server.status();
    EXPECT_EQ(status.fields.at("server.host").value, "h");
    EXPECT_EQ(status.fields.at("server.host").source, "override");
    EXPECT_EQ(status.fields.at("server.port").value, "8080");
    EXPECT_THAT(status.error,
                Optional(std::string("server.port: 0 from source \"override\" is no int: not "
                                     "between 1 and 65535")));
}

TEST_F(BoundTest, MayEndInItsOwnCallback) {
    std::optional<Bound<Server>> server(std::in_place, store, "server", all());
    int calls = 0;
    const auto handle = server->onChange([&](const Server&, const Server&) {
        ++calls;
        server.reset();
    });
    store->set("server.port", 1);
    store->set("server.port", 2);
    EXPECT_EQ(calls, 1);
}

TEST_F(BoundTest, OutlivesTheStore) {
    const Bound<Server> server(store, "server", all());
    store.reset();
    EXPECT_EQ(server.snapshot()->port, 8080);
    EXPECT_TRUE(server.status().storeGone);
}

TEST_F(BoundTest, FollowsASourceThatComesAndGoes) {
    const Bound<Server> server(store, "server", all());
    add("site", "server", 10, {{"port", 1}, {"host", std::string("h")}});
    EXPECT_EQ(server.snapshot()->host, "h");
    store->removeSource("site");
    EXPECT_EQ(server.snapshot()->host, "localhost");
    EXPECT_EQ(server.snapshot()->port, 8080);
}

}  // namespace
}  // namespace velkor::settings::testing
