#pragma once

#include <Poco/JSON/Object.h>

#include <cstddef>
#include <stdexcept>
#include <string>

#include "framework/common/Export.hpp"

namespace velkor::messages {

/// How much of a JSON text is accepted.
struct JsonLimits {
    std::size_t bytes = std::size_t{16} * 1024 * 1024;

    /// How many objects and arrays may be open at once. Messages need three.
    std::size_t depth = 64;

    /// How many objects and arrays there may be. Each takes up to a thousand bytes of memory once
    /// it is parsed, and three in the text.
    std::size_t containers = std::size_t{16} * 1024 * 1024;
};

/// A text that is not the JSON text of one object, or goes beyond the limits.
class VELKOR_EXPORT NoJsonObject : public std::invalid_argument {
public:
    using std::invalid_argument::invalid_argument;
};

/// The object that `text` describes; of members with the same name the last one counts.
/// Throws `NoJsonObject` "JSON text exceeds N bytes", "JSON text is nested more than N levels
/// deep", "JSON text holds more than N objects and arrays", "JSON text is not an object", or
/// "Invalid JSON text: " and what the parser found; a number beyond the range of a double, and
/// beyond 64 bits without a fraction, is invalid. Time and memory are proportional to the size of
/// the text. Stateless.
VELKOR_EXPORT Poco::JSON::Object::Ptr parseJsonObject(const std::string& text,
                                                      const JsonLimits& limits = {});

/// The text of `object` on a single line, members sorted by name; valid JSON whatever it holds: a
/// number that is not finite is null, and what is no UTF-8 in a text becomes U+FFFD. `object` is
/// left as it is. Nested as deep as objects are nested: what deserialisers and handlers make is
/// flat. Lack of memory throws `std::bad_alloc`, so that a text is complete.
VELKOR_EXPORT std::string renderJson(const Poco::JSON::Object& object);

}  // namespace velkor::messages
