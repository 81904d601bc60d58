#pragma once

#include <memory>

#include "framework/DeferredService.hpp"
#include "framework/common/Export.hpp"
#include "framework/json/JsonSerializer.hpp"

namespace velkor::configuration {

/// Keeps the JSON form of the configuration messages registered while it lives.
///
/// What the message types are called is in `messageTypes`. A value is an object of "type" (a tag,
/// see `typeTags`) and "value"; texts travel in UTF-8, narrow ones byte for byte.
///
/// Reading is lenient: a member that is missing, null, or can't be converted by POCO's rules reads
/// as zero, empty or false, and "readOnly" as true; a text is a truth value when
/// `Poco::NumberParser::tryParseBool` says so; a value of no known type is an empty narrow text.
/// Only lack of memory throws (`std::bad_alloc`).
///
/// The registered functions hold no state and are safe for concurrent use.
class VELKOR_EXPORT ConfigurationJsonSerialization : public DeferredService {
public:
    /// Registers all `messageTypes` with `serializer`, which is not null, in their order. When the
    /// registry throws, what it took is withdrawn and the exception passes on.
    explicit ConfigurationJsonSerialization(std::shared_ptr<json::JsonSerializer> serializer);
    ConfigurationJsonSerialization(const ConfigurationJsonSerialization&) = delete;
    ConfigurationJsonSerialization& operator=(const ConfigurationJsonSerialization&) = delete;

    /// Withdraws the types in the same order. An exception of the registry ends the process.
    ~ConfigurationJsonSerialization() override;

private:
    std::shared_ptr<json::JsonSerializer> serializer;
};

}  // namespace velkor::configuration
