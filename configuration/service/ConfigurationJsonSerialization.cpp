#include "configuration/service/ConfigurationJsonSerialization.hpp"

#include <Poco/JSON/Object.h>

#include <cstddef>
#include <iterator>
#include <string>
#include <tuple>
#include <typeinfo>
#include <utility>

#include "configuration/Option.hpp"
#include "configuration/service/ConfigurationMessages.hpp"
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
constexpr std::tuple<> members;

template <>
constexpr std::tuple members<ConfigurationGet>{Member{"key", &ConfigurationGet::key}};

template <>
constexpr std::tuple members<ConfigurationSet>{Member{"key", &ConfigurationSet::key},
                                               Member{"source", &ConfigurationSet::source},
                                               Member{"value", &ConfigurationSet::value}};

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

struct Registration {
    const char* name;
    const std::type_info& type;
    Object::Ptr (*serialise)(const std::unique_ptr<Message>&);
    std::unique_ptr<Message> (*deserialise)(const Object::Ptr&);
};

template <class M>
constexpr Registration registrationOf(const char* name) {
    return {name, typeid(M), serialise<M>, deserialise<M>};
}

constexpr Registration registrations[] = {
    registrationOf<ConfigurationSet>("velkor/configuration/ConfigurationSet"),
    registrationOf<ConfigurationGet>("velkor/configuration/ConfigurationGet"),
    registrationOf<ConfigurationKeys>("velkor/configuration/ConfigurationKeys"),
    registrationOf<ConfigurationKeysResponse>("velkor/configuration/ConfigurationKeysResponse"),
    registrationOf<ConfigurationOptionResponse>("velkor/configuration/ConfigurationOptionResponse"),
    registrationOf<AddPropertyFileSource>("velkor/configuration/AddPropertyFileSource"),
};

// Withdraws the first `count` rows.
void withdraw(json::JsonSerializer& registry, std::size_t count) {
    for (std::size_t row = 0; row < count; ++row) {
        registry.unregisterMessage(registrations[row].type);
    }
}

}  // namespace

ConfigurationJsonSerialization::ConfigurationJsonSerialization(
    std::shared_ptr<json::JsonSerializer> registry)
    : serializer(std::move(registry)) {
    std::size_t registered = 0;
    try {
        for (const auto& [name, type, serialise, deserialise] : registrations) {
            serializer->registerMessage(name, type, serialise, deserialise);
            ++registered;
        }
    } catch (...) {
        withdraw(*serializer, registered);
        throw;
    }
}

ConfigurationJsonSerialization::~ConfigurationJsonSerialization() {
    withdraw(*serializer, std::size(registrations));
}

}  // namespace velkor::configuration
