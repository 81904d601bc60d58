// Messages to POCO objects and back.

#include <Poco/JSON/Array.h>
#include <Poco/JSON/Object.h>

#include <boost/variant/get.hpp>
#include <memory>
#include <string>
#include <utility>
#include <vector>

#include "benchmarks/support/Fixtures.hpp"
#include "benchmarks/support/FormTable.hpp"
#include "benchmarks/support/Harness.hpp"
#include "configuration/service/ConfigurationJsonSerialization.hpp"
#include "configuration/service/ConfigurationMessages.hpp"

namespace velkor::benchmarks {

namespace {

using configuration::ConfigurationSet;
using Poco::JSON::Array;
using Poco::JSON::Object;

// How one kind of value is written and read by hand, with what POCO offers for it.
struct IntByHand {
    static void write(Object& object, const ConfigurationValue& value) {
        object.set("type", "int");
        object.set("value", boost::get<int>(value));
    }
    static ConfigurationValue read(const Object& object) { return object.optValue("value", 0); }
};

struct DoublesByHand {
    static void write(Object& object, const ConfigurationValue& value) {
        Array::Ptr array = new Array;
        for (const double element : boost::get<std::vector<double>>(value)) array->add(element);
        object.set("type", "doubleArray");
        object.set("value", array);
    }
    static ConfigurationValue read(const Object& object) {
        std::vector<double> elements;
        const Array::Ptr array = object.getArray("value");
        elements.reserve(array->size());
        for (unsigned int i = 0; i < array->size(); ++i) {
            elements.push_back(array->optElement(i, 0.0));
        }
        return elements;
    }
};

template <class ByHand>
Object::Ptr encodeByHand(const ConfigurationSet& message) {
    Object::Ptr object = new Object;
    object->set("key", message.key);
    object->set("source", message.source);
    Object::Ptr value = new Object;
    ByHand::write(*value, message.value);
    object->set("value", value);
    return object;
}

template <class ByHand>
std::unique_ptr<Message> decodeByHand(const Object& object) {
    auto message = std::make_unique<ConfigurationSet>();
    message->key = object.optValue<std::string>("key", "");
    message->source = object.optValue<std::string>("source", "");
    message->value = ByHand::read(*object.getObject("value"));
    return message;
}

std::unique_ptr<Message> messageOf(const ConfigurationValue& value) {
    return std::make_unique<ConfigurationSet>(keyNumber(1), value, "override");
}

FormTable::Form registeredForm() {
    const auto table = std::make_shared<FormTable>();
    const configuration::ConfigurationJsonSerialization registration(table);
    return table->formOf<ConfigurationSet>();
}

template <class ByHand>
void measureMessage(const std::string& kind, const ConfigurationValue& value) {
    measure("message/encode/" + kind + "/velkor", [value] {
        return [message = messageOf(value), form = registeredForm()] {
            keep(form.serialise(message));
        };
    });
    measure("message/encode/" + kind + "/poco", [value] {
        return [message = messageOf(value)] {
            keep(encodeByHand<ByHand>(static_cast<const ConfigurationSet&>(*message)));
        };
    });
    measure("message/decode/" + kind + "/velkor", [value] {
        const auto form = registeredForm();
        return
            [object = form.serialise(messageOf(value)), form] { keep(form.deserialise(object)); };
    });
    measure("message/decode/" + kind + "/poco", [value] {
        return [object = registeredForm().serialise(messageOf(value))] {
            keep(decodeByHand<ByHand>(*object));
        };
    });
}

}  // namespace

void addOperations() {
    measureMessage<IntByHand>("int", intValue());
    measureMessage<DoublesByHand>("doubles1000", std::vector<double>(1000, 0.5));
}

}  // namespace velkor::benchmarks
