#include "configuration/service/ValueJson.hpp"

#include <algorithm>
#include <limits>
#include <new>
#include <sstream>
#include <string_view>
#include <type_traits>
#include <typeinfo>

#include "configuration/service/NumberText.hpp"
#include "framework/common/TextConversion.hpp"

namespace velkor::configuration {

namespace {

using Poco::Dynamic::Var;
using Poco::JSON::Array;
using Poco::JSON::Object;

template <class T>
const T* heldBy(const Var& json) {
    return json.type() == typeid(T) ? &json.extract<T>() : nullptr;
}

template <class T>
void readText(const std::string& text, T& content) {
    T parsed{};
    if (parseText(text, parsed)) content = parsed;
}

bool isNested(const Var& json) {
    return asObject(json) != nullptr || asArray(json) != nullptr;
}

// The type that a parser gives every integer that fits.
template <class T>
void readWithin(Poco::Int64 number, T& content) {
    using Limits = std::numeric_limits<T>;
    if (number >= Limits::min() && number <= Limits::max()) content = static_cast<T>(number);
}

// POCO's limits for numbers with a fraction leave out the smallest signed integer. A number that is
// not finite is beyond any limits.
template <class T>
void readNumber(const Var& json, T& content) {
    constexpr double highest = std::numeric_limits<T>::max();
    constexpr double lowestInteger = std::numeric_limits<T>::min();
    constexpr double lowestFraction = std::is_signed_v<T> ? -highest : 0;
    double number = 0;
    json.convert(number);
    const double lowest = json.isInteger() ? lowestInteger : lowestFraction;
    if (number >= lowest && number <= highest) content = static_cast<T>(number);
}

template <class Conversion>
void tryTo(const Conversion& convert) {
    try {
        convert();
    } catch (const std::bad_alloc&) {
        throw;
    } catch (...) {
        return;  // the default stays
    }
}

template <class T>
void convert(const Var& json, T& content) {
    tryTo([&] { content = json.convert<T>(); });
}

// As POCO converts it, whose stream would silently end the text where memory ends.
template <class Nested>
void convertNested(const Nested& json, std::string& content) {
    tryTo([&] {
        std::ostringstream out;
        out.exceptions(std::ios::badbit);
        json.stringify(out, 2);
        content = out.str();
    });
}

// Whatever is often refused is found out without an exception: hostile text can hold millions of
// elements that do not convert.
template <class T>
void readScalar(const Var& json, T& content) {
    if (json.isNumeric()) {
        json.convert(content);
    } else if (const auto* text = heldBy<std::string>(json)) {
        readText(*text, content);
    } else if (!json.isEmpty() && (std::is_same_v<T, bool> || !isNested(json))) {
        convert(json, content);
    }
}

template <class T>
void readInteger(const Var& json, T& content) {
    if (const auto* parsed = heldBy<Poco::Int64>(json)) {
        readWithin(*parsed, content);
    } else if (json.isNumeric()) {
        readNumber(json, content);
    } else {
        readScalar(json, content);
    }
}

common::TextConversion utf8() {
    return common::TextConversion("UTF-8");
}

}  // namespace

Var toJson(bool content) {
    return content;
}

Var toJson(int content) {
    return content;
}

Var toJson(unsigned int content) {
    return content;
}

Var toJson(double content) {
    return content;
}

Var toJson(const std::u16string& content) {
    return utf8().fromUtf16(content);
}

Var toJson(const std::string& content) {
    return content;
}

Var toJson(const ConfigurationValue& content) {
    Object::Ptr object = new Object;
    object->set("type", std::string(typeTags[static_cast<std::size_t>(content.which())]));
    object->set("value",
                boost::apply_visitor([](const auto& held) { return toJson(held); }, content));
    return object;
}

void readJson(const Var& json, bool& content) {
    readScalar(json, content);
}

void readJson(const Var& json, int& content) {
    readInteger(json, content);
}

void readJson(const Var& json, unsigned int& content) {
    readInteger(json, content);
}

void readJson(const Var& json, double& content) {
    readScalar(json, content);
}

void readJson(const Var& json, std::u16string& content) {
    std::string text;
    readJson(json, text);
    content = utf8().toUtf16(text);
}

void readJson(const Var& json, std::string& content) {
    if (const auto* same = heldBy<std::string>(json)) {
        content = *same;
    } else if (const auto* object = asObject(json)) {
        convertNested(*object, content);
    } else if (const auto* array = asArray(json)) {
        convertNested(*array, content);
    } else if (!json.isEmpty()) {
        convert(json, content);
    }
}

void readJson(const Var& json, ConfigurationValue& content) {
    content = std::string();
    const Object* const object = asObject(json);
    if (object == nullptr) return;
    std::string tag;
    readMember(*object, "type", tag);
    forEachValueKind([&](const auto& kind) {
        if (kind.tag != tag) return;
        typename std::decay_t<decltype(kind)>::Type held{};
        readMember(*object, "value", held);
        content = std::move(held);
    });
}

const Object* asObject(const Var& json) {
    const auto* const object = heldBy<Object::Ptr>(json);
    return object == nullptr ? nullptr : object->get();
}

const Array* asArray(const Var& json) {
    const auto* const array = heldBy<Array::Ptr>(json);
    return array == nullptr ? nullptr : array->get();
}

// POCO's own look-up hands out a copy. The objects of messages are so small that searching them
// from one end is as fast as it gets.
const Var* findMember(const Object& object, const char* name) {
    const std::string_view wanted = name;
    const auto member = std::find_if(object.begin(), object.end(),
                                     [&](const auto& entry) { return entry.first == wanted; });
    return member == object.end() ? nullptr : &member->second;
}

Array::Ptr makeArray(std::size_t size) {
    Array::Ptr array = new Array;
    if (size != 0) array->set(static_cast<unsigned int>(size - 1), Var());
    return array;
}

}  // namespace velkor::configuration
