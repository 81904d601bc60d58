#include "messages/MessageDispatcher.hpp"

#include <Poco/JSON/Object.h>
#include <gtest/gtest.h>

#include <limits>
#include <memory>
#include <new>
#include <stdexcept>
#include <string>
#include <thread>
#include <typeinfo>
#include <utility>
#include <variant>
#include <vector>

#include "configuration/StoreErrors.hpp"
#include "framework/RoutingErrors.hpp"
#include "tests/messages/RunningService.hpp"

namespace velkor::messages {
namespace {

using configuration::ConfigurationServiceProvider;
using velkor::testing::outcomeOf;
using velkor::testing::RunningService;

std::string errorText(const DispatchResult& result) {
    return std::get<DispatchError>(result).text;
}

class Dispatcher : public ::testing::Test {
protected:
    RunningService service;
};

TEST_F(Dispatcher, AnswersGetOfAnUnknownKeyWithoutAnOption) {
    EXPECT_EQ(outcomeOf(service.send("ConfigurationGet", R"({"key":"k"})")),
              "reply velkor/configuration/ConfigurationOptionResponse {}");
}

TEST_F(Dispatcher, AnswersSet) {
    EXPECT_EQ(outcomeOf(service.send("ConfigurationSet",
                                     R"({"key":"k","value":{"type":"int","value":5}})")),
              "reply velkor/configuration/ConfigurationOptionResponse "
              R"({"key":"k","source":"","value":{"type":"int","value":5}})");
}

TEST_F(Dispatcher, AnswersGet) {
    service.store->set("k", std::string("text")).get();
    EXPECT_EQ(outcomeOf(service.send("ConfigurationGet", R"({"key":"k"})")),
              "reply velkor/configuration/ConfigurationOptionResponse "
              R"({"key":"k","source":"override","value":{"type":"string","value":"text"}})");
}

TEST_F(Dispatcher, AnswersKeys) {
    service.store->set("b", 1).get();
    service.store->set("a", 1).get();
    EXPECT_EQ(outcomeOf(service.send("ConfigurationKeys", "{}")),
              R"(reply velkor/configuration/ConfigurationKeysResponse {"keys":["a","b"]})");
}

TEST_F(Dispatcher, AnswersNumbersThatAreNotFiniteWithNull) {
    service.store->set("k", std::numeric_limits<double>::infinity()).get();
    EXPECT_EQ(outcomeOf(service.send("ConfigurationGet", R"({"key":"k"})")),
              "reply velkor/configuration/ConfigurationOptionResponse "
              R"({"key":"k","source":"override","value":{"type":"double","value":null}})");
}

TEST_F(Dispatcher, KeepsTheValueThatItAnswersWithNull) {
    service.store->set("k", std::numeric_limits<double>::infinity()).get();
    service.send("ConfigurationGet", R"({"key":"k"})");
    EXPECT_EQ(boost::get<double>(service.store->get("k").get()),
              std::numeric_limits<double>::infinity());
}

TEST_F(Dispatcher, SaysThatTheTypeIsUnknown) {
    const auto result = service.dispatcher.dispatch({"nobody", "{}"});
    EXPECT_EQ(outcomeOf(result), "failure unknown type");
    EXPECT_EQ(errorText(result), "Unknown message type: nobody");
}

TEST_F(Dispatcher, SaysThatTheTextIsNoObject) {
    const auto result = service.send("ConfigurationGet", "[]");
    EXPECT_EQ(outcomeOf(result), "failure no JSON object");
    EXPECT_EQ(errorText(result), "JSON text is not an object");
}

TEST_F(Dispatcher, SaysThatTheServiceIsNotRunning) {
    service.provider->setRunning(false);
    const auto result = service.send("ConfigurationKeys", "{}");
    EXPECT_EQ(outcomeOf(result), "failure not running");
    EXPECT_EQ(errorText(result), "Service exists but is not running.");
}

TEST_F(Dispatcher, SaysThatTheMessageIsNotForTheService) {
    const auto result = service.send("ConfigurationKeysResponse", "{}");
    EXPECT_EQ(outcomeOf(result), "failure misrouted");
    EXPECT_EQ(errorText(result), std::string("Incorrect message type. Expected: ") +
                                     typeid(ServiceMessage<ConfigurationServiceProvider>).name() +
                                     " but found " +
                                     typeid(configuration::ConfigurationKeysResponse).name());
}

TEST_F(Dispatcher, DeliversTheAcknowledgementToNobody) {
    EXPECT_EQ(outcomeOf(service.dispatcher.dispatch({"velkor/Message", "{}"})),
              "failure misrouted");
}

TEST_F(Dispatcher, SaysWhatTheStoreRefuses) {
    const auto result = service.send("ConfigurationSet", R"({"key":"k","source":"nowhere"})");
    EXPECT_EQ(outcomeOf(result), "failure not writable");
    EXPECT_EQ(errorText(result), "Source not found or not writable: k, nowhere");
}

TEST_F(Dispatcher, SaysThatAPropertyFileIsMissing) {
    const auto result =
        service.send("AddPropertyFileSource", R"({"name":"n","path":"/no/such/file"})");
    EXPECT_EQ(outcomeOf(result), "failure file not opened");
    EXPECT_EQ(errorText(result), "Property file could not be opened: /no/such/file");
}

// The error of a taken name is an std::invalid_argument, as that of a wrong message is.
TEST_F(Dispatcher, TellsATakenNameFromAWrongMessage) {
    EXPECT_EQ(outcomeOf(service.send("AddPropertyFileSource",
                                     R"({"name":"override","path":"/dev/null"})")),
              "failure duplicate source");
}

TEST_F(Dispatcher, AcknowledgesAPropertyFile) {
    EXPECT_EQ(
        outcomeOf(service.send("AddPropertyFileSource", R"({"name":"n","path":"/dev/null"})")),
        "reply velkor/Message {}");
}

/// A dispatcher of a front end that may only read.
class ReadingDispatcher : public Dispatcher {
protected:
    DispatchResult send(const std::string& type, const std::string& json) const {
        return reading.dispatch({type, json});
    }

