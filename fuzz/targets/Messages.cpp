// A message as the console sends it, TYPE and JSON: read, written and read again. What is written
// is compared with what the lenient reading of JSON means to the letter, by POCO's own conversions.

#include <Poco/Dynamic/Var.h>
#include <Poco/JSON/Array.h>
#include <Poco/JSON/Object.h>
#include <Poco/NumberParser.h>

#include <memory>
#include <set>
#include <string>
#include <string_view>
#include <type_traits>
#include <vector>

#include "configuration/service/ConfigurationJsonSerialization.hpp"
#include "configuration/service/ConfigurationMessages.hpp"
#include "configuration/service/MessageTypes.hpp"
#include "framework/common/TextConversion.hpp"
#include "fuzz/Finding.hpp"
#include "fuzz/Targets.hpp"
#include "fuzz/Values.hpp"
#include "messages/JsonSerializerImpl.hpp"
#include "messages/JsonText.hpp"

namespace velkor::fuzz {
namespace {

using messages::JsonMessage;
using Poco::Dynamic::Var;
using Poco::JSON::Array;
using Poco::JSON::Object;

const messages::JsonSerializerImpl& serializer() {
    static const auto registry = std::make_shared<messages::JsonSerializerImpl>();
    static const configuration::ConfigurationJsonSerialization registered(registry);
    return *registry;
}

// ---- The second reading

template <class T>
T read(const Var& json, T fallback) {
    if (json.isEmpty()) return fallback;
    if constexpr (std::is_same_v<T, bool>) {
        bool truth = false;
        if (json.isString()) {
            const bool isOne = Poco::NumberParser::tryParseBool(json.extract<std::string>(), truth);
            return isOne ? truth : fallback;
        }
    }
    try {
        return json.convert<T>();
    } catch (const std::exception&) {
        return fallback;
    }
}

std::string text(const Var& json) {
    return read<std::string>(json, "");
}

std::string wideText(const Var& json) {
    const common::TextConversion utf8("UTF-8");
    return utf8.fromUtf16(utf8.toUtf16(text(json)));
}

template <class Read>
Array::Ptr array(const Var& json, Read readElement) {
    Array::Ptr elements = new Array;
    if (json.type() != typeid(Array::Ptr)) return elements;
    for (const Var& element : *json.extract<Array::Ptr>()) elements->add(readElement(element));
    return elements;
}

Var content(const std::string& tag, const Var& json) {
    const auto boolean = [](const Var& held) -> Var { return read(held, false); };
    const auto integer = [](const Var& held) -> Var { return read(held, 0); };
    const auto natural = [](const Var& held) -> Var { return read(held, 0U); };
    const auto number = [](const Var& held) -> Var { return read(held, 0.0); };
    if (tag == "bool") return boolean(json);
    if (tag == "int") return integer(json);
    if (tag == "uint") return natural(json);
    if (tag == "double") return number(json);
    if (tag == "ustring") return wideText(json);
    if (tag == "string") return text(json);
    if (tag == "boolArray") return array(json, boolean);
    if (tag == "intArray") return array(json, integer);
    if (tag == "uintArray") return array(json, natural);
    if (tag == "doubleArray") return array(json, number);
    if (tag == "stringArray") return array(json, text);
    if (tag == "ustringArray") return array(json, wideText);
    return {};
}

bool isObject(const Var& json) {
    return json.type() == typeid(Object::Ptr) && !json.extract<Object::Ptr>().isNull();
}

Object::Ptr value(const Var& json) {
    Object::Ptr object = new Object;
    object->set("type", "string");
    object->set("value", "");
    if (!isObject(json)) return object;
    const Object::Ptr given = json.extract<Object::Ptr>();
    const std::string tag = text(given->get("type"));
    const Var held = content(tag, given->get("value"));
    if (held.isEmpty()) return object;
    object->set("type", tag);
    object->set("value", held);
    return object;
}

Array::Ptr sortedOnce(const Var& json) {
    std::set<std::string> keys;
    const Array::Ptr given = array(json, text);
    for (const Var& key : *given) keys.insert(key.extract<std::string>());
    Array::Ptr sorted = new Array;
    for (const std::string& key : keys) sorted->add(key);
    return sorted;
}

Object::Ptr secondReading(const std::string& type, const Object& given) {
    Object::Ptr object = new Object;
    if (type == "ConfigurationGet") {
        object->set("key", text(given.get("key")));
    } else if (type == "ConfigurationSet" ||
               (type == "ConfigurationOptionResponse" && isObject(given.get("value")))) {
        object->set("key", text(given.get("key")));
        object->set("source", text(given.get("source")));
        object->set("value", value(given.get("value")));
    } else if (type == "ConfigurationKeysResponse") {
        object->set("keys", sortedOnce(given.get("keys")));
    } else if (type == "AddPropertyFileSource") {
        object->set("name", text(given.get("name")));
        object->set("group", text(given.get("group")));
        object->set("order", read(given.get("order"), 0));
        object->set("readOnly", read(given.get("readOnly"), true));
        object->set("path", wideText(given.get("path")));
    }
    return object;
}

// ---- The target

const configuration::ConfigurationValue* valueIn(const Message& message) {
    if (const auto* set = dynamic_cast<const configuration::ConfigurationSet*>(&message)) {
        return &set->value;
    }
    const auto* reply = dynamic_cast<const configuration::ConfigurationOptionResponse*>(&message);
    return reply != nullptr && reply->option ? &reply->option->value : nullptr;
}

// JSON has no way to say what is no UTF-8, or not finite.
bool saysAll(const std::string& json) {
    return json.find("\xEF\xBF\xBD") == std::string::npos && json.find("null") == std::string::npos;
}

void checkMessage(const std::string& type, const JsonMessage& given) {
    std::unique_ptr<Message> message;
    try {
        message = serializer().decode(given);
    } catch (const messages::NoJsonObject&) {
        return;
    }
    const JsonMessage written = serializer().encode(message);
    expectSame("Type of " + given.json, given.type, written.type);
    const Object::Ptr expected = secondReading(type, *messages::parseJsonObject(given.json));
    expectSame("Meaning of " + type + ' ' + spelled(given.json), messages::renderJson(*expected),
               written.json);
    const std::unique_ptr<Message> again = serializer().decode(written);
    expectSame("Written again", written.json, serializer().encode(again).json);
    const auto* const before = valueIn(*message);
    const auto* const after = valueIn(*again);
    expectThat((before == nullptr) == (after == nullptr), "A value stays a value", written.json);
    if (before == nullptr || !saysAll(written.json)) return;
    expectSame("Value of " + written.json, exactly(*before), exactly(*after));
}

void check(std::string_view input) {
    const std::size_t end = input.find(' ');
    if (end == std::string_view::npos) return;
    const std::string type(input.substr(0, end));
    const JsonMessage given{std::string(configuration::messageTypePrefix) + type,
                            std::string(input.substr(end + 1))};
    try {
        checkMessage(type, given);
    } catch (const messages::UnknownMessageType&) {
        configuration::forEachMessageType([&](const auto& known) {
            if (known.shortName == type) report("A type that there is", "known", type);
        });
    }
}

const Target target("messages", check);

}  // namespace
}  // namespace velkor::fuzz
