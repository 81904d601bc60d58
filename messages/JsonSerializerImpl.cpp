#include "messages/JsonSerializerImpl.hpp"

#include <Poco/JSON/Object.h>

#include <utility>

#include "framework/RoutingErrors.hpp"

namespace velkor::messages {

namespace {

std::string unknownType(const std::string& name) {
    return "Unknown message type: " + name;
}

Poco::JSON::Object::Ptr acknowledgementToJson(const std::unique_ptr<Message>&) {
    return new Poco::JSON::Object;
}

std::unique_ptr<Message> acknowledgementFromJson(const Poco::JSON::Object::Ptr&) {
    return std::make_unique<Message>();
}

}  // namespace

JsonSerializerImpl::JsonSerializerImpl(const JsonLimits& textLimits) : limits(textLimits) {
    JsonSerializerImpl::registerMessage("velkor/Message", typeid(Message), acknowledgementToJson,
                                        acknowledgementFromJson);
}

void JsonSerializerImpl::registerMessage(const std::string& name, const std::type_info& type,
                                         Serialise serialise, Deserialise deserialise) {
    const auto form =
        std::make_shared<const Form>(Form{name, std::move(serialise), std::move(deserialise)});
    const common::MutexLock lock(mutex);
    if (byName.count(name) != 0 || byType.count(type) != 0) {
        throw std::invalid_argument("Message type already registered: " + name);
    }
    const auto entry = byName.emplace(name, form).first;
    try {
        byType.emplace(type, form);
    } catch (...) {
        byName.erase(entry);
        throw;
    }
}

void JsonSerializerImpl::unregisterMessage(const std::type_info& type) {
    std::shared_ptr<const Form> withdrawn;  // its functions are destroyed with the mutex released
    const common::MutexLock lock(mutex);
    const auto entry = byType.find(type);
    if (entry == byType.end()) return;
    withdrawn = std::move(entry->second);
    byType.erase(entry);
    byName.erase(withdrawn->name);
}

void JsonSerializerImpl::requireKnown(const std::string& name) const {
    formOf(name);
}

JsonMessage JsonSerializerImpl::encode(const std::unique_ptr<Message>& message) const {
    if (message == nullptr) throw std::bad_typeid();
    const Message& content = *message;
    const auto form = formOf(typeid(content));
    return {form->name, renderJson(*form->serialise(message))};
}

std::unique_ptr<Message> JsonSerializerImpl::decode(const JsonMessage& text) const {
    const auto form = formOf(text.type);
    return form->deserialise(parseJsonObject(text.json, limits));
}

std::shared_ptr<const JsonSerializerImpl::Form> JsonSerializerImpl::formOf(
    const std::type_info& type) const {
    const common::MutexLock lock(mutex);
    const auto entry = byType.find(type);
    if (entry == byType.end()) throw UnknownMessageType(unknownType(typeName(type)));
    return entry->second;
}

std::shared_ptr<const JsonSerializerImpl::Form> JsonSerializerImpl::formOf(
    const std::string& name) const {
    const common::MutexLock lock(mutex);
    const auto entry = byName.find(name);
    if (entry == byName.end()) throw UnknownMessageType(unknownType(name));
    return entry->second;
}

}  // namespace velkor::messages