    MessageDispatcher reading{service.serializer, service.provider,
                              MessageTypeNames{"velkor/configuration/ConfigurationGet", "nobody"}};
};

TEST_F(ReadingDispatcher, AnswersWhatIsAllowed) {
    EXPECT_EQ(outcomeOf(send("velkor/configuration/ConfigurationGet", "{}")),
              "reply velkor/configuration/ConfigurationOptionResponse {}");
}

TEST_F(ReadingDispatcher, RefusesWhatIsNotAllowed) {
    const auto result = send("velkor/configuration/ConfigurationSet", R"({"key":"k"})");
    EXPECT_EQ(outcomeOf(result), "failure forbidden type");
    EXPECT_EQ(errorText(result), "Message type not allowed: velkor/configuration/ConfigurationSet");
    EXPECT_FALSE(service.store->has("k").get());
}

TEST_F(ReadingDispatcher, RefusesWithoutLookingAtTheText) {
    EXPECT_EQ(outcomeOf(send("velkor/configuration/ConfigurationSet", "no json")),
              "failure forbidden type");
}

TEST_F(ReadingDispatcher, TellsAnUnknownTypeFromOneThatIsNotAllowed) {
    EXPECT_EQ(outcomeOf(send("somebody", "{}")), "failure unknown type");
}

TEST_F(ReadingDispatcher, KnowsNoMoreTypesThanThereAre) {
    EXPECT_EQ(outcomeOf(send("nobody", "{}")), "failure unknown type");
}

TEST_F(ReadingDispatcher, AllowsNamesOnlyAsTheyAreWritten) {
    EXPECT_EQ(outcomeOf(send("velkor/configuration/configurationget", "{}")),
              "failure unknown type");
    EXPECT_EQ(outcomeOf(send("ConfigurationGet", "{}")), "failure unknown type");
}

/// Answers the one request there is with what its function gives or throws.
class ScriptedService : public ServiceProvider {
public:
    using Reply = Future<std::unique_ptr<Message>>;

