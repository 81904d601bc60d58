#include "messages/JsonSerializerImpl.hpp"

#include <Poco/JSON/Object.h>
#include <gtest/gtest.h>

#include <memory>
#include <stdexcept>
#include <string>
#include <thread>
#include <typeinfo>
#include <utility>
#include <vector>

#include "messages/JsonText.hpp"
#include "tests/support/BoundedWait.hpp"

namespace velkor::messages {
namespace {

using velkor::testing::completesWithin;
using velkor::testing::patience;

struct Note : Message {
    std::string text;
};

struct Other : Message {};

Poco::JSON::Object::Ptr noteToJson(const std::unique_ptr<Message>& message) {
    Poco::JSON::Object::Ptr object = new Poco::JSON::Object;
    object->set("text", dynamic_cast<const Note&>(*message).text);
    return object;
}

std::unique_ptr<Message> noteFromJson(const Poco::JSON::Object::Ptr& object) {
    auto note = std::make_unique<Note>();
    note->text = object->optValue<std::string>("text", "");
    return note;
}

class Registry : public ::testing::Test {
protected:
    void registerNote(const std::string& name = "note") {
        serializer.registerMessage(name, typeid(Note), noteToJson, noteFromJson);
    }

    std::string encodedType(std::unique_ptr<Message> message) {
        return serializer.encode(message).type;
    }

    JsonSerializerImpl serializer;
};

TEST_F(Registry, EncodesARegisteredMessage) {
    registerNote();
    auto note = std::make_unique<Note>();
    note->text = "x";
    const JsonMessage encoded = serializer.encode(std::move(note));
    EXPECT_EQ(encoded.type, "note");
    EXPECT_EQ(encoded.json, R"({"text":"x"})");
}

TEST_F(Registry, DecodesARegisteredMessage) {
    registerNote();
    const auto message = serializer.decode({"note", R"({"text":"x"})"});
    EXPECT_EQ(dynamic_cast<const Note&>(*message).text, "x");
}

TEST_F(Registry, KnowsTheAcknowledgement) {
    const JsonMessage encoded = serializer.encode(std::make_unique<Message>());
    EXPECT_EQ(encoded.type, "velkor/Message");
    EXPECT_EQ(encoded.json, "{}");
    const auto decoded = serializer.decode(encoded);
    const Message& object = *decoded;
    EXPECT_EQ(typeid(object), typeid(Message));
}

TEST_F(Registry, RefusesToEncodeAnUnknownType) {
    try {
        encodedType(std::make_unique<Other>());
        FAIL() << "no exception";
    } catch (const UnknownMessageType& error) {
        EXPECT_EQ(error.what(), std::string("Unknown message type: ") + typeid(Other).name());
    }
}

TEST_F(Registry, RefusesToDecodeAnUnknownName) {
    try {
        serializer.decode({"other", "{}"});
        FAIL() << "no exception";
    } catch (const UnknownMessageType& error) {
        EXPECT_STREQ(error.what(), "Unknown message type: other");
    }
}

TEST_F(Registry, RequiresANameOnlyWhileItIsRegistered) {
    EXPECT_THROW(serializer.requireKnown("note"), UnknownMessageType);
    registerNote();
    EXPECT_NO_THROW(serializer.requireKnown("note"));
}

TEST_F(Registry, LooksAtTheNameBeforeTheText) {
    EXPECT_THROW(serializer.decode({"other", "no json"}), UnknownMessageType);
}

TEST_F(Registry, RefusesATextThatIsNoObject) {
    registerNote();
    EXPECT_THROW(serializer.decode({"note", "[]"}), NoJsonObject);
}

TEST_F(Registry, RefusesToEncodeNothing) {
    EXPECT_THROW(serializer.encode(nullptr), std::bad_typeid);
}

TEST_F(Registry, ForgetsAWithdrawnType) {
    registerNote();
    serializer.unregisterMessage(typeid(Note));
    EXPECT_THROW(encodedType(std::make_unique<Note>()), UnknownMessageType);
    EXPECT_THROW(serializer.decode({"note", "{}"}), UnknownMessageType);
}

TEST_F(Registry, TakesAWithdrawnTypeAgain) {
    registerNote();
    serializer.unregisterMessage(typeid(Note));
    registerNote("renamed");
    EXPECT_EQ(encodedType(std::make_unique<Note>()), "renamed");
}

TEST_F(Registry, IgnoresTheWithdrawalOfAnUnknownType) {
    registerNote();
    serializer.unregisterMessage(typeid(Other));
    EXPECT_EQ(encodedType(std::make_unique<Note>()), "note");
}

TEST_F(Registry, RefusesANameThatIsTaken) {
    registerNote();
    try {
        serializer.registerMessage("note", typeid(Other), noteToJson, noteFromJson);
        FAIL() << "no exception";
    } catch (const std::invalid_argument& error) {
        EXPECT_STREQ(error.what(), "Message type already registered: note");
    }
    EXPECT_THROW(encodedType(std::make_unique<Other>()), UnknownMessageType);
}

TEST_F(Registry, RefusesATypeThatIsTaken) {
    registerNote();
    EXPECT_THROW(registerNote("again"), std::invalid_argument);
    EXPECT_THROW(serializer.decode({"again", "{}"}), UnknownMessageType);
}

TEST_F(Registry, MayBeUsedFromARegisteredFunction) {
    serializer.registerMessage("note", typeid(Note), noteToJson,
                               [this](const Poco::JSON::Object::Ptr& object) {
                                   serializer.unregisterMessage(typeid(Note));
                                   return noteFromJson(object);
                               });
    EXPECT_NE(serializer.decode({"note", "{}"}), nullptr);
    EXPECT_THROW(serializer.decode({"note", "{}"}), UnknownMessageType);
}

TEST_F(Registry, DestroysWithdrawnFunctionsWithNoLockHeld) {
    bool destroyed = false;
    std::shared_ptr<void> observed(nullptr, [&](void*) {
        destroyed =
            completesWithin(patience, [this] { serializer.unregisterMessage(typeid(Note)); });
    });
    serializer.registerMessage("note", typeid(Note), noteToJson,
                               [held = std::move(observed)](const Poco::JSON::Object::Ptr& object) {
                                   return noteFromJson(object);
                               });
    serializer.unregisterMessage(typeid(Note));
    EXPECT_TRUE(destroyed);
}

TEST_F(Registry, IsSafeForConcurrentUse) {
    std::vector<std::thread> clients;
    for (int client = 0; client < 3; ++client) {
        clients.emplace_back([this] {
            for (int i = 0; i < 300; ++i) {
                try {
                    const auto note = serializer.decode({"note", R"({"text":"x"})"});
                    EXPECT_EQ(dynamic_cast<const Note&>(*note).text, "x");
                } catch (const UnknownMessageType&) {
                    continue;  // withdrawn at the moment
                }
            }
        });
    }
    for (int i = 0; i < 300; ++i) {
        registerNote();
        serializer.unregisterMessage(typeid(Note));
    }
    for (auto& client : clients) client.join();
}

}  // namespace
}  // namespace velkor::messages
