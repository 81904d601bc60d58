#include "configuration/service/ConfigurationJsonSerialization.hpp"

#include <Poco/JSON/Object.h>

#include <cstddef>
#include <string>
#include <tuple>
#include <type_traits>
#include <typeinfo>
#include <utility>

#include "configuration/Option.hpp"
#include "configuration/service/ConfigurationMessages.hpp"
#include "configuration/service/MessageTypes.hpp"
#include "configuration/service/ValueJson.hpp"

namespace velkor::configuration {

namespace {

using Poco::JSON::Object;

// ---- What the messages are made of: one row for each member of the JSON form, in both directions.
// The default of a member is what a new message holds.

template <class M, class T>
struct Member {
    const char* name;
    T M::*field;
};

template <class M, class T>
Member(const char*, T M::*) -> Member<M, T>;

template <class M>
constexpr auto members = nullptr;  // each message states its own, even if it has none

template <>
constexpr std::tuple members<ConfigurationGet>{Member{"key", &ConfigurationGet::key}};

template <>
constexpr std::tuple members<ConfigurationSet>{Member{"key", &ConfigurationSet::key},
                                               Member{"source", &ConfigurationSet::source},
                                               Member{"value", &ConfigurationSet::value}};

template <>
constexpr std::tuple members<ConfigurationKeys>{};

template <>
constexpr std::tuple members<ConfigurationKeysResponse>{
    Member{"keys", &ConfigurationKeysResponse::keys}};

template <>
constexpr std::tuple members<Option>{Member{"key", &Option::key}, Member{"source", &Option::source},
                                     Member{"value", &Option::value}};

template <>
constexpr std::tuple members<AddPropertyFileSource>{
    Member{"name", &AddPropertyFileSource::name}, Member{"group", &AddPropertyFileSource::group},
    Member{"order", &AddPropertyFileSource::order},
    Member{"readOnly", &AddPropertyFileSource::readOnly},
    Member{"path", &AddPropertyFileSource::path}};

template <class M>
void write(const M& message, Object& object) {
    const auto writeMember = [&](const auto& member) {
        object.set(member.name, toJson(message.*member.field));
    };
    std::apply([&](const auto&... member) { (writeMember(member), ...); }, members<M>);
}

template <class M>
void read(const Object& object, M& message) {
    const auto readInto = [&](const auto& member) {
        readMember(object, member.name, message.*member.field);
    };
    std::apply([&](const auto&... member) { (readInto(member), ...); }, members<M>);
}

// The members of the option are those of the response. Whether there is an option shows in whether
// there is a value.
void write(const ConfigurationOptionResponse& response, Object& object) {
    if (response.option != nullptr) write(*response.option, object);
}

void read(const Object& object, ConfigurationOptionResponse& response) {
    const auto* const value = findMember(object, "value");
    if (value == nullptr || asObject(*value) == nullptr) return;
    response.option = std::make_unique<Option>("", "", ConfigurationValue());
    read(object, *response.option);
}

// ---- Registration

template <class M>
Object::Ptr serialise(const std::unique_ptr<Message>& message) {
    Object::Ptr object = new Object;
    write(static_cast<const M&>(*message), *object);
    return object;
}

template <class M>
std::unique_ptr<Message> deserialise(const Object::Ptr& object) {
    auto message = std::make_unique<M>();
    const Object::Ptr content = object.isNull() ? Object::Ptr(new Object) : object;
    read(*content, *message);
    return message;
}

template <class M>
void enter(const MessageType<M>& type, json::JsonSerializer& registry) {
    registry.registerMessage(type.name(), typeid(M), serialise<M>, deserialise<M>);
}

// Withdraws the first `count` types.
void withdraw(json::JsonSerializer& registry, std::size_t count) {
    forEachMessageType([&](const auto& type) {
        if (count == 0) return;
        --count;
        registry.unregisterMessage(typeid(typename std::decay_t<decltype(type)>::Class));
    });
}

}  // namespace

ConfigurationJsonSerialization::ConfigurationJsonSerialization(
    std::shared_ptr<json::JsonSerializer> registry)
    : serializer(std::move(registry)) {
    std::size_t registered = 0;
    try {
        forEachMessageType([&](const auto& type) {
            enter(type, *serializer);
            ++registered;
        });
    } catch (...) {
        withdraw(*serializer, registered);
        throw;
    }
}

ConfigurationJsonSerialization::~ConfigurationJsonSerialization() {
    withdraw(*serializer, std::tuple_size_v<decltype(messageTypes)>);
}

}  // namespace velkor::configuration
