#pragma once

#include <memory>
#include <stdexcept>
#include <string>
#include <typeindex>
#include <typeinfo>
#include <unordered_map>

#include "framework/Message.hpp"
#include "framework/common/Export.hpp"
#include "framework/common/Mutex.hpp"
#include "framework/json/JsonSerializer.hpp"
#include "messages/JsonText.hpp"

namespace velkor::messages {

/// A message as it travels.
struct JsonMessage {
    std::string type;  ///< The name of its type, such as "velkor/configuration/ConfigurationGet".
    std::string json;  ///< Its content: the text of a JSON object.
};

/// A message type that is not registered.
class VELKOR_EXPORT UnknownMessageType : public std::invalid_argument {
public:
    using std::invalid_argument::invalid_argument;
};

/// The registry of message types, and the way from messages to text and back.
///
/// Thread-safe. Registered functions run on the calling thread with no lock held; withdrawing a
/// type doesn't wait for those that still run.
class VELKOR_EXPORT JsonSerializerImpl : public json::JsonSerializer {
public:
    /// Knows one type already: "velkor/Message", the acknowledgement without content, `{}`.
    /// Texts beyond `textLimits` are not decoded.
    explicit JsonSerializerImpl(const JsonLimits& textLimits = {});

    /// Throws `std::invalid_argument` "Message type already registered: " and `name` when there is
    /// that name or `type` already; nothing has changed then.
    void registerMessage(const std::string& name, const std::type_info& type, Serialise serialise,
                         Deserialise deserialise) override;

    /// Does nothing when `type` is not registered.
    void unregisterMessage(const std::type_info& type) override;

    /// Throws `UnknownMessageType` "Unknown message type: " and `name` when there is no such type.
    void requireKnown(const std::string& name) const;

    /// `message` as text, see `renderJson`. Throws `UnknownMessageType` "Unknown message type: "
    /// and the platform's name of the type; `std::bad_typeid` for a null message; what the
    /// registered function throws.
    JsonMessage encode(const std::unique_ptr<Message>& message) const;

    /// The message that `text` describes. Throws `UnknownMessageType` "Unknown message type: " and
    /// the name; `NoJsonObject`, see `parseJsonObject`; what the registered function throws.
    std::unique_ptr<Message> decode(const JsonMessage& text) const;

private:
    struct Form {
        std::string name;
        Serialise serialise;
        Deserialise deserialise;
    };

    std::shared_ptr<const Form> formOf(const std::type_info& type) const VELKOR_EXCLUDES(mutex);
    std::shared_ptr<const Form> formOf(const std::string& name) const VELKOR_EXCLUDES(mutex);

    const JsonLimits limits;
    mutable common::Mutex mutex;
    std::unordered_map<std::type_index, std::shared_ptr<const Form>> byType
        VELKOR_GUARDED_BY(mutex);
    std::unordered_map<std::string, std::shared_ptr<const Form>> byName VELKOR_GUARDED_BY(mutex);
};

}  // namespace velkor::messages