    explicit ScriptedService(Reply (*answer)()) : script(answer) {}
    void onStart() override {}
    void onStop() override {}
    Reply deliver(std::unique_ptr<Message>&&, Address&&, std::shared_ptr<Context>&&) override {
        return script();
    }

private:
    Reply (*script)();
};

DispatchResult answered(ScriptedService::Reply (*answer)()) {
    const MessageDispatcher dispatcher(std::make_shared<JsonSerializerImpl>(),
                                       std::make_shared<ScriptedService>(answer),
                                       MessageTypeNames{"velkor/Message"});
    return dispatcher.dispatch({"velkor/Message", "{}"});
}

/// Fails with `Error` and the given text, in the future.
template <class Error>
ScriptedService::Reply failing(const std::string& text) {
    return makeFailedFuture<std::unique_ptr<Message>>(std::make_exception_ptr(Error(text)));
}

TEST(DispatcherOverAnyService, TellsTheKindsOfFailuresApart) {
    namespace texts = configuration::store_errors;
    using std::invalid_argument;
    using std::runtime_error;
    EXPECT_EQ(outcomeOf(answered([] { return failing<runtime_error>(texts::noSuchOption); })),
              "failure missing option");
    EXPECT_EQ(outcomeOf(answered([] { return failing<runtime_error>(texts::noWritableSource); })),
              "failure not writable");
    EXPECT_EQ(outcomeOf(answered([] { return failing<invalid_argument>(texts::duplicateSource); })),
              "failure duplicate source");
    EXPECT_EQ(outcomeOf(answered([] { return failing<runtime_error>(texts::fileNotOpened); })),
              "failure file not opened");
    EXPECT_EQ(
        outcomeOf(answered([] { return failing<runtime_error>(routing_errors::notRunning); })),
        "failure not running");
    EXPECT_EQ(outcomeOf(answered(
                  [] { return failing<invalid_argument>(routing_errors::notForThisObject); })),
              "failure misrouted");
    EXPECT_EQ(outcomeOf(answered([] { return failing<invalid_argument>(texts::nullSource); })),
              "failure other");
}

// Handlers throw, and a service may do so however it likes.
TEST(DispatcherOverAnyService, TellsTheKindsOfThrownFailuresApart) {
    EXPECT_EQ(outcomeOf(answered([]() -> ScriptedService::Reply {
                  throw std::runtime_error(configuration::store_errors::noSuchOption);
              })),
              "failure missing option");
}

struct Unregistered : Message {};

TEST(DispatcherOverAnyService, SaysThatAReplyHasNoJsonForm) {
    EXPECT_EQ(
        outcomeOf(answered([] {
            return makeReadyFuture<std::unique_ptr<Message>>(std::make_unique<Unregistered>());
        })),
        "failure unknown type");
}

TEST(DispatcherOverAnyService, SaysThatThereIsNoReply) {
    EXPECT_EQ(
        outcomeOf(answered([] { return makeReadyFuture<std::unique_ptr<Message>>(nullptr); })),
        "failure other");
}

TEST(DispatcherOverAnyService, SaysWhatTheReplyFailsWith) {
    const auto result = answered([] {
        return makeFailedFuture<std::unique_ptr<Message>>(
            std::make_exception_ptr(std::runtime_error("too late")));
    });
    EXPECT_EQ(outcomeOf(result), "failure other");
    EXPECT_EQ(errorText(result), "too late");
}

TEST(DispatcherOverAnyService, SurvivesWhatIsNoException) {
    const auto result = answered([]() -> ScriptedService::Reply { throw 5; });
    EXPECT_EQ(outcomeOf(result), "failure other");
    EXPECT_EQ(errorText(result), "Unknown error");
}

TEST(DispatcherOverAnyService, PassesOnLackOfMemory) {
    EXPECT_THROW(answered([]() -> ScriptedService::Reply { throw std::bad_alloc(); }),
                 std::bad_alloc);
}

TEST_F(Dispatcher, IsSafeForConcurrentUse) {
    std::vector<std::thread> clients;
    std::vector<std::string> last(3);
    for (std::size_t client = 0; client < last.size(); ++client) {
        clients.emplace_back([this, client, &last] {
            const std::string key = "k" + std::to_string(client);
            for (int i = 0; i < 100; ++i) {
                service.send("ConfigurationSet", R"({"key":")" + key +
                                                     R"(","value":{"type":"int","value":)" +
                                                     std::to_string(i) + "}}");
            }
            last[client] = outcomeOf(service.send("ConfigurationGet", R"({"key":")" + key + "\"}"));
        });
    }
    for (auto& client : clients) client.join();
    for (const std::string& outcome : last) {
        EXPECT_NE(outcome.find(R"("value":99})"), std::string::npos) << outcome;
    }
}

}  // namespace
}  // namespace velkor::messages
