#pragma once

#include <Poco/Dynamic/Var.h>
#include <Poco/JSON/Array.h>
#include <Poco/JSON/Object.h>

#include <cstddef>
#include <set>
#include <string>
#include <utility>
#include <vector>

#include "configuration/ConfigurationValue.hpp"
#include "framework/common/Export.hpp"

/// How content looks in JSON, in both directions. All functions are stateless.
namespace velkor::configuration {

/// What `content` looks like in JSON: UTF-16 as UTF-8, narrow text byte for byte, a value as an
/// object of "type", its tag, and "value".
Poco::Dynamic::Var toJson(bool content);
Poco::Dynamic::Var toJson(int content);
Poco::Dynamic::Var toJson(unsigned int content);
Poco::Dynamic::Var toJson(double content);
Poco::Dynamic::Var toJson(const std::u16string& content);
Poco::Dynamic::Var toJson(const std::string& content);
VELKOR_EXPORT Poco::Dynamic::Var toJson(const ConfigurationValue& content);

/// Reads `json` into `content`, which holds the default (an empty one, if it is a text) and keeps
/// it when `json` is empty or can't be converted. Conversion follows `Poco::Dynamic::Var`, with two
/// exceptions: a text is a truth value when `Poco::NumberParser::tryParseBool` says so, and a
/// number that is not finite is no integer. Lack of memory throws `std::bad_alloc`, nothing else
/// does.
void readJson(const Poco::Dynamic::Var& json, bool& content);
void readJson(const Poco::Dynamic::Var& json, int& content);
void readJson(const Poco::Dynamic::Var& json, unsigned int& content);
void readJson(const Poco::Dynamic::Var& json, double& content);
void readJson(const Poco::Dynamic::Var& json, std::u16string& content);
void readJson(const Poco::Dynamic::Var& json, std::string& content);

/// Reads a value object. Anything else, and an object of no known type, is an empty narrow text.
VELKOR_EXPORT void readJson(const Poco::Dynamic::Var& json, ConfigurationValue& content);

/// The object or array that `json` holds; null when it holds none. Lives as long as `json`.
const Poco::JSON::Object* asObject(const Poco::Dynamic::Var& json);
const Poco::JSON::Array* asArray(const Poco::Dynamic::Var& json);

/// The member of `object` called `name`; null when there is none. Lives as long as `object`.
const Poco::Dynamic::Var* findMember(const Poco::JSON::Object& object, const char* name);

/// A new array of `size` empty elements. Made at its full size, because a POCO array that grows
/// copies all the elements that it has so far.
Poco::JSON::Array::Ptr makeArray(std::size_t size);

/// An array of the elements of `sequence`, in its order.
template <class Sequence>
Poco::Dynamic::Var elementsToJson(const Sequence& sequence) {
    Poco::JSON::Array::Ptr array = makeArray(sequence.size());
    unsigned int index = 0;
    for (const auto& element : sequence) array->set(index++, toJson(element));
    return array;
}

template <class T>
Poco::Dynamic::Var toJson(const std::vector<T>& content) {
    return elementsToJson(content);
}

inline Poco::Dynamic::Var toJson(const std::set<std::string>& content) {
    return elementsToJson(content);
}

/// Calls `store` with each element of `json`, read as a `T`; anything but an array has none.
template <class T, class Store>
void readElements(const Poco::Dynamic::Var& json, Store&& store) {
    const Poco::JSON::Array* const array = asArray(json);
    if (array == nullptr) return;
    for (const Poco::Dynamic::Var& element : *array) {
        T content{};
        readJson(element, content);
        store(std::move(content));
    }
}

template <class T>
void readJson(const Poco::Dynamic::Var& json, std::vector<T>& content) {
    content.clear();
    if (const auto* array = asArray(json)) content.reserve(array->size());
    readElements<T>(json, [&](T&& element) { content.push_back(std::move(element)); });
}

inline void readJson(const Poco::Dynamic::Var& json, std::set<std::string>& content) {
    content.clear();
    readElements<std::string>(json, [&](std::string&& element) {
        content.insert(content.end(), std::move(element));  // mostly sorted: found at once
    });
}

/// Reads the member of `object` called `name` into `content`; a missing one reads like an empty
/// one.
template <class T>
void readMember(const Poco::JSON::Object& object, const char* name, T& content) {
    if (const Poco::Dynamic::Var* const member = findMember(object, name)) {
        readJson(*member, content);
    } else {
        readJson(Poco::Dynamic::Var(), content);
    }
}

}  // namespace velkor::configuration
