#pragma once

#include <Poco/JSON/Object.h>

#include <functional>
#include <memory>
#include <string>
#include <typeinfo>

#include "framework/Message.hpp"
#include "framework/common/Export.hpp"

namespace velkor::json {

/// The registry of the message types that have a JSON form. Implementations are safe for concurrent
/// use and may call the registered functions on any thread, several at a time.
class VELKOR_EXPORT JsonSerializer {
public:
    /// Gives a new object for a message, which is of the registered type.
    using Serialise = std::function<Poco::JSON::Object::Ptr(const std::unique_ptr<Message>&)>;

    /// Gives a new message of the registered type for an object, which may be null.
    using Deserialise = std::function<std::unique_ptr<Message>(const Poco::JSON::Object::Ptr&)>;

    virtual ~JsonSerializer();

    /// Offers the JSON form of the messages of `type`, known to clients as `name`.
    virtual void registerMessage(const std::string& name, const std::type_info& type,
                                 Serialise serialise, Deserialise deserialise) = 0;

    /// Withdraws the JSON form of the messages of `type`.
    virtual void unregisterMessage(const std::type_info& type) = 0;
};

}  // namespace velkor::json
