#include "host/messages/MessageDispatcher.hpp"

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

#include "tests/host/messages/RunningService.hpp"

namespace velkor::host {
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
    EXPECT_EQ(outcomeOf(result), "failure routing");
    EXPECT_EQ(errorText(result), std::string("Incorrect message type. Expected: ") +
                                     typeid(ServiceMessage<ConfigurationServiceProvider>).name() +
                                     " but found " +
                                     typeid(configuration::ConfigurationKeysResponse).name());
}

TEST_F(Dispatcher, DeliversTheAcknowledgementToNobody) {
    EXPECT_EQ(outcomeOf(service.dispatcher.dispatch({"velkor/Message", "{}"})), "failure routing");
}

TEST_F(Dispatcher, SaysWhatTheStoreRefuses) {
    const auto result = service.send("ConfigurationSet", R"({"key":"k","source":"nowhere"})");
    EXPECT_EQ(outcomeOf(result), "failure service");
    EXPECT_EQ(errorText(result), "Source not found or not writable: k, nowhere");
}

TEST_F(Dispatcher, SaysThatAPropertyFileIsMissing) {
    const auto result =
        service.send("AddPropertyFileSource", R"({"name":"n","path":"/no/such/file"})");
    EXPECT_EQ(outcomeOf(result), "failure service");
    EXPECT_EQ(errorText(result), "Property file could not be opened: /no/such/file");
}

// The error of a taken name is an std::invalid_argument, as that of a wrong message is.
TEST_F(Dispatcher, TellsATakenNameFromAWrongMessage) {
    EXPECT_EQ(outcomeOf(service.send("AddPropertyFileSource",
                                     R"({"name":"override","path":"/dev/null"})")),
              "failure service");
}

TEST_F(Dispatcher, AcknowledgesAPropertyFile) {
    EXPECT_EQ(
        outcomeOf(service.send("AddPropertyFileSource", R"({"name":"n","path":"/dev/null"})")),
        "reply velkor/Message {}");
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
                                       std::make_shared<ScriptedService>(answer));
    return dispatcher.dispatch({"velkor/Message", "{}"});
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
        "failure service");
}

TEST(DispatcherOverAnyService, SaysWhatTheReplyFailsWith) {
    const auto result = answered([] {
        return makeFailedFuture<std::unique_ptr<Message>>(
            std::make_exception_ptr(std::runtime_error("too late")));
    });
    EXPECT_EQ(outcomeOf(result), "failure service");
    EXPECT_EQ(errorText(result), "too late");
}

TEST(DispatcherOverAnyService, SurvivesWhatIsNoException) {
    const auto result = answered([]() -> ScriptedService::Reply { throw 5; });
    EXPECT_EQ(outcomeOf(result), "failure service");
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
}  // namespace velkor::host
