#pragma once

#include <Poco/JSON/Object.h>
#include <Poco/JSON/Parser.h>

#include <memory>
#include <sstream>
#include <string>
#include <typeindex>
#include <typeinfo>
#include <unordered_map>
#include <utility>
#include <vector>

#include "configuration/service/ConfigurationJsonSerialization.hpp"
#include "configuration/service/ConfigurationMessages.hpp"
#include "framework/json/JsonSerializer.hpp"

namespace velkor::testing {

/// A registry that keeps what is registered, and remembers every call in its order.
class RecordingSerializer : public json::JsonSerializer {
public:
    struct Form {
        std::string name;
        Serialise serialise;
        Deserialise deserialise;
    };

    void registerMessage(const std::string& name, const std::type_info& type, Serialise serialise,
                         Deserialise deserialise) override {
        if (name == refused) throw std::runtime_error("refused");
        calls.push_back("register " + name);
        forms[type] = {name, std::move(serialise), std::move(deserialise)};
    }

    void unregisterMessage(const std::type_info& type) override {
        calls.push_back("unregister " + forms.at(type).name);
        forms.erase(type);
    }

    std::vector<std::string> calls;
    std::unordered_map<std::type_index, Form> forms;
    std::string refused;  ///< Registering this name throws.
};

inline Poco::JSON::Object::Ptr parseObject(const std::string& text) {
    return Poco::JSON::Parser().parse(text).extract<Poco::JSON::Object::Ptr>();
}

inline std::string textOfObject(const Poco::JSON::Object& object) {
    std::ostringstream out;
    object.stringify(out);
    return out.str();
}

/// The registered JSON forms, called the way a host does.
class JsonForms {
public:
    template <class M>
    Poco::JSON::Object::Ptr toObject(M message) const {
        const std::unique_ptr<Message> owner = std::make_unique<M>(std::move(message));
        return registry->forms.at(typeid(M)).serialise(owner);
    }

    template <class M>
    std::string toText(M message) const {
        return textOfObject(*toObject(std::move(message)));
    }

    template <class M>
    std::unique_ptr<M> fromObject(const Poco::JSON::Object::Ptr& object) const {
        std::unique_ptr<Message> message = registry->forms.at(typeid(M)).deserialise(object);
        const Message& made = *message;
        if (typeid(made) != typeid(M)) throw std::bad_cast();
        return std::unique_ptr<M>(static_cast<M*>(message.release()));
    }

    template <class M>
    std::unique_ptr<M> fromText(const std::string& text) const {
        return fromObject<M>(parseObject(text));
    }

    /// The value that a value object, given as text, is read as.
    configuration::ConfigurationValue valueFrom(const std::string& valueObject) const {
        return fromText<configuration::ConfigurationSet>("{\"value\":" + valueObject + "}")->value;
    }

    /// The value object that a value is written as.
    Poco::JSON::Object::Ptr objectOf(configuration::ConfigurationValue value) const {
        return toObject(configuration::ConfigurationSet("", std::move(value), ""))
            ->getObject("value");
    }

    std::shared_ptr<RecordingSerializer> registry = std::make_shared<RecordingSerializer>();

private:
    configuration::ConfigurationJsonSerialization registration{registry};
};

}  // namespace velkor::testing
