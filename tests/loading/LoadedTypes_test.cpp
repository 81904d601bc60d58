#include <gtest/gtest.h>

#include <functional>
#include <memory>
#include <stdexcept>
#include <string>
#include <typeinfo>

#include "configuration/ConfigurationImpl.hpp"
#include "framework/reactive_streams/CachedValuePublisher.hpp"
#include "tests/loading/LoadedLibrary.hpp"
#include "tests/loading/LoadingPlugin.hpp"
#include "tests/support/Thrown.hpp"

namespace {

using velkor::Message;
using velkor::configuration::ConfigurationImpl;
using velkor::configuration::ConfigurationValue;
using velkor::testing::LoadedLibrary;
using velkor::testing::LoadedMessage;
using velkor::testing::LoadedObjects;
using velkor::testing::thrownText;

// Types keep their identity between the host and a plugin whose symbols are local to it.
class LoadedTypes : public ::testing::Test {
protected:
    LoadedTypes() { plugin.function<VelkorLoadedObjects>("velkorLoadedObjects")(objects); }

    const LoadedLibrary plugin{LOADING_PLUGIN};
    LoadedObjects objects;
};

TEST_F(LoadedTypes, StoreOfThePluginIsRecognised) {
    EXPECT_NE(std::dynamic_pointer_cast<ConfigurationImpl>(objects.store), nullptr);
}

TEST_F(LoadedTypes, StoreOfThePluginHasTheTypeThatTheHostKnows) {
    const auto& store = *objects.store;
    EXPECT_TRUE(typeid(store) == typeid(ConfigurationImpl));
}

TEST_F(LoadedTypes, StoreOfThePluginIsOfUse) {
    objects.store->set("key", std::string("value")).get();
    EXPECT_TRUE(objects.store->get("key").get() == ConfigurationValue(std::string("value")));
}

TEST_F(LoadedTypes, MessageOfTheFrameworkIsNoOtherMessage) {
    const Message& message = *objects.plainMessage;
    EXPECT_TRUE(typeid(message) == typeid(Message));
    EXPECT_EQ(dynamic_cast<const LoadedMessage*>(&message), nullptr);
}

TEST_F(LoadedTypes, MessageOfThePluginIsRecognisedByTheHost) {
    const auto* message = dynamic_cast<const LoadedMessage*>(objects.ownMessage.get());
    ASSERT_NE(message, nullptr);
    EXPECT_EQ(message->text, "from the plugin");
}

TEST_F(LoadedTypes, MessageOfTheHostIsRecognisedByThePlugin) {
    auto& recognises = plugin.function<VelkorRecognises>("velkorRecognises");
    EXPECT_TRUE(recognises(LoadedMessage()));
    EXPECT_FALSE(recognises(Message()));
}

TEST_F(LoadedTypes, StreamOfAWatchHasTheTypeThatTheHostKnows) {
    using Stream =
        velkor::reactive_streams::CachedValuePublisher<ConfigurationValue, std::function<void()>>;
    const auto stream = objects.store->watchOption("key");
    EXPECT_NE(std::dynamic_pointer_cast<Stream>(stream), nullptr);
}

TEST_F(LoadedTypes, WrappedExceptionOfThePluginIsUnwrapped) {
    EXPECT_EQ(thrownText<std::out_of_range>([this] { objects.failed.get(); }), "from the plugin");
}

TEST_F(LoadedTypes, FailureOfTheStoreIsCaughtByItsType) {
    EXPECT_EQ(thrownText<std::runtime_error>([this] { objects.store->get("missing").get(); }),
              "No option with the specified key was found: missing");
}

}  // namespace
