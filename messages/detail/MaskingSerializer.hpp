#pragma once

#include <memory>
#include <string>
#include <typeinfo>

#include "framework/json/JsonSerializer.hpp"
#include "messages/Secrets.hpp"

namespace velkor::messages::detail {

/// Registers message types with another registry so that replies that show an option show a mark in
/// the place of a secret value. The type of the value, and all other messages, stay as they are.
/// Thread-safe as far as the other registry is.
class MaskingSerializer final : public json::JsonSerializer {
public:
    /// `registry` is not null.
    MaskingSerializer(std::shared_ptr<json::JsonSerializer> registry, Secrets maskedOptions);

    void registerMessage(const std::string& name, const std::type_info& type, Serialise serialise,
                         Deserialise deserialise) override;
    void unregisterMessage(const std::type_info& type) override;

private:
    const std::shared_ptr<json::JsonSerializer> serializer;
    const Secrets secrets;
};

}  // namespace velkor::messages::detail
