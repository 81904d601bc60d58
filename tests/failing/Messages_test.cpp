// Messages as text: whatever is short, a reply is whole or there is none.

#include <memory>
#include <string>

#include "configuration/service/ConfigurationJsonSerialization.hpp"
#include "configuration/service/ConfigurationMessages.hpp"
#include "messages/JsonSerializerImpl.hpp"
#include "messages/JsonText.hpp"
#include "messages/MessageDispatcher.hpp"
#include "messages/MessageService.hpp"
#include "tests/failing/StoreScene.hpp"
#include "tests/support/ValueText.hpp"

namespace velkor::testing {
namespace {

using messages::DispatchResult;
using messages::JsonMessage;
using messages::JsonSerializerImpl;
using messages::MessageService;

constexpr const char* prefix = "velkor/configuration/";

struct MessageScene : StoreScene {
    JsonMessage get() const {
        return {std::string(prefix) + "ConfigurationGet", R"({"key": ")" + near + "\"}"};
    }

    MessageService service{store};
    std::shared_ptr<const messages::MessageDispatcher> dispatcher =
        service.dispatcherFor(messages::allRequestTypes());
};

/// The content of a reply; that there is none is for the caller to expect.
std::string replyIn(const DispatchResult& result) {
    const auto* const reply = std::get_if<JsonMessage>(&result);
    return reply == nullptr ? "no reply" : reply->json;
}

/// Dispatches `request`, which is answered by what has `part` in it. Foreign code that throws is a
/// failure that the reply names; want of memory leaves the call.
void tryDispatch(Trial& trial, MessageScene& scene, const JsonMessage& request,
                 const std::string& part) {
    DispatchResult result;
    const bool passed = trial.passes([&] { result = scene.dispatcher->dispatch(request); });
    if (passed && (trial.isOfMemory() || !trial.hasStruck())) {
        EXPECT_NE(replyIn(result).find(part), std::string::npos) << replyIn(result);
    }
    scene.expectAlive();
}

void dispatchGet(Trial& trial) {
    MessageScene scene;
    tryDispatch(trial, scene, scene.get(), longText("old"));
}

void dispatchKeys(Trial& trial) {
    MessageScene scene;
    tryDispatch(trial, scene, {std::string(prefix) + "ConfigurationKeys", "{}"}, scene.far);
}

void dispatchSet(Trial& trial) {
    MessageScene scene;
    const JsonMessage request{
        std::string(prefix) + "ConfigurationSet",
        R"({"key": ")" + scene.near + R"(", "value": {"type": "intArray", "value": [1, 2, 3]}})"};
    tryDispatch(trial, scene, request, longText("old"));
}

void dispatchNonsense(Trial& trial) {
    MessageScene scene;
    DispatchResult result;
    const JsonMessage request{std::string(prefix) + "ConfigurationGet", longText("{")};
    if (trial.passes([&] { result = scene.dispatcher->dispatch(request); })) {
        const auto* const error = std::get_if<messages::DispatchError>(&result);
        ASSERT_NE(error, nullptr);
        EXPECT_EQ(error->failure, messages::DispatchFailure::noJsonObject) << error->text;
    }
    scene.expectAlive();
}

void makeAService(Trial& trial) {
    StoreScene scene;
    std::unique_ptr<MessageService> service;
    const auto make = [&] { service = std::make_unique<MessageService>(scene.store); };
    if (!trial.passes(make)) make();
    EXPECT_NE(service->dispatcherFor(messages::allRequestTypes()), nullptr);
    service.reset();
    scene.expectAlive();
}

/// A message whose forms are foreign code.
struct Note : Message {};

void enterNote(JsonSerializerImpl& serializer, const std::string& name) {
    serializer.registerMessage(
        name, typeid(Note),
        [](const std::unique_ptr<Message>&) {
            foreignCall();
            return Poco::JSON::Object::Ptr(new Poco::JSON::Object);
        },
        [](const Poco::JSON::Object::Ptr&) {
            foreignCall();
            return std::make_unique<Note>();
        });
}

void registerAMessage(Trial& trial) {
    JsonSerializerImpl serializer;
    const std::string name = longText("note");
    const auto enter = [&] { enterNote(serializer, name); };
    if (!trial.passes(enter)) enter();
    EXPECT_NO_THROW(serializer.requireKnown(name));
}

void withdrawAMessage(Trial& trial) {
    JsonSerializerImpl serializer;
    const std::string name = longText("note");
    enterNote(serializer, name);
    EXPECT_TRUE(trial.passes([&] { serializer.unregisterMessage(typeid(Note)); }));
    EXPECT_NO_THROW(enterNote(serializer, name));
}

void encodeAMessage(Trial& trial) {
    JsonSerializerImpl serializer;
    enterNote(serializer, longText("note"));
    const std::unique_ptr<Message> note = std::make_unique<Note>();
    JsonMessage text;
    if (trial.passes([&] { text = serializer.encode(note); })) {
        EXPECT_EQ(text.type + text.json, longText("note") + "{}");
    }
}

void decodeAMessage(Trial& trial) {
    JsonSerializerImpl serializer;
    enterNote(serializer, longText("note"));
    const JsonMessage text{longText("note"), R"({"a": [1, "b", {"c": null}]})"};
    std::unique_ptr<Message> note;
    if (trial.passes([&] { note = serializer.decode(text); })) {
        EXPECT_NE(dynamic_cast<Note*>(note.get()), nullptr);
    }
}

// JSON in the place of a text is that text, written over several lines.
void decodeANestedValue(Trial& trial) {
    const auto serializer = std::make_shared<JsonSerializerImpl>();
    const configuration::ConfigurationJsonSerialization entered(serializer);
    const JsonMessage text{std::string(prefix) + "ConfigurationSet",
                           R"({"value": {"type": "string", "value": [")" + longText("a") + "\"]}}"};
    const auto decoded = [&] {
        const auto message = serializer->decode(text);
        return textOf(dynamic_cast<const configuration::ConfigurationSet&>(*message).value);
    };
    const std::string expected = decoded();
    std::string read;
    if (trial.passes([&] { read = decoded(); })) {
        EXPECT_EQ(read, expected);
    }
}

void renderAnObject(Trial& trial) {
    const std::string text =
        R"({"a":[1,2.5,"\u00e4)" + longText("") + R"("],"b":{"c":null,"d":true}})";
    const auto object = messages::parseJsonObject(text);
    const std::string expected = messages::renderJson(*object);
    std::string rendered;
    if (trial.passes([&] { rendered = messages::renderJson(*object); })) {
        EXPECT_EQ(rendered, expected);
    }
}

constexpr const char* poco = "Poco::SharedPtr loses its object without the memory for its count";

constexpr Row messageRows[] = {
    {"DispatchGet", dispatchGet, poco},
    {"DispatchKeys", dispatchKeys, poco},
    {"DispatchSet", dispatchSet, poco},
    {"DispatchNonsense", dispatchNonsense, poco},
    {"MakeAService", makeAService},
    {"Register", registerAMessage},
    {"Withdraw", withdrawAMessage},
    {"Encode", encodeAMessage, poco},
    {"Decode", decodeAMessage, poco},
    {"Render", renderAnObject},
    {"DecodeANestedValue", decodeANestedValue, poco},
};
VELKOR_FAILING_ROWS(FailingMessages, messageRows);

}  // namespace
}  // namespace velkor::testing
