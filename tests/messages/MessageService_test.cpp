#include "messages/MessageService.hpp"

#include <gtest/gtest.h>

#include <memory>
#include <set>
#include <string>
#include <variant>

#include "configuration/ConfigurationImpl.hpp"
#include "tests/messages/RunningService.hpp"

namespace velkor::messages {
namespace {

using configuration::ConfigurationImpl;
using velkor::testing::outcomeOf;

const std::string get = "velkor/configuration/ConfigurationGet";
const std::string add = "velkor/configuration/AddPropertyFileSource";

class MessageServiceTest : public ::testing::Test {
protected:
    std::shared_ptr<ConfigurationImpl> store = std::make_shared<ConfigurationImpl>();
    std::unique_ptr<MessageService> service = std::make_unique<MessageService>(store);
};

TEST_F(MessageServiceTest, AnswersFromTheStore) {
    store->set("k", 5);
    EXPECT_EQ(outcomeOf(service->dispatcherFor({get})->dispatch({get, R"({"key":"k"})"})),
              "reply velkor/configuration/ConfigurationOptionResponse "
              R"({"key":"k","source":"override","value":{"type":"int","value":5}})");
}

TEST_F(MessageServiceTest, AllowsEachFrontEndItsOwnTypes) {
    const auto console = service->dispatcherFor({get, add});
    const auto remote = service->dispatcherFor({get});
    const JsonMessage request{add, R"({"name":"n","path":"/dev/null"})"};
    EXPECT_EQ(outcomeOf(remote->dispatch(request)), "failure forbidden type");
    EXPECT_EQ(outcomeOf(console->dispatch(request)), "reply velkor/Message {}");
}

TEST_F(MessageServiceTest, AllowsNothingToAFrontEndWithoutTypes) {
    const auto nobody = service->dispatcherFor({});
    for (const std::string& type : allRequestTypes()) {
        EXPECT_EQ(outcomeOf(nobody->dispatch({type, "{}"})), "failure forbidden type") << type;
    }
}

TEST_F(MessageServiceTest, AnswersEveryRequestType) {
    const auto everything = service->dispatcherFor(allRequestTypes());
    EXPECT_EQ(outcomeOf(everything->dispatch({get, "{}"})).rfind("reply ", 0), 0U);
    EXPECT_EQ(outcomeOf(everything->dispatch({add, R"({"name":"n","path":"/dev/null"})"})),
              "reply velkor/Message {}");
    EXPECT_EQ(outcomeOf(everything->dispatch({"velkor/configuration/ConfigurationKeys", "{}"})),
              R"(reply velkor/configuration/ConfigurationKeysResponse {"keys":[]})");
    EXPECT_EQ(
        outcomeOf(everything->dispatch({"velkor/configuration/ConfigurationSet", R"({"key":"k"})"}))
            .rfind("reply ", 0),
        0U);
}

TEST_F(MessageServiceTest, LeavesTypesUnknownToFrontEndsThatOutliveIt) {
    const auto late = service->dispatcherFor({get});
    service.reset();
    EXPECT_EQ(outcomeOf(late->dispatch({get, "{}"})), "failure unknown type");
}

TEST_F(MessageServiceTest, ReleasesTheStoreWithItself) {
    const std::weak_ptr<ConfigurationImpl> observer = store;
    store.reset();
    EXPECT_FALSE(observer.expired());
    service.reset();
    EXPECT_TRUE(observer.expired());
}

class SecretMessagesTest : public ::testing::Test {
protected:
    std::string send(const std::string& type, const std::string& json) const {
        return outcomeOf(service.dispatcherFor(allRequestTypes())->dispatch({type, json}));
    }

    std::shared_ptr<ConfigurationImpl> store = std::make_shared<ConfigurationImpl>();
    std::set<std::string> keys{"pin"};
    MessageService service{
        store, {}, {[this](const std::string& key) { return keys.count(key) != 0; }, "hidden"}};
};

TEST_F(SecretMessagesTest, HaveTheMarkInThePlaceOfTheValue) {
    store->set("pin", 4711);
    EXPECT_EQ(send(get, R"({"key":"pin"})"),
              "reply velkor/configuration/ConfigurationOptionResponse "
              R"({"key":"pin","source":"override","value":{"type":"int","value":"hidden"}})");
}

TEST_F(SecretMessagesTest, HideWhatAWriteReplaced) {
    store->set("pin", 4711);
    EXPECT_EQ(send("velkor/configuration/ConfigurationSet",
                   R"({"key":"pin","value":{"type":"string","value":"x"}})"),
              "reply velkor/configuration/ConfigurationOptionResponse "
              R"({"key":"pin","source":"","value":{"type":"int","value":"hidden"}})");
}

TEST_F(SecretMessagesTest, ShowAllOtherValues) {
    store->set("age", 30);
    EXPECT_EQ(send(get, R"({"key":"age"})"),
              "reply velkor/configuration/ConfigurationOptionResponse "
              R"({"key":"age","source":"override","value":{"type":"int","value":30}})");
    EXPECT_EQ(send(get, R"({"key":"pin"})"),
              "reply velkor/configuration/ConfigurationOptionResponse {}");
}

TEST_F(SecretMessagesTest, HideWhatIsSecretAtThatMoment) {
    store->set("age", 30);
    keys.insert("age");
    EXPECT_EQ(send(get, R"({"key":"age"})"),
              "reply velkor/configuration/ConfigurationOptionResponse "
              R"({"key":"age","source":"override","value":{"type":"int","value":"hidden"}})");
}

TEST(AllRequestTypes, AreThoseThatTheServiceAnswers) {
    EXPECT_EQ(allRequestTypes(),
              (MessageTypeNames{add, get, "velkor/configuration/ConfigurationKeys",
                                "velkor/configuration/ConfigurationSet"}));
}

}  // namespace
}  // namespace velkor::messages
