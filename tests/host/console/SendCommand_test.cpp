#include "host/console/SendCommand.hpp"

#include <gtest/gtest.h>

#include <memory>
#include <string>
#include <utility>
#include <vector>

#include "configuration/ConfigurationImpl.hpp"
#include "host/console/HostCommands.hpp"
#include "messages/MessageService.hpp"
#include "settings/Setting.hpp"
#include "tests/support/Thrown.hpp"

namespace velkor::host {
namespace {

using velkor::testing::thrownText;
using Words = std::vector<std::string>;

class SendCommandTest : public ::testing::Test {
protected:
    std::string send(Words arguments) { return registry->find("send")->run(std::move(arguments)); }

    std::shared_ptr<SessionStore> store = std::make_shared<SessionStore>(SourceLimits{});
    messages::MessageService service{store, {}, secretsOf(store)};
    std::shared_ptr<CommandRegistry> registry = std::make_shared<CommandRegistry>();
    HostCommands commands{{store, std::make_shared<Watches>(store, [](const auto&, const auto&) {}),
                           service.dispatcherFor(messages::allRequestTypes()), [] {}},
                          registry};
};

TEST_F(SendCommandTest, ShowsTypeAndContentOfTheReply) {
    store->set("a", 1);
    EXPECT_EQ(send({"velkor/configuration/ConfigurationGet", R"({"key":"a"})"}),
              "velkor/configuration/ConfigurationOptionResponse "
              R"({"key":"a","source":"override","value":{"type":"int","value":1}})");
}

TEST_F(SendCommandTest, TakesTheLastWordOfATypeName) {
    EXPECT_EQ(send({"ConfigurationGet", R"({"key":"a"})"}),
              "velkor/configuration/ConfigurationOptionResponse {}");
}

TEST_F(SendCommandTest, NeedsNoContent) {
    EXPECT_EQ(send({"ConfigurationKeys"}),
              R"(velkor/configuration/ConfigurationKeysResponse {"keys":[]})");
}

TEST_F(SendCommandTest, ChangesTheStore) {
    send({"ConfigurationSet", R"({"key":"a","value":{"type":"string","value":"it's"}})"});
    EXPECT_EQ(boost::get<std::string>(store->get("a").get()), "it's");
}

TEST_F(SendCommandTest, HidesSecretsInReplies) {
    const settings::Setting<std::string> token(store, "token", "t", settings::secret());
    store->set("token", "verysecret");
    EXPECT_EQ(send({"ConfigurationGet", R"({"key":"token"})"}),
              "velkor/configuration/ConfigurationOptionResponse "
              R"({"key":"token","source":"override","value":{"type":"string","value":"•••"}})");
    EXPECT_EQ(send({"ConfigurationSet", R"({"key":"token","value":{"type":"int","value":4711}})"}),
              "velkor/configuration/ConfigurationOptionResponse "
              R"({"key":"token","source":"","value":{"type":"string","value":"•••"}})");
}

TEST_F(SendCommandTest, ShowsWhatIsNoSecretBesideSecrets) {
    const settings::Setting<std::string> token(store, "token", "t", settings::secret());
    store->set("a", "visible");
    EXPECT_EQ(send({"ConfigurationGet", R"({"key":"a"})"}),
              "velkor/configuration/ConfigurationOptionResponse "
              R"({"key":"a","source":"override","value":{"type":"string","value":"visible"}})");
    EXPECT_EQ(send({"ConfigurationGet", R"({"key":"token"})"}),
              "velkor/configuration/ConfigurationOptionResponse {}");
    EXPECT_EQ(send({"ConfigurationKeys"}),
              R"(velkor/configuration/ConfigurationKeysResponse {"keys":["a"]})");
}

TEST_F(SendCommandTest, RefusesAnUnknownType) {
    EXPECT_EQ(thrownText<CommandError>([&] {
                  send({"Nope", "{}"});
              }),
              "Unknown message type: velkor/configuration/Nope");
}

TEST_F(SendCommandTest, RefusesATypeThatIsNoRequest) {
    EXPECT_EQ(thrownText<CommandError>([&] { send({"ConfigurationKeysResponse"}); }),
              "Message type not allowed: velkor/configuration/ConfigurationKeysResponse");
}

TEST_F(SendCommandTest, RefusesContentThatIsNoJsonObject) {
    EXPECT_THROW(send({"ConfigurationGet", "[]"}), CommandError);
}

TEST_F(SendCommandTest, ReportsARefusalOfTheService) {
    const char* const request = R"({"key":"a","source":"nobody"})";
    EXPECT_EQ(thrownText<CommandError>([&] {
                  send({"ConfigurationSet", request});
              }),
              "Source not found or not writable: a, nobody");
}

TEST_F(SendCommandTest, TakesTheContentAsItWasTyped) {
    CommandLine line(R"(ConfigurationGet  {"key": "a  'b"} )");
    EXPECT_EQ(registry->find("send")->readArguments(line),
              (Words{"ConfigurationGet", R"({"key": "a  'b"})"}));
}

TEST_F(SendCommandTest, SuggestsTheTypesOfRequests) {
    EXPECT_EQ(registry->find("send")->suggestions()(),
              (Words{"ConfigurationSet", "ConfigurationGet", "ConfigurationKeys",
                     "AddPropertyFileSource"}));
}

}  // namespace
}  // namespace velkor::host
