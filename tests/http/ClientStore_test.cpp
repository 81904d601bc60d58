#include "http/detail/ClientStore.hpp"

#include <gtest/gtest.h>

#include <filesystem>
#include <memory>
#include <stdexcept>
#include <string>
#include <variant>

#include "messages/MessageService.hpp"
#include "settings/Setting.hpp"
#include "tests/support/TemporaryFile.hpp"
#include "tests/support/Thrown.hpp"

namespace velkor::http::detail {
namespace {

using configuration::ConfigurationImpl;
using velkor::testing::TemporaryFile;
using velkor::testing::thrownText;

class ClientStoreTest : public ::testing::Test {
protected:
    /// Type and text of the reply to a message, or the failure.
    std::string send(const std::string& type, const std::string& json) const {
        const messages::MessageService service(clients, {}, secretsOf(store));
        const auto result = service.dispatcherFor(messages::allRequestTypes())
                                ->dispatch({"velkor/configuration/" + type, json});
        if (const auto* error = std::get_if<messages::DispatchError>(&result)) return error->text;
        return std::get<messages::JsonMessage>(result).json;
    }

    const TemporaryFile file{"a = 1\n"};
    const std::shared_ptr<ConfigurationImpl> store = std::make_shared<ConfigurationImpl>();
    const std::shared_ptr<const PropertyRoot> root =
        std::make_shared<PropertyRoot>(file.parent(), 1000);
    const std::shared_ptr<ClientStore> clients = std::make_shared<ClientStore>(store, root);
};

TEST_F(ClientStoreTest, ReadsAndWritesTheStore) {
    clients->set("k", 1).get();
    clients->set("k", 2, "default").get();
    EXPECT_EQ(boost::get<int>(store->get("k").get()), 1);
    EXPECT_EQ(boost::get<int>(clients->get("k").get()), 1);
    EXPECT_EQ(clients->getOption("k").get().source, "override");
    EXPECT_TRUE(clients->has("k").get());
    EXPECT_EQ(clients->keys().get(), std::set<std::string>{"k"});
    EXPECT_EQ(clients->getPtr(), store);
}

TEST_F(ClientStoreTest, ChangesTheLayersOfTheStore) {
    EXPECT_TRUE(clients->addInMemorySource("m", "", 1, true, {{"k", 7}}).get());
    EXPECT_EQ(boost::get<int>(store->get("k").get()), 7);
    EXPECT_TRUE(clients->removeSource("m").get());
    EXPECT_FALSE(store->has("k").get());
    EXPECT_FALSE(clients->addEnvironmentSource("e", "", 1).get());
}

TEST_F(ClientStoreTest, AddsAFileBelowTheRoot) {
    EXPECT_TRUE(clients->addPropertyFileSource("f", "g", 5, true, file.widePath()).get());
    const auto option = store->getOption("g.a").get();
    EXPECT_EQ(option.source, "f");
    EXPECT_EQ(boost::get<std::string>(option.value), "1");
}

TEST_F(ClientStoreTest, RefusesANameThatIsTaken) {
    EXPECT_EQ(thrownText<std::invalid_argument>([this] {
                  clients->addPropertyFileSource("override", "", 5, true, file.widePath()).get();
              }),
              "Source with the requested name already exists: override");
}

TEST_F(ClientStoreTest, RefusesAFileThatIsNotBelowTheRoot) {
    EXPECT_EQ(send("AddPropertyFileSource", R"({"name":"f","path":"/etc/hostname"})"),
              "Property file not allowed: /etc/hostname");
}

TEST_F(ClientStoreTest, TakesNoFileWithoutARoot) {
    ClientStore rootless(store, nullptr);
    EXPECT_EQ(thrownText<std::runtime_error>(
                  [&] { rootless.addPropertyFileSource("f", "", 5, true, u"a.properties").get(); }),
              "Property file not allowed: a.properties");
}

TEST_F(ClientStoreTest, ShowsNoSecretsInReplies) {
    const settings::Setting<std::string> token(store, "token", "t", settings::secret());
    store->set("token", 4711);
    const std::string hidden = R"("value":{"type":"int","value":"•••"})";
    EXPECT_EQ(send("ConfigurationGet", R"({"key":"token"})"),
              R"({"key":"token","source":"override",)" + hidden + "}");
    EXPECT_EQ(send("ConfigurationSet", R"({"key":"token","value":{"type":"int","value":1}})"),
              R"({"key":"token","source":"",)" + hidden + "}");
}

TEST_F(ClientStoreTest, ShowsWhatIsNoSecret) {
    store->set("port", 80);
    EXPECT_EQ(send("ConfigurationGet", R"({"key":"port"})"),
              R"({"key":"port","source":"override","value":{"type":"int","value":80}})");
}

}  // namespace
}  // namespace velkor::http::detail
