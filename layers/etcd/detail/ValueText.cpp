#include "layers/etcd/detail/ValueText.hpp"

#include <Poco/JSON/Object.h>

#include <charconv>
#include <cmath>
#include <memory>
#include <optional>
#include <type_traits>
#include <typeinfo>
#include <utility>
#include <vector>

#include "configuration/service/ConfigurationJsonSerialization.hpp"
#include "configuration/service/ConfigurationMessages.hpp"
#include "framework/common/TextConversion.hpp"
#include "framework/json/JsonSerializer.hpp"
#include "layers/detail/Utf8.hpp"
#include "layers/detail/ValueCodec.hpp"
#include "layers/etcd/detail/Base64.hpp"
#include "layers/etcd/detail/JsonReader.hpp"
#include "messages/JsonText.hpp"

namespace velkor::layers::etcd {

namespace {

using configuration::ConfigurationSet;
using configuration::ConfigurationValue;

/// How the message that holds a value is written.
class SetForm final : public json::JsonSerializer {
public:
    void registerMessage(const std::string& /*name*/, const std::type_info& type,
                         Serialise serialise, Deserialise /*deserialise*/) override {
        if (type == typeid(ConfigurationSet)) write = std::move(serialise);
    }

    void unregisterMessage(const std::type_info& /*type*/) override {}

    Serialise write;
};

json::JsonSerializer::Serialise formOfSet() {
    const auto form = std::make_shared<SetForm>();
    const configuration::ConfigurationJsonSerialization registered(form);
    return form->write;
}

std::string messageText(const ConfigurationValue& value) {
    static const auto serialise = formOfSet();
    auto message = std::make_unique<ConfigurationSet>();
    message->value = value;
    const std::unique_ptr<Message> anyMessage = std::move(message);
    return messages::renderJson(*serialise(anyMessage)->getObject("value"));
}

/// Reads a value, of which "exact" says more or not.
struct ValueReader : JsonReader {
    ValueReader(const JsonReader& reader, bool explained)
        : JsonReader(reader), isExplained(explained) {}

    const bool isExplained;
};

template <class T>
void readNumber(ValueReader& reader, T& content) {
    const std::string_view text = reader.number();
    const char* const end = text.data() + text.size();
    const auto read = std::from_chars(text.data(), end, content);
    if (read.ec != std::errc() || read.ptr != end) throw BadJson("JSON number doesn't fit");
}

void read(ValueReader& reader, bool& content) {
    content = reader.boolean();
}

void read(ValueReader& reader, int& content) {
    readNumber(reader, content);
}

void read(ValueReader& reader, unsigned int& content) {
    readNumber(reader, content);
}

// A number that is not finite is null.
void read(ValueReader& reader, double& content) {
    if (reader.isExplained && reader.null()) {
        content = std::nan("");
    } else {
        readNumber(reader, content);
    }
}

void read(ValueReader& reader, std::string& content) {
    content = reader.text();
}

void read(ValueReader& reader, std::u16string& content) {
    content = common::TextConversion("UTF-8").toUtf16(reader.text());
}

template <class T>
void read(ValueReader& reader, std::vector<T>& content) {
    reader.array([&] {
        T element{};
        read(reader, element);
        content.push_back(std::move(element));
    });
}

ConfigurationValue readKind(ValueReader& reader, std::string_view tag) {
    std::optional<ConfigurationValue> value;
    configuration::forEachValueKind([&](const auto& kind) {
        if (kind.tag != tag) return;
        typename std::decay_t<decltype(kind)>::Type content{};
        read(reader, content);
        value = std::move(content);
    });
    if (!value) throw BadJson("JSON value is of no known kind");
    return std::move(*value);
}

// Throws `BadJson` when `text` is none of a value. Members come in any order, each once.
ConfigurationValue readObject(std::string_view text) {
    std::optional<std::string> tag;
    std::optional<std::string> exact;
    JsonReader reader(text);
    std::optional<JsonReader> valueBegin;
    reader.object([&](std::string_view name) {
        if (name == "type" && !tag) {
            tag = reader.text();
        } else if (name == "exact" && !exact) {
            exact = fromBase64(reader.plainText());
            if (!exact) throw BadJson("JSON member is no base64");
        } else if (name == "value" && !valueBegin) {
            valueBegin = reader;
            reader.skip();
        } else {
            throw BadJson("JSON member is not one of a value");
        }
    });
    reader.end();
    if (!tag || !valueBegin) throw BadJson("JSON object is no value");
    ValueReader valueReader(*valueBegin, exact.has_value());
    ConfigurationValue value = readKind(valueReader, *tag);
    if (!exact) return value;
    auto exactly = layers::detail::decoded(*exact);
    if (!exactly || exactly->which() != value.which()) throw BadJson("JSON value has no sense");
    return std::move(*exactly);
}

}  // namespace

std::string toValueText(const ConfigurationValue& value) {
    std::string text = messageText(value);
    const std::string exact = layers::detail::encoded(value);
    if (layers::detail::encoded(fromValueText(text)) == exact) return text;
    text.pop_back();
    return text + ",\"exact\":\"" + toBase64(exact) + "\"}";
}

ConfigurationValue fromValueText(std::string_view text) {
    // An exception for every text would make those slow that tools write. JSON is UTF-8.
    if (text.substr(0, 1) != "{" || !layers::detail::isUtf8(text)) return std::string(text);
    try {
        return readObject(text);
    } catch (const BadJson&) {
        return std::string(text);
    }
}

}  // namespace velkor::layers::etcd
