#pragma once

#include <Poco/JSON/Object.h>

#include <cstddef>
#include <stdexcept>
#include <string>

namespace velkor::host {

/// How large a JSON text may be, in bytes.
inline constexpr std::size_t maximumJsonSize = std::size_t{16} * 1024 * 1024;

/// How many objects and arrays may be open at once in a JSON text. Messages need three.
inline constexpr std::size_t maximumJsonDepth = 64;

/// A text that is not the JSON text of one object, or goes beyond the limits.
class NoJsonObject : public std::invalid_argument {
public:
    using std::invalid_argument::invalid_argument;
};

/// The object that `text` describes; of members with the same name the last one counts.
/// Throws `NoJsonObject` "JSON text exceeds 16777216 bytes", "JSON text is nested more than 64
/// levels deep", "JSON text is not an object", or "Invalid JSON text: " and what the parser found;
/// a number beyond the range of a double, and beyond 64 bits without a fraction, is invalid.
/// Time and memory are proportional to the size of the text. Stateless.
Poco::JSON::Object::Ptr parseJsonObject(const std::string& text);

/// The text of `object` on a single line, members sorted by name; valid JSON whatever it holds: a
/// number that is not finite is null, and what is no UTF-8 in a text becomes U+FFFD. `object` is
/// left as it is. Nested as deep as objects are nested: what deserialisers and handlers make is
/// flat. Lack of memory throws `std::bad_alloc`, so that a text is complete.
std::string renderJson(const Poco::JSON::Object& object);

}  // namespace velkor::host
